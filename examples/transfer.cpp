// A region of a raster brought to another scale, tile by tile: transfer scene.tif part.tif
// --region 100,60,120,90 --to 480,360

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "processes/gridmill/iiidatatransfer.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::Refusal;
using examples::Tile;
using examples::TileReader;
using orvik::gridmill::IIIDataTransfer;
using orvik::tessel::Raster;

struct TransferOptions : JobOptions {
  std::vector<std::uint32_t> region;  // x, y, width, height; empty: all of it
  std::vector<std::uint32_t> to;      // width, height
  std::vector<int> bands;
  std::vector<int> show;
};

// One axis of the transfer.
struct Axis {
  std::uint32_t start;   // of the region
  std::uint32_t extent;  // of the region
  std::uint32_t to;      // of the output
  std::uint32_t image;   // of the input

  double Scale() const { return static_cast<double>(to) / extent; }

  // Where an output pixel lies in the input, both counted by their upper left pixels' indices. The operator
  // takes the nearest one.
  double Source(double pixel) const { return pixel / Scale() + start; }

  // The input pixels that a tile needs, and one more at each end, so that no rounding matters.
  std::pair<std::uint32_t, std::uint32_t> Needed(std::uint32_t first, std::uint32_t count) const {
    const double last = image - 1.0;
    const double low = std::clamp(std::floor(Source(first)) - 1.0, 0.0, last);
    const double high = std::clamp(std::ceil(Source(first + count - 1.0)) + 1.0, 0.0, last);
    return {static_cast<std::uint32_t>(low), static_cast<std::uint32_t>(high - low) + 1};
  }
};

struct Axes {
  Axis x;
  Axis y;

  Tile Needed(const Tile& tile) const {
    const auto [left, width] = x.Needed(tile.x, tile.width);
    const auto [top, height] = y.Needed(tile.y, tile.height);
    return {left, top, width, height};
  }
};

Axes AxesOf(const TransferOptions& options, GDALDataset& input) {
  const auto width = static_cast<std::uint32_t>(input.GetRasterXSize());
  const auto height = static_cast<std::uint32_t>(input.GetRasterYSize());
  const std::string size = CPLSPrintf("%u x %u pixels", width, height);
  std::vector<std::uint32_t> region = options.region;
  if (region.empty()) region = {0, 0, width, height};
  if (region.size() != 4)
    throw Refusal("--region", std::to_string(region.size()) + " numbers", "four: X,Y,W,H");
  if (options.to.size() != 2)
    throw Refusal("--to", std::to_string(options.to.size()) + " number", "two: W,H");
  if (region[2] == 0 || region[3] == 0)
    throw Refusal("--region", CPLSPrintf("%u x %u pixels", region[2], region[3]), "at least one pixel");
  if (region[0] >= width || region[2] > width - region[0] || region[1] >= height ||
      region[3] > height - region[1])
    throw Refusal("--region",
                  CPLSPrintf("%u x %u pixels at column %u, row %u leave INPUT", region[2], region[3],
                             region[0], region[1]),
                  "a region within its " + size);
  return {{region[0], region[2], options.to[0], width}, {region[1], region[3], options.to[1], height}};
}

// The samples stay where they are on the ground: the centre of an output pixel is the place in the input that
// the operator takes the nearest pixel to.
void Place(GDALDataset& input, const Axes& axes, GDALDataset& grid) {
  const double scaleX = axes.x.Scale(), scaleY = axes.y.Scale();
  const double left = axes.x.start + 0.5 - 0.5 / scaleX, top = axes.y.start + 0.5 - 0.5 / scaleY;
  double in[6];
  if (input.GetGeoTransform(in) == CE_None) {
    double out[] = {in[0] + left * in[1] + top * in[2], in[1] / scaleX, in[2] / scaleY,
                    in[3] + left * in[4] + top * in[5], in[4] / scaleX, in[5] / scaleY};
    grid.SetGeoTransform(out);
  } else if (input.GetGCPCount() > 0) {
    std::vector<GDAL_GCP> points(input.GetGCPs(), input.GetGCPs() + input.GetGCPCount());
    for (GDAL_GCP& point : points) {
      point.dfGCPPixel = (point.dfGCPPixel - left) * scaleX;
      point.dfGCPLine = (point.dfGCPLine - top) * scaleY;
    }
    grid.SetGCPs(static_cast<int>(points.size()), points.data(), input.GetGCPSpatialRef());
  }
  if (const OGRSpatialReference* reference = input.GetSpatialRef()) grid.SetSpatialRef(reference);
  if (const char* kind = input.GetMetadataItem(GDALMD_AREA_OR_POINT))
    grid.SetMetadataItem(GDALMD_AREA_OR_POINT, kind);
}

