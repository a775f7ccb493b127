#include "processes/gridmill/percentile.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/cumulativespline_reference.h"
#include "tests/reference/percentile_reference.h"
#include "tests/support/cases.h"
#include "tests/support/compare.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/splines.h"

namespace orvik::filters {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::SameBits;
using tests::SameBlock;
using tests::Throws;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// What the output's samples hold that the operator does not write.
constexpr int kUnwritten = 77;

/// An operator for one channel.
Percentile OneChannel(const std::vector<int>& counts, float min, float max) {
  Percentile percentile;
  percentile.SetMinData({min});
  percentile.SetMaxData({max});
  percentile.SetNoData(-1.0f);
  percentile.SetBinNum(static_cast<int>(counts.size()));
  percentile.SetCoefficients(counts);
  return percentile;
}

/// The same with one bin for each unit, from 0 on.
Percentile UnitBins(const std::vector<int>& counts) {
  return OneChannel(counts, 0.0f, static_cast<float>(counts.size()));
}

/// A spline that falls to -13.3 at 6 and rises to 109.05 at 22. The range is 0 to 40.
Percentile Overshooting() { return OneChannel({0, 10, 0, 0}, 0.0f, 40.0f); }

/// The results for the samples of one pixel.
template <class Out = float, class In = float>
std::vector<Out> PixelOf(const Percentile& percentile, const std::vector<In>& samples) {
  const auto channels = static_cast<std::uint32_t>(samples.size());
  Image<In> in({1, 1, channels});
  std::copy(samples.begin(), samples.end(), in.Elements());
  Image<Out> out({1, 1, channels}, {}, static_cast<Out>(kUnwritten));
  percentile.Process(&in, nullptr, &out);
  return {out.Elements(), out.Elements() + channels};
}

/// The result for a sample of the only channel.
template <class Out = float, class In = float>
Out PercentileOf(const Percentile& percentile, In sample) {
  return PixelOf<Out, In>(percentile, {sample})[0];
}

// ---- golden

TEST(Percentile, SampleInTheMiddleOfAnEvenHistogramGives50) {
  EXPECT_EQ(PercentileOf(UnitBins({1, 1, 1, 1}), 2.0f), 50.0f);
}

TEST(Percentile, CubicIsEvaluatedInsideABin) {
  const Percentile percentile = UnitBins({1, 3});
  EXPECT_EQ(PercentileOf(percentile, 0.5f), 5.46875f);   // 6.25 / 2 + 18.75 / 8
  EXPECT_EQ(PercentileOf(percentile, 1.5f), 64.84375f);  // 25 + 62.5 / 2 + 56.25 / 4 - 43.75 / 8
  EXPECT_EQ(PercentileOf<double>(percentile, 0.25f), 1.85546875);
}

TEST(Percentile, SplineIsAddedUpInItsOwnOrder) {
  // 74.999999999999986 and 99.999999999999986, by Horner's rule 75 and 100
  EXPECT_EQ((PercentileOf<float, int>(OneChannel({4, 2, 3}, 0.0f, 12.0f), 9)), 74.0f);
  EXPECT_EQ((PercentileOf<float, int>(OneChannel({5, 1, 0}, 0.0f, 60.0f), 59)), 99.0f);
}

TEST(Percentile, SampleOnABinEdgeGivesTheCumulativePercentage) {
  const Percentile percentile = UnitBins({4, 2, 1, 1});
  EXPECT_EQ(PercentileOf(percentile, 1.0f), 50.0f);
  EXPECT_EQ(PercentileOf(percentile, 2.0f), 75.0f);
  EXPECT_EQ(PercentileOf(percentile, 3.0f), 87.5f);
  const Percentile shifted = OneChannel({4, 2, 1, 1}, 10.0f, 18.0f);
  EXPECT_EQ(PercentileOf(shifted, 12.0f), 50.0f);
  EXPECT_EQ(PercentileOf(shifted, 16.0f), 87.5f);
}

TEST(Percentile, EndsOfTheRangeGive0And100) {
  const Percentile percentile = UnitBins({1, 3});
  EXPECT_EQ(PercentileOf(percentile, 0.0f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, -0.5f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, -kInfinity), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, 2.0f), 100.0f);
  EXPECT_EQ(PercentileOf(percentile, 1e20f), 100.0f);
  EXPECT_EQ(PercentileOf(percentile, kInfinity), 100.0f);
}

TEST(Percentile, ConstantsPassTheInputsTypeBy) {
  const Percentile percentile = UnitBins({1, 3});
  for (const PixelType& inType : tests::kPixelTypes) {
    for (const PixelType& outType : tests::kPixelTypes) {
      tests::WithPixelTypes(inType.element, outType.element, [&]<class In, class Out>() {
        EXPECT_EQ((PercentileOf<Out, In>(percentile, In{0})), Out{0}) << inType << " -> " << outType;
        EXPECT_EQ((PercentileOf<Out, In>(percentile, In{2})), Out{100}) << inType << " -> " << outType;
      });
    }
  }
}

