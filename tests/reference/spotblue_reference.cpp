#include "tests/reference/spotblue_reference.h"

#include <cstdint>
#include <type_traits>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using gridmill::details::BlueParams;
using tessel::Mask;
using tessel::Raster;

template <class Out>
void WriteBackground(const BlueParams& p, Raster& out, std::uint32_t x, std::uint32_t y) {
  const std::uint32_t count = out.channels == 3 ? 3 : 1;
  for (std::uint32_t c = 0; c < count; ++c) Write(out, x, y, c, PlainCast<Out>(p.backGround[c]));
}

/// A sample of the first two bands, stretched.
template <class In>
double Stretched(const BlueParams& p, std::uint32_t c, In s) {
  if constexpr (std::is_same_v<In, double>) {
    return (s - static_cast<double>(p.min[c])) * static_cast<double>(p.scale[c]);
  } else {
    const float difference = static_cast<float>(s) - p.min[c];
    const float product = difference * p.scale[c];
    return static_cast<double>(product);
  }
}

/// Finds the synthetic band of a pixel; false if the pixel is background.
template <class In>
bool FindBlue(const BlueParams& p, const Raster& in, std::uint32_t x, std::uint32_t y, double& B) {
  B = 0.0;
  for (std::uint32_t c = 0; c < in.channels; ++c) {
    const std::int32_t i = PlainCast<std::int32_t>(Read<In>(in, x, y, c));
    if (i == PlainCast<std::int32_t>(p.backGround[c])) return false;
    if (c < 2) {
      const float f = static_cast<float>(i);
      if (p.min[c] > f || f > p.max[c]) return false;
    } else {
      const double s0 = static_cast<double>(Read<In>(in, x, y, 0));
      const double s1 = static_cast<double>(Read<In>(in, x, y, 1));
      const double s2 = static_cast<double>(Read<In>(in, x, y, 2));
      B = s0 * 0.873393;
      B = B + 13.9054;
      B = B - s1 * 0.138254;
      B = B - s2 * 0.100616;
      if (static_cast<double>(p.min[2]) > B || B > static_cast<double>(p.max[2])) return false;
    }
  }
  return true;
}

template <class In, class Out>
void WriteValid(const BlueParams& p, const Raster& in, Raster& out, std::uint32_t x, std::uint32_t y,
                double B) {
  const bool isTriple = out.channels == 3;
  const In s0 = isTriple ? Read<In>(in, x, y, 0) : In();
  const In s1 = isTriple ? Read<In>(in, x, y, 1) : In();
  if (p.trim) {
    if (isTriple) Write(out, x, y, 1, ClipTo<Out>(Stretched(p, 0, s0)));
    if (isTriple) Write(out, x, y, 0, ClipTo<Out>(Stretched(p, 1, s1)));
    B = (B - static_cast<double>(p.min[2])) * static_cast<double>(p.scale[2]);
  } else {
    if (B < 0.0) {
      B = 0.0;
    } else if (B > 255.0) {
      B = 255.0;
    }
    if (isTriple) Write(out, x, y, 1, PlainCast<Out>(s0));
    if (isTriple) Write(out, x, y, 0, PlainCast<Out>(s1));
  }
  Write(out, x, y, isTriple ? 2 : 0, ClipTo<Out>(B));
}

template <class In, class Out>
void Image(const BlueParams& p, const Raster& in, const Mask* mask, Raster& out) {
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      double B = 0.0;
      if (IsValid(mask, x, y) && FindBlue<In>(p, in, x, y, B)) {
        WriteValid<In, Out>(p, in, out, x, y, B);
      } else {
        WriteBackground<Out>(p, out, x, y);
      }
    }
  }
}

}  // namespace

void SPOTBlue(const BlueParams& params, const tessel::DataType& readAs, const tessel::DataType& writtenAs,
              const Raster& in, const Mask* mask, Raster& out) {
  tests::WithPixelTypes(readAs, writtenAs,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, mask, out); });
}

void SPOTBlue(const BlueParams& params, const Raster& in, const Mask* mask, Raster& out) {
  SPOTBlue(params, in.dataType, out.dataType, in, mask, out);
}

}  // namespace orvik::reference
