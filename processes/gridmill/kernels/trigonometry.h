#pragma once

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>

#include "processes/gridmill/kernels/multiversion.h"

/// Arc cosine and arc tangent in single precision, without branches, so that loops over them vectorise.
///
/// The argument reductions and the rational and polynomial approximations are those of the Sun Microsystems
/// libm of 1993, on which the mathematical libraries of the BSDs and of GNU rest. The results are
/// bit-identical to `std::acos(float)` and `std::atan2(float, float)` of the GNU C library 2.36, and do not
/// depend on the platform's library.
namespace orvik::kernels {

/// A rational approximation of (asin(t) - t) / t^3 at z = t^2, for t up to 0.5, times z.
GRIDMILL_INLINE float ArcSineCorrection(float z) {
  const float p = z * (1.6666667163e-01f +
                       z * (-3.2556581497e-01f +
                            z * (2.0121252537e-01f + z * (-4.0055535734e-02f +
                                                          z * (7.9153501429e-04f + z * 3.4793309169e-05f)))));
  const float q = 1.0f + z * (-2.4033949375e+00f +
                              z * (2.0209457874e+00f + z * (-6.8828397989e-01f + z * 7.7038154006e-02f)));
  return p / q;
}

/// 2 asin(s), with s the root of z in [0, 0.25] and r its `ArcSineCorrection`: the root goes in two parts.
GRIDMILL_INLINE float TwiceArcSine(float z, float s, float r) {
  const float head = std::bit_cast<float>(std::bit_cast<std::uint32_t>(s) & 0xfffff000u);
  const float tail = (z - head * head) / (s + head);
  return z == 0.0f ? 0.0f : 2.0f * (head + (r * s + tail));
}

/// The arc cosine in radians of a value from 0.5 to 1.
GRIDMILL_INLINE float AcosHigh(float x) {
  const float z = (1.0f - x) * 0.5f;
  return TwiceArcSine(z, std::sqrt(z), ArcSineCorrection(z));
}

/// The arc cosine in radians, from 0 to pi; NaN beyond -1 and 1.
GRIDMILL_INLINE float Acos(float x) {
  constexpr float pi = 3.1415925026e+00f;
  constexpr float halfPi = 1.5707962513e+00f;
  constexpr float halfPiLow = 7.5497894159e-08f;

  const float magnitude = std::fabs(x);
  const bool central = magnitude < 0.5f;
  const float z = central ? x * x : (1.0f - magnitude) * 0.5f;
  const float s = std::sqrt(z);
  const float r = ArcSineCorrection(z);

  const float centre = halfPi - (x - (halfPiLow - x * r));  // |x| < 0.5: pi/2 - asin(x)
  const float low = pi - 2.0f * (s + (r * s - halfPiLow));  // x <= -0.5: pi - 2 asin(s)
  const float outer = x > 0.0f ? TwiceArcSine(z, s, r) : low;
  return central ? centre : outer;
}

/// The arc tangent of a value that is not negative, or NaN.
GRIDMILL_INLINE float AtanPositive(float q) {
  const bool from0 = q >= 0.4375f;
  const bool from1 = q >= 0.6875f;
  const bool from2 = q >= 1.1875f;
  const bool from3 = q >= 2.4375f;

  // atan(q) = atan(c) + atan((q - c) / (1 + c q)) with c = 0, 1/2, 1, 3/2, infinity: the fraction is
  // (a q - b) / (a + b q), and exact products leave its roundings as they are.
  float a = 1.0f;
  float b = 0.0f;
  float base = 0.0f;
  float baseLow = 0.0f;
  a = from0 ? 2.0f : a;
  b = from0 ? 1.0f : b;
  base = from0 ? 4.6364760399e-01f : base;
  baseLow = from0 ? 5.0121582440e-09f : baseLow;
  a = from1 ? 1.0f : a;
  base = from1 ? 7.8539812565e-01f : base;
  baseLow = from1 ? 3.7748947079e-08f : baseLow;
  b = from2 ? 1.5f : b;
  base = from2 ? 9.8279368877e-01f : base;
  baseLow = from2 ? 3.4473217170e-08f : baseLow;
  a = from3 ? 0.0f : a;
  b = from3 ? 1.0f : b;
  base = from3 ? 1.5707962513e+00f : base;
  baseLow = from3 ? 7.5497894159e-08f : baseLow;

  const float numerator = a * q - b;
  const float denominator = a + b * q;
  const float u = numerator / denominator;
  const float z = u * u;
  const float w = z * z;
  const float odd =
      z * (3.3333334327e-01f +
           w * (1.4285714924e-01f +
                w * (9.0908870101e-02f +
                     w * (6.6610731184e-02f + w * (4.9768779427e-02f + w * 1.6285819933e-02f)))));
  const float even = w * (-2.0000000298e-01f +
                          w * (-1.1111110449e-01f +
                               w * (-7.6918758452e-02f + w * (-5.8335702866e-02f + w * -3.6531571299e-02f))));
  const float angle = base - ((u * (odd + even) - baseLow) - u);
  return q >= 0x1p25f ? 1.5707963705e+00f : angle;
}

/// The first step of `Atan2`: |y / x|, with the limits that the arc tangent needs where that is not a number.
GRIDMILL_INLINE float Atan2Quotient(float y, float x) {
  constexpr float infinity = std::numeric_limits<float>::infinity();
  const float height = std::fabs(y);
  const float width = std::fabs(x);
  const bool origin = (height == 0.0f) & (width == 0.0f);
  const bool corner = (height == infinity) & (width == infinity);
  float quotient = height / width;
  quotient = origin ? 0.0f : quotient;
  return corner ? 1.0f : quotient;
}

/// The last step of `Atan2`: puts the arc tangent of the quotient into its quadrant.
GRIDMILL_INLINE float Atan2Quadrant(float y, float x, float arcTangent) {
  constexpr float infinity = std::numeric_limits<float>::infinity();
  constexpr float pi = 3.1415927410e+00f;
  constexpr float piLow = -8.7422776573e-08f;
  constexpr float halfPi = 1.5707963705e+00f;
  const float height = std::fabs(y);
  const float width = std::fabs(x);
  const bool vertical = ((width == 0.0f) & (height > 0.0f)) | ((height == infinity) & (width < infinity));
  const float left = pi - (arcTangent - piLow);
  float angle = std::signbit(x) ? left : arcTangent;
  angle = vertical ? halfPi : angle;
  return std::copysign(angle, y);
}

/// The angle of the point (x, y) in radians, from -pi to pi.
GRIDMILL_INLINE float Atan2(float y, float x) {
  return Atan2Quadrant(y, x, AtanPositive(Atan2Quotient(y, x)));
}

}  // namespace orvik::kernels
