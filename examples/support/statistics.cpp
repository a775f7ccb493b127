#include "statistics.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numeric>

#include "errors.h"
#include "progress.h"

namespace examples {

namespace {

constexpr float exactWholeNumbers = 16777216.0f;  // as far as every whole number is a `float`

// Calls `take(channel, value)` for every finite sample of the valid pixels.
template <class Take>
void ForEachSample(const LoadedTile& tile, Take take) {
  const orvik::tessel::Raster& raster = *tile.raster;
  const auto* sample = reinterpret_cast<const float*>(raster.data);
  for (std::uint32_t y = 0; y < raster.height; ++y) {
    for (std::uint32_t x = 0; x < raster.width; ++x, sample += raster.channels) {
      if (tile.mask && !tile.mask->IsValid(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y)))
        continue;
      for (std::uint32_t c = 0; c < raster.channels; ++c)
        if (std::isfinite(sample[c])) take(c, sample[c]);
    }
  }
}

// One bin for each whole number from the least on, in as many bins as the widest channel needs; 0 bins if
// these are too many.
int WholeNumberBins(const std::vector<ChannelStatistics>& channels, int most) {
  float needed = 0.0f;
  for (const ChannelStatistics& channel : channels) {
    if (std::max(-channel.min, channel.max) + static_cast<float>(most) >= exactWholeNumbers) return 0;
    needed = std::max(needed, channel.max - channel.min + 1.0f);
  }
  return needed <= static_cast<float>(most) ? static_cast<int>(needed) : 0;
}

void LayBins(std::vector<ChannelStatistics>& channels, int most, Bins kind) {
  const int whole = kind == Bins::wholeNumbers ? WholeNumberBins(channels, most) : 0;
  for (ChannelStatistics& channel : channels) {
    channel.low = channel.min;
    channel.high = whole > 0 ? channel.min + static_cast<float>(whole) : channel.max;
    channel.counts.assign(static_cast<std::size_t>(whole > 0 ? whole : most), 0);
  }
}

// The bin is found in single precision, as the operator finds it. The last one includes its upper edge.
void Count(ChannelStatistics& channel, float value) {
  const auto bins = static_cast<float>(channel.counts.size());
  const float bin =
      channel.low < channel.high ? (value - channel.low) * (bins / (channel.high - channel.low)) : 0.0f;
  ++channel.counts[static_cast<std::size_t>(std::clamp(std::floor(bin), 0.0f, bins - 1.0f))];
}

}  // namespace

std::uint64_t ChannelStatistics::Total() const {
  return std::accumulate(counts.begin(), counts.end(), std::uint64_t{0});
}

std::vector<ChannelStatistics> StatisticsOf(const TileReader& reader, const std::vector<Tile>& tiles,
                                            int bins, Bins kind) {
  constexpr float infinity = std::numeric_limits<float>::infinity();
  std::vector<ChannelStatistics> channels(reader.Channels(), {infinity, -infinity, 0.0f, 0.0f, {}});
  Progress progress("statistics", 2 * tiles.size());
  for (const Tile& tile : tiles) {
    ForEachSample(reader.Read(tile), [&](std::size_t c, float value) {
      channels[c].min = std::min(channels[c].min, value);
      channels[c].max = std::max(channels[c].max, value);
    });
    progress.Step();
  }
  for (std::size_t c = 0; c < channels.size(); ++c)
    if (channels[c].min > channels[c].max)
      throw Refusal("INPUT", "band " + std::to_string(reader.Band(c)) + " has no valid pixel",
                    "a raster with data in all bands that are read");
  LayBins(channels, bins, kind);
  for (const Tile& tile : tiles) {
    ForEachSample(reader.Read(tile), [&](std::size_t c, float value) { Count(channels[c], value); });
    progress.Step();
  }
  return channels;
}

}  // namespace examples
