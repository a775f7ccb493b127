#pragma once

#include <cmath>
#include <cstddef>
#include <limits>

#include "processes/gridmill/kernels/thresholds.h"

/// Samples that are neither background nor out of range, as bytes of 0 or 1.
namespace orvik::kernels {

/// The values from `lower` to `upper`; a limit of NaN is none.
struct ValidRange {
  float lower;
  float upper;

  ValidRange(float least, float most)
      : lower(std::isnan(least) ? -std::numeric_limits<float>::infinity() : least),
        upper(std::isnan(most) ? std::numeric_limits<float>::infinity() : most) {}

  /// The samples of a narrow integer type within.
  template <class Sample>
  IntegerRange<Sample> Of() const {
    return {lower, upper, false};
  }
};

/// Clears the bytes of the samples that are the background or leave the range, as whole numbers of 32 bits.
///
/// @param range  null: none
/// @param count  at most `kBlock`
template <class In>
void KeepValidSamples(const In* samples, int background, const ValidRange* range, std::size_t count,
                      unsigned char* valid);

/// Clears the bytes of the values outside a range, which NaN is within.
void KeepWithin(const double* values, double lower, double upper, std::size_t count, unsigned char* valid);

}  // namespace orvik::kernels
