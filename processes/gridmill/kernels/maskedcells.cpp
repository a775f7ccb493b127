#include "processes/gridmill/kernels/maskedcells.h"

#include <cstdint>
#include <cstring>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

using Bytes = unsigned char __attribute__((vector_size(16)));

/// Each of 16 bytes three times.
GRIDMILL_INLINE void Replicate3(const unsigned char* pixel, unsigned char* sample) {
  Bytes p;
  std::memcpy(&p, pixel, 16);
  const Bytes low = __builtin_shufflevector(p, p, 0, 0, 0, 1, 1, 1, 2, 2, 2, 3, 3, 3, 4, 4, 4, 5);
  const Bytes middle = __builtin_shufflevector(p, p, 5, 5, 6, 6, 6, 7, 7, 7, 8, 8, 8, 9, 9, 9, 10, 10);
  const Bytes high =
      __builtin_shufflevector(p, p, 10, 11, 11, 11, 12, 12, 12, 13, 13, 13, 14, 14, 14, 15, 15, 15);
  std::memcpy(sample, &low, 16);
  std::memcpy(sample + 16, &middle, 16);
  std::memcpy(sample + 32, &high, 16);
}

}  // namespace

GRIDMILL_MULTIVERSION void ReplicateRow(const unsigned char* __restrict pixel, std::size_t channels,
                                        std::size_t pixels, unsigned char* __restrict sample) {
  std::size_t x = 0;
  if (channels == 1) {
    for (; x < pixels; ++x) sample[x] = pixel[x];
  } else if (channels == 3) {
    for (; x + 16 <= pixels; x += 16) Replicate3(pixel + x, sample + 3 * x);
  } else if (channels == 4) {
    for (; x < pixels; ++x) {
      const std::uint32_t four = pixel[x] * std::uint32_t{0x01010101};
      std::memcpy(sample + 4 * x, &four, 4);
    }
  }
  for (; x < pixels; ++x)
    for (std::size_t c = 0; c < channels; ++c) sample[x * channels + c] = pixel[x];
}

GRIDMILL_MULTIVERSION void LevelRow(const float* __restrict centre, const float* __restrict corner,
                                    const unsigned char* __restrict valid, std::size_t count,
                                    float* __restrict level) {
  for (std::size_t i = 0; i < count; ++i) level[i] = valid[i] != 0 ? corner[i] : centre[i];
}

}  // namespace orvik::kernels
