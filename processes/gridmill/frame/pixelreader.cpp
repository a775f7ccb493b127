#include "processes/gridmill/frame/pixelreader.h"

#include <algorithm>
#include <cstring>

#include "basic/tessel/samples.h"

namespace orvik::frame {

PixelReader::PixelReader(const tessel::Raster& raster, const tessel::DataType& element, std::size_t samples,
                         std::size_t pixels, Walk walk)
    : raster_(raster),
      sampleBytes_(element.sizeBits / 8),
      samples_(samples),
      inPlace_(walk == Walk::kElements || (Holds(raster, element) && samples <= ElementsOf(raster))),
      stride_(walk == Walk::kElements ? 1
              : inPlace_              ? ElementsOf(raster)
                                      : samples) {
  if (!inPlace_) block_.resize(pixels * samples * sampleBytes_);
}

const unsigned char* PixelReader::At(std::uint32_t x, std::uint32_t y, std::size_t pixels) {
  if (inPlace_) return raster_.data + tessel::PixelOffset(raster_, 0, y) + x * stride_ * sampleBytes_;
  const std::size_t bytes = samples_ * sampleBytes_;
  for (std::size_t i = 0; i < pixels; ++i) {
    const std::uint64_t offset = tessel::PixelOffset(raster_, x + static_cast<std::uint32_t>(i), y);
    const std::uint64_t behind = raster_.dataSize - std::min(offset, raster_.dataSize);
    const std::size_t held = std::min<std::uint64_t>(bytes, behind);
    unsigned char* const target = block_.data() + i * bytes;
    if (held > 0) std::memcpy(target, raster_.data + offset, held);
    std::fill(target + held, target + bytes, static_cast<unsigned char>(0));
  }
  return block_.data();
}

}  // namespace orvik::frame
