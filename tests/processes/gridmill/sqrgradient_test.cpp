#include "processes/gridmill/sqrgradient.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/sqrgradient_reference.h"
#include "tests/support/capturedoutput.h"
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

/// Runs and returns what was printed.
std::string Process(const SqrGradientEvaluation& measure, Raster* in, Mask* mask = nullptr,
                    Raster* out = nullptr) {
  tests::CapturedOutput output;
  measure.Process(in, mask, out);
  return output.End();
}

/// Runs on a new object that expects the channels of the input.
Sums SumsOf(Raster& in, Mask* mask = nullptr) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(in.channels);
  Process(measure, &in, mask);
  return measure.GetEvaluation();
}

/// Runs on one column of one channel and returns what the call adds up to.
template <class T>
double SumOf(SqrGradientEvaluation measure, const std::vector<T>& column, Mask* mask = nullptr) {
  Image<T> in({1, static_cast<std::uint32_t>(column.size())});
  std::copy(column.begin(), column.end(), in.Elements());
  measure.InitEvaluation(1);
  Process(measure, &in, mask);
  return measure.GetEvaluation().at(0);
}
template <class T>
double SumOf(const std::vector<T>& column, Mask* mask = nullptr) {
  return SumOf<T>(SqrGradientEvaluation(), column, mask);
}

/// A measure with the given bounds and failure value.
SqrGradientEvaluation MeasureOf(double low, double high, double failure) {
  SqrGradientEvaluation measure;
  measure.SetBackground(low, high);
  measure.SetFailure(failure);
  return measure;
}
SqrGradientEvaluation Unbounded() { return MeasureOf(-kInfinity, kInfinity, -32767); }

/// In each channel two samples whose difference is `step`, one below the other.
template <class T>
struct Step : Image<T> {
  explicit Step(int step, std::uint32_t channels = 1) : Image<T>({1, 2, channels}, {}, static_cast<T>(100)) {
    for (std::uint32_t c = 0; c < channels; ++c) this->At(0, 1, c) = static_cast<T>(100 + step);
  }
};

// ---- golden

TEST(SqrGradient, SumTakesTheSampleARowBelow) {
  Image<short> in({2, 2});
  in.SetPixel(0, 0, {1, 2, 4, 6});
  EXPECT_EQ(SumsOf(in), Sums{25});
  EXPECT_EQ(SumOf<short>({1, 5, 2}), 16 + 9);
}

TEST(SqrGradient, HeightOf1OrLessAddsNothingAndPrintsALineOfZeroForEachChannel) {
  for (const std::uint32_t height : {0u, 1u}) {
    Image<short> in({5, height, 3}, {2, 2});
    in.Set([](int x, int y, std::uint32_t) { return 10 * x + 7 * y; });
    SqrGradientEvaluation measure;
    measure.InitEvaluation(3);
    EXPECT_EQ(Process(measure, &in),
              "\n BEFORE - 101 0.000000\n\n BEFORE - 101 0.000000\n\n BEFORE - 101 0.000000\n");
    EXPECT_EQ(measure.GetEvaluation(), (Sums{0, 0, 0}));
  }
}

TEST(SqrGradient, WidthOfZeroAddsNothingAndPrintsALineOfZeroForEachChannel) {
  Image<short> in({0, 5, 2}, {2, 2});
  in.Set([](int x, int y, std::uint32_t) { return 10 * x + 7 * y; });
  SqrGradientEvaluation measure;
  measure.InitEvaluation(2);
  EXPECT_EQ(Process(measure, &in), "\n BEFORE - 101 0.000000\n\n BEFORE - 101 0.000000\n");
  EXPECT_EQ(measure.GetEvaluation(), (Sums{0, 0}));
}

TEST(SqrGradient, ConstantRasterGivesSumsOfExactlyZero) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class T>() {
      Image<T> in({300, 5, 3}, {1, 1}, static_cast<T>(99));
      EXPECT_EQ(SumsOf(in), (Sums{0, 0, 0})) << type;
    });
  }
}

TEST(SqrGradient, LastRowNeverServesAsP0AndTheFirstRowNeverServesAsP1) {
  Image<short> in({2, 3}, {1, 2}, 9000);
  for (int x = 0; x < 2; ++x) {
    in.At(x, 0) = 1;
    in.At(x, 1) = 11;
    in.At(x, 2) = 111;
  }
  EXPECT_EQ(SumsOf(in), Sums{2 * (100 + 10000)});
}

