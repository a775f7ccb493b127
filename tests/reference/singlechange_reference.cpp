#include "tests/reference/singlechange_reference.h"

#include <cmath>
#include <cstdint>

#include "tests/reference/changesamples.h"
#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

float Difference(int type, float i, float r) {
  if (type == 1) return r - i;
  if (type == 0) return std::fabs(r - i);
  return i - r;
}

template <class In, class Out>
Out Pixel(int type, const tessel::Raster& image, const tessel::Raster& reference, bool isValid,
          std::uint32_t x, std::uint32_t y) {
  if (!isValid) return ClipTo<Out>(0);
  const float i = static_cast<float>(Read<In>(image, x, y, 0));
  const float r = static_cast<float>(Read<In>(reference, x, y, 0));
  return ClipTo<Out>(Difference(type, i, r));
}

template <class In, class Out>
void Image(int type, const tessel::Raster& image, const tessel::Raster& reference, const tessel::Mask* mask,
           tessel::Raster& out) {
  ForEachPixel(image, [&](std::uint32_t x, std::uint32_t y) {
    Write(out, x, y, 0, Pixel<In, Out>(type, image, reference, IsValid(mask, x, y), x, y));
  });
}

}  // namespace

void SingleChange(int type, const tessel::Raster& image, const tessel::Raster& reference,
                  const tessel::Mask* mask, tessel::Raster& out) {
  tests::WithPixelTypes(image.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(type, image, reference, mask, out); });
}

}  // namespace orvik::reference
