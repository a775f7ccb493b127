#include "processes/gridmill/percentile.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <type_traits>
#include <utility>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/channelpattern.h"
#include "processes/gridmill/kernels/integermean.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/percentilespline.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/tablelookup.h"

namespace orvik::filters {

namespace {

using kernels::kBlock;

// ---- row

/// The splines of some channels, laid out for dense pixels.
struct Splines {
  std::size_t channels;
  std::size_t pixels;      ///< of a block
  std::vector<float> low;  ///< for each sample of a block, as the next three
  std::vector<float> high;
  std::vector<float> scale;  ///< bins per unit
  std::vector<int> firstKnot;
  std::vector<kernels::Knot> knots;

  /// @param first  channel
  Splines(const details::PercentileParams& of, std::size_t first, std::size_t channelCount)
      : channels(channelCount), pixels(frame::DensePixels(channelCount, 2 * kBlock)) {
    for (std::size_t c = first; c < first + channels; ++c) {
      low.push_back(of.MinData[c]);
      high.push_back(of.MaxData[c]);
      scale.push_back(static_cast<float>(of.binScale[c]));
      firstKnot.push_back(static_cast<int>(knots.size()));
      kernels::AppendKnots(
          {of.cumulative[c].data(), of.linear[c].data(), of.quadratic[c].data(), of.cubic[c].data()},
          of.BinNum, of.binScale[c], of.MinData[c], knots);
    }
    low = kernels::ChannelPattern(low, channels, pixels);
    high = kernels::ChannelPattern(high, channels, pixels);
    scale = kernels::ChannelPattern(scale, channels, pixels);
    firstKnot = kernels::ChannelPattern(firstKnot, channels, pixels);
  }
};

/// What a sample is before its spline is evaluated.
struct Binned {
  int knot[kBlock];        ///< one of its channel's also for samples outside
  int inside[kBlock];      ///< 0: the percentile is a constant
  float constant[kBlock];  ///< 0, 100 or the no-data value
};

/// `offset` is the first sample's place in its block.
GRIDMILL_MULTIVERSION void BinRow(const float* __restrict value, const Splines& splines, std::size_t offset,
                                  int bins, float noData, std::size_t count, Binned& __restrict binned) {
  const float* const low = splines.low.data() + offset;
  const float* const high = splines.high.data() + offset;
  const float* const scale = splines.scale.data() + offset;
  const int* const firstKnot = splines.firstKnot.data() + offset;
  for (std::size_t i = 0; i < count; ++i) {
    const float v = value[i];
    const float position = (v - low[i]) * scale[i];
    // A position that is no 32-bit integer counts as a negative bin.
    const bool held = (position >= 0.0f) & (position < 2147483648.0f);
    const int bin = static_cast<int>(held ? position : 0.0f);
    const bool invalid = kernels::IsNoData(v, noData);
    const bool zero = (low[i] == high[i]) | (low[i] >= v);
    const bool hundred = (v >= high[i]) | (held & (bin >= bins));
    const bool inside = !(invalid | zero | hundred) & held;
    const float limit = (!zero & hundred) ? 100.0f : 0.0f;
    binned.constant[i] = invalid ? noData : limit;
    binned.inside[i] = inside;
    binned.knot[i] = firstKnot[i] + (inside ? bin : 0);
  }
}

/// The percentiles of dense samples as they are written.
template <class In, class Out>
void WritePercentileRow(const In* source, const Splines& splines, int bins, float noData, std::size_t samples,
                        Out* target) {
  for (std::size_t i = 0; i < samples; i += kBlock) {
    const std::size_t count = std::min(kBlock, samples - i);
    float scratch[kBlock], percentile[kBlock];
    Binned binned;
    double spline[kBlock];
    const float* const value = kernels::FloatRow(source + i, 1, count, scratch);
    BinRow(value, splines, i, bins, noData, count, binned);
    kernels::SplineRow(value, binned.knot, splines.knots.data(), count, spline);
    kernels::CastThrough<In>(spline, count, percentile);
    kernels::ReplaceOutside(binned.inside, binned.constant, count, percentile);
    kernels::StoreClipped(percentile, count, target + i);
  }
}

// ---- image

/// Tables of more bytes than this would not stay in the caches.
constexpr std::size_t kMaxTableBytes = std::size_t{1} << 20;

}  // namespace

template <class In, class Out>
class Percentile::InnerProcessor : public IProcessor, public details::PercentileParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask*, tessel::Raster* out) const override {
    const std::size_t channels = in->channels;
    if (splines_ == nullptr || splines_->channels != channels)
      splines_ = std::make_unique<Splines>(*this, 0, channels);
    const bool tabled = HasTables(channels, std::uint64_t{in->width} * in->height * channels);

