#include "processes/gridmill/averagechannels.h"

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

constexpr float kNoData = 0.0f;

void Mean(const Workload& work) {
  filters::AverageChannels(kNoData).Process(work.in.get(), work.mask.get(), work.out.get(), nullptr);
}

template <class In>
float PixelMean(const In* pixel, std::size_t channels) {
  float sum = 0.0f;
  for (std::size_t c = 0; c < channels; ++c) {
    const float sample = pixel[c];
    const double difference = sample - kNoData;
    if (difference > -1e-9 && difference < 1e-9) return kNoData;
    sum += sample;
  }
  return sum / static_cast<float>(channels);
}

void NaiveByteMean(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* const source = RowOf<unsigned char>(*work.in, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = ToByte(PixelMean(source + x * channels, channels));
  }
}

void NaiveMaskedByteMean(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* const source = RowOf<unsigned char>(*work.in, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      target[x] = IsValid(*work.mask, x, y) ? ToByte(PixelMean(source + x * channels, channels))
                                            : static_cast<unsigned char>(kNoData);
    }
  }
}

void NaiveFloatMean(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const source = RowOf<unsigned short>(*work.in, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) target[x] = PixelMean(source + x * channels, channels);
  }
}

constexpr Row kRows[] = {
    {.job = "mean",
     .types = "u8 x 3 -> u8",
     .workload = Bands<unsigned char, unsigned char, 3>,
     .gridmill = Mean,
     .naive = NaiveByteMean,
     .opencv = OpenCvMean,
     .twoThreads = true},
    // The peer runs without a mask.
    {.job = "mean, random mask",
     .types = "u8 x 3 -> u8",
     .workload = Bands<unsigned char, unsigned char, 3, MaskPattern::kRandom>,
     .gridmill = Mean,
     .naive = NaiveMaskedByteMean,
     .opencv = OpenCvMean},
    {.job = "mean, mask in runs",
     .types = "u8 x 3 -> u8",
     .workload = Bands<unsigned char, unsigned char, 3, MaskPattern::kRuns>,
     .gridmill = Mean,
     .naive = NaiveMaskedByteMean,
     .opencv = OpenCvMean},
    {.job = "mean",
     .types = "u16 x 4 -> f32",
     .workload = Bands<unsigned short, float, 4>,
     .gridmill = Mean,
     .naive = NaiveFloatMean},
};

}  // namespace

std::span<const Row> AverageChannelsRows() { return kRows; }

}  // namespace orvik::bench
