#include "tests/reference/bitmapfiltering_reference.h"

#include <cmath>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::BitFParams;

bool IsSelected(const BitFParams& p, float s) {
  const bool hasNaN = std::isnan(p.thresholdMin) || std::isnan(p.thresholdMax);
  if (hasNaN || p.thresholdMax < p.thresholdMin) return s >= p.thresholdMin || p.thresholdMax >= s;
  if (p.thresholdMin == p.thresholdMax) return s == p.thresholdMin;
  return s >= p.thresholdMin && p.thresholdMax >= s;
}

template <class In, class Out>
void Image(const BitFParams& p, const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out) {
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      In result = 0;
      if (IsValid(mask, x, y)) {
        const float s = static_cast<float>(Read<In>(in, 0, y, x));
        if (IsSelected(p, s)) result = 1;
      }
      Write(out, x, y, 0, ClipTo<Out>(result));
    }
  }
}

}  // namespace

void BitmapFiltering(const BitFParams& params, const tessel::DataType& writtenAs, const tessel::Raster& in,
                     const tessel::Mask* mask, tessel::Raster& out) {
  tests::WithPixelTypes(in.dataType, writtenAs,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, mask, out); });
}

}  // namespace orvik::reference
