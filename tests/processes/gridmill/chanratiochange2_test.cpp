#include "processes/gridmill/chanratiochange2.h"

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/chanratiochange2_reference.h"
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
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::Throws;
using uchar = unsigned char;
using ushort = unsigned short;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The result for one sample of either date.
template <class In, class Ref, class Out>
Out Change(int type, In image, Ref reference) {
  return ChangePixel<In, Ref, Out>(ChanRatioChange2(static_cast<DiffType>(type)), {image}, {reference}, 1)[0];
}

template <class In, class Ref, class Out>
Out Signed(In image, Ref reference) {
  return Change<In, Ref, Out>(eDIFF_FORWARD, image, reference);
}

template <class In, class Ref, class Out>
Out Absolute(In image, Ref reference) {
  return Change<In, Ref, Out>(eDIFF_ABSOLUTE, image, reference);
}

/// A signed ratio that writes `noData`, with vectors for the test.
ChanRatioChange2 Testing(float noData, std::vector<float> imgNoData, std::vector<float> refNoData) {
  ChanRatioChange2 op(eDIFF_FORWARD);
  op.SetNoData(noData);
  op.SetImgNoData(std::move(imgNoData));
  op.SetRefNoData(std::move(refNoData));
  return op;
}

// ---- golden

TEST(ChanRatioChange2, RatioOfMinus9And2IsRoundedHalfAwayFromZero) {
  EXPECT_EQ((Signed<short, short, short>(-9, 2)), -5);
  EXPECT_EQ((Absolute<short, short, short>(-9, 2)), 5);
}

// Deliberate: `eDIFF_FORWARD` and `eDIFF_BACKWARD` mean the same: neither swaps the two dates.
TEST(ChanRatioChange2, ForwardAndBackwardMeanTheSame) {
  EXPECT_EQ((Change<float, float, float>(eDIFF_BACKWARD, 10.0f, 4.0f)), 2.5f);
  EXPECT_EQ((Change<float, float, float>(eDIFF_FORWARD, 10.0f, 4.0f)), 2.5f);
  EXPECT_EQ((Change<short, short, short>(eDIFF_BACKWARD, -9, 2)), -5);
}

TEST(ChanRatioChange2, EveryTypeBut0IsSigned) {
  for (const int type : {1, 2, 3, 5, 7, -1, std::numeric_limits<int>::min()})
    EXPECT_EQ((Change<short, short, float>(type, -10, 4)), -2.5f) << type;
  EXPECT_EQ((Change<short, short, float>(0, -10, 4)), 2.5f);
}

TEST(ChanRatioChange2, RatioOf0And0Is0In8BitsAndNaNInFloat) {
  EXPECT_EQ((Signed<uchar, uchar, uchar>(0, 0)), 0);
  EXPECT_EQ((Signed<uchar, uchar, short>(0, 0)), 0);
  EXPECT_EQ((Signed<uchar, uchar, ushort>(0, 0)), 0);
  EXPECT_TRUE(std::isnan(Signed<uchar, uchar, float>(0, 0)));
  EXPECT_TRUE(std::isnan(Absolute<float, float, float>(-0.0f, 0.0f)));
}

// Deliberate: a zero in the reference is not tested. It gives an infinity, or NaN for 0 / 0, which `ClipTo`
// turns into the type's limits and 0 in an integer output.
TEST(ChanRatioChange2, ZeroInTheReferenceGivesAnInfinityWhichClipToTurnsIntoTheTypesLimits) {
  EXPECT_EQ((Signed<short, short, uchar>(3, 0)), 255);
  EXPECT_EQ((Signed<short, short, short>(3, 0)), 32767);
  EXPECT_EQ((Signed<short, short, ushort>(3, 0)), 65535);
  EXPECT_EQ((Signed<short, short, float>(3, 0)), kInfinity);
  EXPECT_EQ((Signed<short, short, uchar>(-3, 0)), 0);
  EXPECT_EQ((Signed<short, short, short>(-3, 0)), -32768);
  EXPECT_EQ((Signed<short, short, ushort>(-3, 0)), 0);
  EXPECT_EQ((Signed<short, short, float>(-3, 0)), -kInfinity);
  EXPECT_EQ((Absolute<short, short, uchar>(-3, 0)), 255);
  EXPECT_EQ((Absolute<short, short, short>(-3, 0)), 32767);
  EXPECT_EQ((Absolute<short, short, ushort>(-3, 0)), 65535);
  EXPECT_EQ((Absolute<short, short, float>(-3, 0)), kInfinity);
  EXPECT_EQ((Signed<float, float, float>(3.0f, -0.0f)), -kInfinity);
}

