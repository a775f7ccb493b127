#include "statistics.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numeric>
#include <optional>

#include "basic/tessel/mask/maskdecision.h"
#include "errors.h"
#include "progress.h"

namespace examples {

using orvik::gridmill::RasterStatistics;
using orvik::tessel::Raster;

namespace {

constexpr float exactWholeNumbers = 16777216.0f;  // as far as every whole number is a `float`
constexpr float infinity = std::numeric_limits<float>::infinity();

// Keeps the pixels of a tile that its mask holds for valid. A decision is given a bare pointer, whose
// distance from the first sample says which pixel it is.
class MaskOfTile : public orvik::tessel::IMaskDecision {
 public:
  void Enter(const LoadedTile& tile) { tile_ = &tile; }

  bool IsPixelValid(const void* pixel) override {
    const Raster& raster = *tile_->raster;
    const auto distance = static_cast<std::size_t>(static_cast<const unsigned char*>(pixel) - raster.data);
    const std::size_t index = distance / (raster.channels * (raster.dataType.sizeBits / 8));
    return tile_->mask->IsValid(static_cast<std::int32_t>(index % raster.width),
                                static_cast<std::int32_t>(index / raster.width));
  }

 private:
  const LoadedTile* tile_ = nullptr;
};

void Add(RasterStatistics& statistics, std::vector<Histogram>& channels) {
  std::vector<float> min, max;
  statistics.GetMinValue(min);
  statistics.GetMaxValue(max);
  for (std::size_t c = 0; c < min.size(); ++c) {
    Histogram& channel = channels[c];
    if (min[c] <= max[c]) {  // the initial values, if nothing was counted, are the other way round
      channel.min = std::min(channel.min, min[c]);
      channel.max = std::max(channel.max, max[c]);
    }
    const std::vector<int> counts = statistics.GetPixelCounts(static_cast<int>(c));
    channel.counts.resize(counts.size());
    for (std::size_t bin = 0; bin < counts.size(); ++bin)
      channel.counts[bin] += static_cast<std::uint64_t>(counts[bin]);
  }
}

// An object of the operator for at most 2^31 - 1 pixels, which is as far as its bins count.
class Counter {
 public:
  Counter(const TileReader& reader, orvik::gridmill::StatisticsMethod method)
      : reader_(reader), method_(method), channels_(reader.Channels(), {infinity, -infinity, {}}) {}

  void Count(const Tile& tile) {
    const std::uint64_t pixels = static_cast<std::uint64_t>(tile.width) * tile.height;
    if (statistics_ && counted_ + pixels > INT32_MAX) Collect();
    if (!statistics_) Start();
    const LoadedTile in = reader_.Read(tile);
    decision_.Enter(in);
    statistics_->Process(in.raster.get(), nullptr, nullptr);
    counted_ += pixels;
  }

  std::vector<Histogram> Result() {
    Collect();
    return std::move(channels_);
  }

 private:
  void Start() {
    std::vector<unsigned int> numbers(channels_.size());
    std::iota(numbers.begin(), numbers.end(), 0u);
    statistics_.emplace();
    statistics_->SetChans(numbers);
    statistics_->SetType(static_cast<int>(reader_.Type().sizeBits));
    statistics_->SetMethod(method_);
    if (reader_.Masked()) statistics_->SetMask(&decision_);
    counted_ = 0;
  }

  void Collect() {
    if (statistics_) Add(*statistics_, channels_);
    statistics_.reset();
  }