TEST(Percentile, MinimumEqualToTheMaximumGives0EverywhereButForNoData) {
  const Percentile percentile = OneChannel({1, 2, 3}, 5.0f, 5.0f);
  for (const float sample : {-kInfinity, 4.0f, 5.0f, 6.0f, 1e20f, kInfinity, kNaN}) {
    EXPECT_EQ(PercentileOf(percentile, sample), 0.0f) << sample;
    EXPECT_FALSE(std::signbit(PercentileOf(percentile, sample))) << sample;
  }
  EXPECT_EQ(PercentileOf(percentile, -1.0f), -1.0f);
  EXPECT_EQ(PercentileOf(OneChannel({1}, 0.0f, -0.0f), 7.0f), 0.0f);
  EXPECT_EQ(PercentileOf(OneChannel({1}, kInfinity, kInfinity), 7.0f), 0.0f);
}

TEST(Percentile, MinimumAboveTheMaximumGives0UpToItAnd100Beyond) {
  const Percentile percentile = OneChannel({1, 2, 3}, 5.0f, 3.0f);
  EXPECT_EQ(PercentileOf(percentile, 4.0f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, 5.0f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, 5.5f), 100.0f);
}

TEST(Percentile, NoBinsGive100InsideTheRange) {
  const Percentile percentile = OneChannel({}, 0.0f, 4.0f);
  EXPECT_EQ(PercentileOf(percentile, 1.0f), 100.0f);
  EXPECT_EQ(PercentileOf(percentile, 1e-30f), 100.0f);
  EXPECT_EQ(PercentileOf(percentile, 0.0f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, 4.0f), 100.0f);
}

TEST(Percentile, NaNSampleGives0) {
  EXPECT_EQ(PercentileOf(UnitBins({1, 3}), kNaN), 0.0f);
  EXPECT_EQ((PercentileOf<short, double>(UnitBins({1, 3}), kNaN)), 0);
  Percentile percentile = UnitBins({1, 3});
  percentile.SetNoData(kNaN);
  EXPECT_EQ(PercentileOf(percentile, kNaN), 0.0f);
}

TEST(Percentile, RangeOfNaNOrInfinityRunsThroughTheArithmetic) {
  EXPECT_EQ(PercentileOf(OneChannel({1, 3}, kNaN, 2.0f), 1.0f), 0.0f);
  EXPECT_EQ(PercentileOf(OneChannel({1, 3}, kNaN, 2.0f), 2.0f), 100.0f);
  EXPECT_EQ(PercentileOf(OneChannel({1, 3}, 0.0f, kNaN), 1.0f), 0.0f);
  EXPECT_TRUE(std::isnan(PercentileOf(OneChannel({1, 3}, 0.0f, kInfinity), 1.0f)));
  EXPECT_EQ(PercentileOf(OneChannel({1, 3}, -kInfinity, 2.0f), 1.0f), 0.0f);
  EXPECT_TRUE(std::isnan(PercentileOf(OneChannel({1, 3}, -3e38f, 3e38f), 1.0f)));
}

TEST(Percentile, PositionThatLeaves32BitsGives0) {
  const Percentile percentile = OneChannel({1, 3}, 0.0f, 1e-40f);  // an infinite scale
  EXPECT_EQ(PercentileOf(percentile, 5e-41f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, 1e-40f), 100.0f);
}

TEST(Percentile, BinIsFoundInFloat) {
  const Percentile percentile = OneChannel({21474837, 0}, 0.0f, 1000.0f);  // ends at -100, as its counts wrap
  EXPECT_LT(PercentileOf(percentile, 999.0f), -50.0f);
  EXPECT_EQ(PercentileOf(percentile, std::nextafter(1000.0f, 0.0f)),
            100.0f);  // in `double` of bin 1.99999997
}

TEST(Percentile, SampleIsConvertedToFloat) {
  const Percentile percentile = UnitBins({1, 3});
  EXPECT_EQ((PercentileOf<double, double>(percentile, 1.0 - 1e-12)), 25.0);
  EXPECT_EQ((PercentileOf<double, double>(percentile, 2.0 - 1e-12)), 100.0);
  EXPECT_EQ((PercentileOf<double, double>(percentile, 1.7)),
            static_cast<double>(PercentileOf<float, float>(percentile, 1.7f)));
  const Percentile large = OneChannel({1, 3}, 16777214.0f, 16777218.0f);
  EXPECT_EQ((PercentileOf<float, int>(large, 16777217)), 25.0f);
  EXPECT_EQ((PercentileOf<float, std::int64_t>(large, 16777217)), 25.0f);
  EXPECT_EQ((PercentileOf<float, std::uint64_t>(large, 16777217)), 25.0f);
}