// A raster without bands, for the size and the georeference of the output.
examples::DatasetPtr GridOf(GDALDataset& input, const Axes& axes) {
  GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("MEM");
  examples::DatasetPtr grid(
      driver->Create("", static_cast<int>(axes.x.to), static_cast<int>(axes.y.to), 0, GDT_Byte, nullptr));
  examples::ThrowOnGdalError("laying the output", grid ? CE_None : CE_Failure);
  Place(input, axes, *grid);
  examples::ThrowOnGdalError("laying the output");
  return grid;
}

// The type that holds all the bands.
GDALDataType HeldType(GDALDataset& input, const std::vector<int>& bands) {
  GDALDataType held = input.GetRasterBand(bands.front())->GetRasterDataType();
  for (const int band : bands) held = GDALDataTypeUnion(held, input.GetRasterBand(band)->GetRasterDataType());
  return held;
}

// A tile of the output needs a piece of the input, which is no larger than a raster can be. Complex samples
// are kept as they are, or give their real parts to the type that is asked for.
TileReader ReaderFor(const TransferOptions& options, GDALDataset& input, const std::vector<int>& bands,
                     const Axes& axes) {
  const auto side = [&](const Axis& axis) { return std::ceil(options.tile / axis.Scale()) + 4.0; };
  const double most = std::max(axes.x.image, axes.y.image);
  const GDALDataType type =
      options.type.empty() ? HeldType(input, bands) : examples::RealTypeOf(input, bands);
  TileReader reader({.dataset = input, .bands = bands, .type = type}, 0,
                    static_cast<std::uint32_t>(std::min(std::max(side(axes.x), side(axes.y)), most)));
  if (reader.Type() == orvik::tessel::DataType::Of<char>() &&
      (options.type.empty() || options.type == "Byte"))
    throw Refusal("INPUT", "has signed bytes, which OUTPUT cannot keep", "another --type, as Int16");
  return reader;
}

// As stated, or what INPUT declares, or the default of the type. Complex samples have none.
std::optional<double> NoDataOf(const TransferOptions& options, GDALDataset& input,
                               const std::vector<int>& bands, bool masked) {
  if (GDALDataTypeIsComplex(options.OutputType())) return std::nullopt;
  if (options.noData || !masked) return options.NoDataIf(masked);
  for (const int band : bands) {
    int stated = 0;
    const double value = input.GetRasterBand(band)->GetNoDataValue(&stated);
    if (stated && examples::IsStorable(value, options.OutputType())) return value;
  }
  return options.NoData();
}

IIIDataTransfer OperatorFor(const Axes& axes) {
  std::vector<unsigned int> from = {axes.x.start, axes.y.start, axes.x.extent, axes.y.extent};
  std::vector<unsigned int> to = {0, 0, axes.x.to, axes.y.to};
  IIIDataTransfer transfer;
  transfer.SetInRegion(from);
  transfer.SetOutRegion(to);
  return transfer;
}

// Brings the validity of the pixels to the tile as it does their samples.
void FillNoData(const IIIDataTransfer& transfer, const LoadedTile& in, double noData, GDALDataType type,
                Raster& out) {
  const std::unique_ptr<Raster> valid(in.mask->CreateRaster());
  Raster there({out.width, out.height, 1, orvik::tessel::DataType::Of<unsigned char>()},
               {0, 0, out.originX, out.originY});
  transfer.Process(valid.get(), nullptr, &there);
  orvik::tessel::Mask mask(out.width, out.height);
  for (std::uint32_t i = 0; i < out.width * out.height; ++i)
    if (there.data[i] == 0)
      mask.SetValid(static_cast<std::int32_t>(i % out.width), static_cast<std::int32_t>(i / out.width),
                    false);
  examples::FillMasked(mask, noData, type, out);
}

