#include "processes/gridmill/filterasp.h"

#include <cmath>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

void Aspect(const Workload& work) {
  filters::FilterAsp aspect;
  aspect.SetXSIZE(kSpacing);
  aspect.SetYSIZE(kSpacing);
  aspect.Process(work.in.get(), work.mask.get(), work.out.get());
}

float CellAspect(float z00, float z10, float z01, float z11) {
  const float top = z10 - z00;
  const float left = z01 - z00;
  const float bottom = z01 - z11;
  const float right = z10 - z11;
  const float nx = ((bottom - top) * kSpacing) * 0.5f;
  const float ny = ((right - left) * kSpacing) * 0.5f;
  if (nx == 0.0f && ny == 0.0f) return 510.0f;
  const float aspect = (std::atan2(ny, nx) + 1.5707964f) * 57.29578f;
  return aspect < 0.0f ? aspect + 360.0f : aspect;
}

void NaiveAspect(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const float* const upper = RowOf<float>(*work.in, y);
    const float* const lower = RowOf<float>(*work.in, y + 1);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = CellAspect(upper[x], upper[x + 1], lower[x], lower[x + 1]);
  }
}

constexpr Row kRows[] = {
    {.job = "aspect",
     .types = "f32 -> f32",
     .workload = Elevations<float, float, 1>,
     .gridmill = Aspect,
     .naive = NaiveAspect,
     .opencv = OpenCvAspect,
     .gdal = GdalAspect,
     .twoThreads = true},
};

}  // namespace

std::span<const Row> FilterAspRows() { return kRows; }

}  // namespace orvik::bench
