#include "tests/reference/intenpercent_reference.h"

#include <cmath>
#include <cstdint>

#include "tests/reference/conversions.h"
#include "tests/reference/cumulativespline_reference.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::IntenPercentParams;
using tessel::Mask;
using tessel::Raster;

template <class In>
float PercentileOf(const IntenPercentParams& p, const CumulativeSpline& spline, float value) {
  const double v = value;
  if (p.Min >= v) return 0.0f;
  if (v >= p.Max) return 100.0f;
  const std::int32_t bin = TruncateToInt32(std::floor((v - p.Min) * p.Scale));
  if (bin < 0) return 0.0f;
  if (bin >= static_cast<std::int64_t>(p.Bins.size())) return 100.0f;
  const double dx = v - (bin / p.Scale + p.Min);
  const In inInputType = PlainCast<In>(ValueOf(spline, bin, dx));
  return static_cast<float>(inInputType);
}

template <class In>
bool IsReversed(const IntenPercentParams& p, In first, In second) {
  if (p.Type == 2) return first > second;
  if (p.Type == 1) return second > first;
  return false;
}

template <class In, class Out>
void Pixel(const IntenPercentParams& p, const CumulativeSpline& spline, const Raster& in, bool isValid,
           std::uint32_t x, std::uint32_t y, Raster& out) {
  if (!isValid) {
    const In noData = PlainCast<In>(p.NoData);
    for (std::uint32_t c = 0; c < 4; ++c) Write(out, x, y, c, ClipTo<Out>(noData));
    return;
  }
  for (std::uint32_t c = 0; c < 3; ++c) Write(out, x, y, c, ClipTo<Out>(Read<In>(in, x, y, c)));
  const float value = static_cast<float>(Read<In>(in, x, y, 2));
  if (value == static_cast<float>(p.NoData)) {
    Write(out, x, y, 3, ClipTo<Out>(value));
    return;
  }
  float result = PercentileOf<In>(p, spline, value);
  if (IsReversed(p, Read<In>(in, x, y, 0), Read<In>(in, x, y, 1))) result = result * -1.0f;
  Write(out, x, y, 3, ClipTo<Out>(result));
}

template <class In, class Out>
void Image(const IntenPercentParams& p, const Raster& in, const Mask* mask, Raster& out) {
  const CumulativeSpline spline = SplineThrough(Knots(p.Bins, false), p.Scale);
  for (std::uint32_t y = 0; y < in.height; ++y) {
    for (std::uint32_t x = 0; x < in.width; ++x) {
      Pixel<In, Out>(p, spline, in, IsValid(mask, x, y), x, y, out);
    }
  }
}

}  // namespace

void IntenPercent(const IntenPercentParams& params, const tessel::DataType& writtenAs, const Raster& in,
                  const Mask* mask, Raster& out) {
  tests::WithPixelTypes(in.dataType, writtenAs,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, mask, out); });
}

}  // namespace orvik::reference
