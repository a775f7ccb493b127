#include "processes/gridmill/singlechange.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/attack/guardedpages.h"
#include "tests/reference/singlechange_reference.h"
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
constexpr std::int64_t kMax64 = std::numeric_limits<std::int64_t>::max();

/// The result for one sample of either date.
template <class In, class Out>
Out Change(int type, In image, In reference) {
  return ChangeSample<In, Out>(SingleChange(static_cast<DiffType>(type)), image, reference);
}

// ---- golden

TEST(SingleChange, FormsOf10And250In8BitsAre240ForwardAnd0BackwardAnd240Absolute) {
  EXPECT_EQ((Change<unsigned char, unsigned char>(eDIFF_FORWARD, 10, 250)), 240);
  EXPECT_EQ((Change<unsigned char, unsigned char>(eDIFF_BACKWARD, 10, 250)), 0);
  EXPECT_EQ((Change<unsigned char, unsigned char>(eDIFF_ABSOLUTE, 10, 250)), 240);
}

TEST(SingleChange, SignedOutputKeepsANegativeDifference) {
  EXPECT_EQ((Change<unsigned char, short>(eDIFF_BACKWARD, 10, 250)), -240);
}

// Deliberate: `eDIFF_FORWARD` is reference minus image, the reverse of `ChanDiffChange`.
TEST(SingleChange, ForwardIsReferenceMinusImage) {
  EXPECT_EQ((Change<short, short>(eDIFF_FORWARD, 3, 10)), 7);
  EXPECT_EQ((Change<short, short>(eDIFF_BACKWARD, 3, 10)), -7);
  EXPECT_EQ((Change<short, short>(eDIFF_ABSOLUTE, 3, 10)), 7);
  EXPECT_EQ((Change<short, short>(eDIFF_ABSOLUTE, 10, 3)), 7);
}

TEST(SingleChange, EveryOtherTypeActsAsBackward) {
  for (const int type : {7, 3, -1, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()})
    EXPECT_EQ((Change<short, short>(type, 3, 10)), -7) << type;
}

// Deliberate: `double` and 64-bit samples are narrowed to `float` before the subtraction.
TEST(SingleChange, DoubleAnd64BitSamplesAreNarrowedToFloatBeforeTheSubtraction) {
  EXPECT_EQ((Change<double, double>(eDIFF_FORWARD, 1.0, 1.0 + 1e-12)), 0.0);
  EXPECT_EQ((Change<double, double>(eDIFF_FORWARD, 0.0, 0.1)), static_cast<double>(0.1f));
  EXPECT_EQ((Change<int, int>(eDIFF_FORWARD, 16777216, 16777217)), 0);
  EXPECT_EQ((Change<unsigned int, double>(eDIFF_FORWARD, 0u, 4294967295u)), 4294967296.0);
  EXPECT_EQ((Change<std::int64_t, std::int64_t>(eDIFF_FORWARD, 0, (std::int64_t{1} << 62) + 1)),
            std::int64_t{1} << 62);
  EXPECT_EQ((Change<std::uint64_t, double>(eDIFF_FORWARD, 0, std::numeric_limits<std::uint64_t>::max())),
            0x1p64);
  EXPECT_EQ((Change<double, double>(eDIFF_FORWARD, 0.0, 1e300)), static_cast<double>(kInfinity));
}

TEST(SingleChange, UnsignedOutputLosesNegativeDifferencesTo0) {
  EXPECT_EQ((Change<short, unsigned char>(eDIFF_FORWARD, 5, -5)), 0);
  EXPECT_EQ((Change<short, unsigned short>(eDIFF_FORWARD, 5, -5)), 0);
  EXPECT_EQ((Change<short, unsigned int>(eDIFF_FORWARD, 5, -5)), 0u);
  EXPECT_EQ((Change<short, std::uint64_t>(eDIFF_FORWARD, 5, -5)), 0u);
}

TEST(SingleChange, SignedNarrowOutputIsRoundedHalfAwayFromZeroAndSaturated) {
  EXPECT_EQ((Change<float, char>(eDIFF_FORWARD, 0.0f, 2.5f)), 3);
  EXPECT_EQ((Change<float, char>(eDIFF_FORWARD, 2.5f, 0.0f)), -3);
  EXPECT_EQ((Change<float, char>(eDIFF_FORWARD, 0.0f, 300.0f)), 127);
  EXPECT_EQ((Change<float, char>(eDIFF_FORWARD, 300.0f, 0.0f)), -128);
  EXPECT_EQ((Change<float, short>(eDIFF_FORWARD, 40000.0f, 0.0f)), -32768);
  EXPECT_EQ((Change<float, int>(eDIFF_FORWARD, 0.0f, 3e9f)), 2147483647);
}

