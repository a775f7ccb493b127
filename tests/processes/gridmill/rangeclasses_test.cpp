#include "processes/gridmill/rangeclasses.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/rangeclasses_reference.h"
#include "tests/support/cases.h"
#include "tests/support/compare.h"
#include "tests/support/failures.h"
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
using tests::Throws;

using Bounds = std::vector<float>;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// What the output's samples hold that the operator does not write.
constexpr int kUnwritten = 77;

/// An operator with a class for each pair of bounds.
RangeClasses ClassesOf(const std::vector<std::pair<float, float>>& ranges, float noData = -9999.0f) {
  Bounds lower, upper;
  for (const auto& [low, high] : ranges) {
    lower.push_back(low);
    upper.push_back(high);
  }
  RangeClasses classes;
  classes.SetNumClasses(static_cast<int>(ranges.size()));
  classes.SetMinRange(lower);
  classes.SetMaxRange(upper);
  classes.SetNoData(noData);
  return classes;
}

/// `count` equal classes, of which the last one holds what any of them holds.
RangeClasses EqualClasses(int count, float low, float high) {
  return ClassesOf(std::vector<std::pair<float, float>>(static_cast<std::size_t>(count), {low, high}));
}

/// The result for one sample.
template <class Out = int, class In = float>
Out ClassOf(const RangeClasses& classes, In sample) {
  Image<In> in({1, 1}, {}, sample);
  Image<Out> out({1, 1}, {}, static_cast<Out>(kUnwritten));
  classes.Process(&in, nullptr, &out);
  return out.At(0, 0);
}

/// The elements of the output's row y from pixel 0 on.
template <class T>
std::vector<T> RowOf(Image<T>& image, int y, std::size_t count) {
  return {&image.At(0, y), &image.At(0, y) + count};
}

Bounds MinRangeOf(RangeClasses& classes) {
  Bounds values;
  classes.GetMinRangeValue(values);
  return values;
}

Bounds MaxRangeOf(RangeClasses& classes) {
  Bounds values;
  classes.GetMaxRangeValue(values);
  return values;
}

/// A decision that refuses every pixel and counts how often it is asked.
struct Refusal : tessel::IMaskDecision {
  int calls = 0;

  bool IsPixelValid(const void*) override {
    ++calls;
    return false;
  }
};

// ---- golden: the classes

TEST(RangeClasses, SampleInsideARangeGetsTheNumberOfItsClassAndAnyOther0) {
  const RangeClasses classes = ClassesOf({{0, 10}, {20, 30}, {-5, -1}});
  EXPECT_EQ(ClassOf(classes, 5.0f), 1);
  EXPECT_EQ(ClassOf(classes, 25.0f), 2);
  EXPECT_EQ(ClassOf(classes, -2.5f), 3);
  for (const float sample : {-6.0f, -0.5f, 15.0f, 31.0f, 3e38f, kInfinity, -kInfinity})
    EXPECT_EQ(ClassOf(classes, sample), 0) << sample;
}

// Deliberate: both bounds are exclusive. A sample equal to a bound that two ranges share is in neither.
TEST(RangeClasses, BothBoundsAreExclusiveASampleEqualToABoundThatTwoRangesShareIsInNeither) {
  const RangeClasses classes = ClassesOf({{0, 10}, {10, 20}});
  EXPECT_EQ(ClassOf(classes, 0.0f), 0);
  EXPECT_EQ(ClassOf(classes, std::nextafter(0.0f, 1.0f)), 1);
  EXPECT_EQ(ClassOf(classes, std::nextafter(10.0f, 0.0f)), 1);
  EXPECT_EQ(ClassOf(classes, 10.0f), 0);
  EXPECT_EQ(ClassOf(classes, std::nextafter(10.0f, 20.0f)), 2);
  EXPECT_EQ(ClassOf(classes, std::nextafter(20.0f, 0.0f)), 2);
  EXPECT_EQ(ClassOf(classes, 20.0f), 0);
  EXPECT_EQ((ClassOf<int, unsigned char>(classes, 10)), 0);
  EXPECT_EQ((ClassOf<int, unsigned char>(classes, 9)), 1);
  EXPECT_EQ((ClassOf<int, unsigned char>(classes, 11)), 2);
}

