#include "basic/tessel/raster.h"

namespace orvik::tessel {

namespace {

// Deliberate: the product wraps at 32 bits.
std::uint32_t BufferBytes(const Raster& raster) {
  const std::uint32_t elementBytes = (raster.dataType.sizeBits + 7) >> 3;
  const std::uint32_t parts = static_cast<std::uint32_t>(raster.dataType.isComplex) + 1;
  return elementBytes * parts * raster.bufferHeight * raster.bufferWidth * raster.channels;
}

}  // namespace

RasterInfo::RasterInfo() = default;

RasterInfo::RasterInfo(std::uint32_t widthPixels, std::uint32_t heightPixels, std::uint32_t channelCount,
                       DataType type)
    : width(widthPixels), height(heightPixels), channels(channelCount), dataType(type) {}

RasterInfo::RasterInfo(const RasterInfo&) = default;
RasterInfo& RasterInfo::operator=(const RasterInfo&) = default;
RasterInfo::~RasterInfo() = default;

Raster::Raster(const RasterInfo& info, const RasterContext& context, unsigned char* memory)
    : RasterInfo(info),
      RasterContext(context),
      bufferWidth(width + 2 * marginX),
      bufferHeight(height + 2 * marginY),
      data(memory),
      dataSize(BufferBytes(*this)),
      ownsData(false) {}

Raster::Raster(const RasterInfo& info, const RasterContext& context) : Raster(info, context, nullptr) {
  ownsData = true;
  data = new unsigned char[dataSize];
}

Raster::~Raster() {
  if (data != nullptr && ownsData) delete[] data;
}

}  // namespace orvik::tessel