examples::Job JobOf(const TransferOptions& options, GDALDataset& input, const std::vector<int>& bands,
                    std::optional<double> noData, const Axes& axes, GDALDataset& grid) {
  const std::filesystem::path path(options.input);
  examples::Job job{.options = options, .grid = grid, .bands = {}, .name = "transfer"};
  for (const int band : bands) {
    const std::string name = input.GetRasterBand(band)->GetDescription();
    job.bands.push_back({.name = name.empty() ? "band " + std::to_string(band) : name,
                         .unit = input.GetRasterBand(band)->GetUnitType(),
                         .noData = noData});
  }
  const std::vector<int> places = examples::ShownPlaces(options.show, bands, "transferred");
  const std::string shown = ShowPlaces(job, places, bands);
  if (places.size() == 3) job.style.legend = "bands";
  job.style.title =
      !options.title.empty() ? options.title : "Transfer, " + shown + ", " + path.stem().string();
  job.style.note = CPLSPrintf("from %u x %u pixels", axes.x.extent, axes.y.extent);
  job.style.caption = examples::DescribeGrid(path.filename().string(), grid);
  return job;
}

// Both rasters are pieces of larger images, and say where in them they begin.
void Run(TransferOptions options) {
  const examples::DatasetPtr input = examples::OpenRaster("INPUT", options.input);
  const std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  const Axes axes = AxesOf(options, *input);
  const TileReader reader = ReaderFor(options, *input, bands, axes);
  if (options.type.empty()) options.type = GDALGetDataTypeName(HeldType(*input, bands));
  CheckOutputs(options, {input.get()}, options.NoData());
  const std::optional<double> noData = NoDataOf(options, *input, bands, reader.Masked());
  const examples::DatasetPtr grid = GridOf(*input, axes);
  const IIIDataTransfer samples = OperatorFor(axes), validity = OperatorFor(axes);
  RunJob(JobOf(options, *input, bands, noData, axes, *grid), [&](const Tile& tile, Raster& out) {
    LoadedTile in = reader.Read(axes.Needed(tile));
    out.originX = tile.x;
    out.originY = tile.y;
    samples.Process(in.raster.get(), nullptr, &out);
    if (in.mask && noData) FillNoData(validity, in, *noData, options.OutputType(), out);
  });
}

void AddNumbers(CLI::App& app, const std::string& name, std::vector<std::uint32_t>& numbers, int count,
                std::uint32_t least, const std::string& form, const std::string& help) {
  app.add_option(name, numbers, help)
      ->type_name(form)
      ->delimiter(',')
      ->expected(1, count)
      ->check(examples::Count(1u << 24, least));
}

void AddTransferOptions(CLI::App& app, TransferOptions& options) {
  AddNumbers(app, "--region", options.region, 4, 0, "X,Y,W,H",
             "the region of INPUT, by its first column and row and its size in\n"
             "pixels; default: all of it");
  AddNumbers(app, "--to", options.to, 2, 1, "W,H", "the size of OUTPUT in pixels");
  app.get_option("--to")->required();
  examples::AddBandList(app, "--bands", options.bands,
                        "bands to transfer, as in 1,2,3; default: all but alpha bands");
  examples::AddShow(app, options.show);
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("A region of a raster brought to another scale. Each pixel takes the nearest one of INPUT.\n",
               "transfer");
  TransferOptions options;
  options.type.clear();
  AddJobOptions(
      app, options,
      {.names = examples::OutputTypeNames(),
       .help =
           "Byte, UInt16, Int16, UInt32, Int32,\nUInt64, Int64, Float32 or Float64; default: that of INPUT",
       .noDataHelp = "that of INPUT,\nor the type's own if a pixel can be without data"},
      "With the scale S of an axis, OUTPUT's size over the region's, column x takes the column\n"
      "x / S + X + 0.5 of INPUT, without its fraction: at twice the scale 0, 1, 1, 2, 2, ... The last\n"
      "columns take pixels past the region where INPUT has some, else its edge; rows do the same. The\n"
      "georeference of OUTPUT keeps the samples in their places, so that its edges lie half the\n"
      "difference of the pixel sizes away from those of the region.\n"
      "\n"
      "--type is a plain cast, which drops fractions and high bits: 300.7 is 44 in Byte, and the imaginary\n"
      "parts of complex samples are left out. A pixel without data in one of the bands is without data in\n"
      "all.\n");
  AddTransferOptions(app, options);
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
