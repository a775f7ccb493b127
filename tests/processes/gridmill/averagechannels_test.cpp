#include "processes/gridmill/averagechannels.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/averagechannels_reference.h"
#include "tests/support/cases.h"
#include "tests/support/failures.h"
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
using tests::Throws;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The result for one pixel.
template <class Out, class In>
Out Mean(const AverageChannels& average, const std::vector<In>& pixel, bool isValid = true) {
  Image<In> in({1, 1, static_cast<std::uint32_t>(pixel.size())});
  std::copy(pixel.begin(), pixel.end(), in.Elements());
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1});
  average.Process(&in, &mask, &out, nullptr);
  return out.At(0, 0);
}

// ---- golden

TEST(AverageChannels, HeightOfZeroReturnsAtOnceWithoutTouchingTheOutput) {
  Image<short> in({4, 0, 2}, {1, 1}, 7);
  Image<short> out({4, 0}, {1, 1});
  FillBytes(out);
  AverageChannels().Process(&in, nullptr, &out, nullptr);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(AverageChannels, WidthOfZeroWritesNothing) {
  Image<short> in({0, 3, 2}, {1, 1}, 7);
  Image<short> out({0, 3}, {1, 1});
  FillBytes(out);
  AverageChannels().Process(&in, nullptr, &out, nullptr);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(AverageChannels, ZeroChannelsGiveNaNThroughClipTo) {
  const AverageChannels average;
  EXPECT_TRUE(std::isnan((Mean<float, float>(average, {}))));
  EXPECT_TRUE(std::isnan((Mean<double, char>(average, {}))));
  EXPECT_EQ((Mean<char, short>(average, {})), 0);
  EXPECT_EQ((Mean<unsigned char, short>(average, {})), 0);
  EXPECT_EQ((Mean<short, short>(average, {})), 0);
  EXPECT_EQ((Mean<unsigned short, short>(average, {})), 0);
  EXPECT_EQ((Mean<int, short>(average, {})), -2147483647 - 1);
  EXPECT_EQ((Mean<unsigned int, short>(average, {})), 0u);
  EXPECT_EQ((Mean<std::int64_t, short>(average, {})), std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ((Mean<std::uint64_t, short>(average, {})), std::uint64_t{1} << 63);
}

TEST(AverageChannels, MeanIsRoundedByClipTo) {
  const AverageChannels average(0.0f);
  EXPECT_EQ((Mean<unsigned char, unsigned char>(average, {10, 20, 31})), 20);
  EXPECT_FLOAT_EQ((Mean<float, unsigned char>(average, {10, 20, 31})), 20.333334f);
  EXPECT_EQ((Mean<unsigned char, unsigned char>(average, {10, 21})), 16);
  EXPECT_EQ((Mean<short, short>(average, {-10, -21})), -16);
}

TEST(AverageChannels, MeanOf64BitOutputsIsTruncatedAndNeverNegative) {
  const AverageChannels average(0.0f);
  EXPECT_EQ((Mean<std::int64_t, short>(average, {5, 6})), 5);
  EXPECT_EQ((Mean<std::uint64_t, short>(average, {5, 6})), 5u);
  EXPECT_EQ((Mean<std::int64_t, short>(average, {-5, -6})), 0);
}

TEST(AverageChannels, SingleNoDataChannelMakesTheWholePixelNoData) {
  const AverageChannels average(0.0f);
  EXPECT_EQ((Mean<unsigned char, unsigned char>(average, {0, 200, 100})), 0);
  EXPECT_EQ((Mean<unsigned char, unsigned char>(average, {200, 0, 100})), 0);
  EXPECT_EQ((Mean<unsigned char, unsigned char>(average, {200, 100, 0})), 0);
  EXPECT_EQ((Mean<float, float>(average, {kNaN, 0.0f})), 0.0f);
  EXPECT_EQ((Mean<float, float>(average, {-0.0f, 5.0f})), 0.0f);
}

TEST(AverageChannels, FloatSampleOneStepAboveNoDataIsNoHit) {
  const float above = std::nextafter(1.0f, 2.0f), below = std::nextafter(1.0f, 0.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(1.0f), {above, 3.0f})), (above + 3.0f) / 2.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(1.0f), {below, 3.0f})), (below + 3.0f) / 2.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(1.0f), {1.0f, 3.0f})), 1.0f);
}

