#include "tests/reference/intenratiochange_reference.h"

#include <cmath>
#include <cstdint>
#include <vector>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using changedetection::details::IntenRatioParams;
using tessel::Mask;
using tessel::Raster;

/// Adds the samples of a pixel to `sum`, up to the first no-data sample; false if there was one.
template <class In>
bool Add(const Raster& raster, bool noDataActive, const std::vector<float>& noData, std::uint32_t x,
         std::uint32_t y, double& sum) {
  for (std::uint32_t c = 0; c < raster.channels; ++c) {
    const In sample = Read<In>(raster, x, y, c);
    if (noDataActive && static_cast<float>(sample) == noData[c]) return false;
    sum = sum + static_cast<double>(sample);
  }
  return true;
}

template <class Out>
void Exclude(float noData, std::uint32_t x, std::uint32_t y, Raster& out) {
  for (std::uint32_t c = 0; c < 4; ++c) Write(out, x, y, c, ClipTo<Out>(noData));
}

template <class In, class Out>
void Pixel(const IntenRatioParams& params, const Raster& image, const Raster& reference, bool noDataActive,
           std::uint32_t x, std::uint32_t y, Raster& out) {
  double s = 0.0, t = 0.0;
  const bool imageValid = Add<In>(image, noDataActive, params.imgNoData, x, y, s);
  const bool referenceValid = Add<In>(reference, noDataActive, params.refNoData, x, y, t);
  if (!imageValid || !referenceValid) return Exclude<Out>(params.noData, x, y, out);
  const double T = t / static_cast<double>(reference.channels);
  const double S = s / static_cast<double>(image.channels);
  double D = 0.0;
  if (!(T == 0.0)) D = 10.0 * std::log10(std::fabs(S / T));
  Write(out, x, y, 0, ClipTo<Out>(S));
  Write(out, x, y, 1, ClipTo<Out>(T));
  Write(out, x, y, 2, ClipTo<Out>(D));
  Write(out, x, y, 3, ClipTo<Out>(0.0));
}

template <class In, class Out>
void Image(const IntenRatioParams& params, const Raster& image, const Raster& reference, const Mask* mask,
           Raster& out) {
  const bool noDataActive = image.channels == params.imgNoData.size();
  for (std::uint32_t y = 0; y < image.height; ++y) {
    for (std::uint32_t x = 0; x < image.width; ++x) {
      if (IsValid(mask, x, y)) {
        Pixel<In, Out>(params, image, reference, noDataActive, x, y, out);
      } else {
        Exclude<Out>(params.noData, x, y, out);
      }
    }
  }
}

}  // namespace

void IntenRatioChange(const IntenRatioParams& params, const Raster& image, const Raster& reference,
                      const Mask* mask, Raster& out) {
  tests::WithPixelTypes(image.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, image, reference, mask, out); });
}

}  // namespace orvik::reference
