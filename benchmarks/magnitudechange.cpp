#include "processes/gridmill/magnitudechange.h"

#include <cmath>

#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::eDIFF_FORWARD;
using changedetection::MagnitudeChange;

void Magnitude(const Workload& work) {
  MagnitudeChange(eDIFF_FORWARD)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

double Length(const unsigned short* pixel, std::size_t channels) {
  double sum = 0.0;
  for (std::size_t c = 0; c < channels; ++c) sum += pixel[c] * pixel[c];
  return std::sqrt(sum);
}

void NaiveMagnitude(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const image = RowOf<unsigned short>(*work.in, y);
    const unsigned short* const reference = RowOf<unsigned short>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      const double a = Length(image + x * channels, channels);
      const double b = Length(reference + x * channels, channels);
      target[3 * x] = static_cast<float>(a);
      target[3 * x + 1] = static_cast<float>(b);
      target[3 * x + 2] = static_cast<float>(a - b);
    }
  }
}

constexpr Row kRows[] = {
    {.job = "magnitude",
     .types = "u16 x 4 -> f32 x 3",
     .workload = Dates<unsigned short, unsigned short, float, 4, 3>,
     .gridmill = Magnitude,
     .naive = NaiveMagnitude},
};

}  // namespace

std::span<const Row> MagnitudeChangeRows() { return kRows; }

}  // namespace orvik::bench
