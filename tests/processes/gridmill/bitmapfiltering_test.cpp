#include "processes/gridmill/bitmapfiltering.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/bitmapfiltering_reference.h"
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
using tests::SameBits;
using tests::Throws;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The result for one sample.
template <class Out = int, class In = float>
Out Selected(const BitmapFiltering& filter, In sample, bool isValid = true) {
  Image<In> in({1, 1}, {}, sample);
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1}, {}, static_cast<Out>(77));
  filter.Process(&in, &mask, &out);
  return out.At(0, 0);
}

/// The elements of the output's row y from pixel 0 on.
template <class T>
std::vector<T> RowOf(Image<T>& image, int y, std::size_t count) {
  return {&image.At(0, y), &image.At(0, y) + count};
}

// ---- golden

TEST(BitmapFiltering, BothEndsOfARangeBelongToIt) {
  const BitmapFiltering filter(10, 20);
  EXPECT_EQ(Selected(filter, 10.0f), 1);
  EXPECT_EQ(Selected(filter, 15.0f), 1);
  EXPECT_EQ(Selected(filter, 20.0f), 1);
  EXPECT_EQ(Selected(filter, 9.5f), 0);
  EXPECT_EQ(Selected(filter, 20.5f), 0);
  EXPECT_EQ(Selected(filter, std::nextafter(10.0f, 0.0f)), 0);
  EXPECT_EQ(Selected(filter, std::nextafter(20.0f, 30.0f)), 0);
  EXPECT_EQ(Selected(filter, kInfinity), 0);
  EXPECT_EQ(Selected(filter, -kInfinity), 0);
}

TEST(BitmapFiltering, MinimumAboveTheMaximumSelectsEverythingOutsideTheGap) {
  const BitmapFiltering filter(20, 10);
  EXPECT_EQ(Selected(filter, 10.0f), 1);
  EXPECT_EQ(Selected(filter, 20.0f), 1);
  EXPECT_EQ(Selected(filter, 15.0f), 0);
  EXPECT_EQ(Selected(filter, 5.0f), 1);
  EXPECT_EQ(Selected(filter, 25.0f), 1);
  EXPECT_EQ(Selected(filter, std::nextafter(10.0f, 20.0f)), 0);
  EXPECT_EQ(Selected(filter, std::nextafter(20.0f, 10.0f)), 0);
  EXPECT_EQ(Selected(filter, kInfinity), 1);
  EXPECT_EQ(Selected(filter, -kInfinity), 1);
}

TEST(BitmapFiltering, EqualThresholdsSelectTheirValueAlone) {
  const BitmapFiltering filter(5, 5);
  EXPECT_EQ(Selected(filter, 5.0f), 1);
  EXPECT_EQ(Selected(filter, std::nextafter(5.0f, 0.0f)), 0);
  EXPECT_EQ(Selected(filter, std::nextafter(5.0f, 9.0f)), 0);
  EXPECT_EQ(Selected(filter, -5.0f), 0);
  EXPECT_EQ(Selected(BitmapFiltering(kInfinity, kInfinity), kInfinity), 1);
  EXPECT_EQ(Selected(BitmapFiltering(kInfinity, kInfinity), 3e38f), 0);
}

TEST(BitmapFiltering, DefaultThresholdsSelectTheSamplesEqualToZero) {
  const BitmapFiltering filter;
  EXPECT_EQ(Selected(filter, 0.0f), 1);
  EXPECT_EQ(Selected(filter, -0.0f), 1);
  EXPECT_EQ(Selected(filter, 1e-45f), 0);
  EXPECT_EQ((Selected<int, unsigned char>(filter, 0)), 1);
  EXPECT_EQ((Selected<int, unsigned char>(filter, 1)), 0);
  EXPECT_EQ(Selected(BitmapFiltering(0.0f, -0.0f), 0.0f), 1);
  EXPECT_EQ(Selected(BitmapFiltering(-0.0f, 0.0f), 1.0f), 0);
}

