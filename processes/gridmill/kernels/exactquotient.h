#pragma once

#include <bit>
#include <cstdint>

#include "processes/gridmill/kernels/multiversion.h"

/// Divisions of integers in `double` that leave the processor's divider alone, for where roots and other
/// divisions keep it busy.
namespace orvik::kernels {

/// What is divided by: an integer below 2^18 or the half of one, signed or not. 0 makes NaN of every
/// quotient.
struct Divisor {
  double value;
  double reciprocal;  ///< within 2^-47 of itself

  /// One step of Newton's from the reciprocal in `float`, whose product with the divisor is exact.
  explicit GRIDMILL_INLINE Divisor(float divisor) : value(divisor) {
    const double y = 1.0f / divisor;
    reciprocal = y + y * (1.0 - value * y);
  }
};

/// The quotient of an integer below 2^36 or the half of one, the same bits as those of the division. The
/// upper 32 bits of an estimate leave a remainder that is exact; its quotient is added. What is rounded then
/// lies within 2^-77 of the true quotient, and that is no closer than 2^-72 to the middle between two numbers
/// without being it.
GRIDMILL_INLINE double ExactQuotient(double numerator, const Divisor& divisor) {
  constexpr std::int64_t kUpper = -(std::int64_t{1} << 21);
  const double estimate = numerator * divisor.reciprocal;
  const double upper = std::bit_cast<double>(std::bit_cast<std::int64_t>(estimate) & kUpper);
  return upper + (numerator - upper * divisor.value) * divisor.reciprocal;
}

}  // namespace orvik::kernels