    const frame::FilterShape shape{splines_->pixels, frame::Walk::kPixels, channels, frame::Walk::kElements};
    frame::FilterRows<In, Out>(*in, nullptr, *out, shape, [&](const auto& block) {
      const std::size_t samples = block.pixels * channels;
      if constexpr (kTabled) {
        if (tabled) return kernels::LookUpRow(block.image, tables_.data(), channels, samples, block.target);
      }
      WritePercentileRow(block.image, *splines_, BinNum, NoData, samples, block.target);
    });
  }

 private:
  static constexpr bool kTabled = std::is_integral_v<In> && sizeof(In) <= 2;

  /// True if there is a table with the result of every sample. It is worth its making once the processor has
  /// met as many samples as it has entries.
  bool HasTables([[maybe_unused]] std::size_t channels, [[maybe_unused]] std::uint64_t samples) const {
    if constexpr (kTabled) {
      constexpr std::size_t entries = kernels::kTableEntries<In>;
      if (channels * entries * sizeof(Out) > kMaxTableBytes) return false;
      if (tables_.size() >= channels * entries) return true;
      met_ += samples;
      if (met_ < channels * entries) return false;
      std::vector<In> every(entries);
      for (std::size_t i = 0; i < entries; ++i) every[i] = static_cast<In>(i);
      // Apart, since tables that are not filled must not stay.
      std::vector<Out> tables(channels * entries);
      for (std::size_t c = 0; c < channels; ++c)
        FillTable(Splines(*this, c, 1), every, tables.data() + c * entries);
      tables_ = std::move(tables);
      return true;
    }
    return false;
  }

  void FillTable(const Splines& splines, const std::vector<In>& every, Out* table) const {
    for (std::size_t i = 0; i < every.size(); i += splines.pixels)
      WritePercentileRow(every.data() + i, splines, BinNum, NoData,
                         std::min(splines.pixels, every.size() - i), table + i);
  }

  mutable std::unique_ptr<Splines> splines_;
  mutable std::vector<Out> tables_;  ///< for each channel the result of every sample, by the sample's bits
  mutable std::uint64_t met_ = 0;    ///< samples
};

// ---- frame policy

namespace {

struct PercentileFrame : frame::Defaults<details::PercentileParams> {
  using Dispatcher = frame::Extended<typedispatch::Factory2Template<Percentile::InnerProcessor, IProcessor>,
                                     typeconv::priv::FullTypeList>;

  /// The processor builds its own splines, from the counts and ranges of this moment.
  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    to.MinData = from.MinData;
    to.MaxData = from.MaxData;
    to.NoData = from.NoData;
    to.BinNum = from.BinNum;
    to.SetCoefficients(from.Coefficients);
  }
};

}  // namespace

// ---- operator

void details::PercentileParams::SetCoefficients(std::vector<int> counts) {
  Coefficients = std::move(counts);
  const std::size_t channels = MaxData.size();
  const auto bins = static_cast<std::size_t>(BinNum);
  for (Table* table : {&cumulative, &alpha, &linear, &quadratic, &cubic, &diagonal, &mu, &z})
    table->resize(channels, std::vector<double>(bins + 2));
  totals.resize(channels);
  binScale.resize(channels);
  for (std::size_t c = 0; c < channels; ++c) {
    const int* const count = Coefficients.data() + bins * c;
    totals[c] = kernels::SumOfCounts(count, bins);
    binScale[c] = static_cast<float>(BinNum) / (MaxData[c] - MinData[c]);
    cumulative[c][bins + 1] = 100.0;
    for (std::size_t i = 1; i <= bins; ++i) {
      const double percent = kernels::Hundredfold(count[i - 1]);
      cumulative[c][i] = totals[c] != 0 ? percent / totals[c] + cumulative[c][i - 1] : 0.0;
    }
    kernels::SolveSpline({cumulative[c].data(), alpha[c].data(), linear[c].data(), quadratic[c].data(),
                          cubic[c].data(), diagonal[c].data(), mu[c].data(), z[c].data()},
                         BinNum, binScale[c]);
  }
}

Percentile::Percentile() = default;
Percentile::Percentile(const Percentile&) = default;
Percentile& Percentile::operator=(const Percentile&) = default;
Percentile::~Percentile() = default;

void Percentile::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<PercentileFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
