#include "processes/gridmill/normalize.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/normalize_reference.h"
#include "tests/support/cases.h"
#include "tests/support/compare.h"
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
constexpr float kDenormal = std::numeric_limits<float>::denorm_min();

/// An operator with a range for each channel.
Normalize RangeOf(std::vector<float> min, std::vector<float> max, float noData) {
  Normalize normalize;
  normalize.SetMinData(std::move(min));
  normalize.SetMaxData(std::move(max));
  normalize.SetNoData(noData);
  return normalize;
}

/// What one sample becomes with the range from `min` to `max`.
template <class Out, class In>
Out Percent(In sample, float min, float max, float noData = -1e30f) {
  Image<In> in({1, 1}, {}, sample);
  Image<Out> out({1, 1});
  RangeOf({min}, {max}, noData).Process(&in, nullptr, &out);
  return out.At(0, 0);
}

/// What a sample of 15 becomes.
template <class Out, class In>
Out PercentOf15(const Normalize& normalize) {
  Image<In> in({1, 1}, {}, 15);
  Image<Out> out({1, 1});
  normalize.Process(&in, nullptr, &out);
  return out.At(0, 0);
}

// ---- golden

TEST(Normalize, SamplesArePercentagesOfTheRange) {
  EXPECT_EQ((Percent<float, short>(5, 10, 30)), 0.0f);
  EXPECT_EQ((Percent<float, short>(15, 10, 30)), 25.0f);
  EXPECT_EQ((Percent<float, short>(40, 10, 30)), 100.0f);
  EXPECT_EQ((Percent<float, float>(0.5f, -1.0f, 1.0f)), 75.0f);
}

TEST(Normalize, SampleEqualToMinDataGives0AndSampleEqualToMaxDataGives100) {
  EXPECT_EQ((Percent<float, short>(10, 10, 30)), 0.0f);
  EXPECT_EQ((Percent<float, short>(30, 10, 30)), 100.0f);
  EXPECT_EQ((Percent<int, double>(10.0, 10, 30)), 0);
  EXPECT_EQ((Percent<int, double>(30.0, 10, 30)), 100);
}

TEST(Normalize, NeighboursOfTheBoundsAreWithinTheRange) {
  const float above = std::nextafter(10.0f, 11.0f), below = std::nextafter(30.0f, 29.0f);
  EXPECT_GT((Percent<float, float>(above, 10, 30)), 0.0f);
  EXPECT_LT((Percent<float, float>(below, 10, 30)), 100.0f);
  EXPECT_EQ((Percent<float, float>(below, 0, 30)), 100.0f - 0x1p-17f);
}

// Deliberate: a lower bound at or above the upper one divides by nothing: 0 up to it, 100 beyond.
TEST(Normalize, LowerBoundAtOrAboveTheUpperOneGives0UpToItAnd100Beyond) {
  for (const float max : {20.0f, 10.0f, -5.0f}) {
    EXPECT_EQ((Percent<float, short>(-6, 20, max)), 0.0f) << max;
    EXPECT_EQ((Percent<float, short>(15, 20, max)), 0.0f) << max;
    EXPECT_EQ((Percent<float, short>(20, 20, max)), 0.0f) << max;
    EXPECT_EQ((Percent<float, short>(21, 20, max)), 100.0f) << max;
  }
}

TEST(Normalize, SampleWithin1e9OfNoDataIsNoData) {
  const float lastHit = 1e-9f;  // the next float below 1e-9
  const float firstMiss = std::nextafter(lastHit, 1.0f);
  EXPECT_EQ((Percent<float, float>(lastHit, -1, 1, 0.0f)), 0.0f);
  EXPECT_EQ((Percent<float, float>(-lastHit, -1, 1, 0.0f)), 0.0f);
  EXPECT_EQ((Percent<float, float>(firstMiss, -1, 1, 0.0f)), 50.0f);
  EXPECT_EQ((Percent<float, float>(-firstMiss, -1, 1, 0.0f)), 50.0f);
  EXPECT_EQ((Percent<float, float>(6.5e-9f, -1, 1, 7e-9f)), 7e-9f);
}

TEST(Normalize, FloatSampleOneStepFromNoDataIsNoHit) {
  EXPECT_EQ((Percent<float, float>(5.0f, 0, 10, 5.0f)), 5.0f);
  EXPECT_NE((Percent<float, float>(std::nextafter(5.0f, 6.0f), 0, 10, 5.0f)), 5.0f);
  EXPECT_NE((Percent<float, float>(std::nextafter(5.0f, 4.0f), 0, 10, 5.0f)), 5.0f);
}

