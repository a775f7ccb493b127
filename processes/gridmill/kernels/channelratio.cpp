#include "processes/gridmill/kernels/channelratio.h"

#include <cmath>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

GRIDMILL_MULTIVERSION void RatioRow(const float* image, const float* reference, bool absolute,
                                    std::size_t count, float* ratio) {
  if (absolute) {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i) ratio[i] = std::fabs(image[i] / reference[i]);
  } else {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i) ratio[i] = image[i] / reference[i];
  }
}

}  // namespace orvik::kernels
