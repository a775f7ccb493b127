#include "processes/gridmill/intenpercent.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/cumulativespline_reference.h"
#include "tests/reference/intenpercent_reference.h"
#include "tests/support/cases.h"
#include "tests/support/compare.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/splines.h"

namespace orvik::filters {
namespace {

using changedetection::DiffType;
using changedetection::eDIFF_ABSOLUTE;
using changedetection::eDIFF_BACKWARD;
using changedetection::eDIFF_FORWARD;
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

/// An operator with one bin for each unit, from 0 on.
IntenPercent UnitBins(const std::vector<int>& bins, DiffType type = eDIFF_ABSOLUTE) {
  IntenPercent percent;
  percent.SetMin(0.0);
  percent.SetMax(static_cast<double>(bins.size()));
  percent.SetScale(1.0);
  percent.SetNoData(-1.0);
  percent.SetBins(bins);
  percent.SetType(type);
  return percent;
}

/// A spline that falls to -13.3 at 6 and rises to 109.05 at 22. The range is 0 to 40.
IntenPercent Overshooting() {
  IntenPercent percent = UnitBins({0, 10, 0, 0});
  percent.SetMax(40.0);
  percent.SetScale(0.1);
  return percent;
}

/// The samples of one output pixel.
template <class Out, class In>
std::vector<Out> RunOn(const IntenPercent& percent, const std::vector<In>& pixel, bool isValid = true,
                       std::uint32_t outChannels = 4) {
  Image<In> in({1, 1, static_cast<std::uint32_t>(pixel.size())});
  std::copy(pixel.begin(), pixel.end(), in.Elements());
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1, outChannels}, {}, static_cast<Out>(kUnwritten));
  percent.Process(&in, &mask, &out);
  return {out.Elements(), out.Elements() + outChannels};
}

/// The same by a copy of an operator that has not run, so that each call takes its own output type.
template <class Out, class In>
std::vector<Out> Percents(const IntenPercent& percent, const std::vector<In>& pixel, bool isValid = true,
                          std::uint32_t outChannels = 4) {
  return RunOn<Out, In>(IntenPercent(percent), pixel, isValid, outChannels);
}

/// The percentile of one intensity, with two equal values beside it.
template <class Out = float, class In = float>
Out Percent(const IntenPercent& percent, In intensity) {
  return Percents<Out, In>(percent, {1, 1, intensity})[3];
}

/// The percentile of the intensity 1 beside two values.
template <class Out = float, class In>
Out Signed(const IntenPercent& percent, In first, In second) {
  return Percents<Out, In>(percent, {first, second, 1})[3];
}

// ---- golden

TEST(IntenPercent, IntensityInTheMiddleOfAnEvenHistogramGives50) {
  EXPECT_EQ(Percent(UnitBins({1, 1, 1, 1}), 2.0f), 50.0f);
}

TEST(IntenPercent, CubicIsEvaluatedInsideABin) {
  const IntenPercent percent = UnitBins({1, 3});
  EXPECT_EQ(Percent(percent, 0.5f), 5.46875f);   // 6.25 / 2 + 18.75 / 8
  EXPECT_EQ(Percent(percent, 1.5f), 64.84375f);  // 25 + 62.5 / 2 + 56.25 / 4 - 43.75 / 8
  EXPECT_EQ(Percent<double>(percent, 0.25f), 1.85546875);
}

TEST(IntenPercent, SplineIsAddedUpInItsOwnOrder) {
  // 74.999999999999986 and 99.999999999999986, by Horner's rule 75 and 100
  IntenPercent quarters = UnitBins({4, 2, 3});
  quarters.SetMax(12.0);
  quarters.SetScale(0.25);
  EXPECT_EQ((Percent<float, int>(quarters, 9)), 74.0f);
  IntenPercent twentieths = UnitBins({5, 1, 0});
  twentieths.SetMax(60.0);
  twentieths.SetScale(static_cast<double>(0.05f));
  EXPECT_EQ((Percent<float, int>(twentieths, 59)), 99.0f);
}

TEST(IntenPercent, IntensityOnABinEdgeGivesTheCumulativePercentage) {
  const IntenPercent percent = UnitBins({4, 2, 1, 1});
  EXPECT_EQ(Percent(percent, 1.0f), 50.0f);
  EXPECT_EQ(Percent(percent, 2.0f), 75.0f);
  EXPECT_EQ(Percent(percent, 3.0f), 87.5f);
  EXPECT_EQ((Percent<float, unsigned char>(percent, 3)), 87.0f);
  EXPECT_EQ((Percent<unsigned char, float>(percent, 3)), 88);
}

TEST(IntenPercent, EndsOfTheRangeGive0And100) {
  const IntenPercent percent = UnitBins({1, 3});
  EXPECT_EQ(Percent(percent, 0.0f), 0.0f);
  EXPECT_EQ(Percent(percent, -0.5f), 0.0f);
  EXPECT_EQ(Percent(percent, -kInfinity), 0.0f);
  EXPECT_EQ(Percent(percent, 2.0f), 100.0f);
  EXPECT_EQ(Percent(percent, 1e20f), 100.0f);
  EXPECT_EQ(Percent(percent, kInfinity), 100.0f);
}

TEST(IntenPercent, ConstantsPassTheInputsTypeBy) {
  const IntenPercent percent = UnitBins({1, 3});
  for (const PixelType& inType : tests::kPixelTypes) {
    for (const PixelType& outType : tests::kPixelTypes) {
      tests::WithPixelTypes(inType.element, outType.element, [&]<class In, class Out>() {
        EXPECT_EQ((Percent<Out, In>(percent, In{0})), Out{0}) << inType << " -> " << outType;
        EXPECT_EQ((Percent<Out, In>(percent, In{2})), Out{100}) << inType << " -> " << outType;
      });
    }
  }
}

TEST(IntenPercent, EmptyHistogramGives100InsideTheRange) {
  IntenPercent percent = UnitBins({});
  percent.SetMax(4.0);
  EXPECT_EQ(Percent(percent, 1.0f), 100.0f);
  EXPECT_EQ(Percent(percent, 1e-30f), 100.0f);
  EXPECT_EQ(Percent(percent, 0.0f), 0.0f);
  EXPECT_EQ(Percent(percent, 4.0f), 100.0f);
}

