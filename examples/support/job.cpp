#include "job.h"

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

// Texts that were not stated are made from the input.
PictureStyle Labelled(PictureStyle style, const JobOptions& options, GDALDataset& input,
                      const Quantity& quantity) {
  const std::filesystem::path path(options.input);
  style.title =
      !options.title.empty() ? options.title : Capitalised(quantity.name) + ", " + path.stem().string();
  style.caption = path.filename().string() + ": " +
                  CPLSPrintf("%d x %d pixels", input.GetRasterXSize(), input.GetRasterYSize()) +
                  DescribeCells(input);
  return style;
}

}  // namespace

double JobOptions::NoData() const { return noData.value_or(DefaultNoData(OutputType())); }

DatasetPtr OpenInput(const JobOptions& options) {
  DatasetPtr input = OpenRaster("INPUT", options.input);
  std::vector<std::string> taken = FilesOf(*input);
  CheckTarget("OUTPUT", options.output, taken, {".tif", ".tiff"});
  taken.push_back(options.output);
  if (!options.png.empty()) CheckTarget("--png", options.png, taken, {".png"});
  CheckStorable("--nodata", options.NoData(), options.OutputType());
  return input;
}

void CheckBand(const std::string& argument, GDALDataset& dataset, int band) {
  const int bands = dataset.GetRasterCount();
  if (band >= 1 && band <= bands) return;
  throw Refusal(argument, "there is no band " + std::to_string(band),
                bands == 1 ? "1, as INPUT has one band" : "a band from 1 to " + std::to_string(bands));
}

void RunJob(const JobOptions& options, GDALDataset& input, const TileReader& reader, const Quantity& quantity,
            const PictureStyle& style, const TileOperation& operation) {
  PendingFile file("OUTPUT", options.output);
  std::optional<PendingFile> picture;
  if (!options.png.empty()) picture.emplace("--png", options.png);

  const auto width = static_cast<std::uint32_t>(input.GetRasterXSize());
  const auto height = static_cast<std::uint32_t>(input.GetRasterYSize());
  const std::vector<Tile> tiles = CutTiles(width, height, options.tile);
  OutputRaster output(file, input, options.OutputType(), quantity);
  double seconds = 0.0;
  {
    Progress progress(quantity.name, tiles.size());
    for (const Tile& tile : tiles) {
      LoadedTile in = reader.Read(tile);
      Raster out(RasterInfo(tile.width, tile.height, 1, output.Type()), {});
      operation(in, out);
      output.Write(tile, out);
      progress.Step();
    }
    output.Close();
    seconds = progress.Seconds();
  }

  const DatasetPtr written(
      GDALDataset::Open(file.TemporaryPath().c_str(), GDAL_OF_RASTER | GDAL_OF_VERBOSE_ERROR));
  ThrowOnGdalError("reading back '" + options.output + "'", written ? CE_None : CE_Failure);
  const Summary summary = Summarise(*written, quantity);
  if (picture)
    DrawPicture(*written, quantity, Labelled(style, options, input, quantity), picture->TemporaryPath());
  file.Commit();
  if (picture) picture->Commit();
  std::printf("%s: %s, %u x %u %s, %s, in %.3f s\n", options.output.c_str(), quantity.name.c_str(), width,
              height, options.type.c_str(), Describe(summary, quantity).c_str(), seconds);
}

}  // namespace examples
