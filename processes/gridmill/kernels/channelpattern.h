#pragma once

#include <cstddef>
#include <vector>

namespace orvik::kernels {

/// One value for each sample of `pixels` dense pixels, from one for each channel.
template <class Value>
std::vector<Value> ChannelPattern(const std::vector<Value>& channel, std::size_t channels,
                                  std::size_t pixels) {
  std::vector<Value> pattern;
  pattern.reserve(channels * pixels);
  for (std::size_t i = 0; i < pixels; ++i)
    pattern.insert(pattern.end(), channel.begin(), channel.begin() + static_cast<std::ptrdiff_t>(channels));
  return pattern;
}

}  // namespace orvik::kernels
