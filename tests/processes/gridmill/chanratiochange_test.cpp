#include "processes/gridmill/chanratiochange.h"

#include <bit>
#include <cmath>
#include <cstdint>
#include <limits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/chanratiochange_reference.h"
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
  return ChangePixel<In, Ref, Out>(ChanRatioChange(static_cast<DiffType2>(type)), {image}, {reference}, 1)[0];
}

template <class In, class Ref, class Out>
Out Signed(In image, Ref reference) {
  return Change<In, Ref, Out>(eDIFF2_SIGNED, image, reference);
}

template <class In, class Ref, class Out>
Out Absolute(In image, Ref reference) {
  return Change<In, Ref, Out>(eDIFF2_ABSOLUTE, image, reference);
}

/// A signed ratio that writes `noData`, with vectors for the test.
ChanRatioChange Testing(float noData, std::vector<float> imgNoData, std::vector<float> refNoData) {
  ChanRatioChange op(eDIFF2_SIGNED);
  op.SetNoData(noData);
  op.SetImgNoData(std::move(imgNoData));
  op.SetRefNoData(std::move(refNoData));
  return op;
}

// ---- golden

TEST(ChanRatioChange, RatioOf10And4In8BitsIs3) { EXPECT_EQ((Signed<uchar, uchar, uchar>(10, 4)), 3); }

TEST(ChanRatioChange, RatioOfMinus10And4IsRoundedHalfAwayFromZero) {
  EXPECT_EQ((Signed<short, short, short>(-10, 4)), -3);
  EXPECT_EQ((Absolute<short, short, short>(-10, 4)), 3);
}

TEST(ChanRatioChange, EveryTypeBut0IsSigned) {
  for (const int type : {1, 2, 3, 5, 7, -1, std::numeric_limits<int>::min()})
    EXPECT_EQ((Change<short, short, float>(type, -10, 4)), -2.5f) << type;
  EXPECT_EQ((Change<short, short, float>(0, -10, 4)), 2.5f);
}

TEST(ChanRatioChange, RatioOf0And0Is0In8BitsAndNaNInFloat) {
  EXPECT_EQ((Signed<uchar, uchar, uchar>(0, 0)), 0);
  EXPECT_EQ((Signed<uchar, uchar, short>(0, 0)), 0);
  EXPECT_EQ((Signed<uchar, uchar, ushort>(0, 0)), 0);
  EXPECT_TRUE(std::isnan(Signed<uchar, uchar, float>(0, 0)));
  EXPECT_TRUE(std::isnan(Absolute<float, float, float>(-0.0f, 0.0f)));
}