TEST(SqrGradient, ClearBitSkipsTheStepsOfItsColumnInItsRowAndTheRowAbove) {
  Image<int> in({3, 4});
  in.Set([](int x, int y, std::uint32_t) { return y * (x == 0 ? 1 : x == 1 ? 10 : 100); });
  Mask mask(3, 4);
  mask.SetValid(1, 1, false);  // in rows 0 and 1 the steps x = 0 and 2 read the columns 0 and 1
  EXPECT_EQ(SumsOf(in, &mask), Sums{2 * (1 + 100) + (1 + 100 + 10000)});
}

// Deliberate: in each row, as many pairs from the left end on are read as pixels are set in the mask in both
// rows: the position falls behind at each masked column.
TEST(SqrGradient, PositionFallsBehindAtEachMaskedColumn) {
  Image<int> in({4, 2});
  for (int x = 0; x < 4; ++x) in.At(x, 1) = x + 1;
  Mask mask(4, 2);
  mask.SetValid(0, 0, false);
  EXPECT_EQ(SumsOf(in, &mask), Sums{1 + 4 + 9});
  mask.SetValid(2, 1, false);
  EXPECT_EQ(SumsOf(in, &mask), Sums{1 + 4});
}

TEST(SqrGradient, PositionStartsAgainInEachRow) {
  Image<int> in({3, 3});
  in.Set([](int x, int y, std::uint32_t) { return y * (x + 1); });
  Mask mask(3, 3);
  mask.SetValid(0, 0, false);
  EXPECT_EQ(SumsOf(in, &mask), Sums{(1 + 4) + (1 + 4 + 9)});
}

TEST(SqrGradient, MaskThatExcludesEverythingAddsNothing) {
  Step<short> in(7);
  Mask mask(1, 2, {}, false);
  EXPECT_EQ(SumsOf(in, &mask), Sums{0});
}

TEST(SqrGradient, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<int> in({5, 3}, {1, 1});
  in.Set([](int, int y, std::uint32_t) { return y * y; });
  Mask mask(9, 3, {3, 2}, false);
  for (int x = 1; x < 4; ++x) {
    mask.SetValid(x, 1, true);
    mask.SetValid(x, 2, true);
  }
  EXPECT_EQ(SumsOf(in, &mask), Sums{3 * 9});
}

TEST(SqrGradient, SampleEqualToTheFailureValueRejectsItsPairsInItsChannelOnly) {
  Image<float> in({1, 5, 2});
  in.Set([](int, int y, std::uint32_t) { return y * y; });
  in.At(0, 2, 1) = -32767.0f;
  EXPECT_EQ(SumsOf(in), (Sums{1 + 9 + 25 + 49, 1 + 49}));
}

TEST(SqrGradient, SampleWithin1e9OfTheFailureValueIsRejected) {
  const SqrGradientEvaluation zero = MeasureOf(-10, 10, 0);
  const auto isRejected = [](const SqrGradientEvaluation& measure, double sample) {
    const bool above = SumOf<double>(measure, {sample, 1}) == 0;
    EXPECT_EQ(SumOf<double>(measure, {1, sample}) == 0, above);
    return above;
  };
  EXPECT_TRUE(isRejected(zero, std::nextafter(1e-9, 0.0)));
  EXPECT_TRUE(isRejected(zero, std::nextafter(-1e-9, 0.0)));
  EXPECT_FALSE(isRejected(zero, 1e-9));
  EXPECT_FALSE(isRejected(zero, -1e-9));
  EXPECT_TRUE(isRejected(SqrGradientEvaluation(), -32767.0 + 274 * 0x1p-38));
  EXPECT_FALSE(isRejected(SqrGradientEvaluation(), -32767.0 + 275 * 0x1p-38));
}

TEST(SqrGradient, IntegersAreRejectedByAFailureValueThatIsNone) {
  EXPECT_EQ(SumOf<int>(MeasureOf(-10, 10, 1 + 5e-10), {1, 3, 6}), 9);
  EXPECT_EQ(SumOf<int>(MeasureOf(-10, 10, 1 + 2e-9), {1, 3, 6}), 13);
  EXPECT_EQ(SumOf<int>(MeasureOf(-10, 10, 1.5), {1, 3, 6}), 13);
}

