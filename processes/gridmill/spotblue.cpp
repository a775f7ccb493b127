#include "processes/gridmill/spotblue.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/syntheticblue.h"
#include "processes/gridmill/kernels/thresholds.h"

namespace orvik::gridmill {

namespace {

using kernels::kBlock;

// ---- row

template <class In>
inline constexpr bool kNarrow = std::is_integral_v<In> && sizeof(In) <= 2;

/// The values from `lower` to `upper`; a limit of NaN is none.
struct Range {
  float lower;
  float upper;

  Range(float least, float most)
      : lower(std::isnan(least) ? -std::numeric_limits<float>::infinity() : least),
        upper(std::isnan(most) ? std::numeric_limits<float>::infinity() : most) {}
};

GRIDMILL_MULTIVERSION void KeepOthers(const int* __restrict samples, int background, std::size_t count,
                                      unsigned char* __restrict valid) {
  for (std::size_t i = 0; i < count; ++i) valid[i] &= static_cast<unsigned char>(samples[i] != background);
}

GRIDMILL_MULTIVERSION void KeepWithin(const int* __restrict samples, Range range, std::size_t count,
                                      unsigned char* __restrict valid) {
  for (std::size_t i = 0; i < count; ++i) {
    const auto value = static_cast<float>(samples[i]);
    valid[i] &= static_cast<unsigned char>((value >= range.lower) & (value <= range.upper));
  }
}

/// NaN is within every range.
GRIDMILL_MULTIVERSION void KeepWithin(const double* __restrict values, double lower, double upper,
                                      std::size_t count, unsigned char* __restrict valid) {
  for (std::size_t i = 0; i < count; ++i)
    valid[i] &= static_cast<unsigned char>(!(lower > values[i]) & !(values[i] > upper));
}

GRIDMILL_MULTIVERSION void LimitRow(std::size_t count, double* values) {
  for (std::size_t i = 0; i < count; ++i) {
    const double below = values[i] > 255.0 ? 255.0 : values[i];
    values[i] = values[i] < 0.0 ? 0.0 : below;
  }
}

/// (v - offset) * factor in the precision of the values, as `double`.
template <class Value>
GRIDMILL_MULTIVERSION void TrimRow(const Value* values, Value offset, Value factor, std::size_t count,
                                   double* trimmed) {
  GRIDMILL_INDEPENDENT
  for (std::size_t i = 0; i < count; ++i) trimmed[i] = (values[i] - offset) * factor;
}

/// Clears the bytes of the samples of a channel that are its background or leave its range, as whole numbers.
template <class In>
void KeepChannel(const In* samples, int background, const Range* range, std::size_t count,
                 unsigned char* valid) {
  if constexpr (kNarrow<In>) {
    unsigned char kept[kBlock];
    if (background >= std::numeric_limits<In>::min() && background <= std::numeric_limits<In>::max()) {
      kernels::IntegerRange<In> others(static_cast<float>(background), static_cast<float>(background), false);
      others.inside = false;
      kernels::SelectRow(samples, others, count, kept);
      kernels::KeepValid(kept, count, valid);
    }
    if (range == nullptr) return;
    kernels::SelectRow(samples, kernels::IntegerRange<In>(range->lower, range->upper, false), count, kept);
    kernels::KeepValid(kept, count, valid);
  } else {
    int whole[kBlock];
    kernels::StoreCast(samples, count, whole);
    KeepOthers(whole, background, count, valid);
    if (range != nullptr) KeepWithin(whole, *range, count, valid);
  }
}

/// The samples of a channel, trimmed in `float`, or in `double` if they are of this type, as they are
/// written.
template <class In, class Out>
void TrimChannel(const In* samples, float offset, float factor, std::size_t count, Out* target) {
  double trimmed[kBlock];
  if constexpr (std::is_same_v<In, double>) {
    TrimRow<double>(samples, offset, factor, count, trimmed);
  } else {
    float scratch[kBlock];
    TrimRow<float>(kernels::FloatRow(samples, 1, count, scratch), offset, factor, count, trimmed);
  }
  kernels::StoreClipped(trimmed, count, target);
}

/// What the pixels of an image have in common.
template <class In, class Out>
class BlueRow {
 public:
  /// Samples that are read from a pixel: a triple takes the second one even if there is but one channel.
  static std::size_t SamplesRead(std::size_t channels, bool triple) {
    return std::max<std::size_t>(channels, triple ? 2 : 1);
  }

  BlueRow(const details::BlueParams& params, std::size_t channels, bool triple)
      : params_(params), channels_(channels), triple_(triple), planes_(SamplesRead(channels, triple)) {
    for (std::size_t c = 0; c < channels; ++c) whole_.push_back(tessel::PlainCast<int>(params.backGround[c]));
    for (std::size_t c = 0; c < std::min<std::size_t>(channels, 2); ++c)
      ranges_.emplace_back(params.min[c], params.max[c]);
    for (std::size_t c = 0; c < (triple ? 3 : 1); ++c)
      written_.push_back(tessel::PlainCast<Out>(params.backGround[c]));
  }

