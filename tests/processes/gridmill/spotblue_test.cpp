#include "processes/gridmill/spotblue.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/reference/conversions.h"
#include "tests/reference/spotblue_reference.h"
#include "tests/support/cases.h"
#include "tests/support/compare.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::gridmill {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::SameBits;
using tests::Size;

using Values = std::vector<float>;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr int kIndefinite = std::numeric_limits<int>::min();

/// What the output's samples hold that the operator does not write.
constexpr int kUnwritten = 77;

/// What most tests set: all samples but -1 are valid, no trim.
struct Parameters {
  Values min = {-1e9f, -1e9f, -1e9f};
  Values max = {1e9f, 1e9f, 1e9f};
  Values scale = {};
  Values backGround = {-1, -1, -1};
  bool trim = false;
};

SPOTBlue OperatorOf(Parameters p) {
  SPOTBlue blue;
  blue.SetMin(p.min);
  blue.SetMax(p.max);
  blue.SetScale(p.scale);
  blue.SetBackGround(p.backGround);
  blue.SetTrim(p.trim);
  return blue;
}

/// Parameters of a trim by factors from a least value of 0.
Parameters Trimmed(const Values& scale) {
  return {.min = {0, 0, 0}, .scale = scale, .backGround = {-1, -1, -1}, .trim = true};
}

/// The output pixel for an input pixel.
template <class Out, class In>
std::vector<Out> PixelOf(const SPOTBlue& blue, const std::vector<In>& samples, std::uint32_t outChannels) {
  const auto channels = static_cast<std::uint32_t>(samples.size());
  Image<In> in({1, 1, channels});
  std::copy(samples.begin(), samples.end(), in.Elements());
  Image<Out> out({1, 1, outChannels}, {}, static_cast<Out>(kUnwritten));
  blue.Process(&in, nullptr, &out);
  return {out.Elements(), out.Elements() + outChannels};
}

template <class Out = double, class In = double>
std::vector<Out> TripleOf(const Parameters& p, const std::vector<In>& samples) {
  return PixelOf<Out, In>(OperatorOf(p), samples, 3);
}

template <class Out = double, class In = double>
Out BlueOf(const Parameters& p, const std::vector<In>& samples) {
  return PixelOf<Out, In>(OperatorOf(p), samples, 1)[0];
}

/// True if a pixel becomes background. No other pixel of these tests gives -1.
template <class In = double>
bool IsBackground(Parameters p, const std::vector<In>& samples) {
  const double written = static_cast<double>(p.backGround[0]);
  const double result = BlueOf<double, In>(p, samples);
  return result == written || (std::isnan(result) && std::isnan(written));
}

/// Parameters with other values for the background.
Parameters WithBackGround(const Values& backGround) { return {.backGround = backGround}; }

template <class T>
std::vector<T> ElementsOf(Image<T>& image) {
  return {image.Elements(), image.Elements() + image.dataSize / sizeof(T)};
}

// ---- golden: the blue band

TEST(SPOTBlue, BlueOf000Is13_9054WrittenAs14) {
  EXPECT_EQ((BlueOf<unsigned char, unsigned char>({}, {0, 0, 0})), 14);
  EXPECT_EQ((BlueOf<short, short>({}, {0, 0, 0})), 14);
  EXPECT_EQ((BlueOf<float, unsigned char>({}, {0, 0, 0})), 13.9054f);
  EXPECT_EQ((BlueOf<double, int>({}, {0, 0, 0})), 13.9054);
  EXPECT_EQ((BlueOf<double, float>({}, {0, 0, 0})), 13.9054);
}

TEST(SPOTBlue, BlueIsAWeightedSumOfTheFirstThreeChannels) {
  EXPECT_DOUBLE_EQ(BlueOf({}, {100, 0, 0}), 101.2447);
  EXPECT_DOUBLE_EQ(BlueOf({}, {100, 50, 0}), 94.332);
  EXPECT_DOUBLE_EQ(BlueOf({}, {100, 50, 30}), 91.31352);
  EXPECT_EQ((BlueOf<unsigned char, unsigned char>({}, {100, 50, 30})), 91);
}

TEST(SPOTBlue, BlueKeepsTheFractionOfTheSamplesAlsoWhereTheTestsDoNot) {
  EXPECT_EQ(BlueOf({.max = {7, 7, 1e9f}}, {7.9, 0.0, 0.0}), 7.9 * 0.873393 + 13.9054);
  EXPECT_EQ((BlueOf<double, float>({}, {7.5f, 0.0f, 0.0f})), 7.5 * 0.873393 + 13.9054);
}

TEST(SPOTBlue, BlueIsInDoubleForAllInputs) {
  Parameters p = Trimmed({1, 1, 1});
  p.max = {1e20f, 1e20f, 1e20f};
  EXPECT_EQ((BlueOf<double, std::int64_t>(p, {16777217, 105000000, 1233333})),
            ((16777217.0 * 0.873393 + 13.9054) - 105000000.0 * 0.138254) - 1233333.0 * 0.100616);
}

TEST(SPOTBlue, WithoutTheTrimBlueIsLimitedTo0To255ForAllOutputs) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, []<class Out>() {
      constexpr bool isNarrow = std::is_same_v<Out, char>;
      EXPECT_EQ((BlueOf<Out, short>({}, {300, 0, 0})), static_cast<Out>(isNarrow ? 127 : 255));
      EXPECT_EQ((BlueOf<Out, short>({}, {0, 200, 0})), Out{0});
    });
  }
  const Values none = {kNaN, kNaN, kNaN};
  EXPECT_EQ(BlueOf({.min = none, .max = none}, {1e300, 0.0, 0.0}), 255.0);
  EXPECT_EQ(BlueOf({.min = none, .max = none}, {0.0, 1e300, 0.0}), 0.0);
}

