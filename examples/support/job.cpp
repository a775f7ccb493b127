#include "job.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <cstdio>
#include <filesystem>

#include "errors.h"
#include "output.h"
#include "pendingfile.h"
#include "progress.h"
#include "summary.h"

namespace examples {

using orvik::tessel::Raster;
using orvik::tessel::RasterInfo;

namespace {

std::vector<std::string> FilesOf(GDALDataset& dataset) {
  char** list = dataset.GetFileList();
  std::vector<std::string> files;
  for (char** file = list; file != nullptr && *file != nullptr; ++file) files.emplace_back(*file);
  CSLDestroy(list);
  return files;
}

std::string DescribeCells(GDALDataset& dataset) {
  const Cell cell = CellOf(dataset);
  const char* form = ", cells of %.4g x %.4g %s";
  if (!cell.known) return "";
  if (cell.geographic)
    return CPLSPrintf(form, std::abs(cell.x) * 3600.0, std::abs(cell.y) * 3600.0, "arc seconds");
  return CPLSPrintf(form, std::abs(cell.x), std::abs(cell.y), cell.unit.c_str());
}

std::string Capitalised(std::string text) {
  if (!text.empty()) text[0] = static_cast<char>(std::toupper(static_cast<unsigned char>(text[0])));
  return text;
}

// A raster in memory counts its bytes in 32 bits.
void CheckTileSize(const Job& job) {
  const auto extent = [&](int size) {
    return std::min<std::uint64_t>(static_cast<std::uint64_t>(size), job.options.tile);
  };
  const std::uint64_t pixels = extent(job.grid.GetRasterXSize()) * extent(job.grid.GetRasterYSize());
  const std::uint64_t pixelBytes = job.bands.size() * TypeOf(job.options.OutputType()).sizeBits / 8;
  if (pixels * pixelBytes > INT32_MAX)
    throw Refusal("--tile", "a tile of side " + std::to_string(job.options.tile) + " takes more than 2 GiB",
                  "a smaller one");
}

// The time that it took, in seconds.
double WriteTiles(const Job& job, OutputRaster& output, const TileWork& work) {
  const auto width = static_cast<std::uint32_t>(job.grid.GetRasterXSize());
  const auto height = static_cast<std::uint32_t>(job.grid.GetRasterYSize());
  const auto channels = static_cast<std::uint32_t>(job.bands.size());
  const std::vector<Tile> tiles = CutTiles(width, height, job.options.tile);
  Progress progress(job.bands[job.shown].name, tiles.size());
  for (const Tile& tile : tiles) {
    Raster out(RasterInfo(tile.width, tile.height, channels, output.Type()), {});
    work(tile, out);
    output.Write(tile, out);
    progress.Step();
  }
  output.Close();
  return progress.Seconds();
}

}  // namespace

double OutputOptions::NoData() const { return noData.value_or(DefaultNoData(OutputType())); }

DatasetPtr OpenInput(const JobOptions& options) {
  DatasetPtr input = OpenRaster("INPUT", options.input);
  CheckOutputs(options, {input.get()}, options.NoData());
  return input;
}

void CheckOutputs(const OutputOptions& options, const std::vector<GDALDataset*>& inputs, double noData) {
  std::vector<std::string> taken;
  for (GDALDataset* input : inputs)
    for (const std::string& file : FilesOf(*input)) taken.push_back(file);
  CheckTarget("OUTPUT", options.output, taken, {".tif", ".tiff"});
  taken.push_back(options.output);
  if (!options.png.empty()) CheckTarget("--png", options.png, taken, {".png"});
  CheckStorable("--nodata", noData, options.OutputType());
}

void CheckBand(const std::string& argument, GDALDataset& dataset, int band, const std::string& input) {
  const int bands = dataset.GetRasterCount();
  if (band >= 1 && band <= bands) return;
  throw Refusal(
      argument, "there is no band " + std::to_string(band) + " in " + input,
      bands == 1 ? "1, as " + input + " has one band" : "a band from 1 to " + std::to_string(bands));
}

std::string DescribeGrid(const std::string& what, GDALDataset& dataset) {
  return what + ": " + CPLSPrintf("%d x %d pixels", dataset.GetRasterXSize(), dataset.GetRasterYSize()) +
         DescribeCells(dataset);
}

void RunJob(const Job& job, const TileWork& work) {
  const OutputOptions& options = job.options;
  const Quantity& quantity = job.bands[job.shown];
  const int band = static_cast<int>(job.shown) + 1;
  CheckTileSize(job);
  PendingFile file("OUTPUT", options.output);
  std::optional<PendingFile> picture;
  if (!options.png.empty()) picture.emplace("--png", options.png);

  OutputRaster output(file, job.grid, options.OutputType(), job.bands);
  const double seconds = WriteTiles(job, output, work);

  const DatasetPtr written(
      GDALDataset::Open(file.TemporaryPath().c_str(), GDAL_OF_RASTER | GDAL_OF_VERBOSE_ERROR));
  ThrowOnGdalError("reading back '" + options.output + "'", written ? CE_None : CE_Failure);
  const Summary summary = Summarise(*written->GetRasterBand(band), quantity);
  if (picture) DrawPicture(*written, band, quantity, job.style, picture->TemporaryPath());
  file.Commit();
  if (picture) picture->Commit();
  std::string name = quantity.name;
  if (job.bands.size() > 1) name += CPLSPrintf(" (band %d of %zu)", band, job.bands.size());
  std::printf("%s: %s, %d x %d %s, %s, in %.3f s\n", options.output.c_str(), name.c_str(),
              job.grid.GetRasterXSize(), job.grid.GetRasterYSize(), options.type.c_str(),
              Describe(summary, quantity).c_str(), seconds);
}

void RunJob(const JobOptions& options, GDALDataset& input, const TileReader& reader, const Quantity& quantity,
            PictureStyle style, const TileOperation& operation) {
  const std::filesystem::path path(options.input);
  style.title =
      !options.title.empty() ? options.title : Capitalised(quantity.name) + ", " + path.stem().string();
  style.caption = DescribeGrid(path.filename().string(), input);
  RunJob({.options = options, .grid = input, .bands = {quantity}, .style = style},
         [&](const Tile& tile, Raster& out) {
           LoadedTile in = reader.Read(tile);
           operation(in, out);
         });
}

}  // namespace examples
