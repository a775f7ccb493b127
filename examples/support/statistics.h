#pragma once

#include <cstdint>
#include <vector>

#include "processes/gridmill/rasterstatistics.h"
#include "tiles.h"

namespace examples {

/// How often each whole number from 0 on occurs in a channel.
struct Histogram {
  float min;                          ///< of the counted samples
  float max;                          ///< less than `min` if there is none
  std::vector<std::uint64_t> counts;  ///< 256 or 65536

  std::uint64_t Total() const;
  double Mean() const;
};

/// True for `Byte` and `UInt16`, whose samples have a bin each in `RasterStatistics`. Negative samples have
/// none there, nor has anything above 65535.
bool HasBins(const orvik::tessel::DataType& type);

/// The histograms of all channels over the valid pixels, in one pass over the tiles.
/// @param reader  of a type that `HasBins`
/// @param method  with `eSTATISTICS_SYNTHETIC_BLUE` the third histogram is that of a blue made of the first
///                three channels
std::vector<Histogram> HistogramsOf(
    const TileReader& reader, const std::vector<Tile>& tiles,
    orvik::gridmill::StatisticsMethod method = orvik::gridmill::eSTATISTICS_PLAIN);

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

/// The statistics of some bands over the pixels that are valid in all of them. Infinite samples do not count.
/// All channels get one number of bins, `bins` at most.
///
/// Unsigned samples of 8 or 16 bits come from `HistogramsOf`. All others are counted here, in two passes over
/// the tiles in single precision: `RasterStatistics` has no bins for them.
/// @throws Refusal naming the raster if a channel has no sample to count
std::vector<ChannelStatistics> StatisticsOf(const BandSource& source, std::uint32_t side, int bins,
                                            Bins kind);

}  // namespace examples
