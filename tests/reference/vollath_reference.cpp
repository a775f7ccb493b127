#include "tests/reference/vollath_reference.h"

#include <cstdint>

#include "tests/reference/focussample_reference.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
void VollathEvaluation::SetBackground(double low, double high) {
  low_ = low;
  high_ = high;
}

void VollathEvaluation::SetFailure(double value) { failure_ = value; }

void VollathEvaluation::InitEvaluation(unsigned int channels) { sums_ = Zeros(channels); }

VollathEvaluation::Sums VollathEvaluation::Zeros(unsigned int channels) {
  return {std::vector<double>(channels, 0.0), std::vector<double>(channels, 0.0)};
}

VollathEvaluation::Sums VollathEvaluation::Scan(const tessel::Raster& in, const tessel::Mask* mask) const {
  Sums sums = Zeros(in.channels);
  tests::WithPixelType(in.dataType, [&]<class In>() {
    for (std::uint32_t y = 0; y < in.height; ++y) {
      std::uint32_t k = 0;
      for (std::uint32_t x = 0; std::uint64_t{x} + 2 < in.width; ++x) {
        if (!IsValid(mask, x, y) || !IsValid(mask, x + 1, y)) continue;
        for (std::uint32_t c = 0; c < in.channels; ++c) {
          const double p0 = static_cast<double>(Read<In>(in, k, y, c));
          const double p1 = static_cast<double>(Read<In>(in, k + 1, y, c));
          const double p2 = static_cast<double>(Read<In>(in, k + 2, y, c));
          if (IsRejected(p0, inner_->low, inner_->high, inner_->failure)) continue;
          if (IsRejected(p1, inner_->low, inner_->high, inner_->failure)) continue;
          if (IsRejected(p2, inner_->low, inner_->high, inner_->failure)) continue;
          sums.left[c] += p1 * p0;
          sums.right[c] += p2 * p0;
        }
        ++k;
      }
    }
  });
  return sums;
}

void VollathEvaluation::Process(const tessel::Raster& in, const tessel::Mask* mask) {
  if (!inner_ || inner_->type != in.dataType)
    inner_ = Inner{in.dataType, low_, high_, failure_, Zeros(in.channels)};
  const Sums sums = Scan(in, mask);
  for (std::uint32_t c = 0; c < in.channels; ++c) {
    inner_->sums.left[c] += sums.left[c];
    inner_->sums.right[c] += sums.right[c];
  }
  sums_ = inner_->sums;
}

}  // namespace orvik::reference
