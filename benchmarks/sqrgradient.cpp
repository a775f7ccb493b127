#include "processes/gridmill/sqrgradient.h"

#include <algorithm>
#include <vector>

#include "benchmarks/focus.h"
#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

template <const Accepted& accepted>
void SquaredGradient(const Workload& work) {
  filters::SqrGradientEvaluation focus;
  focus.SetBackground(accepted.low, accepted.high);
  focus.SetFailure(accepted.failure);
  focus.InitEvaluation(work.in->channels);
  focus.Process(work.in.get(), work.mask.get(), nullptr);
  std::ranges::copy(focus.GetEvaluation(), RowOf<double>(*work.out, 0));
}

template <class Pixel, const Accepted& accepted>
void NaiveSquaredGradient(const Workload& work) {
  const std::size_t channels = work.in->channels;
  std::vector<double> sums(channels, 0.0);
  for (std::size_t y = 0; y + 1 < work.in->height; ++y) {
    const Pixel* const upper = RowOf<Pixel>(*work.in, y);
    const Pixel* const lower = RowOf<Pixel>(*work.in, y + 1);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      for (std::size_t c = 0; c < channels; ++c) {
        const double p0 = upper[x * channels + c];
        const double p1 = lower[x * channels + c];
        if (!accepted.Holds(p0) || !accepted.Holds(p1)) continue;
        sums[c] += (p1 - p0) * (p1 - p0);
      }
    }
  }
  std::ranges::copy(sums, RowOf<double>(*work.twin, 0));
}

constexpr Row kRows[] = {
    {.job = "squared gradient",
     .types = "u8",
     .workload = SummedScene<unsigned char, 1, 1>,
     .gridmill = SquaredGradient<kByDefault>,
     .naive = NaiveSquaredGradient<unsigned char, kByDefault>,
     .opencv = OpenCvSquaredGradient,
     .peersWithin = 0.0},
    {.job = "squared gradient, no-data",
     .types = "u8",
     .workload = SummedScene<unsigned char, 1, 1>,
     .gridmill = SquaredGradient<kBytesButNoData>,
     .naive = NaiveSquaredGradient<unsigned char, kBytesButNoData>},
    {.job = "squared gradient",
     .types = "f32",
     .workload = SummedScene<float, 1, 1>,
     .gridmill = SquaredGradient<kByDefault>,
     .naive = NaiveSquaredGradient<float, kByDefault>,
     .opencv = OpenCvSquaredGradient,
     .peersWithin = 1e-9},
    {.job = "squared gradient, no-data",
     .types = "f32",
     .workload = SummedScene<float, 1, 1>,
     .gridmill = SquaredGradient<kButNoData>,
     .naive = NaiveSquaredGradient<float, kButNoData>},
    {.job = "squared gradient",
     .types = "f32 x 4",
     .workload = SummedScene<float, 4, 4>,
     .gridmill = SquaredGradient<kByDefault>,
     .naive = NaiveSquaredGradient<float, kByDefault>},
};

}  // namespace

std::span<const Row> SqrGradientRows() { return kRows; }

}  // namespace orvik::bench
