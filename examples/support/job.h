#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "basic/tessel/raster.h"
#include "gdal.h"
#include "picture.h"
#include "quantity.h"
#include "tiles.h"

namespace examples {

/// What every program of this folder is told: where to write and in which form.
struct OutputOptions {
  std::string output;
  std::string type = "Float32";
  std::uint32_t tile = 512;
  std::optional<double> noData;  ///< none: the default of the output's type
  std::string png;               ///< empty: no picture
  std::string title;             ///< empty: made from the quantity and the names of the inputs

  GDALDataType OutputType() const { return examples::OutputType(type); }
  double NoData() const;  ///< as stated, or the default
  /// As stated, or NaN for a floating output. Any integer could be a value, so that an output without masked
  /// pixels has none unless one is stated.
  std::optional<double> NoDataIf(bool masked) const;
};

/// What a program with one input is told.
struct JobOptions : OutputOptions {
  std::string input;
};

/// Opens the input and refuses what cannot be done with it: an output that is one of its files, a no-data
/// value that does not fit into the output.
DatasetPtr OpenInput(const JobOptions& options);

/// The files that a raster is read from.
std::vector<std::string> FilesOf(GDALDataset& dataset);

/// Refuses outputs that are files of the inputs, and a no-data value that does not fit into the output.
void CheckOutputs(const OutputOptions& options, const std::vector<GDALDataset*>& inputs, double noData);

/// Refuses a band that the raster, which `input` names, does not have.
void CheckBand(const std::string& argument, GDALDataset& dataset, int band,
               const std::string& input = "INPUT");

/// All bands but the alpha bands.
std::vector<int> ValueBands(GDALDataset& dataset);

/// The bands that were asked for, else `ValueBands`. @throws Refusal for a band that INPUT does not have, or
/// if there is none
std::vector<int> ChosenBands(const std::vector<int>& asked, GDALDataset& input);

/// "dem.tif: 83 x 61 pixels, cells of 30 x 25 m"
std::string DescribeGrid(const std::string& what, GDALDataset& dataset);

/// What is to be written.
struct Job {
  const OutputOptions& options;
  GDALDataset& grid;            ///< gives the output its size and its georeference
  std::vector<Quantity> bands;  ///< of the output, all with the same no-data value
  std::size_t shown = 0;        ///< the band that the figures and the picture are made of
  PictureStyle style = {};
  std::vector<Panel> beside = {};  ///< more maps of the picture, with figures of their own
  std::string name = {};           ///< of the bands together; empty: the name of the shown one
};

/// The places in `bands` of those that `--show` asks for, else the first: three as red, green and blue, or
/// one.
/// @param done  what the program does to its bands, for the message of a Refusal: "stretched"
std::vector<int> ShownPlaces(const std::vector<int>& show, const std::vector<int>& bands,
                             const std::string& done);

/// Shows the output's bands at these places, which were made of `bands`. Returns "band 4" or "bands 4, 3, 2".
std::string ShowPlaces(Job& job, const std::vector<int>& places, const std::vector<int>& bands);

/// Fills one tile of the output.
using TileWork = std::function<void(const Tile& tile, orvik::tessel::Raster& out)>;

/// Does the work for all tiles, writes the GeoTIFF and the picture and prints a line of figures for each band
/// that is shown on standard output. @throws Refusal if a tile of the output is larger than a raster can be
void RunJob(const Job& job, const TileWork& work);

/// Fills one output tile from one input tile.
using TileOperation = std::function<void(LoadedTile& in, orvik::tessel::Raster& out)>;

/// The same for one input and one band. The picture's caption is made from the input, and its title from the
/// one that `options` states, or the style's or the quantity's name and the name of the input.
void RunJob(const JobOptions& options, GDALDataset& input, const TileReader& reader, const Quantity& quantity,
            PictureStyle style, const TileOperation& operation);

}  // namespace examples
