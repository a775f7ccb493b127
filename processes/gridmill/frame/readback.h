#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

#include "processes/gridmill/frame/processorcache.h"

/// What operators read from their processors after a call.
namespace orvik::frame {

/// The parameters and results of the cached processor; null before the first `Process`.
template <class Params, class Interface, std::size_t N>
const Params* Built(const ProcessorCache<Interface, N>& cache) {
  return dynamic_cast<const Params*>(cache.processor);
}

/// Appends the first `count` of the values, or as many as there are.
inline void AppendFirst(const std::vector<float>& values, int count, std::vector<float>& target) {
  const auto held = static_cast<std::ptrdiff_t>(values.size());
  target.insert(target.end(), values.begin(), values.begin() + std::clamp<std::ptrdiff_t>(count, 0, held));
}

}  // namespace orvik::frame