TEST(AverageChannels, SmallNoDataIsMetBySamplesThatDifferFromIt) {
  const float lastHit = 1e-9f;  // the next float below 1e-9
  const float firstMiss = std::nextafter(lastHit, 1.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(0.0f), {5e-10f})), 0.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(0.0f), {-lastHit})), 0.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(0.0f), {lastHit})), 0.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(0.0f), {firstMiss})), firstMiss);
  EXPECT_EQ((Mean<float, float>(AverageChannels(0.0f), {-firstMiss})), -firstMiss);
  EXPECT_EQ((Mean<float, float>(AverageChannels(7e-9f), {6.5e-9f})), 7e-9f);
}

TEST(AverageChannels, NoDataThatIsNaNNeverCounts) {
  EXPECT_EQ((Mean<float, float>(AverageChannels(kNaN), {5.0f, 7.0f})), 6.0f);
  EXPECT_TRUE(std::isnan((Mean<float, float>(AverageChannels(kNaN), {kNaN, 7.0f}))));
  EXPECT_EQ((Mean<int, float>(AverageChannels(kNaN), {5.0f, 7.0f})), 6);
}

TEST(AverageChannels, InfiniteNoDataNeverCounts) {
  EXPECT_EQ((Mean<unsigned char, float>(AverageChannels(-kInfinity), {-kInfinity, 7.0f})), 0);
  EXPECT_TRUE(std::isnan((Mean<float, float>(AverageChannels(kInfinity), {kInfinity, -kInfinity}))));
}

TEST(AverageChannels, MaskThatExcludesEverythingGivesNoDataCastEverywhere) {
  Image<unsigned char> in({19, 3, 2}, {1, 1}, 9);
  Image<float> out({19, 3}, {2, 1}, 77.0f);
  Mask mask(19, 3, {1, 1}, false);
  AverageChannels(2.9f).Process(&in, &mask, &out, nullptr);
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 19; ++x) EXPECT_EQ(out.At(x, y), 2.0f) << x << ", " << y;
    EXPECT_EQ(out.At(-1, y), 77.0f);
    EXPECT_EQ(out.At(19, y), 77.0f);
  }
}

TEST(AverageChannels, MaskedPixelOf300In8BitsHolds44) {
  EXPECT_EQ((Mean<unsigned char, unsigned char>(AverageChannels(300.0f), {1, 2}, false)), 44);
}

TEST(AverageChannels, NoSampleOf8BitsEverEqualsANoDataOf300) {
  for (int sample = 0; sample < 256; ++sample) {
    const auto s = static_cast<unsigned char>(sample);
    EXPECT_EQ((Mean<unsigned char, unsigned char>(AverageChannels(300.0f), {s, s})), s);
  }
}

// Deliberate: a masked pixel holds `noData` cast to the input's type and then to the output's, neither
// rounded nor clamped. With -1, `short` in and `unsigned char` out it holds 255, where a no-data pixel holds
// 0.
TEST(AverageChannels, MaskedPixelHoldsNoDataCastToTheInputAndThenToTheOutputNeitherRoundedNorClamped) {
  const AverageChannels average(-1.0f);
  EXPECT_EQ((Mean<unsigned char, short>(average, {5, 5}, false)), 255);
  EXPECT_EQ((Mean<unsigned char, short>(average, {-1, 5})), 0);
  EXPECT_EQ((Mean<short, float>(AverageChannels(2.5f), {1.0f}, false)), 2);
  EXPECT_EQ((Mean<short, float>(AverageChannels(2.5f), {2.5f})), 3);
  EXPECT_EQ((Mean<double, float>(AverageChannels(2.5f), {1.0f}, false)), 2.5);
  EXPECT_EQ((Mean<double, int>(AverageChannels(2.5f), {1}, false)), 2.0);
}

TEST(AverageChannels, MaskedPixelOfANegativeZeroKeepsItsSignOnlyInAFloatingInput) {
  EXPECT_FALSE(std::signbit(Mean<float, int>(AverageChannels(-0.0f), {1}, false)));
  EXPECT_FALSE(std::signbit(Mean<float, std::int64_t>(AverageChannels(-0.25f), {1}, false)));
  EXPECT_FALSE(std::signbit(Mean<double, int>(AverageChannels(-0.0f), {1}, false)));
  EXPECT_TRUE(std::signbit(Mean<float, float>(AverageChannels(-0.0f), {1}, false)));
}