TEST(SqrGradient, SampleEqualToABoundIsRejected) {
  EXPECT_EQ(SumOf<int>(MeasureOf(1, 6, -32767), {1, 2, 4, 6, 5, 4}), 4 + 1);
  EXPECT_EQ(SumOf<int>(MeasureOf(0.5, 5.5, -32767), {1, 2, 4, 6, 5, 4}), 1 + 4 + 1);
  EXPECT_EQ(SumOf<double>(MeasureOf(5e-324, 5, -32767), {5e-324, 2}), 0);
  EXPECT_EQ(SumOf<double>(MeasureOf(0, 5, -32767), {5e-324, 2}), 4);
}

TEST(SqrGradient, BoundsAreTenMillionAndTheFailureValueIsMinus32767ByDefault) {
  const SqrGradientEvaluation measure;
  EXPECT_EQ(measure.backgroundLow, -10000000.0);
  EXPECT_EQ(measure.backgroundHigh, 10000000.0);
  EXPECT_EQ(measure.failure, -32767.0);
  EXPECT_TRUE(measure.GetEvaluation().empty());
  EXPECT_EQ(SumOf<int>({9999998, 10000000}), 0);
  EXPECT_EQ(SumOf<int>({9999998, 9999999}), 1);
  EXPECT_EQ(SumOf<int>({-9999998, -10000000}), 0);
  EXPECT_EQ(SumOf<int>({-9999998, -9999999}), 1);
}

TEST(SqrGradient, BoundsInTheWrongOrderRejectEverything) {
  EXPECT_EQ(SumOf<int>(MeasureOf(5, 1, -32767), {2, 4}), 0);
}

TEST(SqrGradient, NaNAndInfiniteSamplesAreRejected) {
  EXPECT_EQ(SumOf<double>(Unbounded(), {1, kNaN, 2, 4}), 4);
  EXPECT_EQ(SumOf<double>(Unbounded(), {1, kInfinity, 2, 4}), 4);
  EXPECT_EQ(SumOf<float>(Unbounded(), {1, -std::numeric_limits<float>::infinity(), 2, 4}), 4);
}

TEST(SqrGradient, BoundThatIsNaNRejectsEverythingAndAFailureValueThatIsNaNNothing) {
  EXPECT_EQ(SumOf<int>(MeasureOf(kNaN, 10, -32767), {1, 3}), 0);
  EXPECT_EQ(SumOf<int>(MeasureOf(-10, kNaN, -32767), {1, 3}), 0);
  EXPECT_EQ(SumOf<int>(MeasureOf(-10, 10, kNaN), {1, 3}), 4);
  EXPECT_EQ(SumOf<int>(MeasureOf(-10, 10, kInfinity), {1, 3}), 4);
}

TEST(SqrGradient, RowWhereEverySampleIsRejectedAddsNothing) {
  Image<int> in({100, 4});
  in.Set([](int, int y, std::uint32_t) { return y == 1 ? 20000000 : 3 * y; });
  EXPECT_EQ(SumsOf(in), Sums{100 * 9});
}

// ---- golden: precision

TEST(SqrGradient, DifferencesAreTakenInDouble) {
  EXPECT_EQ(SumOf<unsigned char>({0, 255}), 65025);
  EXPECT_EQ(SumOf<unsigned char>({255, 0}), 65025);
  EXPECT_EQ(SumOf<char>({-128, 127}), 65025);
  EXPECT_EQ(SumOf<unsigned short>({65535, 0}), 4294836225.0);
  EXPECT_EQ(SumOf<unsigned int>(Unbounded(), {4294967295u, 4294967293u}), 4);
  EXPECT_EQ(SumOf<int>(Unbounded(), {16777216, 16777217}), 1);
  EXPECT_EQ(SumOf<int>(Unbounded(), {-2147483647, 2147483647}), 4294967294.0 * 4294967294.0);
  EXPECT_EQ(SumOf<double>({0.25, 0.25 + 0x1p-40}), 0x1p-80);
  EXPECT_EQ(SumOf<float>({0.1f, 0.0f}), static_cast<double>(0.1f) * static_cast<double>(0.1f));
}

