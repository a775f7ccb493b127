#include "tiles.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "errors.h"

namespace examples {

using orvik::tessel::DataType;
using orvik::tessel::Mask;
using orvik::tessel::Raster;
using orvik::tessel::RasterContext;
using orvik::tessel::RasterInfo;

namespace {

// GDAL before 3.7 marks signed bytes by an item of metadata.
bool IsSignedByte(GDALRasterBand& band) {
  const char* type = band.GetMetadataItem("PIXELTYPE", "IMAGE_STRUCTURE");
  return band.GetRasterDataType() == GDT_Byte && type != nullptr && EQUAL(type, "SIGNEDBYTE");
}

std::uint64_t PixelBytes(const DataType& type, std::uint64_t channels) {
  return type.sizeBits / 8 * (type.isComplex ? 2u : 1u) * channels;
}

// Marks the pixels that have a NaN among their samples.
template <class Real>
void MarkNaN(const Raster& raster, std::vector<unsigned char>& valid) {
  const auto* samples = reinterpret_cast<const Real*>(raster.data);
  const std::size_t step = raster.dataType.isComplex ? 2 : 1;
  for (std::size_t i = 0; i < valid.size(); ++i)
    for (std::size_t c = 0; c < raster.channels; ++c)
      if (std::isnan(samples[(i * raster.channels + c) * step])) valid[i] = 0;
}

// Marks the pixels that have the value among their samples.
void MarkEqual(const Raster& raster, unsigned char value, std::vector<unsigned char>& valid) {
  for (std::size_t i = 0; i < valid.size(); ++i)
    for (std::size_t c = 0; c < raster.channels; ++c)
      if (raster.data[i * raster.channels + c] == value) valid[i] = 0;
}

}  // namespace

// The part of a tile with its margin that lies in the image, and where it lies in the tile's buffer.
struct TileReader::Window {
  std::uint32_t x, y, width, height;
  std::uint32_t column, row;
  std::uint32_t bufferWidth, bufferHeight;

  std::size_t Offset() const { return static_cast<std::size_t>(row) * bufferWidth + column; }