TEST(AverageChannels, MaskedPixelOfAnImpossibleNoDataIsTheIndefiniteValueCutToTheWidth) {
  const AverageChannels average(kNaN);
  EXPECT_EQ((Mean<int, unsigned char>(average, {1}, false)), 0);
  EXPECT_EQ((Mean<int, int>(average, {1}, false)), -2147483647 - 1);
  EXPECT_EQ((Mean<std::int64_t, unsigned int>(average, {1}, false)), 0);
  EXPECT_EQ((Mean<std::uint64_t, std::uint64_t>(average, {1}, false)), std::uint64_t{1} << 63);
  EXPECT_EQ((Mean<unsigned int, unsigned int>(AverageChannels(-1.0f), {1}, false)), 4294967295u);
}

TEST(AverageChannels, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<unsigned char> in({3, 2}, {1, 1}, 9);
  Image<unsigned char> out({3, 2}, {}, 77);
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  AverageChannels(5.0f).Process(&in, &mask, &out, nullptr);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, y), x == 1 && y == 1 ? 5 : 9) << x << ", " << y;
  }
}

TEST(AverageChannels, ComplexInputGivesTheMeansOfItsRealParts) {
  Image<short> in({2, 1, 2}, {1, 0}, 0, true);
  in.SetPixel(0, 0, {10, -1000, 21, 3000});
  in.SetPixel(1, 0, {40, 0, 50, 0});
  Image<float> out({2, 1});
  AverageChannels().Process(&in, nullptr, &out, nullptr);
  EXPECT_EQ(out.At(0, 0), 15.5f);
  EXPECT_EQ(out.At(1, 0), 45.0f);
}

TEST(AverageChannels, DoubleSampleOf1e300IsInfiniteAndClipToSaturatesIt) {
  const AverageChannels average;
  EXPECT_EQ((Mean<float, double>(average, {1e300, 1.0})), kInfinity);
  EXPECT_EQ((Mean<unsigned char, double>(average, {1e300, 1.0})), 255);
  EXPECT_EQ((Mean<char, double>(average, {-1e300, 1.0})), -128);
  EXPECT_EQ((Mean<int, double>(average, {1e300})), 2147483647);
  EXPECT_EQ((Mean<std::int64_t, double>(average, {1e300})), std::numeric_limits<std::int64_t>::max());
  EXPECT_EQ((Mean<std::uint64_t, double>(average, {1e300})), std::numeric_limits<std::uint64_t>::max());
}

TEST(AverageChannels, AllArithmeticIsInFloat) {
  const AverageChannels average;
  EXPECT_EQ((Mean<double, double>(average, {16777217.0})), 16777216.0);
  EXPECT_EQ((Mean<double, int>(average, {16777216, 1, 1})), static_cast<double>(16777216.0f / 3.0f));
  EXPECT_EQ((Mean<double, float>(average, {1e8f, 1.0f, -1e8f})), 0.0);
  EXPECT_EQ((Mean<double, double>(AverageChannels(16777216.0f), {16777217.0, 2.0})), 16777216.0);
}

TEST(AverageChannels, SamplesAreExtendedByTheirSign) {
  const AverageChannels average;
  EXPECT_EQ((Mean<float, char>(average, {-3, -5})), -4.0f);
  EXPECT_EQ((Mean<float, unsigned char>(average, {253, 255})), 254.0f);
  EXPECT_EQ((Mean<float, short>(average, {-3, -5})), -4.0f);
  EXPECT_EQ((Mean<float, unsigned short>(average, {65533, 65535})), 65534.0f);
  EXPECT_EQ((Mean<float, int>(average, {-3, -5})), -4.0f);
  EXPECT_EQ((Mean<float, unsigned int>(average, {4294967295u})), 4294967296.0f);
  EXPECT_EQ((Mean<float, std::int64_t>(average, {-3, -5})), -4.0f);
  EXPECT_EQ((Mean<float, std::uint64_t>(average, {std::uint64_t{3} << 62})), 0x1.8p63f);
}

TEST(AverageChannels, ResultsArePackedAtTheStartOfEachRowOfAnOutputOfSeveralChannels) {
  Image<unsigned char> in({2, 2, 2});
  in.Set([](int x, int y, std::uint32_t) { return 1 + x + 2 * y; });
  Image<unsigned char> out({2, 2, 3}, {1, 0}, 77);
  AverageChannels().Process(&in, nullptr, &out, nullptr);
  for (int y = 0; y < 2; ++y) {
    EXPECT_EQ(out.At(0, y, 0), 1 + 2 * y);
    EXPECT_EQ(out.At(0, y, 1), 2 + 2 * y);
    for (std::uint32_t element = 2; element < 9; ++element) EXPECT_EQ(out.At(0, y, element), 77) << element;
  }
}

