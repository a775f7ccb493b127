#include "processes/gridmill/intenratiochange.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <initializer_list>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/reference/intenratiochange_reference.h"
#include "tests/support/changecases.h"
#include "tests/support/changetwins.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::changedetection {
namespace {

using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr int kLeastInt = std::numeric_limits<int>::min();

/// The result for one pixel: the means, the decibels and the fourth channel.
template <class Out, class In>
std::vector<Out> Ratio(const IntenRatioChange& ratio, const std::vector<In>& image,
                       const std::vector<In>& reference, bool isValid = true) {
  Image<In> i({1, 1, static_cast<std::uint32_t>(image.size())});
  std::copy(image.begin(), image.end(), i.Elements());
  Image<In> r({1, 1, static_cast<std::uint32_t>(reference.size())});
  std::copy(reference.begin(), reference.end(), r.Elements());
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1, 4}, {}, 77);
  ratio.Process(&i, &r, &mask, &out);
  return {out.Elements(), out.Elements() + 4};
}

/// The decibels of two pixels without no-data.
template <class Out, class In>
Out Decibels(const std::vector<In>& image, const std::vector<In>& reference) {
  return Ratio<Out, In>(IntenRatioChange(eDIFF_FORWARD), image, reference)[2];
}

/// An operator with a test for 0 in an image of `channels` and in any reference, and -5 for no-data.
IntenRatioChange WithNoDataOfZero(std::size_t channels) {
  IntenRatioChange ratio(eDIFF_FORWARD);
  ratio.SetNoData(-5.0f);
  ratio.SetImgNoData(std::vector<float>(channels, 0.0f));
  ratio.SetRefNoData(std::vector<float>(8, 0.0f));
  return ratio;
}

// ---- golden

TEST(IntenRatioChange, Samples100And200Against50And100Give150And75And3Decibels) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  const std::vector<float> result = Ratio<float, unsigned char>(ratio, {100, 200}, {50, 100});
  EXPECT_EQ(result[0], 150.0f);
  EXPECT_EQ(result[1], 75.0f);
  EXPECT_EQ(result[2], static_cast<float>(10.0 * std::log10(2.0)));
  EXPECT_NEAR(result[2], 3.0103f, 5e-5f);
  EXPECT_EQ(result[3], 0.0f);
}

TEST(IntenRatioChange, TheSameInUnsignedCharGives150And75And3) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<unsigned char, unsigned char>(ratio, {100, 200}, {50, 100})),
            (std::vector<unsigned char>{150, 75, 3, 0}));
}

TEST(IntenRatioChange, ReferenceWhoseMeanIsZeroGivesZeroDecibelsAndTheMeansAsTheyAre) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<float, short>(ratio, {10, 20}, {0, 0})), (std::vector<float>{15, 0, 0, 0}));
  EXPECT_EQ((Ratio<float, short>(ratio, {10, 20}, {-5, 5})), (std::vector<float>{15, 0, 0, 0}));
  EXPECT_EQ((Ratio<float, float>(ratio, {10.0f}, {-0.0f})), (std::vector<float>{10, 0, 0, 0}));
  EXPECT_EQ((Ratio<int, float>(ratio, {-kInfinity}, {0.0f})), (std::vector<int>{kLeastInt, 0, 0, 0}));
}

TEST(IntenRatioChange, ImageWhoseMeanIsZeroGivesMinusInfinity) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<float, short>(ratio, {0, 0}, {10, 20})), (std::vector<float>{0, 15, -kInfinity, 0}));
  EXPECT_EQ((Ratio<unsigned char, short>(ratio, {0}, {15})), (std::vector<unsigned char>{0, 15, 0, 0}));
  EXPECT_EQ((Ratio<short, short>(ratio, {0}, {15})), (std::vector<short>{0, 15, -32768, 0}));
  EXPECT_EQ((Decibels<double, short>({0}, {15})), -static_cast<double>(kInfinity));
  EXPECT_EQ((Decibels<char, short>({0}, {15})), -128);
  EXPECT_EQ((Decibels<int, short>({0}, {15})), kLeastInt);
  EXPECT_EQ((Decibels<std::int64_t, short>({0}, {15})), 0);
}

TEST(IntenRatioChange, TwoMeansOfZeroGiveZeroDecibels) {
  EXPECT_EQ((Decibels<double, short>({0}, {0})), 0.0);
}

TEST(IntenRatioChange, MeansOfOppositeSignHaveALogarithm) {
  EXPECT_EQ((Decibels<int, short>({-1000}, {10})), 20);
  EXPECT_EQ((Decibels<int, short>({1000}, {-10})), 20);
  EXPECT_EQ((Decibels<int, short>({-1000}, {-10})), 20);
}

