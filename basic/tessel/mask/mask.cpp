#include "basic/tessel/mask/mask.h"

#include <cstddef>
#include <cstring>
#include <memory>

#include "basic/exceptions/throw.h"
#include "basic/tessel/mask/unpacktable.h"
#include "basic/tessel/samples.h"

namespace orvik::tessel {

namespace {

void Unpack(const std::vector<unsigned char>& bits, unsigned char* target, std::uint32_t pixels) {
  const std::size_t groups = pixels >> 3;
  for (std::size_t group = 0; group < groups; ++group) UnpackByte(bits[group], target + group * 8);
  for (std::size_t i = groups * 8; i < pixels; ++i)
    // cppcheck-suppress constStatement ; it takes the braces for the end of the expression
    target[i] = kUnpackTable[std::size_t{bits[groups]} * 8 + (i & 7)];
}

unsigned char BitOf(std::uint32_t index) { return static_cast<unsigned char>(0x80u >> (index & 7)); }

}  // namespace

Mask::Mask(std::uint32_t widthPixels, std::uint32_t heightPixels, const RasterContext& context, bool valid)
    : RasterContext(context),
      width(widthPixels),
      height(heightPixels),
      bufferWidth(width + 2 * marginX),
      bufferHeight(height + 2 * marginY),
      bits((std::size_t{bufferWidth} * bufferHeight + 7) / 8, valid ? 0xFF : 0x00) {}

bool Mask::IsValid(std::int32_t x, std::int32_t y) const {
  return MaskBitAt(*this, static_cast<std::uint32_t>(x), static_cast<std::uint32_t>(y)) != 0;
}

void Mask::SetValid(std::int32_t x, std::int32_t y, bool valid) {
  const std::uint32_t index = PixelIndex(*this, static_cast<std::uint32_t>(x), static_cast<std::uint32_t>(y));
  unsigned char& byte = bits[index >> 3];
  byte = static_cast<unsigned char>(valid ? byte | BitOf(index) : byte & ~BitOf(index));
}

void Mask::RetrieveRaster(Raster* target) const {
  if (target->dataType == DataType(eDT_BIT)) {
    if (!bits.empty()) std::memcpy(target->data, bits.data(), bits.size());
  } else if (target->dataType == DataType(eDT_8U)) {
    const std::uint32_t pixels =
        (target->height + 2 * target->marginY) * (target->width + 2 * target->marginX);
    Unpack(bits, target->data, pixels);
  } else {
    Throw<DataException>("We can only rasterize into a eDT_BIT or eDT_8U Raster", ORVIK_HERE);
  }
}

Raster* Mask::CreateRaster() const {
  auto raster = std::make_unique<Raster>(RasterInfo(width, height, 1, eDT_8U), *this);
  RetrieveRaster(raster.get());
  return raster.release();
}

}  // namespace orvik::tessel