// Deliberate: the spline's value is cast to the input's type. Integers lose the fraction and wrap: an
// overshoot of -1.2 is 255 for an `unsigned char` input.
TEST(Percentile, SplinesValueIsCastToTheInputsTypeIntegersLoseTheFractionAndWrap) {
  const Percentile percentile = OneChannel({0, 10, 0, 0}, 0.0f, 1000.0f);
  EXPECT_NEAR(PercentileOf(percentile, 9.0f), -1.25, 0.01);
  EXPECT_EQ((PercentileOf<float, char>(percentile, 9)), -1.0f);
  EXPECT_EQ((PercentileOf<float, unsigned char>(percentile, 9)), 255.0f);
  EXPECT_EQ((PercentileOf<float, short>(percentile, 9)), -1.0f);
  EXPECT_EQ((PercentileOf<float, unsigned short>(percentile, 9)), 65535.0f);
  EXPECT_EQ((PercentileOf<double, int>(percentile, 9)), -1.0);
  EXPECT_EQ((PercentileOf<double, unsigned int>(percentile, 9)), 4294967296.0);
  EXPECT_EQ((PercentileOf<double, std::int64_t>(percentile, 9)), -1.0);
  EXPECT_EQ((PercentileOf<double, std::uint64_t>(percentile, 9)), 0x1p64);
  EXPECT_EQ((PercentileOf<char, unsigned char>(percentile, 9)), 127);
  EXPECT_EQ((PercentileOf<unsigned char, short>(percentile, 9)), 0);
  EXPECT_EQ((PercentileOf<double, unsigned char>(Overshooting(), 22)), 109.0);
}

TEST(Percentile, FractionBetweenMinus1And0OfAnIntegerInputIsAPositive0) {
  const Percentile percentile = OneChannel({0, 10, 0, 0}, 0.0f, 4000.0f);
  for (const PixelType& inType : tests::kPixelTypes) {
    tests::WithPixelType(inType.element, [&]<class In>() {
      const double result = PercentileOf<double, In>(percentile, In{1});
      if constexpr (std::is_floating_point_v<In>) {
        EXPECT_LT(result, 0.0) << inType;
      } else {
        EXPECT_EQ(result, 0.0) << inType;
        EXPECT_FALSE(std::signbit(result)) << inType;
      }
    });
  }
}

TEST(Percentile, ByteInputGivesWholeNumbersInAFloatOutput) {
  const Percentile percentile = OneChannel({5, 9, 2, 6, 5, 3, 5}, 0.0f, 255.0f);
  for (int sample = 1; sample < 255; ++sample) {
    const float result = PercentileOf<float>(percentile, static_cast<unsigned char>(sample));
    const float unrounded = PercentileOf<float>(percentile, static_cast<float>(sample));
    EXPECT_EQ(result, std::trunc(unrounded)) << sample;
  }
}

TEST(Percentile, OvershootOfAFloatingInputStaysUntilItIsWritten) {
  const Percentile percentile = Overshooting();
  EXPECT_NEAR(PercentileOf(percentile, 6.0f), -13.3387, 1e-4);
  EXPECT_NEAR((PercentileOf<double, double>(percentile, 22.0)), 109.0453, 1e-4);
  EXPECT_EQ(PercentileOf<unsigned char>(percentile, 6.0f), 0);
  EXPECT_EQ(PercentileOf<char>(percentile, 6.0f), -13);
  EXPECT_EQ(PercentileOf<unsigned int>(percentile, 22.0f), 109u);
  EXPECT_EQ(PercentileOf<std::int64_t>(percentile, 6.0f), 0);
  EXPECT_EQ(PercentileOf<std::int64_t>(percentile, 22.0f), 109);
}

TEST(Percentile, IntegerOutputsAreRoundedButNotThoseOf64Bits) {
  const Percentile percentile = UnitBins({1, 3});
  EXPECT_EQ(PercentileOf<unsigned char>(percentile, 1.5f), 65);  // 64.84375
  EXPECT_EQ(PercentileOf<int>(percentile, 1.5f), 65);
  EXPECT_EQ(PercentileOf<std::int64_t>(percentile, 1.5f), 64);
  EXPECT_EQ(PercentileOf<std::uint64_t>(percentile, 1.5f), 64u);
}

TEST(Percentile, DoubleOutputHoldsTheFloatResult) {
  const Percentile percentile = OneChannel({5, 9, 2}, 0.0f, 7.0f);
  for (const float sample : {0.3f, 2.7f, 6.9f}) {
    EXPECT_EQ(PercentileOf<double>(percentile, sample),
              static_cast<double>(PercentileOf<float>(percentile, sample)));
    EXPECT_EQ((PercentileOf<double, double>(percentile, static_cast<double>(sample))),
              static_cast<double>(PercentileOf<float>(percentile, sample)));
  }
}

TEST(Percentile, NoDataTestComesFirst) {
  const auto resultOfNoData = [](float noData, float max) {
    Percentile percentile = OneChannel({1, 3}, 0.0f, max);
    percentile.SetNoData(noData);
    return PercentileOf(percentile, noData);
  };
  EXPECT_EQ(resultOfNoData(5.0f, 0.0f), 5.0f);
  EXPECT_EQ(resultOfNoData(0.0f, 0.0f), 0.0f);
  EXPECT_EQ(resultOfNoData(1.0f, 2.0f), 1.0f);
  EXPECT_EQ(resultOfNoData(9.0f, 2.0f), 9.0f);
  EXPECT_EQ(resultOfNoData(-9.0f, 2.0f), -9.0f);
}