TEST(SqrGradient, SamplesOf64BitsAreRoundedToDouble) {
  constexpr std::int64_t kBig = std::int64_t{1} << 53;
  EXPECT_EQ(SumOf<std::int64_t>(Unbounded(), {kBig, kBig + 1}), 0);
  EXPECT_EQ(SumOf<std::int64_t>(Unbounded(), {kBig, kBig + 3}), 16);
  EXPECT_EQ(SumOf<std::uint64_t>(Unbounded(), {0, ~0ull}), 0x1p128);
  EXPECT_EQ(SumOf<std::uint64_t>(Unbounded(), {1ull << 63, (1ull << 63) + 2048}), 0x1p22);
}

TEST(SqrGradient, BoundsMeetA64BitSampleAsADouble) {
  constexpr std::int64_t kBig = std::int64_t{1} << 53;
  EXPECT_EQ(SumOf<std::int64_t>(MeasureOf(0, 0x1p53, -1), {kBig - 1, kBig - 3}), 4);
  EXPECT_EQ(SumOf<std::int64_t>(MeasureOf(0, 0x1p53, -1), {kBig + 1, kBig - 3}), 0);
  EXPECT_EQ(SumOf<std::int64_t>(MeasureOf(0, 0x1p60, 0x1p53), {kBig + 1, kBig - 3}), 0);
  EXPECT_EQ(SumOf<std::uint64_t>(MeasureOf(0, 0x1p64, -1), {~0ull, 5}), 0);
}

TEST(SqrGradient, SumsAreAddedInTheOrderOfThePixels) {
  const double big = 0x1p27;  // its square is 2^54
  EXPECT_EQ(SumOf<double>(Unbounded(), {0, big, big + 1, big + 2}), 0x1p54);
  EXPECT_EQ(SumOf<double>(Unbounded(), {2, 1, 0, big}), 0x1p54);  // 2 + 2^54 is a tie
  EXPECT_EQ(SumOf<double>(Unbounded(), {4, 2, 0, big}), 0x1p54 + 8);
  EXPECT_EQ(SumOf<double>(Unbounded(), {0, big, big + 1, big + 2, big + 4}), 0x1p54 + 4);
}

TEST(SqrGradient, SumsAroundPowersOfTwoAreRoundedTermByTerm) {
  tests::Random random(20240602);
  for (int i = 0; i < 1000; ++i) {
    const std::uint32_t width = 1 + random.Below(1200);
    Image<double> in({width, 3});
    const double first = 0x1p27 - random.Below(3) * 0x1p-27;  // its square is 2^54 or just below
    const std::uint32_t largest = 2 + random.Below(20);
    double expected = first * first;
    in.At(0, 1) = in.At(0, 2) = first;
    for (int x = 1; x < static_cast<int>(width); ++x) {
      const double root = 0.25 * random.Below(random.OneIn(50) ? 1u << 26 : largest);
      in.At(x, 2) = root;
      expected += root * root;
    }
    SqrGradientEvaluation measure = Unbounded();
    measure.InitEvaluation(1);
    Process(measure, &in);
    ASSERT_TRUE(SameSums({expected}, measure.GetEvaluation())) << width << " pixels";
  }
}

TEST(SqrGradient, SquaresOverflowToInfinity) {
  EXPECT_EQ(SumOf<double>(Unbounded(), {1e200, 0, 1}), kInfinity);
  EXPECT_EQ(SumOf<double>(Unbounded(), {1.7e308, -1.7e308}), kInfinity);
}

// The squares are odd: from 2^53 on each sum is rounded.
TEST(SqrGradient, SumsBeyond2To53AreRoundedAtEachAddition) {
  Image<unsigned short> in({2300, 1001});
  in.Set([](int x, int y, std::uint32_t) { return y % 2 == 0 ? 0 : 65535 - 2 * ((x * 7 + y * 13) % 20); });
  SqrGradientEvaluation measure;
  reference::SqrGradientEvaluation twin;
  measure.InitEvaluation(1);
  twin.InitEvaluation(1);
  for (int call = 0; call < 2; ++call) {
    EXPECT_EQ(Process(measure, &in), twin.Process(in, nullptr));
    EXPECT_TRUE(SameSums(twin.GetEvaluation(), measure.GetEvaluation()));
    EXPECT_GT(measure.GetEvaluation()[0], 0x1p53);
  }
}