TEST(Normalize, NoDataIsFoundAfterTheConversionToFloat) {
  EXPECT_EQ((Percent<float, int>(16777217, 0, 1e9f, 16777216.0f)), 16777216.0f);
  EXPECT_EQ((Percent<float, double>(0.1, 0, 1, 0.1f)), 0.1f);
  EXPECT_EQ((Percent<double, double>(1e-300, -1, 1, 0.0f)), 0.0);
  EXPECT_EQ((Percent<float, std::uint64_t>(~0ull, 0, 1, 0x1p64f)), 0x1p64f);
}

// Deliberate: with the default `NoData` samples of exactly 0 stay 0, whatever the range.
TEST(Normalize, WithTheDefaultNoDataSamplesOfExactly0Stay0WhateverTheRange) {
  Normalize normalize;
  normalize.SetMinData({-10.0f});
  normalize.SetMaxData({10.0f});
  Image<float> in({3, 1});
  in.SetPixel(0, 0, {0.0f, -0.0f, 5.0f});
  Image<float> out({3, 1}, {}, 77.0f);
  normalize.Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 0.0f);
  EXPECT_EQ(out.At(1, 0), 0.0f);
  EXPECT_EQ(out.At(2, 0), 75.0f);
}

TEST(Normalize, NoDataComesBeforeTheRange) {
  EXPECT_EQ((Percent<float, short>(15, 10, 30, 15.0f)), 15.0f);
  EXPECT_EQ((Percent<float, short>(5, 10, 30, 5.0f)), 5.0f);
  EXPECT_EQ((Percent<float, short>(40, 10, 30, 40.0f)), 40.0f);
}

TEST(Normalize, NoDataOutside0To100StaysAsItIsOnAFloatingOutputAndSaturatesOnAnIntegerOne) {
  EXPECT_EQ((Percent<float, short>(-999, 10, 30, -999.0f)), -999.0f);
  EXPECT_EQ((Percent<double, short>(-999, 10, 30, -999.0f)), -999.0);
  EXPECT_EQ((Percent<double, float>(0.1f, 10, 30, 0.1f)), static_cast<double>(0.1f));
  EXPECT_EQ((Percent<char, short>(-999, 10, 30, -999.0f)), -128);
  EXPECT_EQ((Percent<unsigned char, short>(-999, 10, 30, -999.0f)), 0);
  EXPECT_EQ((Percent<unsigned char, short>(999, 10, 30, 999.0f)), 255);
  EXPECT_EQ((Percent<short, short>(-999, 10, 30, -999.0f)), -999);
  EXPECT_EQ((Percent<unsigned short, int>(70000, 10, 30, 70000.0f)), 65535);
  EXPECT_EQ((Percent<int, float>(3e9f, 10, 30, 3e9f)), 2147483647);
  EXPECT_EQ((Percent<unsigned int, float>(5e9f, 10, 30, 5e9f)), 4294967295u);
  EXPECT_EQ((Percent<std::int64_t, short>(-999, 10, 30, -999.0f)), 0);
  EXPECT_EQ((Percent<std::uint64_t, float>(1e20f, 10, 30, 1e20f)), ~0ull);
}

TEST(Normalize, NoDataIsWrittenThroughClipToInFloat) {
  EXPECT_EQ((Percent<int, int>(8388609, 0, 1, 8388609.0f)), 8388610);
  EXPECT_EQ((Percent<short, float>(2.5f, 0, 9, 2.5f)), 3);
  EXPECT_EQ((Percent<std::int64_t, float>(2.75f, 0, 9, 2.75f)), 2);
}

TEST(Normalize, IntegerOutputsUpTo32BitsAreRounded) {
  EXPECT_EQ((Percent<char, float>(49.6f, 0, 100)), 50);
  EXPECT_EQ((Percent<unsigned char, float>(49.6f, 0, 100)), 50);
  EXPECT_EQ((Percent<short, float>(49.4f, 0, 100)), 49);
  EXPECT_EQ((Percent<unsigned short, float>(49.5f, 0, 100)), 50);
  EXPECT_EQ((Percent<int, short>(1, 0, 200)), 1);
  EXPECT_EQ((Percent<unsigned int, short>(3, 0, 200)), 2);
}

