#include "processes/gridmill/singlechange.h"

#include <cmath>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::eDIFF_ABSOLUTE;
using changedetection::SingleChange;

void Difference(const Workload& work) {
  SingleChange(eDIFF_ABSOLUTE).Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

void NaiveDifference(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const float* const image = RowOf<float>(*work.in, y);
    const float* const reference = RowOf<float>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) target[x] = std::fabs(reference[x] - image[x]);
  }
}

constexpr Row kRows[] = {
    {.job = "single difference",
     .types = "f32 -> f32",
     .workload = Dates<float, float, float, 1, 1>,
     .gridmill = Difference,
     .naive = NaiveDifference,
     .opencv = OpenCvDifference},
};

}  // namespace

std::span<const Row> SingleChangeRows() { return kRows; }

}  // namespace orvik::bench
