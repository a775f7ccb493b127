#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "gdal.h"

namespace examples {

/// A piece of an image, in pixels of the whole image.
struct Tile {
  std::uint32_t x;
  std::uint32_t y;
  std::uint32_t width;
  std::uint32_t height;
};

/// Cuts an image into tiles of at most `side` x `side` pixels, row by row.
std::vector<Tile> CutTiles(std::uint32_t width, std::uint32_t height, std::uint32_t side);

/// A tile in memory as the operators take it. `mask` is null where every pixel is valid.
struct LoadedTile {
  std::unique_ptr<orvik::tessel::Raster> raster;
  std::unique_ptr<orvik::tessel::Mask> mask;
};

/// Which samples of a raster are read.
struct BandSource {
  GDALDataset& dataset;
  std::vector<int> bands;                  ///< count from 1
  std::string argument = "INPUT";          ///< names the raster in messages
  GDALDataType type = GDT_Unknown;         ///< to read in; unknown: the type that holds all the bands
  std::optional<unsigned char> hole = {};  ///< a value of `Byte` samples that stands for no data too
};

/// Reads tiles of some bands, in their own type unless told otherwise, with a margin of neighbouring pixels
/// around them.
///
/// The margin holds the pixels of the neighbouring tiles; beyond the image it repeats the nearest edge pixel,
/// validity included. A pixel is invalid where GDAL's mask of one of the bands says so, which covers no-data
/// values, alpha and mask bands, or where a sample is NaN or the hole of the source.
class TileReader {
 public:
  /// @throws Refusal if a tile of `side` x `side` pixels is larger than a raster can be, or if signed bytes
  /// would have to be widened, as GDAL before 3.7 reads them unsigned
  TileReader(BandSource source, std::uint32_t margin, std::uint32_t side);

  orvik::tessel::DataType Type() const { return dataType_; }

  std::size_t Channels() const { return source_.bands.size(); }
  int Band(std::size_t channel) const { return source_.bands[channel]; }

  /// True if a pixel may be invalid.
  bool Masked() const { return masked_; }

  LoadedTile Read(const Tile& tile) const;

 private:
  struct Window;
  Window InsideOf(const Tile& tile) const;
  void ReadSamples(const Window& inside, orvik::tessel::Raster& raster) const;
  std::vector<unsigned char> ReadValidity(const Window& inside, const orvik::tessel::Raster& raster) const;

  BandSource source_;
  std::uint32_t margin_;
  orvik::tessel::DataType dataType_;
  bool masked_ = false;
};

}  // namespace examples
