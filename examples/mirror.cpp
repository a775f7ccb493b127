// A raster, or a window of it, mirrored: mirror vert scene.tif mirrored.tif --window 200,90,149,120

#include <algorithm>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "processes/gridmill/mirrorimg.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::Refusal;
using examples::Tile;
using orvik::filters::MirrorImg;
using orvik::tessel::Mask;
using orvik::tessel::Raster;

struct MirrorOptions : JobOptions {
  std::vector<std::uint32_t> window;  // x, y, width, height; empty: all of it
  std::vector<int> bands;
  std::vector<int> show;
};

// A window may reach over the whole raster, which is therefore one tile.
void ChooseTile(MirrorOptions& options, GDALDataset& input) {
  options.tile = static_cast<std::uint32_t>(std::max(input.GetRasterXSize(), input.GetRasterYSize()));
}

Tile WindowOf(const MirrorOptions& options, GDALDataset& input) {
  const auto width = static_cast<std::uint32_t>(input.GetRasterXSize());
  const auto height = static_cast<std::uint32_t>(input.GetRasterYSize());
  if (options.window.empty()) return {0, 0, width, height};
  if (options.window.size() != 4)
    throw Refusal("--window", std::to_string(options.window.size()) + " numbers", "four: X,Y,W,H");
  const Tile window{options.window[0], options.window[1], options.window[2], options.window[3]};
  const std::string place = CPLSPrintf("%u x %u pixels", window.width, window.height);
  if (window.width == 0 || window.height == 0) throw Refusal("--window", place, "at least one pixel");
  if (window.x >= width || window.width > width - window.x || window.y >= height ||
      window.height > height - window.y)
    throw Refusal("--window", place + CPLSPrintf(" at column %u, row %u leave INPUT", window.x, window.y),
                  CPLSPrintf("a window within its %u x %u pixels", width, height));
  return window;
}

// The operator finds the window by the bits of a mask.
Mask MaskOf(const Tile& window, std::uint32_t width, std::uint32_t height) {
  Mask mask(width, height, {}, false);
  for (std::uint32_t y = window.y; y < window.y + window.height; ++y)
    for (std::uint32_t x = window.x; x < window.x + window.width; ++x)
      mask.SetValid(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y), true);
  return mask;
}

MirrorImg OperatorFor(const std::string& axis, const Tile& window) {
  MirrorImg mirror;
  mirror.SetAxis(axis);
  mirror.SetWindow({window.x, window.y, window.width, window.height});
  mirror.IsNewFile(false);
  return mirror;
}

// The validity of the pixels changes places as their samples do.
void FillNoData(const MirrorImg& mirror, Mask& window, const Mask& valid, double noData, GDALDataType type,
                Raster& out) {
  const std::unique_ptr<Raster> before(valid.CreateRaster());
  Raster after({out.width, out.height, 1, orvik::tessel::DataType::Of<unsigned char>()}, {});
  mirror.Process(before.get(), &window, &after);
  Mask mask(out.width, out.height);
  for (std::uint32_t i = 0; i < out.width * out.height; ++i)
    if (after.data[i] == 0)
      mask.SetValid(static_cast<std::int32_t>(i % out.width), static_cast<std::int32_t>(i / out.width),
                    false);
  examples::FillMasked(mask, noData, type, out);
}

examples::Job JobOf(const MirrorOptions& options, GDALDataset& input, const std::vector<int>& bands,
                    std::optional<double> noData) {
  const std::filesystem::path path(options.input);
  examples::Job job{.options = options, .grid = input, .bands = {}, .name = "mirror"};
  for (const int band : bands) {
    const std::string name = input.GetRasterBand(band)->GetDescription();
    job.bands.push_back({.name = name.empty() ? "band " + std::to_string(band) : name,
                         .unit = input.GetRasterBand(band)->GetUnitType(),
                         .noData = noData});
  }
  const std::vector<int> places = examples::ShownPlaces(options.show, bands, "mirrored");
  const std::string shown = ShowPlaces(job, places, bands);
  if (places.size() == 3) job.style.legend = "bands";
  job.style.title =
      !options.title.empty() ? options.title : "Mirrored, " + shown + ", " + path.stem().string();
  job.style.caption = examples::DescribeGrid(path.filename().string(), input);
  return job;
}

void Run(const std::string& axis, MirrorOptions options) {
  const examples::DatasetPtr input = examples::OpenRaster("INPUT", options.input);
  const std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  ChooseTile(options, *input);
  if (options.type.empty()) options.type = GDALGetDataTypeName(examples::RealTypeOf(*input, bands));
  CheckOutputs(options, {input.get()}, options.NoData());
  const Tile window = WindowOf(options, *input);
  const examples::TileReader reader(
      {.dataset = *input, .bands = bands, .type = examples::RealTypeOf(*input, bands)}, 0, options.tile);
  const std::optional<double> noData =
      reader.Masked() ? std::optional(options.NoData()) : options.NoDataIf(false);
  const MirrorImg samples = OperatorFor(axis, window), validity = OperatorFor(axis, window);
  RunJob(JobOf(options, *input, bands, noData), [&](const Tile& tile, Raster& out) {
    const LoadedTile in = reader.Read(tile);
    Mask marked = MaskOf(window, tile.width, tile.height);
    samples.Process(in.raster.get(), &marked, &out);
    if (in.mask) FillNoData(validity, marked, *in.mask, *noData, options.OutputType(), out);
  });
}

void AddMirrorOptions(CLI::App& command, MirrorOptions& options) {
  AddJobOptions(
      command, options,
      {.names = examples::OutputTypeNames(),
       .help =
           "Byte, UInt16, Int16, UInt32, Int32,\nUInt64, Int64, Float32 or Float64; default: that of INPUT",
       .noDataHelp = "nan for floating types, else\n"
                     "-32768 for Int16 and Int32, 255 for Byte, 65535 for the rest"},
      "The samples change places, the georeference does not. They pass through single precision, in\n"
      "which integers above 16777216 are rounded. --tile has no effect: the raster is one tile.\n");
  command
      .add_option("--window", options.window,
                  "the part of INPUT to mirror in its place, by its first column and\n"
                  "row and its size in pixels; default: all of it")
      ->type_name("X,Y,W,H")
      ->delimiter(',')
      ->expected(1, 4)
      ->check(examples::Count(1u << 24, 0));
  examples::AddBandList(command, "--bands", options.bands,
                        "bands to write, as in 1,2,3; default: all but alpha bands");
  examples::AddShow(command, options.show);
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("A raster, or a window of it, mirrored.\n", "mirror");
  MirrorOptions options;
  options.type.clear();
  app.require_subcommand(1);
  app.fallthrough(false);
  CLI::App* vert = app.add_subcommand("vert", "left and right change places");
  CLI::App* hori = app.add_subcommand("hori", "top and bottom change places");
  for (CLI::App* command : {vert, hori}) AddMirrorOptions(*command, options);
  return examples::RunProgram(app, argc, argv, [&] { Run(vert->parsed() ? "vert" : "hori", options); });
}