TEST(RangeClasses, HighestClassWinsWhereRangesOverlap) {
  const RangeClasses classes = ClassesOf({{0, 10}, {5, 20}});
  EXPECT_EQ(ClassOf(classes, 3.0f), 1);
  EXPECT_EQ(ClassOf(classes, 5.0f), 1);
  EXPECT_EQ(ClassOf(classes, 7.0f), 2);
  EXPECT_EQ(ClassOf(classes, 10.0f), 2);
  EXPECT_EQ(ClassOf(classes, 20.0f), 0);
  const RangeClasses exchanged = ClassesOf({{5, 20}, {0, 10}});
  EXPECT_EQ(ClassOf(exchanged, 7.0f), 2);
  EXPECT_EQ(ClassOf(exchanged, 10.0f), 1);
  const RangeClasses nested = ClassesOf({{4, 6}, {2, 8}, {3, 5}});
  EXPECT_EQ(ClassOf(nested, 5.0f), 2);
  EXPECT_EQ(ClassOf(nested, 4.5f), 3);
}

TEST(RangeClasses, RangeWhoseLowerBoundIsNotBelowItsUpperBoundHoldsNothing) {
  const RangeClasses classes = ClassesOf({{20, 10}, {5, 5}});
  for (const float sample : {5.0f, 7.0f, 10.0f, 15.0f, 20.0f, 25.0f, kInfinity, -kInfinity})
    EXPECT_EQ(ClassOf(classes, sample), 0) << sample;
}

TEST(RangeClasses, BothZerosAreOneValueInSamplesAndBounds) {
  const float tiny = std::numeric_limits<float>::denorm_min();
  for (const float zero : {0.0f, -0.0f}) {
    for (const float sample : {0.0f, -0.0f}) {
      EXPECT_EQ(ClassOf(ClassesOf({{-tiny, tiny}}), sample), 1);
      EXPECT_EQ(ClassOf(ClassesOf({{-tiny, 1}}), sample), 1);
      EXPECT_EQ(ClassOf(ClassesOf({{-1, tiny}}), sample), 1);
      EXPECT_EQ(ClassOf(ClassesOf({{zero, 1}, {-1, zero}}), sample), 0);
    }
    EXPECT_EQ(ClassOf(ClassesOf({{zero, 1}}), tiny), 1);
    EXPECT_EQ(ClassOf(ClassesOf({{-1, zero}}), -tiny), 1);
  }
}

TEST(RangeClasses, InfiniteBoundsHoldEveryNumberButTheInfiniteOnes) {
  const RangeClasses classes = ClassesOf({{-kInfinity, kInfinity}, {5, kInfinity}, {-kInfinity, -5}});
  EXPECT_EQ(ClassOf(classes, 3.4028235e38f), 2);
  EXPECT_EQ(ClassOf(classes, -3.4028235e38f), 3);
  EXPECT_EQ(ClassOf(classes, 0.0f), 1);
  EXPECT_EQ(ClassOf(classes, kInfinity), 0);
  EXPECT_EQ(ClassOf(classes, -kInfinity), 0);
}

TEST(RangeClasses, BoundOfNaNHoldsNothing) {
  const RangeClasses classes = ClassesOf({{0, 10}, {kNaN, 10}, {0, kNaN}, {kNaN, kNaN}});
  EXPECT_EQ(ClassOf(classes, 5.0f), 1);
  EXPECT_EQ(ClassOf(classes, -5.0f), 0);
  EXPECT_EQ(ClassOf(classes, 50.0f), 0);
}

TEST(RangeClasses, NaNSampleGets0) {
  const RangeClasses classes = ClassesOf({{-kInfinity, kInfinity}, {kNaN, kNaN}}, kNaN);
  EXPECT_EQ(ClassOf(classes, kNaN), 0);
  EXPECT_EQ(ClassOf(classes, std::numeric_limits<double>::quiet_NaN()), 0);
  EXPECT_EQ(ClassOf<unsigned char>(classes, -kNaN), 0);
}

TEST(RangeClasses, ClassCountOf0OrMinus1Writes0Everywhere) {
  for (const int count : {0, -1, -300}) {
    RangeClasses classes = ClassesOf({{0, 10}, {20, 30}});
    classes.SetNumClasses(count);
    Image<short> in({300, 3}, {1, 1}, 5);
    Image<float> out({300, 3}, {}, kUnwritten);
    classes.Process(&in, nullptr, &out);
    EXPECT_EQ(tests::Bytes(out), tests::Bytes(Image<float>({300, 3}, {}, 0.0f))) << count;
    EXPECT_EQ(classes.GetClassNumber(), count);
  }
  EXPECT_EQ(ClassOf(RangeClasses(), 5.0f), 0);
}

TEST(RangeClasses, MoreBoundsThanClassesAreNoHarm) {
  RangeClasses classes = ClassesOf({{0, 10}, {20, 30}, {0, 30}});
  classes.SetNumClasses(2);
  EXPECT_EQ(ClassOf(classes, 5.0f), 1);
  EXPECT_EQ(ClassOf(classes, 25.0f), 2);
  EXPECT_EQ(ClassOf(classes, 15.0f), 0);
}

// ---- golden: no-data

