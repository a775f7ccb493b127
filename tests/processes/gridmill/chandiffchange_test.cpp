#include "processes/gridmill/chandiffchange.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/chandiffchange_reference.h"
#include "tests/support/changecases.h"
#include "tests/support/changepixel.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::changedetection {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::ChangePixel;
using tests::ChangeSample;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::Throws;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The result for one sample of either date.
template <class In, class Out>
Out Change(int type, In image, In reference) {
  return ChangeSample<In, Out>(ChanDiffChange(static_cast<DiffType>(type)), image, reference);
}

/// An operator that writes `noData`, with vectors for the test.
ChanDiffChange Testing(float noData, std::vector<float> imgNoData, std::vector<float> refNoData) {
  ChanDiffChange op(eDIFF_FORWARD);
  op.SetNoData(noData);
  op.SetImgNoData(std::move(imgNoData));
  op.SetRefNoData(std::move(refNoData));
  return op;
}

// ---- golden

TEST(ChanDiffChange, FormsOf10And250In8BitsAre16ForwardAnd240BackwardAnd240Absolute) {
  EXPECT_EQ((Change<unsigned char, unsigned char>(eDIFF_FORWARD, 10, 250)), 16);
  EXPECT_EQ((Change<unsigned char, unsigned char>(eDIFF_BACKWARD, 10, 250)), 240);
  EXPECT_EQ((Change<unsigned char, unsigned char>(eDIFF_ABSOLUTE, 10, 250)), 240);
}

TEST(ChanDiffChange, WiderSignedOutputKeepsTheNegativeDifference) {
  EXPECT_EQ((Change<unsigned char, short>(eDIFF_FORWARD, 10, 250)), -240);
}

TEST(ChanDiffChange, EveryOtherTypeActsAsBackward) {
  for (const int type : {7, 3, -1, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()}) {
    EXPECT_EQ((Change<short, short>(type, 3, 10)), 7) << type;
    EXPECT_EQ((Change<float, float>(type, 3.0f, 10.0f)), 7.0f) << type;
  }
}

// Deliberate: integer differences wrap and never saturate; an absolute difference in a signed output can be
// negative.
TEST(ChanDiffChange, IntegerDifferencesWrapAndNeverSaturate) {
  EXPECT_EQ((Change<char, char>(eDIFF_ABSOLUTE, 100, -100)), -56);
  EXPECT_EQ((Change<char, char>(eDIFF_FORWARD, 100, -100)), -56);
  EXPECT_EQ((Change<char, char>(eDIFF_BACKWARD, 100, -100)), 56);
  EXPECT_EQ((Change<short, short>(eDIFF_ABSOLUTE, -32768, 32767)), -1);
  EXPECT_EQ((Change<unsigned short, unsigned short>(eDIFF_FORWARD, 0, 1)), 65535);
  EXPECT_EQ((Change<int, int>(eDIFF_FORWARD, std::numeric_limits<int>::min(), 1)), 2147483647);
  EXPECT_EQ((Change<int, int>(eDIFF_ABSOLUTE, std::numeric_limits<int>::min(), 2147483647)), -1);
  EXPECT_EQ((Change<unsigned int, unsigned int>(eDIFF_BACKWARD, 1u, 0u)), 4294967295u);
  EXPECT_EQ((Change<std::int64_t, std::int64_t>(eDIFF_FORWARD, std::numeric_limits<std::int64_t>::min(), 1)),
            std::numeric_limits<std::int64_t>::max());
  EXPECT_EQ((Change<std::uint64_t, std::uint64_t>(eDIFF_FORWARD, 0, 1)),
            std::numeric_limits<std::uint64_t>::max());
}

TEST(ChanDiffChange, DirectionOfTheAbsoluteDifferenceIsComparedInTheOutputsType) {
  EXPECT_EQ((Change<short, unsigned char>(eDIFF_ABSOLUTE, -1, 1)), 254);
  EXPECT_EQ((Change<unsigned char, char>(eDIFF_ABSOLUTE, 200, 100)), -100);
  EXPECT_EQ((Change<int, unsigned int>(eDIFF_ABSOLUTE, -1, 1)), 4294967294u);
}

// Deliberate: floating samples are truncated one by one before an integer subtraction, wider integers lose
// their high bits.
TEST(ChanDiffChange, FloatingSamplesAreTruncatedOneByOneAndWiderIntegersLoseTheirHighBits) {
  EXPECT_EQ((Change<float, unsigned char>(eDIFF_ABSOLUTE, 300.7f, 2.9f)), 42);
  EXPECT_EQ((Change<float, short>(eDIFF_FORWARD, 2.9f, 1.1f)), 1);
  EXPECT_EQ((Change<float, short>(eDIFF_FORWARD, -2.9f, 0.0f)), -2);
  EXPECT_EQ((Change<double, int>(eDIFF_FORWARD, 5.9, -5.9)), 10);
  EXPECT_EQ((Change<int, short>(eDIFF_FORWARD, 0x18000, 0)), -32768);
  EXPECT_EQ((Change<std::int64_t, unsigned int>(eDIFF_FORWARD, (std::int64_t{1} << 32) + 7, 2)), 5u);
}

