#include "processes/gridmill/intenratiochange.h"

#include <cmath>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::eDIFF_FORWARD;
using changedetection::IntenRatioChange;

void IntensityRatio(const Workload& work) {
  IntenRatioChange(eDIFF_FORWARD)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

double PixelMean(const unsigned char* pixel, std::size_t channels) {
  double sum = 0.0;
  for (std::size_t c = 0; c < channels; ++c) sum += pixel[c];
  return sum / static_cast<double>(channels);
}

void NaiveIntensityRatio(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* const image = RowOf<unsigned char>(*work.in, y);
    const unsigned char* const reference = RowOf<unsigned char>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      const double s = PixelMean(image + x * channels, channels);
      const double t = PixelMean(reference + x * channels, channels);
      target[4 * x] = static_cast<float>(s);
      target[4 * x + 1] = static_cast<float>(t);
      target[4 * x + 2] = t == 0.0 ? 0.0f : static_cast<float>(10.0 * std::log10(std::fabs(s / t)));
      target[4 * x + 3] = 0.0f;
    }
  }
}

constexpr Row kRows[] = {
    {.job = "intensity ratio",
     .types = "u8 x 3 -> f32 x 4",
     .workload = Dates<unsigned char, unsigned char, float, 3, 4>,
     .gridmill = IntensityRatio,
     .naive = NaiveIntensityRatio,
     .opencv = OpenCvDecibels},
};

}  // namespace

std::span<const Row> IntenRatioChangeRows() { return kRows; }

}  // namespace orvik::bench
