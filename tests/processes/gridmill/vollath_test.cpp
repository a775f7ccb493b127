#include "processes/gridmill/vollath.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/vollath_reference.h"
#include "tests/support/failures.h"
#include "tests/support/focuscases.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::filters {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::SameSums;
using tests::Throws;

using Sums = std::vector<double>;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

/// Left and right sum of one row of one channel.
template <class T>
Sums SumsOf(const VollathEvaluation& measure, const std::vector<T>& row, Mask* mask = nullptr) {
  Image<T> in({static_cast<std::uint32_t>(row.size()), 1});
  std::copy(row.begin(), row.end(), in.Elements());
  measure.Process(&in, mask, nullptr);
  return {measure.GetLeftEq().at(0), measure.GetRightEq().at(0)};
}
template <class T>
Sums SumsOf(const std::vector<T>& row, Mask* mask = nullptr) {
  return SumsOf(VollathEvaluation(), row, mask);
}

/// A measure with the given bounds and failure value.
VollathEvaluation MeasureOf(double low, double high, double failure) {
  VollathEvaluation measure;
  measure.SetBackground(low, high);
  measure.SetFailure(failure);
  return measure;
}

VollathEvaluation Unbounded() { return MeasureOf(-kInfinity, kInfinity, -32767); }

// ---- golden

TEST(Vollath, LeftSumTakesTheRightNeighbourAndRightSumTheSampleTwoPlacesOn) {
  EXPECT_EQ(SumsOf<short>({1, 2, 3, 4}), (Sums{8, 11}));
  EXPECT_EQ(SumsOf<short>({2, 3, 5}), (Sums{6, 10}));
}

TEST(Vollath, WidthOf2OrLessAddsNothing) {
  for (const std::uint32_t width : {0u, 1u, 2u}) {
    Image<short> in({width, 3, 2}, {3, 1}, 5);
    const VollathEvaluation measure;
    measure.Process(&in, nullptr, nullptr);
    EXPECT_EQ(measure.GetLeftEq(), (Sums{0, 0})) << width;
    EXPECT_EQ(measure.GetRightEq(), (Sums{0, 0})) << width;
  }
}

TEST(Vollath, WidthOf2OrLessAndHeightOf0LeaveBothSumsAsTheyStood) {
  const VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {2, 3, 5}), (Sums{6, 10}));
  for (const tests::Size size :
       {tests::Size{0, 3}, tests::Size{1, 3}, tests::Size{2, 3}, tests::Size{9, 0}}) {
    Image<short> in(size, {2, 2}, 5);
    measure.Process(&in, nullptr, nullptr);
    EXPECT_EQ(measure.GetLeftEq(), Sums{6}) << size.width << " x " << size.height;
    EXPECT_EQ(measure.GetRightEq(), Sums{10}) << size.width << " x " << size.height;
  }
}

TEST(Vollath, ConstantRasterGivesEqualSumsOfTheSquareForEachTriple) {
  Image<unsigned char> in({300, 5, 3});
  in.Set([](int, int, std::uint32_t c) { return 10 * (c + 1); });
  const VollathEvaluation measure;
  measure.Process(&in, nullptr, nullptr);
  const double triples = 298 * 5;
  EXPECT_EQ(measure.GetLeftEq(), (Sums{triples * 100, triples * 400, triples * 900}));
  EXPECT_EQ(measure.GetRightEq(), measure.GetLeftEq());
}

TEST(Vollath, LastTwoColumnsNeverServeAsP0AndColumn0NeverServesAsP1OrP2) {
  Image<short> in({4, 2}, {2, 1}, 9000);
  in.SetPixel(0, 0, {1, 10, 100, 1000});
  in.SetPixel(0, 1, {1, 0, 0, 1000});
  const VollathEvaluation measure;
  measure.Process(&in, nullptr, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), Sums{1 * 10 + 10 * 100});
  EXPECT_EQ(measure.GetRightEq(), Sums{1 * 100 + 10 * 1000});
}

TEST(Vollath, ClearBitSkipsTwoStepsAndLaterTriplesAreReadOnePlaceBehindForEach) {
  Mask mask(7, 1);
  mask.SetValid(3, 0, false);  // skips x = 2 and 3; x = 4 reads the triple of column 2
  EXPECT_EQ(SumsOf<int>({1, 2, 3, 4, 5, 6, 7}, &mask), (Sums{1 * 2 + 2 * 3 + 3 * 4, 1 * 3 + 2 * 4 + 3 * 5}));
}

