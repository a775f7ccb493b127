#include "tests/reference/cumulativespline_reference.h"

#include <cstddef>

namespace orvik::reference {

std::int32_t TotalOf(const std::vector<int>& counts) {
  std::uint32_t total = 0;
  for (const int count : counts) total = total + static_cast<std::uint32_t>(count);
  return static_cast<std::int32_t>(total);
}

double ShareOf(int count, std::int32_t total) {
  const auto hundredfold = static_cast<std::int32_t>(static_cast<std::uint32_t>(count) * 100u);
  return static_cast<double>(hundredfold) / static_cast<double>(total);
}

std::vector<double> Knots(const std::vector<int>& counts, bool emptyIsZero) {
  const std::int32_t total = TotalOf(counts);
  std::vector<double> cumulative(counts.size() + 2, 0.0);
  cumulative[counts.size() + 1] = 100.0;
  for (std::size_t i = 1; i <= counts.size(); ++i) {
    if (total == 0 && emptyIsZero) {
      cumulative[i] = 0.0;
    } else {
      cumulative[i] = ShareOf(counts[i - 1], total) + cumulative[i - 1];
    }
  }
  return cumulative;
}

CumulativeSpline SplineThrough(const std::vector<double>& knots, double scale) {
  const std::size_t n = knots.size() - 2;
  const std::vector<double> zeros(n + 2, 0.0);
  CumulativeSpline s = {knots, zeros, zeros, zeros, zeros, zeros, zeros, zeros};
  for (std::size_t i = 1; i <= n; ++i) {
    s.alpha[i] = ((s.cumulative[i + 1] - s.cumulative[i] * 2.0) + s.cumulative[i - 1]) * (scale * 3.0);
  }
  s.diagonal[0] = 1.0;
  s.mu[0] = 0.0;
  s.z[0] = 0.0;
  for (std::size_t i = 1; i <= n; ++i) {
    s.diagonal[i] = ((2.0 - s.mu[i - 1]) * 2.0) / scale;
    s.mu[i] = 1.0 / (s.diagonal[i] * scale);
    s.z[i] = (s.alpha[i] - s.z[i - 1] / scale) / s.diagonal[i];
  }
  s.diagonal[n + 1] = 1.0;
  s.z[n + 1] = 0.0;
  s.quadratic[n + 1] = 0.0;
  for (std::size_t j = n + 1; j-- > 0;) {
    s.quadratic[j] = s.z[j] - s.mu[j] * s.quadratic[j + 1];
    s.linear[j] = (s.cumulative[j + 1] - s.cumulative[j]) * scale -
                  (s.quadratic[j] * 2.0 + s.quadratic[j + 1]) / (scale * 3.0);
    s.cubic[j] = ((s.quadratic[j + 1] - s.quadratic[j]) * scale) / 3.0;
  }
  return s;
}

double ValueOf(const CumulativeSpline& spline, std::int32_t bin, double dx) {
  const auto b = static_cast<std::size_t>(bin);
  const double line = dx * spline.linear[b] + spline.cumulative[b];
  const double parabola = line + (dx * spline.quadratic[b]) * dx;
  return parabola + ((dx * spline.cubic[b]) * dx) * dx;
}

}  // namespace orvik::reference
