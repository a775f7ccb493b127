// Slope and aspect of an elevation model, tile by tile: terrain slope dem.tif slope.tif --png slope.png

#include <cmath>
#include <string>
#include <vector>

#include "processes/gridmill/filterasp.h"
#include "processes/gridmill/filterslp.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::Cell;
using examples::JobOptions;
using examples::LoadedTile;
using examples::Quantity;
using examples::Refusal;
using orvik::tessel::Raster;

constexpr std::uint32_t margin = 1;  // an operator reads a cell of 2 x 2 pixels

struct TerrainOptions : JobOptions {
  int band = 1;
  std::vector<double> scale;
  double zFactor = 1.0;
  std::optional<double> flat;

  double Flat() const;
};

// -1 where the type has it, else a value beyond the full circle.
double TerrainOptions::Flat() const {
  if (flat) return *flat;
  switch (OutputType()) {
    case GDT_Byte:
      return 254.0;  // degrees are halved there, the circle ends at 180
    case GDT_Int16:
    case GDT_Int32:
    case GDT_Float32:
    case GDT_Float64:
      return -1.0;
    default:
      return 510.0;
  }
}

// The spacings of the pixels in the unit of the elevations, with the signs of the georeference.
struct Spacing {
  double x;
  double y;
};

// The metres in a unit of longitude and of latitude at the centre of the raster, as text for --scale.
std::string MetresInDegree(GDALDataset& input) {
  double transform[6];
  if (input.GetGeoTransform(transform) != CE_None) return "SX,SY";
  const double unit = input.GetSpatialRef()->GetAngularUnits();  // in radians
  const double latitude = (transform[3] + transform[5] * input.GetRasterYSize() / 2.0) * unit;
  const double along = 6378137.0 * unit;
  return CPLSPrintf("%.0f,%.0f", along * std::cos(latitude), along);
}

Spacing SpacingOf(const TerrainOptions& options, GDALDataset& input) {
  const Cell cell = examples::CellOf(input);
  const std::string name = "'" + options.input + "'";
  if (!cell.straight)
    throw Refusal("INPUT", name + " is rotated or sheared against its coordinates",
                  "rows along one axis and columns along the other, as gdalwarp makes them");
  if (options.scale.empty() && cell.geographic)
    throw Refusal("INPUT", name + " has coordinates in degrees, which are no measure for a slope",
                  "--scale with the elevation units in a degree of longitude and of latitude, for metres "
                  "here --scale " +
                      MetresInDegree(input) + ", or a raster in metres, as gdalwarp makes it");
  if (options.scale.empty() && !cell.known)
    throw Refusal("INPUT", name + " has no georeference, so that the size of a pixel is unknown",
                  "--scale with the size of a pixel in elevation units");
  const double scaleX = options.scale.empty() ? 1.0 : options.scale.front();
  const double scaleY = options.scale.empty() ? 1.0 : options.scale.back();
  return {cell.x * scaleX, cell.y * scaleY};
}

examples::TileReader ReaderFor(const TerrainOptions& options, GDALDataset& input) {
  examples::CheckBand("--band", input, options.band);
  return examples::TileReader({.dataset = input, .bands = {options.band}}, margin, options.tile);
}

void RunSlope(const TerrainOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  const examples::TileReader reader = ReaderFor(options, *input);
  const Spacing spacing = SpacingOf(options, *input);
  orvik::filters::FilterSlp slope(static_cast<float>(std::abs(spacing.x)),
                                  static_cast<float>(std::abs(spacing.y)),
                                  static_cast<float>(options.zFactor));
  slope.SetBackground(static_cast<float>(options.NoData()));
  RunJob(options, *input, reader, {.name = "slope", .unit = "degrees", .noData = options.NoData()},
         {.ramp = examples::HeatRamp, .span = examples::Span::fromZero},
         [&](LoadedTile& in, Raster& out) { slope.Process(in.raster.get(), in.mask.get(), &out); });
}