TEST(BitmapFiltering, NaNSampleIsOutsideEveryRange) {
  for (const auto& [min, max] : {std::pair{10.0f, 20.0f}, std::pair{20.0f, 10.0f}, std::pair{5.0f, 5.0f},
                                 std::pair{-kInfinity, kInfinity}, std::pair{kInfinity, -kInfinity},
                                 std::pair{kNaN, kNaN}, std::pair{kNaN, 5.0f}, std::pair{5.0f, kNaN}}) {
    EXPECT_EQ(Selected(BitmapFiltering(min, max), kNaN), 0) << min << ", " << max;
    EXPECT_EQ((Selected<float, double>(BitmapFiltering(min, max), kNaN)), 0.0f) << min << ", " << max;
  }
}

TEST(BitmapFiltering, ThresholdOfNaNLeavesTheOtherHalfOfAWrappedRange) {
  const BitmapFiltering fromFive(5, kNaN), upToFive(kNaN, 5), none(kNaN, kNaN);
  EXPECT_EQ(Selected(fromFive, 4.0f), 0);
  EXPECT_EQ(Selected(fromFive, 5.0f), 1);
  EXPECT_EQ(Selected(fromFive, 6.0f), 1);
  EXPECT_EQ(Selected(upToFive, 4.0f), 1);
  EXPECT_EQ(Selected(upToFive, 5.0f), 1);
  EXPECT_EQ(Selected(upToFive, 6.0f), 0);
  for (const float sample : {-kInfinity, -1.0f, 0.0f, 5.0f, kInfinity}) EXPECT_EQ(Selected(none, sample), 0);
}

TEST(BitmapFiltering, InfiniteThresholdsAreEnds) {
  EXPECT_EQ(Selected(BitmapFiltering(-kInfinity, 5), -3e38f), 1);
  EXPECT_EQ(Selected(BitmapFiltering(-kInfinity, 5), -kInfinity), 1);
  EXPECT_EQ(Selected(BitmapFiltering(-kInfinity, 5), 6.0f), 0);
  EXPECT_EQ(Selected(BitmapFiltering(5, kInfinity), kInfinity), 1);
  EXPECT_EQ(Selected(BitmapFiltering(kInfinity, 5), 6.0f), 0);
  EXPECT_EQ(Selected(BitmapFiltering(kInfinity, 5), kInfinity), 1);
}

TEST(BitmapFiltering, ResultIsZeroOrOneInEveryPairOfTypes) {
  for (const PixelType& inType : tests::kPixelTypes) {
    for (const PixelType& outType : tests::kPixelTypes) {
      tests::WithPixelTypes(inType.element, outType.element, [&]<class In, class Out>() {
        const BitmapFiltering filter(10, 20);
        EXPECT_EQ((Selected<Out, In>(filter, In{10})), Out{1}) << inType << " -> " << outType;
        EXPECT_EQ((Selected<Out, In>(filter, In{20})), Out{1}) << inType << " -> " << outType;
        EXPECT_EQ((Selected<Out, In>(filter, In{21})), Out{0}) << inType << " -> " << outType;
        EXPECT_EQ((Selected<Out, In>(filter, In{10}, false)), Out{0}) << inType << " -> " << outType;
      });
    }
  }
}

TEST(BitmapFiltering, ZeroOfAFloatingOutputIsPositive) {
  EXPECT_FALSE(std::signbit(Selected<float>(BitmapFiltering(10, 20), -5.0f)));
  EXPECT_FALSE(std::signbit(Selected<double>(BitmapFiltering(10, 20), -0.0f)));
  EXPECT_FALSE(std::signbit(Selected<double>(BitmapFiltering(10, 20), 15.0f, false)));
}

TEST(BitmapFiltering, NegativeSamplesAreExtendedByTheirSign) {
  const BitmapFiltering filter(-10, -5);
  EXPECT_EQ((Selected<int, char>(filter, -7)), 1);
  EXPECT_EQ((Selected<int, short>(filter, -7)), 1);
  EXPECT_EQ((Selected<int, int>(filter, -7)), 1);
  EXPECT_EQ((Selected<int, std::int64_t>(filter, -7)), 1);
  EXPECT_EQ((Selected<int, unsigned char>(filter, 249)), 0);
  EXPECT_EQ((Selected<int, unsigned int>(BitmapFiltering(4e9f, 5e9f), 4294967289u)), 1);
  EXPECT_EQ((Selected<int, std::uint64_t>(BitmapFiltering(1.8e19f, 2e19f), ~std::uint64_t{0})), 1);
}