TEST(RangeClasses, SampleEqualToNoDataGets0EvenInsideARange) {
  const RangeClasses classes = ClassesOf({{0, 10}, {5, 20}}, 7);
  EXPECT_EQ(ClassOf(classes, 7.0f), 0);
  EXPECT_EQ(ClassOf(classes, std::nextafter(7.0f, 0.0f)), 2);
  EXPECT_EQ(ClassOf(classes, std::nextafter(7.0f, 9.0f)), 2);
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class In>() {
      EXPECT_EQ((ClassOf<int, In>(classes, In{7})), 0) << type;
      EXPECT_EQ((ClassOf<int, In>(classes, In{8})), 2) << type;
    });
  }
}

TEST(RangeClasses, NoDataIsMetByADifferenceBelow1e9OnBothSides) {
  const float lastHit = 1e-9f;  // the next float below 1e-9
  const float firstMiss = std::nextafter(lastHit, 1.0f);
  const RangeClasses classes = ClassesOf({{-1, 1}}, 0);
  for (const float sample : {0.0f, -0.0f, 1e-40f, lastHit, -lastHit}) EXPECT_EQ(ClassOf(classes, sample), 0);
  for (const float sample : {firstMiss, -firstMiss, 0.5f, -0.5f}) EXPECT_EQ(ClassOf(classes, sample), 1);
}

TEST(RangeClasses, DifferenceFromNoDataIsFormedInFloat) {
  const float noData = -2.9e-17f;  // 1e-9f differs from it by more than 1e-9, rounded to `float` by less
  EXPECT_GT(static_cast<double>(1e-9f) - static_cast<double>(noData), 1e-9);
  EXPECT_EQ(ClassOf(ClassesOf({{-1, 1}}, noData), 1e-9f), 0);
  EXPECT_EQ(ClassOf(ClassesOf({{-1, 1}}, -noData), -1e-9f), 0);
  EXPECT_EQ(ClassOf(ClassesOf({{0, 9}}, 5), 5.00000001), 0);
  EXPECT_EQ((ClassOf<int, int>(ClassesOf({{0, 1e9f}}, 16777216), 16777217)), 0);
}

TEST(RangeClasses, NoDataOfNaNOrInfinityIsMetByNoSample) {
  for (const float noData : {kNaN, kInfinity, -kInfinity}) {
    EXPECT_EQ(ClassOf(ClassesOf({{0, 10}}, noData), 5.0f), 1) << noData;
    EXPECT_EQ(ClassOf(ClassesOf({{-kInfinity, kInfinity}}, noData), 3e38f), 1) << noData;
  }
}

TEST(RangeClasses, NoDataThatWasNotSetIsMetByNoSample) {
  RangeClasses classes;
  EXPECT_TRUE(std::isnan(classes.noData));
  classes.SetNumClasses(1);
  classes.SetMinRange({-1});
  classes.SetMaxRange({1});
  EXPECT_EQ(ClassOf(classes, 0.0f), 1);
}

// ---- golden: types

// Deliberate: `double` and 64-bit samples are narrowed to `float` before they are compared.
TEST(RangeClasses, DoubleAnd64BitSamplesAreNarrowedToFloatBeforeTheyAreCompared) {
  const RangeClasses classes = ClassesOf({{16777216, 16777218}});
  EXPECT_EQ((ClassOf<int, double>(classes, 16777217.0)), 0);
  EXPECT_EQ((ClassOf<int, double>(classes, 16777217.5)), 0);
  EXPECT_EQ((ClassOf<int, int>(classes, 16777217)), 0);
  EXPECT_EQ((ClassOf<int, unsigned int>(classes, 16777217)), 0);
  EXPECT_EQ((ClassOf<int, std::int64_t>(classes, 16777217)), 0);
  EXPECT_EQ((ClassOf<int, std::uint64_t>(classes, 16777217)), 0);
  EXPECT_EQ((ClassOf<int, double>(ClassesOf({{0, 1}}), 1.0 - 1e-12)), 0);
  EXPECT_EQ((ClassOf<int, double>(ClassesOf({{0, 0.1f}}), 0.1)), 0);
  EXPECT_EQ((ClassOf<int, double>(ClassesOf({{0, kInfinity}}), 1e300)), 0);
  EXPECT_EQ((ClassOf<int, std::uint64_t>(ClassesOf({{0, 0x1p64f}}), ~std::uint64_t{0})), 0);
  EXPECT_EQ((ClassOf<int, std::uint64_t>(ClassesOf({{1e19f, 1e20f}}), ~std::uint64_t{0})), 1);
}

