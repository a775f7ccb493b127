#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/pixelwriter.h"

namespace orvik::frame {

/// Gives the samples of an input's pixels, a block of a row at a time: where they stand, or copied if they
/// are not of the type that is read. A kept processor may meet such a raster.
class PixelReader {
 public:
  /// @param element  the type that is read; that of the raster may be another
  /// @param samples  read from each pixel; those past the pixel's own come from the memory behind it, those
  ///                 past the raster's memory are 0
  /// @param pixels   of a block at most
  PixelReader(const tessel::Raster& raster, const tessel::DataType& element, std::size_t samples,
              std::size_t pixels, Walk walk = Walk::kPixels);

  /// The first sample of pixel (x, y), followed by those of the row's next ones.
  const unsigned char* At(std::uint32_t x, std::uint32_t y, std::size_t pixels);

  /// Samples from pixel to pixel.
  std::size_t Stride() const { return stride_; }

 private:
  const tessel::Raster& raster_;
  std::size_t sampleBytes_;
  std::size_t samples_;
  bool inPlace_;
  std::size_t stride_;
  std::vector<unsigned char> block_;
};

}  // namespace orvik::frame
