#include "benchmarks/naivespline.h"

#include <numeric>

namespace orvik::bench {

NaiveSpline::NaiveSpline(const int* counts, int bins, double scale)
    : cumulative(static_cast<std::size_t>(bins) + 2),
      linear(cumulative.size()),
      quadratic(cumulative.size()),
      cubic(cumulative.size()) {
  const std::size_t count = static_cast<std::size_t>(bins);
  const int total = std::accumulate(counts, counts + bins, 0);
  cumulative[count + 1] = 100.0;
  for (std::size_t i = 1; i <= count; ++i)
    cumulative[i] = static_cast<double>(counts[i - 1] * 100) / total + cumulative[i - 1];

  std::vector<double> mu(cumulative.size());
  std::vector<double> z(cumulative.size());
  for (std::size_t i = 1; i <= count; ++i) {
    const double alpha = ((cumulative[i + 1] - cumulative[i] * 2.0) + cumulative[i - 1]) * (scale * 3.0);
    const double diagonal = ((2.0 - mu[i - 1]) * 2.0) / scale;
    mu[i] = 1.0 / (diagonal * scale);
    z[i] = (alpha - z[i - 1] / scale) / diagonal;
  }
  for (std::size_t j = count + 1; j-- > 0;) {
    quadratic[j] = z[j] - mu[j] * quadratic[j + 1];
    linear[j] =
        (cumulative[j + 1] - cumulative[j]) * scale - (quadratic[j] * 2.0 + quadratic[j + 1]) / (scale * 3.0);
    cubic[j] = ((quadratic[j + 1] - quadratic[j]) * scale) / 3.0;
  }
}

}  // namespace orvik::bench