TEST(RangeClasses, NegativeSamplesAreExtendedByTheirSign) {
  const RangeClasses classes = ClassesOf({{-10, -5}, {240, 250}, {4e9f, 5e9f}, {1.8e19f, 2e19f}});
  EXPECT_EQ((ClassOf<int, char>(classes, -7)), 1);
  EXPECT_EQ((ClassOf<int, short>(classes, -7)), 1);
  EXPECT_EQ((ClassOf<int, int>(classes, -7)), 1);
  EXPECT_EQ((ClassOf<int, std::int64_t>(classes, -7)), 1);
  EXPECT_EQ((ClassOf<int, unsigned char>(classes, 249)), 2);
  EXPECT_EQ((ClassOf<int, unsigned int>(classes, 4294967289u)), 3);
  EXPECT_EQ((ClassOf<int, std::uint64_t>(classes, ~std::uint64_t{6})), 4);
}

TEST(RangeClasses, NumberIsStoredAsAPlainCast) {
  EXPECT_EQ(ClassOf<unsigned char>(EqualClasses(300, 0, 9), 5.0f), 44);
  EXPECT_EQ(ClassOf<unsigned char>(EqualClasses(256, 0, 9), 5.0f), 0);
  EXPECT_EQ(ClassOf<unsigned char>(EqualClasses(255, 0, 9), 5.0f), 255);
  EXPECT_EQ(ClassOf<char>(EqualClasses(300, 0, 9), 5.0f), 44);
  EXPECT_EQ(ClassOf<char>(EqualClasses(200, 0, 9), 5.0f), -56);
  EXPECT_EQ(ClassOf<short>(EqualClasses(40000, 0, 9), 5.0f), -25536);
  EXPECT_EQ(ClassOf<unsigned short>(EqualClasses(65539, 0, 9), 5.0f), 3);
  EXPECT_EQ(ClassOf<float>(EqualClasses(300, 0, 9), 5.0f), 300.0f);
}

TEST(RangeClasses, Class300InEveryPairOfTypes) {
  const RangeClasses classes = EqualClasses(300, 70, 80);
  for (const PixelType& inType : tests::kPixelTypes) {
    for (const PixelType& outType : tests::kPixelTypes) {
      tests::WithPixelTypes(inType.element, outType.element, [&]<class In, class Out>() {
        const Out expected = sizeof(Out) == 1 ? Out{44} : static_cast<Out>(300);
        EXPECT_EQ((ClassOf<Out, In>(classes, In{77})), expected) << inType << " -> " << outType;
        EXPECT_EQ((ClassOf<Out, In>(classes, In{80})), Out{0}) << inType << " -> " << outType;
      });
    }
  }
}

TEST(RangeClasses, NumberAbove255StaysWholeWhereFewClassesHoldAnything) {
  for (const int last : {255, 256, 300}) {
    std::vector<std::pair<float, float>> ranges(static_cast<std::size_t>(last), {80.0f, 70.0f});
    ranges[1] = {0, 60};
    ranges.back() = {70, 80};
    const RangeClasses classes = ClassesOf(ranges, 76);
    for (const PixelType& inType : tests::kPixelTypes) {
      tests::WithPixelType(inType.element, [&]<class In>() {
        EXPECT_EQ((ClassOf<int, In>(classes, In{77})), last) << inType;
        EXPECT_EQ((ClassOf<double, In>(classes, In{77})), last) << inType;
        EXPECT_EQ((ClassOf<unsigned char, In>(classes, In{77})), last % 256) << inType;
        EXPECT_EQ((ClassOf<short, In>(classes, In{50})), 2) << inType;
        EXPECT_EQ((ClassOf<short, In>(classes, In{76})), 0) << inType;
      });
    }
  }
}

TEST(RangeClasses, ZeroOfAFloatingOutputIsPositive) {
  for (const float sample : {-5.0f, -0.0f, kNaN, -9999.0f}) {
    EXPECT_FALSE(std::signbit(ClassOf<float>(ClassesOf({{0, 10}}), sample)));
    EXPECT_FALSE(std::signbit(ClassOf<double>(ClassesOf({{0, 10}}), sample)));
  }
}

// ---- golden: the rasters

TEST(RangeClasses, FurtherChannelsAreIgnored) {
  Image<short> in({3, 2, 3}, {1, 1}, 5);
  in.SetPixel(0, 0, {15, 5, 5});
  in.SetPixel(1, 0, {5, 15, 99});
  in.SetPixel(2, 1, {99, 5, 15});
  Image<short> out({3, 2}, {}, kUnwritten);
  ClassesOf({{0, 10}, {10, 20}}).Process(&in, nullptr, &out);
  EXPECT_EQ(RowOf(out, 0, 3), (std::vector<short>{2, 1, 1}));
  EXPECT_EQ(RowOf(out, 1, 3), (std::vector<short>{1, 1, 0}));
}