TEST(ChanDiffChange, SampleThatTheOutputCannotHoldIsTheIndefiniteValueCutToTheWidth) {
  EXPECT_EQ((Change<float, short>(eDIFF_FORWARD, kNaN, 5.0f)), -5);
  EXPECT_EQ((Change<float, int>(eDIFF_FORWARD, 3e9f, 0.0f)), std::numeric_limits<int>::min());
  EXPECT_EQ((Change<float, unsigned int>(eDIFF_FORWARD, -1.0f, 0.0f)), 4294967295u);
  EXPECT_EQ((Change<double, std::uint64_t>(eDIFF_FORWARD, kNaN, 0.0)), std::uint64_t{1} << 63);
  EXPECT_EQ((Change<double, std::int64_t>(eDIFF_FORWARD, -5.5, 0.0)), -5);
}

TEST(ChanDiffChange, FloatingOutputComputesInItsOwnTypeAfterNarrowingEachSample) {
  EXPECT_EQ((Change<double, double>(eDIFF_BACKWARD, 1.0, 1.0 + 1e-12)), (1.0 + 1e-12) - 1.0);
  EXPECT_EQ((Change<double, float>(eDIFF_BACKWARD, 1.0, 1.0 + 1e-12)), 0.0f);
  EXPECT_EQ((Change<int, float>(eDIFF_FORWARD, 16777217, 16777216)), 0.0f);
  EXPECT_EQ((Change<int, double>(eDIFF_FORWARD, 16777217, 16777216)), 1.0);
  EXPECT_EQ((Change<std::uint64_t, float>(eDIFF_FORWARD, std::numeric_limits<std::uint64_t>::max(), 0)),
            0x1p64f);
}

TEST(ChanDiffChange, BackwardFormOfEqualFloatingSamplesIsPositiveZero) {
  EXPECT_FALSE(std::signbit(Change<float, float>(eDIFF_BACKWARD, 3.5f, 3.5f)));
  EXPECT_FALSE(std::signbit(Change<double, double>(eDIFF_BACKWARD, 3.5, 3.5)));
  EXPECT_FALSE(std::signbit(Change<double, double>(eDIFF_BACKWARD, -0.0, 0.0)));
  EXPECT_FALSE(std::signbit(Change<double, double>(eDIFF_BACKWARD, 0.0, -0.0)));
}

TEST(ChanDiffChange, AbsoluteDifferenceOfTheTwoZerosIsImageMinusReference) {
  EXPECT_TRUE(std::signbit(Change<float, float>(eDIFF_ABSOLUTE, -0.0f, 0.0f)));
  EXPECT_FALSE(std::signbit(Change<float, float>(eDIFF_ABSOLUTE, 0.0f, -0.0f)));
}

TEST(ChanDiffChange, NoDataTestIsPerSample) {
  const ChanDiffChange op = Testing(-9.0f, {0, 5, 0}, {0, 0, 8});
  EXPECT_EQ((ChangePixel<short, short, short>(op, {10, 5, 30}, {1, 1, 1}, 3)),
            (std::vector<short>{9, -9, 29}));
  EXPECT_EQ((ChangePixel<short, short, short>(op, {10, 6, 30}, {1, 1, 8}, 3)),
            (std::vector<short>{9, 5, -9}));
  EXPECT_EQ((ChangePixel<short, short, short>(op, {5, 6, 8}, {1, 5, 1}, 3)), (std::vector<short>{4, 1, 7}));
}

TEST(ChanDiffChange, NoDataIsWrittenThroughClipTo) {
  const std::vector<unsigned char> image = {5};
  EXPECT_EQ(
      (ChangePixel<unsigned char, unsigned char, unsigned char>(Testing(-1.0f, {5}, {0}), image, {1}, 1)),
      (std::vector<unsigned char>{0}));
  EXPECT_EQ(
      (ChangePixel<unsigned char, unsigned char, unsigned char>(Testing(300.0f, {5}, {0}), image, {1}, 1)),
      (std::vector<unsigned char>{255}));
  EXPECT_EQ((ChangePixel<unsigned char, unsigned char, char>(Testing(2.5f, {5}, {0}), image, {1}, 1)),
            (std::vector<char>{3}));
  EXPECT_EQ((ChangePixel<unsigned char, unsigned char, double>(Testing(0.1f, {5}, {0}), image, {1}, 1)),
            (std::vector<double>{static_cast<double>(0.1f)}));
  EXPECT_EQ(
      (ChangePixel<unsigned char, unsigned char, std::int64_t>(Testing(-3.0f, {5}, {0}), image, {1}, 1)),
      (std::vector<std::int64_t>{0}));
}

