#pragma once

#include <cstdint>
#include <vector>

#include "tiles.h"

namespace examples {

/// What is known of a channel: its extremes, and a histogram of equal bins from `low` to `high`.
struct ChannelStatistics {
  float min;
  float max;
  float low;
  float high;
  std::vector<std::uint64_t> counts;

  std::uint64_t Total() const;
};

/// How the bins are laid.
enum class Bins {
  overRange,    ///< from the least to the greatest value of each channel
  wholeNumbers  ///< one for each whole number if so many are enough, else over the range
};

/// The statistics of all channels over the valid pixels, in two passes over the tiles. Infinite samples do
/// not count. All channels get one number of bins, `bins` at most. @param reader  of `Float32` samples
/// @throws Refusal naming INPUT if a channel has no sample to count
std::vector<ChannelStatistics> StatisticsOf(const TileReader& reader, const std::vector<Tile>& tiles,
                                            int bins, Bins kind);

}  // namespace examples