TEST(SPOTBlue, WithTheTrimBlueIsLimitedByClipToAlone) {
  Parameters p = {.min = {0, 0, -100}, .scale = {1, 1, 1}, .trim = true};
  EXPECT_EQ(BlueOf(p, {300.0, 0.0, 0.0}), (300.0 * 0.873393 + 13.9054) + 100.0);
  EXPECT_EQ((BlueOf<unsigned char, double>(p, {300.0, 0.0, 0.0})), 255);
  EXPECT_EQ((BlueOf<short, double>(p, {300.0, 0.0, 0.0})), 376);
  p.scale[2] = -2;
  EXPECT_EQ(BlueOf(p, {300.0, 0.0, 0.0}), ((300.0 * 0.873393 + 13.9054) + 100.0) * -2.0);
  EXPECT_EQ((BlueOf<unsigned char, double>(p, {300.0, 0.0, 0.0})), 0);
  EXPECT_EQ((BlueOf<short, double>(p, {300.0, 0.0, 0.0})), -752);
}

TEST(SPOTBlue, BlueOfNaNIsNoBackgroundAndIsWrittenAsSuch) {
  EXPECT_TRUE(std::isnan(BlueOf<float, float>({}, {1, 1, kNaN})));
  EXPECT_EQ((BlueOf<int, float>({}, {1, 1, kNaN})), kIndefinite);
  EXPECT_EQ((BlueOf<unsigned char, float>({}, {1, 1, kNaN})), 0);
  EXPECT_TRUE(std::isnan(BlueOf<float, float>(Trimmed({1, 1, 1}), {1, 1, kNaN})));
}

TEST(SPOTBlue, OneOrTwoInputChannelsGiveABlueOf0) {
  EXPECT_EQ(BlueOf({}, {5.0}), 0.0);
  EXPECT_EQ(BlueOf({}, {5.0, 6.0}), 0.0);
  EXPECT_EQ(TripleOf({}, {5.0, 6.0}), (std::vector<double>{6, 5, 0}));
  EXPECT_EQ(BlueOf({.min = {0, 0, 4}, .scale = {1, 1, 3}, .trim = true}, {5.0}), -12.0);
  EXPECT_TRUE(IsBackground({}, {-1.0}));
  EXPECT_TRUE(IsBackground({}, {5.0, -1.0}));
  EXPECT_TRUE(IsBackground({.max = {4, 4, 4}}, {5.0}));
  EXPECT_TRUE(IsBackground({.max = {9, 4, 4}}, {5.0, 6.0}));
}

TEST(SPOTBlue, RangeOfBlueIsTestedOnlyIfThereAreThreeChannels) {
  const Parameters p = {.min = {0, 0, 5}, .max = {100, 100, 6}};
  EXPECT_EQ(BlueOf(p, {5.0}), 0.0);
  EXPECT_EQ(BlueOf(p, {5.0, 6.0}), 0.0);
  EXPECT_TRUE(IsBackground(p, {5.0, 6.0, 7.0}));
}

// ---- golden: valid ranges

TEST(SPOTBlue, SampleExactlyAtMinOrMaxIsValid) {
  const Parameters p = {.min = {5, 15, -1e9f}, .max = {7, 17, 1e9f}};
  for (const int s : {5, 6, 7}) EXPECT_FALSE(IsBackground<int>(p, {s, 16, 0})) << s;
  for (const int s : {4, 8}) EXPECT_TRUE(IsBackground<int>(p, {s, 16, 0})) << s;
  for (const int s : {15, 16, 17}) EXPECT_FALSE(IsBackground<int>(p, {6, s, 0})) << s;
  for (const int s : {14, 18}) EXPECT_TRUE(IsBackground<int>(p, {6, s, 0})) << s;
}

TEST(SPOTBlue, RangesOfTheFirstTwoChannelsAreThoseOfTheTruncatedSample) {
  const Parameters p = {.min = {5, -3.5f, -1e9f}, .max = {7, 17.5f, 1e9f}};
  EXPECT_FALSE(IsBackground(p, {7.9, 0.0, 0.0}));
  EXPECT_TRUE(IsBackground(p, {4.9, 0.0, 0.0}));
  EXPECT_FALSE(IsBackground(p, {6.0, 17.9, 0.0}));
  EXPECT_FALSE(IsBackground(p, {6.0, -3.9, 0.0}));
  EXPECT_TRUE(IsBackground(p, {6.0, -4.0, 0.0}));
  EXPECT_TRUE(IsBackground({.min = {5.5f, -9, -1e9f}}, {5.9, 0.0, 0.0}));
}

TEST(SPOTBlue, RangesAreComparedInFloat) {
  const Parameters p = {.max = {16777216, 16777216, 1e20f}};
  EXPECT_FALSE(IsBackground<int>(p, {16777217, 0, 0}));
  EXPECT_FALSE(IsBackground<int>(p, {0, 16777217, 0}));
  EXPECT_TRUE(IsBackground<int>(p, {16777218, 0, 0}));
}

TEST(SPOTBlue, SampleOutOf32BitsIsRangedAsItsCast) {
  const Parameters p = {.min = {0, 0, -1e30f}, .max = {1e30f, 1e30f, 1e30f}};
  EXPECT_TRUE(IsBackground<double>(p, {3e9, 0, 0}));
  EXPECT_TRUE(IsBackground<unsigned int>(p, {3000000000u, 0, 0}));
  EXPECT_FALSE(IsBackground<std::int64_t>(p, {4294967301, 0, 0}));
  EXPECT_TRUE(
      IsBackground<std::int64_t>({.min = {6, 0, -1e30f}, .max = {1e30f, 1e30f, 1e30f}}, {4294967301, 0, 0}));
  EXPECT_FALSE(IsBackground<std::uint64_t>({.max = {5, 0, 1e30f}}, {0xFFFFFFFF00000005u, 0, 0}));
}

TEST(SPOTBlue, BlueExactlyAtMinOrMaxIsValid) {
  const std::vector<double> samples = {2.3982330978150719, 0, 0};
  ASSERT_EQ(BlueOf({}, samples), 16.0);
  EXPECT_FALSE(IsBackground({.min = {0, 0, 16}}, samples));
  EXPECT_FALSE(IsBackground({.max = {9, 9, 16}}, samples));
  EXPECT_TRUE(IsBackground({.min = {0, 0, std::nextafter(16.0f, 17.0f)}}, samples));
  EXPECT_TRUE(IsBackground({.max = {9, 9, std::nextafter(16.0f, 15.0f)}}, samples));
}