TEST(AverageChannels, OutputMaskIsIgnored) {
  Image<unsigned char> in({9, 2}, {}, 5);
  Image<unsigned char> out({9, 2});
  Mask inMask(9, 2), outMask(9, 2, {}, false);
  inMask.SetValid(3, 1, false);
  const std::vector<unsigned char> before = outMask.bits;
  AverageChannels(1.0f).Process(&in, &inMask, &out, &outMask);
  EXPECT_EQ(outMask.bits, before);
  EXPECT_EQ(out.At(2, 1), 5);
  EXPECT_EQ(out.At(3, 1), 1);
}

TEST(AverageChannels, NoDataIsZeroByDefault) {
  EXPECT_EQ((Mean<float, float>(AverageChannels(), {0.0f, 8.0f})), 0.0f);
  EXPECT_EQ((Mean<float, float>(AverageChannels(8.0f), {0.0f, 8.0f})), 8.0f);
  AverageChannels average(8.0f);
  average.SetNodata(3.0f);
  EXPECT_EQ((Mean<float, float>(average, {0.0f, 8.0f})), 4.0f);
}

// ---- failures

struct AverageChannelsFailure : ::testing::Test {
  Image<short> in{{3, 2, 2}, {1, 1}, 7};
  Image<short> out{{3, 2}, {1, 1}};
  const AverageChannels average;

  AverageChannelsFailure() { FillBytes(out); }
};

TEST_F(AverageChannelsFailure, NullInputIsAnInvalidPointer) {
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { average.Process(nullptr, nullptr, &out, nullptr); }));
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { average.Process(nullptr, nullptr, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(AverageChannelsFailure, NullOutputIsAnInvalidPointer) {
  EXPECT_TRUE(Throws<Exception>("poRasterOut is invalid pointer",
                                [&] { average.Process(&in, nullptr, nullptr, nullptr); }));
}

TEST_F(AverageChannelsFailure, OutputCannotBeComplex) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster complex({3, 2, 1, DataType(type.element, true)}, {1, 1});
    FillBytes(complex);
    EXPECT_TRUE(Throws<Exception>("Output cannot be complex", [&] {
      average.Process(&in, nullptr, &complex, nullptr);
    })) << type;
    EXPECT_TRUE(IsUntouched(complex));
  }
}

TEST_F(AverageChannelsFailure, TypesOutsideTheListAreInvalid) {
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { average.Process(&odd, nullptr, &out, nullptr); }));
    EXPECT_TRUE(IsUntouched(out));
    if (type.isComplex) continue;
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { average.Process(&in, nullptr, &odd, nullptr); }));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

TEST_F(AverageChannelsFailure, ComplexOutputComesBeforeTheDispatcher) {
  Raster odd({3, 2, 1, DataType(tessel::eDT_BIT)}, {1, 1});
  Raster complex({3, 2, 1, DataType(tessel::eDT_32F, true)}, {1, 1});
  EXPECT_TRUE(Throws<Exception>("Output cannot be complex",
                                [&] { average.Process(&odd, nullptr, &complex, nullptr); }));
}

// ---- differential

float DrawNoData(tests::Random& random) {
  constexpr float kValues[] = {3.0f,   7.0f, 255.0f, -128.0f, 32767.0f,  0.0f,       -0.0f,    1.0f,
                               -1.0f,  2.0f, 2.5f,   -2.5f,   127.5f,    300.0f,     -9999.0f, 5e-10f,
                               1e-40f, 3e9f, 1e20f,  -1e20f,  kInfinity, -kInfinity, kNaN};
  return random.Pick(kValues);
}

struct AverageChannelsDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(AverageChannelsDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : tests::CasesFrom(GetParam(), {})) {
    tests::Random random(~c.seed);
    const float noData = DrawNoData(random);
    const double nearNoData[] = {noData, std::nextafter(noData, 1e30f), noData + 6e-10, noData - 1e-9,
                                 noData + 1e-9};
    const AverageChannels average(noData);
    const ::testing::AssertionResult result = Agree(
        c, nearNoData, [&](Raster* in, Mask* mask, Raster* out) { average.Process(in, mask, out, nullptr); },
        [&](const Raster& in, const Mask* mask, Raster& out) {
          reference::AverageChannels(noData, in, mask, out);
        });
    ASSERT_TRUE(result) << "noData " << noData;
  }
}

