#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>

#include "basic/tessel/raster.h"
#include "gdal.h"
#include "picture.h"
#include "quantity.h"
#include "tiles.h"

namespace examples {

/// What every program of this folder is told: where to read, where to write and in which form.
struct JobOptions {
  std::string input;
  std::string output;
  std::string type = "Float32";
  std::uint32_t tile = 512;
  std::optional<double> noData;  ///< none: the default of the output's type
  std::string png;               ///< empty: no picture
  std::string title;             ///< empty: made from the quantity and the input's name

  GDALDataType OutputType() const { return examples::OutputType(type); }
  double NoData() const;  ///< as stated, or the default
};

/// Opens the input and refuses what cannot be done with it: an output that is one of its files, a no-data
/// value that does not fit into the output.
DatasetPtr OpenInput(const JobOptions& options);

/// Refuses a band that the raster does not have.
void CheckBand(const std::string& argument, GDALDataset& dataset, int band);

/// Fills one output tile from one input tile.
using TileOperation = std::function<void(LoadedTile& in, orvik::tessel::Raster& out)>;

/// Runs an operation over all tiles of the input, writes the GeoTIFF and the picture and prints a line of
/// figures for the output on standard output.
void RunJob(const JobOptions& options, GDALDataset& input, const TileReader& reader, const Quantity& quantity,
            const PictureStyle& style, const TileOperation& operation);

}  // namespace examples
