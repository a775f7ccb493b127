#include "processes/gridmill/vegindex.h"

#include <cmath>
#include <vector>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using namespace filters;

void Ndvi(const Workload& work) {
  VegIndex index;
  std::vector<unsigned int> requests(12, 0);
  requests[eINDEX_NDVI] = 1;
  index.SetRequestedIndex(requests);
  index.SetBandIndex({eBAND_BLUE, eBAND_GREEN, eBAND_RED, eBAND_NIR});
  index.Process(work.in.get(), work.mask.get(), work.out.get());
}

void AllIndices(const Workload& work) {
  VegIndex indices;
  indices.SetRequestedIndex(std::vector<unsigned int>(12, 1));
  indices.SetBandIndex(
      {eBAND_BLUE, eBAND_GREEN, eBAND_RED, eBAND_RED_EDGE, eBAND_NIR, eBAND_SWIR1, eBAND_SWIR2});
  indices.Process(work.in.get(), work.mask.get(), work.out.get());
}

double Limited(double value) {
  if (value > 1.0) return 1.0;
  if (value < -1.0) return -1.0;
  return value;
}

double PixelNdvi(double red, double nir) {
  return nir + red == 0.0 ? 0.0 : Limited((nir - red) / (nir + red));
}

double PixelTvi(double red, double nir) {
  return nir + red == 0.0 ? 0.0 : static_cast<float>(std::sqrt(((nir - red) / (nir + red)) + 0.5));
}

double PixelSavi(double red, double nir) {
  const double divisor = (nir + red) + 0.5;
  return divisor == 0.0 ? 0.0 : Limited(((nir - red) / divisor) * 1.5);
}

double PixelMsavi2(double red, double nir) {
  const double sum = nir * 2.0 + 1.0;
  return (((nir + 1.0) * 2.0) - std::sqrt(sum * sum - ((nir - red) * 8.0))) * 0.5;
}

double PixelGemi(double red, double nir) {
  const double divisor = (nir + red) + 0.5;
  const double eta =
      divisor == 0.0 ? 0.0 : ((((nir * nir) - (red * red)) * 2.0) + (nir * 1.5) + (red * 0.5)) / divisor;
  const double rest = 1.0 - red;
  return rest == 0.0 ? 0.0 : ((1.0 - (eta * 0.25)) * eta) - ((red - 0.125) / rest);
}

void NaiveNdvi(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const source = RowOf<unsigned short>(*work.in, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = static_cast<float>(PixelNdvi(source[4 * x + 2], source[4 * x + 3]));
  }
}

void PixelIndices(const unsigned short* bands, float* out) {
  const double b = bands[0], g = bands[1], r = bands[2], e = bands[3], n = bands[4], s1 = bands[5],
               s2 = bands[6];
  out[0] = static_cast<float>(g + r == 0.0 ? 0.0 : (g - r) / (g + r));
  out[1] = static_cast<float>(((g + 255.0) - ((r + b) * 0.5)) * 0.5);
  out[2] = static_cast<float>(n - r);
  out[3] = static_cast<float>(r == 0.0 ? 0.0 : n / r);
  out[4] = static_cast<float>(PixelNdvi(r, n));
  out[5] = static_cast<float>(PixelTvi(r, n));
  out[6] = static_cast<float>(PixelSavi(r, n));
  out[7] = static_cast<float>(PixelMsavi2(r, n));
  out[8] = static_cast<float>(PixelGemi(r, n));
  out[9] = static_cast<float>(b * -0.2848 + g * -0.2435 + r * -0.5436 + n * 0.7243 + s1 * 0.084 + s2 * -1.18);
  out[10] = static_cast<float>(r == 0.0 ? 0.0 : ((e - r) - ((e - g) * 0.2)) * (e / r));
  out[11] = static_cast<float>((((n - g) * 1.2) - ((r - g) * 2.5)) * 1.2);
}

void NaiveIndices(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const source = RowOf<unsigned short>(*work.in, y);
    float* const target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) PixelIndices(source + 7 * x, target + 12 * x);
  }
}

constexpr Row kRows[] = {
    {.job = "NDVI",
     .types = "u16 x 4 -> f32",
     .workload = Scene<unsigned short, float, 4, 1>,
     .gridmill = Ndvi,
     .naive = NaiveNdvi,
     .vectorised = VectorisedNdvi,
     .opencv = OpenCvNdvi,
     .peersWithin = 2e-7},
    {.job = "twelve indices",
     .types = "u16 x 7 -> f32 x 12",
     .workload = Scene<unsigned short, float, 7, 12>,
     .gridmill = AllIndices,
     .naive = NaiveIndices,
     .python = "twelve_indices"},
};

}  // namespace

std::span<const Row> VegIndexRows() { return kRows; }

}  // namespace orvik::bench
