#pragma once

#include <cstdint>

#include "basic/core/export.h"
#include "basic/tessel/datatype.h"

namespace orvik::tessel {

/// What an image is: its size without margins, its channels and its element type.
struct GRIDMILL_EXPORT RasterInfo {
  std::uint32_t width = 0;     ///< pixels in a row of the image area
  std::uint32_t height = 0;    ///< rows of the image area
  std::uint32_t channels = 0;  ///< samples in a pixel
  DataType dataType;           ///< the element type, one for all channels

  RasterInfo();
  RasterInfo(std::uint32_t width, std::uint32_t height, std::uint32_t channels, DataType dataType);
  RasterInfo(const RasterInfo&);
  RasterInfo& operator=(const RasterInfo&);
  virtual ~RasterInfo();
};

/// Where an image lies in its buffer and in the whole image that it is a piece of.
struct RasterContext {
  std::uint32_t marginX = 0;  ///< extra columns on the left and on the right, real neighbouring data
  std::uint32_t marginY = 0;  ///< extra rows above and below
  std::uint32_t originX = 0;  ///< column of pixel (0, 0) in the whole image
  std::uint32_t originY = 0;  ///< row of pixel (0, 0) in the whole image

  RasterContext(std::uint32_t marginX = 0, std::uint32_t marginY = 0, std::uint32_t originX = 0,
                std::uint32_t originY = 0)
      : marginX(marginX), marginY(marginY), originX(originX), originY(originY) {}
};

/// A pixel-interleaved block of pixels in memory with a margin around the image area.
///
/// The buffer holds `bufferHeight` rows of `bufferWidth` pixels without padding; a pixel holds `channels`
/// elements, a complex one twice as many.
class GRIDMILL_EXPORT Raster : public RasterInfo, public RasterContext {
 public:
  std::uint32_t bufferWidth;   ///< `width` + 2 x `marginX`
  std::uint32_t bufferHeight;  ///< `height` + 2 x `marginY`
  unsigned char* data;         ///< the first byte of the buffer
  std::uint64_t dataSize;      ///< bytes in the buffer
  bool ownsData;               ///< the destructor frees `data` with array delete

  /// Owns a new buffer, not initialised.
  ///
  /// Deliberate: `dataSize` is formed in 32-bit unsigned arithmetic and wraps; the wrapped size is allocated.
  /// @throws std::bad_alloc
  Raster(const RasterInfo& info, const RasterContext& context);

  /// Wraps the caller's memory, which has to hold the whole buffer and stays the caller's.
  Raster(const RasterInfo& info, const RasterContext& context, unsigned char* data);

  Raster(const Raster&) = delete;
  Raster& operator=(const Raster&) = delete;
  ~Raster() override;
};

}  // namespace orvik::tessel