TEST(Percentile, NoDataIsWrittenThroughClipTo) {
  Percentile percentile = UnitBins({1, 3});
  percentile.SetNoData(-2.5f);
  EXPECT_EQ(PercentileOf<unsigned char>(percentile, -2.5f), 0);
  EXPECT_EQ(PercentileOf<short>(percentile, -2.5f), -3);
  EXPECT_EQ(PercentileOf<std::int64_t>(percentile, -2.5f), 0);
  EXPECT_EQ(PercentileOf<double>(percentile, -2.5f), -2.5);
  Percentile odd = UnitBins({1, 3});
  odd.SetNoData(8388609.0f);
  EXPECT_EQ((PercentileOf<int, int>(odd, 8388609)), 8388610);
  Percentile large = UnitBins({1, 3});
  large.SetNoData(300.0f);
  EXPECT_EQ((PercentileOf<unsigned char, short>(large, 300)), 255);
}

TEST(Percentile, NoDataIsMetWithin1e9InFloat) {
  const float lastHit = 1e-9f;  // the next float below 1e-9
  const float firstMiss = std::nextafter(lastHit, 1.0f);
  Percentile percentile = OneChannel({1, 3}, -1.0f, 1.0f);
  percentile.SetNoData(0.0f);
  const auto isHit = [&](float sample) { return PercentileOf(percentile, sample) == 0.0f; };
  EXPECT_TRUE(isHit(0.0f));
  EXPECT_TRUE(isHit(-0.0f));
  EXPECT_TRUE(isHit(lastHit));
  EXPECT_TRUE(isHit(-lastHit));
  EXPECT_FALSE(isHit(firstMiss));
  EXPECT_FALSE(isHit(-firstMiss));
  Percentile infinite = UnitBins({1, 3});
  infinite.SetNoData(kInfinity);
  EXPECT_EQ(PercentileOf(infinite, kInfinity), 100.0f);
}

TEST(Percentile, NoDataIs0ByDefaultSoThatSamplesOfExactly0AreNoData) {
  EXPECT_EQ(Percentile().NoData, 0.0f);
  Percentile percentile;
  percentile.SetMinData({-2.0f});
  percentile.SetMaxData({2.0f});
  percentile.SetBinNum(2);
  percentile.SetCoefficients({1, 1});
  EXPECT_EQ(PercentileOf(percentile, 0.0f), 0.0f);
  EXPECT_NEAR(PercentileOf(percentile, 1e-6f), 50.0, 1e-3);
}

TEST(Percentile, EachChannelHasItsOwnHistogram) {
  Percentile percentile;
  percentile.SetMinData({0.0f, 10.0f, 5.0f});
  percentile.SetMaxData({2.0f, 14.0f, 5.0f});
  percentile.SetNoData(-1.0f);
  percentile.SetBinNum(2);
  percentile.SetCoefficients({1, 3, 2, 3, 7, 7});
  EXPECT_EQ(PixelOf<float>(percentile, {1.0f, 12.0f, 6.0f}), (std::vector<float>{25, 40, 0}));
  EXPECT_EQ(PixelOf<float>(percentile, {2.0f, 10.0f, -1.0f}), (std::vector<float>{100, 0, -1}));
  EXPECT_EQ(PixelOf<float>(percentile, {0.5f, 14.0f, 5.0f}), (std::vector<float>{5.46875f, 100, 0}));
}

TEST(Percentile, MoreHistogramsThanChannelsAreNoHarm) {
  Percentile percentile;
  percentile.SetMinData({0.0f, 10.0f, 5.0f});
  percentile.SetMaxData({2.0f, 14.0f});
  percentile.SetNoData(-1.0f);
  percentile.SetBinNum(2);
  percentile.SetCoefficients({1, 3, 2, 3, 7, 7});
  EXPECT_EQ(PixelOf<float>(percentile, {1.0f}), (std::vector<float>{25}));
  EXPECT_EQ(PixelOf<float>(percentile, {1.0f, 12.0f}), (std::vector<float>{25, 40}));
  EXPECT_EQ(PixelOf<float>(percentile, {0.5f}), (std::vector<float>{5.46875f}));
}

TEST(Percentile, MaskHasNoEffect) {
  Image<float> in({300, 2}, {1, 1}, 1.0f);
  Image<float> out({300, 2}, {}, kUnwritten);
  Mask mask(300, 2, {1, 1}, false);
  Mask empty(0, 0);
  const Percentile percentile = UnitBins({1, 3});
  for (Mask* const given : {&mask, &empty}) {
    FillBytes(out);
    percentile.Process(&in, given, &out);
    EXPECT_EQ(tests::Bytes(out), tests::Bytes(Image<float>({300, 2}, {}, 25.0f)));
  }
}

