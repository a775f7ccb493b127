#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/mask/unpacktable.h"

namespace orvik::tessel {

/// Spreads 16 bits over 16 bytes of 0 or 1.
inline void Unpack16(const unsigned char* bits, unsigned char* target) {
  using Bytes = unsigned char __attribute__((vector_size(16)));
  constexpr Bytes weights = {128, 64, 32, 16, 8, 4, 2, 1, 128, 64, 32, 16, 8, 4, 2, 1};
  constexpr Bytes one = {1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1, 1};
  Bytes b = {};
  std::memcpy(&b, bits, 2);
  // Each byte twice, then each pair, then each four: steps that every x86-64 processor has.
  b = __builtin_shufflevector(b, b, 0, 16, 1, 17, 2, 18, 3, 19, 4, 20, 5, 21, 6, 22, 7, 23);
  b = __builtin_shufflevector(b, b, 0, 1, 16, 17, 2, 3, 18, 19, 4, 5, 20, 21, 6, 7, 22, 23);
  b = __builtin_shufflevector(b, b, 0, 1, 2, 3, 0, 1, 2, 3, 4, 5, 6, 7, 4, 5, 6, 7);
  const Bytes spread = reinterpret_cast<Bytes>((b & weights) == weights) & one;
  std::memcpy(target, &spread, 16);
}

/// Spreads `count` mask bits, from the one with index `bitIndex` on, over bytes of 0 or 1.
inline void UnpackBits(const Mask& mask, std::uint32_t bitIndex, std::size_t count, unsigned char* target) {
  const unsigned char* const bytes = mask.bits.data() + (bitIndex >> 3);
  const unsigned int shift = bitIndex & 7;
  std::size_t done = 0;
  if (shift == 0) {
    for (; done + 16 <= count; done += 16) Unpack16(bytes + done / 8, target + done);
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