TEST(ChanDiffChange, NoDataIs0ByDefault) {
  EXPECT_EQ((ChangeSample<short, short>(ChanDiffChange(eDIFF_FORWARD), 9, 2, false)), 0);
  EXPECT_EQ((ChangeSample<short, float>(ChanDiffChange(eDIFF_FORWARD), 9, 2, false)), 0.0f);
}

TEST(ChanDiffChange, MaskedPixelHoldsNoDataInEachChannelOfTheImage) {
  const ChanDiffChange op = Testing(-9.0f, {}, {});
  EXPECT_EQ((ChangePixel<short, short, short>(op, {1, 2}, {5, 6, 7}, 3, false)),
            (std::vector<short>{-9, -9, tests::kUnwritten}));
}

TEST(ChanDiffChange, ImgNoDataOfAnotherLengthSwitchesTheTestOffForBothRasters) {
  const std::vector<short> image = {5, 5, 5}, reference = {1, 8, 8};
  const std::vector<short> differences = {4, -3, -3};
  for (const std::size_t length : {0u, 1u, 2u, 4u}) {
    const ChanDiffChange op = Testing(-9.0f, std::vector<float>(length, 5.0f), {8, 8, 8, 8});
    EXPECT_EQ((ChangePixel<short, short, short>(op, image, reference, 3)), differences) << length;
  }
  EXPECT_EQ((ChangePixel<short, short, short>(Testing(-9.0f, {0, 0, 0}, {8, 8, 8, 8}), image, reference, 3)),
            (std::vector<short>{4, -9, -9}));
}

TEST(ChanDiffChange, NoDataComparisonIsInFloatWithoutATolerance) {
  EXPECT_EQ((ChangeSample<double, double>(Testing(-9.0f, {0.1f}, {7}), 0.1, 0.0)), -9.0);
  EXPECT_EQ((ChangeSample<int, int>(Testing(-9.0f, {16777216.0f}, {7}), 16777217, 0)), -9);
  EXPECT_EQ((ChangeSample<int, int>(Testing(-9.0f, {16777216.0f}, {7}), 16777218, 0)), 16777218);
  EXPECT_EQ(
      (ChangeSample<std::int64_t, int>(Testing(-9.0f, {0x1p62f}, {7}), (std::int64_t{1} << 62) + 99, 0)), -9);
  EXPECT_EQ((ChangeSample<std::uint64_t, int>(Testing(-9.0f, {7}, {0x1p64f}), 0,
                                              std::numeric_limits<std::uint64_t>::max())),
            -9);
  const float next = std::nextafter(5.0f, 6.0f);
  EXPECT_EQ((ChangeSample<float, float>(Testing(-9.0f, {5.0f}, {7}), next, 0.0f)), next);
}

TEST(ChanDiffChange, NaNMatchesNothingAndInfinitiesAndZerosMatchTheirEquals) {
  EXPECT_TRUE(std::isnan(ChangeSample<float, float>(Testing(-9.0f, {kNaN}, {kNaN}), kNaN, 1.0f)));
  EXPECT_EQ((ChangeSample<float, float>(Testing(-9.0f, {kInfinity}, {7}), kInfinity, 1.0f)), -9.0f);
  EXPECT_EQ((ChangeSample<float, float>(Testing(-9.0f, {kInfinity}, {7}), -kInfinity, 1.0f)), -kInfinity);
  EXPECT_EQ((ChangeSample<double, float>(Testing(-9.0f, {kInfinity}, {7}), 1e300, 1.0)), -9.0f);
  EXPECT_EQ((ChangeSample<float, float>(Testing(-9.0f, {-0.0f}, {7}), 0.0f, 1.0f)), -9.0f);
}

TEST(ChanDiffChange, NoDataValueThatTheTypeCannotHoldMatchesNothing) {
  for (int s = 0; s < 256; ++s) {
    const auto sample = static_cast<unsigned char>(s);
    EXPECT_EQ((ChangeSample<unsigned char, short>(Testing(-9.0f, {300}, {-1}), sample, sample)), 0) << s;
  }
  EXPECT_EQ((ChangeSample<char, short>(Testing(-9.0f, {2.5f}, {200}), 2, -56)), 58);
}

