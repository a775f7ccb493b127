// A natural-colour triple of a sensor that has no blue band, tile by tile: naturalcolor scene.tif rgb.tif
// --bands 1,2,3 --cut 1 --png rgb.png

#include <algorithm>
#include <filesystem>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "processes/gridmill/spotblue.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"
#include "support/statistics.h"

namespace {

using examples::Histogram;
using examples::JobOptions;
using examples::LoadedTile;
using examples::Refusal;
using examples::Tile;
using orvik::tessel::Raster;

constexpr float unlimited = std::numeric_limits<float>::max();
constexpr float mostOfByte = 255.0f;

struct ColourOptions : JobOptions {
  std::vector<int> bands;  // green, red, near infrared
  std::optional<double> cut;
  std::optional<int> background;

  ColourOptions() { type = "Byte"; }
};

// Entries for green, red and blue, as the operator takes them.
struct Stretch {
  std::vector<float> min = {0.0f, 0.0f, -unlimited};
  std::vector<float> max = {mostOfByte, mostOfByte, unlimited};
  std::vector<float> scale = {1.0f, 1.0f, 1.0f};
};

void CheckBands(const ColourOptions& options, GDALDataset& input) {
  if (options.bands.size() != 3)
    throw Refusal("--bands", std::to_string(options.bands.size()) + " bands",
                  "three, for green, red and near infrared");
  for (const int band : options.bands) {
    examples::CheckBand("--bands", input, band);
    const GDALDataType type = input.GetRasterBand(band)->GetRasterDataType();
    if (type != GDT_Byte)
      throw Refusal("INPUT",
                    "band " + std::to_string(band) + " has samples of type " + GDALGetDataTypeName(type) +
                        ", and the blue is made for counts from 0 to 255",
                    "Byte, as gdal_translate -ot Byte -scale makes it");
  }
}

// The value that at most `percent` of the samples lie above.
float EndOf(const Histogram& histogram, double percent) {
  const double tail = static_cast<double>(histogram.Total()) * percent / 100.0;
  std::size_t value = histogram.counts.size() - 1;
  for (double above = 0.0; value > 0; --value)
    if ((above += static_cast<double>(histogram.counts[value])) > tail) break;
  return static_cast<float>(value);
}

// No blue of the scene is less. Its histogram counts negative ones as 0: then it is what the least green, the
// greatest red and the greatest infrared that there can be would give.
float LeastBlue(const std::vector<Histogram>& bands) {
  if (bands[2].min > 0.0f) return bands[2].min;
  return 0.873393f * bands[0].min + 13.9f - 0.138255f * bands[1].max - 0.100617f * mostOfByte;
}

// From `black` to 255. The least valid value of a band is also what is subtracted from it, so that all of
// them have to be valid: it is taken from the least sample, less what `black` is worth.
Stretch StretchOf(const std::vector<Histogram>& bands, double cut, float black) {
  Stretch stretch;
  for (std::size_t i = 0; i < 3; ++i) {
    const float least = i < 2 ? bands[i].min : LeastBlue(bands);
    const float range = std::max(EndOf(bands[i], cut) - least, 1.0f);
    stretch.scale[i] = (mostOfByte - black) / range;
    stretch.min[i] = least - black / stretch.scale[i];
  }
  return stretch;
}

// What a pixel without data holds. A stretch leaves 0 free; else it is what INPUT uses for it.
int BackgroundOf(const ColourOptions& options, GDALDataset& input) {
  if (options.cut) return 0;
  if (options.background) return *options.background;
  for (const int band : options.bands) {
    int stated = 0;
    const double value = input.GetRasterBand(band)->GetNoDataValue(&stated);
    if (stated && examples::IsStorable(value, GDT_Byte)) return static_cast<int>(value);
  }
  return 0;
}

orvik::gridmill::SPOTBlue OperatorFor(Stretch stretch, bool trim, int background) {
  // 256 more than what is written: the plain cast to `Byte` drops it, and no sample equals it, so that the
  // mask alone decides.
  std::vector<float> never(3, 256.0f + static_cast<float>(background));
  orvik::gridmill::SPOTBlue blue;
  blue.SetMin(stretch.min);
  blue.SetMax(stretch.max);
  blue.SetScale(stretch.scale);
  blue.SetBackGround(never);
  blue.SetTrim(trim);
  return blue;
}

examples::Job JobOf(const ColourOptions& options, GDALDataset& input, std::optional<double> noData) {
  const std::filesystem::path path(options.input);
  examples::Job job{.options = options, .grid = input, .bands = {}, .name = "natural colour, blue synthetic"};
  const std::string green = "band " + std::to_string(options.bands[0]);
  const std::string red = "band " + std::to_string(options.bands[1]);
  job.bands = {{.name = "red from " + red, .noData = noData},
               {.name = "green from " + green, .noData = noData},
               {.name = "synthetic blue", .noData = noData}};
  job.style.span = examples::Span::byte;
  job.style.composite = {{1, "red: " + red}, {2, "green: " + green}, {3, "blue: synthetic"}};
  job.style.legend = "natural colour";
  job.style.note = options.cut ? CPLSPrintf("%.4g %% cut above", *options.cut) : "as stored";
  job.style.unit = "0 to 255";
  job.style.title =
      !options.title.empty() ? options.title : "Natural colour, blue synthetic, " + path.stem().string();
  job.style.caption = examples::DescribeGrid(path.filename().string(), input);
  return job;
}

Stretch MeasuredStretch(const examples::TileReader& reader, const ColourOptions& options,
                        GDALDataset& input) {
  const std::vector<Tile> tiles =
      examples::CutTiles(static_cast<std::uint32_t>(input.GetRasterXSize()),
                         static_cast<std::uint32_t>(input.GetRasterYSize()), options.tile);
  const std::vector<Histogram> bands =
      HistogramsOf(reader, tiles, orvik::gridmill::eSTATISTICS_SYNTHETIC_BLUE);
  if (bands[0].min > bands[0].max)
    throw Refusal("INPUT", "has no valid pixel", "a raster with data in the three bands");
  return StretchOf(bands, *options.cut, reader.Masked() ? 1.0f : 0.0f);
}

void Run(const ColourOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  CheckBands(options, *input);
  examples::BandSource source{.dataset = *input, .bands = options.bands};
  if (options.background) source.hole = static_cast<unsigned char>(*options.background);
  const examples::TileReader reader(source, 0, options.tile);
  if (!examples::HasBins(reader.Type())) throw Refusal("INPUT", "has signed bytes", "counts from 0 to 255");
  const int background = BackgroundOf(options, *input);
  const Stretch stretch = options.cut ? MeasuredStretch(reader, options, *input) : Stretch{};
  const orvik::gridmill::SPOTBlue blue = OperatorFor(stretch, options.cut.has_value(), background);
  const std::optional<double> noData = reader.Masked() ? std::optional<double>(background) : std::nullopt;
  RunJob(JobOf(options, *input, noData), [&](const Tile& tile, Raster& out) {
    LoadedTile in = reader.Read(tile);
    blue.Process(in.raster.get(), in.mask.get(), &out);
  });
}

void AddColourOptions(CLI::App& app, ColourOptions& options) {
  examples::AddBandList(app, "--bands", options.bands,
                        "the bands that hold green, red and near infrared, in this\norder");
  app.get_option("--bands")->type_name("GREEN,RED,NIR")->required();
  app.add_option("--cut", options.cut,
                 "stretch each colour from its least sample to the one that at\n"
                 "most P percent lie above; default: no stretch")
      ->type_name("P")
      ->check(examples::Tail());
  app.add_option("--background", options.background,
                 "a sample with this value in one of the bands has no data\n"
                 "either; default: what INPUT declares alone")
      ->type_name("V")
      ->check(examples::Count(255, 0));
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("Natural colour from a sensor without a blue band: red, green and a synthetic blue.\n",
               "naturalcolor");
  ColourOptions options;
  AddJobOptions(
      app, options, {.names = {"Byte"}, .help = "Byte and no other", .noDataHelp = ""},
      "The blue is no measurement. It is 0.873393 green + 13.9054 - 0.138254 red - 0.100616 infrared, made\n"
      "for counts from 0 to 255, so that the bands have to be Byte. OUTPUT holds red, green and blue.\n"
      "Without --cut red and green are those of INPUT, and the blue is limited to 0 to 255.\n"
      "\n"
      "Where there can be pixels without data, OUTPUT has a no-data value: with --cut 0, and the colours\n"
      "take 1 to 255; else --background, the value that INPUT declares, or 0. Without --cut a synthetic\n"
      "blue may equal it by chance. A pixel needs data in all three bands.\n");
  app.get_option("INPUT")->description("a raster that GDAL reads, with three bands of Byte samples");
  AddColourOptions(app, options);
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
