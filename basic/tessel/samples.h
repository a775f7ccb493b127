#pragma once

#include <cstdint>

#include "basic/tessel/raster.h"

namespace orvik::tessel {

/// The index of pixel (x, y) in the buffer of a raster or mask, in wrapping 32-bit arithmetic. Positions in
/// the margin are taken as they wrap: -1 as 2^32 - 1.
template <class Geometry>
inline std::uint32_t PixelIndex(const Geometry& geometry, std::uint32_t x, std::uint32_t y) {
  return (geometry.marginY + y) * geometry.bufferWidth + geometry.marginX + x;
}

/// The byte offset of pixel (x, y): the one addressing rule for inputs, references and outputs alike.
inline std::uint64_t PixelOffset(const Raster& raster, std::uint32_t x, std::uint32_t y) {
  const std::uint64_t parts = raster.dataType.isComplex ? 2 : 1;
  const std::uint64_t pixelBits = parts * raster.dataType.sizeBits * raster.channels;
  return (PixelIndex(raster, x, y) * pixelBits) >> 3;
}

/// Sample 0 of pixel (x, y), as an element of type `Pixel`.
template <class Pixel>
inline Pixel* PixelAt(const Raster& raster, std::uint32_t x, std::uint32_t y) {
  return reinterpret_cast<Pixel*>(raster.data + PixelOffset(raster, x, y));
}

}  // namespace orvik::tessel