TEST(SPOTBlue, BlueIsComparedInDoubleAndNotTruncated) {
  EXPECT_TRUE(IsBackground({.min = {0, 0, 13.9054f}}, {0.0, 0.0, 0.0}));  // as a `float` slightly greater
  EXPECT_FALSE(IsBackground({.max = {9, 9, 13.9054f}}, {0.0, 0.0, 0.0}));
  EXPECT_TRUE(IsBackground({.max = {9, 9, 13.5f}}, {0.0, 0.0, 0.0}));
  EXPECT_FALSE(IsBackground({.min = {0, 0, 13.5f}}, {0.0, 0.0, 0.0}));
}

TEST(SPOTBlue, RangeOfBlueIsTestedBeforeItIsLimited) {
  EXPECT_TRUE(IsBackground({.max = {1e9f, 1e9f, 255}}, {300.0, 0.0, 0.0}));
  EXPECT_TRUE(IsBackground({.min = {-1e9f, -1e9f, 0}}, {0.0, 200.0, 0.0}));
}

TEST(SPOTBlue, NearInfraredHasNoRangeOfItsOwn) {
  EXPECT_FALSE(IsBackground({.min = {0, 0, 10}, .max = {9, 9, 14}}, {0.0, 0.0, 20.0}));
  EXPECT_FALSE(IsBackground({.min = {0, 0, 0}, .max = {9, 9, 20}}, {0.0, 0.0, 90.0}));
}

TEST(SPOTBlue, BoundsOfNaNExcludeNothing) {
  const Values none = {kNaN, kNaN, kNaN};
  for (const double s : {0.0, -1e8, 1e300, -1e300}) {
    EXPECT_FALSE(IsBackground({.min = none, .max = none}, {s, 0.0, 0.0})) << s;
    EXPECT_FALSE(IsBackground({.min = none, .max = none}, {0.0, s, 0.0})) << s;
    EXPECT_FALSE(IsBackground({.min = none, .max = none}, {0.0, 0.0, s})) << s;
  }
  EXPECT_TRUE(IsBackground({.min = none, .max = {5, 5, 5}}, {6.0, 0.0, 0.0}));
}

TEST(SPOTBlue, MinAboveMaxLeavesNoPixelValid) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class In>() {
      for (const int s : {0, 5, 10, 12, 20, 100}) {
        const In t = static_cast<In>(s);
        EXPECT_TRUE(IsBackground<In>({.min = {20, 0, -1e9f}, .max = {10, 127, 1e9f}}, {t, 0, 0})) << s;
        EXPECT_TRUE(IsBackground<In>({.min = {0, 20, -1e9f}, .max = {127, 10, 1e9f}}, {0, t, 0})) << s;
        EXPECT_TRUE(IsBackground<In>({.min = {0, 0, 200}, .max = {127, 127, 1}}, {t, 0, 0})) << s;
      }
    });
  }
}

TEST(SPOTBlue, FurtherChannelsHaveNoRange) {
  const Parameters p = {.min = {0, 0, 0}, .max = {9, 9, 20}, .backGround = {-1, -1, -1, -1}};
  EXPECT_EQ(BlueOf(p, {0.0, 0.0, 0.0, 1e6}), 13.9054);
  EXPECT_EQ(BlueOf(p, {0.0, 0.0, 0.0, -1e6}), 13.9054);
}

// ---- golden: background

TEST(SPOTBlue, ChannelEqualToItsBackgroundMakesThePixelBackgroundEvenIfTheOthersAreValid) {
  const Parameters p = WithBackGround({200, 201, 202});
  EXPECT_TRUE(IsBackground<int>(p, {200, 1, 1}));
  EXPECT_TRUE(IsBackground<int>(p, {1, 201, 1}));
  EXPECT_TRUE(IsBackground<int>(p, {1, 1, 202}));
  EXPECT_FALSE(IsBackground<int>(p, {201, 202, 200}));
}

TEST(SPOTBlue, FourthAndFurtherChannelsHaveABackgroundEach) {
  const Parameters p = WithBackGround({200, 201, 202, 203, 204});
  EXPECT_TRUE(IsBackground<int>(p, {1, 1, 1, 203, 1}));
  EXPECT_TRUE(IsBackground<int>(p, {1, 1, 1, 1, 204}));
  EXPECT_FALSE(IsBackground<int>(p, {1, 1, 1, 204, 203}));
  EXPECT_FALSE(IsBackground<int>(p, {1, 1, 1}));
  EXPECT_EQ((TripleOf<int, int>(p, {1, 1, 1, 203, 1})), (std::vector<int>{200, 201, 202}));
}

TEST(SPOTBlue, MoreBackgroundsThanChannelsAreNoHarm) {
  EXPECT_EQ(BlueOf(WithBackGround({200, 201, 202, 0, 0}), {0.0, 0.0, 0.0}), 13.9054);
}

// Deliberate: the background is a plain cast of the `float`, and is compared in whole numbers of 32 bits: a
// sample of 7.9 is a background of 7.2, and 300 is none of an `unsigned char`.
TEST(SPOTBlue, BackgroundIsComparedInWholeNumbersOf32BitsASampleOf7_9IsABackgroundOf7_2) {
  EXPECT_TRUE(IsBackground<float>(WithBackGround({7.2f, -1, -1}), {7.9f, 0, 0}));
  EXPECT_TRUE(IsBackground<double>(WithBackGround({7.2f, -1, -1}), {7.0, 0, 0}));
  EXPECT_FALSE(IsBackground<double>(WithBackGround({7.2f, -1, -1}), {8.0, 0, 0}));
  EXPECT_TRUE(IsBackground<double>(WithBackGround({-0.9f, -1, -1}), {0.9, 0, 0}));
  EXPECT_TRUE(IsBackground<unsigned char>(WithBackGround({7.9f, -1, -1}), {7, 0, 0}));
  EXPECT_FALSE(IsBackground<unsigned char>(WithBackGround({300, -1, -1}), {44, 0, 0}));
  EXPECT_FALSE(IsBackground<unsigned char>(WithBackGround({-1, -1, -1}), {255, 0, 0}));
  EXPECT_TRUE(IsBackground<char>(WithBackGround({-1, -1, -1}), {-1, 0, 0}));
  EXPECT_FALSE(IsBackground<int>(WithBackGround({16777216, -1, -1}), {16777217, 0, 0}));
}

