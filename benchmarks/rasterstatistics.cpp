#include "processes/gridmill/rasterstatistics.h"

#include <algorithm>
#include <any>
#include <numeric>
#include <vector>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using gridmill::StatisticsMethod;

template <class Pixel>
constexpr std::size_t kBins = std::size_t{1} << (8 * sizeof(Pixel));

/// The operator is kept from call to call, as for the tiles of an image.
template <class Pixel, StatisticsMethod method>
gridmill::RasterStatistics& StatisticsOf(const Workload& work) {
  if (!work.kept.has_value()) {
    std::vector<unsigned int> channels(work.in->channels);
    std::iota(channels.begin(), channels.end(), 0u);
    auto& statistics = work.kept.emplace<gridmill::RasterStatistics>();
    statistics.SetMethod(method);
    statistics.SetChans(channels);
    statistics.SetType(8 * sizeof(Pixel));
  }
  return *std::any_cast<gridmill::RasterStatistics>(&work.kept);
}

template <class Pixel, StatisticsMethod method>
void Statistics(const Workload& work) {
  StatisticsOf<Pixel, method>(work).Process(work.in.get(), work.mask.get(), nullptr);
}

/// The statistics of one channel.
struct Tally {
  std::vector<int> counts;
  float minimum = 100000.0f;
  float maximum = -100000.0f;

  template <class Pixel>
  void Count(Pixel sample) {
    ++counts[sample];
    const float value = sample;
    if (value < minimum) minimum = value;
    if (value > maximum) maximum = value;
  }

  void CountBlue(int blue) {
    ++counts[static_cast<std::size_t>(blue)];
    if (blue < static_cast<int>(minimum)) minimum = static_cast<float>(blue);
    if (blue > static_cast<int>(maximum)) maximum = static_cast<float>(blue);
  }
};

using Tallies = std::vector<Tally>;

template <class Pixel>
Tallies& TalliesOf(const Workload& work) {
  if (!work.keptTwin.has_value())
    work.keptTwin.emplace<Tallies>(work.in->channels, Tally{std::vector<int>(kBins<Pixel>)});
  return *std::any_cast<Tallies>(&work.keptTwin);
}

template <class Pixel>
int Blue(const Pixel* pixel) {
  const double blue = pixel[0] * 0.873393 + 13.9054 - pixel[1] * 0.138254 - pixel[2] * 0.100616;
  return std::clamp(static_cast<int>(blue), 0, 255);
}

template <class Pixel, StatisticsMethod method>
void NaiveStatistics(const Workload& work) {
  Tally* const tallies = TalliesOf<Pixel>(work).data();
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const Pixel* pixel = RowOf<Pixel>(*work.in, y);
    for (std::size_t x = 0; x < work.in->width; ++x, pixel += channels) {
      for (std::size_t c = 0; c < channels; ++c) {
        if (method == gridmill::eSTATISTICS_SYNTHETIC_BLUE && c == 2)
          tallies[c].CountBlue(Blue(pixel));
        else
          tallies[c].Count(pixel[c]);
      }
    }
  }
}

template <class Pixel, StatisticsMethod method>
void Results(const Workload& work) {
  gridmill::RasterStatistics& statistics = StatisticsOf<Pixel, method>(work);
  std::vector<float> minima, maxima;
  statistics.GetMinValue(minima);
  statistics.GetMaxValue(maxima);
  const Tallies& tallies = TalliesOf<Pixel>(work);
  int* result = RowOf<int>(*work.out, 0);
  int* twin = RowOf<int>(*work.twin, 0);
  for (std::size_t c = 0; c < tallies.size(); ++c) {
    *result++ = static_cast<int>(minima[c]);
    *result++ = static_cast<int>(maxima[c]);
    result = std::ranges::copy(statistics.GetPixelCounts(static_cast<int>(c)), result).out;
    *twin++ = static_cast<int>(tallies[c].minimum);
    *twin++ = static_cast<int>(tallies[c].maximum);
    twin = std::ranges::copy(tallies[c].counts, twin).out;
  }
}

constexpr Row kRows[] = {
    {.job = "statistics",
     .types = "u8 x 3",
     .workload = CountedScene<unsigned char, 3, 256>,
     .gridmill = Statistics<unsigned char, gridmill::eSTATISTICS_PLAIN>,
     .naive = NaiveStatistics<unsigned char, gridmill::eSTATISTICS_PLAIN>,
     .opencv = OpenCvHistograms,
     .results = Results<unsigned char, gridmill::eSTATISTICS_PLAIN>},
    {.job = "statistics, synthetic blue",
     .types = "u8 x 3",
     .workload = CountedScene<unsigned char, 3, 256>,
     .gridmill = Statistics<unsigned char, gridmill::eSTATISTICS_SYNTHETIC_BLUE>,
     .naive = NaiveStatistics<unsigned char, gridmill::eSTATISTICS_SYNTHETIC_BLUE>,
     .opencv = OpenCvHistograms,
     .results = Results<unsigned char, gridmill::eSTATISTICS_SYNTHETIC_BLUE>},
    {.job = "statistics",
     .types = "u16",
     .workload = CountedScene<unsigned short, 1, 65536>,
     .gridmill = Statistics<unsigned short, gridmill::eSTATISTICS_PLAIN>,
     .naive = NaiveStatistics<unsigned short, gridmill::eSTATISTICS_PLAIN>,
     .opencv = OpenCvWideHistogram,
     .python = "statistics",
     .results = Results<unsigned short, gridmill::eSTATISTICS_PLAIN>},
};

}  // namespace

std::span<const Row> RasterStatisticsRows() { return kRows; }

}  // namespace orvik::bench