// Deliberate: an excluded pixel holds 0, which a sample outside the range gives too.
TEST(BitmapFiltering, ExcludedPixelHolds0WhichASampleOutsideTheRangeGivesToo) {
  for (const auto& [min, max] : {std::pair{10.0f, 20.0f}, std::pair{20.0f, 10.0f}, std::pair{10.0f, 10.0f}}) {
    const BitmapFiltering filter(min, max);
    EXPECT_EQ(Selected(filter, 10.0f), 1);
    EXPECT_EQ(Selected(filter, 10.0f, false), 0);
    EXPECT_EQ(Selected(filter, 15.5f, false), 0);
  }
  EXPECT_EQ(Selected(BitmapFiltering(10, 20), 25.0f), 0);
}

// Deliberate: `double` and 64-bit samples are narrowed to `float` before they are compared.
TEST(BitmapFiltering, DoubleAnd64BitSamplesAreNarrowedToFloatBeforeTheyAreCompared) {
  const BitmapFiltering filter(16777216, 16777216);
  EXPECT_EQ((Selected<int, double>(filter, 16777217.0)), 1);
  EXPECT_EQ((Selected<int, double>(filter, 16777215.9)), 1);
  EXPECT_EQ((Selected<int, std::int64_t>(filter, 16777217)), 1);
  EXPECT_EQ((Selected<int, std::uint64_t>(filter, 16777217)), 1);
  EXPECT_EQ((Selected<int, int>(filter, 16777217)), 1);
  EXPECT_EQ((Selected<int, unsigned int>(filter, 16777217)), 1);
  EXPECT_EQ((Selected<int, double>(filter, 16777218.0)), 0);
  EXPECT_EQ((Selected<int, double>(BitmapFiltering(1, 2), 1.0 - 1e-9)), 1);
  EXPECT_EQ((Selected<int, double>(BitmapFiltering(kInfinity, kInfinity), 1e300)), 1);
  EXPECT_EQ((Selected<int, std::uint64_t>(BitmapFiltering(0x1p64f, 0x1p64f), ~std::uint64_t{0})), 1);
}

TEST(BitmapFiltering, FirstElementsOfARowAreReadWhateverPixelsTheyBelongTo) {
  Image<short> in({4, 2, 3}, {1, 1}, 15);
  in.SetPixel(0, 0, {5, 15, 25});
  in.SetPixel(1, 0, {15, 15, 15});
  in.SetPixel(2, 0, {15, 15, 15});
  in.SetPixel(3, 0, {5, 5, 5});
  Image<short> out({4, 2}, {}, 77);
  BitmapFiltering(10, 20).Process(&in, nullptr, &out);
  EXPECT_EQ(RowOf(out, 0, 4), (std::vector<short>{0, 1, 0, 1}));
  EXPECT_EQ(RowOf(out, 1, 4), (std::vector<short>{1, 1, 1, 1}));
}

TEST(BitmapFiltering, ComplexInputIsReadAsItsElements) {
  Image<float> in({3, 2}, {1, 0}, 0.0f, true);
  in.SetPixel(0, 0, {15, 5});
  in.SetPixel(1, 0, {20, 15});
  in.SetPixel(0, 1, {5, 12});
  in.SetPixel(1, 1, {5, 12});
  Image<float> out({3, 2}, {}, 77);
  BitmapFiltering(10, 20).Process(&in, nullptr, &out);
  EXPECT_EQ(RowOf(out, 0, 3), (std::vector<float>{1, 0, 1}));
  EXPECT_EQ(RowOf(out, 1, 3), (std::vector<float>{0, 1, 0}));
}