TEST(SPOTBlue, SampleOf64BitsMatchesOnItsLow32BitsAlone) {
  const Parameters p = {
      .min = {-3e9f, -3e9f, -kInfinity}, .max = {3e9f, 3e9f, kInfinity}, .backGround = {5, -1, -1}};
  EXPECT_TRUE(IsBackground<std::int64_t>(p, {4294967301, 0, 0}));
  EXPECT_TRUE(IsBackground<std::uint64_t>(p, {0xABCDEF0100000005u, 0, 0}));
  EXPECT_TRUE(IsBackground<std::int64_t>(p, {0, 4294967295, 0}));
  EXPECT_FALSE(IsBackground<std::int64_t>(p, {4294967302, 0, 0}));
  EXPECT_TRUE(IsBackground<unsigned int>(p, {0, 4294967295u, 0}));
}

TEST(SPOTBlue, NaNAndValuesOutOf32BitsAreComparedAsTheMostNegativeInteger) {
  for (const float background : {kNaN, kInfinity, -kInfinity, 3e9f, 1e30f, -2147483648.0f}) {
    const Parameters p = {.min = {-3e9f, -3e9f, -kInfinity},
                          .max = {3e9f, 3e9f, kInfinity},
                          .backGround = {background, background, background}};
    for (const float s : {kNaN, kInfinity, -kInfinity, 1e20f, -1e20f, -2147483648.0f}) {
      EXPECT_TRUE(IsBackground<float>(p, {s, 0, 0})) << s << ", " << background;
      EXPECT_TRUE(IsBackground<double>(p, {0, 0, static_cast<double>(s)})) << s << ", " << background;
    }
    EXPECT_TRUE(IsBackground<int>(p, {kIndefinite, 0, 0})) << background;
    EXPECT_TRUE(IsBackground<unsigned int>(p, {2147483648u, 0, 0})) << background;
    EXPECT_FALSE(IsBackground<int>(p, {-2147483647, 0, 0})) << background;
  }
  EXPECT_FALSE(IsBackground<float>({.min = {-3e9f, 0, 0}}, {kNaN, 0, 0}));
}

TEST(SPOTBlue, BackgroundIsWrittenByAPlainCast) {
  const Parameters p = {.max = {0, 0, 0}, .backGround = {300.7f, -1.9f, kNaN}};
  const std::vector<int> out = {1, 1, 1};
  EXPECT_EQ((TripleOf<unsigned char, int>(p, out)), (std::vector<unsigned char>{44, 255, 0}));
  EXPECT_EQ((TripleOf<char, int>(p, out)), (std::vector<char>{44, -1, 0}));
  EXPECT_EQ((TripleOf<short, int>(p, out)), (std::vector<short>{300, -1, 0}));
  EXPECT_EQ((TripleOf<unsigned short, int>(p, out)), (std::vector<unsigned short>{300, 65535, 0}));
  EXPECT_EQ((TripleOf<int, int>(p, out)), (std::vector<int>{300, -1, kIndefinite}));
  EXPECT_EQ((TripleOf<unsigned int, int>(p, out)), (std::vector<unsigned int>{300, 4294967295u, 0}));
  EXPECT_EQ((TripleOf<std::int64_t, int>(p, out)),
            (std::vector<std::int64_t>{300, -1, std::numeric_limits<std::int64_t>::min()}));
  EXPECT_EQ((TripleOf<std::uint64_t, int>(p, out)),
            (std::vector<std::uint64_t>{300, 18446744073709551615u, std::uint64_t{1} << 63}));
  const std::vector<double> exact = TripleOf<double, int>(p, out);
  EXPECT_EQ(exact[0], static_cast<double>(300.7f));
  EXPECT_EQ(exact[1], static_cast<double>(-1.9f));
  EXPECT_TRUE(std::isnan(exact[2]));
  EXPECT_EQ((BlueOf<unsigned char, int>(p, out)), 44);
}

TEST(SPOTBlue, ExcludedByTheMaskIsBackground) {
  for (const std::uint32_t channels : {1u, 2u, 3u}) {
    std::vector<float> valid(channels, kUnwritten), background(channels, kUnwritten);
    valid[0] = 13.9054f;
    background[0] = 8;
    if (channels == 3) {
      valid = {0, 0, 13.9054f};
      background = {8, 9, 10};
    }
    Image<short> in({3, 2, 3}, {1, 1}, 0);
    Image<float> out({3, 2, channels}, {}, kUnwritten);
    Mask mask(3, 2, {1, 1});
    mask.SetValid(1, 0, false);
    mask.SetValid(2, 1, false);
    OperatorOf(WithBackGround({8, 9, 10})).Process(&in, &mask, &out);
    for (int y = 0; y < 2; ++y) {
      for (int x = 0; x < 3; ++x) {
        const std::vector<float> pixel(&out.At(x, y), &out.At(x, y) + channels);
        EXPECT_EQ(pixel, mask.IsValid(x, y) ? valid : background) << x << ", " << y;
      }
    }
  }
}

TEST(SPOTBlue, MaskIsLookedUpByItsOwnGeometry) {
  Image<short> in({3, 2, 3}, {1, 1}, 0);
  Image<double> out({3, 2}, {}, kUnwritten);
  Mask mask(5, 2, {0, 2});
  mask.SetValid(1, 1, false);
  OperatorOf({}).Process(&in, &mask, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<double>{13.9054, 13.9054, 13.9054, 13.9054, -1, 13.9054}));
}

// ---- golden: forms of the output

