#include "processes/gridmill/combchange.h"

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::CombChange;
using changedetection::eDIFF_FORWARD;

void Combination(const Workload& work) {
  CombChange(eDIFF_FORWARD).Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

void NaiveCombination(const Workload& work) {
  const std::size_t first = work.in->channels;
  const std::size_t second = work.reference->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* image = RowOf<unsigned char>(*work.in, y);
    const unsigned char* reference = RowOf<unsigned char>(*work.reference, y);
    unsigned char* target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      for (std::size_t c = 0; c < first; ++c) *target++ = *image++;
      for (std::size_t c = 0; c < second; ++c) *target++ = *reference++;
    }
  }
}

constexpr Row kRows[] = {
    {.job = "combination",
     .types = "u8 x 3, u8 x 3 -> u8 x 6",
     .workload = Dates<unsigned char, unsigned char, unsigned char, 3, 6>,
     .gridmill = Combination,
     .naive = NaiveCombination,
     .opencv = OpenCvCombination},
};

}  // namespace

std::span<const Row> CombChangeRows() { return kRows; }

}  // namespace orvik::bench
