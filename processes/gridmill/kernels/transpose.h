#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

/// The unsigned integer of 1, 2, 4 or 8 bytes.
template <std::size_t bytes>
using WordOf =
    std::conditional_t<bytes == 1, std::uint8_t,
                       std::conditional_t<bytes == 2, std::uint16_t,
                                          std::conditional_t<bytes == 4, std::uint32_t, std::uint64_t>>>;

/// A register that every processor with vectors has, and how many words it holds.
template <class Word>
struct LanesOf {
  typedef Word Type __attribute__((vector_size(16)));
  static constexpr std::size_t count = 16 / sizeof(Word);
};
template <class Word>
using Lanes = typename LanesOf<Word>::Type;
template <class Word>
inline constexpr std::size_t kLanes = LanesOf<Word>::count;

/// The lower or the upper halves of two registers, word by word in turn.
template <bool upper, class Word>
GRIDMILL_INLINE Lanes<Word> Zipped(Lanes<Word> a, Lanes<Word> b) {
  constexpr int h = upper ? static_cast<int>(kLanes<Word>) / 2 : 0;
  constexpr int n = static_cast<int>(kLanes<Word>) + h;
  if constexpr (kLanes<Word> == 2) {
    return __builtin_shufflevector(a, b, h, n);
  } else if constexpr (kLanes<Word> == 4) {
    return __builtin_shufflevector(a, b, h, n, h + 1, n + 1);
  } else if constexpr (kLanes<Word> == 8) {
    return __builtin_shufflevector(a, b, h, n, h + 1, n + 1, h + 2, n + 2, h + 3, n + 3);
  } else {
    return __builtin_shufflevector(a, b, h, n, h + 1, n + 1, h + 2, n + 2, h + 3, n + 3, h + 4, n + 4, h + 5,
                                   n + 5, h + 6, n + 6, h + 7, n + 7);
  }
}

/// Turns the rows of a square of words into its columns: each round doubles the words of a column that follow
/// each other.
template <class Word>
GRIDMILL_INLINE void Transpose(Lanes<Word> (&rows)[kLanes<Word>]) {
  constexpr std::size_t half = kLanes<Word> / 2;
  for (std::size_t run = 1; run < kLanes<Word>; run *= 2) {
    Lanes<Word> zipped[kLanes<Word>];
    for (std::size_t k = 0; k < half; ++k) {
      zipped[2 * k] = Zipped<false, Word>(rows[k], rows[k + half]);
      zipped[2 * k + 1] = Zipped<true, Word>(rows[k], rows[k + half]);
    }
    for (std::size_t k = 0; k < kLanes<Word>; ++k) rows[k] = zipped[k];
  }
}

}  // namespace orvik::kernels
