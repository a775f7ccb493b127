#pragma once

#include <algorithm>
#include <cstddef>
#include <cstring>

namespace orvik::kernels {

/// True if every one of `count` mask bytes is set.
inline bool AllValid(const unsigned char* valid, std::size_t count) {
  return std::memchr(valid, 0, count) == nullptr;
}

/// True if every one of `count` mask bytes is clear.
inline bool AllMasked(const unsigned char* valid, std::size_t count) {
  return std::memchr(valid, 1, count) == nullptr;
}

/// One byte of validity for each sample of `pixels` pixels, from one for each pixel.
void ReplicateRow(const unsigned char* pixel, std::size_t channels, std::size_t pixels,
                  unsigned char* sample);

/// Corners of cells with the masked ones replaced by their centres.
void LevelRow(const float* centre, const float* corner, const unsigned char* valid, std::size_t count,
              float* level);

/// Walks a row of cells in blocks of `pixels`: those with every pixel masked go to `row.Background`, those
/// with every corner valid to `row.Unmasked`, the others with their bytes to `row.Masked`.
///
/// @param mask       one byte of 0 or 1 for each of `width` + 1 pixels
/// @param maskBelow  the same for the row below
template <class Row>
void RunMaskedCells(const Row& row, std::size_t width, std::size_t pixels, const unsigned char* mask,
                    const unsigned char* maskBelow) {
  for (std::size_t x = 0; x < width; x += pixels) {
    const std::size_t count = std::min(pixels, width - x);
    if (AllMasked(mask + x, count)) {
      row.Background(x, count);
    } else if (AllValid(mask + x, count + 1) && AllValid(maskBelow + x, count + 1)) {
      row.Unmasked(x, count);
    } else {
      row.Masked(x, count, mask + x, maskBelow + x);
    }
  }
}

}  // namespace orvik::kernels