TEST(IntenPercent, MinimumAtOrAboveTheMaximumGives0UpToItAnd100Beyond) {
  for (const double max : {3.0, 1.0, -5.0}) {
    IntenPercent percent = UnitBins({1, 1, 1, 1});
    percent.SetMin(3.0);
    percent.SetMax(max);
    EXPECT_EQ(Percent(percent, 3.0f), 0.0f) << max;
    EXPECT_EQ(Percent(percent, 2.0f), 0.0f) << max;
    EXPECT_EQ(Percent(percent, 3.5f), 100.0f) << max;
    EXPECT_EQ(Percent(percent, 9.0f), 100.0f) << max;
  }
}

TEST(IntenPercent, MaximumWithinTheBinsGives100) {
  IntenPercent percent = UnitBins({1, 1, 1, 1});
  percent.SetMax(2.0);
  EXPECT_EQ(Percent(percent, 1.0f), 25.0f);
  EXPECT_EQ(Percent(percent, 2.0f), 100.0f);
  EXPECT_EQ(Percent(percent, 3.0f), 100.0f);
}

TEST(IntenPercent, BinBeyondTheLastGives100AndANegativeBin0) {
  IntenPercent wide = UnitBins({1, 3});
  wide.SetMax(10.0);
  EXPECT_EQ(Percent(wide, 2.0f), 100.0f);
  EXPECT_EQ(Percent(wide, 9.0f), 100.0f);
  IntenPercent reversed = UnitBins({1, 3});
  reversed.SetScale(-1.0);
  EXPECT_EQ(Percent(reversed, 0.5f), 0.0f);
  EXPECT_EQ(Percent(reversed, 1.5f), 0.0f);
  IntenPercent empty = UnitBins({});
  empty.SetMax(4.0);
  empty.SetScale(-1.0);
  EXPECT_EQ(Percent(empty, 1.0f), 0.0f);
}

TEST(IntenPercent, BinThatLeaves32BitsIsNegative) {
  IntenPercent percent = UnitBins({1, 3});
  percent.SetScale(1e10);
  EXPECT_EQ(Percent(percent, 1.0f), 0.0f);
  EXPECT_EQ(Percent(percent, 0.125f), 100.0f);
  percent = UnitBins({1, 3});
  percent.SetScale(std::numeric_limits<double>::quiet_NaN());
  EXPECT_EQ(Percent(percent, 1.0f), 0.0f);
}

TEST(IntenPercent, NaNIntensityGives0) {
  EXPECT_EQ(Percent(UnitBins({1, 3}), kNaN), 0.0f);
  EXPECT_EQ((Percent<unsigned char, double>(UnitBins({1, 3}), kNaN)), 0);
  IntenPercent noData = UnitBins({1, 3});
  noData.SetNoData(kNaN);
  EXPECT_EQ(Percent(noData, kNaN), 0.0f);
}

TEST(IntenPercent, ScaleOf0GivesNaN) {
  IntenPercent percent = UnitBins({1, 3});
  percent.SetScale(0.0);
  EXPECT_TRUE(std::isnan(Percent(percent, 1.0f)));
}

TEST(IntenPercent, RangeAndScaleAreDouble) {
  IntenPercent percent = UnitBins({1, 1});
  percent.SetMax(0.1);  // below the `float` that is called 0.1
  percent.SetScale(20.0);
  EXPECT_EQ(Percent(percent, 0.1f), 100.0f);
  percent = UnitBins({1, 1});
  percent.SetMin(0.7);  // above that of 0.7
  EXPECT_EQ(Percent(percent, 0.7f), 0.0f);
  percent = UnitBins({1, 1});
  percent.SetMin(0.1);
  EXPECT_GT(Percent(percent, 0.1f), 0.0f);
  percent = UnitBins({1, 3});
  percent.SetMin(16777217.0);
  percent.SetMax(16777219.0);
  EXPECT_EQ((Percent<float, int>(percent, 16777218)), 25.0f);
  percent = UnitBins({1, 1, 1, 1});
  percent.SetMin(0.1);
  percent.SetScale(1.0 / 0.3);
  const auto spline = reference::SplineThrough({0, 25, 50, 75, 100, 100}, 1.0 / 0.3);
  const double dx = static_cast<double>(0.5f) - (1 / (1.0 / 0.3) + 0.1);
  EXPECT_EQ(Percent<double>(percent, 0.5f), static_cast<double>(static_cast<float>(ValueOf(spline, 1, dx))));
}

TEST(IntenPercent, IntensityPassesThroughFloat) {
  const IntenPercent percent = UnitBins({1, 3});
  EXPECT_EQ((Percent<double, double>(percent, 1.0 - 1e-12)), 25.0);
  EXPECT_EQ((Percent<double, double>(percent, 2.0 - 1e-12)), 100.0);
  EXPECT_EQ((Percent<double, double>(percent, 0.5)), 5.46875);
  EXPECT_EQ((Percent<double, double>(percent, 1.7)),
            static_cast<double>(Percent<float, float>(percent, 1.7f)));
}

TEST(IntenPercent, ThreeChannelsPassThroughClipTo) {
  const IntenPercent percent = UnitBins({1, 1});
  EXPECT_EQ((Percents<short, short>(percent, {-300, 301, 1})), (std::vector<short>{-300, 301, 1, 50}));
  EXPECT_EQ((Percents<unsigned char, short>(percent, {-300, 301, 1})),
            (std::vector<unsigned char>{0, 255, 1, 50}));
  EXPECT_EQ((Percents<short, float>(percent, {2.5f, -2.5f, 1.5f}))[0], 3);
  EXPECT_EQ((Percents<short, float>(percent, {2.5f, -2.5f, 1.5f}))[1], -3);
  EXPECT_EQ((Percents<short, float>(percent, {2.5f, -2.5f, 1.5f}))[2], 2);
  EXPECT_EQ((Percents<int, float>(percent, {8388609.0f, kNaN, 1}))[0], 8388610);
  EXPECT_EQ((Percents<int, float>(percent, {8388609.0f, kNaN, 1}))[1], std::numeric_limits<int>::min());
  EXPECT_EQ((Percents<int, double>(percent, {8388609.0, 0, 1}))[0], 8388609);
  EXPECT_EQ((Percents<double, double>(percent, {1e300, 0.1, 1}))[0], 1e300);
  EXPECT_EQ((Percents<double, double>(percent, {1e300, 0.1, 1}))[1], 0.1);
  EXPECT_EQ((Percents<unsigned char, std::int64_t>(percent, {-1, 300, 1}))[0], 255);
  EXPECT_EQ((Percents<unsigned char, std::int64_t>(percent, {-1, 300, 1}))[1], 255);
  EXPECT_EQ((Percents<std::int64_t, char>(percent, {-5, 5, 1}))[0], 0);
  EXPECT_EQ((Percents<std::int64_t, double>(percent, {-5.5, 5.9, 1}))[1], 5);
  const std::int64_t least = std::numeric_limits<std::int64_t>::min();
  EXPECT_EQ((Percents<std::int64_t, std::int64_t>(percent, {least, -1, 1}))[0], least);
}

