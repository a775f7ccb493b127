#include "tests/support/masks.h"

#include <algorithm>
#include <cstdint>

namespace orvik::tests {
namespace {

/// Bits that lookups by the raster's own geometry need, for the pixels (0, 0) to (width, height).
std::uint32_t BitsByRaster(const tessel::Raster& raster) {
  return (raster.marginY + raster.height) * raster.bufferWidth + raster.marginX + raster.width + 1;
}

std::unique_ptr<tessel::Mask> MaskOfWidth(const tessel::Raster& raster, std::uint32_t width,
                                          const tessel::RasterContext& context) {
  const std::uint32_t row = std::max(1u, width + 2 * context.marginX);
  const std::uint32_t byMask = (context.marginY + raster.height) * row + context.marginX + raster.width + 1;
  const std::uint32_t bits = std::max(byMask, BitsByRaster(raster));
  const std::uint32_t rows = (bits + row - 1) / row;
  const std::uint32_t height = std::max(raster.height, rows - std::min(rows, 2 * context.marginY));
  return std::make_unique<tessel::Mask>(row - 2 * context.marginX, height, context);
}

std::unique_ptr<tessel::Mask> MaskOf(const tessel::Raster& raster, MaskGeometry geometry, Random& random) {
  const tessel::RasterContext margins{random.Below(5), random.Below(5)};
  switch (geometry) {
    case MaskGeometry::eSAME:
      return std::make_unique<tessel::Mask>(raster.width, raster.height, raster);
    case MaskGeometry::eOTHER_MARGIN:
      return MaskOfWidth(raster, raster.width, margins);
    case MaskGeometry::eOTHER_WIDTH:
      break;
  }
  return MaskOfWidth(raster, raster.width / 2 + random.Below(raster.width + 4), margins);
}

void SetRuns(tessel::Mask& mask, Random& random) {
  bool isValid = true;
  std::uint32_t left = 0;
  for (std::uint32_t bit = 0; bit < 8 * mask.bits.size(); ++bit) {
    if (left == 0) {
      isValid = !isValid;
      left = 1 + random.Below(isValid ? 600 : 40);
    }
    --left;
    const auto flag = static_cast<unsigned char>(0x80u >> (bit & 7));
    mask.bits[bit >> 3] =
        static_cast<unsigned char>(isValid ? mask.bits[bit >> 3] | flag : mask.bits[bit >> 3] & ~flag);
  }
}

void SetBits(tessel::Mask& mask, MaskKind kind, Random& random) {
  if (kind == MaskKind::eLONG_RUNS) return SetRuns(mask, random);
  for (unsigned char& byte : mask.bits) {
    const auto bits = static_cast<unsigned char>(random.Bits());
    if (kind == MaskKind::eFULL) byte = 0xFF;
    if (kind == MaskKind::eEMPTY) byte = 0;
    if (kind == MaskKind::eRANDOM) byte = bits;
    if (kind == MaskKind::eFEW_CLEAR) byte = random.OneIn(10) ? bits : 0xFF;
  }
}

void RandomisePadding(tessel::Mask& mask, Random& random) {
  const std::uint32_t used = mask.bufferWidth * mask.bufferHeight & 7;
  if (used == 0 || mask.bits.empty()) return;
  const auto padding = static_cast<unsigned char>(0xFFu >> used);
  mask.bits.back() = static_cast<unsigned char>((mask.bits.back() & ~padding) | (random.Bits() & padding));
}

}  // namespace

const char* NameOf(MaskKind kind) {
  constexpr const char* kNames[] = {"null", "full", "empty", "random", "long runs", "few clear bits"};
  return kNames[static_cast<int>(kind)];
}

const char* NameOf(MaskGeometry geometry) {
  constexpr const char* kNames[] = {"of the raster's geometry", "of another margin", "of another width"};
  return kNames[static_cast<int>(geometry)];
}

std::unique_ptr<tessel::Mask> RandomMask(const tessel::Raster& raster, MaskKind kind, MaskGeometry geometry,
                                         Random& random) {
  if (kind == MaskKind::eNULL) return nullptr;
  std::unique_ptr<tessel::Mask> mask = MaskOf(raster, geometry, random);
  SetBits(*mask, kind, random);
  RandomisePadding(*mask, random);
  return mask;
}

}  // namespace orvik::tests
