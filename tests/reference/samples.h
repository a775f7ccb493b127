#pragma once

#include <cstdint>
#include <cstring>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::reference {

/// The index of pixel (x, y) in the buffer of a raster or a mask.
template <class Grid>
std::uint32_t PixelIndex(const Grid& grid, std::uint32_t x, std::uint32_t y) {
  return (grid.marginY + y) * grid.bufferWidth + grid.marginX + x;
}

/// The address of pixel (x, y), by the raster's own fields.
inline unsigned char* PixelAddress(const tessel::Raster& raster, std::uint32_t x, std::uint32_t y) {
  const std::uint64_t pixelBits =
      std::uint64_t{raster.dataType.isComplex ? 2u : 1u} * raster.dataType.sizeBits;
  const std::uint64_t bitOffset = PixelIndex(raster, x, y) * pixelBits * raster.channels;
  return raster.data + (bitOffset >> 3);
}

/// The element with the index `element`, counted from pixel (x, y).
template <class T>
T Read(const tessel::Raster& raster, std::uint32_t x, std::uint32_t y, std::uint64_t element) {
  T value;
  std::memcpy(&value, PixelAddress(raster, x, y) + element * sizeof(T), sizeof(T));
  return value;
}

template <class T>
void Write(tessel::Raster& raster, std::uint32_t x, std::uint32_t y, std::uint64_t element, T value) {
  std::memcpy(PixelAddress(raster, x, y) + element * sizeof(T), &value, sizeof(T));
}

/// The bit with the index `index`, the most significant bit of a byte first.
inline bool Bit(const tessel::Mask& mask, std::uint32_t index) {
  return (mask.bits[index >> 3] >> (7 - (index & 7)) & 1) != 0;
}

/// The mask bit of pixel (x, y), by the mask's own geometry; set where there is no mask.
inline bool IsValid(const tessel::Mask* mask, std::uint32_t x, std::uint32_t y) {
  return mask == nullptr || Bit(*mask, PixelIndex(*mask, x, y));
}

/// The real parts of a complex raster, margins included.
inline std::unique_ptr<tessel::Raster> RealParts(const tessel::Raster& raster) {
  tessel::RasterInfo info = raster;
  info.dataType.isComplex = false;
  auto real = std::make_unique<tessel::Raster>(info, raster);
  const std::uint64_t bytes = raster.dataType.sizeBits / 8;
  for (std::uint64_t i = 0; i * bytes < real->dataSize; ++i) {
    std::memcpy(real->data + i * bytes, raster.data + 2 * i * bytes, bytes);
  }
  return real;
}

}  // namespace orvik::reference