TEST(Normalize, OutputsOf64BitsAreTruncated) {
  EXPECT_EQ((Percent<std::int64_t, float>(49.6f, 0, 100)), 49);
  EXPECT_EQ((Percent<std::uint64_t, float>(49.6f, 0, 100)), 49u);
  EXPECT_EQ((Percent<std::int64_t, short>(40, 10, 30)), 100);
}

TEST(Normalize, DoubleOutputHoldsTheSinglePrecisionResult) {
  EXPECT_EQ((Percent<double, short>(1, 0, 3)), static_cast<double>(33.333332f));
  EXPECT_EQ((Percent<float, short>(1, 0, 3)), 33.333332f);
}

TEST(Normalize, RangeAndDifferenceAreSingleAndProductAndQuotientAreDouble) {
  EXPECT_EQ((Percent<float, float>(1.0f, 0x1p-30f, 2.0f)), 50.0f);      // both differences round
  EXPECT_EQ((Percent<float, float>(0x1p126f, 0.0f, 0x1p127f)), 50.0f);  // 100 x 2^126 is no float
  EXPECT_EQ((Percent<float, float>(-2e38f, -3e38f, 3e38f)), 0.0f);      // the range is infinite
  EXPECT_EQ((Percent<float, float>(kDenormal, 0.0f, 4 * kDenormal)), 25.0f);
  EXPECT_EQ((Percent<float, short>(1, 0, 7)), static_cast<float>(100.0 / 7.0));
}

TEST(Normalize, EverySampleIsConvertedToFloatFirst) {
  EXPECT_EQ((Percent<double, int>(16777217, 16777214, 16777216)), 100.0);
  EXPECT_EQ((Percent<double, double>(0.1, 0, 1)),
            static_cast<double>(static_cast<float>(static_cast<double>(0.1f) * 100.0)));
  EXPECT_EQ((Percent<float, double>(1e300, 0, 3e38f)), 100.0f);
  EXPECT_EQ((Percent<float, double>(-1e300, 0, 3e38f)), 0.0f);
  EXPECT_EQ((Percent<float, std::uint64_t>(std::uint64_t{3} << 62, 0, 0x1p64f)), 75.0f);
  EXPECT_EQ((Percent<float, unsigned int>(3000000000u, 0, 4e9f)), 75.0f);
  EXPECT_EQ((Percent<float, char>(-64, -128, 0)), 50.0f);
}

TEST(Normalize, SamplesOf64BitsAreRoundedOnce) {
  constexpr std::int64_t kAboveATie = (std::int64_t{1} << 60) + (std::int64_t{1} << 36) + 1;
  EXPECT_EQ((Percent<float, std::int64_t>(kAboveATie, 0x1p60f, 0x1p60f + 0x1p37f)), 100.0f);
  EXPECT_EQ((Percent<float, std::uint64_t>(kAboveATie, 0x1p60f, 0x1p60f + 0x1p37f)), 100.0f);
}

