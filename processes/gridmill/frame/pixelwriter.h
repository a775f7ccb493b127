#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"

namespace orvik::frame {

/// Pixels of a block at most.
inline constexpr std::size_t kMaxBlock = 2048;

/// Pixels of a block of about `samples` samples: whole vectors of them where pixels are not large.
inline std::size_t DensePixels(std::size_t channels, std::size_t samples) {
  const std::size_t pixels = std::min(kMaxBlock, samples / std::max<std::size_t>(channels, 1));
  return pixels >= 64 ? pixels & ~std::size_t{63} : std::max<std::size_t>(pixels, 1);
}

/// Where the samples of a row's pixels lie.
enum class Walk {
  kPixels,    ///< those of each pixel at the place that the raster's own fields give it
  kElements,  ///< one after the other from the row's first element on, whatever the raster's channels
};

/// Elements of a pixel: two for each channel of a complex raster.
inline std::size_t ElementsOf(const tessel::Raster& raster) {
  return std::size_t{raster.channels} * (raster.dataType.isComplex ? 2 : 1);
}

/// True if the raster holds elements of this type, real or complex.
inline bool Holds(const tessel::Raster& raster, tessel::DataType element) {
  element.isComplex = raster.dataType.isComplex;
  return raster.dataType == element;
}

/// Takes the samples of an output's pixels, a block of a row at a time: where they belong, or by way of a
/// scratch block if the pixels have other samples between or another type than is written. A large output
/// goes past the caches, by way of the scratch block too.
class PixelWriter {
 public:
  /// @param element  the type that is written; that of the raster may be another
  /// @param samples  written to each pixel
  /// @param pixels   of a block at most
  PixelWriter(const tessel::Raster& raster, const tessel::DataType& element, std::size_t samples,
              std::size_t pixels, Walk walk = Walk::kPixels);
  PixelWriter(const PixelWriter&) = delete;
  PixelWriter& operator=(const PixelWriter&) = delete;
  ~PixelWriter();

  /// Where the samples of the pixels from (x, y) on are to be put.
  unsigned char* At(std::uint32_t x, std::uint32_t y);

  /// Called when they are there. Pixels are written in their order: where one has less room than is written,
  /// the next one prevails.
  void Write(std::uint32_t x, std::uint32_t y, std::size_t pixels) const;

 private:
  bool InPlace() const { return dense_ && !streams_; }
  unsigned char* Place(std::uint32_t x, std::uint32_t y) const;

  const tessel::Raster& raster_;
  Walk walk_;
  std::size_t bytes_;  // of a pixel that are written
  bool dense_;         // they follow each other without others between
  bool streams_;
  std::vector<unsigned char> block_;
};

}  // namespace orvik::frame
