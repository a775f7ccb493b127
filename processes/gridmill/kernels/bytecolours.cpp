#include "processes/gridmill/kernels/bytecolours.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>

#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/syntheticblue.h"

namespace orvik::kernels {

namespace {

/// What is done with the estimate of blue.
struct BlueRule {
  float middle, halfWidth;  ///< of the valid range
  Trim trim;
};

/// How far the estimates of a row stay away from where the exact blue could decide otherwise. Distances are
/// kept as the bits of positive numbers, which have the numbers' order.
struct Distances {
  static constexpr std::int32_t kFar = std::numeric_limits<std::int32_t>::max();
  std::int32_t limit = kFar;  ///< of the valid range
  std::int32_t half = kFar;   ///< between two whole numbers, where rounding turns
};

GRIDMILL_INLINE std::int32_t BitsOf(float distance) {
  return std::bit_cast<std::int32_t>(std::fabs(distance));
}

/// A sum with it is a whole number, the nearest one, whose low bits are the integer's.
constexpr float kWhole = 0x1.8p23f;

/// Blue as bytes, and 1 where it is valid.
template <bool trims>
GRIDMILL_MULTIVERSION Distances EstimateRow(const unsigned char* __restrict s0,
                                            const unsigned char* __restrict s1,
                                            const unsigned char* __restrict s2, BlueRule rule,
                                            std::size_t count, unsigned char* __restrict blue,
                                            unsigned char* __restrict within) {
  Distances least;
  for (std::size_t i = 0; i < count; ++i) {
    const float b = EstimatedBlue(s0[i], s1[i], s2[i]);
    const float outside = std::fabs(b - rule.middle) - rule.halfWidth;
    within[i] = static_cast<unsigned char>(outside <= 0.0f);
    least.limit = std::min(least.limit, BitsOf(outside));
    // Beyond the limits of a byte all is certain.
    const float trimmed = trims ? (b - rule.trim.offset) * rule.trim.factor : b;
    const float above = trimmed > 0.0f ? trimmed : 0.0f;
    const float held = above < 255.0f ? above : 255.0f;
    const float sum = held + kWhole;
    const float fraction = held - (sum - kWhole);
    least.half = std::min(least.half, BitsOf(0.5f - std::fabs(fraction)));
    blue[i] = static_cast<unsigned char>(std::bit_cast<std::int32_t>(sum));
  }
  return least;
}

/// A trimmed byte, rounded and limited to a byte: 0.5 and more is rounded up without an addition that rounds.
GRIDMILL_INLINE unsigned char TrimByte(unsigned char sample, Trim trim) {
  const float t = (static_cast<float>(sample) - trim.offset) * trim.factor;
  const float above = t > 0.0f ? t : 0.0f;
  const float held = above < 255.0f ? above : 255.0f;
  const int whole = static_cast<int>(held);
  return static_cast<unsigned char>(whole + static_cast<int>(held - static_cast<float>(whole) >= 0.5f));
}

GRIDMILL_MULTIVERSION void TrimRow(const unsigned char* __restrict s0, const unsigned char* __restrict s1,
                                   const Trim* trims, std::size_t count, unsigned char* __restrict t0,
                                   unsigned char* __restrict t1) {
  const Trim first = trims[0], second = trims[1];
  for (std::size_t i = 0; i < count; ++i) {
    t0[i] = TrimByte(s0[i], first);
    t1[i] = TrimByte(s1[i], second);
  }
}

/// The bytes of a channel that are valid.
struct ChannelRule {
  unsigned char background;
  unsigned char open;  ///< 1: there is no background
  unsigned char first, span;
};

GRIDMILL_INLINE unsigned char IsValid(unsigned char sample, ChannelRule rule) {
  const auto other = static_cast<unsigned char>((sample != rule.background) | rule.open);
  const auto above = static_cast<unsigned char>(sample - rule.first);
  return static_cast<unsigned char>(other & static_cast<unsigned char>(above <= rule.span));
}

/// Clears the bytes of the pixels that a channel or blue makes background.
GRIDMILL_MULTIVERSION void JudgeRow(const unsigned char* __restrict s0, const unsigned char* __restrict s1,
                                    const unsigned char* __restrict s2, const ChannelRule* rules,
                                    const unsigned char* __restrict within, std::size_t count,
                                    unsigned char* __restrict valid) {
  const ChannelRule first = rules[0], second = rules[1], third = rules[2];
  for (std::size_t i = 0; i < count; ++i)
    valid[i] &= static_cast<unsigned char>(within[i] & IsValid(s0[i], first) & IsValid(s1[i], second) &
                                           IsValid(s2[i], third));
}

/// The pixels that are valid, and the background.
GRIDMILL_MULTIVERSION void SelectRow(const unsigned char* __restrict valid,
                                     const unsigned char* __restrict s0, const unsigned char* __restrict s1,
                                     const unsigned char* others, std::size_t count,
                                     unsigned char* __restrict red, unsigned char* __restrict green,
                                     unsigned char* __restrict blue) {
  const unsigned char otherRed = others[0], otherGreen = others[1], otherBlue = others[2];
  for (std::size_t i = 0; i < count; ++i) {
    red[i] = valid[i] != 0 ? s1[i] : otherRed;
    green[i] = valid[i] != 0 ? s0[i] : otherGreen;
    blue[i] = valid[i] != 0 ? blue[i] : otherBlue;
  }
}

/// The valid range of blue. Limits that blue does not reach, NaN among them, are as good as none.
BlueRule RuleOf(float least, float greatest, Trim trim) {
  constexpr float none = 1024.0f;
  const float low = least > -none ? least : -none;
  const float high = greatest < none ? greatest : none;
  return {low + (high - low) / 2, (high - low) / 2, trim};
}

}  // namespace

bool ByteColours::Make(const unsigned char (*planes)[kBlock], unsigned char* valid, std::size_t count,
                       unsigned char (*bands)[kBlock]) const {
  ChannelRule rules[3];
  for (std::size_t c = 0; c < 3; ++c) {
    const bool open = background[c] < 0 || background[c] > 255;
    rules[c] = {static_cast<unsigned char>(background[c]), open, 0, 255};
    if (c == 2) break;
    if (range[c].empty) return false;
    rules[c].first = range[c].first;
    rules[c].span = range[c].span;
  }
  // Differences, products and sums are off by their own roundings too.
  const Trim blue = trims ? trim[2] : Trim{0.0f, 1.0f};
  const float error = trims
                          ? std::fabs(blue.factor) * (0x1p-14f + std::fabs(blue.offset) * 0x1p-23f) + 0x1p-15f
                          : kEstimateError + 0x1p-17f;
  constexpr float limitError = kEstimateError + 0x1p-12f;
  if (!(error < 0.25f)) return false;

  unsigned char within[kBlock], trimmed[2][kBlock];
  const BlueRule rule = RuleOf(least, greatest, blue);
  const auto estimate = trims ? EstimateRow<true> : EstimateRow<false>;
  const Distances near = estimate(planes[0], planes[1], planes[2], rule, count, bands[2], within);
  if (near.limit <= BitsOf(limitError) || near.half <= BitsOf(error)) return false;
  JudgeRow(planes[0], planes[1], planes[2], rules, within, count, valid);
  if (trims) TrimRow(planes[0], planes[1], trim, count, trimmed[0], trimmed[1]);
  SelectRow(valid, trims ? trimmed[0] : planes[0], trims ? trimmed[1] : planes[1], written, count, bands[0],
            bands[1], bands[2]);
  return true;
}

}  // namespace orvik::kernels