TEST(SPOTBlue, OutputOf1Or2Or4ChannelsHoldsBlueInChannel0AndTheOthersKeepWhatTheyHeld) {
  for (const std::uint32_t channels : {1u, 2u, 4u, 5u}) {
    std::vector<double> valid(channels, kUnwritten), background(channels, kUnwritten);
    valid[0] = 13.9054;
    background[0] = 8;
    const Parameters p = WithBackGround({8, 9, 10});
    EXPECT_EQ((PixelOf<double, int>(OperatorOf(p), {0, 0, 0}, channels)), valid);
    EXPECT_EQ((PixelOf<double, int>(OperatorOf(p), {8, 0, 0}, channels)), background);
    const Parameters trimmed = {.min = {0, 0, 0}, .scale = {2, 2, 2}, .backGround = {8, 9, 10}, .trim = true};
    valid[0] = 13.9054 * 2;
    EXPECT_EQ((PixelOf<double, int>(OperatorOf(trimmed), {0, 0, 0}, channels)), valid);
  }
}

// Deliberate: a valid pixel swaps the first two bands, a background pixel keeps the order of `backGround`.
TEST(SPOTBlue, ValidPixelSwapsTheFirstTwoBandsABackgroundPixelKeepsTheOrderOfBackGround) {
  const Parameters p = WithBackGround({200, 201, 202});
  EXPECT_EQ((TripleOf<unsigned char, unsigned char>(p, {10, 20, 30})),
            (std::vector<unsigned char>{20, 10, 17}));
  EXPECT_EQ((TripleOf<unsigned char, unsigned char>(p, {200, 20, 30})),
            (std::vector<unsigned char>{200, 201, 202}));
}

TEST(SPOTBlue, WithoutTheTrimRedAndGreenArePlainCasts) {
  EXPECT_EQ((TripleOf<unsigned char, short>({}, {300, -2, 0})), (std::vector<unsigned char>{254, 44, 255}));
  EXPECT_EQ((TripleOf<short, int>({}, {70000, 40000, 0})), (std::vector<short>{-25536, 4464, 255}));
  EXPECT_EQ((TripleOf<short, float>({}, {1.9f, -2.9f, 0})), (std::vector<short>{-2, 1, 16}));
  EXPECT_EQ((TripleOf<std::int64_t, short>({}, {-7, -8, 0})), (std::vector<std::int64_t>{-8, -7, 8}));
  EXPECT_EQ((TripleOf<float, int>({.max = {1e9f, 1e9f, 1e9f}}, {16777217, 5, 0})),
            (std::vector<float>{5, 16777216, 255}));
  EXPECT_EQ(TripleOf({}, {1.25, 2.75, 0.0}),
            (std::vector<double>{2.75, 1.25, (1.25 * 0.873393 + 13.9054) - 2.75 * 0.138254}));
}

TEST(SPOTBlue, TrimStretchesEachBandByItsOwnMinimumAndScale) {
  const Parameters p = {.min = {10, 20, 4}, .scale = {2, 3, 0.5f}, .trim = true};
  EXPECT_EQ((TripleOf<double, int>(p, {15, 26, 0})),
            (std::vector<double>{18, 10, (((15.0 * 0.873393 + 13.9054) - 26.0 * 0.138254) - 4.0) * 0.5}));
}

TEST(SPOTBlue, TrimmedBandsAreWrittenThroughClipTo) {
  const Parameters p = Trimmed({0.5f, -1, 1});
  EXPECT_EQ((TripleOf<unsigned char, int>(p, {5, 7, 0})), (std::vector<unsigned char>{0, 3, 17}));
  EXPECT_EQ((TripleOf<short, int>(p, {5, 7, 0})), (std::vector<short>{-7, 3, 17}));
  EXPECT_EQ((TripleOf<unsigned char, int>(Trimmed({100, 100, 1}), {5, 7, 0})),
            (std::vector<unsigned char>{255, 255, 17}));
  const std::vector<float> nan = TripleOf<float, int>(Trimmed({kNaN, 1, 1}), {5, 7, 0});
  EXPECT_TRUE(std::isnan(nan[1]));
  EXPECT_EQ((TripleOf<int, int>(Trimmed({kNaN, 1, 1}), {5, 7, 0}))[1], kIndefinite);
}

TEST(SPOTBlue, TrimKeepsTheFractionOfTheSamples) {
  const Parameters p = {.min = {0, 0, 0}, .max = {1, 2, 1e9f}, .scale = {4, 4, 1}, .trim = true};
  const std::vector<double> triple = TripleOf(p, {1.75, 2.25, 0.0});
  EXPECT_EQ(triple[1], 7.0);
  EXPECT_EQ(triple[0], 9.0);
}

TEST(SPOTBlue, TrimOfRedAndGreenIsInDoubleForADoubleInputElseInFloat) {
  const Parameters p = {.min = {0.1f, 0.3f, 0}, .scale = {3.3f, 1.7f, 1}, .trim = true};
  const double greenInFloat = static_cast<double>((7.0f - 0.1f) * 3.3f);
  const double greenInDouble = (7.0 - static_cast<double>(0.1f)) * static_cast<double>(3.3f);
  const double redInFloat = static_cast<double>((9.0f - 0.3f) * 1.7f);
  const double redInDouble = (9.0 - static_cast<double>(0.3f)) * static_cast<double>(1.7f);
  ASSERT_NE(greenInFloat, greenInDouble);
  ASSERT_NE(redInFloat, redInDouble);
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class In>() {
      const bool isDouble = std::is_same_v<In, double>;
      const std::vector<double> triple = TripleOf<double, In>(p, {7, 9, 0});
      EXPECT_EQ(triple[0], isDouble ? redInDouble : redInFloat) << type;
      EXPECT_EQ(triple[1], isDouble ? greenInDouble : greenInFloat) << type;
    });
  }
  const Parameters wide = {.min = {0, 0, 0}, .max = {1e9f, 1e9f, 1e20f}, .scale = {1, 1, 1}, .trim = true};
  EXPECT_EQ((TripleOf<double, int>(wide, {16777217, 0, 0}))[1], 16777216.0);
  EXPECT_EQ((TripleOf<double, double>(wide, {16777217, 0, 0}))[1], 16777217.0);
}

TEST(SPOTBlue, TrimOfBlueIsInDoubleForAllInputs) {
  const Parameters p = {.min = {0, 0, 0.1f}, .scale = {1, 1, 3.3f}, .trim = true};
  const double expected = (13.9054 - static_cast<double>(0.1f)) * static_cast<double>(3.3f);
  EXPECT_EQ((BlueOf<double, float>(p, {0, 0, 0})), expected);
  EXPECT_EQ((BlueOf<double, unsigned char>(p, {0, 0, 0})), expected);
  EXPECT_EQ((BlueOf<double, double>(p, {0, 0, 0})), expected);
}