TEST(IntenPercent, OvershootOfAFloatingInputStaysUntilItIsWritten) {
  const IntenPercent percent = Overshooting();
  EXPECT_NEAR(Percent(percent, 6.0f), -13.3387, 1e-4);
  EXPECT_NEAR((Percent<double, double>(percent, 22.0)), 109.0453, 1e-4);
  EXPECT_EQ(Percent<unsigned char>(percent, 6.0f), 0);
  EXPECT_EQ(Percent<char>(percent, 6.0f), -13);
  EXPECT_EQ(Percent<unsigned int>(percent, 22.0f), 109u);
  EXPECT_EQ(Percent<std::int64_t>(percent, 6.0f), 0);
  EXPECT_EQ(Percent<std::int64_t>(percent, 22.0f), 109);
}

TEST(IntenPercent, ResultOf64BitOutputsIsNotRounded) {
  const IntenPercent percent = UnitBins({1, 3});
  EXPECT_EQ(Percent<std::int64_t>(percent, 1.5f), 64);  // 64.84375
  EXPECT_EQ(Percent<std::uint64_t>(percent, 1.5f), 64u);
  EXPECT_EQ(Percent<int>(percent, 1.5f), 65);
}

TEST(IntenPercent, NoDataIntensityKeepsTheThreeChannelsAndWritesItsOwnValue) {
  IntenPercent percent = UnitBins({1, 3}, eDIFF_FORWARD);
  percent.SetNoData(1.0);
  EXPECT_EQ((Percents<short, short>(percent, {5, 9, 1})), (std::vector<short>{5, 9, 1, 1}));
  percent = UnitBins({1, 3}, eDIFF_FORWARD);
  percent.SetNoData(-2.5);
  EXPECT_EQ((Percents<short, float>(percent, {5, 9, -2.5f})), (std::vector<short>{5, 9, -3, -3}));
  percent = UnitBins({1, 3});
  percent.SetNoData(300.0);
  EXPECT_EQ((Percents<unsigned char, int>(percent, {5, 9, 300})),
            (std::vector<unsigned char>{5, 9, 255, 255}));
}

TEST(IntenPercent, NoDataIsComparedExactlyInFloat) {
  IntenPercent percent = UnitBins({1, 3});
  percent.SetNoData(0.1);
  EXPECT_EQ(Percent<double>(percent, 0.1f), static_cast<double>(0.1f));
  EXPECT_NE(Percent(percent, std::nextafter(0.1f, 1.0f)), std::nextafter(0.1f, 1.0f));
  EXPECT_NE(Percent(percent, std::nextafter(0.1f, 0.0f)), std::nextafter(0.1f, 0.0f));
  percent = UnitBins({1, 3});
  percent.SetNoData(0.1);
  EXPECT_EQ((Percent<double, double>(percent, 0.1)), static_cast<double>(0.1f));
  EXPECT_EQ((Percent<double, double>(percent, 0.1 + 1e-12)), static_cast<double>(0.1f));
  percent = UnitBins({1, 3});
  percent.SetNoData(0.0);
  EXPECT_EQ(Percent(percent, 5e-10f), Percent(UnitBins({1, 3}), 5e-10f));
  EXPECT_TRUE(std::signbit(Percent(percent, -0.0f)));
  percent = UnitBins({1, 3});
  percent.SetNoData(16777217.0);
  EXPECT_EQ((Percent<int, int>(percent, 16777216)), 16777216);
  EXPECT_EQ((Percent<int, int>(percent, 16777215)), 100);
  percent = UnitBins({1, 3});
  percent.SetNoData(1e300);
  EXPECT_EQ(Percent(percent, kInfinity), kInfinity);
  EXPECT_EQ(Percent(percent, 3e38f), 100.0f);
}

TEST(IntenPercent, NoDataIs0ByDefault) {
  EXPECT_EQ(IntenPercent().NoData, 0.0);
  IntenPercent percent;
  percent.SetMin(-2.0);
  percent.SetMax(2.0);
  percent.SetScale(0.5);
  percent.SetBins({1, 1});
  percent.SetType(eDIFF_ABSOLUTE);
  EXPECT_EQ(Percent(percent, 0.0f), 0.0f);
  EXPECT_NEAR(Percent(percent, 1e-6f), 50.0, 1e-3);
}

// Deliberate: an excluded pixel holds `NoData` cast to the input's type in all four samples.
TEST(IntenPercent, ExcludedPixelHoldsNoDataCastToTheInputsTypeInAllFourSamples) {
  IntenPercent percent = UnitBins({1, 3});
  percent.SetNoData(300.9);
  EXPECT_EQ((Percents<double, unsigned char>(percent, {5, 9, 1}, false)), std::vector<double>(4, 44.0));
  percent = UnitBins({1, 3});
  percent.SetNoData(-1.5);
  EXPECT_EQ((Percents<short, unsigned short>(percent, {5, 9, 1}, false)), std::vector<short>(4, 32767));
  EXPECT_EQ((Percents<float, int>(percent, {5, 9, 1}, false)), std::vector<float>(4, -1.0f));
  EXPECT_EQ((Percents<short, float>(percent, {5, 9, 1}, false)), std::vector<short>(4, -2));
  EXPECT_EQ((Percents<std::int64_t, double>(percent, {5, 9, 1}, false)), std::vector<std::int64_t>(4, 0));
  EXPECT_EQ((Percents<unsigned char, std::int64_t>(percent, {5, 9, 1}, false)),
            std::vector<unsigned char>(4, 255));
  percent = UnitBins({1, 3});
  percent.SetNoData(0.1);
  EXPECT_EQ((Percents<double, double>(percent, {5, 9, 1}, false)), std::vector<double>(4, 0.1));
  EXPECT_EQ((Percents<double, float>(percent, {5, 9, 1}, false)),
            std::vector<double>(4, static_cast<double>(0.1f)));
  percent = UnitBins({1, 3});
  percent.SetNoData(kNaN);
  EXPECT_EQ((Percents<int, int>(percent, {5, 9, 1}, false)),
            std::vector<int>(4, std::numeric_limits<int>::min()));
  EXPECT_EQ((Percents<int, unsigned char>(percent, {5, 9, 1}, false)), std::vector<int>(4, 0));
}

