#include "processes/gridmill/rasterstatistics.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/pixelreader.h"
#include "processes/gridmill/frame/readback.h"
#include "processes/gridmill/frame/rows.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/samplecounts.h"
#include "processes/gridmill/kernels/syntheticblue.h"

namespace orvik::gridmill {

namespace {

using kernels::kBlock;

// ---- row

/// Where the samples of a channel are counted.
struct Tally {
  std::vector<int>* bins;
  kernels::Extremes extremes;
  kernels::ByteCounts bytes;

  Tally(std::vector<int>& histogram, float least, float greatest)
      : bins(&histogram), extremes{least, greatest} {}

  template <class In>
  void Count(const In* samples, std::size_t count) {
    kernels::TakeExtremes(samples, count, extremes);
    if constexpr (std::is_same_v<In, unsigned char>) {
      bytes.Count(samples, count);
    } else {
      kernels::CountSamples(samples, count, *bins);
    }
  }
};

/// The blue band of at most `kBlock` pixels as the bins that it counts in.
template <class In>
void BlueBins(const In* pixels, std::size_t stride, std::size_t count, unsigned char* bins) {
  double samples[3][kBlock], blue[kBlock];
  for (std::size_t c = 0; c < 3; ++c) kernels::LoadRow(pixels + c, stride, count, samples[c]);
  kernels::SyntheticBlueRow(samples[0], samples[1], samples[2], count, blue);
  kernels::BlueBinRow(blue, count, bins);
}

/// Counts at most `kBlock` pixels.
template <class In>
void CountRow(const In* pixels, std::size_t stride, std::size_t count, bool synthesises,
              std::vector<Tally>& tallies) {
  for (std::size_t c = 0; c < tallies.size(); ++c) {
    if (synthesises && c == 2) {
      unsigned char bins[kBlock];
      BlueBins(pixels, stride, count, bins);
      tallies[c].Count(bins, count);
    } else if (stride == 1) {
      tallies[c].Count(pixels, count);
    } else {
      In channel[kBlock];
      kernels::CopyRow(pixels + c, stride, count, channel);
      tallies[c].Count(channel, count);
    }
  }
}

// ---- image

/// The pixels of a block that the decision keeps, one after the other.
template <class In>
class KeptPixels {
 public:
  KeptPixels(const tessel::Raster& in, tessel::IMaskDecision* decision)
      : in_(in), decision_(decision), kept_(decision == nullptr ? 0 : kBlock * in.channels) {}

  const In* Data() const { return kept_.data(); }

  /// Returns their number.
  std::size_t Keep(const In* pixels, std::size_t stride, std::uint32_t x, std::uint32_t y,
                   std::size_t count) {
    In* end = kept_.data();
    for (std::size_t i = 0; i < count; ++i) {
      const auto column = x + static_cast<std::uint32_t>(i);
      if (!decision_->IsPixelValid(in_.data + tessel::PixelOffset(in_, column, y))) continue;
      end = std::copy_n(pixels + i * stride, in_.channels, end);
    }
    return in_.channels == 0 ? 0 : static_cast<std::size_t>(end - kept_.data()) / in_.channels;
  }

 private:
  const tessel::Raster& in_;
  tessel::IMaskDecision* decision_;
  std::vector<In> kept_;
};

}  // namespace

template <class In, class Out>
class RasterStatistics::InnerProcessor : public filters::IProcessor, public details::StatisticsParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask*, tessel::Raster*) const override {
    std::vector<Tally> tallies;
    const std::size_t counted = std::min<std::size_t>(in->channels, histograms.size());
    for (std::size_t c = 0; c < counted; ++c) tallies.emplace_back(histograms[c], minValues[c], maxValues[c]);

    CountImage(*in, tallies);

    for (std::size_t c = 0; c < counted; ++c) {
      tallies[c].bytes.AddTo(histograms[c]);
      minValues[c] = tallies[c].extremes.least;
      maxValues[c] = tallies[c].extremes.greatest;
    }
  }

 private:
  void CountImage(const tessel::Raster& in, std::vector<Tally>& tallies) const {
    const bool synthesises = method == eSTATISTICS_SYNTHETIC_BLUE;
    frame::PixelReader reader(in, tessel::DataType::Of<In>(), in.channels, kBlock);
    KeptPixels<In> kept(in, maskDecision);
    frame::SerialRows(in.height, [&](std::uint32_t y) {
      for (std::size_t done = 0; done < in.width; done += kBlock) {
        const auto x = static_cast<std::uint32_t>(done);
        const std::size_t count = std::min<std::size_t>(kBlock, in.width - done);
        const In* const pixels = reinterpret_cast<const In*>(reader.At(x, y, count));
        if (maskDecision == nullptr) {
          CountRow(pixels, reader.Stride(), count, synthesises, tallies);
        } else {
          const std::size_t valid = kept.Keep(pixels, reader.Stride(), x, y, count);
          CountRow(kept.Data(), in.channels, valid, synthesises, tallies);
        }
      }
    });
  }
};

struct RasterStatistics::RasterStatsCreationPolicy {
  template <class In, class Out>
  static filters::IProcessor* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

/// Deliberate: the first input's type stays, whatever comes later.
struct StatisticsFrame : frame::Defaults<details::StatisticsParams> {
  static constexpr frame::Compares compares = frame::Compares::kNone;
  static constexpr frame::Selects selects = frame::Selects::kInputTwice;
  using Dispatcher = frame::TwoLevel<RasterStatistics::RasterStatsCreationPolicy>;

  /// The processor starts with results of its own.
  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    std::vector<unsigned int> listed = from.channels;
    to.SetChans(listed);
    to.SetType(from.histogramType);
    to.SetMask(from.maskDecision);
    to.SetMethod(from.method);
  }
};

}  // namespace

// ---- operator

RasterStatistics::RasterStatistics() = default;
RasterStatistics::RasterStatistics(const RasterStatistics&) = default;
RasterStatistics& RasterStatistics::operator=(const RasterStatistics&) = default;
RasterStatistics::~RasterStatistics() = default;

void RasterStatistics::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<StatisticsFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

void RasterStatistics::GetMinValue(std::vector<float>& values) {
  if (const auto* const built = frame::Built<details::StatisticsParams>(cache_))
    frame::AppendFirst(built->minValues, channelCount, values);
}

void RasterStatistics::GetMaxValue(std::vector<float>& values) {
  if (const auto* const built = frame::Built<details::StatisticsParams>(cache_))
    frame::AppendFirst(built->maxValues, channelCount, values);
}

std::vector<int> RasterStatistics::GetPixelCounts(int channel) {
  const auto* const built = frame::Built<details::StatisticsParams>(cache_);
  return built == nullptr ? std::vector<int>() : built->histograms[static_cast<std::size_t>(channel)];
}

}  // namespace orvik::gridmill