TEST(SingleChange, Output64BitGetsTheTruncatedValueWithNegativeDifferencesAt0) {
  EXPECT_EQ((Change<float, std::int64_t>(eDIFF_FORWARD, 0.0f, 5.9f)), 5);
  EXPECT_EQ((Change<float, std::int64_t>(eDIFF_FORWARD, 5.9f, 0.0f)), 0);
  EXPECT_EQ((Change<float, std::uint64_t>(eDIFF_FORWARD, 0.0f, 5.9f)), 5u);
  EXPECT_EQ((Change<float, std::int64_t>(eDIFF_FORWARD, 0.0f, 1e20f)), kMax64);
}

TEST(SingleChange, NaNIsKeptByAFloatingOutputAndIndefiniteInAnIntegerOne) {
  EXPECT_TRUE(std::isnan((Change<float, float>(eDIFF_ABSOLUTE, kNaN, 1.0f))));
  EXPECT_TRUE(std::isnan((Change<float, double>(eDIFF_FORWARD, kInfinity, kInfinity))));
  EXPECT_EQ((Change<float, unsigned char>(eDIFF_FORWARD, kNaN, 1.0f)), 0);
  EXPECT_EQ((Change<float, int>(eDIFF_FORWARD, kNaN, 1.0f)), std::numeric_limits<int>::min());
}

// Deliberate: an excluded pixel holds 0, which is a valid difference too.
TEST(SingleChange, ExcludedPixelHolds0WhichIsAValidDifferenceToo) {
  const SingleChange op(eDIFF_FORWARD);
  EXPECT_EQ((ChangeSample<short, short>(op, 5, 9, false)), 0);
  EXPECT_EQ((ChangeSample<short, float>(op, 5, 9, false)), 0.0f);
  EXPECT_FALSE(std::signbit(ChangeSample<short, double>(op, 5, 9, false)));
  EXPECT_EQ((ChangeSample<short, short>(op, 9, 9, true)), 0);
}

TEST(SingleChange, NullMaskExcludesNothing) {
  Image<short> image({9, 2}, {}, 4), reference({9, 2}, {}, 6), out({9, 2});
  SingleChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  for (int i = 0; i < 18; ++i) EXPECT_EQ(out.Elements()[i], 2) << i;
}

TEST(SingleChange, ImageOf3ChannelsGivesItsFirstBandAndLeavesTheOtherSamplesUntouched) {
  const SingleChange op(eDIFF_FORWARD);
  EXPECT_EQ((ChangePixel<short, short, short>(op, {1, 2, 3}, {11, 22, 33}, 3)),
            (std::vector<short>{10, tests::kUnwritten, tests::kUnwritten}));
  EXPECT_EQ((ChangePixel<short, short, short>(op, {1, 2, 3}, {11, 22, 33}, 3, false)),
            (std::vector<short>{0, tests::kUnwritten, tests::kUnwritten}));
}

TEST(SingleChange, ChannelsEnterThroughTheAddressingOfEachRasterOnly) {
  Image<short> image({3, 2, 2}, {1, 0}), reference({3, 2, 3}, {0, 1}), out({3, 2, 4}, {2, 2}, 77);
  image.Set([](int x, int y, std::uint32_t c) { return c == 0 ? 10 * y + x : 99; });
  reference.Set([](int x, int y, std::uint32_t c) { return c == 0 ? 100 + 20 * y + 2 * x : 99; });
  SingleChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  for (int y = -2; y < 4; ++y) {
    for (int x = -2; x < 5; ++x) {
      const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y), isInside ? 100 + 10 * y + x : 77) << x << ", " << y;
      EXPECT_EQ(out.At(x, y, 1), 77) << x << ", " << y;
    }
  }
}

TEST(SingleChange, ReferenceOfAnotherTypeIsReadAsTheTypeOfTheImage) {
  Image<short> image({2, 1}, {}, 1), out({2, 1});
  Image<int> wide({2, 1});
  wide.SetPixel(0, 0, {0x00050003, 0x00070009});
  const SingleChange op(eDIFF_FORWARD);
  op.Process(&image, &wide, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 2);
  EXPECT_EQ(out.At(1, 0), 8);
  Image<unsigned char> narrow({2, 1}, {0, 1});
  narrow.SetPixel(0, 0, {3, 1});
  narrow.SetPixel(0, 1, {2, 0});
  op.Process(&image, &narrow, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 3 + 256 - 1);
  EXPECT_EQ(out.At(1, 0), 1 + 2 * 256 - 1);
}

