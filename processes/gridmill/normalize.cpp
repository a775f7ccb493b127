#include "processes/gridmill/normalize.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/channelpattern.h"
#include "processes/gridmill/kernels/integermean.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::filters {

namespace {

/// Samples that go through the stages together.
constexpr std::size_t kSamples = 1024;

// ---- pixel

/// How the distance from the lower bound becomes a percentage.
enum class Scaling {
  kDivide,    ///< times 100, by the range
  kMultiply,  ///< times the gain, 100 / range
};

/// A percentage within the range. `scale` is the range or the gain.
template <Scaling scaling>
GRIDMILL_INLINE float QuotientOf(float value, float low, double scale) {
  const double distance = value - low;
  return static_cast<float>(scaling == Scaling::kDivide ? distance * 100.0 / scale : distance * scale);
}

/// A sample as it is written, from its percentage within the range. This needs no limits: below the upper
/// bound the distance, rounded, is at most the range, rounded.
GRIDMILL_INLINE float PercentOf(float value, float quotient, float low, float high, float noData) {
  const float below = value >= high ? 100.0f : quotient;
  const float percent = low >= value ? 0.0f : below;
  return kernels::IsNoData(value, noData) ? noData : percent;
}

/// True if products with the gain, narrowed to `float`, are the bits of the quotients.
///
/// Product and quotient in `double` differ by less than 2^-51 of the quotient, in relation to it. The
/// dividend has 31 bits and the range 24: a quotient that is not half way between two floats is further than
/// 2^-49 from there, so that both go to the same float. One that is half way has an odd part of 25 bits.
/// Times the odd part of the range it is 25 times that of the distance, which has 24 bits: the range's is
/// below 25. The product is half way too if the error of the gain is below 2^-54.
bool GainServes(float range) {
  if (!std::isfinite(range) || range == 0.0f) return false;
  int exponent = 0;
  auto odd = static_cast<std::uint32_t>(std::ldexp(std::frexp(std::fabs(range), &exponent), 24));
  while (odd % 2 == 0) odd /= 2;
  return odd >= 25 || std::fabs(std::fma(100.0 / odd, odd, -100.0)) < 100 * 0x1p-54;
}

/// Floats below have fewer bits, for which a gain does not serve.
constexpr float kLeastProduct = 2.0f * std::numeric_limits<float>::min();

// ---- row

/// The ranges of the samples of a block.
struct Ranges {
  const float* low;
  const float* high;
  const double* range;
  const double* gain;
};

GRIDMILL_MULTIVERSION void DividedRow(const float* value, const Ranges& ranges, float noData,
                                      std::size_t count, float* __restrict percent) {
  const auto [low, high, range, gain] = ranges;
  for (std::size_t i = 0; i < count; ++i) {
    const float quotient = QuotientOf<Scaling::kDivide>(value[i], low[i], range[i]);
    percent[i] = PercentOf(value[i], quotient, low[i], high[i], noData);
  }
}

/// Returns false if a product is too small to be the quotient.
GRIDMILL_MULTIVERSION bool MultipliedRow(const float* value, const Ranges& ranges, float noData,
                                         std::size_t count, float* __restrict percent) {
  const auto [low, high, range, gain] = ranges;
  int small = 0;
  for (std::size_t i = 0; i < count; ++i) {
    const float quotient = QuotientOf<Scaling::kMultiply>(value[i], low[i], gain[i]);
    small |= static_cast<int>(quotient < kLeastProduct) & static_cast<int>(value[i] > low[i]);
    percent[i] = PercentOf(value[i], quotient, low[i], high[i], noData);
  }
  return small == 0;
}

/// The percentages in a row that is not the samples'.
void PercentRow(const float* value, const Ranges& ranges, float noData, std::size_t count, float* percent) {
  if (ranges.gain == nullptr || !MultipliedRow(value, ranges, noData, count, percent))
    DividedRow(value, ranges, noData, count, percent);
}

/// The percentages as they are written.
template <class In, class Out>
void WritePercentRow(const In* source, const Ranges& ranges, float noData, std::size_t count, Out* target) {
  float scratch[kSamples], percent[kSamples];
  const float* const value = kernels::FloatRow(source, 1, count, scratch);
  if constexpr (std::is_same_v<Out, float> && !std::is_same_v<In, float>) {
    PercentRow(value, ranges, noData, count, target);
  } else {
    PercentRow(value, ranges, noData, count, percent);
    kernels::StoreClipped(percent, count, target);
  }
}

// ---- image

/// The ranges of all channels, laid out for dense pixels.
struct Pattern {
  std::size_t pixels;  ///< of a block
  std::vector<float> low, high;
  std::vector<double> range, gain;
  bool multiplies = true;

  Pattern(const details::NormalizeParams& of, std::size_t channels)
      : pixels(frame::DensePixels(channels, kSamples)) {
    for (std::size_t c = 0; c < channels; ++c) {
      const float difference = of.MaxData[c] - of.MinData[c];
      range.push_back(difference);
      gain.push_back(100.0 / difference);
      multiplies = multiplies && GainServes(difference);
    }
    low = kernels::ChannelPattern(of.MinData, channels, pixels);
    high = kernels::ChannelPattern(of.MaxData, channels, pixels);
    range = kernels::ChannelPattern(range, channels, pixels);
    gain = kernels::ChannelPattern(gain, channels, pixels);
  }

  Ranges From(std::size_t sample) const {
    return {low.data() + sample, high.data() + sample, range.data() + sample,
            multiplies ? gain.data() + sample : nullptr};
  }
};

}  // namespace

template <class In, class Out>
class Normalize::InnerProcessor : public IProcessor, public details::NormalizeParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask*, tessel::Raster* out) const override {
    const std::size_t channels = in->channels;
    const Pattern pattern(*this, channels);
    const frame::FilterShape shape{pattern.pixels, frame::Walk::kPixels, channels, frame::Walk::kElements};
    frame::FilterRows<In, Out>(*in, nullptr, *out, shape, [&](const auto& block) {
      const std::size_t samples = block.pixels * channels;
      for (std::size_t i = 0; i < samples; i += kSamples)
        WritePercentRow(block.image + i, pattern.From(i), NoData, std::min(kSamples, samples - i),
                        block.target + i);
    });
  }
};

// ---- frame policy

namespace {

struct NormalizeFrame : frame::Defaults<details::NormalizeParams> {
  using Dispatcher = frame::Extended<typedispatch::Factory2Template<Normalize::InnerProcessor, IProcessor>,
                                     typeconv::priv::FullTypeList>;
};

}  // namespace

// ---- operator

Normalize::Normalize() = default;
Normalize::Normalize(const Normalize&) = default;
Normalize& Normalize::operator=(const Normalize&) = default;
Normalize::~Normalize() = default;

void Normalize::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<NormalizeFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
