#pragma once

#include <algorithm>
#include <cstddef>
#include <type_traits>

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
        choice_(params, channels, pixels) {}

  template <class Block>
  void operator()(const Block& block) {
    const std::size_t count = block.pixels * channels_;
    const unsigned char* const keep = choice_.Of(block);
    for (std::size_t i = 0; i < count; i += kChunk)
      WriteRatios(block.image + i, block.reference + i, std::min(kChunk, count - i), block.target + i);
    if (keep != nullptr) ReplaceMasked(keep, excluded_, count, block.target);
  }

 private:
  /// Samples whose `float` forms stay in the first-level cache together.
  static constexpr std::size_t kChunk = 1024;

  void WriteRatios(const In* image, const Ref* reference, std::size_t count, Out* target) const {
    float imageScratch[kChunk], referenceScratch[kChunk], q[kChunk];
    const float* const i = FloatRow(image, 1, count, imageScratch);
    const float* const r = FloatRow(reference, 1, count, referenceScratch);
    if constexpr (std::is_same_v<Out, float>) {
      RatioRow(i, r, absolute_, count, target);
    } else {
      RatioRow(i, r, absolute_, count, q);
      StoreClipped(q, count, target);
    }
  }

  bool absolute_;
  std::size_t channels_;
  Out excluded_;
  SampleChoice<In, Ref> choice_;
};

}  // namespace orvik::kernels