// ---- golden: the object

// Deliberate: without a call of `InitEvaluation` on this object the result stays empty.
TEST(SqrGradient, WithoutACallOfInitEvaluationTheResultStaysEmpty) {
  SqrGradientEvaluation measure;
  Step<short> in(3);
  EXPECT_EQ(Process(measure, &in), "\n BEFORE - 101 9.000000\n");
  EXPECT_TRUE(measure.GetEvaluation().empty());
  measure.InitEvaluation(1);
  Process(measure, &in);
  EXPECT_EQ(measure.GetEvaluation(), Sums{18});
}

// Deliberate: after a call the running total of all calls with this type is added to the result, which
// therefore grows quadratically: sums s1 and s2 give s1 + (s1 + s2).
TEST(SqrGradient, RunningTotalOfAllCallsIsAddedToTheResult) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  Step<short> first(3), second(5), third(1);
  Process(measure, &first);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9});
  Process(measure, &second);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9 + (9 + 25)});
  Process(measure, &third);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9 + (9 + 25) + (9 + 25 + 1)});
}

// Deliberate: every call prints a line for each channel to the standard output: "\n BEFORE - 101 %f\n" with
// the sum of the call.
TEST(SqrGradient, EveryCallPrintsALineForEachChannelWithTheSumOfTheCall) {
  const SqrGradientEvaluation measure;
  Image<double> in({1, 2, 3});
  in.SetPixel(0, 1, {1.5, 1000.0, 0.001});
  const std::string expected =
      "\n BEFORE - 101 2.250000\n\n BEFORE - 101 1000000.000000\n\n BEFORE - 101 0.000001\n";
  EXPECT_EQ(Process(measure, &in), expected);
  EXPECT_EQ(Process(measure, &in), expected);
}

TEST(SqrGradient, LineHoldsAllDigitsOfALargeSum) {
  Image<double> in({1, 2});
  in.At(0, 1) = 0x1p100;
  EXPECT_EQ(Process(Unbounded(), &in),
            "\n BEFORE - 101 1606938044258990275541962092341162602522202993782792835301376.000000\n");
  in.At(0, 1) = 1e200;
  EXPECT_EQ(Process(Unbounded(), &in), "\n BEFORE - 101 inf\n");
}

TEST(SqrGradient, EveryInputTypePrints) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class T>() {
      Step<T> in(3);
      EXPECT_EQ(Process(SqrGradientEvaluation(), &in), "\n BEFORE - 101 9.000000\n") << type;
    });
  }
}

TEST(SqrGradient, EachCallStartsASumOfItsOwnThatIsAddedToTheTotal) {
  SqrGradientEvaluation measure = Unbounded();
  Image<double> big({1, 2}), small({1, 5});
  big.At(0, 1) = 0x1p27;
  small.SetPixel(0, 0, {1, 0, 1, 0, 1});
  Process(measure, &big);
  measure.InitEvaluation(1);
  Process(measure, &small);
  EXPECT_EQ(measure.GetEvaluation(), Sums{0x1p54 + 4});
}

TEST(SqrGradient, ChangeOfTheInputsTypeResetsTheRunningTotalButNotTheResult) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  Step<short> first(3);
  Step<int> second(5);
  Process(measure, &first);
  Process(measure, &second);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9 + 25});
  Process(measure, &first);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9 + 25 + 9});
}

TEST(SqrGradient, InitEvaluationClearsTheResultButNotTheRunningTotal) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  EXPECT_EQ(measure.numChannels, 1u);
  Step<short> in(3);
  Process(measure, &in);
  measure.InitEvaluation(1);
  EXPECT_EQ(measure.GetEvaluation(), Sums{0});
  Process(measure, &in);
  EXPECT_EQ(measure.GetEvaluation(), Sums{18});
}

TEST(SqrGradient, ResultOfFewerChannelsThanTheInputTakesThoseThatItHas) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(2);
  Step<short> in(3, 3);
  in.At(0, 1, 1) = 104;
  Process(measure, &in);
  EXPECT_EQ(measure.GetEvaluation(), (Sums{9, 16}));
}

