#include "processes/gridmill/kernels/wholedegrees.h"

#include <cmath>

namespace orvik::kernels {

namespace {

/// The whole degrees of an estimate, and whether it is too close to a half degree to tell.
struct EstimatedDegrees {
  int degrees;
  int doubtful;  // 0 or 1
};

/// The estimate is sqrt(1 - |x|) times a polynomial that interpolates acos(x) / sqrt(1 - x), good to 0.00005
/// degrees. Wherever it is not doubtful it agrees with `RoundedDegrees`: compared for every `float`.
GRIDMILL_INLINE EstimatedDegrees EstimateDegrees(float cosine) {
  constexpr float doubt = 1.0f / 8192.0f;
  const float magnitude = std::fabs(cosine);
  const bool inside = magnitude <= 1.0f;
  const float x = inside ? magnitude : 1.0f;
  const float polynomial =
      89.9999885f +
      x * (-12.2946423f +
           x * (5.08317214f +
                x * (-2.78711498f + x * (1.52394147f + x * (-0.623359182f + x * 0.126489371f)))));
  const float acute = std::sqrt(1.0f - x) * polynomial;
  const float rounded = (cosine < 0.0f ? 180.0f - acute : acute) + 0.5f;
  const int degrees = static_cast<int>(rounded);
  const float fraction = rounded - static_cast<float>(degrees);
  return {degrees, static_cast<int>(!inside) | static_cast<int>(fraction < doubt) |
                       static_cast<int>(fraction > 1.0f - doubt)};
}

}  // namespace

GRIDMILL_MULTIVERSION void RoundedDegreesRow(const float* __restrict cosine, std::size_t count,
                                             int* __restrict degrees) {
  int doubtful = 0;
  for (std::size_t i = 0; i < count; ++i) {
    const EstimatedDegrees estimate = EstimateDegrees(cosine[i]);
    degrees[i] = estimate.degrees;
    doubtful |= estimate.doubtful;
  }
  if (doubtful == 0) return;
  for (std::size_t i = 0; i < count; ++i) degrees[i] = RoundedDegrees(cosine[i]);
}

}  // namespace orvik::kernels