TEST(RangeClasses, FirstElementsOfTheOutputsRowAreWrittenWhateverPixelsTheyBelongTo) {
  Image<short> in({3, 2}, {1, 0}, 5);
  in.At(1, 0) = 15;
  in.At(2, 1) = 15;
  Image<unsigned char> out({3, 2, 3}, {1, 1}, kUnwritten);
  ClassesOf({{0, 10}, {10, 20}}).Process(&in, nullptr, &out);
  EXPECT_EQ(RowOf(out, 0, 9), (std::vector<unsigned char>{1, 2, 1, 77, 77, 77, 77, 77, 77}));
  EXPECT_EQ(RowOf(out, 1, 9), (std::vector<unsigned char>{1, 1, 2, 77, 77, 77, 77, 77, 77}));
}

TEST(RangeClasses, MaskHasNoEffect) {
  Image<short> in({300, 2}, {1, 1}, 5);
  Mask mask(300, 2, {1, 1}, false), nothing(0, 0);
  const RangeClasses classes = ClassesOf({{0, 10}});
  for (Mask* const given : {&mask, &nothing}) {
    Image<float> out({300, 2}, {}, kUnwritten);
    classes.Process(&in, given, &out);
    EXPECT_EQ(tests::Bytes(out), tests::Bytes(Image<float>({300, 2}, {}, 1.0f)));
  }
}

// Deliberate: the mask decision is handed over and never called.
TEST(RangeClasses, MaskDecisionIsHandedOverAndNeverCalled) {
  RangeClasses classes = ClassesOf({{0, 10}});
  EXPECT_EQ(classes.maskDecision, nullptr);
  Refusal refusal;
  classes.SetMask(&refusal);
  EXPECT_EQ(classes.maskDecision, &refusal);
  Image<short> in({300, 2}, {1, 1}, 5);
  Image<short> out({300, 2}, {}, kUnwritten);
  classes.Process(&in, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), tests::Bytes(Image<short>({300, 2}, {}, 1)));
  EXPECT_EQ(refusal.calls, 0);
}

TEST(RangeClasses, MarginIsNeitherReadNorWritten) {
  Image<float> in({5, 2}, {2, 1}, 15.0f);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 5; ++x) in.At(x, y) = 5.0f;
  }
  Image<float> out({5, 2}, {1, 3}, kUnwritten);
  ClassesOf({{0, 10}, {10, 20}}).Process(&in, nullptr, &out);
  for (int y = -3; y < 5; ++y) {
    for (int x = -1; x < 6; ++x) {
      const bool isInside = x >= 0 && x < 5 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y), isInside ? 1.0f : kUnwritten) << x << ", " << y;
    }
  }
}

TEST(RangeClasses, HeightOrWidthOf0WritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0}, tests::Size{0, 4}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out(size, {1, 1});
    FillBytes(out);
    ClassesOf({{0, 10}}).Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(RangeClasses, ComplexRasterIsRefusedOnBothSides) {
  Image<float> real({2, 1}, {}, 5.0f), complex({2, 1}, {}, 5.0f, true);
  for (const auto& [in, out] : {std::pair{&complex, &real}, std::pair{&real, &complex}}) {
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] {
      ClassesOf({{0, 10}}).Process(in, nullptr, out);
    }));
  }
  for (float* const element : {&real.At(0, 0), &real.At(1, 0), &complex.At(0, 0), &complex.At(1, 0)})
    EXPECT_EQ(*element, 5.0f);
}

// ---- golden: the object

TEST(RangeClasses, SetNumClassesNumbersTheClassesFrom1AndAlwaysReturnsTrue) {
  RangeClasses classes;
  EXPECT_EQ(classes.classCount, -1);
  EXPECT_TRUE(classes.classValues.empty());
  EXPECT_TRUE(classes.SetNumClasses(3));
  EXPECT_EQ(classes.classCount, 3);
  EXPECT_EQ(classes.classValues, (std::vector<int>{1, 2, 3}));
  EXPECT_TRUE(classes.SetNumClasses(2));
  EXPECT_EQ(classes.classValues, (std::vector<int>{1, 2}));
  for (const int count : {0, -7}) {
    EXPECT_TRUE(classes.SetNumClasses(count));
    EXPECT_EQ(classes.classCount, count);
    EXPECT_TRUE(classes.classValues.empty());
  }
}

TEST(RangeClasses, BoundsAreReplacedAndTheirNumberIsNotCompared) {
  RangeClasses classes;
  classes.SetMinRange({1, 2, 3});
  classes.SetMaxRange({4});
  EXPECT_EQ(classes.minRange, (Bounds{1, 2, 3}));
  EXPECT_EQ(classes.maxRange, (Bounds{4}));
  classes.SetMinRange({9});
  classes.SetMaxRange({});
  EXPECT_EQ(classes.minRange, (Bounds{9}));
  EXPECT_TRUE(classes.maxRange.empty());
  EXPECT_EQ(classes.classCount, -1);
}

