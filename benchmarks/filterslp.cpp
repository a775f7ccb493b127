#include "processes/gridmill/filterslp.h"

#include <cmath>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

void Slope(const Workload& work) {
  filters::FilterSlp(kSpacing, kSpacing).Process(work.in.get(), work.mask.get(), work.out.get());
}

float CellSlope(float z00, float z10, float z01, float z11, float rounding) {
  const float top = z10 - z00;
  const float left = z01 - z00;
  const float bottom = z01 - z11;
  const float right = z10 - z11;
  const float nx = ((bottom - top) * kSpacing) * 0.5f;
  const float ny = ((right - left) * kSpacing) * 0.5f;
  const float nz = kSpacing * kSpacing;
  if (nx == 0.0f && ny == 0.0f) return 0.0f;
  const float norm = std::sqrt((ny * ny + nx * nx) + nz * nz);
  const float cosine = nz / norm;
  if (cosine > 1.0f) return 0.0f;
  return std::acos(cosine) * 57.29578f + rounding;
}

void NaiveSlope(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const float* const upper = RowOf<float>(*work.in, y);
    const float* const lower = RowOf<float>(*work.in, y + 1);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = CellSlope(upper[x], upper[x + 1], lower[x], lower[x + 1], 0.0f);
  }
}

void NaiveByteSlope(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const short* const upper = RowOf<short>(*work.in, y);
    const short* const lower = RowOf<short>(*work.in, y + 1);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      const float slope = CellSlope(upper[x], upper[x + 1], lower[x], lower[x + 1], 0.5f);
      const double rounded = static_cast<float>(static_cast<int>(slope)) + 0.5;
      target[x] = rounded >= 255.0 ? 255 : rounded <= 0.0 ? 0 : static_cast<unsigned char>(rounded);
    }
  }
}

void NaiveMaskedSlope(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const float* const upper = RowOf<float>(*work.in, y);
    const float* const lower = RowOf<float>(*work.in, y + 1);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      const bool valid = IsValid(*work.mask, x, y);
      for (std::size_t c = 0; c < channels; ++c) {
        const std::size_t i = x * channels + c;
        if (!valid) {
          target[i] = 0.0f;
          continue;
        }
        const float z00 = upper[i];
        const float z10 = IsValid(*work.mask, x + 1, y) ? upper[i + channels] : z00;
        const float z01 = IsValid(*work.mask, x, y + 1) ? lower[i] : z00;
        const float z11 = IsValid(*work.mask, x + 1, y + 1) ? lower[i + channels] : z00;
        target[i] = CellSlope(z00, z10, z01, z11, 0.0f);
      }
    }
  }
}

constexpr Row kRows[] = {
    {.job = "slope",
     .types = "f32 -> f32",
     .workload = Elevations<float, float, 1>,
     .gridmill = Slope,
     .naive = NaiveSlope,
     .opencv = OpenCvSlope,
     .gdal = GdalSlope,
     .twoThreads = true},
    {.job = "slope",
     .types = "i16 -> u8",
     .workload = Elevations<short, unsigned char, 1>,
     .gridmill = Slope,
     .naive = NaiveByteSlope},
    {.job = "slope, random mask",
     .types = "f32 x 3 -> f32 x 3",
     .workload = Elevations<float, float, 3, MaskPattern::kRandom>,
     .gridmill = Slope,
     .naive = NaiveMaskedSlope},
    {.job = "slope, mask in runs",
     .types = "f32 x 3 -> f32 x 3",
     .workload = Elevations<float, float, 3, MaskPattern::kRuns>,
     .gridmill = Slope,
     .naive = NaiveMaskedSlope},
};

}  // namespace

std::span<const Row> FilterSlpRows() { return kRows; }

}  // namespace orvik::bench
