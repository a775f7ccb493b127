#include "processes/gridmill/frame/changerows.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <vector>

#include "basic/tessel/mask/maskrow.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/rows.h"

namespace orvik::frame {

namespace {

using tessel::DataType;
using tessel::PixelOffset;
using tessel::Raster;

std::size_t BytesOf(const DataType& element) { return element.sizeBits / 8; }

/// Pixels read as elements of one type.
class PixelReader {
 public:
  PixelReader(const Raster& raster, const DataType& element, std::size_t samples, const BlockShape& shape)
      : raster_(raster),
        bytes_(samples * BytesOf(element)),
        stride_(ElementsOf(raster)),
        inPlace_(Holds(raster, element) && (!shape.dense || stride_ == samples)) {
    if (inPlace_) return;
    stride_ = samples;
    gathered_.resize(shape.pixels * bytes_);
  }

  std::size_t Stride() const { return stride_; }

  const unsigned char* Read(std::uint32_t x, std::uint32_t y, std::size_t pixels) {
    if (inPlace_) return raster_.data + PixelOffset(raster_, x, y);
    // A pixel's address follows from the raster's own type and need not be a multiple of the element's size.
    for (std::size_t i = 0; i < pixels && bytes_ > 0; ++i)
      std::memcpy(gathered_.data() + i * bytes_,
                  raster_.data + PixelOffset(raster_, x + static_cast<std::uint32_t>(i), y), bytes_);
    return gathered_.data();
  }

 private:
  const Raster& raster_;
  std::size_t bytes_;  // of a pixel that are read
  std::size_t stride_;
  bool inPlace_;
  std::vector<unsigned char> gathered_;
};

/// Fills `valid` for the pixels from (x, y) on if there is a mask; returns whether one of them is excluded.
bool UnpackMasks(const TwoDates& dates, std::uint32_t x, std::uint32_t y, std::size_t pixels,
                 unsigned char* valid) {
  const auto unpack = [&](const tessel::Mask& mask, unsigned char* bits) {
    tessel::UnpackBits(mask, tessel::PixelIndex(mask, x, y), pixels, bits);
  };
  if (dates.mask == nullptr && dates.referenceMask == nullptr) return false;
  if (dates.mask != nullptr) {
    unpack(*dates.mask, valid);
  } else {
    std::fill_n(valid, pixels, static_cast<unsigned char>(1));
  }
  if (dates.referenceMask != nullptr) {
    std::array<unsigned char, kMaxBlock> excluded;
    unpack(*dates.referenceMask, excluded.data());
    for (std::size_t i = 0; i < pixels; ++i) valid[i] &= static_cast<unsigned char>(excluded[i] ^ 1);
  }
  return std::memchr(valid, 0, pixels) != nullptr;
}

}  // namespace

void WalkBlocks(const TwoDates& dates, const BlockShape& shape, const ElementTypes& types,
                const std::function<void(const RawBlock&)>& row) {
  PixelReader image(dates.image, types.image, shape.imageSamples, shape);
  PixelReader reference(dates.reference, types.reference, shape.referenceSamples, shape);
  PixelWriter out(dates.out, types.out, shape.outSamples, shape.pixels);
  const std::size_t width = dates.image.width;
  SerialRows(dates.image.height, [&](std::uint32_t y) {
    for (std::size_t done = 0; done < width; done += shape.pixels) {
      const auto x = static_cast<std::uint32_t>(done);
      const std::size_t pixels = std::min(shape.pixels, width - done);
      unsigned char valid[kMaxBlock];
      const bool masked = UnpackMasks(dates, x, y, pixels, valid);
      row({image.Read(x, y, pixels), image.Stride(), reference.Read(x, y, pixels), reference.Stride(), pixels,
           valid, masked, out.At(x, y)});
      out.Write(x, y, pixels);
    }
  });
}

}  // namespace orvik::frame
