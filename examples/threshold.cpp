// A bitmap of the samples within a range, tile by tile: threshold scene.tif water.tif --band 4 --max 30

#include <filesystem>
#include <limits>
#include <optional>
#include <string>

#include "processes/gridmill/bitmapfiltering.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::PictureStyle;
using examples::Quantity;
using examples::Refusal;
using orvik::tessel::Raster;

struct ThresholdOptions : JobOptions {
  int band = 1;
  std::optional<float> min;
  std::optional<float> max;

  ThresholdOptions() { type = "Byte"; }
  bool Wraps() const { return min && max && *min > *max; }
};

// How the condition is written: with what stands for the samples, and the signs.
struct Signs {
  std::string samples;
  std::string atMost;
  std::string atLeast;
};

// "10 <= band 4 <= 40", "band 4 >= 40", "band 4 <= 10 or >= 40"
std::string Condition(const ThresholdOptions& options, const Signs& signs) {
  const std::string min = options.min ? CPLSPrintf("%.7g", *options.min) : "";
  const std::string max = options.max ? CPLSPrintf("%.7g", *options.max) : "";
  const std::string upTo = signs.samples + " " + signs.atMost + " " + max;
  const std::string from = signs.samples + " " + signs.atLeast + " " + min;
  if (options.Wraps()) return upTo + " or " + signs.atLeast + " " + min;
  if (!options.max) return from;
  if (!options.min) return upTo;
  return *options.min == *options.max ? signs.samples + " = " + min : min + " " + signs.atMost + " " + upTo;
}

// What the band is said to hold, or "band 4".
std::string BandName(GDALDataset& input, int band) {
  const std::string name = input.GetRasterBand(band)->GetDescription();
  return name.empty() ? "band " + std::to_string(band) : name;
}

PictureStyle StyleOf(const ThresholdOptions& options, const std::string& band) {
  PictureStyle style;
  style.title = Condition(options, {band, "≤", "≥"});
  style.legend = options.Wraps() ? "wrapped range" : "range";
  style.note = style.title;
  style.classes = {{1.0, {0.20, 0.24, 0.34}, "inside"}, {0.0, {0.90, 0.89, 0.86}, "outside"}};
  return style;
}

// The operator leaves a 0 where the mask is clear, as it does outside the range.
void Run(const ThresholdOptions& options) {
  if (!options.min && !options.max)
    throw Refusal("--min", "is missing, and --max too", "one of them or both");
  if (options.noData && (*options.noData == 0.0 || *options.noData == 1.0))
    throw Refusal("--nodata", "0 and 1 are the values of the bitmap", "another one, up to 255");
  const examples::DatasetPtr input = OpenInput(options);
  examples::CheckBand("--band", *input, options.band);
  const examples::TileReader reader(
      {.dataset = *input, .bands = {options.band}, .type = examples::RealTypeOf(*input, {options.band})}, 0,
      options.tile);
  constexpr float infinity = std::numeric_limits<float>::infinity();
  const orvik::filters::BitmapFiltering filter(options.min.value_or(-infinity),
                                               options.max.value_or(infinity));
  const std::string band = BandName(*input, options.band);
  const Quantity quantity = {.name = Condition(options, {band, "<=", ">="}),
                             .bitmap = true,
                             .noData = options.NoDataIf(reader.Masked())};
  RunJob(options, *input, reader, quantity, StyleOf(options, band), [&](LoadedTile& in, Raster& out) {
    filter.Process(in.raster.get(), in.mask.get(), &out);
    if (in.mask) examples::FillMasked(*in.mask, *quantity.noData, options.OutputType(), out);
  });
}

void AddThreshold(CLI::App& app, const std::string& name, std::optional<float>& value,
                  const std::string& help) {
  app.add_option(name, value, help)->type_name("V")->check(examples::SinglePrecision());
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("A bitmap of the samples within a range: 1 inside, 0 outside.\n", "threshold");
  ThresholdOptions options;
  AddJobOptions(
      app, options, {.names = {"Byte"}, .help = "Byte and no other", .noDataHelp = "255"},
      "Both ends belong to the range. A --min above --max is no mistake: the range then wraps around,\n"
      "as for angles, and holds what is at or above --min or at or below --max. Samples and thresholds\n"
      "are compared in single precision. OUTPUT has no no-data value if no pixel can be without data.\n");
  app.add_option("--band", options.band, "band of INPUT to compare, 1 by default")
      ->type_name("N")
      ->check(examples::Count(1u << 16));
  AddThreshold(app, "--min", options.min, "least value of the range; default: none");
  AddThreshold(app, "--max", options.max, "greatest value of the range; default: none");
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