TEST(ChanRatioChange2, ZeroReferenceIsKeptOutByRefNoDataWithAnImgNoDataOfFullLength) {
  EXPECT_EQ((ChangePixel<uchar, uchar, short>(Testing(-1.0f, {kNaN}, {0}), {3}, {0}, 1)[0]), -1);
  EXPECT_EQ((ChangePixel<uchar, uchar, short>(Testing(-1.0f, {}, {0}), {3}, {0}, 1)[0]), 32767);
}

TEST(ChanRatioChange2, SmallRatiosAreRoundedInAnIntegerOutput) {
  EXPECT_EQ((Signed<uchar, uchar, uchar>(4, 10)), 0);
  EXPECT_EQ((Signed<uchar, uchar, uchar>(15, 10)), 2);
  EXPECT_EQ((Signed<uchar, uchar, uchar>(1, 2)), 1);
  EXPECT_EQ((Signed<short, short, ushort>(-30, 10)), 0);
  EXPECT_EQ((Absolute<short, short, ushort>(-30, 10)), 3);
}

TEST(ChanRatioChange2, BothSamplesBecomeFloatBeforeTheDivision) {
  EXPECT_EQ((Signed<ushort, short, float>(65535, -7)), 65535.0f / -7.0f);
  EXPECT_EQ((Signed<uchar, float, float>(1, 3.0f)), 1.0f / 3.0f);
  EXPECT_EQ((Absolute<float, uchar, float>(-1.0f, 3)), 1.0f / 3.0f);
  EXPECT_EQ((Signed<float, ushort, float>(1e-40f, 3)), 1e-40f / 3.0f);
  EXPECT_EQ((Signed<float, float, float>(1e30f, 1e-30f)), kInfinity);
}

TEST(ChanRatioChange2, ExcludedPixelHoldsTheDefaultNoDataOf3Point4e38ThroughClipTo) {
  const ChanRatioChange2 op(eDIFF_FORWARD);
  EXPECT_EQ(std::bit_cast<std::uint32_t>(ChangePixel<short, short, float>(op, {8}, {2}, 1, false)[0]),
            0x7F7FC99Eu);
  EXPECT_EQ((ChangePixel<short, short, uchar>(op, {8}, {2}, 1, false)[0]), 255);
  EXPECT_EQ((ChangePixel<short, short, short>(op, {8}, {2}, 1, false)[0]), 32767);
  EXPECT_EQ((ChangePixel<short, short, ushort>(op, {8}, {2}, 1, false)[0]), 65535);
}

TEST(ChanRatioChange2, MaskedPixelHoldsNoDataInEachChannelOfTheImage) {
  const ChanRatioChange2 op = Testing(-9.4f, {}, {});
  EXPECT_EQ((ChangePixel<uchar, short, short>(op, {1, 2}, {5, 6, 7}, 3, false)),
            (std::vector<short>{-9, -9, tests::kUnwritten}));
}

TEST(ChanRatioChange2, NoDataTestIsPerSample) {
  const ChanRatioChange2 op = Testing(-9.0f, {0, 5, 0}, {0, 0, 8});
  EXPECT_EQ((ChangePixel<short, uchar, float>(op, {10, 5, 30}, {4, 4, 8}, 3)),
            (std::vector<float>{2.5f, -9, -9}));
  EXPECT_EQ((ChangePixel<short, uchar, float>(op, {10, 6, 0}, {0, 4, 4}, 3)),
            (std::vector<float>{-9, 1.5f, -9}));
}

TEST(ChanRatioChange2, ImgNoDataOfAnotherLengthSwitchesTheTestOffForBothRasters) {
  for (const std::size_t length : {0u, 1u, 2u, 4u}) {
    const ChanRatioChange2 op = Testing(-9.0f, std::vector<float>(length, 6.0f), {8, 8, 8});
    EXPECT_EQ((ChangePixel<short, uchar, float>(op, {6, 6, 6}, {4, 8, 8}, 3)),
              (std::vector<float>{1.5f, 0.75f, 0.75f}))
        << length;
  }
}

TEST(ChanRatioChange2, ReferenceOf5ChannelsUnderAnImageOf3ContributesItsFirst3) {
  Image<uchar> image({2, 1, 3}), out({2, 1, 4}, {}, 77);
  Image<short> reference({2, 1, 5}, {}, 1);
  image.Set([](int x, int, std::uint32_t c) { return 8 * (x + 1) + 8 * static_cast<int>(c); });
  reference.SetPixel(0, 0, {1, 2, 4, 99, 99, 4, 2, 1, 99, 99});
  ChanRatioChange2(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), (std::vector<uchar>{8, 8, 6, 77, 4, 12, 32, 77}));
}