TEST(Normalize, SampleThatIsNaNGivesNaN) {
  EXPECT_TRUE(std::isnan(Percent<float, float>(kNaN, 0, 1)));
  EXPECT_TRUE(std::isnan(Percent<double, float>(kNaN, 1, 0)));
  EXPECT_EQ((Percent<char, float>(kNaN, 0, 1)), 0);
  EXPECT_EQ((Percent<unsigned char, float>(kNaN, 0, 1)), 0);
  EXPECT_EQ((Percent<short, float>(kNaN, 0, 1)), 0);
  EXPECT_EQ((Percent<unsigned short, float>(kNaN, 0, 1)), 0);
  EXPECT_EQ((Percent<int, float>(kNaN, 0, 1)), std::numeric_limits<int>::min());
  EXPECT_EQ((Percent<unsigned int, float>(kNaN, 0, 1)), 0u);
  EXPECT_EQ((Percent<std::int64_t, float>(kNaN, 0, 1)), std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ((Percent<std::uint64_t, float>(kNaN, 0, 1)), std::uint64_t{1} << 63);
}

TEST(Normalize, InfiniteSamplesAreBeyondTheRange) {
  EXPECT_EQ((Percent<float, float>(kInfinity, 0, 1)), 100.0f);
  EXPECT_EQ((Percent<float, float>(-kInfinity, 0, 1)), 0.0f);
  EXPECT_EQ((Percent<float, float>(kInfinity, 0, kInfinity)), 100.0f);
}

TEST(Normalize, BoundsThatAreNaNOrInfiniteFollowTheArithmetic) {
  EXPECT_TRUE(std::isnan(Percent<float, float>(0.5f, kNaN, 1)));
  EXPECT_EQ((Percent<float, float>(1.5f, kNaN, 1)), 100.0f);
  EXPECT_TRUE(std::isnan(Percent<float, float>(0.5f, 0, kNaN)));
  EXPECT_EQ((Percent<float, float>(-0.5f, 0, kNaN)), 0.0f);
  EXPECT_TRUE(std::isnan(Percent<float, float>(0.5f, -kInfinity, 1)));
  EXPECT_EQ((Percent<float, float>(0.5f, 0, kInfinity)), 0.0f);
}

TEST(Normalize, NoDataThatIsNaNNeverCountsAndAnInfiniteOneNeither) {
  EXPECT_EQ((Percent<float, float>(0.5f, 0, 1, kNaN)), 50.0f);
  EXPECT_TRUE(std::isnan(Percent<float, float>(kNaN, 0, 1, kNaN)));
  EXPECT_EQ((Percent<float, float>(kInfinity, 0, 1, kInfinity)), 100.0f);
}

TEST(Normalize, EachChannelHasItsRange) {
  Image<short> in({2, 1, 3});
  in.SetPixel(0, 0, {5, 5, 5, 10, 10, 10});
  Image<float> out({2, 1, 3});
  RangeOf({0, 5, 10, 99}, {10, 15, 20, 99}, -1).Process(&in, nullptr, &out);
  EXPECT_EQ(std::vector<float>(&out.At(0, 0), &out.At(0, 0) + 6), (std::vector<float>{50, 0, 0, 100, 50, 0}));
}

TEST(Normalize, OutputRowsAreSteppedByTheChannelsOfTheInput) {
  Image<short> in({2, 2, 2});
  in.Set([](int x, int y, std::uint32_t c) { return 1 + x * 2 + static_cast<int>(c) + 4 * y; });
  Image<short> out({2, 2, 3}, {1, 0}, 77);
  RangeOf({0, 0}, {100, 100}, -1).Process(&in, nullptr, &out);
  for (int y = 0; y < 2; ++y) {
    const auto first = static_cast<short>(1 + 4 * y);
    const std::vector<short> row(&out.At(0, y), &out.At(0, y) + 6);
    EXPECT_EQ(row, (std::vector<short>{first, static_cast<short>(first + 1), static_cast<short>(first + 2),
                                       static_cast<short>(first + 3), 77, 77}));
  }
}

TEST(Normalize, MaskHasNoEffect) {
  Image<short> in({300, 2}, {1, 1}, 15);
  Image<float> out({300, 2}, {1, 1});
  Mask mask(300, 2, {1, 1}, false), unreadable(300, 2);
  unreadable.bits.clear();
  unreadable.bits.shrink_to_fit();
  for (Mask* given : {&mask, &unreadable}) {
    FillBytes(out);
    RangeOf({10}, {30}, -1).Process(&in, given, &out);
    for (int y = 0; y < 2; ++y) {
      for (int x = 0; x < 300; ++x) EXPECT_EQ(out.At(x, y), 25.0f);
    }
  }
}

TEST(Normalize, HeightOrWidthOrChannelsOfZeroWriteNothing) {
  for (const tests::Size size : {tests::Size{4, 0, 2}, tests::Size{0, 4, 2}, tests::Size{4, 4, 0}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({size.width, size.height, 2}, {1, 1});
    FillBytes(out);
    RangeOf({0, 0}, {9, 9}, -1).Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(Normalize, ZeroChannelsNeedNoBounds) {
  Image<short> in({4, 4, 0}), out({4, 4, 0});
  Normalize().Process(&in, nullptr, &out);
}

TEST(Normalize, MarginIsNotWritten) {
  Image<short> in({3, 2}, {1, 2}, 15);
  Image<short> out({3, 2}, {2, 1}, 77);
  RangeOf({10}, {30}, -1).Process(&in, nullptr, &out);
  for (int y = -1; y < 3; ++y) {
    for (int x = -2; x < 5; ++x) {
      const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y), isInside ? 25 : 77) << x << ", " << y;
    }
  }
}

TEST(Normalize, ParametersAreEmptyAndNoDataIsZeroByDefault) {
  const Normalize normalize;
  EXPECT_TRUE(normalize.MinData.empty());
  EXPECT_TRUE(normalize.MaxData.empty());
  EXPECT_EQ(normalize.NoData, 0.0f);
}

// ---- failures

TEST(NormalizeFailure, TypesOutsideTheListAreInvalidComplexOnesIncluded) {
  std::vector<DataType> types = {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)};
  for (const PixelType& type : tests::kPixelTypes) types.push_back(DataType(type.element, true));
  Image<short> real({3, 2}, {1, 1}, 7);
  FillBytes(real);
  for (const DataType& type : types) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    const Normalize normalize = RangeOf({10}, {30}, 0);
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { normalize.Process(&odd, nullptr, &real); }));
    EXPECT_TRUE(
        Throws<Exception>("Invalid type requested.", [&] { normalize.Process(&real, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(odd));
    EXPECT_TRUE(IsUntouched(real));
  }
}

// ---- differential

/// The lower and the upper bound of a channel.
struct Bounds {
  float low, high;
};

Bounds DrawBounds(tests::Random& random) {
  constexpr float kLows[] = {0.0f, 1.0f,  2.0f,    10.0f,  -1.0f,  -100.0f,
                             0.5f, 12.3f, -128.0f, 255.0f, 1e-30f, 16777216.0f};
  constexpr float kWidths[] = {1.0f,   2.0f,   3.0f,      7.0f,   8.0f,    10.0f,    50.0f,   64.0f,
                               100.0f, 127.0f, 200.0f,    255.0f, 1000.0f, 65535.0f, 0.001f,  0x1p-10f,
                               1e-30f, 1e-40f, kDenormal, 1e10f,  0x1p32f, 0x1p64f,  3.3e38f, 12.7f};
  constexpr float kOdd[] = {0.0f,   -0.0f,  kNaN,           kInfinity, -kInfinity, 3.4028235e38f,
                            -1e20f, 1e-45f, -3.4028235e38f, 5.0f,      300.0f};
  if (random.OneIn(4)) return {random.Pick(kOdd), random.Pick(kOdd)};
  const float low = random.Pick(kLows);
  return {low, low + random.Pick(kWidths)};
}

/// An operator for a number of channels, and values that its samples are likely to meet.
struct Drawn {
  Normalize normalize;
  std::vector<double> extra;

  Drawn(tests::Random& random, std::uint32_t channels) {
    constexpr float kNoData[] = {0.0f,   0.0f,   -0.0f,   1.0f,      2.0f,       3.0f,       -1.0f, 12.0f,
                                 50.5f,  255.0f, -128.0f, 300.f,     8388609.f,  16777216.f, 3e9f,  1e20f,
                                 -1e20f, 5e-10f, 1e-40f,  kInfinity, -kInfinity, kNaN};
    std::vector<float> min, max;
    for (std::uint32_t c = 0; c < channels + (random.OneIn(4) ? 2 : 0); ++c) {
      const Bounds bounds = DrawBounds(random);
      min.push_back(bounds.low);
      max.push_back(bounds.high);
      if (c < 3) Append(bounds.low, bounds.high);
    }
    const float noData = random.Pick(kNoData);
    Append(noData, noData);
    normalize = RangeOf(min, max, noData);
  }

 private:
  void Append(float low, float high) {
    extra.insert(extra.end(),
                 {low, high, std::nextafter(low, high), std::nextafter(high, low), 0.5 * low + 0.5 * high,
                  low + 1.0, high - 1.0, low + 6e-10, low - 1e-9, high * (1 + 0x1p-30)});
  }
};

/// A case without what this operator refuses; some are wider than all blocks.
tests::Case Adapted(tests::Case c, tests::Random& random) {
  c.in.isComplex = false;
  if (c.size.channels < 10 && random.OneIn(60))
    c.size = {1020 + random.Below(3100), 1 + random.Below(2), c.size.channels};
  if (c.size.channels > 200 && random.OneIn(2)) {
    c.outChannels += 1000;
    c.size.channels += 1000;
  }
  return c;
}

/// Makes the operator take the output for one that is larger than the caches.
constexpr std::uint64_t kLarge = std::uint64_t{1} << 30;

struct NormalizeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(NormalizeDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& drawn : tests::CasesFrom(GetParam(), {.outputHasInputChannels = true})) {
    tests::Random random(~drawn.seed);
    const tests::Case c = Adapted(drawn, random);
    const Drawn with(random, c.size.channels);
    const bool isLarge = random.OneIn(4);
    const auto process = [&](Raster* in, Mask* mask, Raster* out) {
      const std::uint64_t size = out->dataSize;
      if (isLarge) out->dataSize = kLarge;
      with.normalize.Process(in, mask, out);
      out->dataSize = size;
    };
    const auto twin = [&](const Raster& in, const Mask*, Raster& out) {
      reference::Normalize(with.normalize, in, out);
    };
    ASSERT_TRUE(Agree(c, with.extra, process, twin))
        << "MinData " << ::testing::PrintToString(with.normalize.MinData) << ", MaxData "
        << ::testing::PrintToString(with.normalize.MaxData) << ", NoData " << with.normalize.NoData;
  }
}

