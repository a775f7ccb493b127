#include "tests/reference/rasterstatistics_reference.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

/// True if the truncated value is the number of one of the bins.
template <class T>
bool HasBin(T value, std::size_t bins) {
  if constexpr (std::is_floating_point_v<T>) {
    const double truncated = std::trunc(static_cast<double>(value));
    return truncated >= 0 && truncated < static_cast<double>(bins);
  } else {
    return value >= 0 && static_cast<std::uint64_t>(value) < bins;
  }
}

}  // namespace

RasterStatistics::RasterStatistics(const gridmill::details::StatisticsParams& params,
                                   tessel::IMaskDecision* decision)
    : method_(params.method), decision_(decision) {
  const std::size_t bins = params.histogramType == 8 ? 256 : 65536;
  minima_.assign(params.channels.size(), 100000.0f);
  maxima_.assign(params.channels.size(), -100000.0f);
  histograms_.assign(params.channels.size(), std::vector<int>(bins, 0));
}

void RasterStatistics::Process(const tessel::Raster& in) {
  if (!type_) type_ = in.dataType;
  tests::WithPixelType(*type_, [&]<class T>() {
    for (std::uint32_t y = 0; y < in.height; ++y) {
      for (std::uint32_t x = 0; x < in.width; ++x) {
        if (decision_ != nullptr && !decision_->IsPixelValid(PixelAddress(in, x, y))) continue;
        CountPixel<T>(in, x, y);
      }
    }
  });
}

template <class T>
void RasterStatistics::CountPixel(const tessel::Raster& in, unsigned x, unsigned y) {
  for (std::uint32_t c = 0; c < in.channels; ++c) {
    if (c >= histograms_.size()) continue;
    if (method_ == 1 && c == 2) {
      const double s0 = static_cast<double>(Read<T>(in, x, y, 0));
      const double s1 = static_cast<double>(Read<T>(in, x, y, 1));
      const double s2 = static_cast<double>(Read<T>(in, x, y, 2));
      CountBlue(s0, s1, s2);
    } else {
      CountSample(c, Read<T>(in, x, y, c));
    }
  }
}

template <class T>
void RasterStatistics::CountSample(unsigned channel, T sample) {
  std::vector<int>& histogram = histograms_[channel];
  if (HasBin(sample, histogram.size())) ++histogram[static_cast<std::size_t>(sample)];
  const float s = static_cast<float>(sample);
  if (s < minima_[channel]) minima_[channel] = s;
  if (s > maxima_[channel]) maxima_[channel] = s;
}

void RasterStatistics::CountBlue(double s0, double s1, double s2) {
  const double b = s0 * 0.873393 + 13.9054 - s1 * 0.138254 - s2 * 0.100616;
  int blue = TruncateToInt32(b);
  if (blue < 0) blue = 0;
  if (blue > 255) blue = 255;
  ++histograms_[2][static_cast<std::size_t>(blue)];
  if (blue < TruncateToInt32(static_cast<double>(minima_[2]))) minima_[2] = static_cast<float>(blue);
  if (blue > TruncateToInt32(static_cast<double>(maxima_[2]))) maxima_[2] = static_cast<float>(blue);
}

}  // namespace orvik::reference
