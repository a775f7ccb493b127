#include "benchmarks/peers/peers.h"
#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::bench {

namespace {

GRIDMILL_MULTIVERSION void NdviRow(const unsigned short* __restrict source, std::size_t count,
                                   float* __restrict target) {
  for (std::size_t x = 0; x < count; ++x) {
    const float red = source[4 * x + 2];
    const float nir = source[4 * x + 3];
    const float sum = nir + red;
    target[x] = sum == 0.0f ? 0.0f : (nir - red) / sum;
  }
}

}  // namespace

void VectorisedNdvi(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y)
    NdviRow(RowOf<unsigned short>(*work.in, y), work.in->width, RowOf<float>(*work.twin, y));
}

}  // namespace orvik::bench