TEST(SqrGradient, FewerChannelsInALaterCallAddTheOtherTotalsOnceMore) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(3);
  Step<short> three(3, 3), one(1);
  Process(measure, &three);
  EXPECT_EQ(Process(measure, &one), "\n BEFORE - 101 1.000000\n");
  EXPECT_EQ(measure.GetEvaluation(), (Sums{9 + 10, 9 + 9, 9 + 9}));
}

TEST(SqrGradient, MoreChannelsInALaterCallArePrintedButHaveNoTotal) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(3);
  Step<short> two(3, 2), three(1, 3);
  Process(measure, &two);
  EXPECT_EQ(Process(measure, &three),
            "\n BEFORE - 101 1.000000\n\n BEFORE - 101 1.000000\n\n BEFORE - 101 1.000000\n");
  EXPECT_EQ(measure.GetEvaluation(), (Sums{9 + 10, 9 + 10, 0}));
}

TEST(SqrGradient, NullOutputWorksAndNoOutputIsTouched) {
  Step<short> in(3);
  for (const DataType type :
       {DataType(tessel::eDT_16S), DataType(tessel::eDT_32F, true), DataType(tessel::eDT_BIT), DataType()}) {
    unsigned char bytes[64] = {};
    Raster out({1, 2, 1, type}, {}, bytes);
    SqrGradientEvaluation measure;
    measure.InitEvaluation(1);
    Process(measure, &in, nullptr, nullptr);
    Process(measure, &in, nullptr, &out);
    EXPECT_EQ(measure.GetEvaluation(), Sums{27});
    for (const unsigned char byte : bytes) EXPECT_EQ(byte, 0);
  }
}

TEST(SqrGradient, ResultIsACopy) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  Step<short> in(3);
  Process(measure, &in);
  measure.GetEvaluation()[0] = 0;
  EXPECT_EQ(measure.GetEvaluation(), Sums{9});
}

// ---- failures

/// Passes if a call fails with the message, prints nothing and leaves the result.
::testing::AssertionResult Fails(const char* message, Raster* in, Raster* out = nullptr) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  tests::CapturedOutput output;
  const ::testing::AssertionResult result =
      Throws<Exception>(message, [&] { measure.Process(in, nullptr, out); });
  if (!result) return result;
  if (!output.End().empty()) return ::testing::AssertionFailure() << "something was printed";
  if (measure.GetEvaluation() != Sums{0}) return ::testing::AssertionFailure() << "the result has changed";
  return ::testing::AssertionSuccess();
}

TEST(SqrGradientFailure, NullInputIsAnInvalidPointer) {
  Image<short> out({3, 1});
  FillBytes(out);
  EXPECT_TRUE(Fails("poRasterIn is invalid pointer", nullptr, &out));
  EXPECT_TRUE(Fails("poRasterIn is invalid pointer", nullptr));
  EXPECT_TRUE(IsUntouched(out));
}

TEST(SqrGradientFailure, NoChannelsAreToldBeforeTheType) {
  for (const DataType type :
       {DataType(tessel::eDT_16S), DataType(tessel::eDT_BIT), DataType(), DataType(tessel::eDT_32F, true)}) {
    Raster in({3, 2, 0, type}, {});
    EXPECT_TRUE(Fails("poRasterIn must have minimum 1 channels.", &in));
  }
}

TEST(SqrGradientFailure, TypesOutsideTheListAreInvalidComplexOnesIncluded) {
  std::vector<DataType> types = {DataType(), DataType(tessel::eDT_BIT)};
  for (const PixelType& type : tests::kPixelTypes) types.push_back(DataType(type.element, true));
  for (const DataType& type : types) {
    Raster odd({3, 2, 1, type}, {});
    EXPECT_TRUE(Fails("Invalid type requested.", &odd));
  }
}

// ---- differential