TEST(IntenRatioChange, OneChannelImageBesideAThreeChannelReferenceAreAveragedOverTheirOwnChannels) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<short, short>(ratio, {40}, {1, 2, 9})), (std::vector<short>{40, 4, 10, 0}));
  EXPECT_EQ((Ratio<short, short>(ratio, {1, 2, 9}, {40})), (std::vector<short>{4, 40, -10, 0}));
}

/// Compares the means of all sums of `channels` samples with the divisions that the operator does without.
template <class In, std::uint32_t channels>
void ExpectQuotientsOfAllSums() {
  const int largest = std::numeric_limits<In>::max();
  const int lowest = std::numeric_limits<In>::min();
  const auto least = static_cast<int>(channels) * lowest, most = static_cast<int>(channels) * largest;
  std::vector<int> sums;
  for (int sum = least; sum <= most; ++sum) sums.push_back(sum);
  Image<In> image({static_cast<std::uint32_t>(sums.size()), 1, channels});
  for (std::size_t x = 0; x < sums.size(); ++x) {
    int rest = sums[x];
    for (std::uint32_t c = 0; c < channels; ++c) {
      const int left = static_cast<int>(channels - c);
      const int share = std::clamp(rest - (left - 1) * (x % 2 == 0 ? lowest : largest), lowest, largest);
      image.At(static_cast<int>(x), 0, c) = static_cast<In>(share);
      rest -= share;
    }
    ASSERT_EQ(rest, 0);
  }
  Image<double> out({image.width, 1, 4});
  IntenRatioChange(eDIFF_FORWARD).Process(&image, &image, nullptr, &out);
  for (std::size_t x = 0; x < sums.size(); ++x)
    ASSERT_EQ(out.At(static_cast<int>(x), 0), static_cast<double>(sums[x]) / channels) << sums[x];
}

TEST(IntenRatioChange, MeansOfNarrowSamplesAreTheRoundedQuotients) {
  ExpectQuotientsOfAllSums<unsigned char, 3>();
  ExpectQuotientsOfAllSums<unsigned char, 4>();
  ExpectQuotientsOfAllSums<char, 3>();
  ExpectQuotientsOfAllSums<unsigned short, 3>();
  ExpectQuotientsOfAllSums<unsigned short, 4>();
  ExpectQuotientsOfAllSums<short, 3>();
}

TEST(IntenRatioChange, OneNoDataChannelOutOfThreeGivesNoDataInAllFourChannels) {
  const IntenRatioChange ratio = WithNoDataOfZero(3);
  const std::vector<short> excluded(4, -5);
  for (std::size_t c = 0; c < 3; ++c) {
    std::vector<short> pixel = {1, 2, 3};
    pixel[c] = 0;
    EXPECT_EQ((Ratio<short, short>(ratio, pixel, {1, 2, 3})), excluded) << c;
    EXPECT_EQ((Ratio<short, short>(ratio, {1, 2, 3}, pixel)), excluded) << c;
    EXPECT_EQ((Ratio<short, short>(ratio, pixel, pixel)), excluded) << c;
  }
  EXPECT_EQ((Ratio<short, short>(ratio, {1, 2, 3}, {1, 2, 3})), (std::vector<short>{2, 2, 0, 0}));
}

TEST(IntenRatioChange, MaskedPixelGetsNoDataInAllFourChannels) {
  EXPECT_EQ((Ratio<short, short>(IntenRatioChange(eDIFF_FORWARD), {1}, {2}, false)),
            std::vector<short>(4, 0));
  EXPECT_EQ((Ratio<short, short>(WithNoDataOfZero(1), {1}, {2}, false)), std::vector<short>(4, -5));
}

TEST(IntenRatioChange, NoDataIsWrittenThroughClipTo) {
  IntenRatioChange ratio(eDIFF_FORWARD);
  ratio.SetNoData(-9999.5f);
  EXPECT_EQ((Ratio<unsigned char, short>(ratio, {1}, {2}, false)), std::vector<unsigned char>(4, 0));
  EXPECT_EQ((Ratio<short, unsigned char>(ratio, {1}, {2}, false)), std::vector<short>(4, -10000));
  EXPECT_EQ((Ratio<double, unsigned char>(ratio, {1}, {2}, false)), std::vector<double>(4, -9999.5));
}

TEST(IntenRatioChange, NoDataIsRoundedInFloat) {
  IntenRatioChange ratio(eDIFF_FORWARD);
  ratio.SetNoData(8388609.0f);
  EXPECT_EQ((Ratio<int, short>(ratio, {1}, {2}, false)), std::vector<int>(4, 8388610));
}