void RunAspect(const TerrainOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  const examples::TileReader reader = ReaderFor(options, *input);
  const Spacing spacing = SpacingOf(options, *input);
  examples::CheckStorable("--flat", options.Flat(), options.OutputType());
  orvik::filters::FilterAsp aspect;
  // The operator takes the top of the raster for the north and its right side for the east. The gradient
  // along y is multiplied by XSIZE and that along x by YSIZE, so that a negative one turns it around where
  // rows run northwards or columns westwards.
  aspect.SetXSIZE(static_cast<float>(std::copysign(spacing.x, -spacing.y)));
  aspect.SetYSIZE(static_cast<float>(std::copysign(spacing.y, spacing.x)));
  aspect.SetELSZ(static_cast<float>(options.zFactor));
  aspect.SetZeroSlope(static_cast<float>(options.Flat()));
  aspect.SetBackground(static_cast<float>(options.NoData()));
  const Quantity quantity = {.name = "aspect",
                             .unit = "degrees",
                             .compass = true,
                             .scale = options.OutputType() == GDT_Byte ? 2.0 : 1.0,
                             .flat = options.Flat(),
                             .noData = options.NoData()};
  RunJob(options, *input, reader, quantity, {.ramp = examples::CompassRamp},
         [&](LoadedTile& in, Raster& out) { aspect.Process(in.raster.get(), in.mask.get(), &out); });
}

void AddTerrainOptions(CLI::App& command, TerrainOptions& options, const std::string& notes) {
  AddJobOptions(
      command, options,
      "A pixel is the upper left one of the 2 x 2 cell that its value stands for. The last column and\n"
      "the last row have no neighbours: the edge pixel is repeated there.\n" +
          notes +
          "Elevations and coordinates are taken to be in one unit: state --scale where they are not.\n");
  command.add_option("--band", options.band, "band of INPUT that holds the elevations, 1 by default")
      ->type_name("N")
      ->check(examples::Count(1u << 16));
  command
      .add_option("--scale", options.scale,
                  "elevation units in one unit of the coordinates, along x and\n"
                  "along y; one number stands for both; default 1. For metres on\n"
                  "degrees at latitude L: 111320 * cos(L),111320. For metres on\n"
                  "feet: 0.3048. Without a georeference: the size of a pixel")
      ->type_name("SX[,SY]")
      ->delimiter(',')
      ->expected(1, 2)
      ->check(examples::PositiveNumber());
  command.add_option("--z-factor", options.zFactor, "factor on the elevations, 1 by default")
      ->type_name("Z")
      ->check(examples::Number());
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("Slope and aspect of an elevation model, from cells of 2 x 2 pixels.\n", "terrain");
  TerrainOptions options;
  app.require_subcommand(1);
  app.fallthrough(false);
  CLI::App* slope =
      app.add_subcommand("slope", "angle of the surface against the horizontal, 0 to 90 degrees");
  AddTerrainOptions(
      *slope, options,
      "A neighbour without data counts as level with the pixel. All types but Float32 hold whole\n"
      "degrees.\n");
  CLI::App* aspect =
      app.add_subcommand("aspect", "compass direction in which the surface falls away, 0 to 360 degrees");
  AddTerrainOptions(
      *aspect, options,
      "0 is north, 90 east, 180 south and 270 west, also in rasters whose rows run northwards. Byte\n"
      "holds half the degrees, 0 to 180.\n");
  aspect
      ->add_option("--flat", options.flat,
                   "value of a cell that is flat or lacks a neighbour; default: -1,\n"
                   "254 for Byte, 510 for UInt16, UInt32, UInt64 and Int64")
      ->type_name("V")
      ->check(examples::Number());
  return examples::RunProgram(app, argc, argv,
                              [&] { slope->parsed() ? RunSlope(options) : RunAspect(options); });
}