TEST(ChanRatioChange2, ComplexImageAndReferenceGiveTheirRealParts) {
  Image<short> image({2, 1, 1}, {1, 0}, 0, true);
  Image<float> reference({2, 1, 2}, {0, 1}, 0.0f, true), out({2, 1, 1});
  image.SetPixel(0, 0, {10, -1000, 30, 3000});
  reference.SetPixel(0, 0, {4.0f, 99.0f, 0, 0, 20.0f, 99.0f});
  ChanRatioChange2(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 2.5f);
  EXPECT_EQ(out.At(1, 0), 1.5f);
}

TEST(ChanRatioChange2, WidthOrHeightOrChannelsOf0WriteNothing) {
  Image<short> out({4, 3, 2}, {1, 1});
  FillBytes(out);
  Image<short> noRows({4, 0, 2}, {1, 1}, 5), noColumns({0, 3, 2}, {1, 1}, 5), noChannels({4, 3, 0}, {1, 1});
  Image<float> reference({4, 3, 2}, {1, 1}, 9);
  const ChanRatioChange2 op(eDIFF_FORWARD);
  op.Process(&noRows, &reference, nullptr, &out);
  op.Process(&noColumns, &reference, nullptr, &out);
  op.Process(&noChannels, &reference, nullptr, &out);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(ChanRatioChange2, OutputMayTakeThePlaceOfEitherDate) {
  Image<float> image({3, 1, 2}, {}, 6.0f), reference({3, 1, 2}, {}, 3.0f);
  const ChanRatioChange2 op(eDIFF_FORWARD);
  op.Process(&image, &reference, nullptr, &image);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(image.Elements()[i], 2.0f) << i;
  op.Process(&image, &reference, nullptr, &reference);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(reference.Elements()[i], 2.0f / 3.0f) << i;
}

TEST(ChanRatioChange2, ClearBitOfTheMaskExcludesThePixelByTheMasksOwnGeometry) {
  Image<short> image({3, 2}, {1, 1}, 8), reference({3, 2}, {}, 2), out({3, 2}, {}, 77);
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  Testing(-1.0f, {}, {}).Process(&image, &reference, &mask, &out);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, y), x == 1 && y == 1 ? -1 : 4) << x << ", " << y;
  }
}

// ---- failures

struct ChanRatioChange2Failure : ::testing::Test {
  Image<short> image{{3, 2, 2}, {1, 1}, 7};
  Image<uchar> reference{{3, 2, 2}, {1, 1}, 5};
  Image<float> out{{3, 2, 2}, {1, 1}};
  const ChanRatioChange2 op{eDIFF_FORWARD};

  ChanRatioChange2Failure() { FillBytes(out); }
};

TEST_F(ChanRatioChange2Failure, NullRastersAreInvalidPointers) {
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { op.Process(nullptr, &reference, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterRef is invalid pointer",
                                [&] { op.Process(&image, nullptr, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterOut is invalid pointer",
                                [&] { op.Process(&image, &reference, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(ChanRatioChange2Failure, OutputCannotBeComplex) {
  Image<float> complex({3, 2, 2}, {}, 77.0f, true);
  EXPECT_TRUE(Throws<Exception>("Output cannot be complex",
                                [&] { op.Process(&image, &reference, nullptr, &complex); }));
  EXPECT_EQ(complex.At(0, 0), 77.0f);
}

TEST_F(ChanRatioChange2Failure, TypesOutsideTheShortListAreInvalid) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster odd({3, 2, 2, DataType(type.element)}, {1, 1});
    FillBytes(odd);
    if (tests::IsShortPixelType(type)) continue;
    const auto asImage = [&] { op.Process(&odd, &reference, nullptr, &out); };
    const auto asReference = [&] { op.Process(&image, &odd, nullptr, &out); };
    const auto asOutput = [&] { op.Process(&image, &reference, nullptr, &odd); };
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", asImage)) << type;
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", asReference)) << type;
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", asOutput)) << type;
    EXPECT_TRUE(IsUntouched(out) && IsUntouched(odd));
  }
}

// ---- differential

struct ChanRatioChange2Differential : ::testing::TestWithParam<PixelType> {};

TEST_P(ChanRatioChange2Differential, AgreesWithTheTwinBitForBit) {
  tests::ChangeLimits limits;
  limits.isOfThreeTypes = true;
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), limits)) {
    ChanRatioChange2 op(static_cast<DiffType>(c.parameters.type));
    SetNoDataOf(c.parameters, op);
    ASSERT_TRUE(Agree(
        c,
        [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
          op.Process(image, reference, mask, out);
        },
        [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
          reference::ChanRatioChange2(c.parameters, image, reference, mask, out);
        }));
  }
}

INSTANTIATE_TEST_SUITE_P(From, ChanRatioChange2Differential, ::testing::ValuesIn(tests::kShortPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