TEST(RangeClasses, GettersHaveNothingBeforeTheFirstProcess) {
  RangeClasses classes = ClassesOf({{0, 10}, {5, 20}});
  EXPECT_EQ(classes.GetClassNumber(), -1);
  EXPECT_TRUE(MinRangeOf(classes).empty());
  EXPECT_TRUE(MaxRangeOf(classes).empty());
}

TEST(RangeClasses, GettersAppendTheBoundsToWhatTheVectorAlreadyHolds) {
  RangeClasses classes = ClassesOf({{0, 10}, {5, 20}});
  ClassOf(classes, 1.0f);
  EXPECT_EQ(classes.GetClassNumber(), 2);
  Bounds values = {77};
  classes.GetMinRangeValue(values);
  EXPECT_EQ(values, (Bounds{77, 0, 5}));
  classes.GetMaxRangeValue(values);
  EXPECT_EQ(values, (Bounds{77, 0, 5, 10, 20}));
}

TEST(RangeClasses, GettersGiveTheBoundsOfTheLastBuild) {
  RangeClasses classes = ClassesOf({{0, 10}, {5, 20}});
  ClassOf(classes, 1.0f);
  classes.SetMinRange({100, 200});
  classes.SetMaxRange({300, 400});
  ClassOf(classes, 1.0f);
  EXPECT_EQ(MinRangeOf(classes), (Bounds{0, 5}));
  EXPECT_EQ(MaxRangeOf(classes), (Bounds{10, 20}));
  ClassOf(classes, 1.0);
  EXPECT_EQ(MinRangeOf(classes), (Bounds{100, 200}));
  EXPECT_EQ(MaxRangeOf(classes), (Bounds{300, 400}));
}

TEST(RangeClasses, GettersGiveAsManyBoundsAsThisObjectHasClassesAndNoMoreThanTheLastBuild) {
  RangeClasses classes;
  classes.SetNumClasses(2);
  classes.SetMinRange({1, 2, 3, 4});
  classes.SetMaxRange({5, 6, 7});
  ClassOf(classes, 1.0f);
  EXPECT_EQ(MinRangeOf(classes), (Bounds{1, 2}));
  classes.SetNumClasses(1);
  EXPECT_EQ(MinRangeOf(classes), (Bounds{1}));
  EXPECT_EQ(MaxRangeOf(classes), (Bounds{5}));
  classes.SetNumClasses(9);
  classes.SetMinRange(Bounds(9, 0.0f));
  EXPECT_EQ(MinRangeOf(classes), (Bounds{1, 2, 3, 4}));
  EXPECT_EQ(MaxRangeOf(classes), (Bounds{5, 6, 7}));
  EXPECT_EQ(classes.GetClassNumber(), 2);
  for (const int count : {0, -1}) {
    classes.SetNumClasses(count);
    EXPECT_TRUE(MinRangeOf(classes).empty());
    EXPECT_TRUE(MaxRangeOf(classes).empty());
  }
}

/// What each setter changes in the classes of 5, 15 and 25, which at first are 1, 2 and 0.
struct Change {
  const char* setter;
  void (*apply)(RangeClasses& classes);
  std::vector<int> results;
};

const Change kChanges[] = {
    {"SetNumClasses", [](RangeClasses& classes) { classes.SetNumClasses(3); }, {1, 2, 3}},
    {"SetMinRange",
     [](RangeClasses& classes) {
       classes.SetMinRange({6, 12, 20});
     },
     {0, 2, 0}},
    {"SetMaxRange",
     [](RangeClasses& classes) {
       classes.SetMaxRange({30, 12, 30});
     },
     {1, 1, 1}},
    {"SetNoData", [](RangeClasses& classes) { classes.SetNoData(15); }, {1, 0, 0}},
};

/// The classes of 5, 15 and 25.
template <class Out, class In>
std::vector<int> ThreeClasses(const RangeClasses& classes) {
  Image<In> in({3, 1});
  in.SetPixel(0, 0, {In{5}, In{15}, In{25}});
  Image<Out> out({3, 1}, {}, static_cast<Out>(kUnwritten));
  classes.Process(&in, nullptr, &out);
  return {static_cast<int>(out.At(0, 0)), static_cast<int>(out.At(1, 0)), static_cast<int>(out.At(2, 0))};
}