// Deliberate: `type` is stored and has no effect.
TEST(IntenRatioChange, TypeIsStoredAndHasNoEffect) {
  for (int type = -1; type <= 3; ++type) {
    IntenRatioChange ratio(eDIFF_ABSOLUTE);
    ratio.SetType(static_cast<DiffType>(type));
    EXPECT_EQ(ratio.type, static_cast<DiffType>(type));
    EXPECT_EQ((Ratio<short, short>(ratio, {4}, {40})), (std::vector<short>{4, 40, -10, 0})) << type;
  }
}

// Deliberate: only T is tested: an S of 0 gives minus infinity.
TEST(IntenRatioChange, OnlyTIsTestedAnSOf0GivesMinusInfinity) {
  EXPECT_EQ((Decibels<float, float>({0.0f}, {3.0f})), -kInfinity);
  EXPECT_EQ((Decibels<float, float>({-0.0f}, {3.0f})), -kInfinity);
  EXPECT_EQ((Decibels<float, float>({-4.0f, 4.0f}, {1e-40f})), -kInfinity);
  EXPECT_EQ((Decibels<float, float>({3.0f}, {0.0f})), 0.0f);
}

TEST(IntenRatioChange, NaNInTheReferencePassesTheTestAndGivesNaN) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  const std::vector<float> result = Ratio<float, float>(ratio, {3.0f}, {kNaN, 1.0f});
  EXPECT_EQ(result[0], 3.0f);
  EXPECT_TRUE(std::isnan(result[1]));
  EXPECT_TRUE(std::isnan(result[2]));
  EXPECT_EQ(result[3], 0.0f);
  EXPECT_EQ((Ratio<int, float>(ratio, {3.0f}, {kNaN})), (std::vector<int>{3, kLeastInt, kLeastInt, 0}));
  EXPECT_EQ((Ratio<short, float>(ratio, {kNaN}, {3.0f})), (std::vector<short>{0, 3, 0, 0}));
  EXPECT_EQ((Ratio<short, float>(ratio, {kNaN}, {0.0f})), (std::vector<short>{0, 0, 0, 0}));
}

TEST(IntenRatioChange, InfiniteMeansFollowTheDivision) {
  EXPECT_EQ((Decibels<float, float>({kInfinity}, {3.0f})), kInfinity);
  EXPECT_EQ((Decibels<float, float>({3.0f}, {-kInfinity})), -kInfinity);
  EXPECT_TRUE(std::isnan(Decibels<float, float>({kInfinity}, {kInfinity})));
  EXPECT_EQ((Decibels<float, double>({1e300}, {1e-300})), kInfinity);
}

TEST(IntenRatioChange, MeansOfIntegerOutputsAreRoundedByClipTo) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<unsigned char, short>(ratio, {10, 21}, {10, 20})),
            (std::vector<unsigned char>{16, 15, 0, 0}));
  EXPECT_EQ((Ratio<short, short>(ratio, {-10, -21}, {-10, -20})), (std::vector<short>{-16, -15, 0, 0}));
  EXPECT_EQ((Ratio<char, short>(ratio, {300}, {-300})), (std::vector<char>{127, -128, 0, 0}));
}

TEST(IntenRatioChange, OutputsOf64BitsAreTruncatedAndNeverNegative) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<std::int64_t, short>(ratio, {5, 6}, {-5, -6})), (std::vector<std::int64_t>{5, 0, 0, 0}));
  EXPECT_EQ((Ratio<std::uint64_t, short>(ratio, {9}, {1})), (std::vector<std::uint64_t>{9, 1, 9, 0}));
  EXPECT_EQ((Ratio<std::int64_t, short>(ratio, {1}, {9})), (std::vector<std::int64_t>{1, 9, 0, 0}));
}

TEST(IntenRatioChange, DecibelsOfABrighterReferenceAreLostInAnUnsignedOutput) {
  EXPECT_EQ((Decibels<unsigned char, short>({1}, {1000})), 0);
  EXPECT_EQ((Decibels<unsigned int, short>({1}, {1000})), 0u);
  EXPECT_EQ((Decibels<std::int64_t, short>({1}, {1000})), 0);
  EXPECT_EQ((Decibels<short, short>({1}, {1000})), -30);
}

TEST(IntenRatioChange, DecibelsOfPowersOfTenAreWhole) {
  std::uint64_t power = 1;
  for (int decibels = 0; decibels <= 180; decibels += 10, power *= 10) {
    EXPECT_EQ((Decibels<double, std::uint64_t>({power}, {1})), decibels);
    EXPECT_EQ((Decibels<std::int64_t, std::uint64_t>({power}, {1})), decibels);
  }
}