  void Write(const frame::FilterBlock<In, Out>& block) {
    const std::size_t count = block.pixels;
    for (std::size_t c = 0; c < planes_.size(); ++c)
      kernels::CopyRow(block.image + c, block.stride, count, planes_[c].data());
    unsigned char valid[kBlock];
    if (block.masked) std::copy_n(block.valid, count, valid);
    if (!block.masked) std::fill_n(valid, count, static_cast<unsigned char>(1));
    double blue[kBlock] = {};
    Judge(count, blue, valid);
    if (triple_) {
      Out bands[3][kBlock];
      WriteColours(count, bands);
      WriteBlue(blue, count, bands[2]);
      for (std::size_t c = 0; c < 3; ++c) WriteBackground(valid, c, count, bands[c]);
      kernels::StorePixels(bands, count, block.target);
    } else {
      WriteBlue(blue, count, block.target);
      WriteBackground(valid, 0, count, block.target);
    }
  }

 private:
  /// Makes the blue band and clears the bytes of the pixels that are background.
  void Judge(std::size_t count, double* blue, unsigned char* valid) const {
    for (std::size_t c = 0; c < channels_; ++c)
      KeepChannel(planes_[c].data(), whole_[c], c < 2 ? &ranges_[c] : nullptr, count, valid);
    if (channels_ < 3) return;
    double samples[3][kBlock];
    for (std::size_t c = 0; c < 3; ++c) kernels::LoadRow(planes_[c].data(), 1, count, samples[c]);
    kernels::SyntheticBlueRow(samples[0], samples[1], samples[2], count, blue);
    KeepWithin(blue, params_.min[2], params_.max[2], count, valid);
  }

  /// Deliberate: the first two bands change places.
  void WriteColours(std::size_t count, Out (*bands)[kBlock]) const {
    for (std::size_t c = 0; c < 2; ++c) {
      if (params_.trim) {
        TrimChannel(planes_[c].data(), params_.min[c], params_.scale[c], count, bands[1 - c]);
      } else {
        kernels::StoreCast(planes_[c].data(), count, bands[1 - c]);
      }
    }
  }

  void WriteBlue(double* blue, std::size_t count, Out* target) const {
    if (params_.trim) {
      TrimRow<double>(blue, params_.min[2], params_.scale[2], count, blue);
    } else {
      LimitRow(count, blue);
    }
    kernels::StoreClipped(blue, count, target);
  }

  /// Deliberate: a background pixel keeps the order of the entries.
  void WriteBackground(const unsigned char* valid, std::size_t c, std::size_t count, Out* target) const {
    if (!kernels::AllValid(valid, count)) kernels::ReplaceMasked(valid, written_[c], count, target);
  }

  const details::BlueParams& params_;
  std::size_t channels_;
  bool triple_;
  std::vector<std::array<In, kBlock>> planes_;
  std::vector<int> whole_;  ///< background of each channel in whole numbers
  std::vector<Range> ranges_;
  std::vector<Out> written_;  ///< background of each band as it is written
};

// ---- image

}  // namespace

template <class In, class Out>
class SPOTBlue::InnerProcessor : public filters::IProcessor, public details::BlueParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (in->height < 1 || in->width < 1) return;
    const bool triple = out->channels == 3;
    BlueRow<In, Out> row(*this, in->channels, triple);
    const std::size_t read = BlueRow<In, Out>::SamplesRead(in->channels, triple);
    const std::size_t written = triple ? 3 : 1;
    const frame::FilterShape shape{kBlock, frame::Walk::kPixels, written, frame::Walk::kPixels, read};
    frame::FilterRows<In, Out>(*in, mask, *out, shape, [&row](const auto& block) { row.Write(block); });
  }
};

struct SPOTBlue::BlueCreationPolicy {
  template <class In, class Out>
  static filters::IProcessor* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

/// Deliberate: the first types stay, whatever comes later.
struct BlueFrame : frame::Defaults<details::BlueParams> {
  static constexpr frame::Compares compares = frame::Compares::kNone;
  using Dispatcher = frame::TwoLevel<SPOTBlue::BlueCreationPolicy>;
};

}  // namespace

// ---- operator

SPOTBlue::SPOTBlue() = default;
SPOTBlue::SPOTBlue(const SPOTBlue&) = default;
SPOTBlue& SPOTBlue::operator=(const SPOTBlue&) = default;
SPOTBlue::~SPOTBlue() = default;

void SPOTBlue::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<BlueFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::gridmill