TEST(BitmapFiltering, FirstElementOfAnOutputPixelIsWritten) {
  Image<unsigned char> in({3, 1}, {}, 15);
  Image<short> out({3, 1, 3}, {1, 1}, 77);
  const BitmapFiltering filter(10, 20);
  filter.Process(&in, nullptr, &out);
  EXPECT_EQ(RowOf(out, 0, 9), (std::vector<short>{1, 77, 77, 1, 77, 77, 1, 77, 77}));
  Image<short> complex({3, 1}, {}, 77, true);
  BitmapFiltering(10, 20).Process(&in, nullptr, &complex);
  EXPECT_EQ(RowOf(complex, 0, 6), (std::vector<short>{1, 77, 1, 77, 1, 77}));
}

TEST(BitmapFiltering, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<unsigned char> in({3, 2}, {1, 1}, 15);
  Image<unsigned char> out({3, 2}, {}, 77);
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  BitmapFiltering(10, 20).Process(&in, &mask, &out);
  EXPECT_EQ(RowOf(out, 0, 3), (std::vector<unsigned char>{1, 1, 1}));
  EXPECT_EQ(RowOf(out, 1, 3), (std::vector<unsigned char>{1, 0, 1}));
}

TEST(BitmapFiltering, MarginIsNeitherReadNorWritten) {
  Image<float> in({5, 2}, {2, 1}, kNaN);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 5; ++x) in.At(x, y) = 15.0f;
  }
  Image<float> out({5, 2}, {1, 3}, 77.0f);
  BitmapFiltering(10, 20).Process(&in, nullptr, &out);
  for (int y = -3; y < 5; ++y) {
    for (int x = -1; x < 6; ++x) {
      const bool isInside = x >= 0 && x < 5 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y), isInside ? 1.0f : 77.0f) << x << ", " << y;
    }
  }
}

TEST(BitmapFiltering, HeightOrWidthOfZeroWritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0}, tests::Size{0, 4}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out(size, {1, 1});
    FillBytes(out);
    Mask mask(size.width, size.height, {1, 1}, false);
    BitmapFiltering(0, 9).Process(&in, nullptr, &out);
    BitmapFiltering(0, 9).Process(&in, &mask, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(BitmapFiltering, OutputMayBeTheInput) {
  Image<short> image({300, 3}, {1, 1});
  image.Set([](int x, int y, std::uint32_t) { return x + y; });
  BitmapFiltering(100, 200).Process(&image, nullptr, &image);
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 300; ++x) EXPECT_EQ(image.At(x, y), x + y >= 100 && x + y <= 200) << x << ", " << y;
  }
}

TEST(BitmapFiltering, SettersStoreTheThresholds) {
  BitmapFiltering filter;
  filter.SetThresholdMin(-3.5f);
  filter.SetThresholdMax(kNaN);
  EXPECT_EQ(filter.thresholdMin, -3.5f);
  EXPECT_TRUE(std::isnan(filter.thresholdMax));
  EXPECT_EQ(BitmapFiltering(7).thresholdMin, 7.0f);
  EXPECT_EQ(BitmapFiltering(7).thresholdMax, 0.0f);
}

TEST(BitmapFiltering, ReservedBytesAreCopied) {
  BitmapFiltering filter(1, 2), assigned;
  std::fill(std::begin(filter.reserved), std::end(filter.reserved), std::byte{0x5C});
  const BitmapFiltering copy(filter);
  assigned = filter;
  for (std::size_t i = 0; i < sizeof(filter.reserved); ++i) {
    EXPECT_EQ(copy.reserved[i], std::byte{0x5C});
    EXPECT_EQ(assigned.reserved[i], std::byte{0x5C});
  }
  EXPECT_EQ(Selected(copy, 2.0f), 1);
  EXPECT_EQ(Selected(assigned, 3.0f), 0);
}

// ---- failures

TEST(BitmapFilteringFailure, TypesOutsideTheListAreInvalid) {
  const BitmapFiltering filter(0, 9);
  Image<short> good({3, 2}, {1, 1}, 7);
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    FillBytes(good);
    EXPECT_TRUE(
        Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&odd, nullptr, &good); }));
    EXPECT_TRUE(
        Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&good, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(good));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

