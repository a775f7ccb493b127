#pragma once

#include <bit>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

/// A word for two samples of 1, 2 or 4 bytes.
template <class In>
using PairOf = std::conditional_t<sizeof(In) == 1, std::uint16_t,
                                  std::conditional_t<sizeof(In) == 2, std::uint32_t, std::uint64_t>>;

/// True if two samples can be taken out of one word, the first out of its lower half.
template <class In>
inline constexpr bool kPairs = sizeof(In) <= 4 && std::endian::native == std::endian::little;

/// The samples of a pair as numbers. Narrow ones stay in 32 bits on the way: compilers would pack and unpack
/// them otherwise.
template <class In>
GRIDMILL_INLINE void SplitPair(PairOf<In> pair, double* values) {
  constexpr int bits = 8 * sizeof(In);
  if constexpr (sizeof(In) > 2) {
    values[0] = tessel::PlainCast<double>(std::bit_cast<In>(static_cast<std::uint32_t>(pair)));
    values[1] = tessel::PlainCast<double>(std::bit_cast<In>(static_cast<std::uint32_t>(pair >> bits)));
  } else {
    using Wide = std::conditional_t<std::is_signed_v<In>, std::int32_t, std::uint32_t>;
    const std::uint32_t word = pair;
    values[0] = static_cast<std::int32_t>(static_cast<Wide>(word << (32 - bits)) >> (32 - bits));
    values[1] = static_cast<std::int32_t>(static_cast<Wide>(word << (32 - 2 * bits)) >> (32 - bits));
  }
}

/// Converts the samples of one of many dense pixels. Six are loaded as three pairs: compilers take groups of
/// three apart in registers, but not groups of six.
template <std::size_t samples, class In>
GRIDMILL_INLINE void LoadPixel(const In* pixel, double* values) {
  if constexpr (samples == 6 && kPairs<In>) {
    struct __attribute__((packed, may_alias)) Pairs {
      PairOf<In> pairs[3];
    };
    for (std::size_t k = 0; k < 3; ++k)
      SplitPair<In>(reinterpret_cast<const Pairs*>(pixel)->pairs[k], values + 2 * k);
  } else {
    for (std::size_t k = 0; k < samples; ++k) values[k] = tessel::PlainCast<double>(pixel[k]);
  }
}

}  // namespace orvik::kernels
