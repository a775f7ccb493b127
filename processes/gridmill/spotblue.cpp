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

/// Pixels on their way to the bands of the output, at most `kBlock`.
template <class In>
class BluePixels {
 public:
  std::size_t count = 0;
  unsigned char valid[kBlock];  ///< 0: background
  double blue[kBlock];

  /// Samples that are read from a pixel: a triple takes the second one even if there is but one channel.
  static std::size_t SamplesRead(std::size_t channels, bool triple) {
    return std::max<std::size_t>(channels, triple ? 2 : 1);
  }

  BluePixels(const details::BlueParams& params, std::size_t channels, bool triple)
      : params_(params), channels_(channels), planes_(SamplesRead(channels, triple)) {
    for (std::size_t c = 0; c < channels; ++c)
      background_.push_back(tessel::PlainCast<int>(params.backGround[c]));
    for (std::size_t c = 0; c < std::min<std::size_t>(channels, 2); ++c)
      ranges_.emplace_back(params.min[c], params.max[c]);
  }

  /// @param mask  a byte for each pixel, or null if all are valid
  void Load(const In* pixels, std::size_t stride, std::size_t pixelCount, const unsigned char* mask) {
    count = pixelCount;
    for (std::size_t c = 0; c < planes_.size(); ++c)
      kernels::CopyRow(pixels + c, stride, count, planes_[c].data());
    std::fill_n(valid, count, static_cast<unsigned char>(1));
    if (mask != nullptr) std::copy_n(mask, count, valid);
    for (std::size_t c = 0; c < channels_; ++c)
      KeepChannel(Channel(c), background_[c], c < 2 ? &ranges_[c] : nullptr, count, valid);
    Synthesise();
  }

  const In* Channel(std::size_t c) const { return planes_[c].data(); }

  /// A channel trimmed in `float`, or in `double` if its samples are of this type.
  void TrimChannel(std::size_t c, double* trimmed) const {
    const float offset = params_.min[c], factor = params_.scale[c];
    if constexpr (std::is_same_v<In, double>) {
      TrimRow<double>(Channel(c), offset, factor, count, trimmed);
    } else {
      float scratch[kBlock];
      TrimRow<float>(kernels::FloatRow(Channel(c), 1, count, scratch), offset, factor, count, trimmed);
    }
  }

 private:
  /// The blue band, trimmed or limited, after its own range has been judged.
  void Synthesise() {
    std::fill_n(blue, count, 0.0);
    if (channels_ >= 3) {
      kernels::SyntheticBlueRow(Channel(0), Channel(1), Channel(2), count, blue);
      KeepWithin(blue, params_.min[2], params_.max[2], count, valid);
    }
    if (params_.trim) {
      TrimRow<double>(blue, params_.min[2], params_.scale[2], count, blue);
    } else {
      LimitRow(count, blue);
    }
  }

  const details::BlueParams& params_;
  std::size_t channels_;
  std::vector<std::array<In, kBlock>> planes_;
  std::vector<int> background_;  ///< of each channel, in whole numbers
  std::vector<Range> ranges_;
};

/// The bands of the pixels as they are written: three, or blue alone.
template <class In, class Out>
void WriteBands(const BluePixels<In>& pixels, const details::BlueParams& params, bool triple, Out* target) {
  Out bands[3][kBlock];
  Out* const blue = triple ? bands[2] : target;
  for (std::size_t c = 0; c < (triple ? 2 : 0); ++c) {
    // Deliberate: the first two bands change places.
    Out* const band = bands[1 - c];
    double trimmed[kBlock];
    if (params.trim) {
      pixels.TrimChannel(c, trimmed);
      kernels::StoreClipped(trimmed, pixels.count, band);
    } else {
      kernels::StoreCast(pixels.Channel(c), pixels.count, band);
    }
  }
  kernels::StoreClipped(pixels.blue, pixels.count, blue);
  if (!kernels::AllValid(pixels.valid, pixels.count)) {
    // Deliberate: a background pixel keeps the order of the entries.
    for (std::size_t c = 0; c < (triple ? 3 : 1); ++c)
      kernels::ReplaceMasked(pixels.valid, tessel::PlainCast<Out>(params.backGround[c]), pixels.count,
                             triple ? bands[c] : target);
  }
  if (triple) kernels::StorePixels(bands, pixels.count, target);
}

// ---- image

}  // namespace

template <class In, class Out>
class SPOTBlue::InnerProcessor : public filters::IProcessor, public details::BlueParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (in->height < 1 || in->width < 1) return;
    const bool triple = out->channels == 3;
    BluePixels<In> pixels(*this, in->channels, triple);
    const std::size_t read = BluePixels<In>::SamplesRead(in->channels, triple);
    const std::size_t written = triple ? 3 : 1;
    const frame::FilterShape shape{kBlock, frame::Walk::kPixels, written, frame::Walk::kPixels, read};
    frame::FilterRows<In, Out>(*in, mask, *out, shape, [&](const auto& block) {
      pixels.Load(block.image, block.stride, block.pixels, block.masked ? block.valid : nullptr);
      WriteBands(pixels, *this, triple, block.target);
    });
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
