#pragma once

#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>

namespace orvik::reference {

/// Truncation to 32 bits: NaN and what lies out of range give the most negative value.
inline std::int32_t TruncateToInt32(double v) {
  if (std::isnan(v)) return std::numeric_limits<std::int32_t>::min();
  if (v <= -2147483649.0 || v >= 2147483648.0) return std::numeric_limits<std::int32_t>::min();
  return static_cast<std::int32_t>(v);
}

/// Truncation to 64 bits, likewise.
inline std::int64_t TruncateToInt64(double v) {
  if (std::isnan(v)) return std::numeric_limits<std::int64_t>::min();
  if (v < -0x1p63 || v >= 0x1p63) return std::numeric_limits<std::int64_t>::min();
  return static_cast<std::int64_t>(v);
}

/// Truncation to 64 bits unsigned: from 2^63 on, 2^63 is taken off before and the top bit put back after.
inline std::uint64_t TruncateToUint64(double v) {
  if (v >= 0x1p63) return static_cast<std::uint64_t>(TruncateToInt64(v - 0x1p63)) + (std::uint64_t{1} << 63);
  return static_cast<std::uint64_t>(TruncateToInt64(v));
}

/// A conversion with no rounding and no saturation, defined for every value.
template <class To, class From>
To PlainCast(From v) {
  if constexpr (std::is_integral_v<From> || std::is_floating_point_v<To>) {
    return static_cast<To>(v);
  } else if constexpr (std::is_same_v<To, std::uint64_t>) {
    return TruncateToUint64(v);
  } else if constexpr (std::is_same_v<To, std::int64_t> || std::is_same_v<To, unsigned int>) {
    return static_cast<To>(TruncateToInt64(v));
  } else {
    return static_cast<To>(TruncateToInt32(v));
  }
}

/// The written form of a value that was computed as a `float` or a `double`, in the precision of `v`.
template <class Out, class Value>
Out ClipFloating(Value v) {
  constexpr bool is64Bit = std::is_integral_v<Out> && sizeof(Out) == 8;
  const Value upper = static_cast<Value>(std::numeric_limits<Out>::max());
  const Value lower = static_cast<Value>(std::numeric_limits<Out>::lowest());
  const Value half = static_cast<Value>(0.5);
  if constexpr (std::is_floating_point_v<Out>) {
    return static_cast<Out>(v);
  } else if constexpr (is64Bit) {
    if (v <= 0) return 0;
    if (v >= upper) return std::numeric_limits<Out>::max();
    return PlainCast<Out>(v);
  } else if constexpr (std::is_unsigned_v<Out>) {
    v = v + half;
    if (v <= 0) return 0;
    if (v >= upper) return std::numeric_limits<Out>::max();
    return PlainCast<Out>(v);
  } else {
    v = v >= 0 ? v + half : v - half;
    if (v >= upper) return std::numeric_limits<Out>::max();
    if (v < lower) return std::numeric_limits<Out>::lowest();
    return PlainCast<Out>(v);
  }
}

/// The written form of an integer: clamped, not rounded.
template <class Out, class Value>
Out ClipInteger(Value v) {
  constexpr Out upper = std::numeric_limits<Out>::max();
  constexpr Out lower = std::numeric_limits<Out>::lowest();
  if constexpr (std::is_same_v<Out, Value> || std::is_floating_point_v<Out>) {
    return static_cast<Out>(v);
  } else if constexpr (std::is_unsigned_v<Value>) {
    return v >= static_cast<std::uint64_t>(upper) ? upper : static_cast<Out>(v);
  } else if constexpr (sizeof(Out) == 8) {
    return v < 1 ? Out{0} : static_cast<Out>(v);
  } else if constexpr (std::is_same_v<Value, std::int64_t>) {
    return v >= static_cast<std::int64_t>(upper) ? upper : static_cast<Out>(v);
  } else if constexpr (std::is_unsigned_v<Out>) {
    if (v < 1) return 0;
    return static_cast<std::int64_t>(v) >= static_cast<std::int64_t>(upper) ? upper : static_cast<Out>(v);
  } else {
    if (static_cast<std::int64_t>(v) >= static_cast<std::int64_t>(upper)) return upper;
    if (static_cast<std::int64_t>(v) < static_cast<std::int64_t>(lower)) return lower;
    return static_cast<Out>(v);
  }
}

/// The conversion of a computed or copied value to a sample.
template <class Out, class Value>
Out ClipTo(Value v) {
  if constexpr (std::is_floating_point_v<Value>) return ClipFloating<Out>(v);
  if constexpr (std::is_integral_v<Value>) return ClipInteger<Out>(v);
}

}  // namespace orvik::reference
