#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "fuzz/support/bytes.h"

namespace orvik::fuzz {

/// The shape of a raster.
struct Shape {
  std::uint32_t width = 0;
  std::uint32_t height = 0;
  std::uint32_t channels = 0;
  tessel::DataType type;
  tessel::RasterContext margins;
};

/// A raster in a buffer of its own. With AddressSanitizer the buffer ends where the last sample does; without
/// it, sentinels stand around the buffer.
class Buffer {
 public:
  /// @param isRoomy  room behind the last sample for rows of the widest elements
  Buffer(const Shape& shape, bool isRoomy);

  tessel::Raster* Get() const { return raster_.get(); }
  tessel::Raster& operator*() const { return *raster_; }

  /// True if no sentinel was overwritten.
  bool IsIntact() const;

 private:
  std::unique_ptr<unsigned char[]> bytes_;
  std::size_t size_ = 0;
  std::unique_ptr<tessel::Raster> raster_;
};

/// The size of an image in which a pixel has so many channels: 0 to 40 by 0 to 12 pixels, and margins.
///
/// @param canBeLarge  sometimes one that is worth a parallel region
Shape DrawShape(Bytes& bytes, const tessel::DataType& type, std::uint32_t channels, std::uint32_t leastMargin,
                bool canBeLarge = false);

/// Fills the whole buffer with samples of the type `type`: any bits, or values cast to the type. A long
/// buffer repeats what it starts with.
void Fill(Bytes& bytes, const tessel::DataType& type, tessel::Raster& raster);

/// Null, or a mask for an image of this shape: of its geometry, of another margin or of a larger width.
std::unique_ptr<tessel::Mask> DrawMask(Bytes& bytes, const tessel::Raster& raster);

/// A copy of all bytes.
std::vector<unsigned char> BytesOf(const tessel::Raster& raster);
std::vector<unsigned char> BytesOf(const tessel::Mask* mask);

/// Ends the process with a message, for the fuzzer to keep the input.
[[noreturn]] void Fail(const char* what);

/// Fails unless both buffers hold the same bits. Any NaN equals any other: which one a sum of two of them
/// gives is the compiler's choice.
///
/// @param writtenAs  the type of the elements, whatever the rasters' own is
void RequireSame(const tessel::Raster& expected, const tessel::Raster& actual,
                 const tessel::DataType& writtenAs);

/// True if a sample of a raster of floating-point numbers is NaN, in the margins too.
bool HasNaN(const tessel::Raster& raster);

/// Fails if an input was modified.
void RequireUntouched(const std::vector<unsigned char>& before, const std::vector<unsigned char>& after);

}  // namespace orvik::fuzz
