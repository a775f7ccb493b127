#pragma once

#include <cstdint>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/raster.h"

namespace orvik::tessel {

/// One validity bit for each pixel of a raster's buffer, margins included. A set bit means valid.
///
/// Bits run on from row to row without padding, the most significant bit of a byte first. Wherever an
/// operator takes a `Mask*`, null means that every pixel is valid. An operator looks a mask up by the mask's
/// own margins and `bufferWidth`; its geometry is not compared with the raster's.
class GRIDMILL_EXPORT Mask : public RasterContext {
 public:
  std::uint32_t width;              ///< pixels in a row of the image area
  std::uint32_t height;             ///< rows of the image area
  std::uint32_t bufferWidth;        ///< `width` + 2 x `marginX`
  std::uint32_t bufferHeight;       ///< `height` + 2 x `marginY`
  std::vector<unsigned char> bits;  ///< `bufferWidth` x `bufferHeight` bits, rounded up to whole bytes

  /// Every bit, margins and the padding of the last byte included, is set to `valid`.
  /// @throws std::bad_alloc
  Mask(std::uint32_t width, std::uint32_t height, const RasterContext& context = {}, bool valid = true);

  /// The bit of pixel (x, y), which may lie in the margin. The position is not checked.
  bool IsValid(std::int32_t x, std::int32_t y) const;

  /// Sets the bit of pixel (x, y), which may lie in the margin. The position is not checked.
  void SetValid(std::int32_t x, std::int32_t y, bool valid);

  /// Copies the mask into a raster of the caller's: into `eDT_BIT` its bytes as they stand, into `eDT_8U` one
  /// byte of 0 or 1 for each pixel of the target's buffer. The target's size is not compared with the mask's.
  /// @throws DataException for any other type, signed and complex 8-bit rasters included
  void RetrieveRaster(Raster* target) const;

  /// Returns a new one-channel `eDT_8U` raster of the mask's geometry, one byte of 0 or 1 for each bit. The
  /// caller deletes it.
  /// @throws std::bad_alloc
  Raster* CreateRaster() const;
};

}  // namespace orvik::tessel