// Deliberate: a zero in the reference is not tested. It gives an infinity, or NaN for 0 / 0, which `ClipTo`
// turns into the type's limits and 0 in an integer output.
TEST(ChanRatioChange, ZeroInTheReferenceGivesAnInfinityWhichClipToTurnsIntoTheTypesLimits) {
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

TEST(ChanRatioChange, ZeroReferenceIsKeptOutByRefNoDataWithAnImgNoDataOfFullLength) {
  EXPECT_EQ((ChangePixel<uchar, uchar, short>(Testing(-1.0f, {kNaN}, {0}), {3}, {0}, 1)[0]), -1);
  EXPECT_EQ((ChangePixel<uchar, uchar, short>(Testing(-1.0f, {}, {0}), {3}, {0}, 1)[0]), 32767);
}

TEST(ChanRatioChange, SmallRatiosAreRoundedInAnIntegerOutput) {
  EXPECT_EQ((Signed<uchar, uchar, uchar>(4, 10)), 0);
  EXPECT_EQ((Signed<uchar, uchar, uchar>(15, 10)), 2);
  EXPECT_EQ((Signed<uchar, uchar, uchar>(1, 2)), 1);
  EXPECT_EQ((Signed<short, short, ushort>(-30, 10)), 0);
  EXPECT_EQ((Absolute<short, short, ushort>(-30, 10)), 3);
}

TEST(ChanRatioChange, BothSamplesBecomeFloatBeforeTheDivision) {
  EXPECT_EQ((Signed<ushort, short, float>(65535, -7)), 65535.0f / -7.0f);
  EXPECT_EQ((Signed<uchar, float, float>(1, 3.0f)), 1.0f / 3.0f);
  EXPECT_EQ((Absolute<float, uchar, float>(-1.0f, 3)), 1.0f / 3.0f);
  EXPECT_EQ((Signed<float, ushort, float>(1e-40f, 3)), 1e-40f / 3.0f);
  EXPECT_EQ((Signed<float, float, float>(1e30f, 1e-30f)), kInfinity);
}

TEST(ChanRatioChange, ExcludedPixelHoldsTheDefaultNoDataOf3Point4e38ThroughClipTo) {
  const ChanRatioChange op(eDIFF2_SIGNED);
  EXPECT_EQ(std::bit_cast<std::uint32_t>(ChangePixel<short, short, float>(op, {8}, {2}, 1, false)[0]),
            0x7F7FC99Eu);
  EXPECT_EQ((ChangePixel<short, short, uchar>(op, {8}, {2}, 1, false)[0]), 255);
  EXPECT_EQ((ChangePixel<short, short, short>(op, {8}, {2}, 1, false)[0]), 32767);
  EXPECT_EQ((ChangePixel<short, short, ushort>(op, {8}, {2}, 1, false)[0]), 65535);
}

TEST(ChanRatioChange, MaskedPixelHoldsNoDataInEachChannelOfTheImage) {
  const ChanRatioChange op = Testing(-9.4f, {}, {});
  EXPECT_EQ((ChangePixel<uchar, short, short>(op, {1, 2}, {5, 6, 7}, 3, false)),
            (std::vector<short>{-9, -9, tests::kUnwritten}));
}

TEST(ChanRatioChange, NoDataTestIsPerSample) {
  const ChanRatioChange op = Testing(-9.0f, {0, 5, 0}, {0, 0, 8});
  EXPECT_EQ((ChangePixel<short, uchar, float>(op, {10, 5, 30}, {4, 4, 8}, 3)),
            (std::vector<float>{2.5f, -9, -9}));
  EXPECT_EQ((ChangePixel<short, uchar, float>(op, {10, 6, 0}, {0, 4, 4}, 3)),
            (std::vector<float>{-9, 1.5f, -9}));
}

TEST(ChanRatioChange, ImgNoDataOfAnotherLengthSwitchesTheTestOffForBothRasters) {
  for (const std::size_t length : {0u, 1u, 2u, 4u}) {
    const ChanRatioChange op = Testing(-9.0f, std::vector<float>(length, 6.0f), {8, 8, 8});
    EXPECT_EQ((ChangePixel<short, uchar, float>(op, {6, 6, 6}, {4, 8, 8}, 3)),
              (std::vector<float>{1.5f, 0.75f, 0.75f}))
        << length;
  }
}

TEST(ChanRatioChange, ReferenceOf5ChannelsUnderAnImageOf3ContributesItsFirst3) {
  Image<uchar> image({2, 1, 3}), out({2, 1, 4}, {}, 77);
  Image<short> reference({2, 1, 5}, {}, 1);
  image.Set([](int x, int, std::uint32_t c) { return 8 * (x + 1) + 8 * static_cast<int>(c); });
  reference.SetPixel(0, 0, {1, 2, 4, 99, 99, 4, 2, 1, 99, 99});
  ChanRatioChange(eDIFF2_SIGNED).Process(&image, &reference, nullptr, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), (std::vector<uchar>{8, 8, 6, 77, 4, 12, 32, 77}));
}

TEST(ChanRatioChange, ComplexImageAndReferenceGiveTheirRealParts) {
  Image<short> image({2, 1, 1}, {1, 0}, 0, true);
  Image<float> reference({2, 1, 2}, {0, 1}, 0.0f, true), out({2, 1, 1});
  image.SetPixel(0, 0, {10, -1000, 30, 3000});
  reference.SetPixel(0, 0, {4.0f, 99.0f, 0, 0, 20.0f, 99.0f});
  ChanRatioChange(eDIFF2_SIGNED).Process(&image, &reference, nullptr, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 2.5f);
  EXPECT_EQ(out.At(1, 0), 1.5f);
}