TEST(RangeClasses, SetterCalledAfterProcessTakesEffectWhenATypeChanges) {
  for (const Change& change : kChanges) {
    for (const bool isInput : {true, false}) {
      RangeClasses classes = ClassesOf({{0, 10}, {10, 20}, {20, 30}});
      classes.SetNumClasses(2);
      EXPECT_EQ((ThreeClasses<short, short>(classes)), (std::vector<int>{1, 2, 0})) << change.setter;
      change.apply(classes);
      EXPECT_EQ((ThreeClasses<short, short>(classes)), (std::vector<int>{1, 2, 0})) << change.setter;
      const std::vector<int> later =
          isInput ? ThreeClasses<short, float>(classes) : ThreeClasses<float, short>(classes);
      EXPECT_EQ(later, change.results) << change.setter << (isInput ? ", input" : ", output");
    }
  }
}

// ---- differential

constexpr std::uint32_t kClassCounts[] = {0, 1, 1, 3, 3, 8, 8, 40, 40, 300};

/// The range that most samples of a raster lie in.
struct Span {
  double low, high;
};

Span SpanOf(const DataType& type, tests::Fill fill) {
  if (fill == tests::Fill::eFEW) return {-1.0, 4.0};
  if (fill == tests::Fill::eSMOOTH || fill == tests::Fill::eMIXED) return {8.0, 90.0};
  Span span = {0.0, 0.0};
  tests::WithPixelType(type, [&]<class T>() {
    span = {static_cast<double>(std::numeric_limits<T>::lowest()),
            static_cast<double>(std::numeric_limits<T>::max())};
  });
  return span;
}

/// A bound in the span, for a floating type with any bits one of any magnitude.
float DrawBound(tests::Random& random, const Span& span) {
  if (span.high > 1e30) {
    const auto bits = static_cast<std::uint32_t>(random.Bits());
    float bound;
    std::memcpy(&bound, &bits, sizeof bound);
    return std::isnan(bound) ? 0.0f : bound;
  }
  const double at = static_cast<double>(random.Below(1u << 24)) * 0x1p-24;
  const double bound = span.low + at * (span.high - span.low);
  return static_cast<float>(random.OneIn(2) ? std::floor(bound) : bound);
}

/// Ranges that lie next to each other, inside each other, or anywhere.
std::vector<std::pair<float, float>> DrawRanges(tests::Random& random, const Span& span, std::size_t count) {
  Bounds bounds(2 * count);
  for (float& bound : bounds) bound = DrawBound(random, span);
  std::vector<std::pair<float, float>> ranges;
  const std::uint32_t kind = random.Below(3);
  if (kind != 0) std::sort(bounds.begin(), bounds.end());
  for (std::size_t i = 0; i < count; ++i) {
    if (kind == 0) {
      const auto [low, high] = std::minmax(bounds[2 * i], bounds[2 * i + 1]);
      ranges.emplace_back(low, high);
      if (random.OneIn(12)) std::swap(ranges.back().first, ranges.back().second);
    } else if (kind == 1) {
      ranges.emplace_back(bounds[i], bounds[i + 1]);
    } else {
      ranges.emplace_back(bounds[i], bounds[2 * count - 1 - i]);
    }
  }
  if (random.OneIn(3)) std::reverse(ranges.begin(), ranges.end());
  const std::uint32_t holding = 1 + random.Below(12);
  if (count > 12 && random.OneIn(3)) {  // few of many classes hold anything
    for (auto& [low, high] : ranges) {
      if (!random.OneIn(1 + static_cast<std::uint32_t>(count) / holding)) low = high;
    }
  }
  return ranges;
}

RangeClasses DrawClasses(tests::Random& random, const Span& span, std::size_t count) {
  constexpr float kOdd[] = {kNaN, kNaN,  kInfinity, -kInfinity, 0.0f,    -0.0f,    1.0f,    2.0f,
                            3.0f, 15.0f, 255.0f,    65535.0f,   0x1p31f, -0x1p63f, 0x1p64f, 3.4028235e38f};
  std::vector<std::pair<float, float>> ranges = DrawRanges(random, span, count);
  if (random.OneIn(3)) {
    for (auto& [low, high] : ranges) {
      if (random.OneIn(6)) low = random.Pick(kOdd);
      if (random.OneIn(6)) high = random.Pick(kOdd);
    }
  }
  float noData = random.OneIn(2) ? random.Pick(kOdd) : DrawBound(random, span);
  if (!ranges.empty() && random.OneIn(2)) {
    const auto [low, high] = random.Pick(ranges);
    noData = random.OneIn(2) ? low : std::floor(low / 2 + high / 2);
  }
  return ClassesOf(ranges, noData);
}