TEST(IntenPercent, ExcludedPixelOfANegativeZeroKeepsItsSignOnlyInAFloatingInput) {
  const auto isNegative = []<class In>(double noData, In sample) {
    IntenPercent percent = UnitBins({1, 3});
    percent.SetNoData(noData);
    return std::signbit(Percents<double, In>(percent, {sample, sample, sample}, false)[3]);
  };
  EXPECT_FALSE(isNegative(-0.25, short{1}));
  EXPECT_FALSE(isNegative(-0.0, 1));
  EXPECT_FALSE(isNegative(-0.25, std::int64_t{1}));
  EXPECT_TRUE(isNegative(-0.0, 1.0f));
  EXPECT_TRUE(isNegative(-0.0, 1.0));
}

TEST(IntenPercent, ForwardReversesTheSignWhereTheSecondValueIsAboveTheFirst) {
  const IntenPercent percent = UnitBins({2, 3}, eDIFF_FORWARD);
  EXPECT_EQ(Signed(percent, 5.0f, 6.0f), -40.0f);
  EXPECT_EQ(Signed(percent, 6.0f, 5.0f), 40.0f);
  EXPECT_EQ(Signed(percent, 5.0f, 5.0f), 40.0f);
  EXPECT_EQ(Signed(percent, kNaN, 5.0f), 40.0f);
  EXPECT_EQ(Signed(percent, 5.0f, kNaN), 40.0f);
  EXPECT_EQ(Signed(percent, -0.0f, 0.0f), 40.0f);
}

TEST(IntenPercent, BackwardReversesTheSignWhereTheFirstValueIsAboveTheSecond) {
  const IntenPercent percent = UnitBins({2, 3}, eDIFF_BACKWARD);
  EXPECT_EQ(Signed(percent, 6.0f, 5.0f), -40.0f);
  EXPECT_EQ(Signed(percent, 5.0f, 6.0f), 40.0f);
  EXPECT_EQ(Signed(percent, 5.0f, 5.0f), 40.0f);
  EXPECT_EQ(Signed(percent, kNaN, 5.0f), 40.0f);
  EXPECT_EQ(Signed(percent, 5.0f, kNaN), 40.0f);
}

TEST(IntenPercent, AbsoluteAndEveryOtherValueLeaveTheSign) {
  for (const int type : {0, 3, -1, 256, 257, 1 << 30, -2147483647}) {
    const IntenPercent percent = UnitBins({2, 3}, static_cast<DiffType>(type));
    EXPECT_EQ(Signed(percent, 6.0f, 5.0f), 40.0f) << type;
    EXPECT_EQ(Signed(percent, 5.0f, 6.0f), 40.0f) << type;
  }
}

TEST(IntenPercent, ValuesAreComparedInTheInputsType) {
  EXPECT_EQ((Signed<float, int>(UnitBins({2, 3}, eDIFF_FORWARD), 16777216, 16777217)), -40.0f);
  EXPECT_EQ((Signed<float, unsigned int>(UnitBins({2, 3}, eDIFF_FORWARD), 1, 4294967295u)), -40.0f);
  EXPECT_EQ((Signed<float, double>(UnitBins({2, 3}, eDIFF_FORWARD), 1.0, 1.0 + 1e-15)), -40.0f);
  EXPECT_EQ((Signed<float, std::int64_t>(UnitBins({2, 3}, eDIFF_BACKWARD), (std::int64_t{1} << 60) + 1,
                                         std::int64_t{1} << 60)),
            -40.0f);
  EXPECT_EQ((Signed<float, std::uint64_t>(UnitBins({2, 3}, eDIFF_BACKWARD), ~std::uint64_t{0},
                                          ~std::uint64_t{0} - 1)),
            -40.0f);
  EXPECT_EQ((Signed<float, char>(UnitBins({2, 3}, eDIFF_FORWARD), -1, 1)), -40.0f);
  EXPECT_EQ((Signed<float, unsigned char>(UnitBins({2, 3}, eDIFF_BACKWARD), 255, 1)), -40.0f);
  EXPECT_EQ((Signed<float, unsigned short>(UnitBins({2, 3}, eDIFF_BACKWARD), 65535, 1)), -40.0f);
}

TEST(IntenPercent, ReversedPercentileIsLostOnUnsignedAnd64BitOutputs) {
  for (const PixelType& outType : tests::kPixelTypes) {
    tests::WithPixelType(outType.element, [&]<class Out>() {
      constexpr bool keepsSign =
          std::is_floating_point_v<Out> || (std::is_signed_v<Out> && sizeof(Out) < sizeof(std::int64_t));
      const Out expected = static_cast<Out>(keepsSign ? -40 : 0);
      EXPECT_EQ((Signed<Out, float>(UnitBins({2, 3}, eDIFF_FORWARD), 5, 6)), expected) << outType;
    });
  }
}

TEST(IntenPercent, ConstantsTakeTheSignToo) {
  const IntenPercent percent = UnitBins({2, 3}, eDIFF_FORWARD);
  EXPECT_EQ((Percents<float, float>(percent, {5, 6, 9}))[3], -100.0f);
  const float zero = Percents<float, float>(percent, {5, 6, -9})[3];
  EXPECT_EQ(zero, 0.0f);
  EXPECT_TRUE(std::signbit(zero));
  EXPECT_FALSE(std::signbit((Percents<float, float>(percent, {6, 5, -9}))[3]));
}

