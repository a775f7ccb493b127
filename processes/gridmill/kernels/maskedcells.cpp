#include "processes/gridmill/kernels/maskedcells.h"

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

GRIDMILL_MULTIVERSION void ReplicateRow(const unsigned char* __restrict pixel, std::size_t channels,
                                        std::size_t pixels, unsigned char* __restrict sample) {
  if (channels == 1) {
    for (std::size_t x = 0; x < pixels; ++x) sample[x] = pixel[x];
  } else if (channels == 3) {
    for (std::size_t x = 0; x < pixels; ++x) sample[3 * x] = sample[3 * x + 1] = sample[3 * x + 2] = pixel[x];
  } else {
    for (std::size_t x = 0; x < pixels; ++x)
      for (std::size_t c = 0; c < channels; ++c) sample[x * channels + c] = pixel[x];
  }
}

GRIDMILL_MULTIVERSION void LevelRow(const float* __restrict centre, const float* __restrict corner,
                                    const unsigned char* __restrict valid, std::size_t count,
                                    float* __restrict level) {
  for (std::size_t i = 0; i < count; ++i) level[i] = valid[i] != 0 ? corner[i] : centre[i];
}

}  // namespace orvik::kernels
