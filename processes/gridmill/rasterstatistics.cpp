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

/// Pixels that are counted together.
constexpr std::size_t kPixels = 1024;

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
    kernels::CountSamples(samples, count, *bins);
  }
};

/// Counts at most `kPixels` pixels. `planes` is scratch for three channels.
template <class In>
void CountRow(const In* pixels, std::size_t stride, std::size_t count, bool synthesises,
              In (*planes)[kPixels], std::vector<Tally>& tallies) {
  constexpr bool bytes = std::is_same_v<In, unsigned char>;
  for (std::size_t c = 0; c < tallies.size(); ++c) {
    In* const plane = planes[std::min<std::size_t>(c, 2)];
    if (!bytes || (synthesises && tallies.size() > 2 && c < 3))
      kernels::CopyRow(pixels + c, stride, count, plane);
    if (synthesises && c == 2) {
      unsigned char bins[kPixels];
      kernels::BlueBinRow(planes[0], planes[1], planes[2], count, bins);
      tallies[c].bytes.Count(bins, 1, count);
    } else if constexpr (bytes) {
      tallies[c].bytes.Count(pixels + c, stride, count);
    } else {
      tallies[c].Count(plane, count);
    }
  }
}

// ---- image

/// The pixels of a block that the decision keeps, one after the other.
template <class In>
class KeptPixels {
 public:
  KeptPixels(const tessel::Raster& in, tessel::IMaskDecision* decision)
      : in_(in), decision_(decision), kept_(decision == nullptr ? 0 : kPixels * in.channels) {}

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
    tallies.reserve(counted);
    for (std::size_t c = 0; c < counted; ++c) tallies.emplace_back(histograms[c], minValues[c], maxValues[c]);

    CountImage(*in, tallies);

    for (std::size_t c = 0; c < counted; ++c) {
      tallies[c].bytes.AddTo(histograms[c], tallies[c].extremes);
      minValues[c] = tallies[c].extremes.least;
      maxValues[c] = tallies[c].extremes.greatest;
    }
  }

 private:
  void CountImage(const tessel::Raster& in, std::vector<Tally>& tallies) const {
    const bool synthesises = method == eSTATISTICS_SYNTHETIC_BLUE;
    frame::PixelReader reader(in, tessel::DataType::Of<In>(), in.channels, kPixels);
    KeptPixels<In> kept(in, maskDecision);
    In planes[3][kPixels];
    frame::SerialRows(in.height, [&](std::uint32_t y) {
      for (std::size_t done = 0; done < in.width; done += kPixels) {
        const auto x = static_cast<std::uint32_t>(done);
        const std::size_t count = std::min<std::size_t>(kPixels, in.width - done);
        const In* const pixels = reinterpret_cast<const In*>(reader.At(x, y, count));
        kernels::PrefetchAhead(pixels, count * reader.Stride());
        if (maskDecision == nullptr) {
          CountRow(pixels, reader.Stride(), count, synthesises, planes, tallies);
        } else {
          const std::size_t valid = kept.Keep(pixels, reader.Stride(), x, y, count);
          CountRow(kept.Data(), in.channels, valid, synthesises, planes, tallies);
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