  const TileReader& reader_;
  orvik::gridmill::StatisticsMethod method_;
  std::vector<Histogram> channels_;
  MaskOfTile decision_;
  std::optional<RasterStatistics> statistics_;
  std::uint64_t counted_ = 0;
};

std::uint64_t Sum(const std::vector<std::uint64_t>& counts) {
  return std::accumulate(counts.begin(), counts.end(), std::uint64_t{0});
}

// Calls `take(channel, value)` for every finite sample of the valid pixels.
template <class Take>
void ForEachSample(const LoadedTile& tile, Take take) {
  const Raster& raster = *tile.raster;
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

// The bin is found in single precision, as the operators find it. The last one includes its upper edge.
void Count(ChannelStatistics& channel, float value, std::uint64_t times) {
  const auto bins = static_cast<float>(channel.counts.size());
  const float bin =
      channel.low < channel.high ? (value - channel.low) * (bins / (channel.high - channel.low)) : 0.0f;
  channel.counts[static_cast<std::size_t>(std::clamp(std::floor(bin), 0.0f, bins - 1.0f))] += times;
}

void RefuseEmpty(const BandSource& source, const std::vector<ChannelStatistics>& channels) {
  for (std::size_t c = 0; c < channels.size(); ++c)
    if (channels[c].min > channels[c].max)
      throw Refusal(source.argument, "band " + std::to_string(source.bands[c]) + " has no valid pixel",
                    "a raster with data in all bands that are read");
}

std::vector<ChannelStatistics> CountedByOperator(const BandSource& source, const TileReader& reader,
                                                 const std::vector<Tile>& tiles, int bins, Bins kind) {
  const std::vector<Histogram> histograms = HistogramsOf(reader, tiles);
  std::vector<ChannelStatistics> channels;
  for (const Histogram& histogram : histograms)
    channels.push_back({histogram.min, histogram.max, 0.0f, 0.0f, {}});
  RefuseEmpty(source, channels);
  LayBins(channels, bins, kind);
  for (std::size_t c = 0; c < channels.size(); ++c)
    for (std::size_t value = 0; value < histograms[c].counts.size(); ++value)
      if (const std::uint64_t times = histograms[c].counts[value])
        Count(channels[c], static_cast<float>(value), times);
  return channels;
}

std::vector<ChannelStatistics> CountedHere(const BandSource& source, const TileReader& reader,
                                           const std::vector<Tile>& tiles, int bins, Bins kind) {
  std::vector<ChannelStatistics> channels(reader.Channels(), {infinity, -infinity, 0.0f, 0.0f, {}});
  Progress progress("statistics", 2 * tiles.size());
  for (const Tile& tile : tiles) {
    ForEachSample(reader.Read(tile), [&](std::size_t c, float value) {
      channels[c].min = std::min(channels[c].min, value);
      channels[c].max = std::max(channels[c].max, value);
    });
    progress.Step();
  }
  RefuseEmpty(source, channels);
  LayBins(channels, bins, kind);
  for (const Tile& tile : tiles) {
    ForEachSample(reader.Read(tile), [&](std::size_t c, float value) { Count(channels[c], value, 1); });
    progress.Step();
  }
  return channels;
}

}  // namespace

std::uint64_t Histogram::Total() const { return Sum(counts); }

double Histogram::Mean() const {
  double sum = 0.0;
  for (std::size_t value = 0; value < counts.size(); ++value)
    sum += static_cast<double>(counts[value]) * static_cast<double>(value);
  return sum / static_cast<double>(Total());
}

std::uint64_t ChannelStatistics::Total() const { return Sum(counts); }

bool HasBins(const orvik::tessel::DataType& type) {
  using orvik::tessel::DataType;
  return type == DataType::Of<unsigned char>() || type == DataType::Of<unsigned short>();
}

std::vector<Histogram> HistogramsOf(const TileReader& reader, const std::vector<Tile>& tiles,
                                    orvik::gridmill::StatisticsMethod method) {
  Counter counter(reader, method);
  Progress progress("statistics", tiles.size());
  for (const Tile& tile : tiles) {
    counter.Count(tile);
    progress.Step();
  }
  return counter.Result();
}

std::vector<ChannelStatistics> StatisticsOf(const BandSource& source, std::uint32_t side, int bins,
                                            Bins kind) {
  const std::vector<Tile> tiles = CutTiles(static_cast<std::uint32_t>(source.dataset.GetRasterXSize()),
                                           static_cast<std::uint32_t>(source.dataset.GetRasterYSize()), side);
  const GDALDataType type = RealTypeOf(source.dataset, source.bands);
  if (type == GDT_Byte || type == GDT_UInt16) {
    const TileReader own({source.dataset, source.bands, source.argument}, 0, side);
    if (HasBins(own.Type())) return CountedByOperator(source, own, tiles, bins, kind);
  }
  const TileReader single({source.dataset, source.bands, source.argument, GDT_Float32}, 0, side);
  return CountedHere(source, single, tiles, bins, kind);
}

}  // namespace examples
