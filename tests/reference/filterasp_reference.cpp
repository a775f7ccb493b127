#include "tests/reference/filterasp_reference.h"

#include <cmath>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/reference/terraincell_reference.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::AspParams;

float Aspect(float nx, float ny, bool isHalved) {
  float aspect = (std::atan2(ny, nx) + 1.5707964f) * 57.29578f;
  if (aspect < 0.0f) aspect = aspect + 360.0f;
  if (isHalved) aspect = aspect * 0.5f;
  return aspect;
}

template <class In>
float Result(const AspParams& p, const tessel::Raster& in, const tessel::Mask* mask, std::uint32_t x,
             std::uint32_t y, bool isHalved) {
  if (!IsValid(mask, x, y)) return p.Background;
  if (!IsValid(mask, x + 1, y) || !IsValid(mask, x + 1, y + 1) || !IsValid(mask, x, y + 1))
    return p.ZeroSlope;
  const std::uint32_t row = in.width + 2 * in.marginX;
  const auto corner = [&](std::uint32_t cx, std::uint32_t cy) {
    const std::uint32_t index = (in.marginY + cy) * row + in.marginX + cx;
    const bool isByteSet = mask == nullptr || Bit(*mask, index);
    return isByteSet ? static_cast<float>(Read<In>(in, cx, cy, 0)) : 0.0f;
  };
  const auto [nx, ny] = CellNormal(corner(x, y), corner(x + 1, y), corner(x, y + 1), corner(x + 1, y + 1),
                                   p.XSIZE, p.YSIZE, p.ELSZ);
  if (nx == 0.0f && ny == 0.0f) return p.ZeroSlope;
  return Aspect(nx, ny, isHalved);
}

template <class In, class Out>
void Image(const AspParams& p, const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out) {
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      Write(out, 0, y, x, ClipTo<Out>(Result<In>(p, in, mask, x, y, sizeof(Out) == 1)));
    }
  }
}

}  // namespace

void FilterAsp(const AspParams& params, const tessel::Raster& in, const tessel::Mask* mask,
               tessel::Raster& out) {
  if (in.dataType.isComplex) return FilterAsp(params, *RealParts(in), mask, out);
  tests::WithPixelTypes(in.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, mask, out); });
}

}  // namespace orvik::reference
