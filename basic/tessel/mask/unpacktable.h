#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/samples.h"

namespace orvik::tessel {

/// Row v is the byte v spelled out as eight bytes of 0 or 1, the most significant bit first.
using UnpackTable = std::array<unsigned char, std::size_t{256} * 8>;

constexpr UnpackTable MakeUnpackTable() {
  UnpackTable table{};
  for (std::size_t v = 0; v < 256; ++v)
    for (std::size_t i = 0; i < 8; ++i) table[v * 8 + i] = static_cast<unsigned char>((v >> (7 - i)) & 1);
  return table;
}

/// One table for all operators, there before the library runs.
alignas(64) inline constexpr UnpackTable kUnpackTable = MakeUnpackTable();

/// The mask bit with the given index, 0 or 1.
inline unsigned char MaskBit(const Mask& mask, std::uint32_t bitIndex) {
  return kUnpackTable[std::size_t{mask.bits[bitIndex >> 3]} * 8 + (bitIndex & 7)];
}

/// The mask bit of pixel (x, y), 0 or 1, by the mask's own geometry.
inline unsigned char MaskBitAt(const Mask& mask, std::uint32_t x, std::uint32_t y) {
  return MaskBit(mask, PixelIndex(mask, x, y));
}

/// Spreads the bits of one byte over eight bytes of 0 or 1.
inline void UnpackByte(unsigned char byte, unsigned char* target) {
  std::memcpy(target, kUnpackTable.data() + std::size_t{byte} * 8, 8);
}

}  // namespace orvik::tessel
