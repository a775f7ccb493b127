#include "tests/reference/vegindex_reference.h"

#include <cmath>
#include <cstdint>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::VegIndexParams;

constexpr unsigned int kBands = 7;
constexpr unsigned int kIndices = 12;
constexpr double kNoData = -1e20;

double Limited(double v) {
  if (v > 1.0) return 1.0;
  if (v < -1.0) return -1.0;
  return v;
}

double Ngrdi(double G, double R) {
  const double sum = G + R;
  return sum == 0.0 ? 0.0 : (G - R) / sum;
}

double Ndvi(double R, double N) {
  const double sum = N + R;
  return sum == 0.0 ? 0.0 : Limited((N - R) / sum);
}

double Tvi(double R, double N) {
  const double sum = N + R;
  if (sum == 0.0) return 0.0;
  const double root = std::sqrt(((N - R) / sum) + 0.5);
  return static_cast<double>(static_cast<float>(root));
}

double Savi(double R, double N) {
  const double D = (N + R) + 0.5;
  return D == 0.0 ? 0.0 : Limited(((N - R) / D) * 1.5);
}

double Msavi2(double R, double N) {
  const double base = N * 2.0 + 1.0;
  const double radicand = base * base - ((N - R) * 8.0);
  return (((N + 1.0) * 2.0) - std::sqrt(radicand)) * 0.5;
}

double Gemi(double R, double N) {
  const double D = (N + R) + 0.5;
  double eta = 0.0;
  if (D != 0.0) eta = ((((N * N) - (R * R)) * 2.0) + (N * 1.5) + (R * 0.5)) / D;
  const double Q = 1.0 - R;
  if (Q == 0.0) return 0.0;
  return ((1.0 - (eta * 0.25)) * eta) - ((R - 0.125) / Q);
}

double Greenness(const double* band) {
  double sum = band[0] * -0.2848;
  sum = sum + band[1] * -0.2435;
  sum = sum + band[2] * -0.5436;
  sum = sum + band[4] * 0.7243;
  sum = sum + band[5] * 0.084;
  sum = sum + band[6] * -1.18;
  return sum;
}

double Mcari(double G, double R, double E) { return R == 0.0 ? 0.0 : ((E - R) - ((E - G) * 0.2)) * (E / R); }

double Index(unsigned int code, const double* band) {
  const double B = band[0], G = band[1], R = band[2], E = band[3], N = band[4];
  if (code == 0) return Ngrdi(G, R);
  if (code == 1) return ((G + 255.0) - ((R + B) * 0.5)) * 0.5;
  if (code == 2) return N - R;
  if (code == 3) return R == 0.0 ? 0.0 : N / R;
  if (code == 4) return Ndvi(R, N);
  if (code == 5) return Tvi(R, N);
  if (code == 6) return Savi(R, N);
  if (code == 7) return Msavi2(R, N);
  if (code == 8) return Gemi(R, N);
  if (code == 9) return Greenness(band);
  if (code == 10) return Mcari(G, R, E);
  return (((N - G) * 1.2) - ((R - G) * 2.5)) * 1.2;
}

template <class In, class Out>
void Image(const VegIndexParams& params, const tessel::Raster& in, const tessel::Mask* mask,
           tessel::Raster& out) {
  double band[kBands] = {};
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      double result[kIndices];
      if (!IsValid(mask, x, y)) {
        for (double& r : result) r = kNoData;
      } else {
        for (std::uint32_t c = 0; c < in.channels; ++c) {
          const unsigned int role = params.bandIndex[c];
          if (role < kBands) band[role] = static_cast<double>(static_cast<float>(Read<In>(in, x, y, c)));
        }
        for (unsigned int k = 0; k < kIndices; ++k) result[k] = Index(k, band);
      }
      std::uint32_t written = 0;
      for (unsigned int k = 0; k < kIndices; ++k) {
        if (params.requestedIndex[k] == 1) Write(out, x, y, written++, ClipTo<Out>(result[k]));
      }
    }
  }
}

}  // namespace

void VegIndex(const VegIndexParams& params, const tessel::Raster& in, const tessel::Mask* mask,
              tessel::Raster& out) {
  tests::WithPixelTypes(in.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, mask, out); });
}

}  // namespace orvik::reference
