#pragma once

#include <cstddef>
#include <vector>

namespace orvik::bench {

/// The spline through the cumulative percentages of a histogram, as the naive twins of the percentiles build
/// it. A vector has an entry for each edge of a bin and one more.
struct NaiveSpline {
  std::vector<double> cumulative;
  std::vector<double> linear;
  std::vector<double> quadratic;
  std::vector<double> cubic;

  /// @param scale  bins per unit
  NaiveSpline(const int* counts, int bins, double scale);

  /// The percentage `dx` above the lower edge of a bin.
  double At(std::size_t bin, double dx) const {
    return ((dx * linear[bin] + cumulative[bin]) + (dx * quadratic[bin]) * dx) +
           ((dx * cubic[bin]) * dx) * dx;
  }
};

}  // namespace orvik::bench
