#include "processes/gridmill/vollath.h"

#include <algorithm>
#include <vector>

#include "benchmarks/focus.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

template <const Accepted& accepted>
void Autocorrelation(const Workload& work) {
  filters::VollathEvaluation focus;
  focus.SetBackground(accepted.low, accepted.high);
  focus.SetFailure(accepted.failure);
  focus.Process(work.in.get(), work.mask.get(), nullptr);
  double* const sums = RowOf<double>(*work.out, 0);
  std::ranges::copy(focus.GetLeftEq(), sums);
  std::ranges::copy(focus.GetRightEq(), sums + work.in->channels);
}

template <class Pixel, const Accepted& accepted>
void NaiveAutocorrelation(const Workload& work) {
  const std::size_t channels = work.in->channels;
  std::vector<double> left(channels, 0.0);
  std::vector<double> right(channels, 0.0);
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const Pixel* const row = RowOf<Pixel>(*work.in, y);
    for (std::size_t x = 0; x + 2 < work.in->width; ++x) {
      for (std::size_t c = 0; c < channels; ++c) {
        const double p0 = row[x * channels + c];
        const double p1 = row[(x + 1) * channels + c];
        const double p2 = row[(x + 2) * channels + c];
        if (!accepted.Holds(p0) || !accepted.Holds(p1) || !accepted.Holds(p2)) continue;
        left[c] += p1 * p0;
        right[c] += p2 * p0;
      }
    }
  }
  double* const sums = RowOf<double>(*work.twin, 0);
  std::ranges::copy(left, sums);
  std::ranges::copy(right, sums + channels);
}

constexpr Row kRows[] = {
    {.job = "autocorrelation",
     .types = "u8",
     .workload = SummedScene<unsigned char, 1, 2>,
     .gridmill = Autocorrelation<kByDefault>,
     .naive = NaiveAutocorrelation<unsigned char, kByDefault>},
    {.job = "autocorrelation, no-data",
     .types = "u8",
     .workload = SummedScene<unsigned char, 1, 2>,
     .gridmill = Autocorrelation<kBytesButNoData>,
     .naive = NaiveAutocorrelation<unsigned char, kBytesButNoData>},
    {.job = "autocorrelation",
     .types = "u16",
     .workload = SummedScene<unsigned short, 1, 2>,
     .gridmill = Autocorrelation<kByDefault>,
     .naive = NaiveAutocorrelation<unsigned short, kByDefault>},
    {.job = "autocorrelation",
     .types = "f32",
     .workload = SummedScene<float, 1, 2>,
     .gridmill = Autocorrelation<kByDefault>,
     .naive = NaiveAutocorrelation<float, kByDefault>},
    {.job = "autocorrelation, no-data",
     .types = "f32",
     .workload = SummedScene<float, 1, 2>,
     .gridmill = Autocorrelation<kButNoData>,
     .naive = NaiveAutocorrelation<float, kButNoData>},
    {.job = "autocorrelation",
     .types = "f32 x 4",
     .workload = SummedScene<float, 4, 8>,
     .gridmill = Autocorrelation<kByDefault>,
     .naive = NaiveAutocorrelation<float, kByDefault>},
};

}  // namespace

std::span<const Row> VollathRows() { return kRows; }

}  // namespace orvik::bench