TEST(SPOTBlue, OutputsOf64BitsAreNotRoundedAndANegativeValueIs0) {
  EXPECT_EQ((BlueOf<std::int64_t, int>({}, {0, 0, 0})), 13);
  EXPECT_EQ((BlueOf<std::uint64_t, int>({}, {0, 0, 0})), 13u);
  const Parameters negative = Trimmed({-1, 0.5f, -1});
  EXPECT_EQ((TripleOf<std::int64_t, int>(negative, {5, 7, 0})), (std::vector<std::int64_t>{3, 0, 0}));
  EXPECT_EQ((TripleOf<std::uint64_t, int>(negative, {5, 7, 0})), (std::vector<std::uint64_t>{3, 0, 0}));
  const Parameters huge = Trimmed({1e19f, 1e30f, 1e30f});
  constexpr std::int64_t kMost = std::numeric_limits<std::int64_t>::max();
  constexpr std::uint64_t kMostUnsigned = std::numeric_limits<std::uint64_t>::max();
  EXPECT_EQ((TripleOf<std::int64_t, int>(huge, {1, 7, 0})), (std::vector<std::int64_t>{kMost, kMost, kMost}));
  EXPECT_EQ((TripleOf<std::uint64_t, int>(huge, {1, 7, 0})),
            (std::vector<std::uint64_t>{kMostUnsigned, static_cast<std::uint64_t>(1e19f), kMostUnsigned}));
}

TEST(SPOTBlue, HeightOrWidthOf0LeavesTheOutputUntouched) {
  for (const Size size : {Size{4, 0, 3}, Size{0, 4, 3}, Size{0, 0, 3}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out(size, {1, 1});
    FillBytes(out);
    OperatorOf({}).Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(SPOTBlue, LargerOutputKeepsItsOtherPixels) {
  Image<short> in({3, 2, 3}, {1, 2}, 0);
  Image<float> out({5, 4}, {2, 1}, kUnwritten);
  OperatorOf({}).Process(&in, nullptr, &out);
  for (int y = -1; y < 5; ++y) {
    for (int x = -2; x < 7; ++x) {
      const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y), isInside ? 13.9054f : kUnwritten) << x << ", " << y;
    }
  }
}

TEST(SPOTBlue, OfAComplexRasterElementCOfAPixelIsItsSampleC) {
  Image<short> in({2, 1, 3}, {}, 0, true);
  in.SetPixel(0, 0, {10, 20, 30, -1, -1, -1});  // the last three are not looked at
  in.SetPixel(1, 0, {10, 200, 30, 1, 1, 1});
  Image<float> out({2, 1, 3}, {}, kUnwritten, true);
  OperatorOf(WithBackGround({-1, 200, -1, -1, -1, -1})).Process(&in, nullptr, &out);
  const auto blue = static_cast<float>(((10.0 * 0.873393 + 13.9054) - 20.0 * 0.138254) - 30.0 * 0.100616);
  EXPECT_EQ(ElementsOf(out), (std::vector<float>{20, 10, blue, 77, 77, 77, -1, 200, -1, 77, 77, 77}));
  Image<float> single({2, 1, 1}, {}, kUnwritten, true);
  OperatorOf(WithBackGround({-1, 200, -1, -1, -1, -1})).Process(&in, nullptr, &single);
  EXPECT_EQ(ElementsOf(single), (std::vector<float>{blue, 77, -1, 77}));
}

TEST(SPOTBlue, ComplexInputOfOneChannelHasNoBlue) {
  Image<short> in({1, 1}, {}, 5, true);
  Image<float> out({1, 1}, {}, kUnwritten);
  OperatorOf({}).Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 0.0f);
}

// ---- golden: parameters

// Deliberate: the setters append. A second call adds behind what is there, and the first entries go on being
// the ones used.
TEST(SPOTBlue, SettersAppendASecondCallAddsBehindAndTheFirstEntriesGoOnBeingUsed) {
  Values first = {0, 0, 0}, second = {20, 20, 20}, none;
  SPOTBlue blue;
  blue.SetTrim(true);
  Values wide = {1000, 1000, 1000}, factors = {2, 2, 2}, backGround = {-1, -1, -1}, other = {7, 7, 7};
  blue.SetMin(none);
  blue.SetMin(first);
  blue.SetMin(second);
  blue.SetMax(wide);
  blue.SetMax(first);
  blue.SetScale(factors);
  blue.SetScale(first);
  blue.SetBackGround(backGround);
  blue.SetBackGround(other);
  blue.SetBackGround(none);
  EXPECT_EQ(blue.min, (Values{0, 0, 0, 20, 20, 20}));
  EXPECT_EQ(blue.max, (Values{1000, 1000, 1000, 0, 0, 0}));
  EXPECT_EQ(blue.scale, (Values{2, 2, 2, 0, 0, 0}));
  EXPECT_EQ(blue.backGround, (Values{-1, -1, -1, 7, 7, 7}));
  EXPECT_EQ((PixelOf<double, int>(blue, {7, 8, 0}, 3)),
            (std::vector<double>{16, 14, ((7.0 * 0.873393 + 13.9054) - 8.0 * 0.138254) * 2.0}));
}

TEST(SPOTBlue, SecondBackGroundServesTheChannelsBehind) {
  SPOTBlue blue = OperatorOf({});
  Values more = {50};
  blue.SetBackGround(more);
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0, 50}, 1)), std::vector<double>{-1});
}

TEST(SPOTBlue, SetterTakesItsOwnField) {
  details::BlueParams params;
  params.min = {1, 2};
  params.SetMin(params.min);
  EXPECT_EQ(params.min, (Values{1, 2, 1, 2}));
}

TEST(SPOTBlue, ScaleMayStayEmptyWithoutTheTrim) {
  const SPOTBlue blue = OperatorOf({});
  ASSERT_TRUE(blue.scale.empty());
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0}, 3)), (std::vector<double>{0, 0, 13.9054}));
}

