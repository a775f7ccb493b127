#pragma once

#include <cstddef>
#include <type_traits>
#include <vector>

#include "basic/tessel/clipto.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::kernels {

/// Ratios of `count` samples, or their absolute values. `ratio` may be one of the sources.
/// Deliberate: a zero in the reference is not tested.
void RatioRow(const float* image, const float* reference, bool absolute, std::size_t count, float* ratio);

/// The ratios of blocks of two dates, sample by sample.
template <class In, class Ref, class Out>
class ChannelRatios {
 public:
  /// @param params  with `noData`, `imgNoData` and `refNoData`
  template <class Params>
  ChannelRatios(const Params& params, bool absolute, std::size_t channels, std::size_t pixels)
      : absolute_(absolute),
        channels_(channels),
        excluded_(tessel::ClipTo<Out>(params.noData)),
        choice_(params, channels, pixels),
        scratch_(3 * channels * pixels) {}

  template <class Block>
  void operator()(const Block& block) {
    const std::size_t count = block.pixels * channels_;
    const unsigned char* const keep = choice_.Of(block);
    float* const scratch = scratch_.data();
    const float* const image = FloatRow(block.image, 1, count, scratch);
    const float* const reference = FloatRow(block.reference, 1, count, scratch + count);
    if constexpr (std::is_same_v<Out, float>) {
      RatioRow(image, reference, absolute_, count, block.target);
    } else {
      RatioRow(image, reference, absolute_, count, scratch + 2 * count);
      StoreClipped(scratch + 2 * count, count, block.target);
    }
    if (keep != nullptr) ReplaceMasked(keep, excluded_, count, block.target);
  }

 private:
  bool absolute_;
  std::size_t channels_;
  Out excluded_;
  SampleChoice<In, Ref> choice_;
  std::vector<float> scratch_;
};

}  // namespace orvik::kernels
