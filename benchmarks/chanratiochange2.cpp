#include "processes/gridmill/chanratiochange2.h"

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::ChanRatioChange2;
using changedetection::eDIFF_FORWARD;

void Ratio(const Workload& work) {
  ChanRatioChange2(eDIFF_FORWARD)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

void NaiveRatio(const Workload& work) {
  const std::size_t samples = std::size_t{work.in->width} * work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const image = RowOf<unsigned short>(*work.in, y);
    const unsigned short* const reference = RowOf<unsigned short>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t i = 0; i < samples; ++i)
      target[i] = static_cast<float>(image[i]) / static_cast<float>(reference[i]);
  }
}

constexpr Row kRows[] = {
    {.job = "ratio",
     .types = "u16 x 4 -> f32 x 4",
     .workload = Dates<unsigned short, unsigned short, float, 4, 4>,
     .gridmill = Ratio,
     .naive = NaiveRatio,
     .opencv = OpenCvRatio},
};

}  // namespace

std::span<const Row> ChanRatioChange2Rows() { return kRows; }

}  // namespace orvik::bench
