#pragma once

#include <cstdint>
#include <vector>

namespace orvik::reference {

/// The tables of a spline through cumulative percentages, each with two entries more than there are bins.
struct CumulativeSpline {
  std::vector<double> cumulative, alpha, linear, quadratic, cubic, diagonal, mu, z;
};

/// The sum of the counts in 32 bits, wrapping.
std::int32_t TotalOf(const std::vector<int>& counts);

/// The percentage that one bin adds: the count times 100 in 32 bits, wrapping, then divided.
double ShareOf(int count, std::int32_t total);

/// The knots at the lower edges of the bins, at the upper edge of the last one, and one beyond at 100.
///
/// @param emptyIsZero  a total of 0 gives knots of 0; else 0 is divided by 0
std::vector<double> Knots(const std::vector<int>& counts, bool emptyIsZero);

/// The spline through the knots, slowly: step by step in the order of the steps.
///
/// @param scale  bins per unit
CumulativeSpline SplineThrough(const std::vector<double>& knots, double scale);

/// The value in a bin, `dx` after its lower edge.
double ValueOf(const CumulativeSpline& spline, std::int32_t bin, double dx);

}  // namespace orvik::reference
