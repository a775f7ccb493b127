#include "tests/reference/combchange_reference.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using changedetection::details::CombParams;
using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

/// True if a orders before b: the first of the five fields that differs decides.
bool OrdersBefore(const DataType& a, const DataType& b) {
  if (a.sizeBits != b.sizeBits) return a.sizeBits < b.sizeBits;
  if (a.isSigned != b.isSigned) return b.isSigned;
  if (a.isFloat != b.isFloat) return b.isFloat;
  if (a.mantissaBits != b.mantissaBits) return a.mantissaBits < b.mantissaBits;
  if (a.isComplex != b.isComplex) return b.isComplex;
  return false;
}

/// What one call keeps from pixel to pixel on the path of unlike types.
struct State {
  float value = 0.0f;
  char scratch[3] = {'\0', '\0', '\0'};
};

template <class In, class Out>
void LikeTypes(const Raster& image, const Raster& reference, std::uint32_t x, std::uint32_t y, Raster& out) {
  const std::uint32_t m = image.channels, n = reference.channels;
  for (std::uint32_t c = 0; c < m; ++c) Write(out, x, y, c, ClipTo<Out>(Read<In>(image, x, y, c)));
  for (std::uint32_t c = 0; c < n; ++c) {
    Write(out, x, y, std::uint64_t{m} + c, ClipTo<Out>(Read<In>(reference, x, y, c)));
  }
}

template <class In, class Out>
void UnlikeImageSample(const Raster& image, bool imageNotBelow, std::uint32_t x, std::uint32_t y,
                       std::uint32_t c, State& state, Raster& out) {
  if (imageNotBelow) {
    Write(out, x, y, c, ClipTo<Out>(Read<In>(image, x, y, c)));
    return;
  }
  if (image.dataType.sizeBits == 16) {
    std::memcpy(state.scratch, PixelAddress(image, x, y) + std::uint64_t{c} * sizeof(In), 2);
    state.scratch[2] = 0;
  }
  state.value = static_cast<float>(std::atoi(state.scratch));
  Write(out, x, y, c, ClipTo<Out>(state.value));
}

template <class In, class Out>
void UnlikeReferenceSample(const Raster& reference, bool imageNotBelow, std::uint32_t x, std::uint32_t y,
                           std::uint32_t c, std::uint64_t outSample, State& state, Raster& out) {
  if (!imageNotBelow) {
    Write(out, x, y, outSample, ClipTo<Out>(Read<In>(reference, x, y, c)));
    return;
  }
  if (reference.dataType.sizeBits == 8) {
    state.value = static_cast<float>(PixelAddress(reference, x, y)[c]);
  }
  Write(out, x, y, outSample, ClipTo<Out>(state.value));
}

template <class In, class Out>
void UnlikeTypes(const Raster& image, const Raster& reference, bool imageNotBelow, std::uint32_t x,
                 std::uint32_t y, State& state, Raster& out) {
  const std::uint32_t m = image.channels, n = reference.channels;
  for (std::uint32_t c = 0; c < m; ++c) {
    UnlikeImageSample<In, Out>(image, imageNotBelow, x, y, c, state, out);
  }
  for (std::uint32_t c = 0; c < n; ++c) {
    UnlikeReferenceSample<In, Out>(reference, imageNotBelow, x, y, c, std::uint64_t{m} + c, state, out);
  }
}

template <class In, class Out>
void Image(const CombParams& params, const Raster& image, const Raster& reference, const Mask* mask,
           Raster& out) {
  const std::uint64_t samples = std::uint64_t{image.channels} + reference.channels;
  const bool sameType = image.dataType == reference.dataType;
  const bool imageNotBelow = !OrdersBefore(image.dataType, reference.dataType);
  State state;
  for (std::uint32_t y = 0; y < image.height; ++y) {
    for (std::uint32_t x = 0; x < image.width; ++x) {
      if (!IsValid(mask, x, y)) {
        for (std::uint64_t c = 0; c < samples; ++c) Write(out, x, y, c, ClipTo<Out>(params.noData));
      } else if (sameType) {
        LikeTypes<In, Out>(image, reference, x, y, out);
      } else {
        UnlikeTypes<In, Out>(image, reference, imageNotBelow, x, y, state, out);
      }
    }
  }
}

}  // namespace

void CombChange(const CombParams& params, const Raster& image, const Raster& reference, const Mask* mask,
                Raster& out) {
  tests::WithPixelTypes(image.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, image, reference, mask, out); });
}

}  // namespace orvik::reference
