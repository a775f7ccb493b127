#include "tests/reference/normalize_reference.h"

#include <cstdint>
#include <vector>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::NormalizeParams;

float Percent(float value, float min, float max, float range) {
  if (min >= value) return 0.0f;
  if (value >= max) return 100.0f;
  const float above = value - min;
  const double product = static_cast<double>(above) * 100.0;
  const float percent = static_cast<float>(product / static_cast<double>(range));
  if (percent < 0.0f) return 0.0f;
  if (percent >= 100.0f) return 100.0f;
  return percent;
}

template <class In, class Out>
Out Sample(const NormalizeParams& params, const std::vector<float>& range, In sample, std::uint32_t c) {
  const float value = static_cast<float>(sample);
  const float difference = value - params.NoData;
  const double delta = static_cast<double>(difference);
  if (delta > -1e-9 && delta < 1e-9) return ClipTo<Out>(params.NoData);
  return ClipTo<Out>(Percent(value, params.MinData[c], params.MaxData[c], range[c]));
}

template <class In, class Out>
void Image(const NormalizeParams& params, const tessel::Raster& in, tessel::Raster& out) {
  std::vector<float> range(in.channels);
  for (std::uint32_t c = 0; c < in.channels; ++c) range[c] = params.MaxData[c] - params.MinData[c];
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      for (std::uint32_t c = 0; c < in.channels; ++c) {
        const std::uint64_t element = std::uint64_t{x} * in.channels + c;
        Write(out, 0, y, element, Sample<In, Out>(params, range, Read<In>(in, x, y, c), c));
      }
    }
  }
}

}  // namespace

void Normalize(const NormalizeParams& params, const tessel::Raster& in, tessel::Raster& out) {
  tests::WithPixelTypes(in.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, out); });
}

}  // namespace orvik::reference
