#include "tests/reference/percentile_reference.h"

#include <cmath>
#include <cstddef>
#include <cstdint>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::PercentileParams;
using tessel::Raster;

bool IsNoData(float value, float noData) {
  const float difference = value - noData;
  return static_cast<double>(difference) > -1e-9 && static_cast<double>(difference) < 1e-9;
}

template <class In>
float PercentileOf(const PercentileParams& p, const CumulativeSpline& spline, double binScale, std::size_t c,
                   float value) {
  if (p.MinData[c] == p.MaxData[c]) return 0.0f;
  if (p.MinData[c] >= value) return 0.0f;
  if (value >= p.MaxData[c]) return 100.0f;
  const float position = (value - p.MinData[c]) * static_cast<float>(binScale);
  const std::int32_t bin = TruncateToInt32(std::floor(position));
  if (bin < 0) return 0.0f;
  if (bin >= p.BinNum) return 100.0f;
  const double dx = static_cast<double>(value) - (bin / binScale + static_cast<double>(p.MinData[c]));
  const In inInputType = PlainCast<In>(ValueOf(spline, bin, dx));
  return static_cast<float>(inInputType);
}

template <class In, class Out>
void Image(const PercentileParams& p, const Raster& in, Raster& out) {
  const std::vector<CumulativeSpline> splines = PercentileSplines(p);
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      for (std::uint32_t c = 0; c < in.channels; ++c) {
        const std::uint64_t element = std::uint64_t{x} * in.channels + c;
        const float value = static_cast<float>(Read<In>(in, x, y, c));
        if (IsNoData(value, p.NoData)) {
          Write(out, 0, y, element, ClipTo<Out>(p.NoData));
        } else {
          const float result = PercentileOf<In>(p, splines[c], BinScale(p, c), c, value);
          Write(out, 0, y, element, ClipTo<Out>(result));
        }
      }
    }
  }
}

}  // namespace

double BinScale(const PercentileParams& params, std::size_t channel) {
  const float range = params.MaxData[channel] - params.MinData[channel];
  const float scale = static_cast<float>(params.BinNum) / range;
  return static_cast<double>(scale);
}

std::vector<CumulativeSpline> PercentileSplines(const PercentileParams& params) {
  std::vector<CumulativeSpline> splines;
  for (std::size_t c = 0; c < params.MaxData.size(); ++c) {
    std::vector<int> counts;
    for (int i = 0; i < params.BinNum; ++i) {
      counts.push_back(
          params.Coefficients[static_cast<std::size_t>(params.BinNum) * c + static_cast<std::size_t>(i)]);
    }
    splines.push_back(SplineThrough(Knots(counts, true), BinScale(params, c)));
  }
  return splines;
}

void Percentile(const PercentileParams& params, const Raster& in, Raster& out) {
  tests::WithPixelTypes(in.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, out); });
}

}  // namespace orvik::reference
