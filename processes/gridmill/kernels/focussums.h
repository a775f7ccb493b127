#pragma once

#include <cstddef>

#include "processes/gridmill/kernels/countedsamples.h"

/// The sums of the focus measures.
namespace orvik::kernels {

/// Adds the terms of one row to sums, one sum for each channel: the bits of one addition to a `double` after
/// the other, in the order of the pixels.
template <class In>
struct FocusSums {
  std::size_t channels;
  CountedSamples<In> counted;

  /// Adds (p1 - p0)^2 for p0 in `upper` and p1 below it in `lower` where both count.
  void AddSquaredDifferences(const In* upper, const In* lower, std::size_t pixels, double* sums) const;

  /// Adds p1 p0 to `left` and p2 p0 to `right`, for p0 in the first `pixels` pixels of `row` and p1 and p2 in
  /// the two that follow, where all three count.
  void AddNeighbourProducts(const In* row, std::size_t pixels, double* left, double* right) const;
};

/// How many of `count` bits are set in both of two runs. The runs begin at the bits with the indices `first`
/// and `second`; the most significant bit of a byte comes first.
std::size_t CountSetInBoth(const unsigned char* bits, std::size_t first, std::size_t second,
                           std::size_t count);

}  // namespace orvik::kernels
