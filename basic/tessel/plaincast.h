#pragma once

#include <cstdint>
#include <limits>
#include <type_traits>

namespace orvik::tessel {

/// Truncates toward zero to a 32 or 64-bit signed integer; NaN and values out of range give the most negative
/// one. A C++ cast of such a value would be undefined; this is the same on every processor.
template <class Int, class Value>
constexpr Int TruncateSigned(Value v) {
  constexpr Int lowest = std::numeric_limits<Int>::min();
  constexpr Value limit = -static_cast<Value>(lowest);  // exact: a power of two
  const bool fits = v >= -limit && v < limit;
  const Int truncated = static_cast<Int>(fits ? v : Value{0});
  return fits ? truncated : lowest;
}

/// `TruncateSigned` to 64 bits; from 2^63 on, 2^63 is subtracted first and the top bit added after.
template <class Value>
constexpr std::uint64_t TruncateUnsigned64(Value v) {
  constexpr std::uint64_t topBit = std::uint64_t{1} << 63;
  constexpr Value top = static_cast<Value>(topBit);
  return v >= top ? static_cast<std::uint64_t>(TruncateSigned<std::int64_t>(v - top)) ^ topBit
                  : static_cast<std::uint64_t>(TruncateSigned<std::int64_t>(v));
}

/// The conversion with no rounding and no saturation.
///
/// | from | to | result |
/// |---|---|---|
/// | integer | integer | the low bits, or extended by the sign of the source |
/// | any | `float`, `double` | the nearest value |
/// | floating | 8 and 16 bits, `int` | truncated to 32 bits signed, low bits kept |
/// | floating | `unsigned int` | truncated to 64 bits signed, low bits kept |
/// | floating | 64 bits signed | truncated |
/// | floating | 64 bits unsigned | truncated, from 2^63 on as well |
///
/// NaN, and values that a signed truncation cannot hold, give its most negative value; to 64 bits unsigned,
/// NaN gives 2^63 and values from 2^64 on give 0.
template <class Out, class Value>
constexpr Out PlainCast(Value v) {
  if constexpr (std::is_floating_point_v<Out> || std::is_integral_v<Value>) {
    return static_cast<Out>(v);
  } else if constexpr (std::is_same_v<Out, std::uint64_t>) {
    return TruncateUnsigned64(v);
  } else if constexpr (sizeof(Out) == 8 || std::is_same_v<Out, unsigned int>) {
    return static_cast<Out>(TruncateSigned<std::int64_t>(v));
  } else {
    return static_cast<Out>(TruncateSigned<std::int32_t>(v));
  }
}

}  // namespace orvik::tessel