TEST(SingleChange, ReferenceOfAnotherTypeIsNotReadBehindItsLastSample) {
  const attack::GuardedPages pages(1);
  const float samples[] = {10.0f, 20.0f, 30.0f};
  Raster bits({3, 1, 1, tessel::eDT_32S}, {}, pages.Place(sizeof(samples), true));
  std::memcpy(bits.data, samples, sizeof(samples));
  Image<float> image({3, 1}, {}, 1.0f), out({3, 1});
  SingleChange(eDIFF_FORWARD).Process(&image, &bits, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 9.0f);
  EXPECT_EQ(out.At(1, 0), 19.0f);
  EXPECT_EQ(out.At(2, 0), 29.0f);
}

TEST(SingleChange, ComplexRastersAreReadAndWrittenByTheirFirstElement) {
  Image<float> image({2, 1, 1}, {}, 0.0f, true), reference({2, 1, 1}, {}, 0.0f, true);
  Image<float> out({2, 1, 1}, {}, 77.0f, true);
  image.SetPixel(0, 0, {1.0f, 50.0f, 2.0f, 60.0f});
  reference.SetPixel(0, 0, {10.0f, 70.0f, 20.0f, 80.0f});
  SingleChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 0), 9.0f);
  EXPECT_EQ(out.At(0, 0, 1), 77.0f);
  EXPECT_EQ(out.At(1, 0, 0), 18.0f);
  EXPECT_EQ(out.At(1, 0, 1), 77.0f);
}

TEST(SingleChange, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<short> image({3, 2}, {1, 1}, 5), reference({3, 2}, {}, 9), out({3, 2}, {}, 77);
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  SingleChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, y), x == 1 && y == 1 ? 0 : 4) << x << ", " << y;
  }
}

TEST(SingleChange, WidthOrHeightOf0WritesNothing) {
  Image<short> out({4, 3}, {1, 1});
  FillBytes(out);
  Image<short> noRows({4, 0}, {1, 1}, 5), noColumns({0, 3}, {1, 1}, 5), reference({4, 3}, {1, 1}, 9);
  const SingleChange op(eDIFF_FORWARD);
  op.Process(&noRows, &reference, nullptr, &out);
  op.Process(&noColumns, &reference, nullptr, &out);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(SingleChange, OutputMayTakeThePlaceOfEitherDate) {
  Image<float> image({3, 1, 2}, {}, 1.0f), reference({3, 1, 2}, {}, 3.0f);
  const SingleChange op(eDIFF_FORWARD);
  op.Process(&image, &reference, nullptr, &image);
  EXPECT_EQ(image.At(2, 0), 2.0f);
  EXPECT_EQ(image.At(2, 0, 1), 1.0f);
  op.Process(&image, &reference, nullptr, &reference);
  EXPECT_EQ(reference.At(2, 0), 1.0f);
  EXPECT_EQ(reference.At(2, 0, 1), 3.0f);
}

// ---- failures

TEST(SingleChangeFailure, ImageOrOutputOfNoPixelTypeIsAnInvalidType) {
  const SingleChange op(eDIFF_FORWARD);
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

TEST(SingleChangeFailure, ReferenceOfNoPixelTypeIsNoFailure) {
  Image<unsigned char> image({2, 1}, {}, 1), out({2, 1});
  Raster bits({8, 2, 1, DataType(tessel::eDT_BIT)}, {0, 0});
  FillBytes(bits, 5);
  SingleChange(eDIFF_FORWARD).Process(&image, &bits, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 4);
  EXPECT_EQ(out.At(1, 0), 4);
}

// ---- differential

struct SingleChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(SingleChangeDifferential, AgreesWithTheTwinBitForBit) {
  tests::ChangeLimits limits;
  limits.leastRead = 1;
  limits.read = limits.written = [](std::uint32_t, std::uint32_t) { return std::uint32_t{1}; };
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), limits)) {
    const int type = c.parameters.type;
    const SingleChange op(static_cast<DiffType>(type));
    ASSERT_TRUE(Agree(
        c,
        [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
          op.Process(image, reference, mask, out);
        },
        [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
          reference::SingleChange(type, image, reference, mask, out);
        }));
  }
}

INSTANTIATE_TEST_SUITE_P(From, SingleChangeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