/// Compares operator and twin on one input, for all output types.
::testing::AssertionResult AgreesForAllOutputs(const Normalize& parameters, Raster& in) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster expected({in.width, in.height, in.channels, type.element}, {1, 1});
    Raster actual({in.width, in.height, in.channels, type.element}, {1, 1});
    FillBytes(expected);
    FillBytes(actual);
    reference::Normalize(parameters, in, expected);
    Normalize(parameters).Process(&in, nullptr, &actual);
    ::testing::AssertionResult result = tests::SameBits(expected, actual);
    if (!result) return result;
  }
  return ::testing::AssertionSuccess();
}

/// The types of at most 16 bits.
struct NormalizeOfNarrowSamples : ::testing::TestWithParam<PixelType> {};

TEST_P(NormalizeOfNarrowSamples, AgreesWithTheTwinOnAllValues) {
  constexpr Bounds kBounds[] = {{0, 127},      {-128, 127}, {0, 255},       {5, 8},        {-3, 4},
                                {-50, 50},     {0, 65535},  {-32768, 0},    {100, 1100},   {0.5f, 40000.25f},
                                {0, 0.00001f}, {7, -7},     {-1e30f, 1e6f}, {-1e-3f, 3e4f}};
  tests::Random random(20240412);
  tests::WithPixelType(GetParam().element, [&]<class T>() {
    Image<T> in({512, 129});  // one row more than the values
    for (std::size_t i = 0; i < in.dataSize / sizeof(T); ++i) in.Elements()[i] = static_cast<T>(i);
    for (int i = 0; i < 3; ++i) {
      const Bounds bounds = random.Pick(kBounds);
      const float noData = random.OneIn(2) ? bounds.low + 1.0f : -1e30f;
      EXPECT_TRUE(AgreesForAllOutputs(RangeOf({bounds.low}, {bounds.high}, noData), in))
          << bounds.low << " to " << bounds.high;
    }
  });
}