TEST(Percentile, OutputRowsAreSteppedByTheChannelsOfTheInput) {
  Image<float> in({2, 2, 1}, {1, 0}, 1.0f);
  Image<float> out({2, 2, 3}, {1, 0}, kUnwritten);
  UnitBins({1, 3}).Process(&in, nullptr, &out);
  for (int y = 0; y < 2; ++y) {
    const std::vector<float> row(&out.At(0, y), &out.At(0, y) + 6);
    EXPECT_EQ(row, (std::vector<float>{25, 25, kUnwritten, kUnwritten, kUnwritten, kUnwritten}));
  }
}

TEST(Percentile, MarginIsNeitherReadNorWritten) {
  Image<float> in({5, 2}, {2, 1}, kNaN);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 5; ++x) in.At(x, y) = 1.0f;
  }
  Image<float> out({5, 2}, {1, 3}, kUnwritten);
  UnitBins({1, 3}).Process(&in, nullptr, &out);
  for (int y = -3; y < 5; ++y) {
    for (int x = -1; x < 6; ++x) {
      const bool isInside = x >= 0 && x < 5 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y), isInside ? 25.0f : kUnwritten) << x << ", " << y;
    }
  }
}

TEST(Percentile, SizeOfZeroWritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0}, tests::Size{0, 4}, tests::Size{4, 4, 0}}) {
    Image<short> in(size, {1, 1}, 1);
    Image<short> out({size.width, size.height}, {1, 1});
    FillBytes(out);
    UnitBins({1, 3}).Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(Percentile, OutputMayBeTheInput) {
  Image<float> image({300, 3}, {1, 1});
  image.Set([](int x, int y, std::uint32_t) { return (x + y) % 3; });
  UnitBins({1, 3}).Process(&image, nullptr, &image);
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 300; ++x) {
      const float kExpected[] = {0.0f, 25.0f, 100.0f};
      EXPECT_EQ(image.At(x, y), kExpected[(x + y) % 3]) << x << ", " << y;
    }
  }
}

// ---- the splines

details::PercentileParams Params(const std::vector<float>& min, const std::vector<float>& max, int bins,
                                 const std::vector<int>& counts) {
  details::PercentileParams params;
  params.SetMinData(min);
  params.SetMaxData(max);
  params.SetBinNum(bins);
  params.SetCoefficients(counts);
  return params;
}

TEST(PercentileSplines, TablesAgreeWithTheTwinBitForBit) {
  tests::Random random(7);
  for (int i = 0; i < 300; ++i) {
    const std::uint32_t bins = random.Below(40), channels = random.Below(4);
    constexpr float kEdges[] = {0.0f, 1.0f, 255.0f, -128.0f, 0.1f, 1e-38f, 3e38f, kInfinity, kNaN, 100.0f};
    std::vector<float> min(channels), max(channels);
    for (float& edge : min) edge = random.Pick(kEdges);
    for (float& edge : max) edge = random.Pick(kEdges);
    std::vector<int> counts;
    for (std::uint32_t c = 0; c < channels; ++c) {
      const std::vector<int> own = tests::DrawCounts(random, bins);
      counts.insert(counts.end(), own.begin(), own.end());
    }
    const details::PercentileParams params = Params(min, max, static_cast<int>(bins), counts);
    const auto expected = reference::PercentileSplines(params);
    ASSERT_EQ(params.cumulative.size(), channels);
    for (std::uint32_t c = 0; c < channels; ++c) {
      const std::vector<int> own(counts.begin() + bins * c, counts.begin() + bins * (c + 1));
      EXPECT_EQ(params.totals[c], reference::TotalOf(own));
      EXPECT_TRUE(SameBlock({reference::BinScale(params, c)}, &params.binScale[c]));
      ASSERT_EQ(params.cumulative[c].size(), bins + 2);
      EXPECT_TRUE(SameBlock(expected[c].cumulative, params.cumulative[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].alpha, params.alpha[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].linear, params.linear[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].quadratic, params.quadratic[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].cubic, params.cubic[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].diagonal, params.diagonal[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].mu, params.mu[c].data()));
      EXPECT_TRUE(SameBlock(expected[c].z, params.z[c].data()));
    }
  }
}

// Deliberate: the spline's system is its own, with 2 (2 - mu) where a natural spline has 4 - mu.
TEST(PercentileSplines, SystemIsItsOwnWith2Times2MinusMuWhereANaturalSplineHas4MinusMu) {
  const details::PercentileParams unit = Params({0}, {4}, 4, {1, 1, 1, 1});
  EXPECT_TRUE(SameBlock({1.0, 4.0, 3.5, (2.0 - 1.0 / 3.5) * 2.0}, unit.diagonal[0].data()));
  EXPECT_TRUE(SameBlock({0.0, 0.25, 1.0 / 3.5}, unit.mu[0].data()));
  const details::PercentileParams half = Params({0}, {8}, 4, {1, 1, 1, 1});
  EXPECT_TRUE(SameBlock({1.0, 8.0, 7.0}, half.diagonal[0].data()));
}

