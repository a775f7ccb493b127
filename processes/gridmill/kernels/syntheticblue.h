#pragma once

#include <cstddef>

#include "processes/gridmill/kernels/multiversion.h"

/// A blue band for sensors that have none, from their first three: green, red and near infrared.
namespace orvik::kernels {

GRIDMILL_INLINE double SyntheticBlue(double s0, double s1, double s2) {
  return s0 * 0.873393 + 13.9054 - s1 * 0.138254 - s2 * 0.100616;
}

/// The blue of bytes in `float`.
GRIDMILL_INLINE float EstimatedBlue(unsigned char s0, unsigned char s1, unsigned char s2) {
  return s0 * 0.873393f + 13.9054f - s1 * 0.138254f - s2 * 0.100616f;
}

/// What an estimate is off by at most: 3.03e-5 over all bytes.
inline constexpr float kEstimateError = 0x1p-15f;

template <class Sample>
void SyntheticBlueRow(const Sample* s0, const Sample* s1, const Sample* s2, std::size_t count, double* blue);

/// Blue truncated to 32 bits and limited to 0 to 255. NaN and values that leave 32 bits give 0.
template <class Sample>
void BlueBinRow(const Sample* s0, const Sample* s1, const Sample* s2, std::size_t count, unsigned char* bins);

}  // namespace orvik::kernels
