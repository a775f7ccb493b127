// The contrast of a scene's bands stretched to percent, tile by tile: stretch percentile scene.tif out.tif
// --show 4,3,2 --png out.png

#include <algorithm>
#include <filesystem>
#include <limits>
#include <string>
#include <vector>

#include "processes/gridmill/normalize.h"
#include "processes/gridmill/percentile.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"
#include "support/statistics.h"

namespace {

using examples::ChannelStatistics;
using examples::JobOptions;
using examples::LoadedTile;
using examples::Refusal;
using examples::Tile;
using orvik::tessel::Raster;

constexpr float neverEqual = std::numeric_limits<float>::quiet_NaN();  // the mask alone decides

struct StretchOptions : JobOptions {
  std::vector<int> bands;
  std::vector<int> show;
  int bins = 256;
  double cut = 0.0;
};

// A scene, the bands of it that are read, and their statistics.
struct Scene {
  examples::DatasetPtr input;
  std::vector<int> bands;
  std::vector<int> shown;  // places in `bands`: three as red, green and blue, or one
  examples::TileReader reader;
  std::vector<ChannelStatistics> channels;
};

// Read in single precision, in which the operators compute: the percentile of an integer sample would lose
// its fraction.
Scene OpenScene(const StretchOptions& options) {
  examples::DatasetPtr input = OpenInput(options);
  std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  std::vector<int> shown = examples::ShownPlaces(options.show, bands, "stretched");
  examples::TileReader reader({.dataset = *input, .bands = bands, .type = GDT_Float32}, 0, options.tile);
  const bool whole = !examples::IsFloating(examples::RealTypeOf(*input, bands));
  std::vector<ChannelStatistics> channels =
      StatisticsOf({.dataset = *input, .bands = bands}, options.tile, options.bins,
                   whole ? examples::Bins::wholeNumbers : examples::Bins::overRange);
  return {std::move(input), std::move(bands), std::move(shown), std::move(reader), std::move(channels)};
}

// The operator takes counts in 32 bits, multiplied by 100 in 32 bits; more than that are reduced.
std::vector<int> Counts(const std::vector<ChannelStatistics>& channels) {
  constexpr std::uint64_t mostInBin = 21474836, most = 2147483647;
  std::uint64_t divisor = 1;
  for (const ChannelStatistics& channel : channels) {
    divisor = std::max(divisor, channel.Total() / most + 1);
    for (const std::uint64_t count : channel.counts)
      divisor = std::max(divisor, (count + mostInBin - 1) / mostInBin);
  }
  std::vector<int> counts;
  for (const ChannelStatistics& channel : channels)
    for (const std::uint64_t count : channel.counts) counts.push_back(static_cast<int>(count / divisor));
  return counts;
}

// The part of the range that is left when at most `percent` of the samples lie beyond each end, in whole
// bins; all of it if that leaves nothing.
struct Range {
  float low;
  float high;
};

Range WithoutTails(const ChannelStatistics& channel, double percent) {
  const double tail = static_cast<double>(channel.Total()) * percent / 100.0;
  const std::size_t bins = channel.counts.size();
  std::size_t first = 0, last = bins;
  for (double below = 0.0; first < bins; ++first)
    if ((below += static_cast<double>(channel.counts[first])) > tail) break;
  for (double above = 0.0; last > 0; --last)
    if ((above += static_cast<double>(channel.counts[last - 1])) > tail) break;
  const float step = (channel.high - channel.low) / static_cast<float>(bins);
  if (channel.high > channel.max) --last;  // a bin for each whole number, which is its lower edge
  const Range range{channel.low + static_cast<float>(first) * step,
                    channel.low + static_cast<float>(last) * step};
  return percent > 0.0 && range.low < range.high ? range : Range{channel.min, channel.max};
}

// A measure as the output and its picture name it.
struct Words {
  std::string measure;
  std::string title;
  std::string note = {};
};

examples::Job JobOf(const StretchOptions& options, const Scene& scene, const Words& words) {
  const std::filesystem::path path(options.input);
  examples::Job job{.options = options, .grid = *scene.input, .bands = {}, .name = words.measure};
  for (const int band : scene.bands)
    job.bands.push_back({.name = words.measure + " of band " + std::to_string(band),
                         .unit = "percent",
                         .noData = options.NoDataIf(scene.reader.Masked())});
  job.style.span = examples::Span::percent;
  const std::string shown = ShowPlaces(job, scene.shown, scene.bands);
  job.style.legend = words.measure;
  job.style.note = words.note;
  job.style.unit = job.style.composite.empty() ? "percent" : "0 to 100 percent";
  job.style.title =
      !options.title.empty() ? options.title : words.title + " of " + shown + ", " + path.stem().string();
  job.style.caption = examples::DescribeGrid(path.filename().string(), *scene.input);
  return job;
}

template <class Operator>
void Stretch(const StretchOptions& options, const Scene& scene, const examples::Job& job,
             const Operator& stretch) {
  RunJob(job, [&](const Tile& tile, Raster& out) {
    LoadedTile in = scene.reader.Read(tile);
    stretch.Process(in.raster.get(), nullptr, &out);  // the operator ignores masks
    if (in.mask) examples::FillMasked(*in.mask, *job.bands.front().noData, options.OutputType(), out);
  });
}

void RunPercentile(const StretchOptions& options) {
  const Scene scene = OpenScene(options);
  std::vector<float> low, high;
  for (const ChannelStatistics& channel : scene.channels) {
    low.push_back(channel.low);
    high.push_back(channel.high);
  }
  orvik::filters::Percentile percentile;
  percentile.SetNoData(neverEqual);
  percentile.SetMinData(low);
  percentile.SetMaxData(high);
  percentile.SetBinNum(static_cast<int>(scene.channels.front().counts.size()));
  percentile.SetCoefficients(Counts(scene.channels));
  Stretch(options, scene, JobOf(options, scene, {"percentile", "Percentiles"}), percentile);
}

void RunNormalize(const StretchOptions& options) {
  const Scene scene = OpenScene(options);
  std::vector<float> low, high;
  for (const ChannelStatistics& channel : scene.channels) {
    const Range range = WithoutTails(channel, options.cut);
    low.push_back(range.low);
    high.push_back(range.high);
  }
  orvik::filters::Normalize normalize;
  normalize.SetNoData(neverEqual);
  normalize.SetMinData(low);
  normalize.SetMaxData(high);
  const std::string note = options.cut > 0.0 ? CPLSPrintf("%.4g %% cut at each end", options.cut) : "";
  Stretch(options, scene, JobOf(options, scene, {"share of range", "Share of the range", note}), normalize);
}

void AddStretchOptions(CLI::App& command, StretchOptions& options, const std::string& notes) {
  AddJobOptions(
      command, options,
      notes +
          "The statistics are those of the valid pixels of the whole raster. A pixel needs data in all\n"
          "bands. Integer outputs hold whole percents, and no no-data value if no pixel can be without\n"
          "data.\n");
  examples::AddBandList(command, "--bands", options.bands,
                        "bands to stretch, as in 1,2,3; default: all but alpha bands");
  examples::AddShow(command, options.show);
  command
      .add_option("--bins", options.bins,
                  "bins of the histograms at most, 256 by default. Integers get\n"
                  "a bin for each value if so many are enough")
      ->type_name("N")
      ->check(examples::Count(1u << 20));
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("The contrast of a scene, band by band, in percent.\n", "stretch");
  StretchOptions options;
  app.require_subcommand(1);
  app.fallthrough(false);
  CLI::App* percentile =
      app.add_subcommand("percentile", "the percentage of the band's samples that lie below the sample");
  AddStretchOptions(
      *percentile, options,
      "Histogram equalisation. Between the edges of the bins runs a spline, which can leave 0 to 100\n"
      "by a little.\n");
  CLI::App* normalize =
      app.add_subcommand("normalize", "the sample as a percentage of the range of its band");
  AddStretchOptions(*normalize, options, "A linear stretch between the least and the greatest sample.\n");
  normalize
      ->add_option("--cut", options.cut,
                   "leave out this percentage of the samples at each end when the\n"
                   "range is measured, in whole bins; default 0")
      ->type_name("P")
      ->check(examples::Tail());
  return examples::RunProgram(app, argc, argv,
                              [&] { percentile->parsed() ? RunPercentile(options) : RunNormalize(options); });
}