/// Values at and around what decides on a class.
std::vector<double> NearbyOf(const RangeClasses& classes, tests::Random& random) {
  const float noData = classes.noData;
  std::vector<double> values = {noData,
                                noData,
                                noData,
                                noData + 1e-9f,
                                noData - std::nextafter(1e-9f, 1.0f),
                                std::nextafter(noData, kInfinity)};
  for (int i = 0; i < 4 && !classes.minRange.empty(); ++i) {
    const float low = random.Pick(classes.minRange), high = random.Pick(classes.maxRange);
    values.insert(values.end(), {low, high, std::nextafter(low, kInfinity), std::nextafter(high, -kInfinity),
                                 low / 2 + high / 2});
  }
  return values;
}

/// The cases of one input type, some with rows longer than any block. The second of two calls meets the
/// processor of the first one.
std::vector<tests::Case> CasesOf(const PixelType& in) {
  std::vector<tests::Case> cases = tests::CasesFrom(in, {.leastChannels = 1});
  for (tests::Case& c : cases) {
    tests::Random random(c.seed + 1);
    if (c.size.width == 601) c.size.width = 2040 + random.Below(200);
    c.in.isComplex = false;
    c.threads = {1};
    if (random.OneIn(6)) c.threads = {1, 1};
  }
  return cases;
}

struct RangeClassesDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(RangeClassesDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : CasesOf(GetParam())) {
    tests::Random random(~c.seed);
    const bool isLarge = c.size.width * c.size.height > 10000;
    const std::uint32_t count =
        isLarge && !random.OneIn(4) ? 1 + random.Below(20) : random.Pick(kClassCounts);
    const RangeClasses classes = DrawClasses(random, SpanOf(c.in, c.fill), count);
    const std::vector<double> near = NearbyOf(classes, random);
    const ::testing::AssertionResult result = Agree(
        c, near, [&](Raster* in, Mask* mask, Raster* out) { classes.Process(in, mask, out); },
        [&](const Raster& in, const Mask*, Raster& out) { reference::RangeClasses(classes, in, out); });
    ASSERT_TRUE(result) << ", " << count << " classes, no-data " << classes.noData;
  }
}

INSTANTIATE_TEST_SUITE_P(From, RangeClassesDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

struct RangeClassesOfNarrowIntegers : ::testing::TestWithParam<PixelType> {};

// A processor that has met many samples of few values may know all results by then.
TEST_P(RangeClassesOfNarrowIntegers, AgreesWithTheTwinForEverySampleAgainAndAgain) {
  Raster in({256, 256, 1, GetParam().element}, {1, 0});
  for (std::size_t i = 0; i < in.dataSize; ++i) {
    const bool isWide = in.dataType.sizeBits == 16;
    const std::size_t pixel = isWide ? i / 2 : i;
    in.data[i] = static_cast<unsigned char>(isWide && i % 2 != 0 ? pixel >> 8 : pixel);
  }
  for (const tessel::ElementType out : {tessel::eDT_8U, tessel::eDT_32F, tessel::eDT_64S}) {
    for (const std::uint32_t count : {1u, 3u, 40u, 300u}) {
      tests::Random random(static_cast<std::uint64_t>(out) + count);
      const RangeClasses classes = DrawClasses(random, SpanOf(in.dataType, tests::Fill::eBITS), count);
      Raster expected({256, 256, 1, out}, {0, 1}), actual(expected, expected);
      FillBytes(expected);
      reference::RangeClasses(classes, in, expected);
      for (int call = 0; call < 3; ++call) {
        FillBytes(actual);
        classes.Process(&in, nullptr, &actual);
        ASSERT_TRUE(SameBits(expected, actual)) << count << " classes, call " << call;
      }
    }
  }
}

INSTANTIATE_TEST_SUITE_P(From, RangeClassesOfNarrowIntegers,
                         ::testing::ValuesIn(tests::kPixelTypes.begin(), tests::kPixelTypes.begin() + 4),
                         ::testing::PrintToStringParamName());

TEST(RangeClassesOfManyPixels, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  const RangeClasses classes = DrawClasses(random, {8.0, 90.0}, 8);
  Raster in({2100, 1050, 1, tessel::eDT_32F}, {});
  FillRandom(in, tests::Fill::eSMOOTH, random, NearbyOf(classes, random));
  Raster expected({2100, 1050, 1, tessel::eDT_64F}, {3, 1}), actual(expected, expected);
  FillBytes(expected);
  FillBytes(actual);
  reference::RangeClasses(classes, in, expected);
  classes.Process(&in, nullptr, &actual);
  EXPECT_TRUE(SameBits(expected, actual));
}

static_assert(std::is_base_of_v<details::RangeClassesParams, RangeClasses>);
static_assert(!std::is_polymorphic_v<RangeClasses>);

}  // namespace
}  // namespace orvik::gridmill