TEST(ChanRatioChange, WidthOrHeightOrChannelsOf0WriteNothing) {
  Image<short> out({4, 3, 2}, {1, 1});
  FillBytes(out);
  Image<short> noRows({4, 0, 2}, {1, 1}, 5), noColumns({0, 3, 2}, {1, 1}, 5), noChannels({4, 3, 0}, {1, 1});
  Image<float> reference({4, 3, 2}, {1, 1}, 9);
  const ChanRatioChange op(eDIFF2_SIGNED);
  op.Process(&noRows, &reference, nullptr, nullptr, &out);
  op.Process(&noColumns, &reference, nullptr, nullptr, &out);
  op.Process(&noChannels, &reference, nullptr, nullptr, &out);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(ChanRatioChange, OutputMayTakeThePlaceOfEitherDate) {
  Image<float> image({3, 1, 2}, {}, 6.0f), reference({3, 1, 2}, {}, 3.0f);
  const ChanRatioChange op(eDIFF2_SIGNED);
  op.Process(&image, &reference, nullptr, nullptr, &image);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(image.Elements()[i], 2.0f) << i;
  op.Process(&image, &reference, nullptr, nullptr, &reference);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(reference.Elements()[i], 2.0f / 3.0f) << i;
}

/// The results, 4 or the `noData` -1, of the pixels of four that have (image bit, reference bit) = (0, 0),
/// (0, 1), (1, 0) and (1, 1).
std::vector<short> WithMasks(bool hasImageMask, bool hasReferenceMask) {
  Image<short> image({4, 1}, {}, 8), reference({4, 1}, {}, 2), out({4, 1}, {}, 77);
  Mask imageMask(4, 1), referenceMask(4, 1);
  for (int x = 0; x < 4; ++x) {
    imageMask.SetValid(x, 0, (x & 2) != 0);
    referenceMask.SetValid(x, 0, (x & 1) != 0);
  }
  Testing(-1.0f, {}, {})
      .Process(&image, &reference, hasImageMask ? &imageMask : nullptr,
               hasReferenceMask ? &referenceMask : nullptr, &out);
  return {out.Elements(), out.Elements() + 4};
}

// Deliberate: a set bit of the reference mask excludes the pixel, the reverse of every other mask.
TEST(ChanRatioChange, SetBitOfTheReferenceMaskExcludesThePixelAlsoWithoutAnImageMask) {
  EXPECT_EQ(WithMasks(true, true), (std::vector<short>{-1, -1, 4, -1}));
  EXPECT_EQ(WithMasks(false, true), (std::vector<short>{4, -1, 4, -1}));
  EXPECT_EQ(WithMasks(true, false), (std::vector<short>{-1, -1, 4, 4}));
  EXPECT_EQ(WithMasks(false, false), (std::vector<short>{4, 4, 4, 4}));
}

// ---- failures

struct ChanRatioChangeFailure : ::testing::Test {
  Image<short> image{{3, 2, 2}, {1, 1}, 7};
  Image<uchar> reference{{3, 2, 2}, {1, 1}, 5};
  Image<float> out{{3, 2, 2}, {1, 1}};
  const ChanRatioChange op{eDIFF2_SIGNED};

  ChanRatioChangeFailure() { FillBytes(out); }
};

TEST_F(ChanRatioChangeFailure, NullRastersAreInvalidPointers) {
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { op.Process(nullptr, &reference, nullptr, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterRef is invalid pointer",
                                [&] { op.Process(&image, nullptr, nullptr, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterOut is invalid pointer",
                                [&] { op.Process(&image, &reference, nullptr, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(ChanRatioChangeFailure, OutputCannotBeComplex) {
  Image<float> complex({3, 2, 2}, {}, 77.0f, true);
  EXPECT_TRUE(Throws<Exception>("Output cannot be complex",
                                [&] { op.Process(&image, &reference, nullptr, nullptr, &complex); }));
  EXPECT_EQ(complex.At(0, 0), 77.0f);
}

TEST_F(ChanRatioChangeFailure, TypesOutsideTheShortListAreInvalid) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster odd({3, 2, 2, DataType(type.element)}, {1, 1});
    FillBytes(odd);
    if (tests::IsShortPixelType(type)) continue;
    const auto asImage = [&] { op.Process(&odd, &reference, nullptr, nullptr, &out); };
    const auto asReference = [&] { op.Process(&image, &odd, nullptr, nullptr, &out); };
    const auto asOutput = [&] { op.Process(&image, &reference, nullptr, nullptr, &odd); };
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", asImage)) << type;
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", asReference)) << type;
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", asOutput)) << type;
    EXPECT_TRUE(IsUntouched(out) && IsUntouched(odd));
  }
}

// ---- differential

struct ChanRatioChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(ChanRatioChangeDifferential, AgreesWithTheTwinBitForBit) {
  tests::ChangeLimits limits;
  limits.isOfThreeTypes = true;
  limits.hasTwoMasks = true;
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), limits)) {
    ChanRatioChange op(static_cast<DiffType2>(c.parameters.type));
    SetNoDataOf(c.parameters, op);
    ASSERT_TRUE(Agree(
        c,
        [&](Raster* image, Raster* reference, Mask* imageMask, Mask* referenceMask, Raster* out) {
          op.Process(image, reference, imageMask, referenceMask, out);
        },
        [&](const Raster& image, const Raster& reference, const Mask* imageMask, const Mask* referenceMask,
            Raster& out) {
          reference::ChanRatioChange(c.parameters, image, reference, imageMask, referenceMask, out);
        }));
  }
}

INSTANTIATE_TEST_SUITE_P(From, ChanRatioChangeDifferential, ::testing::ValuesIn(tests::kShortPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
