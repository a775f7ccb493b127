#include "processes/gridmill/chanratiochange.h"

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::ChanRatioChange;
using changedetection::eDIFF2_SIGNED;

void Ratio(const Workload& work) {
  ChanRatioChange(eDIFF2_SIGNED)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), nullptr, work.out.get());
}

void NaiveRatio(const Workload& work) {
  const std::size_t samples = std::size_t{work.in->width} * work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* const image = RowOf<unsigned char>(*work.in, y);
    const unsigned char* const reference = RowOf<unsigned char>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t i = 0; i < samples; ++i)
      target[i] = static_cast<float>(image[i]) / static_cast<float>(reference[i]);
  }
}

constexpr Row kRows[] = {
    {.job = "ratio",
     .types = "u8 x 3 -> f32 x 3",
     .workload = Dates<unsigned char, unsigned char, float, 3, 3>,
     .gridmill = Ratio,
     .naive = NaiveRatio,
     .opencv = OpenCvRatio},
};

}  // namespace

std::span<const Row> ChanRatioChangeRows() { return kRows; }

}  // namespace orvik::bench
