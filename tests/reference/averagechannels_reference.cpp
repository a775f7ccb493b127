#include "tests/reference/averagechannels_reference.h"

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

template <class In, class Out>
Out Pixel(float noData, const tessel::Raster& in, bool isValid, std::uint32_t x, std::uint32_t y) {
  if (!isValid) return PlainCast<Out>(PlainCast<In>(noData));
  float sum = 0.0f;
  for (std::uint32_t c = 0; c < in.channels; ++c) {
    const float s = static_cast<float>(Read<In>(in, x, y, c));
    const float difference = s - noData;
    if (static_cast<double>(difference) > -1e-9 && static_cast<double>(difference) < 1e-9) {
      return ClipTo<Out>(noData);
    }
    sum = sum + s;
  }
  const float mean = sum / static_cast<float>(in.channels);
  return ClipTo<Out>(mean);
}

template <class In, class Out>
void Image(float noData, const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out) {
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      Write(out, 0, y, x, Pixel<In, Out>(noData, in, IsValid(mask, x, y), x, y));
    }
  }
}

}  // namespace

void AverageChannels(float noData, const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out) {
  if (in.dataType.isComplex) return AverageChannels(noData, *RealParts(in), mask, out);
  tests::WithPixelTypes(in.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(noData, in, mask, out); });
}

}  // namespace orvik::reference