TEST(ChanDiffChange, ReferenceOf5ChannelsUnderAnImageOf3ContributesItsFirst3) {
  Image<unsigned char> image({2, 1, 3}), reference({2, 1, 5}), out({2, 1, 4}, {}, 77);
  image.Set([](int x, int, std::uint32_t c) { return 100 + 10 * x + static_cast<int>(c); });
  reference.Set([](int x, int, std::uint32_t c) { return x + 2 * static_cast<int>(c); });
  ChanDiffChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), (std::vector<unsigned char>{100, 99, 98, 77, 109, 108, 107, 77}));
}

TEST(ChanDiffChange, SamplesOfAnOutputWithTooFewChannelsOverlapAndTheLaterOnesWin) {
  Image<unsigned char> image({3, 1, 2}), reference({3, 1, 2}), out({3, 1, 1}, {0, 1}, 77);
  image.Set([](int x, int, std::uint32_t c) { return 10 * (x + 1) + static_cast<int>(c); });
  ChanDiffChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), (std::vector<unsigned char>{77, 77, 77, 10, 20, 30, 31, 77, 77}));
}

TEST(ChanDiffChange, ReferenceOfAnotherTypeIsReadAsTheTypeOfTheImage) {
  Image<unsigned char> image({2, 1, 2}, {}, 100), out({2, 1, 2});
  Image<short> reference({2, 1, 1});
  reference.SetPixel(0, 0, {0x0201, 0x0403});
  ChanDiffChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), (std::vector<unsigned char>{99, 98, 97, 96}));
}

TEST(ChanDiffChange, ComplexRastersAreReadAndWrittenByTheFirstElementsOfTheirPixels) {
  Image<float> image({1, 1, 2}, {}, 0.0f, true), reference({1, 1, 2}, {}, 0.0f, true);
  Image<float> out({1, 1, 2}, {}, 77.0f, true);
  image.SetPixel(0, 0, {10.0f, 20.0f, 30.0f, 40.0f});
  reference.SetPixel(0, 0, {1.0f, 2.0f, 3.0f, 4.0f});
  ChanDiffChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(std::vector<float>(out.Elements(), out.Elements() + 4), (std::vector<float>{9, 18, 77, 77}));
}

TEST(ChanDiffChange, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<short> image({3, 2}, {1, 1}, 9), reference({3, 2}, {}, 5), out({3, 2}, {}, 77);
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  ChanDiffChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, y), x == 1 && y == 1 ? 0 : 4) << x << ", " << y;
  }
}

TEST(ChanDiffChange, WidthOrHeightOrChannelsOf0WriteNothing) {
  Image<short> out({4, 3, 2}, {1, 1});
  FillBytes(out);
  Image<short> noRows({4, 0, 2}, {1, 1}, 5), noColumns({0, 3, 2}, {1, 1}, 5), noChannels({4, 3, 0}, {1, 1});
  Image<short> reference({4, 3, 2}, {1, 1}, 9);
  Mask mask(4, 3, {1, 1}, false);
  const ChanDiffChange op(eDIFF_FORWARD);
  op.Process(&noRows, &reference, nullptr, &out);
  op.Process(&noColumns, &reference, nullptr, &out);
  op.Process(&noChannels, &reference, nullptr, &out);
  op.Process(&noChannels, &reference, &mask, &out);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(ChanDiffChange, OutputMayTakeThePlaceOfEitherDate) {
  Image<float> image({3, 1, 2}, {}, 1.0f), reference({3, 1, 2}, {}, 3.0f);
  const ChanDiffChange op(eDIFF_FORWARD);
  op.Process(&image, &reference, nullptr, &image);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(image.Elements()[i], -2.0f) << i;
  op.Process(&image, &reference, nullptr, &reference);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(reference.Elements()[i], -5.0f) << i;
}

// ---- failures

TEST(ChanDiffChangeFailure, ImageOrOutputOfNoPixelTypeIsAnInvalidType) {
  const ChanDiffChange op(eDIFF_FORWARD);
  Image<short> image({3, 2}, {1, 1}, 5), out({3, 2}, {1, 1});
  FillBytes(out);
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(
        Throws<Exception>("Invalid type to dispatch.", [&] { op.Process(&odd, &image, nullptr, &out); }));
    EXPECT_TRUE(IsUntouched(out));
    EXPECT_TRUE(
        Throws<Exception>("Invalid type to dispatch.", [&] { op.Process(&image, &image, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

// ---- differential

struct ChanDiffChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(ChanDiffChangeDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), {})) {
    ChanDiffChange op(static_cast<DiffType>(c.parameters.type));
    SetNoDataOf(c.parameters, op);
    ASSERT_TRUE(Agree(
        c,
        [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
          op.Process(image, reference, mask, out);
        },
        [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
          reference::ChanDiffChange(c.parameters, image, reference, mask, out);
        }));
  }
}

INSTANTIATE_TEST_SUITE_P(From, ChanDiffChangeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
