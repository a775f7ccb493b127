#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/mask/unpacktable.h"

namespace orvik::tessel {

/// Spreads `count` mask bits, from the one with index `bitIndex` on, over bytes of 0 or 1.
inline void UnpackBits(const Mask& mask, std::uint32_t bitIndex, std::size_t count, unsigned char* target) {
  const unsigned char* const bytes = mask.bits.data() + (bitIndex >> 3);
  const unsigned int shift = bitIndex & 7;
  std::size_t done = 0;
  if (shift == 0) {
    for (; done + 8 <= count; done += 8) UnpackByte(bytes[done / 8], target + done);
  } else {
    for (; done + 8 <= count; done += 8) {
      const unsigned int pair = (static_cast<unsigned int>(bytes[done / 8]) << 8) | bytes[done / 8 + 1];
      UnpackByte(static_cast<unsigned char>(pair >> (8 - shift)), target + done);
    }
  }
  for (; done < count; ++done) target[done] = MaskBit(mask, bitIndex + static_cast<std::uint32_t>(done));
}

/// True if the bit of a pixel in `mask` has the index that the pixel has in `raster`'s buffer.
inline bool HasGeometryOf(const Mask& mask, const Raster& raster) {
  return mask.marginX == raster.marginX && mask.marginY == raster.marginY &&
         mask.bufferWidth == raster.width + 2 * raster.marginX;
}

/// A mask spread over one byte of 0 or 1 for each bit, looked up by the geometry of the raster that it masks.
class MaskBytes {
 public:
  /// Null makes an empty one, which must not be looked up.
  explicit MaskBytes(const Mask* mask) : raster_(mask != nullptr ? mask->CreateRaster() : nullptr) {}

  /// The byte of pixel (x, y) of `raster`; that of the pixel below lies `Pitch` further.
  const unsigned char* At(const Raster& raster, std::uint32_t x, std::uint32_t y) const {
    return raster_->data + ((raster.marginY + y) * Pitch(raster) + raster.marginX + x);
  }

  static std::uint32_t Pitch(const Raster& raster) { return raster.width + 2 * raster.marginX; }

 private:
  std::unique_ptr<Raster> raster_;
};

}  // namespace orvik::tessel
