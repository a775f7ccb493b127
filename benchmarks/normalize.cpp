#include "processes/gridmill/normalize.h"

#include <iterator>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

void Normalized(const Workload& work) {
  filters::Normalize normalize;
  normalize.SetMinData({std::begin(kStretchFrom), std::end(kStretchFrom)});
  normalize.SetMaxData({std::begin(kStretchTo), std::end(kStretchTo)});
  normalize.Process(work.in.get(), work.mask.get(), work.out.get());
}

float Stretched(float value, std::size_t c) {
  const double delta = value - 0.0f;
  if (delta > -1e-9 && delta < 1e-9) return 0.0f;
  if (kStretchFrom[c] >= value) return 0.0f;
  if (value >= kStretchTo[c]) return 100.0f;
  const double above = value - kStretchFrom[c];
  const auto percent = static_cast<float>(above * 100.0 / (kStretchTo[c] - kStretchFrom[c]));
  return percent < 0.0f ? 0.0f : percent >= 100.0f ? 100.0f : percent;
}

void NaiveNormalized(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const source = RowOf<unsigned short>(*work.in, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      for (std::size_t c = 0; c < channels; ++c)
        target[x * channels + c] = Stretched(source[x * channels + c], c);
  }
}

constexpr Row kRows[] = {
    {.job = "normalize",
     .types = "u16 x 3 -> f32 x 3",
     .workload = Scene<unsigned short, float, 3, 3>,
     .gridmill = Normalized,
     .naive = NaiveNormalized,
     .opencv = OpenCvStretch,
     .peersWithin = 1e-6,
     .python = "normalize"},
};

}  // namespace

std::span<const Row> NormalizeRows() { return kRows; }

}  // namespace orvik::bench