// Deliberate: the spline's value is cast to the input's type. Integers lose the fraction and wrap.
TEST(IntenPercent, SplinesValueIsCastToTheInputsTypeIntegersLoseTheFractionAndWrap) {
  const IntenPercent percent = Overshooting();
  EXPECT_EQ((Percent<float, char>(percent, 6)), -13.0f);
  EXPECT_EQ((Percent<float, unsigned char>(percent, 6)), 243.0f);
  EXPECT_EQ((Percent<float, short>(percent, 6)), -13.0f);
  EXPECT_EQ((Percent<float, unsigned short>(percent, 6)), 65523.0f);
  EXPECT_EQ((Percent<double, int>(percent, 6)), -13.0);
  EXPECT_EQ((Percent<double, unsigned int>(percent, 6)), 4294967296.0);
  EXPECT_EQ((Percent<double, std::int64_t>(percent, 6)), -13.0);
  EXPECT_EQ((Percent<double, std::uint64_t>(percent, 6)), 0x1p64);
  EXPECT_EQ((Percent<char, unsigned char>(percent, 6)), 127);
  EXPECT_EQ((Percent<double, unsigned char>(percent, 22)), 109.0);
}

TEST(IntenPercent, FractionBetweenMinus1And0OfAnIntegerInputIsAPositive0) {
  IntenPercent percent = Overshooting();
  percent.SetMax(4000.0);
  percent.SetScale(0.001);
  for (const PixelType& inType : tests::kPixelTypes) {
    tests::WithPixelType(inType.element, [&]<class In>() {
      const double result = Percent<double, In>(percent, In{1});
      if constexpr (std::is_floating_point_v<In>) {
        EXPECT_LT(result, 0.0) << inType;
      } else {
        EXPECT_EQ(result, 0.0) << inType;
        EXPECT_FALSE(std::signbit(result)) << inType;
      }
    });
  }
}

TEST(IntenPercent, HistogramOfZerosGivesNaNInsideTheRangeAnd0And100OutsideIt) {
  const IntenPercent percent = UnitBins({0, 0});
  EXPECT_TRUE(std::isnan(Percent(percent, 1.0f)));
  EXPECT_TRUE(std::isnan(Percent(percent, 0.5f)));
  EXPECT_EQ(Percent(percent, 0.0f), 0.0f);
  EXPECT_EQ(Percent(percent, 2.0f), 100.0f);
  EXPECT_EQ((Percent<double, unsigned char>(percent, 1)), 0.0);
  EXPECT_EQ((Percent<double, int>(percent, 1)), -2147483648.0);
  EXPECT_EQ((Percent<double, unsigned int>(percent, 1)), 0.0);
  EXPECT_EQ((Percent<double, std::int64_t>(percent, 1)), -0x1p63);
  EXPECT_EQ((Percent<double, std::uint64_t>(percent, 1)), 0x1p63);
  EXPECT_EQ((Percent<int, float>(percent, 1)), std::numeric_limits<int>::min());
}

TEST(IntenPercent, FirstThreeChannelsOfALargerPixelAreRead) {
  const IntenPercent percent = UnitBins({2, 3}, eDIFF_FORWARD);
  Image<float> in({2, 1, 5}, {1, 1}, 9.0f);
  in.SetPixel(0, 0, {5, 6, 1});
  in.SetPixel(1, 0, {6, 5, 1});
  Image<float> out({2, 1, 6}, {0, 2}, kUnwritten);
  percent.Process(&in, nullptr, &out);
  EXPECT_EQ(std::vector<float>(&out.At(0, 0), &out.At(0, 0) + 12),
            (std::vector<float>{5, 6, 1, -40, kUnwritten, kUnwritten, 6, 5, 1, 40, kUnwritten, kUnwritten}));
}

TEST(IntenPercent, MoreThanFourOutputChannelsKeepWhatTheyHeld) {
  const IntenPercent percent = UnitBins({2, 3});
  EXPECT_EQ((Percents<short, short>(percent, {5, 6, 1}, true, 7)),
            (std::vector<short>{5, 6, 1, 40, kUnwritten, kUnwritten, kUnwritten}));
  EXPECT_EQ((Percents<short, short>(percent, {5, 6, 1}, false, 5)),
            (std::vector<short>{-1, -1, -1, -1, kUnwritten}));
}

TEST(IntenPercent, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<short> in({3, 2, 3}, {1, 1}, 1);
  Image<short> out({3, 2, 4});
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  UnitBins({2, 3}).Process(&in, &mask, &out);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, y, 3), x == 1 && y == 1 ? -1 : 40) << x << ", " << y;
  }
}

TEST(IntenPercent, MarginIsNeitherReadNorWritten) {
  Image<float> in({5, 2, 3}, {2, 1}, kNaN);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 5; ++x) in.SetPixel(x, y, {1, 1, 1});
  }
  Image<float> out({5, 2, 4}, {1, 3}, kUnwritten);
  UnitBins({2, 3}).Process(&in, nullptr, &out);
  for (int y = -3; y < 5; ++y) {
    for (int x = -1; x < 6; ++x) {
      const bool isInside = x >= 0 && x < 5 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y, 0), isInside ? 1.0f : kUnwritten) << x << ", " << y;
      EXPECT_EQ(out.At(x, y, 3), isInside ? 40.0f : kUnwritten) << x << ", " << y;
    }
  }
}