TEST(SPOTBlue, ParametersAreEmptyByDefault) {
  const SPOTBlue blue;
  EXPECT_TRUE(blue.min.empty());
  EXPECT_TRUE(blue.max.empty());
  EXPECT_TRUE(blue.scale.empty());
  EXPECT_TRUE(blue.backGround.empty());
}

// ---- golden: one processor for all calls

// Deliberate: built once and never again. Neither another type nor a setter after the first `Process` takes
// effect.
TEST(SPOTBlue, BuiltOnceAndNeverAgainSettersAfterTheFirstProcessTakeNoEffect) {
  SPOTBlue blue = OperatorOf({});
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0}, 3)), (std::vector<double>{0, 0, 13.9054}));
  Values scale = {2, 2, 2};
  blue.SetScale(scale);
  blue.SetTrim(true);
  blue.min = {1, 1, 1};
  blue.max = {2, 2, 2};
  blue.backGround = {0, 0, 0};
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0}, 3)), (std::vector<double>{0, 0, 13.9054}));
  EXPECT_EQ((PixelOf<double, unsigned int>(blue, {0, 0, 0}, 3)), (std::vector<double>{0, 0, 13.9054}));
}

TEST(SPOTBlue, BuiltOnceAndNeverAgainALaterOutputOfAnotherTypeIsWrittenAsTheFirstType) {
  const SPOTBlue blue = OperatorOf({});
  EXPECT_EQ((PixelOf<unsigned char, int>(blue, {0, 0, 0}, 1)), std::vector<unsigned char>{14});
  Image<int> in({2, 1, 3}, {}, 0);
  in.SetPixel(1, 0, {3, 5, -1});
  Image<short> single({2, 1}, {}, 0x5A5A), triple({2, 1, 3}, {}, 0x5A5A);
  blue.Process(&in, nullptr, &single);
  EXPECT_EQ(ElementsOf(single), (std::vector<short>{0x5A0E, 0x5AFF}));
  blue.Process(&in, nullptr, &triple);
  EXPECT_EQ(ElementsOf(triple),
            (std::vector<short>{0x0000, 0x5A0E, 0x5A5A, static_cast<short>(0xFFFF), 0x5AFF, 0x5A5A}));
}

TEST(SPOTBlue, BuiltOnceAndNeverAgainALaterInputOfAnotherTypeIsReadAsTheFirstType) {
  const SPOTBlue blue = OperatorOf({});
  EXPECT_EQ((PixelOf<double, unsigned char>(blue, {0, 0, 0}, 3)), (std::vector<double>{0, 0, 13.9054}));
  Image<short> in({2, 1, 3});  // pixels of 6 bytes, of which the first 3 are read
  in.SetPixel(0, 0, {0x0201, 0x0400, 0});
  in.SetPixel(1, 0, {0x0605, 0x0800, 0});
  Image<double> out({2, 1, 3});
  blue.Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<double>{2, 1, (1 * 0.873393 + 13.9054) - 2 * 0.138254,  //
                                                  6, 5, (5 * 0.873393 + 13.9054) - 6 * 0.138254}));
}

TEST(SPOTBlue, LaterRastersHaveSizesAndChannelsOfTheirOwn) {
  const SPOTBlue blue = OperatorOf(WithBackGround({-1, -2, -3, 50}));
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0}, 1)), std::vector<double>{13.9054});
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0}, 3)), (std::vector<double>{0, 0, 13.9054}));
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0, 0, 50}, 3)), (std::vector<double>{-1, -2, -3}));
  EXPECT_EQ((PixelOf<double, int>(blue, {0, 0}, 2)), (std::vector<double>{0, kUnwritten}));
}

// ---- differential

/// Parameters under which about half of the pixels are valid, for as many channels.
Parameters DrawParameters(tests::Random& random, std::uint32_t channels) {
  constexpr float kMin[] = {0, 1, 2, 5, 12.5f, -128, -3, 20, -1e9f, -2147483648.f, kNaN, 100, 2.2f, 0.1f};
  constexpr float kMax[] = {3, 2, 60, 40, 127, 255, 17.5f, 70000, 1e9f, 2147483648.f, kNaN, 1, 14.1f, 2e19f};
  constexpr float kScale[] = {1,    0.5f,  -1, 2.55f, 0,         1e10f,     3.3f,  100,
                              0.1f, 1e30f, 7,  kNaN,  kInfinity, -12345.6f, 1e-9f, 2};
  constexpr float kBackGround[] = {-1,   -1,    -1,        -1,    0,        2.5f,          3,        44,
                                   255,  17.9f, 12,        300,   -7.2f,    -2147483648.f, 16777216, -0.5f,
                                   kNaN, 1e20f, kInfinity, 65535, 70000.7f, 1e9f};
  Parameters p;
  p.trim = random.OneIn(2);
  for (std::size_t band = 0; band < 3; ++band) {
    p.min[band] = random.OneIn(3) ? random.Pick(kMin) : random.OneIn(2) ? -kInfinity : -3e9f;
    p.max[band] = random.OneIn(3) ? random.Pick(kMax) : random.OneIn(2) ? kInfinity : 1e20f;
    if (p.trim) p.scale.push_back(random.Pick(kScale));
    if (p.trim && random.OneIn(2)) p.min[band] = random.Pick(kMin);
  }
  p.backGround.clear();
  for (std::uint32_t c = 0; c < std::max(3u, channels); ++c) p.backGround.push_back(random.Pick(kBackGround));
  return p;
}

/// Samples on and beside what the operator compares with.
std::vector<double> NearbyOf(const Parameters& p) {
  std::vector<double> near = {13.9054, 4294967296.0 + 3, 2147483648.0};
  for (std::size_t band = 0; band < 2; ++band) {
    const double min = p.min[band], max = p.max[band];
    near.insert(near.end(), {min, max, min - 1, max + 1, max + 0.5, min - 0.5, min + 2});
  }
  for (std::size_t c = 0; c < 3; ++c) {
    near.push_back(p.backGround[c]);
    near.push_back(std::floor(p.backGround[c]) + 0.75);
  }
  return near;
}