TEST(PercentileSplines, CoefficientsOfTwoBins) {
  const details::PercentileParams params = Params({0}, {2}, 2, {1, 3});
  EXPECT_TRUE(SameBlock({0, 25, 100, 100}, params.cumulative[0].data()));
  EXPECT_TRUE(SameBlock({0, 150, -225, 0}, params.alpha[0].data()));
  EXPECT_TRUE(SameBlock({6.25, 62.5, 50, 0}, params.linear[0].data()));
  EXPECT_TRUE(SameBlock({0, 56.25, -75, 0}, params.quadratic[0].data()));
  EXPECT_TRUE(SameBlock({18.75, -43.75, 25, 0}, params.cubic[0].data()));
  EXPECT_TRUE(SameBlock({0, 37.5, -75, 0}, params.z[0].data()));
}

// Deliberate: counts are multiplied by 100 in 32 bits and wrap above 21474836.
TEST(PercentileSplines, CountsAreMultipliedBy100In32BitsAndWrapAbove21474836) {
  EXPECT_EQ(Params({0}, {2}, 2, {21474836, 0}).cumulative[0][1], 100.0);
  EXPECT_EQ(Params({0}, {2}, 2, {21474837, 0}).cumulative[0][1], -2147483596.0 / 21474837.0);
  EXPECT_EQ(Params({0}, {2}, 2, {42949673, 0}).cumulative[0][1], 4.0 / 42949673.0);
  EXPECT_EQ(PercentileOf(UnitBins({21474836, 0}), 1.0f), 100.0f);
  EXPECT_EQ(PercentileOf(UnitBins({21474837, 0}), 1.0f), static_cast<float>(-2147483596.0 / 21474837.0));
}

TEST(PercentileSplines, TotalIsASumOf32Bits) {
  const details::PercentileParams params = Params({0}, {2}, 2, {2147483647, 1});
  EXPECT_EQ(params.totals[0], std::numeric_limits<int>::min());
  EXPECT_EQ(params.cumulative[0][1], -100.0 / -2147483648.0);
  const details::PercentileParams none = Params({0}, {3}, 3, {2147483647, 2147483647, 2});
  EXPECT_EQ(none.totals[0], 0);
  EXPECT_TRUE(SameBlock({0, 0, 0, 0, 100}, none.cumulative[0].data()));
}

TEST(PercentileSplines, ChannelOfZerosHasKnotsOf0AndALastOneOf100) {
  const details::PercentileParams params = Params({0, 0}, {3, 3}, 3, {0, 0, 0, 1, 1, 1});
  EXPECT_EQ(params.totals, (std::vector<int>{0, 3}));
  EXPECT_TRUE(SameBlock({0, 0, 0, 0, 100}, params.cumulative[0].data()));
  EXPECT_GT(params.cumulative[1][1], 33.0);
  Percentile percentile = UnitBins({0, 0, 0});
  EXPECT_EQ(PercentileOf(percentile, 1.0f), 0.0f);
  EXPECT_EQ(PercentileOf(percentile, 2.0f), 0.0f);
  EXPECT_LT(PercentileOf(percentile, 2.5f), -1.0f);
}

TEST(PercentileSplines, KnotBeyondTheLastBinIsLevelWithTheLastKnot) {
  const std::vector<int> kHistograms[] = {{1, 1, 1}, {3, 7, 11, 13}, {0, 0, 9}, {5}};
  for (const std::vector<int>& counts : kHistograms) {
    const int bins = static_cast<int>(counts.size());
    const details::PercentileParams params = Params({0}, {1}, bins, counts);
    EXPECT_NEAR(params.cumulative[0][counts.size()], 100.0, 1e-12);
    EXPECT_EQ(params.cumulative[0][counts.size() + 1], 100.0);
  }
}

TEST(PercentileSplines, ScaleIsAQuotientInFloat) {
  const details::PercentileParams params = Params({0.1f}, {0.7f}, 3, {1, 1, 1});
  EXPECT_EQ(params.binScale[0], static_cast<double>(3.0f / (0.7f - 0.1f)));
  EXPECT_EQ(Params({5}, {5}, 3, {1, 1, 1}).binScale[0], kInfinity);
}

TEST(PercentileSplines, NoMaximumAtTheTimeOfTheCountsLeavesNoTablesAndDoesNoHarm) {
  Percentile percentile;
  percentile.SetBinNum(2);
  percentile.SetCoefficients({1, 3});
  EXPECT_TRUE(percentile.cumulative.empty());
  EXPECT_TRUE(percentile.binScale.empty());
  EXPECT_EQ(percentile.Coefficients, (std::vector<int>{1, 3}));
  percentile.SetNoData(-1.0f);
  percentile.SetMinData({0.0f});
  percentile.SetMaxData({2.0f});
  EXPECT_EQ(PercentileOf(percentile, 1.0f), 25.0f);
  EXPECT_TRUE(percentile.cumulative.empty());
}

TEST(PercentileSplines, ProcessorBuildsItsTablesFromTheRangesOfItsOwnMoment) {
  Percentile percentile = UnitBins({1, 3});
  percentile.SetMinData({10.0f});
  percentile.SetMaxData({14.0f});
  EXPECT_EQ(PercentileOf(percentile, 12.0f), 25.0f);
  EXPECT_EQ(PercentileOf(percentile, 1.0f), 0.0f);
  EXPECT_EQ(percentile.binScale[0], 1.0);
}