TEST(IntenPercent, HeightOrWidthOfZeroWritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0, 3}, tests::Size{0, 4, 3}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({size.width, size.height, 4}, {1, 1});
    FillBytes(out);
    Mask mask(size.width, size.height, {1, 1}, false);
    UnitBins({1, 3}).Process(&in, nullptr, &out);
    UnitBins({1, 3}).Process(&in, &mask, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

// ---- the spline

/// Parameters whose blocks are freed at the end.
struct Tables : details::IntenPercentParams {
  Tables(const std::vector<int>& bins, double scale) {
    SetBins(bins);
    SetScale(scale);
    SetCoefficients();
  }
  Tables(const Tables&) = delete;
  Tables& operator=(const Tables&) = delete;
  ~Tables() { Free(*this); }

  static void Free(const details::IntenPercentParams& p) {
    std::free(p.spareBlock);
    for (double* block : {p.cumulative, p.alpha, p.linear, p.quadratic, p.cubic, p.diagonal, p.mu, p.z})
      std::free(block);
  }
};

TEST(IntenPercentSpline, TablesAgreeWithTheTwinBitForBit) {
  tests::Random random(5);
  for (int i = 0; i < 300; ++i) {
    const std::vector<int> bins = tests::DrawCounts(random, random.Below(40));
    constexpr double kScales[] = {1.0, 0.1, 3.0, -2.5, 0.0, 1e-300, 1e300, kInfinity, kNaN};
    const double scale = random.Pick(kScales);
    const Tables tables(bins, scale);
    const reference::CumulativeSpline expected =
        reference::SplineThrough(reference::Knots(bins, false), scale);
    EXPECT_EQ(tables.total, reference::TotalOf(bins));
    ASSERT_EQ(static_cast<std::size_t>(tables.binCount), bins.size());
    EXPECT_TRUE(SameBlock(expected.cumulative, tables.cumulative));
    EXPECT_TRUE(SameBlock(expected.alpha, tables.alpha));
    EXPECT_TRUE(SameBlock(expected.linear, tables.linear));
    EXPECT_TRUE(SameBlock(expected.quadratic, tables.quadratic));
    EXPECT_TRUE(SameBlock(expected.cubic, tables.cubic));
    EXPECT_TRUE(SameBlock(expected.diagonal, tables.diagonal));
    EXPECT_TRUE(SameBlock(expected.mu, tables.mu));
    EXPECT_TRUE(SameBlock(expected.z, tables.z));
    for (std::size_t entry = 0; entry < bins.size() + 2; ++entry) EXPECT_EQ(tables.spareBlock[entry], 0);
  }
}

// Deliberate: the spline's system is its own, with 2 (2 - mu) where a natural spline has 4 - mu.
TEST(IntenPercentSpline, SystemIsItsOwnWith2Times2MinusMuWhereANaturalSplineHas4MinusMu) {
  const Tables tables({1, 1, 1, 1}, 1.0);
  EXPECT_EQ(tables.diagonal[1], 4.0);
  EXPECT_EQ(tables.mu[1], 0.25);
  EXPECT_EQ(tables.diagonal[2], 3.5);
  EXPECT_EQ(tables.mu[2], 1.0 / 3.5);
  EXPECT_EQ(tables.diagonal[3], (2.0 - 1.0 / 3.5) * 2.0);
  const Tables narrow({1, 1, 1, 1}, 0.5);
  EXPECT_EQ(narrow.diagonal[1], 8.0);
  EXPECT_EQ(narrow.mu[1], 0.25);
  EXPECT_EQ(narrow.diagonal[2], 7.0);
}

TEST(IntenPercentSpline, CoefficientsOfTwoBins) {
  const Tables tables({1, 3}, 1.0);
  EXPECT_TRUE(SameBlock({0, 25, 100, 100}, tables.cumulative));
  EXPECT_TRUE(SameBlock({0, 150, -225, 0}, tables.alpha));
  EXPECT_TRUE(SameBlock({6.25, 62.5, 50, 0}, tables.linear));
  EXPECT_TRUE(SameBlock({0, 56.25, -75, 0}, tables.quadratic));
  EXPECT_TRUE(SameBlock({18.75, -43.75, 25, 0}, tables.cubic));
  EXPECT_TRUE(SameBlock({0, 37.5, -75, 0}, tables.z));
}

// Deliberate: counts are multiplied by 100 in 32 bits and wrap above 21474836.
TEST(IntenPercentSpline, CountsAreMultipliedBy100In32BitsAndWrapAbove21474836) {
  EXPECT_EQ(Tables({21474836, 0}, 1.0).cumulative[1], 100.0);
  EXPECT_EQ(Tables({21474837, 0}, 1.0).cumulative[1], -2147483596.0 / 21474837.0);
  EXPECT_EQ(Tables({42949673, 0}, 1.0).cumulative[1], 4.0 / 42949673.0);
  EXPECT_EQ(Percent<double>(UnitBins({21474836, 0}), 1.0f), 100.0);
  EXPECT_EQ(Percent<float>(UnitBins({21474837, 0}), 1.0f), static_cast<float>(-2147483596.0 / 21474837.0));
}

TEST(IntenPercentSpline, TotalIsASumOf32Bits) {
  const Tables tables({2147483647, 1}, 1.0);
  EXPECT_EQ(tables.total, std::numeric_limits<int>::min());
  EXPECT_EQ(tables.cumulative[1], -100.0 / -2147483648.0);
  EXPECT_EQ(Tables({2147483647, 2147483647, 2}, 1.0).total, 0);
  EXPECT_EQ(Tables({2147483647, 2147483647, 2}, 1.0).cumulative[1], -kInfinity);
}

// Deliberate: there is no test for a histogram of zeros, whose knots are NaN.
TEST(IntenPercentSpline, ThereIsNoTestForAHistogramOfZerosWhoseKnotsAreNaN) {
  const Tables tables({0, 0, 0}, 1.0);
  EXPECT_EQ(tables.total, 0);
  EXPECT_EQ(tables.cumulative[0], 0.0);
  for (int i = 1; i <= 3; ++i) EXPECT_TRUE(std::isnan(tables.cumulative[i])) << i;
  EXPECT_EQ(tables.cumulative[4], 100.0);
  for (int i = 0; i <= 3; ++i) EXPECT_TRUE(std::isnan(tables.linear[i])) << i;
}

// Deliberate: appends. A second call lengthens the histogram.
TEST(IntenPercentSpline, SetBinsAppendsASecondCallLengthensTheHistogram) {
  IntenPercent percent = UnitBins({2});
  percent.SetBins({});
  percent.SetBins({3});
  percent.SetMax(2.0);
  EXPECT_EQ(percent.Bins, (std::vector<int>{2, 3}));
  EXPECT_EQ(Percent(percent, 1.0f), 40.0f);
}

// Deliberate: nothing frees the blocks. A copy reads the same ones, and a second call leaves the first ones
// behind.
TEST(IntenPercentSpline, NothingFreesTheBlocksACopyReadsTheSameOnesAndASecondCallLeavesTheFirstOnesBehind) {
  Tables tables({1, 3}, 1.0);
  const details::IntenPercentParams first(tables);
  details::IntenPercentParams assigned;
  assigned = tables;
  EXPECT_EQ(first.cumulative, tables.cumulative);
  EXPECT_EQ(first.spareBlock, tables.spareBlock);
  EXPECT_EQ(assigned.z, tables.z);
  EXPECT_EQ(assigned.Bins, tables.Bins);
  EXPECT_EQ(assigned.binCount, 2);
  tables.SetBins({4});
  tables.SetCoefficients();
  EXPECT_NE(first.cumulative, tables.cumulative);
  EXPECT_EQ(tables.binCount, 3);
  EXPECT_EQ(tables.cumulative[1], 12.5);
  EXPECT_TRUE(SameBlock({0, 25, 100, 100}, first.cumulative));
  EXPECT_TRUE(SameBlock({18.75, -43.75, 25, 0}, first.cubic));
  Tables::Free(first);
}

TEST(IntenPercentSpline, CallOnTheOperatorChangesNothingForItsProcessor) {
  IntenPercent percent = UnitBins({2, 3});
  percent.SetCoefficients();
  const details::IntenPercentParams blocks(percent);
  percent.SetBins({5});
  percent.SetMax(3.0);
  EXPECT_EQ(Percent(percent, 1.0f), 20.0f);
  Tables::Free(blocks);
}

// ---- failures

struct IntenPercentFailure : ::testing::Test {
  Image<short> in{{3, 2, 3}, {1, 1}, 1};
  Image<short> out{{3, 2, 4}, {1, 1}};
  const IntenPercent percent = UnitBins({2, 3});

  IntenPercentFailure() { FillBytes(out); }
};

TEST_F(IntenPercentFailure, TypesOutsideTheListAreInvalid) {
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd({3, 2, 4, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(
        Throws<Exception>("Invalid type to dispatch.", [&] { percent.Process(&odd, nullptr, &out); }));
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { percent.Process(&in, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(out));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

TEST_F(IntenPercentFailure, ComplexRastersAreInvalid) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster complex({3, 2, 4, DataType(type.element, true)}, {1, 1});
    FillBytes(complex);
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] {
      percent.Process(&complex, nullptr, &out);
    })) << type;
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] {
      percent.Process(&in, nullptr, &complex);
    })) << type;
    EXPECT_TRUE(IsUntouched(out));
    EXPECT_TRUE(IsUntouched(complex));
  }
}

