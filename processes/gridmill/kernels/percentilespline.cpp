#include "processes/gridmill/kernels/percentilespline.h"

#include <cstdint>
#include <cstring>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

int SumOfCounts(const int* counts, std::size_t bins) {
  std::uint32_t sum = 0;
  for (std::size_t i = 0; i < bins; ++i) sum += static_cast<std::uint32_t>(counts[i]);
  return static_cast<int>(sum);
}

int Hundredfold(int count) { return static_cast<int>(static_cast<std::uint32_t>(count) * 100u); }

void SolveSpline(const SplineTables& tables, int bins, double scale) {
  const auto [cumulative, alpha, linear, quadratic, cubic, diagonal, mu, z] = tables;
  for (int i = 1; i <= bins; ++i)
    alpha[i] = ((cumulative[i + 1] - cumulative[i] * 2.0) + cumulative[i - 1]) * (scale * 3.0);
  diagonal[0] = 1.0;
  mu[0] = 0.0;
  z[0] = 0.0;
  for (int i = 1; i <= bins; ++i) {
    // Deliberate: 2 (2 - mu), where a natural spline has 4 - mu.
    diagonal[i] = ((2.0 - mu[i - 1]) * 2.0) / scale;
    mu[i] = 1.0 / (diagonal[i] * scale);
    z[i] = (alpha[i] - z[i - 1] / scale) / diagonal[i];
  }
  diagonal[bins + 1] = 1.0;
  z[bins + 1] = 0.0;
  quadratic[bins + 1] = 0.0;
  for (int j = bins; j >= 0; --j) {
    quadratic[j] = z[j] - mu[j] * quadratic[j + 1];
    linear[j] =
        (cumulative[j + 1] - cumulative[j]) * scale - (quadratic[j] * 2.0 + quadratic[j + 1]) / (scale * 3.0);
    cubic[j] = ((quadratic[j + 1] - quadratic[j]) * scale) / 3.0;
  }
}

void AppendKnots(const SplineCoefficients& tables, int bins, double scale, double least,
                 std::vector<Knot>& knots) {
  for (int bin = 0; bin <= bins; ++bin)
    knots.push_back({bin / scale + least, tables.cumulative[bin], tables.linear[bin], tables.quadratic[bin],
                     tables.cubic[bin]});
}

namespace {

using Pair = double __attribute__((vector_size(16)));
using FloatPair = float __attribute__((vector_size(8)));

/// The spline at the values from index i on, in their bins. Two at a time: knots are loaded one by one, and
/// wider vectors would take longer to put together than they save.
GRIDMILL_INLINE Pair SplinePair(const float* value, const int* bin, const Knot* knots, std::size_t i) {
  const Knot& a = knots[bin[i]];
  const Knot& b = knots[bin[i + 1]];
  const FloatPair narrow = {value[i], value[i + 1]};
  const Pair dx = __builtin_convertvector(narrow, Pair) - Pair{a.edge, b.edge};
  const Pair cumulative = {a.cumulative, b.cumulative}, linear = {a.linear, b.linear};
  const Pair quadratic = {a.quadratic, b.quadratic}, cubic = {a.cubic, b.cubic};
  return ((dx * linear + cumulative) + (dx * quadratic) * dx) + ((dx * cubic) * dx) * dx;
}

}  // namespace

GRIDMILL_MULTIVERSION void SplineRow(const float* __restrict value, const int* __restrict bin,
                                     const Knot* __restrict knots, std::size_t count,
                                     double* __restrict spline) {
  std::size_t i = 0;
  for (; i + 4 <= count; i += 4) {
    const Pair first = SplinePair(value, bin, knots, i), second = SplinePair(value, bin, knots, i + 2);
    std::memcpy(spline + i, &first, sizeof(Pair));
    std::memcpy(spline + i + 2, &second, sizeof(Pair));
  }
  for (; i < count; ++i) {
    const float values[2] = {value[i], value[i]};
    const int bins[2] = {bin[i], bin[i]};
    spline[i] = SplinePair(values, bins, knots, 0)[0];
  }
}

GRIDMILL_MULTIVERSION void ReplaceOutside(const int* __restrict inside, const float* __restrict constant,
                                          std::size_t count, float* __restrict percentile) {
  for (std::size_t i = 0; i < count; ++i) percentile[i] = inside[i] != 0 ? percentile[i] : constant[i];
}

}  // namespace orvik::kernels