TEST(IntenRatioChange, AllArithmeticIsInDouble) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  EXPECT_EQ((Ratio<double, int>(ratio, {16777217}, {16777217, 2, 2})[0]), 16777217.0);
  EXPECT_EQ((Ratio<double, int>(ratio, {16777217}, {16777217, 2, 2})[1]), 16777221.0 / 3.0);
  EXPECT_EQ((Ratio<double, unsigned int>(ratio, {4294967295u, 4294967294u}, {1})[0]), 4294967294.5);
  EXPECT_EQ((Ratio<double, float>(ratio, {1e8f, 1.0f, -1e8f}, {1})[0]), 1.0 / 3.0);
  EXPECT_EQ((Ratio<double, double>(ratio, {1e16, 1.0, -1e16}, {1})[0]), 0.0);
  EXPECT_EQ((Ratio<double, std::uint64_t>(ratio, {~0ull}, {1})[0]), 0x1p64);
}

TEST(IntenRatioChange, NoDataIsComparedInFloatAndWithoutATolerance) {
  IntenRatioChange ratio(eDIFF_FORWARD);
  ratio.SetNoData(-5.0f);
  ratio.SetImgNoData({16777216.0f});
  ratio.SetRefNoData({1.0f});
  EXPECT_EQ((Ratio<short, double>(ratio, {16777217.0}, {7.0})), std::vector<short>(4, -5));
  EXPECT_EQ((Ratio<short, std::int64_t>(ratio, {16777217}, {7})), std::vector<short>(4, -5));
  EXPECT_EQ((Ratio<double, double>(ratio, {16777218.0}, {7.0})[0]), 16777218.0);
  EXPECT_EQ((Ratio<short, double>(ratio, {7.0}, {1.0 + 1e-9})), std::vector<short>(4, -5));
  EXPECT_EQ((Ratio<short, double>(ratio, {7.0}, {1.0 + 1e-7}))[0], 7);
}

TEST(IntenRatioChange, ZerosOfBothSignsAreNoDataOfZeroAndNaNMatchesNothing) {
  EXPECT_EQ((Ratio<short, float>(WithNoDataOfZero(1), {-0.0f}, {1.0f})), std::vector<short>(4, -5));
  IntenRatioChange ratio(eDIFF_FORWARD);
  ratio.SetNoData(-5.0f);
  ratio.SetImgNoData({kNaN});
  ratio.SetRefNoData({kNaN});
  EXPECT_TRUE(std::isnan((Ratio<float, float>(ratio, {kNaN}, {1.0f})[0])));
}

TEST(IntenRatioChange, NoDataTestNeedsAsManyImageEntriesAsChannelsAndGovernsBothRasters) {
  EXPECT_EQ((Ratio<short, short>(WithNoDataOfZero(2), {0, 3, 3}, {0, 6, 0})),
            (std::vector<short>{2, 2, 0, 0}));
  EXPECT_EQ((Ratio<short, short>(WithNoDataOfZero(0), {0, 3, 3}, {0, 6, 0})),
            (std::vector<short>{2, 2, 0, 0}));
  EXPECT_EQ((Ratio<short, short>(WithNoDataOfZero(3), {1, 2, 3}, {0})), std::vector<short>(4, -5));
}

TEST(IntenRatioChange, EachChannelHasNoDataOfItsOwnAlsoInALongerReference) {
  IntenRatioChange ratio(eDIFF_FORWARD);
  ratio.SetNoData(-5.0f);
  ratio.SetImgNoData({7.0f});
  ratio.SetRefNoData({1.0f, 2.0f, 3.0f});
  EXPECT_EQ((Ratio<short, short>(ratio, {1}, {3, 1, 2})), (std::vector<short>{1, 2, -3, 0}));
  EXPECT_EQ((Ratio<short, short>(ratio, {1}, {9, 9, 3})), std::vector<short>(4, -5));
  EXPECT_EQ((Ratio<short, short>(ratio, {7}, {9, 9, 9})), std::vector<short>(4, -5));
}