// ---- differential

struct Range {
  double min, max;
};

/// An operator with a histogram of its own, in most cases over a range in which samples lie.
IntenPercent DrawPercent(tests::Random& random) {
  constexpr Range kRanges[] = {{0, 100},     {-0.5, 3.5},   {8, 60},       {-128, 127},     {0, 255},
                               {0, 65535},   {-1e9, 1e9},   {10, 40.7},    {0.1, 70.3},     {5, 5},
                               {50, 10},     {-1e300, 1e9}, {-1e20, 1e20}, {0, kInfinity},  {-kInfinity, 50},
                               {kNaN, 50.0}, {0, kNaN},     {0, 1e-30},    {-1e-3, 1e-310}, {0, 2e19}};
  constexpr double kScales[] = {1.0, 0.25, 3.7, 1e-3, 1e10, 0.0, -1.0, 1e-310, kInfinity, kNaN};
  constexpr double kNoData[] = {0.0,       -1.0,       3.0,   44.0,  255.0, 300.9, 16777217.0,
                                -32768.0,  1e20,       1e300, -1e40, 2.5,   0.1,   kNaN,
                                kInfinity, -kInfinity, 20.0,  40.0,  1e10,  0x1p63};
  constexpr std::uint32_t kBins[] = {0, 1, 2, 3, 4, 5, 16, 33, 64, 100, 255, 256, 1000};
  const Range range = random.Pick(kRanges);
  IntenPercent percent;
  percent.SetMin(range.min);
  percent.SetMax(range.max);
  percent.SetNoData(random.Pick(kNoData));
  percent.SetBins(tests::DrawCounts(random, random.Pick(kBins)));
  const double fitting = static_cast<double>(percent.Bins.size()) / (range.max - range.min);
  percent.SetScale(random.OneIn(5) ? random.Pick(kScales) : fitting);
  percent.SetType(static_cast<DiffType>(random.Below(5) - 1));
  return percent;
}

/// Samples on and beside what the operator compares with.
std::vector<double> NearbyOf(const IntenPercent& percent, tests::Random& random) {
  std::vector<double> near = {percent.NoData, percent.Min, percent.Max};
  for (int i = 0; i < 4; ++i) {
    const double edge =
        percent.Min + random.Below(static_cast<std::uint32_t>(percent.Bins.size()) + 2) / percent.Scale;
    near.insert(near.end(), {edge, edge + 0.25 / percent.Scale});
  }
  const std::size_t exact = near.size();
  for (std::size_t i = 0; i < exact; ++i) {
    const auto narrowed = static_cast<float>(near[i]);
    near.push_back(std::nextafter(narrowed, kInfinity));
    near.push_back(std::nextafter(narrowed, -kInfinity));
  }
  return near;
}

/// The cases of one input type: outputs of four channels or a few more, rows longer than any block.
std::vector<tests::Case> CasesOf(const PixelType& in) {
  std::vector<tests::Case> cases = tests::CasesFrom(in, {});
  for (tests::Case& c : cases) {
    tests::Random random(c.seed + 1);
    if (c.size.width == 601) c.size.width = 2040 + random.Below(200);
    c.in.isComplex = false;
    c.size.channels = std::max(3u, c.size.channels);
    c.outChannels = 4 + (random.OneIn(4) ? random.Below(4) : 0);
  }
  return cases;
}

struct IntenPercentDifferential : ::testing::TestWithParam<PixelType> {
  /// Compares the operator with its twin. An output of the type `writtenAs` comes first where the case's own
  /// type is another.
  static ::testing::AssertionResult Compare(const tests::Case& c, const IntenPercent& percent,
                                            const std::vector<double>& near, const DataType& writtenAs) {
    if (writtenAs != c.out) {
      Raster in({0, 0, 3, c.in}, {}), out({0, 0, 4, writtenAs}, {});
      percent.Process(&in, nullptr, &out);
    }
    return Agree(
               c, near, [&](Raster* in, Mask* mask, Raster* out) { percent.Process(in, mask, out); },
               [&](const Raster& in, const Mask* mask, Raster& out) {
                 reference::IntenPercent(percent, writtenAs, in, mask, out);
               })
           << ", Min " << percent.Min << ", Max " << percent.Max << ", NoData " << percent.NoData
           << ", Scale " << percent.Scale << ", Type " << percent.Type << ", bins " << percent.Bins.size()
           << ", written as " << tests::NameOf(writtenAs);
  }
};

TEST_P(IntenPercentDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : CasesOf(GetParam())) {
    tests::Random random(~c.seed);
    const IntenPercent percent = DrawPercent(random);
    ASSERT_TRUE(Compare(c, percent, NearbyOf(percent, random), c.out));
  }
}