// Deliberate: in each row, as many triples from the left end on are read as positions pass the mask: the
// position falls behind at each masked column.
TEST(Vollath, PositionFallsBehindAtEachMaskedColumn) {
  const std::vector<int> row = {1, 2, 3, 4, 5, 6, 7, 8};
  Mask mask(8, 1);
  mask.SetValid(0, 0, false);  // skips x = 0
  EXPECT_EQ(SumsOf(row, &mask), (Sums{2 + 6 + 12 + 20 + 30, 3 + 8 + 15 + 24 + 35}));
  mask.SetValid(2, 0, false);  // skips x = 1 and 2, leaves x = 3, 4 and 5
  EXPECT_EQ(SumsOf(row, &mask), (Sums{2 + 6 + 12, 3 + 8 + 15}));
}

TEST(Vollath, PositionStartsAgainInEachRow) {
  Image<int> in({4, 2});
  in.SetPixel(0, 0, {1, 2, 3, 4});
  in.SetPixel(0, 1, {5, 6, 7, 8});
  Mask mask(4, 2);
  mask.SetValid(0, 0, false);
  const VollathEvaluation measure;
  measure.Process(&in, &mask, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), Sums{1 * 2 + 5 * 6 + 6 * 7});
  EXPECT_EQ(measure.GetRightEq(), Sums{1 * 3 + 5 * 7 + 6 * 8});
}

// Deliberate: the mask's bit of p2 is not tested.
TEST(Vollath, BitOfP2IsNotTested) {
  Mask mask(5, 1);
  mask.SetValid(4, 0, false);
  EXPECT_EQ(SumsOf<int>({1, 2, 3, 4, 5}, &mask), SumsOf<int>({1, 2, 3, 4, 5}));
}

TEST(Vollath, ExcludedSampleStillServesOncePositionsFallBehind) {
  Mask mask(6, 1);
  mask.SetValid(0, 0, false);
  EXPECT_EQ(SumsOf<int>({100, 2, 3, 4, 5, 6}, &mask),
            (Sums{100 * 2 + 2 * 3 + 3 * 4, 100 * 3 + 2 * 4 + 3 * 5}));
}

TEST(Vollath, MaskThatExcludesEverythingAddsNothing) {
  Mask mask(5, 1, {}, false);
  EXPECT_EQ(SumsOf<int>({1, 2, 3, 4, 5}, &mask), (Sums{0, 0}));
}

TEST(Vollath, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<int> in({5, 2}, {1, 1}, 1);
  Mask mask(9, 2, {3, 2}, false);
  for (int x = 0; x < 5; ++x) mask.SetValid(x, 1, true);
  const VollathEvaluation measure;
  measure.Process(&in, &mask, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), Sums{3});
}

TEST(Vollath, SampleEqualToTheFailureValueRejectsItsTriplesInItsChannelOnly) {
  Image<float> in({6, 1, 2});
  in.Set([](int x, int, std::uint32_t) { return x + 1; });
  in.At(2, 0, 1) = -32767.0f;
  const VollathEvaluation measure;
  measure.Process(&in, nullptr, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), (Sums{2 + 6 + 12 + 20, 20}));
  EXPECT_EQ(measure.GetRightEq(), (Sums{3 + 8 + 15 + 24, 24}));
}

