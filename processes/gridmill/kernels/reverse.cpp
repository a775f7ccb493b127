#include "processes/gridmill/kernels/reverse.h"

#include <cstdint>
#include <cstring>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

/// Pixels of the size of a word, wherever they lie.
template <class Word>
GRIDMILL_MULTIVERSION void ReverseWords(const unsigned char* __restrict first, std::size_t count,
                                        unsigned char* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) {
    Word word;
    std::memcpy(&word, first + (count - 1 - i) * sizeof(Word), sizeof(Word));
    std::memcpy(target + i * sizeof(Word), &word, sizeof(Word));
  }
}

/// Pixels of any size that is known to the compiler.
template <std::size_t bytes>
void ReverseSized(const unsigned char* last, std::size_t count, unsigned char* target) {
  for (std::size_t i = 0; i < count; ++i)
    std::memcpy(target + i * bytes, last - static_cast<std::ptrdiff_t>(i * bytes), bytes);
}

}  // namespace

void ReversePixels(const unsigned char* last, std::size_t pixelBytes, std::size_t pixels,
                   unsigned char* target) {
  if (pixels == 0 || pixelBytes == 0) return;
  const unsigned char* const first = last - static_cast<std::ptrdiff_t>((pixels - 1) * pixelBytes);
  switch (pixelBytes) {
    case 1:
      return ReverseWords<std::uint8_t>(first, pixels, target);
    case 2:
      return ReverseWords<std::uint16_t>(first, pixels, target);
    case 3:
      return ReverseSized<3>(last, pixels, target);
    case 4:
      return ReverseWords<std::uint32_t>(first, pixels, target);
    case 6:
      return ReverseSized<6>(last, pixels, target);
    case 8:
      return ReverseWords<std::uint64_t>(first, pixels, target);
    case 12:
      return ReverseSized<12>(last, pixels, target);
    case 16:
      return ReverseSized<16>(last, pixels, target);
    default:
      for (std::size_t i = 0; i < pixels; ++i)
        std::memcpy(target + i * pixelBytes, last - static_cast<std::ptrdiff_t>(i * pixelBytes), pixelBytes);
  }
}

}  // namespace orvik::kernels