// ---- differential

float DrawThreshold(tests::Random& random) {
  constexpr float kValues[] = {0.0f,   -0.0f,     1.0f,         2.0f,       3.0f,     10.0f,     30.0f,
                               40.0f,  -1.0f,     -128.0f,      127.0f,     255.0f,   -32768.0f, 65535.0f,
                               2.5f,   16777216., 2147483648.f, 0x1p63f,    -0x1p63f, 0x1p64f,   1e-40f,
                               -1e20f, 3.4e38f,   kInfinity,    -kInfinity, kNaN};
  return random.Pick(kValues);
}

BitmapFiltering DrawFilter(tests::Random& random) {
  const float min = DrawThreshold(random);
  return {min, random.OneIn(4) ? min : DrawThreshold(random)};
}

/// The cases of one input type: complex ones on both sides, and rows longer than any block.
std::vector<tests::Case> CasesOf(const PixelType& in) {
  std::vector<tests::Case> cases = tests::CasesFrom(in, {.leastChannels = 1});
  for (tests::Case& c : cases) {
    tests::Random random(c.seed + 1);
    if (c.size.width == 601) c.size.width = 2040 + random.Below(200);
    c.out.isComplex = random.OneIn(6);
  }
  return cases;
}

struct BitmapFilteringDifferential : ::testing::TestWithParam<PixelType> {
  /// Compares the operator with its twin. An output of the type `writtenAs` comes first where the case's own
  /// type is another.
  static ::testing::AssertionResult Compare(const tests::Case& c, const DataType& writtenAs) {
    tests::Random random(~c.seed);
    const BitmapFiltering filter = DrawFilter(random);
    if (writtenAs != c.out) {
      Raster in({0, 0, 1, c.in}, {}), out({0, 0, 1, writtenAs}, {});
      filter.Process(&in, nullptr, &out);
    }
    const double near[] = {filter.thresholdMin, filter.thresholdMax,
                           std::nextafter(filter.thresholdMin, kInfinity),
                           std::nextafter(filter.thresholdMax, -kInfinity), 15.0};
    return Agree(
               c, near, [&](Raster* in, Mask* mask, Raster* out) { filter.Process(in, mask, out); },
               [&](const Raster& in, const Mask* mask, Raster& out) {
                 reference::BitmapFiltering(filter, writtenAs, in, mask, out);
               })
           << ", thresholds " << filter.thresholdMin << ", " << filter.thresholdMax << ", written as "
           << tests::NameOf(writtenAs);
  }
};

TEST_P(BitmapFilteringDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : CasesOf(GetParam())) ASSERT_TRUE(Compare(c, c.out));
}

TEST_P(BitmapFilteringDifferential, AgreesWithTheTwinBitForBitWhereAnEarlierOutputHadAnotherType) {
  for (tests::Case c : CasesOf(GetParam())) {
    c.outMargins = {8, 4};  // room for elements wider than the output's own
    tests::Random random(c.seed + 2);
    ASSERT_TRUE(Compare(c, random.Pick(tests::kPixelTypes).element));
  }
}