TEST_P(IntenPercentDifferential, AgreesWithTheTwinBitForBitWhereAnEarlierOutputHadAnotherType) {
  for (tests::Case c : CasesOf(GetParam())) {
    tests::Random random(~c.seed);
    c.fill = random.OneIn(2) ? tests::Fill::eFEW : tests::Fill::eSMOOTH;  // a NaN's bits are not compared
    c.outMargins = {8, 4};  // room for elements wider than the output's own
    c.out.isComplex = random.OneIn(4);
    const auto type = static_cast<DiffType>(random.Below(4));
    IntenPercent percent = UnitBins({3, 1, 4, 1, 5, 9, 2, 6}, type);
    percent.SetScale(random.OneIn(2) ? 1.0 : 0.125);
    percent.SetMax(8.0 / percent.Scale);
    ASSERT_TRUE(Compare(c, percent, {-1.0, 1.5, 7.75}, random.Pick(tests::kPixelTypes).element));
  }
}

INSTANTIATE_TEST_SUITE_P(From, IntenPercentDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

TEST(IntenPercentOfManyPixels, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  const IntenPercent percent = UnitBins(tests::DrawCounts(random, 200), eDIFF_FORWARD);
  Raster in({1100, 1000, 3, tessel::eDT_8U}, {});
  FillRandom(in, tests::Fill::eSMOOTH, random);
  const auto mask = RandomMask(in, tests::MaskKind::eFEW_CLEAR, tests::MaskGeometry::eSAME, random);
  Raster expected({1100, 1000, 4, tessel::eDT_64F}, {3, 1}), actual(expected, expected);
  FillBytes(expected);
  FillBytes(actual);
  reference::IntenPercent(percent, expected.dataType, in, mask.get(), expected);
  percent.Process(&in, mask.get(), &actual);
  EXPECT_TRUE(SameBits(expected, actual));
}

// ---- contract

// Deliberate: only a change of the input's type rebuilds. A later output of another type is written as the
// type of the first one.
TEST(IntenPercentContract, LaterOutputOfAnotherTypeIsWrittenAsTheTypeOfTheFirstOne) {
  const IntenPercent percent = UnitBins({2, 3});
  EXPECT_EQ((RunOn<unsigned char, short>(percent, {5, 6, 1})), (std::vector<unsigned char>{5, 6, 1, 40}));
  Image<short> in({2, 1, 3});
  in.SetPixel(0, 0, {5, 6, 1});
  in.SetPixel(1, 0, {7, 8, 300});
  Image<int> out({2, 1, 4});
  FillBytes(out, 0x5A);
  percent.Process(&in, nullptr, &out);
  for (std::size_t byte = 0; byte < out.dataSize; ++byte) {
    const int kFirst[] = {5, 6, 1, 40}, kSecond[] = {7, 8, 255, 100};
    const int expected = byte % 16 >= 4 ? 0x5A : byte < 16 ? kFirst[byte] : kSecond[byte - 16];
    EXPECT_EQ(out.data[byte], expected) << byte;
  }
}

TEST(IntenPercentContract, WiderElementsOfTheFirstOutputOverlapInALaterOne) {
  const IntenPercent percent = UnitBins({2, 3});
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 1})), (std::vector<short>{5, 6, 1, 40}));
  Image<short> in({2, 1, 3});
  in.SetPixel(0, 0, {5, 6, 1});
  in.SetPixel(1, 0, {7, 8, 0x0102});
  Image<unsigned char> out({2, 1, 4}, {0, 1}, 0x5A);
  percent.Process(&in, nullptr, &out);
  EXPECT_EQ(std::vector<unsigned char>(out.Elements() + 8, out.Elements() + 24),
            (std::vector<unsigned char>{5, 0, 6, 0, 7, 0, 8, 0, 2, 1, 100, 0, 0x5A, 0x5A, 0x5A, 0x5A}));
}

TEST(IntenPercentContract, LaterOutputThatIsComplexIsAddressedByItsOwnFields) {
  const IntenPercent percent = UnitBins({2, 3});
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 1})), (std::vector<short>{5, 6, 1, 40}));
  Image<short> in({2, 1, 3}, {}, 1);
  Image<short> out({2, 1, 4}, {}, kUnwritten, true);
  percent.Process(&in, nullptr, &out);
  for (int x = 0; x < 2; ++x) {
    for (std::uint32_t element = 0; element < 8; ++element) {
      const int expected = element < 3 ? 1 : element == 3 ? 40 : kUnwritten;
      EXPECT_EQ(out.At(x, 0, element), expected) << x << ", " << element;
    }
  }
}

TEST(IntenPercentContract, ChangeOfTheInputsTypeTakesTheOutputsTypeOfThatMoment) {
  const IntenPercent percent = UnitBins({2, 3});
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 1})), (std::vector<short>{5, 6, 1, 40}));
  EXPECT_EQ((RunOn<float, int>(percent, {5, 6, 1})), (std::vector<float>{5, 6, 1, 40}));
  EXPECT_EQ((RunOn<double, short>(percent, {5, 6, 1})), (std::vector<double>{5, 6, 1, 40}));
}

TEST(IntenPercentContract, EveryParameterTravelsWithARebuild) {
  IntenPercent percent = UnitBins({2, 3});
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 1})), (std::vector<short>{5, 6, 1, 40}));
  percent.SetMin(10.0);
  percent.SetMax(16.0);
  percent.SetScale(0.5);
  percent.SetNoData(15.0);
  percent.SetBins({5});
  percent.SetType(eDIFF_FORWARD);
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 1})), (std::vector<short>{5, 6, 1, 40}));
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 12}))[3], 100);
  EXPECT_EQ((RunOn<short, short>(percent, {5, 6, 12}, false))[3], -1);
  EXPECT_EQ((RunOn<short, int>(percent, {5, 6, 12}))[3], -20);
  EXPECT_EQ((RunOn<short, int>(percent, {5, 6, 10}))[3], 0);
  EXPECT_EQ((RunOn<short, int>(percent, {6, 5, 14}))[3], 50);
  EXPECT_EQ((RunOn<short, int>(percent, {6, 5, 15}))[3], 15);
  EXPECT_EQ((RunOn<short, int>(percent, {6, 5, 16}))[3], 100);
  EXPECT_EQ((RunOn<short, int>(percent, {6, 5, 12}, false))[3], 15);
}

static_assert(std::is_base_of_v<details::IntenPercentParams, IntenPercent>);
static_assert(!std::is_polymorphic_v<IntenPercent>);

}  // namespace
}  // namespace orvik::filters
