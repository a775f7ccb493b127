#pragma once

#include <cstdint>

namespace orvik::frame {

/// Below this many samples a parallel region costs more than it saves.
inline constexpr std::uint64_t kParallelSamples = 32768;

/// Calls `row(y)` for y from 0 to `height` - 1 on the caller's thread.
template <class Row>
void SerialRows(std::uint32_t height, const Row& row) {
  for (std::uint32_t y = 0; y < height; ++y) row(y);
}

/// Calls `row(y)` for y from 0 to `height` - 1, with one contiguous block of rows for each thread of the
/// team. The only parallel region of the library: no reduction, no lock, no barrier but its end. `row` must
/// not throw.
///
/// @param rowSamples  the work of a row; images with little of it run on the caller's thread
template <class Row>
void ParallelRows(std::uint32_t height, std::uint64_t rowSamples, const Row& row) {
  [[maybe_unused]] const bool worthwhile = height > 1 && rowSamples * height >= kParallelSamples;
#pragma omp parallel for schedule(static) if (worthwhile)
  for (std::int64_t y = 0; y < std::int64_t{height}; ++y) row(static_cast<std::uint32_t>(y));
}

}  // namespace orvik::frame