/// A raster of one row with `draw()` for each sample.
template <class T, class Draw>
std::unique_ptr<Image<T>> RowOf(std::uint32_t width, Draw draw) {
  auto row = std::make_unique<Image<T>>(tests::Size{width, 1});
  std::generate_n(row->Elements(), width, [&] { return static_cast<T>(draw()); });
  return row;
}

TEST(NormalizeQuotients, AgreeWithTheTwinsHalfWayBetweenFloats) {
  tests::Random random(20240415);
  for (std::uint32_t odd = 1; odd < 64; odd += 2) {
    for (const int power : {24, 0, -20, 60}) {
      // 100 times an odd number of 20 bits or a little more is, over a power of two, one of 25 bits
      const auto row = RowOf<float>(1000, [&] {
        const std::uint32_t multiple = std::min(671089 + random.Below(671089), (1u << 24) / odd) | 1;
        return std::ldexp(static_cast<double>(odd * multiple), power - 24);
      });
      const float max = std::ldexp(static_cast<float>(odd), power);
      EXPECT_TRUE(AgreesForAllOutputs(RangeOf({0}, {max}, -1), *row)) << max;
    }
  }
}

TEST(NormalizeQuotients, AgreeWithTheTwinsOnPixelsOfMoreSamplesThanABlock) {
  constexpr std::uint32_t kChannels = 2500;
  std::vector<float> min, max;
  for (std::uint32_t c = 0; c < kChannels; ++c) {
    min.push_back(static_cast<float>(c % 5));
    max.push_back(min.back() + static_cast<float>(25 + 2 * (c % 400)));  // ranges that a product serves
  }
  Image<unsigned char> in({2, 1, kChannels});
  in.Set([](int x, int, std::uint32_t c) { return 50 * x + static_cast<int>(c % 100); });
  EXPECT_TRUE(AgreesForAllOutputs(RangeOf(min, max, -1), in));
}