  // Repeats the edge pixels of the window into the rest of the buffer.
  void RepeatEdges(unsigned char* buffer, std::size_t pixelBytes) const {
    const auto at = [&](std::uint32_t r, std::uint32_t c) {
      return buffer + (static_cast<std::size_t>(r) * bufferWidth + c) * pixelBytes;
    };
    const std::uint32_t endColumn = column + width, endRow = row + height;
    for (std::uint32_t r = row; r < endRow; ++r) {
      for (std::uint32_t c = 0; c < column; ++c) std::memcpy(at(r, c), at(r, column), pixelBytes);
      for (std::uint32_t c = endColumn; c < bufferWidth; ++c)
        std::memcpy(at(r, c), at(r, endColumn - 1), pixelBytes);
    }
    for (std::uint32_t r = 0; r < row; ++r) std::memcpy(at(r, 0), at(row, 0), bufferWidth * pixelBytes);
    for (std::uint32_t r = endRow; r < bufferHeight; ++r)
      std::memcpy(at(r, 0), at(endRow - 1, 0), bufferWidth * pixelBytes);
  }
};

std::vector<Tile> CutTiles(std::uint32_t width, std::uint32_t height, std::uint32_t side) {
  std::vector<Tile> tiles;
  for (std::uint32_t y = 0; y < height; y += std::min(side, height - y))
    for (std::uint32_t x = 0; x < width; x += std::min(side, width - x))
      tiles.push_back({x, y, std::min(side, width - x), std::min(side, height - y)});
  return tiles;
}

TileReader::TileReader(BandSource source, std::uint32_t margin, std::uint32_t side)
    : source_(std::move(source)), margin_(margin) {
  GDALDataType held = GDT_Unknown;
  std::size_t signedBytes = 0;
  for (const int number : source_.bands) {
    GDALRasterBand& band = *source_.dataset.GetRasterBand(number);
    const GDALDataType type = band.GetRasterDataType();
    held = held == GDT_Unknown ? type : GDALDataTypeUnion(held, type);
    masked_ = masked_ || band.GetMaskFlags() != GMF_ALL_VALID;
    signedBytes += IsSignedByte(band) ? 1u : 0u;
  }
  if (source_.type == GDT_Unknown) source_.type = held;
  const bool allSigned = signedBytes == source_.bands.size() && source_.type == GDT_Byte;
  if (signedBytes > 0 && !allSigned)
    throw Refusal(source_.argument, "has signed bytes, which are not read as another type",
                  "a raster of another pixel type");
  dataType_ = allSigned ? DataType::Of<char>() : TypeOf(source_.type, source_.argument);
  masked_ = masked_ || dataType_.isFloat || source_.hole;

  const auto extent = [&](int size) {
    return std::min<std::uint64_t>(static_cast<std::uint64_t>(size), side) + 2 * margin_;
  };
  const std::uint64_t pixels =
      extent(source_.dataset.GetRasterXSize()) * extent(source_.dataset.GetRasterYSize());
  if (pixels * PixelBytes(dataType_, source_.bands.size()) > INT32_MAX)
    throw Refusal("--tile", "a tile of side " + std::to_string(side) + " takes more than 2 GiB",
                  "a smaller one");
}

TileReader::Window TileReader::InsideOf(const Tile& tile) const {
  const auto imageWidth = static_cast<std::uint32_t>(source_.dataset.GetRasterXSize());
  const auto imageHeight = static_cast<std::uint32_t>(source_.dataset.GetRasterYSize());
  const std::uint32_t left = std::min(tile.x, margin_), above = std::min(tile.y, margin_);
  const std::uint32_t right = std::min(imageWidth - tile.x - tile.width, margin_);
  const std::uint32_t below = std::min(imageHeight - tile.y - tile.height, margin_);
  return {tile.x - left,  tile.y - above,  left + tile.width + right, above + tile.height + below,
          margin_ - left, margin_ - above, tile.width + 2 * margin_,  tile.height + 2 * margin_};
}

LoadedTile TileReader::Read(const Tile& tile) const {
  const RasterInfo info(tile.width, tile.height, static_cast<std::uint32_t>(source_.bands.size()), dataType_);
  const RasterContext context(margin_, margin_, tile.x, tile.y);
  LoadedTile loaded{std::make_unique<Raster>(info, context), nullptr};
  const Window inside = InsideOf(tile);
  ReadSamples(inside, *loaded.raster);
  if (!masked_) return loaded;

  const std::vector<unsigned char> valid = ReadValidity(inside, *loaded.raster);
  loaded.mask = std::make_unique<Mask>(tile.width, tile.height, context);
  const auto margin = static_cast<std::int32_t>(margin_);
  for (std::uint32_t row = 0, i = 0; row < inside.bufferHeight; ++row)
    for (std::uint32_t column = 0; column < inside.bufferWidth; ++column, ++i)
      if (!valid[i])
        loaded.mask->SetValid(static_cast<std::int32_t>(column) - margin,
                              static_cast<std::int32_t>(row) - margin, false);
  return loaded;
}

void TileReader::ReadSamples(const Window& inside, Raster& raster) const {
  const auto pixelBytes = static_cast<GSpacing>(PixelBytes(dataType_, raster.channels));
  const auto width = static_cast<int>(inside.width), height = static_cast<int>(inside.height);
  std::vector<int> bands = source_.bands;
  const CPLErr result = source_.dataset.RasterIO(
      GF_Read, static_cast<int>(inside.x), static_cast<int>(inside.y), width, height,
      raster.data + inside.Offset() * static_cast<std::size_t>(pixelBytes), width, height, source_.type,
      static_cast<int>(bands.size()), bands.data(), pixelBytes, pixelBytes * inside.bufferWidth,
      pixelBytes / static_cast<GSpacing>(raster.channels), nullptr);
  ThrowOnGdalError("reading " + source_.argument, result);
  inside.RepeatEdges(raster.data, static_cast<std::size_t>(pixelBytes));
}

std::vector<unsigned char> TileReader::ReadValidity(const Window& inside, const Raster& raster) const {
  const std::size_t pixels = static_cast<std::size_t>(inside.bufferWidth) * inside.bufferHeight;
  std::vector<unsigned char> valid(pixels, 1), ofBand(pixels, 1);
  const auto width = static_cast<int>(inside.width), height = static_cast<int>(inside.height);
  for (const int number : source_.bands) {
    GDALRasterBand& band = *source_.dataset.GetRasterBand(number);
    if (band.GetMaskFlags() == GMF_ALL_VALID) continue;
    const CPLErr result = band.GetMaskBand()->RasterIO(
        GF_Read, static_cast<int>(inside.x), static_cast<int>(inside.y), width, height,
        ofBand.data() + inside.Offset(), width, height, GDT_Byte, 1, inside.bufferWidth, nullptr);
    ThrowOnGdalError("reading the mask of " + source_.argument, result);
    inside.RepeatEdges(ofBand.data(), 1);
    for (std::size_t i = 0; i < pixels; ++i) valid[i] = valid[i] != 0 && ofBand[i] != 0;
  }
  if (dataType_.isFloat && dataType_.sizeBits == 32) MarkNaN<float>(raster, valid);
  if (dataType_.isFloat && dataType_.sizeBits == 64) MarkNaN<double>(raster, valid);
  if (source_.hole) MarkEqual(raster, *source_.hole, valid);
  return valid;
}

}  // namespace examples