INSTANTIATE_TEST_SUITE_P(From, AverageChannelsDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

// ---- contract

/// Runs on a pixel of two channels, (10, 20), of the type `In`.
template <class Out, class In>
Out MeanOf10And20(const AverageChannels& average) {
  return Mean<Out, In>(average, {10, 20});
}

TEST(AverageChannelsContract, ParameterSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  AverageChannels average(10.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
  average.SetNodata(0.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
}

TEST(AverageChannelsContract, ParameterSetAfterTheFirstProcessIsTakenWhenATypeChanges) {
  AverageChannels average(10.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
  average.SetNodata(0.0f);
  EXPECT_EQ((MeanOf10And20<double, short>(average)), 15.0);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 15.0f);
  average.SetNodata(20.0f);
  EXPECT_EQ((MeanOf10And20<float, unsigned short>(average)), 20.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 20.0f);
}

TEST(AverageChannelsContract, CacheHoldsTheTypesOfTheInterpretedRaster) {
  AverageChannels average(10.0f);
  Image<short> complex({1, 1, 2}, {}, 0, true);
  complex.SetPixel(0, 0, {10, 0, 20, 0});
  Image<float> out({1, 1});
  average.Process(&complex, nullptr, &out, nullptr);
  EXPECT_EQ(out.At(0, 0), 10.0f);
  average.SetNodata(0.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
  average.Process(&complex, nullptr, &out, nullptr);
  EXPECT_EQ(out.At(0, 0), 10.0f);
}

/// A call that the dispatcher refuses.
void FailToDispatch(const AverageChannels& average) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {});
  Image<float> out({1, 1});
  EXPECT_TRUE(
      Throws<Exception>("Invalid type requested.", [&] { average.Process(&bits, nullptr, &out, nullptr); }));
}

TEST(AverageChannelsContract, ObjectWorksAfterAFailedDispatch) {
  const AverageChannels average(10.0f);
  FailToDispatch(average);
  FailToDispatch(average);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
}

TEST(AverageChannelsContract, ObjectThatHadRunWorksAfterAFailedDispatchWithTheNewParameter) {
  AverageChannels average(10.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
  average.SetNodata(0.0f);
  FailToDispatch(average);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 15.0f);
}

TEST(AverageChannelsContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto average = std::make_unique<AverageChannels>(10.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(*average)), 10.0f);
  FailToDispatch(*average);
}

TEST(AverageChannelsContract, FailedGuardLeavesTheProcessorAsItWas) {
  AverageChannels average(10.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
  average.SetNodata(0.0f);
  EXPECT_THROW(average.Process(nullptr, nullptr, nullptr, nullptr), Exception);
  EXPECT_EQ((MeanOf10And20<float, short>(average)), 10.0f);
}

TEST(AverageChannelsContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  const AverageChannels original(10.0f);
  AverageChannels copy(original), assigned;
  assigned = original;
  copy.SetNodata(20.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(original)), 10.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(copy)), 20.0f);
  EXPECT_EQ((MeanOf10And20<float, short>(assigned)), 10.0f);
}

TEST(AverageChannelsContract, TwoObjectsRunOnTwoThreadsAtOnce) {
  const auto work = [](float noData, bool* isRight) {
    const AverageChannels average(noData);
    Image<short> in({300, 60, 2}, {1, 1}, 7);
    Image<float> out({300, 60});
    for (int i = 0; i < 20; ++i) {
      in.SetPixel(150, 30, {9, static_cast<short>(i)});
      average.Process(&in, nullptr, &out, nullptr);
      const float expected = noData == 9.0f ? 9.0f : (9.0f + static_cast<float>(i)) / 2.0f;
      *isRight = *isRight && out.At(150, 30) == expected && out.At(299, 59) == 7.0f;
    }
  };
  bool isFirstRight = true, isSecondRight = true;
  std::thread first(work, 9.0f, &isFirstRight), second(work, -1.0f, &isSecondRight);
  first.join();
  second.join();
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

}  // namespace
}  // namespace orvik::filters