struct SqrGradientDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(SqrGradientDifferential, AgreesWithTheTwinBitForBit) {
  for (const std::vector<tests::FocusStep>& sequence : tests::FocusSequencesFrom(GetParam())) {
    SqrGradientEvaluation measure;
    reference::SqrGradientEvaluation twin;
    for (const tests::FocusStep& step : sequence) {
      const tests::FocusScene scene(step);
      const std::vector<unsigned char> before = tests::Bytes(*scene.in);
      Prepare(step, measure);
      Prepare(step, twin);
      const std::string printed = Process(measure, scene.in.get(), scene.mask.get());
      ASSERT_EQ(printed, twin.Process(*scene.in, scene.mask.get())) << step;
      ASSERT_TRUE(SameSums(twin.GetEvaluation(), measure.GetEvaluation())) << step;
      ASSERT_EQ(tests::Bytes(*scene.in), before);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(From, SqrGradientDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

// ---- contract

/// The sum that a call adds to: the running total, read through a result that starts at 0.
template <class T>
double TotalOf(SqrGradientEvaluation& measure, int step) {
  Step<T> in(step);
  measure.InitEvaluation(1);
  Process(measure, &in);
  return measure.GetEvaluation()[0];
}

TEST(SqrGradientContract, ParametersSetAfterTheFirstProcessAreIgnoredWhileTheTypeStays) {
  SqrGradientEvaluation measure;
  EXPECT_EQ(TotalOf<short>(measure, 3), 9);
  measure.SetBackground(500, 600);
  measure.SetFailure(100);
  EXPECT_EQ(TotalOf<short>(measure, 3), 18);
}

TEST(SqrGradientContract, ParametersSetAfterTheFirstProcessAreTakenWhenTheInputsTypeChanges) {
  SqrGradientEvaluation measure;
  EXPECT_EQ(TotalOf<short>(measure, 3), 9);
  measure.SetBackground(0, 103);
  EXPECT_EQ(TotalOf<int>(measure, 3), 0);
  EXPECT_EQ(TotalOf<int>(measure, 2), 4);
  measure.SetFailure(100);
  EXPECT_EQ(TotalOf<short>(measure, 2), 0);
}

TEST(SqrGradientContract, OutputsTypeIsNotCompared) {
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  Step<short> in(3), sameOut(0);
  Image<float> out({1, 2});
  Process(measure, &in, nullptr, &sameOut);
  measure.SetFailure(100);
  Process(measure, &in, nullptr, &out);
  Process(measure, &in);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9 + 18 + 27});
}

/// A call that the dispatcher refuses.
void FailToDispatch(const SqrGradientEvaluation& measure) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {});
  EXPECT_TRUE(
      Throws<Exception>("Invalid type requested.", [&] { measure.Process(&bits, nullptr, nullptr); }));
}

TEST(SqrGradientContract, RefusedTypeLeavesTheResultAndLosesTheRunningTotal) {
  SqrGradientEvaluation measure;
  EXPECT_EQ(TotalOf<short>(measure, 3), 9);
  FailToDispatch(measure);
  FailToDispatch(measure);
  EXPECT_EQ(measure.GetEvaluation(), Sums{9});
  measure.SetBackground(0, 103);
  EXPECT_EQ(TotalOf<short>(measure, 3), 0);
  EXPECT_EQ(TotalOf<short>(measure, 2), 4);
}

TEST(SqrGradientContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto measure = std::make_unique<SqrGradientEvaluation>();
  EXPECT_EQ(TotalOf<short>(*measure, 3), 9);
  FailToDispatch(*measure);
}

TEST(SqrGradientContract, FailedGuardLeavesTheProcessorAsItWas) {
  SqrGradientEvaluation measure;
  EXPECT_EQ(TotalOf<short>(measure, 3), 9);
  measure.SetFailure(100);
  Raster noChannels({3, 1, 0, DataType(tessel::eDT_32S)}, {});
  EXPECT_THROW(measure.Process(nullptr, nullptr, nullptr), Exception);
  EXPECT_THROW(measure.Process(&noChannels, nullptr, nullptr), Exception);
  EXPECT_EQ(TotalOf<short>(measure, 3), 18);
}

TEST(SqrGradientContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  SqrGradientEvaluation original = MeasureOf(0, 103, -32767);
  original.InitEvaluation(2);
  SqrGradientEvaluation copy(original), assigned;
  assigned = original;
  copy.SetBackground(0, 200);
  EXPECT_EQ(copy.GetEvaluation(), (Sums{0, 0}));
  EXPECT_EQ(assigned.numChannels, 2u);
  EXPECT_EQ(TotalOf<short>(original, 3), 0);
  EXPECT_EQ(TotalOf<short>(copy, 3), 9);
  EXPECT_EQ(TotalOf<short>(assigned, 3), 0);
  EXPECT_EQ(TotalOf<short>(assigned, 2), 4);
}

}  // namespace
}  // namespace orvik::filters