TEST(IntenRatioChange, MeanOfNoChannelsIsNaN) {
  const IntenRatioChange ratio(eDIFF_FORWARD);
  const std::vector<float> result = Ratio<float, short>(ratio, {5}, {});
  EXPECT_EQ(result[0], 5.0f);
  EXPECT_TRUE(std::isnan(result[1]));
  EXPECT_TRUE(std::isnan(result[2]));
  EXPECT_EQ(result[3], 0.0f);
  EXPECT_EQ((Ratio<int, short>(ratio, {5}, {})), (std::vector<int>{5, kLeastInt, kLeastInt, 0}));
  EXPECT_EQ((Ratio<int, short>(WithNoDataOfZero(1), {}, {5})),
            (std::vector<int>{kLeastInt, 5, kLeastInt, 0}));
}

TEST(IntenRatioChange, EmptyNoDataVectorOfAnImageWithoutChannelsActivatesTheTest) {
  EXPECT_EQ((Ratio<short, short>(WithNoDataOfZero(0), {}, {0, 5})), std::vector<short>(4, -5));
}

TEST(IntenRatioChange, ComplexRastersGiveTheFirstElementsOfTheirPixels) {
  Image<short> image({2, 1, 2}, {}, 0, true), reference({2, 1, 1}, {}, 0, true);
  image.SetPixel(1, 0, {10, 30, 1000, 1000});
  reference.SetPixel(1, 0, {2, 1000});
  Image<short> out({2, 1, 2}, {}, 77, true);
  IntenRatioChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(std::vector<short>(&out.At(1, 0), &out.At(1, 0) + 4), (std::vector<short>{20, 2, 10, 0}));
}

TEST(IntenRatioChange, ReferenceOfAnotherTypeIsReadAsTheImagesFromItsOwnAddresses) {
  Image<short> image({2, 1}, {}, 10);
  Image<int> reference({2, 1}, {}, 0x00020001);
  reference.SetPixel(1, 0, {0x00040003});
  Image<short> out({2, 1, 4});
  IntenRatioChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 1), 1);
  EXPECT_EQ(out.At(1, 0, 1), 3);
}

TEST(IntenRatioChange, ChannelsBehindTheFourthKeepTheirBits) {
  Image<short> image({2, 1}, {}, 40), reference({2, 1}, {}, 4);
  Image<short> out({2, 1, 6}, {}, 77);
  Mask mask(2, 1);
  mask.SetValid(1, 0, false);
  IntenRatioChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  EXPECT_EQ(std::vector<short>(&out.At(0, 0), &out.At(0, 0) + 12),
            (std::vector<short>{40, 4, 10, 0, 77, 77, 0, 0, 0, 0, 77, 77}));
}

TEST(IntenRatioChange, EmptyImageWritesNothing) {
  for (const tests::Size size : {tests::Size{3, 0}, tests::Size{0, 3}}) {
    Image<short> image(size, {1, 1}, 5), reference(size, {1, 1}, 6);
    Image<short> out({3, 3, 4}, {1, 1});
    FillBytes(out);
    IntenRatioChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

// ---- differential

constexpr tests::ChangeLimits kLimits = {.read = [](std::uint32_t, std::uint32_t n) { return n; },
                                         .written = [](std::uint32_t, std::uint32_t) { return 4u; }};

/// True if the decibels, whose logarithm may be off by one unit in the last place, are off by two at most.
bool IsNear(double expected, double actual) {
  double low = expected, high = expected;
  for (int i = 0; i < 2; ++i) {
    low = std::nextafter(low, -static_cast<double>(kInfinity));
    high = std::nextafter(high, static_cast<double>(kInfinity));
  }
  return std::isfinite(expected) && expected != 0 && actual >= low && actual <= high;
}

struct IntenRatioChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(IntenRatioChangeDifferential, AgreesWithTheTwinBitForBitButForTheLastBitsOfDecibelsInDouble) {
  for (tests::ChangeCase c : tests::ChangeCasesFrom(GetParam(), kLimits)) {
    const bool isDouble = c.out.type.sizeBits == 64 && c.out.type.isFloat;
    if (isDouble) c.out.size.channels = std::max(c.out.size.channels, 4u);
    IntenRatioChange ratio(static_cast<DiffType>(c.parameters.type));
    SetNoDataOf(c.parameters, ratio);
    const auto params = tests::ParamsOf<details::IntenRatioParams>(c.parameters);
    const auto twin = [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
      reference::IntenRatioChange(params, image, reference, mask, out);
    };
    const tests::ChangeScene expected(c);
    twin(*expected.image, *expected.reference, expected.mask.get(), *expected.Out());
    const auto process = [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
      ratio.Process(image, reference, mask, out);
      if (isDouble) tests::Settle<double>(*expected.Out(), *out, c.image.size, 2, IsNear);
    };
    ASSERT_TRUE(Agree(c, process, twin));
  }
}

INSTANTIATE_TEST_SUITE_P(From, IntenRatioChangeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