TEST(NormalizeQuotients, AgreeWithTheTwinsHalfWayBetweenDenormals) {
  tests::Random random(20240416);
  for (std::uint32_t odd = 1; odd < 400; odd += 2) {
    const auto row = RowOf<float>(500, [&] {
      const std::uint32_t multiple = random.Below(random.OneIn(2) ? 16 : 30000);
      return std::ldexp(static_cast<double>(odd * multiple), -150 + 60);
    });
    const float max = std::ldexp(100.0f * static_cast<float>(odd), 60);
    EXPECT_TRUE(AgreesForAllOutputs(RangeOf({0}, {max}, -1), *row)) << max;
  }
}

TEST_P(NormalizeDifferential, AgreesWithTheTwinWhereInputAndOutputAreOneRaster) {
  tests::Random random(20240413);
  for (int i = 0; i < 40; ++i) {
    const tests::Size size = {random.Below(700), 1 + random.Below(3), 1 + random.Below(5)};
    const Drawn with(random, size.channels);
    const tessel::RasterInfo info(size.width, size.height, size.channels, GetParam().element);
    Raster in(info, {1, 1}), expected(info, {1, 1});
    tests::FillRandom(in, random.Pick(tests::kFills), random, with.extra);
    std::copy_n(in.data, in.dataSize, expected.data);
    reference::Normalize(with.normalize, in, expected);
    with.normalize.Process(&in, nullptr, &in);
    ASSERT_TRUE(tests::SameBits(expected, in));
  }
}

INSTANTIATE_TEST_SUITE_P(From, NormalizeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());
INSTANTIATE_TEST_SUITE_P(From, NormalizeOfNarrowSamples,
                         ::testing::ValuesIn(tests::kPixelTypes.begin(), tests::kPixelTypes.begin() + 4),
                         ::testing::PrintToStringParamName());

// ---- contract

TEST(NormalizeContract, ParametersSetAfterTheFirstProcessAreIgnoredWhileTheTypesStay) {
  Normalize normalize = RangeOf({10}, {30}, 0);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 25.0f);
  normalize.SetMinData({0});
  normalize.SetMaxData({15});
  normalize.SetNoData(15);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 25.0f);
}

TEST(NormalizeContract, ParametersSetAfterTheFirstProcessAreTakenWhenATypeChanges) {
  Normalize normalize = RangeOf({10}, {30}, 0);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 25.0f);
  normalize.SetMinData({0});
  EXPECT_EQ((PercentOf15<double, short>(normalize)), 50.0);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 50.0f);
  normalize.SetMaxData({15});
  EXPECT_EQ((PercentOf15<float, int>(normalize)), 100.0f);
  normalize.SetNoData(15);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 15.0f);
}

/// A call that the dispatcher refuses.
void FailToDispatch(const Normalize& normalize) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {});
  Image<float> out({1, 1});
  EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { normalize.Process(&bits, nullptr, &out); }));
}

TEST(NormalizeContract, ObjectWorksAfterAFailedDispatchWithTheNewParameters) {
  Normalize normalize = RangeOf({10}, {30}, 0);
  FailToDispatch(normalize);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 25.0f);
  normalize.SetMinData({0});
  FailToDispatch(normalize);
  EXPECT_EQ((PercentOf15<float, short>(normalize)), 50.0f);
}

TEST(NormalizeContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto normalize = std::make_unique<Normalize>(RangeOf({10}, {30}, 0));
  EXPECT_EQ((PercentOf15<float, short>(*normalize)), 25.0f);
  FailToDispatch(*normalize);
}

TEST(NormalizeContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  const Normalize original = RangeOf({10}, {30}, 0);
  Normalize copy(original), assigned;
  assigned = original;
  copy.SetMinData({0});
  EXPECT_EQ((PercentOf15<float, short>(original)), 25.0f);
  EXPECT_EQ((PercentOf15<float, short>(copy)), 50.0f);
  EXPECT_EQ((PercentOf15<float, short>(assigned)), 25.0f);
}

}  // namespace
}  // namespace orvik::filters