TEST(PercentileSplines, SecondCallKeepsTheLengthOfTheRowsThatStand) {
  details::PercentileParams params = Params({0}, {4}, 4, {1, 1, 1, 1});
  params.SetBinNum(2);
  params.SetMaxData({2, 2});
  params.SetMinData({0, 0});
  params.SetCoefficients({1, 3, 2, 3});
  ASSERT_EQ(params.cumulative.size(), 2u);
  EXPECT_EQ(params.cumulative[0].size(), 6u);
  EXPECT_EQ(params.cumulative[1].size(), 4u);
  EXPECT_TRUE(SameBlock({0, 25, 100, 100}, params.cumulative[0].data()));
  EXPECT_TRUE(SameBlock({0, 40, 100, 100}, params.cumulative[1].data()));
  EXPECT_TRUE(SameBlock({6.25, 62.5, 50}, params.linear[0].data()));
}

// ---- failures

struct PercentileFailure : ::testing::Test {
  Image<short> in{{3, 2}, {1, 1}, 1};
  Image<short> out{{3, 2}, {1, 1}};
  const Percentile percentile = UnitBins({2, 3});

  PercentileFailure() { FillBytes(out); }
};

TEST_F(PercentileFailure, TypesOutsideTheListAndComplexOnesAreInvalid) {
  std::vector<DataType> invalid = {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)};
  for (const PixelType& type : tests::kPixelTypes) invalid.emplace_back(type.element, true);
  for (const DataType& type : invalid) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { percentile.Process(&odd, nullptr, &out); }));
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { percentile.Process(&in, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(out));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

// ---- differential

struct Range {
  float min, max;
};

/// An operator with histograms of its own, in most cases over ranges in which samples lie.
Percentile DrawPercentile(tests::Random& random, std::uint32_t channels) {
  constexpr Range kRanges[] = {{0, 100},        {-0.5f, 3.5f},  {8, 60},          {-128, 127},
                               {0, 255},        {0, 65535},     {-1e9f, 1e9f},    {10, 40.7f},
                               {0.1f, 70.3f},   {5, 5},         {50, 10},         {-3e38f, 3e38f},
                               {-1e20f, 1e20f}, {0, kInfinity}, {-kInfinity, 50}, {kNaN, 50.0f},
                               {0, kNaN},       {0, 1e-30f},    {-1e-3f, 1e-40f}, {0, 2e19f}};
  constexpr float kNoData[] = {0.0f,   -1.0f, 3.0f, 44.0f, 255.0f, -128.0f,   16777216.0f, -32768.0f, 1e20f,
                               -1e20f, 2.5f,  0.1f, kNaN,  20.0f,  kInfinity, -kInfinity,  5e-10f,    1e10f};
  constexpr std::uint32_t kBins[] = {0, 1, 2, 3, 4, 5, 16, 33, 64, 100, 255, 256, 1000};
  const std::uint32_t bins = channels > 8 ? 1 + random.Below(30) : random.Pick(kBins);
  const std::uint32_t splines = channels + (random.OneIn(5) ? 1 : 0);
  std::vector<float> min, max;
  std::vector<int> counts;
  for (std::uint32_t c = 0; c < splines; ++c) {
    const Range range = random.Pick(kRanges);
    min.push_back(range.min);
    max.push_back(range.max);
    const std::vector<int> own = tests::DrawCounts(random, bins);
    counts.insert(counts.end(), own.begin(), own.end());
  }
  Percentile percentile;
  percentile.SetMinData(min);
  percentile.SetMaxData(max);
  percentile.SetNoData(random.Pick(kNoData));
  percentile.SetBinNum(static_cast<int>(bins));
  percentile.SetCoefficients(counts);
  return percentile;
}

/// Samples on and beside what the operator compares with.
std::vector<double> NearbyOf(const Percentile& percentile, tests::Random& random) {
  std::vector<double> near = {percentile.NoData, percentile.NoData + 6e-10, percentile.NoData - 1e-9};
  for (std::size_t c = 0; c < std::min<std::size_t>(3, percentile.MaxData.size()); ++c) {
    const float edge = percentile.MinData[c] + static_cast<float>(random.Below(12) / percentile.binScale[c]);
    near.insert(near.end(), {percentile.MinData[c], percentile.MaxData[c], edge, edge + 0.25});
  }
  const std::size_t exact = near.size();
  for (std::size_t i = 3; i < exact; ++i) {
    const auto narrowed = static_cast<float>(near[i]);
    near.push_back(std::nextafter(narrowed, kInfinity));
    near.push_back(std::nextafter(narrowed, -kInfinity));
  }
  return near;
}

/// The cases of one input type, with rows longer than any block.
std::vector<tests::Case> CasesOf(const PixelType& in) {
  std::vector<tests::Case> cases = tests::CasesFrom(in, {.outputHasInputChannels = true});
  for (tests::Case& c : cases) {
    tests::Random random(c.seed + 1);
    if (c.size.width == 601) c.size.width = 2040 + random.Below(200);
    c.in.isComplex = false;
  }
  return cases;
}

struct PercentileDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(PercentileDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : CasesOf(GetParam())) {
    tests::Random random(~c.seed);
    const Percentile percentile = DrawPercentile(random, c.size.channels);
    const std::vector<double> near = NearbyOf(percentile, random);
    const ::testing::AssertionResult result = Agree(
        c, near, [&](Raster* in, Mask* mask, Raster* out) { percentile.Process(in, mask, out); },
        [&](const Raster& in, const Mask*, Raster& out) { reference::Percentile(percentile, in, out); });
    ASSERT_TRUE(result) << "NoData " << percentile.NoData << ", BinNum " << percentile.BinNum;
  }
}

