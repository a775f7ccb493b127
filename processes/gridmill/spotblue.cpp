#include "processes/gridmill/spotblue.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <type_traits>
#include <vector>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/bytecolours.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/pixelplanes.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/syntheticblue.h"
#include "processes/gridmill/kernels/validrange.h"

namespace orvik::gridmill {

namespace {

using kernels::kBlock;

// ---- row

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
      kernels::KeepValidSamples(Channel(c), background_[c], c < 2 ? &ranges_[c] : nullptr, count, valid);
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
      kernels::KeepWithin(blue, params_.min[2], params_.max[2], count, valid);
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
  std::vector<kernels::ValidRange> ranges_;
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

/// The short way of most bytes, from three channels to three bands.
template <class In, class Out>
struct ByteWay {
  ByteWay(const details::BlueParams&, std::size_t, bool) {}
  bool Write(const frame::FilterBlock<In, Out>&) const { return false; }
};

template <>
class ByteWay<unsigned char, unsigned char> {
 public:
  ByteWay(const details::BlueParams& params, std::size_t channels, bool triple)
      : open_(channels == 3 && triple) {
    if (!open_) return;
    for (std::size_t c = 0; c < 3; ++c) {
      rule_.background[c] = tessel::PlainCast<int>(params.backGround[c]);
      rule_.written[c] = tessel::PlainCast<unsigned char>(params.backGround[c]);
      if (params.trim) rule_.trim[c] = {params.min[c], params.scale[c]};
      if (c == 2) continue;
      rule_.range[c] = kernels::ValidRange(params.min[c], params.max[c]).Of<unsigned char>();
    }
    rule_.least = params.min[2];
    rule_.greatest = params.max[2];
    rule_.trims = params.trim;
  }

  /// Returns false, with nothing written, if the pixels have to go the long way.
  bool Write(const frame::FilterBlock<unsigned char, unsigned char>& block) const {
    if (!open_ || block.stride != 3) return false;
    unsigned char planes[3][kBlock], bands[3][kBlock], valid[kBlock];
    kernels::SplitTriples(block.image, block.pixels, planes[0], planes[1], planes[2]);
    std::fill_n(valid, block.pixels, static_cast<unsigned char>(1));
    if (block.masked) std::copy_n(block.valid, block.pixels, valid);
    if (!rule_.Make(planes, valid, block.pixels, bands)) return false;
    kernels::StorePixels(bands, block.pixels, block.target);
    return true;
  }

 private:
  bool open_;
  kernels::ByteColours rule_{};
};

// ---- image

}  // namespace

template <class In, class Out>
class SPOTBlue::InnerProcessor : public filters::IProcessor, public details::BlueParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (in->height < 1 || in->width < 1) return;
    const bool triple = out->channels == 3;
    BluePixels<In> pixels(*this, in->channels, triple);
    ByteWay<In, Out> bytes(*this, in->channels, triple);
    const std::size_t read = BluePixels<In>::SamplesRead(in->channels, triple);
    const std::size_t written = triple ? 3 : 1;
    const frame::FilterShape shape{kBlock, frame::Walk::kPixels, written, frame::Walk::kPixels, read};
    frame::FilterRows<In, Out>(*in, mask, *out, shape, [&](const auto& block) {
      if (bytes.Write(block)) return;
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