INSTANTIATE_TEST_SUITE_P(From, BitmapFilteringDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

TEST(BitmapFilteringOfManyPixels, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  const BitmapFiltering filter(30, 50);
  Raster in({2100, 2050, 1, tessel::eDT_8U}, {});
  FillRandom(in, tests::Fill::eSMOOTH, random);
  const auto mask = RandomMask(in, tests::MaskKind::eFEW_CLEAR, tests::MaskGeometry::eSAME, random);
  Raster expected({2100, 2050, 1, tessel::eDT_64F}, {3, 1}), actual(expected, expected);
  FillBytes(expected);
  FillBytes(actual);
  reference::BitmapFiltering(filter, expected.dataType, in, mask.get(), expected);
  filter.Process(&in, mask.get(), &actual);
  EXPECT_TRUE(SameBits(expected, actual));
}

// ---- contract

// Deliberate: only a change of the input's type rebuilds. A later output of another type is written as the
// type of the first one.
TEST(BitmapFilteringContract, LaterOutputOfAnotherTypeIsWrittenAsTheTypeOfTheFirstOne) {
  const BitmapFiltering filter(10, 20);
  Image<float> in({3, 1});
  in.SetPixel(0, 0, {15});
  in.SetPixel(1, 0, {25});
  in.SetPixel(2, 0, {15});
  Image<unsigned char> narrow({3, 1});
  filter.Process(&in, nullptr, &narrow);
  Image<short> wide({3, 1}, {}, 0x5A5A);
  filter.Process(&in, nullptr, &wide);
  EXPECT_EQ(RowOf(wide, 0, 3), (std::vector<short>{0x5A01, 0x5A00, 0x5A01}));
  Image<double> twice({3, 1, 2});
  FillBytes(twice, 0x5A);
  filter.Process(&in, nullptr, &twice);
  for (std::size_t byte = 0; byte < twice.dataSize; ++byte) {
    const int expected = byte % 16 != 0 ? 0x5A : byte == 16 ? 0 : 1;
    EXPECT_EQ(twice.data[byte], expected) << byte;
  }
}

TEST(BitmapFilteringContract, WiderElementsOfTheFirstOutputOverlapInALaterOne) {
  const BitmapFiltering filter(10, 20);
  Image<float> in({2, 1}, {}, 15);
  Image<int> first({2, 1});
  filter.Process(&in, nullptr, &first);
  Image<unsigned char> later({2, 1}, {0, 2}, 0x5A);
  filter.Process(&in, nullptr, &later);
  EXPECT_EQ(std::vector<unsigned char>(later.Elements(), later.Elements() + 10),
            (std::vector<unsigned char>{0x5A, 0x5A, 0x5A, 0x5A, 1, 1, 0, 0, 0, 0x5A}));
}

TEST(BitmapFilteringContract, LaterOutputIsAddressedByItsOwnFields) {
  const BitmapFiltering filter(10, 20);
  Image<float> in({3, 1}, {}, 15);
  Image<unsigned char> first({3, 1});
  filter.Process(&in, nullptr, &first);
  Image<unsigned char> complex({3, 1}, {1, 0}, 0x5A, true);
  filter.Process(&in, nullptr, &complex);
  EXPECT_EQ(std::vector<unsigned char>(complex.Elements(), complex.Elements() + 10),
            (std::vector<unsigned char>{0x5A, 0x5A, 1, 0x5A, 1, 0x5A, 1, 0x5A, 0x5A, 0x5A}));
  Raster bits({3, 1, 8, tessel::eDT_BIT}, {1, 0});  // a byte for each pixel
  FillBytes(bits, 0x5A);
  filter.Process(&in, nullptr, &bits);
  EXPECT_EQ(std::vector<unsigned char>(bits.data, bits.data + 5),
            (std::vector<unsigned char>{0x5A, 1, 1, 1, 0x5A}));
}

TEST(BitmapFilteringContract, ChangeOfTheInputsTypeTakesTheOutputsTypeOfThatMoment) {
  const BitmapFiltering filter(10, 20);
  EXPECT_EQ((Selected<unsigned char, float>(filter, 15)), 1);
  EXPECT_EQ((Selected<double, short>(filter, 15)), 1.0);
  Image<float> in({1, 1}, {}, 15);
  Image<short> out({1, 1}, {}, 0x5A5A);
  filter.Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 1);
}

TEST(BitmapFilteringContract, ComplexVariantOfATypeIsAnotherType) {
  BitmapFiltering filter(10, 20);
  EXPECT_EQ(Selected(filter, 15.0f), 1);
  filter.SetThresholdMin(16);
  EXPECT_EQ(Selected(filter, 15.0f), 1);
  Image<float> complex({1, 1}, {}, 15, true);
  Image<int> out({1, 1}, {}, 77);
  filter.Process(&complex, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 0);
  EXPECT_EQ(Selected(filter, 15.0f), 0);
}

static_assert(std::is_base_of_v<details::BitFParams, BitmapFiltering>);
static_assert(!std::is_polymorphic_v<BitmapFiltering>);

}  // namespace
}  // namespace orvik::filters