INSTANTIATE_TEST_SUITE_P(From, PercentileDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

TEST(PercentileOfManySamples, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  const Percentile percentile = DrawPercentile(random, 1);
  Raster in({2100, 2050, 1, tessel::eDT_8U}, {});
  FillRandom(in, tests::Fill::eSMOOTH, random, NearbyOf(percentile, random));
  Raster expected({2100, 2050, 1, tessel::eDT_64F}, {3, 1}), actual(expected, expected);
  FillBytes(expected);
  FillBytes(actual);
  reference::Percentile(percentile, in, expected);
  percentile.Process(&in, nullptr, &actual);
  EXPECT_TRUE(SameBits(expected, actual));
}

struct PercentileOfNarrowIntegers : ::testing::TestWithParam<PixelType> {};

// A processor that has met many samples of few values may know all results by then.
TEST_P(PercentileOfNarrowIntegers, AgreesWithTheTwinForEverySampleAgainAndAgain) {
  for (const PixelType& outType : tests::kPixelTypes) {
    tests::Random random(static_cast<std::uint64_t>(outType.element));
    for (const std::uint32_t channels : {1u, 2u, 3u, 4u, 6u}) {
      const Percentile percentile = DrawPercentile(random, channels);
      Raster in({256, 256, channels, GetParam().element}, {1, 0});
      for (std::size_t i = 0; i < in.dataSize; ++i) {
        const std::size_t pixel = i / (channels * in.dataType.sizeBits / 8);
        const bool isHighByte = in.dataType.sizeBits == 16 && i % 2 != 0;
        in.data[i] = static_cast<unsigned char>(isHighByte ? pixel >> 8 : pixel);
      }
      Raster expected({256, 256, channels, outType.element}, {0, 1}), actual(expected, expected);
      FillBytes(expected);
      reference::Percentile(percentile, in, expected);
      for (int call = 0; call < 3; ++call) {
        FillBytes(actual);
        percentile.Process(&in, nullptr, &actual);
        ASSERT_TRUE(SameBits(expected, actual)) << outType << ", " << channels << " channels, call " << call;
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(From, PercentileOfNarrowIntegers,
                         ::testing::ValuesIn(tests::kPixelTypes.begin(), tests::kPixelTypes.begin() + 4),
                         ::testing::PrintToStringParamName());

// ---- contract

TEST(PercentileContract, EveryParameterTravelsWithARebuild) {
  Percentile percentile = UnitBins({1, 1, 2});
  EXPECT_EQ((PercentileOf<float, short>(percentile, 1)), 25.0f);
  percentile.SetMinData({10.0f});
  percentile.SetMaxData({14.0f});
  percentile.SetNoData(13.0f);
  percentile.SetBinNum(2);
  percentile.SetCoefficients({2, 3});
  EXPECT_EQ((PercentileOf<float, short>(percentile, 1)), 25.0f);
  EXPECT_EQ((PercentileOf<float, short>(percentile, 2)), 50.0f);
  EXPECT_EQ((PercentileOf<float, short>(percentile, -1)), -1.0f);
  EXPECT_EQ((PercentileOf<float, short>(percentile, 12)), 100.0f);
  EXPECT_EQ((PercentileOf<float, int>(percentile, 12)), 40.0f);
  EXPECT_EQ((PercentileOf<float, int>(percentile, 13)), 13.0f);
  EXPECT_EQ((PercentileOf<float, int>(percentile, 14)), 100.0f);
  EXPECT_EQ((PercentileOf<float, int>(percentile, 1)), 0.0f);
}

TEST(PercentileContract, OneProcessorTakesRastersOfOtherChannels) {
  Percentile percentile;
  percentile.SetMinData({0.0f, 10.0f});
  percentile.SetMaxData({2.0f, 14.0f});
  percentile.SetNoData(-1.0f);
  percentile.SetBinNum(2);
  percentile.SetCoefficients({1, 3, 2, 3});
  for (int call = 0; call < 2; ++call) {
    EXPECT_EQ(PixelOf<float>(percentile, {1.0f}), (std::vector<float>{25}));
    EXPECT_EQ(PixelOf<float>(percentile, {1.0f, 12.0f}), (std::vector<float>{25, 40}));
  }
}

static_assert(std::is_base_of_v<details::PercentileParams, Percentile>);
static_assert(!std::is_polymorphic_v<Percentile>);

}  // namespace
}  // namespace orvik::filters
