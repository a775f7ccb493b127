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
  Progress progress(job.name.empty() ? job.bands[job.shown].name : job.name, tiles.size());
  for (const Tile& tile : tiles) {
    Raster out(RasterInfo(tile.width, tile.height, channels, output.Type()), {});
    work(tile, out);
    output.Write(tile, out);
    progress.Step();
  }
  output.Close();
  return progress.Seconds();
}

std::vector<Panel> PanelsOf(const Job& job) {
  std::vector<Panel> panels = {
      {.band = static_cast<int>(job.shown) + 1, .quantity = job.bands[job.shown], .style = job.style}};
  panels.insert(panels.end(), job.beside.begin(), job.beside.end());
  return panels;
}

// The bands that the panels show, each once.
std::vector<int> BandsOf(const std::vector<Panel>& panels) {
  std::vector<int> bands;
  const auto add = [&](int band) {
    if (std::find(bands.begin(), bands.end(), band) == bands.end()) bands.push_back(band);
  };
  for (const Panel& panel : panels) {
    if (panel.style.composite.empty()) add(panel.band);
    for (const CompositeBand& part : panel.style.composite) add(part.band);
  }
  return bands;
}

// A line for the band that is shown, or a line for all and one for each.
std::string FiguresOf(const Job& job, GDALDataset& written, const std::vector<int>& bands, double seconds) {
  const std::size_t count = job.bands.size();
  const std::string size = CPLSPrintf(", %d x %d %s, ", job.grid.GetRasterXSize(), job.grid.GetRasterYSize(),
                                      job.options.type.c_str());
  const std::string time = CPLSPrintf("in %.3f s\n", seconds);
  const auto quantity = [&](int band) { return job.bands[static_cast<std::size_t>(band) - 1]; };
  if (bands.size() == 1) {
    const int band = bands.front();
    const Summary summary = Summarise(*written.GetRasterBand(band), quantity(band));
    const std::string place = count > 1 ? CPLSPrintf(" (band %d of %zu)", band, count) : "";
    return job.options.output + ": " + quantity(band).name + place + size +
           Describe(summary, quantity(band)) + ", " + time + DescribeClasses(summary, quantity(band));
  }
  std::string text =
      job.options.output + ": " + job.name + ", " + std::to_string(count) + " bands" + size + time;
  for (const int band : bands)
    text += "  band " + std::to_string(band) + ", " + quantity(band).name + ": " +
            Describe(Summarise(*written.GetRasterBand(band), quantity(band)), quantity(band)) + "\n";
  return text;
}

}  // namespace

double OutputOptions::NoData() const { return noData.value_or(DefaultNoData(OutputType())); }

std::optional<double> OutputOptions::NoDataIf(bool masked) const {
  if (noData || IsFloating(OutputType()) || masked) return NoData();
  return std::nullopt;
}

DatasetPtr OpenInput(const JobOptions& options) {
  DatasetPtr input = OpenRaster("INPUT", options.input);
  CheckOutputs(options, {input.get()}, options.NoData());
  return input;
}

std::vector<std::string> FilesOf(GDALDataset& dataset) {
  char** list = dataset.GetFileList();
  std::vector<std::string> files;
  for (char** file = list; file != nullptr && *file != nullptr; ++file) files.emplace_back(*file);
  CSLDestroy(list);
  return files;
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

std::vector<int> ValueBands(GDALDataset& dataset) {
  std::vector<int> bands;
  for (int band = 1; band <= dataset.GetRasterCount(); ++band)
    if (dataset.GetRasterBand(band)->GetColorInterpretation() != GCI_AlphaBand) bands.push_back(band);
  return bands;
}

std::vector<int> ChosenBands(const std::vector<int>& asked, GDALDataset& input) {
  for (const int band : asked) CheckBand("--bands", input, band);
  const std::vector<int> bands = asked.empty() ? ValueBands(input) : asked;
  if (bands.empty()) throw Refusal("INPUT", "all bands are alpha bands", "a band with values, or --bands");
  return bands;
}

std::vector<int> ShownPlaces(const std::vector<int>& show, const std::vector<int>& bands,
                             const std::string& done) {
  if (show.size() == 2)
    throw Refusal("--show", "two bands make no picture", "three for red, green and blue, or one");
  std::vector<int> places;
  for (const int band : show) {
    const auto at = std::find(bands.begin(), bands.end(), band);
    if (at == bands.end())
      throw Refusal("--show", "band " + std::to_string(band) + " is not " + done, "one of the --bands");
    places.push_back(static_cast<int>(at - bands.begin()));
  }
  return places.empty() ? std::vector<int>{0} : places;
}

std::string ShowPlaces(Job& job, const std::vector<int>& places, const std::vector<int>& bands) {
  const std::string parts[] = {"red: ", "green: ", "blue: "};
  const bool composite = places.size() == 3;
  std::string list;
  for (const int place : places) {
    const std::string band = std::to_string(bands[static_cast<std::size_t>(place)]);
    if (composite)
      job.style.composite.push_back({place + 1, parts[job.style.composite.size()] + "band " + band});
    list += (list.empty() ? "" : ", ") + band;
  }
  job.shown = static_cast<std::size_t>(places.front());
  return (composite ? "bands " : "band ") + list;
}

std::string DescribeGrid(const std::string& what, GDALDataset& dataset) {
  return what + ": " + CPLSPrintf("%d x %d pixels", dataset.GetRasterXSize(), dataset.GetRasterYSize()) +
         DescribeCells(dataset);
}

void RunJob(const Job& job, const TileWork& work) {
  const OutputOptions& options = job.options;
  CheckTileSize(job);
  PendingFile file("OUTPUT", options.output);
  std::optional<PendingFile> picture;
  if (!options.png.empty()) picture.emplace("--png", options.png);

  OutputRaster output(file, job.grid, options.OutputType(), job.bands);
  const double seconds = WriteTiles(job, output, work);

  const DatasetPtr written(
      GDALDataset::Open(file.TemporaryPath().c_str(), GDAL_OF_RASTER | GDAL_OF_VERBOSE_ERROR));
  ThrowOnGdalError("reading back '" + options.output + "'", written ? CE_None : CE_Failure);
  const std::vector<Panel> panels = PanelsOf(job);
  if (picture) DrawPicture(*written, panels, picture->TemporaryPath());
  const std::string figures = FiguresOf(job, *written, BandsOf(panels), seconds);
  file.Commit();
  if (picture) picture->Commit();
  std::fputs(figures.c_str(), stdout);
}

void RunJob(const JobOptions& options, GDALDataset& input, const TileReader& reader, const Quantity& quantity,
            PictureStyle style, const TileOperation& operation) {
  const std::filesystem::path path(options.input);
  const std::string words = Capitalised(style.title.empty() ? quantity.name : style.title);
  style.title = !options.title.empty() ? options.title : words + ", " + path.stem().string();
  style.caption = DescribeGrid(path.filename().string(), input);
  RunJob({.options = options, .grid = input, .bands = {quantity}, .style = style},
         [&](const Tile& tile, Raster& out) {
           LoadedTile in = reader.Read(tile);
           operation(in, out);
         });
}

}  // namespace examples
