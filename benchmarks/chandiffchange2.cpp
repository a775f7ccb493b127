#include "processes/gridmill/chandiffchange2.h"

#include <cmath>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::ChanDiffChange2;
using changedetection::eDIFF2_ABSOLUTE;

void Difference(const Workload& work) {
  ChanDiffChange2(eDIFF2_ABSOLUTE)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), nullptr, work.out.get());
}

void NaiveDifference(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const short* const image = RowOf<short>(*work.in, y);
    const unsigned short* const reference = RowOf<unsigned short>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = std::fabs(static_cast<float>(image[x]) - static_cast<float>(reference[x]));
  }
}

constexpr Row kRows[] = {
    {.job = "difference",
     .types = "i16, u16 -> f32",
     .workload = Dates<short, unsigned short, float, 1, 1>,
     .gridmill = Difference,
     .naive = NaiveDifference,
     .opencv = OpenCvUnlikeDifference},
};

}  // namespace

std::span<const Row> ChanDiffChange2Rows() { return kRows; }

}  // namespace orvik::bench
