#include "processes/gridmill/tasseledcapchange.h"

#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::eDIFF_FORWARD;
using changedetection::TCGNChange;

void Greenness(const Workload& work) {
  TCGNChange("Landsat-5 TM", "Landsat-5 TM", eDIFF_FORWARD)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

double PixelGreenness(const unsigned short* band) {
  return 0.7243 * band[3] - (0.2435 * band[1] + 0.2848 * band[0] + 0.5436 * band[2]) + 0.084 * band[4] -
         0.18 * band[5];
}

void NaiveGreenness(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const image = RowOf<unsigned short>(*work.in, y);
    const unsigned short* const reference = RowOf<unsigned short>(*work.reference, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      const double a = PixelGreenness(image + 6 * x);
      const double b = PixelGreenness(reference + 6 * x);
      target[3 * x] = static_cast<float>(a);
      target[3 * x + 1] = static_cast<float>(b);
      target[3 * x + 2] = static_cast<float>(a - b);
    }
  }
}

constexpr Row kRows[] = {
    {.job = "greenness",
     .types = "u16 x 6 -> f32 x 3",
     .workload = Dates<unsigned short, unsigned short, float, 6, 3>,
     .gridmill = Greenness,
     .naive = NaiveGreenness},
};

}  // namespace

std::span<const Row> TasseledCapChangeRows() { return kRows; }

}  // namespace orvik::bench
