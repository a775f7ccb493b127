#include "basic/tessel/complexinterpretation.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <memory>

namespace orvik::tessel {

namespace {

/// Copies every `stride`-th element of `ElementBytes` bytes.
template <std::size_t ElementBytes>
void CopyElements(const unsigned char* source, std::size_t stride, unsigned char* target, std::size_t count) {
  for (std::size_t i = 0; i < count; ++i)
    std::memcpy(target + i * ElementBytes, source + i * stride * ElementBytes, ElementBytes);
}

}  // namespace

ComplexInterpretation::~ComplexInterpretation() = default;

Raster* ComplexInterpretation::InterpretRaster(const Raster* raster, core::OrvikInterpretationTypes) const {
  RasterInfo info(*raster);
  info.dataType.isComplex = false;
  auto real = std::make_unique<Raster>(info, *raster);

  const std::size_t parts = raster->dataType.isComplex ? 2 : 1;
  const std::size_t count = 8 * real->dataSize / std::max(real->dataType.sizeBits, 8u);
  switch (raster->dataType.sizeBits) {
    case 8:
      CopyElements<1>(raster->data, parts, real->data, count);
      break;
    case 16:
      CopyElements<2>(raster->data, parts, real->data, count);
      break;
    case 32:
      CopyElements<4>(raster->data, parts, real->data, count);
      break;
    case 64:
      CopyElements<8>(raster->data, parts, real->data, count);
      break;
    default:
      break;
  }
  return real.release();
}

}  // namespace orvik::tessel