TEST(Vollath, SampleIsRejectedInEachOfTheThreePlaces) {
  constexpr short kFailure = -32767;
  EXPECT_EQ(SumsOf<short>({kFailure, 2, 3}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<short>({1, kFailure, 3}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<short>({1, 2, kFailure}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<short>({1, 2, -32768}), (Sums{2, -32768}));
}

TEST(Vollath, SampleWithin1e9OfTheFailureValueIsRejected) {
  const VollathEvaluation zero = MeasureOf(-10, 10, 0);
  const auto isRejected = [](const VollathEvaluation& measure, double sample) {
    return SumsOf<double>(VollathEvaluation(measure), {sample, 1, 1}) == Sums{0, 0};
  };
  EXPECT_TRUE(isRejected(zero, std::nextafter(1e-9, 0.0)));
  EXPECT_TRUE(isRejected(zero, std::nextafter(-1e-9, 0.0)));
  EXPECT_FALSE(isRejected(zero, 1e-9));
  EXPECT_FALSE(isRejected(zero, -1e-9));
  EXPECT_TRUE(isRejected(VollathEvaluation(), -32767.0 + 274 * 0x1p-38));
  EXPECT_FALSE(isRejected(VollathEvaluation(), -32767.0 + 275 * 0x1p-38));
}

TEST(Vollath, IntegersAreRejectedByAFailureValueThatIsNone) {
  EXPECT_EQ(SumsOf<int>(MeasureOf(-10, 10, 1 + 5e-10), {1, 2, 3, 4}), (Sums{6, 8}));
  EXPECT_EQ(SumsOf<int>(MeasureOf(-10, 10, 1 + 2e-9), {1, 2, 3, 4}), (Sums{8, 11}));
  EXPECT_EQ(SumsOf<int>(MeasureOf(-10, 10, 1.5), {1, 2, 3, 4}), (Sums{8, 11}));
}

TEST(Vollath, SampleEqualToABoundIsRejected) {
  EXPECT_EQ(SumsOf<int>(MeasureOf(1, 5, -32767), {1, 2, 3, 4, 5}), (Sums{6, 8}));
  EXPECT_EQ(SumsOf<double>(MeasureOf(0, 5, -32767), {5e-324, 2, 4}), (Sums{2 * 5e-324, 4 * 5e-324}));
  EXPECT_EQ(SumsOf<double>(MeasureOf(5e-324, 5, -32767), {5e-324, 2, 4}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<int>(MeasureOf(0.5, 4.5, -32767), {1, 2, 3, 4, 5}), (Sums{8, 11}));
}

TEST(Vollath, BoundsAreTenMillionAndTheFailureValueIsMinus32767ByDefault) {
  const VollathEvaluation measure;
  EXPECT_EQ(measure.backgroundLow, -10000000.0);
  EXPECT_EQ(measure.backgroundHigh, 10000000.0);
  EXPECT_EQ(measure.failure, -32767.0);
  EXPECT_TRUE(measure.GetLeftEq().empty());
  EXPECT_TRUE(measure.GetRightEq().empty());
  EXPECT_EQ(SumsOf<int>({1, 2, 10000000}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<int>({1, 2, 9999999}), (Sums{2, 9999999}));
  EXPECT_EQ(SumsOf<int>({1, 2, -10000000}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<int>({1, 2, -9999999}), (Sums{2, -9999999}));
}

TEST(Vollath, BoundsInTheWrongOrderRejectEverything) {
  EXPECT_EQ(SumsOf<int>(MeasureOf(5, 1, -32767), {2, 3, 4}), (Sums{0, 0}));
}

TEST(Vollath, NaNAndInfiniteSamplesAreRejected) {
  EXPECT_EQ(SumsOf<double>(Unbounded(), {kNaN, 2, 3, 4, 5}), (Sums{18, 23}));
  EXPECT_EQ(SumsOf<double>(Unbounded(), {kInfinity, 2, 3, 4, 5}), (Sums{18, 23}));
  EXPECT_EQ(SumsOf<float>(Unbounded(), {-std::numeric_limits<float>::infinity(), 2, 3, 4, 5}),
            (Sums{18, 23}));
}

TEST(Vollath, BoundThatIsNaNRejectsEverythingAndAFailureValueThatIsNaNNothing) {
  EXPECT_EQ(SumsOf<int>(MeasureOf(kNaN, 10, -32767), {1, 2, 3}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<int>(MeasureOf(-10, kNaN, -32767), {1, 2, 3}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<int>(MeasureOf(-10, 10, kNaN), {1, 2, 3}), (Sums{2, 3}));
  EXPECT_EQ(SumsOf<int>(MeasureOf(-10, 10, kInfinity), {1, 2, 3}), (Sums{2, 3}));
}

TEST(Vollath, RowWhereEverySampleIsRejectedAddsNothing) {
  Image<int> in({100, 3}, {}, 2);
  for (int x = 0; x < 100; ++x) in.At(x, 1) = 20000000;
  const VollathEvaluation measure;
  measure.Process(&in, nullptr, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), Sums{2 * 98 * 4});
}

// ---- golden: precision

TEST(Vollath, SamplesAreConvertedToDoubleWithoutAStepThroughFloat) {
  EXPECT_EQ(SumsOf<int>(Unbounded(), {1, 16777217, 33554433}), (Sums{16777217, 33554433}));
  EXPECT_EQ(SumsOf<double>(Unbounded(), {1, 0.1, 0.2}), (Sums{0.1, 0.2}));
  EXPECT_EQ(SumsOf<unsigned int>(Unbounded(), {1, 4294967295u, 4294967294u}),
            (Sums{4294967295.0, 4294967294.0}));
  EXPECT_EQ(SumsOf<char>(Unbounded(), {1, -128, 127}), (Sums{-128, 127}));
  EXPECT_EQ(SumsOf<unsigned char>(Unbounded(), {1, 255, 254}), (Sums{255, 254}));
}

TEST(Vollath, SamplesOf64BitsAreRoundedToDouble) {
  constexpr std::int64_t kBig = (std::int64_t{1} << 53) + 1;
  EXPECT_EQ(SumsOf<std::int64_t>(Unbounded(), {1, kBig, -kBig}), (Sums{0x1p53, -0x1p53}));
  EXPECT_EQ(SumsOf<std::uint64_t>(Unbounded(), {1, ~0ull, 1ull << 63}), (Sums{0x1p64, 0x1p63}));
}

TEST(Vollath, BoundsMeetA64BitSampleAsADouble) {
  constexpr std::int64_t kBig = (std::int64_t{1} << 53) + 1;
  EXPECT_EQ(SumsOf<std::int64_t>(MeasureOf(0, 0x1p53 + 2, -32767), {1, kBig, 2}), (Sums{0x1p53, 2}));
  EXPECT_EQ(SumsOf<std::int64_t>(MeasureOf(0, 0x1p53, -32767), {1, kBig - 2, 2}), (Sums{0x1p53 - 1, 2}));
  EXPECT_EQ(SumsOf<std::int64_t>(MeasureOf(0, 0x1p53, -32767), {1, kBig, 2}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<std::int64_t>(MeasureOf(0, 0x1p60, 0x1p53), {1, kBig, 2}), (Sums{0, 0}));
  EXPECT_EQ(SumsOf<std::uint64_t>(MeasureOf(0, 0x1p64, -1), {1, ~0ull, 2}), (Sums{0, 0}));
}

TEST(Vollath, SumsAreAddedInTheOrderOfThePixels) {
  // 2^53, then 1 twice, which are lost one by one
  EXPECT_EQ(SumsOf<double>(Unbounded(), {0x1p53, 1, 1, 1, 1}), (Sums{0x1p53, 0x1p53}));
  // left: 1 twice, then 2^53; right: 1, 2^53, 0
  EXPECT_EQ(SumsOf<double>(Unbounded(), {1, 1, 1, 0x1p53, 0}), (Sums{0x1p53 + 2, 0x1p53}));
}

/// Sums up from `start` on in the order of `terms`: as left sum of two rows, and one by one.
::testing::AssertionResult IsSummedInOrder(double start, const std::vector<double>& terms) {
  const auto width = static_cast<std::uint32_t>(3 * terms.size() + 3);
  Image<double> in({width, 2});
  in.SetPixel(0, 0, {1.0, start, 0.0});
  double expected = start;
  for (std::size_t i = 0; i < terms.size(); ++i) {
    in.SetPixel(static_cast<int>(3 * i), 1, {1.0, terms[i], 0.0});
    expected += terms[i];
  }
  const VollathEvaluation measure = Unbounded();
  measure.Process(&in, nullptr, nullptr);
  if (measure.GetLeftEq()[0] == expected) return ::testing::AssertionSuccess();
  return SameSums({expected}, measure.GetLeftEq())
         << ", start " << ::testing::PrintToString(start) << ", terms " << ::testing::PrintToString(terms);
}

/// These terms, and others of 0 up to a count of `count`.
std::vector<double> Padded(std::vector<double> terms, std::size_t count) {
  terms.resize(std::max(count, terms.size()), 0.0);
  return terms;
}

TEST(Vollath, SumThatLeavesItsPowersOfTwoIsRoundedToTheirUnits) {
  for (const std::size_t count : {2u, 3u, 16u, 33u, 170u, 171u, 500u}) {
    for (const double sign : {1.0, -1.0}) {
      const double power = sign * 0x1p53;
      EXPECT_TRUE(IsSummedInOrder(power, Padded({-0.75 * sign}, count)));
      EXPECT_TRUE(IsSummedInOrder(power, Padded({-0.75 * sign, 1.125 * sign}, count)));
      EXPECT_TRUE(IsSummedInOrder(power, Padded({1.125 * sign, -0.75 * sign, -0.75 * sign}, count)));
      EXPECT_TRUE(IsSummedInOrder(power, std::vector<double>(count, sign)));
      EXPECT_TRUE(IsSummedInOrder(2 * power - 4 * sign, std::vector<double>(count, 1.5 * sign)));
      EXPECT_TRUE(IsSummedInOrder(1.5 * power, Padded({-0.375 * power - sign, -2 * sign}, count)));
      EXPECT_TRUE(IsSummedInOrder(1.5 * power, Padded({-1.5 * power, 0.25, 0x1p-50}, count)));
      EXPECT_TRUE(IsSummedInOrder(power, Padded({-2 * power, 3 * power, 0.75 * sign}, count)));
    }
  }
}

TEST(Vollath, SumsAroundPowersOfTwoAreRoundedTermByTerm) {
  tests::Random random(20240601);
  for (int i = 0; i < 5000; ++i) {
    const double unit = std::ldexp(1.0, static_cast<int>(random.Below(40)) - 20);
    const double start = (random.OneIn(2) ? 0x1p53 : 0x1p52 + random.Below(5)) + random.Below(3) * 2.0;
    std::vector<double> terms(1 + random.Below(random.OneIn(20) ? 400 : 6));
    const std::uint32_t largest = 2 + random.Below(24), bias = random.Below(largest);
    for (double& term : terms) {
      term = (static_cast<double>(random.Below(largest)) - bias) * 0.125 * unit;
      if (random.OneIn(50)) term *= 0x1p49;
    }
    ASSERT_TRUE(IsSummedInOrder((random.OneIn(2) ? unit : -unit) * start, Padded(terms, 12)));
  }
}

TEST(Vollath, ProductsOverflowToInfinityAndTheirSumToNaN) {
  EXPECT_EQ(SumsOf<double>(Unbounded(), {1e200, 1e200, 1, 1}), (Sums{kInfinity, 2e200}));
  const Sums sums = SumsOf<double>(Unbounded(), {1e200, 1e200, -1e200, 1});
  EXPECT_TRUE(std::isnan(sums[0]));
}

// The products are odd: from 2^53 on each sum is rounded.
TEST(Vollath, SumsBeyond2To53AreRoundedAtEachAddition) {
  Image<unsigned short> in({2300, 1000});
  in.Set([](int x, int y, std::uint32_t) { return 65535 - 2 * ((x * 7 + y * 13) % 20); });
  const VollathEvaluation measure;
  reference::VollathEvaluation twin;
  for (int call = 0; call < 2; ++call) {
    measure.Process(&in, nullptr, nullptr);
    twin.Process(in, nullptr);
    EXPECT_TRUE(SameSums(twin.GetLeftEq(), measure.GetLeftEq()));
    EXPECT_TRUE(SameSums(twin.GetRightEq(), measure.GetRightEq()));
    EXPECT_GT(measure.GetLeftEq()[0], 0x1p53);
  }
}

// ---- golden: the object

// Deliberate: the totals are not reset by a call with the same type.
TEST(Vollath, TotalsAreNotResetByACallWithTheSameType) {
  const VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{16, 22}));
  EXPECT_EQ(SumsOf<short>(measure, {2, 3, 5}), (Sums{22, 32}));
}

TEST(Vollath, EachCallStartsASumOfItsOwnThatIsAddedToTheTotal) {
  const VollathEvaluation measure = Unbounded();
  EXPECT_EQ(SumsOf<double>(measure, {0x1p53, 1, 0})[0], 0x1p53);
  EXPECT_EQ(SumsOf<double>(measure, {1, 1, 1, 0})[0], 0x1p53 + 2);  // 1 + 1 in one call
}

TEST(Vollath, ChangeOfTheInputsTypeResetsTheTotals) {
  const VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  EXPECT_EQ(SumsOf<int>(measure, {2, 3, 5}), (Sums{6, 10}));
  EXPECT_EQ(SumsOf<short>(measure, {2, 3, 5}), (Sums{6, 10}));
}

TEST(Vollath, InitEvaluationOnTheObjectClearsACopyThatTheNextCallOverwritesWithTheTotals) {
  VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  measure.InitEvaluation(3);
  EXPECT_EQ(measure.numChannels, 3u);
  EXPECT_EQ(measure.GetLeftEq(), (Sums{0, 0, 0}));
  EXPECT_EQ(measure.GetRightEq(), (Sums{0, 0, 0}));
  EXPECT_EQ(SumsOf<short>(measure, {2, 3, 5}), (Sums{14, 21}));
  EXPECT_EQ(measure.GetLeftEq().size(), 1u);
  EXPECT_EQ(measure.GetRightEq().size(), 1u);
}

TEST(Vollath, FewerChannelsInALaterCallLeaveTheOtherTotals) {
  const VollathEvaluation measure;
  Image<short> three({3, 1, 3}, {}, 2), one({3, 1, 1}, {}, 3);
  measure.Process(&three, nullptr, nullptr);
  measure.Process(&one, nullptr, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), (Sums{13, 4, 4}));
  EXPECT_EQ(measure.GetRightEq(), (Sums{13, 4, 4}));
}

TEST(Vollath, NullOutputWorksAndNoOutputIsTouched) {
  Image<short> in({3, 1}, {}, 2);
  for (const DataType type :
       {DataType(tessel::eDT_16S), DataType(tessel::eDT_32F, true), DataType(tessel::eDT_BIT), DataType()}) {
    unsigned char bytes[64] = {};
    Raster out({3, 1, 1, type}, {}, bytes);
    const VollathEvaluation measure;
    measure.Process(&in, nullptr, nullptr);
    measure.Process(&in, nullptr, &out);
    EXPECT_EQ(measure.GetLeftEq(), Sums{8});
    for (const unsigned char byte : bytes) EXPECT_EQ(byte, 0);
  }
}

TEST(Vollath, ResultsAreCopies) {
  const VollathEvaluation measure;
  SumsOf<short>(measure, {1, 2, 3, 4});
  measure.GetLeftEq()[0] = 0;
  measure.GetRightEq()[0] = 0;
  EXPECT_EQ(measure.GetLeftEq(), Sums{8});
  EXPECT_EQ(measure.GetRightEq(), Sums{11});
}

// ---- failures

TEST(VollathFailure, NullInputIsAnInvalidPointer) {
  Image<short> out({3, 1});
  FillBytes(out);
  const VollathEvaluation measure;
  EXPECT_TRUE(
      Throws<Exception>("poRasterIn is invalid pointer", [&] { measure.Process(nullptr, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { measure.Process(nullptr, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST(VollathFailure, NoChannelsAreToldBeforeTheType) {
  constexpr const char* kMessage = "poRasterIn must have minimum 1 channels.";
  const VollathEvaluation measure;
  for (const DataType type :
       {DataType(tessel::eDT_16S), DataType(tessel::eDT_BIT), DataType(), DataType(tessel::eDT_32F, true)}) {
    Raster in({3, 2, 0, type}, {});
    EXPECT_TRUE(Throws<Exception>(kMessage, [&] { measure.Process(&in, nullptr, nullptr); }));
  }
  EXPECT_TRUE(measure.GetLeftEq().empty());
}

TEST(VollathFailure, TypesOutsideTheListAreInvalidComplexOnesIncluded) {
  std::vector<DataType> types = {DataType(), DataType(tessel::eDT_BIT)};
  for (const PixelType& type : tests::kPixelTypes) types.push_back(DataType(type.element, true));
  for (const DataType& type : types) {
    Raster odd({3, 2, 1, type}, {});
    const VollathEvaluation measure;
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { measure.Process(&odd, nullptr, nullptr); }));
    EXPECT_TRUE(measure.GetLeftEq().empty());
    EXPECT_TRUE(measure.GetRightEq().empty());
  }
}

// ---- differential

struct VollathDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(VollathDifferential, AgreesWithTheTwinBitForBit) {
  for (const std::vector<tests::FocusStep>& sequence : tests::FocusSequencesFrom(GetParam())) {
    VollathEvaluation measure;
    reference::VollathEvaluation twin;
    for (const tests::FocusStep& step : sequence) {
      const tests::FocusScene scene(step);
      const std::vector<unsigned char> before = tests::Bytes(*scene.in);
      Prepare(step, measure);
      Prepare(step, twin);
      measure.Process(scene.in.get(), scene.mask.get(), nullptr);
      twin.Process(*scene.in, scene.mask.get());
      ASSERT_TRUE(SameSums(twin.GetLeftEq(), measure.GetLeftEq())) << "left, " << step;
      ASSERT_TRUE(SameSums(twin.GetRightEq(), measure.GetRightEq())) << "right, " << step;
      ASSERT_EQ(tests::Bytes(*scene.in), before);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(From, VollathDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

// ---- contract

TEST(VollathContract, ParametersSetAfterTheFirstProcessAreIgnoredWhileTheTypeStays) {
  VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  measure.SetBackground(100, 200);
  measure.SetFailure(2);
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{16, 22}));
}

TEST(VollathContract, ParametersSetAfterTheFirstProcessAreTakenWhenTheInputsTypeChanges) {
  VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  measure.SetBackground(1, 200);
  EXPECT_EQ(SumsOf<int>(measure, {1, 2, 3, 4}), (Sums{6, 8}));
  measure.SetFailure(2);
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{0, 0}));
}

TEST(VollathContract, OutputsTypeIsNotCompared) {
  VollathEvaluation measure;
  Image<short> in({3, 1}, {}, 2), sameOut({3, 1});
  Image<float> out({3, 1});
  measure.Process(&in, nullptr, &sameOut);
  measure.SetFailure(2);
  measure.Process(&in, nullptr, &out);
  measure.Process(&in, nullptr, nullptr);
  EXPECT_EQ(measure.GetLeftEq(), Sums{12});
}

/// A call that the dispatcher refuses.
void FailToDispatch(const VollathEvaluation& measure) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {});
  EXPECT_TRUE(
      Throws<Exception>("Invalid type requested.", [&] { measure.Process(&bits, nullptr, nullptr); }));
}

TEST(VollathContract, RefusedTypeLeavesTheResultsAndLosesTheTotals) {
  VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  FailToDispatch(measure);
  FailToDispatch(measure);
  EXPECT_EQ(measure.GetLeftEq(), Sums{8});
  measure.SetBackground(1, 200);
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{6, 8}));
}

TEST(VollathContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto measure = std::make_unique<VollathEvaluation>();
  EXPECT_EQ(SumsOf<short>(*measure, {1, 2, 3, 4}), (Sums{8, 11}));
  FailToDispatch(*measure);
}

TEST(VollathContract, FailedGuardLeavesTheProcessorAsItWas) {
  VollathEvaluation measure;
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{8, 11}));
  measure.SetFailure(2);
  Raster noChannels({3, 1, 0, DataType(tessel::eDT_32S)}, {});
  EXPECT_THROW(measure.Process(nullptr, nullptr, nullptr), Exception);
  EXPECT_THROW(measure.Process(&noChannels, nullptr, nullptr), Exception);
  EXPECT_EQ(SumsOf<short>(measure, {1, 2, 3, 4}), (Sums{16, 22}));
}

TEST(VollathContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  VollathEvaluation original = MeasureOf(1, 200, -32767);
  original.InitEvaluation(2);
  VollathEvaluation copy(original), assigned;
  assigned = original;
  copy.SetBackground(-10, 200);
  EXPECT_EQ(copy.GetLeftEq(), (Sums{0, 0}));
  EXPECT_EQ(assigned.numChannels, 2u);
  EXPECT_EQ(SumsOf<short>(original, {1, 2, 3, 4}), (Sums{6, 8}));
  EXPECT_EQ(SumsOf<short>(copy, {1, 2, 3, 4}), (Sums{8, 11}));
  EXPECT_EQ(SumsOf<short>(assigned, {1, 2, 3, 4}), (Sums{6, 8}));
}

TEST(VollathContract, DerivedClassesCanSetTheSums) {
  struct Open : VollathEvaluation {
    using VollathEvaluation::SetLeftEvaluation;
    using VollathEvaluation::SetRightEvaluation;
  };
  const Open measure;
  measure.SetLeftEvaluation({1, 2});
  measure.SetRightEvaluation({3});
  EXPECT_EQ(measure.GetLeftEq(), (Sums{1, 2}));
  EXPECT_EQ(measure.GetRightEq(), Sums{3});
}

}  // namespace
}  // namespace orvik::filters
