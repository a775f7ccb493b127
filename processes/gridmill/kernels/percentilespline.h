#pragma once

#include <cstddef>
#include <vector>

#include "processes/gridmill/kernels/rowconversions.h"

/// The cubic spline through cumulative percentages at the edges of equal bins.
namespace orvik::kernels {

/// Deliberate: counts are added, and multiplied by 100, in 32 bits that wrap.
int SumOfCounts(const int* counts, std::size_t bins);
int Hundredfold(int count);

/// The tables of a spline, with an entry for each bin and two more. `cumulative` is given.
struct SplineTables {
  const double* cumulative;
  double* alpha;
  double* linear;
  double* quadratic;
  double* cubic;
  double* diagonal;
  double* mu;
  double* z;
};

/// Fills the tables for `bins` bins, `scale` of them to a unit of value.
void SolveSpline(const SplineTables& tables, int bins, double scale);

/// What the evaluation reads of a bin: one line of the cache.
struct alignas(64) Knot {
  double edge;  ///< lower one, in the unit of the values
  double cumulative;
  double linear;
  double quadratic;
  double cubic;
};

/// The tables that an evaluation needs.
struct SplineCoefficients {
  const double* cumulative;
  const double* linear;
  const double* quadratic;
  const double* cubic;
};

/// Appends the knots of a spline of `bins` bins, the first of which begins at `least`.
void AppendKnots(const SplineCoefficients& tables, int bins, double scale, double least,
                 std::vector<Knot>& knots);

/// The spline at each value, which lies in the bin with the index `bin`.
void SplineRow(const float* value, const int* bin, const Knot* knots, std::size_t count, double* spline);

/// Deliberate: the spline's value is cast to the input's type, which drops the fraction of an integer, and
/// then to `float`. `count` is at most `kBlock`.
template <class In>
void CastThrough(const double* spline, std::size_t count, float* percentile) {
  if constexpr (std::is_floating_point_v<In>) {
    StoreCast(spline, count, percentile);
  } else {
    In scratch[kBlock];
    StoreCast(spline, count, scratch);
    LoadRow(scratch, 1, count, percentile);
  }
}

/// Replaces the percentiles of values outside the bins by constants.
void ReplaceOutside(const int* inside, const float* constant, std::size_t count, float* percentile);

}  // namespace orvik::kernels
