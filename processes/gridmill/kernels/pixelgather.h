#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

/// Pixels taken from a row in any order.
namespace orvik::kernels {

/// A choice of pixels of a row, prepared for many rows of one kind. Pixels are moved as bytes.
class PixelGather {
 public:
  /// @param columns     the pixels in the order in which they are taken
  /// @param pixelBytes  of a pixel
  /// @param rowPixels   of a row; each column is one of them
  PixelGather(std::vector<std::uint32_t> columns, std::size_t pixelBytes, std::size_t rowPixels);

  /// True if the pixels from the one at position `from` on follow each other in the row.
  bool IsConsecutive(std::size_t from, std::size_t count) const;

  /// The first byte of the pixel at a position.
  const unsigned char* At(const unsigned char* row, std::size_t position) const {
    return row + columns_[position] * pixelBytes_;
  }

  /// Copies `count` pixels from the position `from` on, which is a multiple of 16.
  void Take(const unsigned char* row, std::size_t from, std::size_t count, unsigned char* target) const;

 private:
  /// Bytes of the target that come from as many neighbouring bytes of the row.
  struct Chunk {
    std::array<unsigned char, 16> order;
    std::uint32_t first;
  };

  void PrepareChunks(std::size_t rowPixels);

  std::vector<std::uint32_t> columns_;
  std::size_t pixelBytes_;
  std::vector<std::uint32_t> jumps_;  ///< positions whose column does not follow the one before
  std::vector<Chunk> chunks_;         ///< empty if bytes lie too far apart for one of them
};

}  // namespace orvik::kernels
