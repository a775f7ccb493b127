#pragma once

#include <cstddef>

#include "processes/gridmill/kernels/rowconversions.h"

/// Pixels of many samples, taken apart into planes and put together again.
namespace orvik::kernels {

/// Channels that are taken apart together.
template <class Sample>
inline constexpr std::size_t kSplitChannels = 16 / sizeof(Sample);

/// Copies `channels` samples of `count` pixels, `stride` elements apart, to planes; at most `kSplitChannels`
/// and `stride` of them.
template <class Sample>
void SplitPixels(const Sample* first, std::size_t stride, std::size_t channels, std::size_t count,
                 Sample (*planes)[kBlock]);

/// Copies the samples of `count` pixels of three bytes to planes, in one pass.
void SplitTriples(const unsigned char* pixels, std::size_t count, unsigned char* first, unsigned char* second,
                  unsigned char* third);

/// Stores `count` pixels of any number of samples, each from a plane of its own.
template <class Sample>
void JoinPixels(const Sample* const* planes, std::size_t samples, std::size_t count, Sample* target);

}  // namespace orvik::kernels
