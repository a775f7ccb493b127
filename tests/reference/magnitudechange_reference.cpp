#include "tests/reference/magnitudechange_reference.h"

#include <cmath>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using changedetection::details::MagnitudeParams;
using tessel::Mask;
using tessel::Raster;

/// The square in the sample's own arithmetic, which wraps for integers.
template <class In>
double Square(In sample) {
  if constexpr (std::is_floating_point_v<In>) {
    const In square = sample * sample;
    return static_cast<double>(square);
  } else if constexpr (std::is_same_v<In, std::int64_t>) {
    const std::uint64_t bits = static_cast<std::uint64_t>(sample) * static_cast<std::uint64_t>(sample);
    return static_cast<double>(static_cast<std::int64_t>(bits));
  } else if constexpr (std::is_same_v<In, unsigned int> || std::is_same_v<In, std::uint64_t>) {
    return static_cast<double>(sample * sample);
  } else {
    const std::uint32_t bits = static_cast<std::uint32_t>(sample) * static_cast<std::uint32_t>(sample);
    return static_cast<double>(static_cast<std::int32_t>(bits));
  }
}

/// Adds the squares of a pixel to `sum`, up to the first no-data sample; false if there was one.
template <class In>
bool AddSquares(const Raster& raster, bool noDataActive, const std::vector<float>& noData, std::uint32_t x,
                std::uint32_t y, double& sum) {
  for (std::uint32_t c = 0; c < raster.channels; ++c) {
    const In sample = Read<In>(raster, x, y, c);
    if (noDataActive && static_cast<float>(sample) == noData[c]) return false;
    sum = sum + Square(sample);
  }
  return true;
}

template <class Out>
void Exclude(float noData, std::uint32_t x, std::uint32_t y, Raster& out) {
  for (std::uint32_t c = 0; c < 3; ++c) Write(out, x, y, c, ClipTo<Out>(noData));
}

double Compare(int type, double A, double B) {
  if (type == 0) return std::fabs(A - B);
  if (type == 1) return A - B;
  return B - A;
}

template <class In, class Out>
void Pixel(const MagnitudeParams& params, const Raster& image, const Raster& reference, bool noDataActive,
           std::uint32_t x, std::uint32_t y, Raster& out) {
  double s = 0.0, t = 0.0;
  const bool imageValid = AddSquares<In>(image, noDataActive, params.imgNoData, x, y, s);
  const bool referenceValid = AddSquares<In>(reference, noDataActive, params.refNoData, x, y, t);
  if (!imageValid || !referenceValid) return Exclude<Out>(params.noData, x, y, out);
  const double A = std::sqrt(s), B = std::sqrt(t);
  Write(out, x, y, 0, ClipTo<Out>(A));
  Write(out, x, y, 1, ClipTo<Out>(B));
  Write(out, x, y, 2, ClipTo<Out>(Compare(params.type, A, B)));
}

template <class In, class Out>
void Image(const MagnitudeParams& params, const Raster& image, const Raster& reference, const Mask* mask,
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

void MagnitudeChange(const MagnitudeParams& params, const Raster& image, const Raster& reference,
                     const Mask* mask, Raster& out) {
  tests::WithPixelTypes(image.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, image, reference, mask, out); });
}

}  // namespace orvik::reference
