#include "processes/gridmill/percentile.h"

#include <cmath>
#include <memory>
#include <vector>

#include "benchmarks/naivespline.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

/// The operator is kept from call to call, as for the tiles of an image: narrow samples get their tables
/// once.
void Percentiles(const Workload& work) {
  static std::unique_ptr<filters::Percentile> percentile;
  if (percentile == nullptr || percentile->Coefficients != work.histogram.counts) {
    percentile = std::make_unique<filters::Percentile>();
    percentile->SetBinNum(work.histogram.bins);
    percentile->SetMinData(work.histogram.minimum);
    percentile->SetMaxData(work.histogram.maximum);
    percentile->SetCoefficients(work.histogram.counts);
  }
  percentile->Process(work.in.get(), work.mask.get(), work.out.get());
}

/// One channel of the histogram with its spline.
struct Channel {
  float minimum;
  float maximum;
  int bins;
  double scale;
  NaiveSpline spline;

  Channel(const Histogram& histogram, std::size_t c)
      : minimum(histogram.minimum[c]),
        maximum(histogram.maximum[c]),
        bins(histogram.bins),
        scale(static_cast<float>(bins) / (maximum - minimum)),
        spline(histogram.counts.data() + c * static_cast<std::size_t>(bins), bins, scale) {}
};

unsigned short ToSample(double value, unsigned short) {
  return static_cast<unsigned short>(static_cast<int>(value));
}

float ToSample(double value, float) { return static_cast<float>(value); }

template <class In>
float Rank(In sample, const Channel& channel) {
  const float value = sample;
  const double delta = value - 0.0f;
  if (delta > -1e-9 && delta < 1e-9) return 0.0f;
  if (channel.minimum == channel.maximum || channel.minimum >= value) return 0.0f;
  if (value >= channel.maximum) return 100.0f;
  const int bin = static_cast<int>(std::floor((value - channel.minimum) * static_cast<float>(channel.scale)));
  if (bin < 0) return 0.0f;
  if (bin >= channel.bins) return 100.0f;
  const double dx = value - (bin / channel.scale + channel.minimum);
  return ToSample(channel.spline.At(static_cast<std::size_t>(bin), dx), In{});
}

void Store(float value, unsigned char& target) { target = ToByte(value); }

void Store(float value, float& target) { target = value; }

template <class In, class Out>
void NaivePercentiles(const Workload& work) {
  const std::size_t channels = work.in->channels;
  std::vector<Channel> ranks;
  for (std::size_t c = 0; c < channels; ++c) ranks.emplace_back(work.histogram, c);
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const In* const source = RowOf<In>(*work.in, y);
    Out* const target = RowOf<Out>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      for (std::size_t c = 0; c < channels; ++c)
        Store(Rank(source[x * channels + c], ranks[c]), target[x * channels + c]);
  }
}

constexpr Row kRows[] = {
    {.job = "percentile",
     .types = "u16 x 3 -> u8 x 3",
     .workload = RankedScene<unsigned short, unsigned char, 3, 3>,
     .gridmill = Percentiles,
     .naive = NaivePercentiles<unsigned short, unsigned char>,
     .python = "percentile_bytes"},
    {.job = "percentile",
     .types = "f32 -> f32",
     .workload = RankedScene<float, float, 1, 1>,
     .gridmill = Percentiles,
     .naive = NaivePercentiles<float, float>,
     .python = "percentile_floats"},
};

}  // namespace

std::span<const Row> PercentileRows() { return kRows; }

}  // namespace orvik::bench
