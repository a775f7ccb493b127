#pragma once

#include <cstdint>
#include <limits>
#include <type_traits>

#include "basic/tessel/plaincast.h"

/// `ClipTo<Out>(v)`: the conversion of a computed value to the output type.
///
/// A floating v, with the bounds as the type of v holds them (so 2147483648, 4294967296, 2^63 and 2^64 in
/// `float`):
///
/// | Out | first | at or above | below | else |
/// |---|---|---|---|---|
/// | `char`, `short`, `int` | v >= 0: v + 0.5, else v - 0.5 | the largest: it | the lowest: it | truncate |
/// | `unsigned char`, `unsigned short`, `unsigned int` | v + 0.5 | the largest: it | or at 0: 0 | truncate |
/// | 64-bit signed, 64-bit unsigned | | the largest: it | or at 0: 0 | truncate |
/// | `float`, `double` | | | | plain conversion |
///
/// Deliberate: the 64-bit outputs do not round, and a negative value gives 0 in a 64-bit signed output.
/// NaN fails every comparison and is truncated as `PlainCast` does it.
///
/// An integer v is clamped without rounding:
///
/// | from | to | result |
/// |---|---|---|
/// | any type | itself, `float`, `double` | plain conversion |
/// | signed | narrower signed | clamped at both ends |
/// | signed | unsigned, or 64-bit signed | less than 1: 0; clamped above if narrower |
/// | unsigned | narrower, or signed of the same width | clamped above |
/// | 64-bit signed | any narrower type | clamped above; deliberate: a negative value keeps its low bits |
/// | any other | | keeps the value |
namespace orvik::tessel {

static_assert(std::is_signed_v<char>, "plain char has to be signed: -fsigned-char");

namespace clip {

template <class Out, class Value>
constexpr Out FromFloating(Value value) {
  constexpr bool rounds = sizeof(Out) < 8;
  constexpr bool zeroBelow = std::is_unsigned_v<Out> || sizeof(Out) == 8;
  constexpr Out highest = std::numeric_limits<Out>::max();
  constexpr Out lowest = zeroBelow ? Out{0} : std::numeric_limits<Out>::min();
  constexpr Value upper = static_cast<Value>(highest);
  constexpr Value lower = static_cast<Value>(lowest);
  constexpr Value half = static_cast<Value>(0.5);

  Value v = value;
  if constexpr (rounds) v = v + (std::is_unsigned_v<Out> || v >= 0 ? half : -half);
  const bool above = v >= upper;
  const bool below = zeroBelow ? v <= lower : v < lower;
  const Out truncated = PlainCast<Out>(v);
  return above ? highest : below ? lowest : truncated;
}

/// True if values of `From` can lie above the largest `To`.
template <class To, class From>
inline constexpr bool kCanExceed = std::numeric_limits<From>::digits > std::numeric_limits<To>::digits;

template <class Out, class Value>
constexpr Out FromInteger(Value v) {
  constexpr bool fromSigned64 = std::is_same_v<Value, std::int64_t>;
  constexpr bool narrows = sizeof(Out) < sizeof(Value);
  constexpr bool clampsAtZero =
      std::is_signed_v<Value> && (std::is_unsigned_v<Out> || sizeof(Out) == 8) && !(fromSigned64 && narrows);
  constexpr bool clampsAtLowest =
      std::is_signed_v<Value> && std::is_signed_v<Out> && narrows && !fromSigned64;

  if constexpr (kCanExceed<Out, Value>) {
    constexpr Out highest = std::numeric_limits<Out>::max();
    if (v >= static_cast<Value>(highest)) return highest;
  }
  if constexpr (clampsAtZero) {
    if (v < 1) return Out{0};
  }
  if constexpr (clampsAtLowest) {
    constexpr Out lowest = std::numeric_limits<Out>::min();
    if (v < static_cast<Value>(lowest)) return lowest;
  }
  return static_cast<Out>(v);
}

}  // namespace clip

template <class Out, class Value>
constexpr Out ClipTo(Value v) {
  if constexpr (std::is_floating_point_v<Out> || std::is_same_v<Out, Value>) {
    return static_cast<Out>(v);
  } else if constexpr (std::is_floating_point_v<Value>) {
    return clip::FromFloating<Out>(v);
  } else {
    return clip::FromInteger<Out>(v);
  }
}

}  // namespace orvik::tessel