/// A case of this operator: up to 6 input channels, and the forms of the output in turn.
tests::Case Adapted(tests::Case c, tests::Random& random) {
  constexpr std::uint32_t kInChannels[] = {3, 3, 3, 3, 3, 4, 4, 5, 6, 2, 1, 0};
  constexpr std::uint32_t kOutChannels[] = {1, 1, 1, 3, 3, 3, 3, 2, 4, 5};
  constexpr std::uint32_t kMostPixels = 30000;
  if (c.size.channels < 100) c.size.channels = random.Pick(kInChannels);
  c.outChannels = random.Pick(kOutChannels);
  if (c.size.channels < 2 && c.outChannels == 3) c.outChannels = 1;  // there is no second sample
  if (c.size.width == 601 && random.OneIn(3)) c.size.width = 2040 + random.Below(200);
  if (c.size.width * c.size.height > kMostPixels && !random.OneIn(12)) c.size.height = 2;
  c.out.isComplex = random.OneIn(6);
  c.threads = {1};
  return c;
}

/// Makes the operator take the output for one that is larger than the caches.
constexpr std::uint64_t kLarge = std::uint64_t{1} << 30;

/// Fills an output such that its elements differ.
void FillSmooth(Raster& raster, std::uint64_t seed) {
  tests::Random random(seed);
  FillRandom(raster, tests::Fill::eSMOOTH, random);
}

/// Compares the operator with its twin.
///
/// @param readAs, writtenAs  the types of an earlier call
::testing::AssertionResult Agrees(const tests::Case& c, const DataType& readAs, const DataType& writtenAs) {
  tests::Random random(~c.seed);
  const Parameters p = DrawParameters(random, c.size.channels);
  const SPOTBlue blue = OperatorOf(p);
  const bool isLarge = random.OneIn(4);
  if (readAs != c.in || writtenAs != c.out) {
    Raster in({0, 0, 3, readAs}, {}), out({0, 0, 3, writtenAs}, {});
    blue.Process(&in, nullptr, &out);
  }
  const auto process = [&](Raster* in, Mask* mask, Raster* out) {
    FillSmooth(*out, c.seed);
    const std::uint64_t size = out->dataSize;
    if (isLarge) out->dataSize = kLarge;
    blue.Process(in, mask, out);
    out->dataSize = size;
  };
  const auto twin = [&](const Raster& in, const Mask* mask, Raster& out) {
    FillSmooth(out, c.seed);
    reference::SPOTBlue(blue, readAs, writtenAs, in, mask, out);
  };
  return Agree(c, NearbyOf(p), process, twin)
         << ", min " << ::testing::PrintToString(p.min) << ", max " << ::testing::PrintToString(p.max)
         << ", scale " << ::testing::PrintToString(p.scale) << ", backGround "
         << ::testing::PrintToString(p.backGround);
}

struct SPOTBlueDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(SPOTBlueDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& drawn : tests::CasesFrom(GetParam(), {})) {
    tests::Random random(drawn.seed + 1);
    if (random.OneIn(4)) continue;
    const tests::Case c = Adapted(drawn, random);
    ASSERT_TRUE(Agrees(c, c.in, c.out));
  }
}

TEST_P(SPOTBlueDifferential, AgreesWithTheTwinBitForBitWhereEarlierRastersHadOtherTypes) {
  for (const tests::Case& drawn : tests::CasesFrom(GetParam(), {})) {
    tests::Random random(drawn.seed + 2);
    if (!random.OneIn(8)) continue;
    tests::Case c = Adapted(drawn, random);
    c.inMargins = c.outMargins = {8, 4};  // room for elements wider than the rasters' own
    const DataType readAs(random.Pick(tests::kPixelTypes).element, random.OneIn(4));
    const DataType writtenAs(random.Pick(tests::kPixelTypes).element, random.OneIn(4));
    ASSERT_TRUE(Agrees(c, readAs, writtenAs))
        << "first types " << tests::NameOf(readAs) << ", " << tests::NameOf(writtenAs);
  }
}

TEST_P(SPOTBlueDifferential, AgreesWithTheTwinWhereInputAndOutputAreOneRaster) {
  tests::Random random(20240603);
  for (int i = 0; i < 20; ++i) {
    const std::uint32_t channels = random.OneIn(3) ? 1 + random.Below(5) : 3;
    const tessel::RasterInfo info(random.Below(700), 1 + random.Below(3), channels, GetParam().element);
    const Parameters p = DrawParameters(random, channels);
    const SPOTBlue blue = OperatorOf(p);
    Raster in(info, {1, 1}), expected(info, {1, 1});
    FillRandom(in, random.Pick(tests::kFills), random, NearbyOf(p));
    std::copy_n(in.data, in.dataSize, expected.data);
    const auto mask = RandomMask(in, random.Pick(tests::kMaskKinds), tests::MaskGeometry::eSAME, random);
    reference::SPOTBlue(blue, expected, mask.get(), expected);
    blue.Process(&in, mask.get(), &in);
    ASSERT_TRUE(SameBits(expected, in)) << info.width << " x " << info.height << " x " << channels;
  }
}

INSTANTIATE_TEST_SUITE_P(From, SPOTBlueDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

TEST(SPOTBlueOfManyPixels, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  const SPOTBlue blue = OperatorOf({.min = {12, 14, 5}, .max = {60, 60, 40}, .backGround = {20, 25, 30}});
  Raster in({1300, 1250, 3, tessel::eDT_8U}, {1, 2});
  FillRandom(in, tests::Fill::eSMOOTH, random);
  const auto mask = RandomMask(in, tests::MaskKind::eFEW_CLEAR, tests::MaskGeometry::eSAME, random);
  Raster expected({1300, 1250, 3, tessel::eDT_64F}, {3, 1}), actual(expected, expected);
  FillBytes(expected);
  FillBytes(actual);
  reference::SPOTBlue(blue, in, mask.get(), expected);
  blue.Process(&in, mask.get(), &actual);
  EXPECT_TRUE(SameBits(expected, actual));
}

static_assert(std::is_base_of_v<details::BlueParams, SPOTBlue>);
static_assert(!std::is_polymorphic_v<SPOTBlue>);

}  // namespace
}  // namespace orvik::gridmill
