#include "processes/gridmill/kernels/syntheticblue.h"

namespace orvik::kernels {

GRIDMILL_MULTIVERSION void SyntheticBlueRow(const double* __restrict s0, const double* __restrict s1,
                                            const double* __restrict s2, std::size_t count,
                                            double* __restrict blue) {
  for (std::size_t i = 0; i < count; ++i) blue[i] = SyntheticBlue(s0[i], s1[i], s2[i]);
}

GRIDMILL_MULTIVERSION void BlueBinRow(const double* __restrict blue, std::size_t count,
                                      unsigned char* __restrict bins) {
  for (std::size_t i = 0; i < count; ++i) {
    // Truncation keeps the order: the limits can come first.
    const double b = blue[i];
    const bool fits = (b >= 0.0) & (b < 2147483648.0);
    const double held = fits ? b : 0.0;
    bins[i] = static_cast<unsigned char>(static_cast<int>(held > 255.0 ? 255.0 : held));
  }
}

}  // namespace orvik::kernels
