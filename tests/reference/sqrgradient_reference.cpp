#include "tests/reference/sqrgradient_reference.h"

#include <cstddef>
#include <cstdint>
#include <cstdio>

#include "tests/reference/focussample_reference.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

std::string TraceOf(double sum) {
  char line[400];
  const int length = std::snprintf(line, sizeof line, "\n BEFORE - 101 %f\n", sum);
  return {line, static_cast<std::size_t>(length)};
}

}  // namespace

void SqrGradientEvaluation::SetBackground(double low, double high) {
  low_ = low;
  high_ = high;
}

void SqrGradientEvaluation::SetFailure(double value) { failure_ = value; }

void SqrGradientEvaluation::InitEvaluation(unsigned int channels) { evaluation_.assign(channels, 0.0); }

std::vector<double> SqrGradientEvaluation::Scan(const tessel::Raster& in, const tessel::Mask* mask) const {
  std::vector<double> sums(in.channels, 0.0);
  tests::WithPixelType(in.dataType, [&]<class In>() {
    for (std::uint32_t y = 0; y + 1 < in.height; ++y) {
      std::uint32_t k = 0;
      for (std::uint32_t x = 0; x < in.width; ++x) {
        if (!IsValid(mask, x, y) || !IsValid(mask, x, y + 1)) continue;
        for (std::uint32_t c = 0; c < in.channels; ++c) {
          const double p0 = static_cast<double>(Read<In>(in, k, y, c));
          const double p1 = static_cast<double>(Read<In>(in, k, y + 1, c));
          if (IsRejected(p0, inner_->low, inner_->high, inner_->failure)) continue;
          if (IsRejected(p1, inner_->low, inner_->high, inner_->failure)) continue;
          sums[c] += (p1 - p0) * (p1 - p0);
        }
        ++k;
      }
    }
  });
  return sums;
}

std::string SqrGradientEvaluation::Process(const tessel::Raster& in, const tessel::Mask* mask) {
  if (!inner_ || inner_->type != in.dataType) {
    inner_ = Inner{in.dataType, low_, high_, failure_, std::vector<double>(in.channels, 0.0)};
  }
  const std::vector<double> sums = Scan(in, mask);
  std::string trace;
  for (std::uint32_t c = 0; c < in.channels; ++c) {
    trace += TraceOf(sums[c]);
    inner_->evaluation[c] += sums[c];
  }
  for (std::size_t c = 0; c < evaluation_.size(); ++c) evaluation_[c] += inner_->evaluation[c];
  return trace;
}

}  // namespace orvik::reference
