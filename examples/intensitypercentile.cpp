// How remarkable an intensity is, and in which direction: intensitypercentile change.tif percentile.tif
// --bands 1,2,3 --absolute --png percentile.png

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "processes/gridmill/intenpercent.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::Quantity;
using examples::Refusal;
using examples::Tile;
using examples::TileReader;
using orvik::tessel::Raster;

struct PercentOptions : JobOptions {
  std::vector<int> bands = {1, 2, 3};
  bool absolute = false;
  int bins = 256;
};

// The intensities of all valid pixels in equal bins.
struct Histogram {
  float low = std::numeric_limits<float>::infinity();
  float high = -std::numeric_limits<float>::infinity();
  std::vector<std::uint64_t> counts;

  // Bins in a unit of the intensity.
  double Scale() const { return static_cast<double>(counts.size()) / (static_cast<double>(high) - low); }

  // Counts a value in the bin in which the operator will look for it; the upper end belongs to the last one.
  void Count(float value) {
    const double place = std::floor((static_cast<double>(value) - low) * Scale());
    ++counts[std::min(static_cast<std::size_t>(place), counts.size() - 1)];
  }
};

// The operator takes counts in 32 bits and multiplies them by 100 in 32 bits; more than that are reduced.
std::vector<int> Reduced(const std::vector<std::uint64_t>& counts) {
  constexpr std::uint64_t most = 21474836;
  std::uint64_t total = 0;
  for (const std::uint64_t count : counts) total += count;
  std::vector<int> reduced;
  for (const std::uint64_t count : counts) reduced.push_back(static_cast<int>(count / (total / most + 1)));
  return reduced;
}

class Intensities {
 public:
  Intensities(const PercentOptions& options, GDALDataset& input)
      : options_(options),
        reader_({.dataset = input, .bands = options.bands, .type = GDT_Float32}, 0, options.tile) {}

  const TileReader& Reader() const { return reader_; }

  // Two values and an intensity of each pixel.
  LoadedTile Read(const Tile& tile) const {
    LoadedTile in = reader_.Read(tile);
    if (options_.absolute) ForEach(in, [](float& intensity) { intensity = std::fabs(intensity); });
    return in;
  }

  template <class Work>
  static void ForEach(LoadedTile& in, Work work) {
    auto* samples = reinterpret_cast<float*>(in.raster->data);
    const std::size_t pixels = static_cast<std::size_t>(in.raster->width) * in.raster->height;
    for (std::size_t i = 0; i < pixels; ++i) {
      const auto x = static_cast<std::int32_t>(i % in.raster->width);
      const auto y = static_cast<std::int32_t>(i / in.raster->width);
      if ((!in.mask || in.mask->IsValid(x, y)) && std::isfinite(samples[3 * i + 2])) work(samples[3 * i + 2]);
    }
  }

 private:
  const PercentOptions& options_;
  TileReader reader_;
};

Histogram HistogramOf(const PercentOptions& options, GDALDataset& input, const Intensities& intensities) {
  const std::vector<Tile> tiles =
      examples::CutTiles(static_cast<std::uint32_t>(input.GetRasterXSize()),
                         static_cast<std::uint32_t>(input.GetRasterYSize()), options.tile);
  Histogram histogram;
  for (const Tile& tile : tiles) {
    LoadedTile in = intensities.Read(tile);
    Intensities::ForEach(in, [&](float value) {
      histogram.low = std::min(histogram.low, value);
      histogram.high = std::max(histogram.high, value);
    });
  }
  if (!(histogram.low < histogram.high))
    throw Refusal("INPUT", CPLSPrintf("band %d has not two values", options.bands[2]), "a band with some");
  histogram.counts.resize(static_cast<std::size_t>(options.bins));
  for (const Tile& tile : tiles) {
    LoadedTile in = intensities.Read(tile);
    Intensities::ForEach(in, [&](float value) { histogram.Count(value); });
  }
  return histogram;
}

examples::Job JobOf(const PercentOptions& options, GDALDataset& input, std::optional<double> noData) {
  const std::filesystem::path path(options.input);
  examples::Job job{.options = options, .grid = input, .bands = {}, .shown = 3};
  for (const int band : options.bands) {
    const std::string name = input.GetRasterBand(band)->GetDescription();
    job.bands.push_back({.name = name.empty() ? "band " + std::to_string(band) : name,
                         .unit = input.GetRasterBand(band)->GetUnitType(),
                         .noData = noData});
  }
  job.bands.push_back(
      {.name = "percentile of " + job.bands.back().name, .unit = "percent", .noData = noData});
  job.style.span = examples::Span::bothSigns;
  job.style.ramp = examples::ChangeRamp;
  job.style.legend = "percentile";
  job.style.note = "sign of the greater value";
  job.style.title = !options.title.empty() ? options.title : "Signed percentile, " + path.stem().string();
  job.style.caption = examples::DescribeGrid(path.filename().string(), input);
  return job;
}

void Run(const PercentOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  if (options.bands.size() != 3)
    throw Refusal("--bands", std::to_string(options.bands.size()) + " bands", "three");
  for (const int band : options.bands) examples::CheckBand("--bands", *input, band);
  const Intensities intensities(options, *input);
  const Histogram histogram = HistogramOf(options, *input, intensities);
  orvik::filters::IntenPercent percent;
  percent.SetNoData(std::numeric_limits<double>::quiet_NaN());  // the mask alone decides
  percent.SetMin(histogram.low);
  percent.SetMax(histogram.high);
  percent.SetScale(histogram.Scale());
  percent.SetBins(Reduced(histogram.counts));
  percent.SetType(orvik::changedetection::eDIFF_FORWARD);
  const std::optional<double> noData = options.NoDataIf(intensities.Reader().Masked());
  RunJob(JobOf(options, *input, noData), [&](const Tile& tile, Raster& out) {
    LoadedTile in = intensities.Read(tile);
    percent.Process(in.raster.get(), nullptr, &out);
    if (in.mask) examples::FillMasked(*in.mask, *noData, options.OutputType(), out);
  });
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("The percentile of an intensity, negative where the second of two values is the greater.\n",
               "intensitypercentile");
  PercentOptions options;
  AddJobOptions(
      app, options,
      {.names = {"Int16", "Int32", "Float32", "Float64"},
       .help = "Int16, Int32, Float32 (default) or\nFloat64",
       .noDataHelp = "nan for floating types,\n-32768 for Int16 and Int32"},
      "OUTPUT holds the three bands and the percentile. Between the edges of the bins runs a spline,\n"
      "which can leave 0 to 100 by a little.\n");
  examples::AddBandList(app, "--bands", options.bands, "two values and the intensity; default: 1,2,3");
  app.add_flag("--absolute", options.absolute, "take the intensity without its sign");
  app.add_option("--bins", options.bins, "bins of the histogram, 256 by default")
      ->type_name("N")
      ->check(examples::Count(1u << 20));
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
