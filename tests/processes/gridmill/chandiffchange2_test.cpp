#include "processes/gridmill/chandiffchange2.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/chandiffchange2_reference.h"
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

/// The result for one sample of either date.
template <class In, class Ref, class Out>
Out Change(int type, In image, Ref reference) {
  return ChangePixel<In, Ref, Out>(ChanDiffChange2(static_cast<DiffType2>(type)), {image}, {reference}, 1)[0];
}

template <class In, class Ref, class Out>
Out Signed(In image, Ref reference) {
  return Change<In, Ref, Out>(eDIFF2_SIGNED, image, reference);
}

template <class In, class Ref, class Out>
Out Absolute(In image, Ref reference) {
  return Change<In, Ref, Out>(eDIFF2_ABSOLUTE, image, reference);
}

/// A signed difference that writes `noData`, with vectors for the test.
ChanDiffChange2 Testing(float noData, std::vector<float> imgNoData, std::vector<float> refNoData) {
  ChanDiffChange2 op(eDIFF2_SIGNED);
  op.SetNoData(noData);
  op.SetImgNoData(std::move(imgNoData));
  op.SetRefNoData(std::move(refNoData));
  return op;
}

// ---- golden

TEST(ChanDiffChange2, FormsOf10And250In8BitsAre16SignedAnd240Absolute) {
  EXPECT_EQ((Signed<uchar, uchar, uchar>(10, 250)), 16);
  EXPECT_EQ((Absolute<uchar, uchar, uchar>(10, 250)), 240);
  EXPECT_EQ((Absolute<uchar, uchar, uchar>(250, 10)), 240);
}

TEST(ChanDiffChange2, FloatRastersGive1AbsoluteAndMinus1Signed) {
  EXPECT_EQ((Absolute<float, float, float>(1.5f, 2.5f)), 1.0f);
  EXPECT_EQ((Signed<float, float, float>(1.5f, 2.5f)), -1.0f);
}

TEST(ChanDiffChange2, EveryTypeBut0IsSigned) {
  for (const int type : {1, 2, 3, 7, -1, std::numeric_limits<int>::min()})
    EXPECT_EQ((Change<short, short, short>(type, 3, 10)), -7) << type;
  EXPECT_EQ((Change<short, short, short>(0, 3, 10)), 7);
}

// Deliberate: the absolute form is not symmetric. Plain casts of both decide on the direction, the
// subtraction takes the image as it stands and the reference clipped.
TEST(ChanDiffChange2, AbsoluteFormDecidesByPlainCastsAndSubtractsTheClippedReference) {
  EXPECT_EQ((Absolute<uchar, short, ushort>(5, -3)), 65531);
  EXPECT_EQ((Absolute<short, uchar, ushort>(-3, 5)), 65528);
  EXPECT_EQ((Absolute<float, float, uchar>(2.2f, 2.7f)), 0);
  EXPECT_EQ((Absolute<float, float, uchar>(2.7f, 2.2f)), 0);
}

TEST(ChanDiffChange2, NegativeShortReferenceIsClippedTo0InAnUnsignedOutput) {
  EXPECT_EQ((Absolute<uchar, short, uchar>(255, -3)), 255);  // b is 253
  EXPECT_EQ((Absolute<uchar, short, uchar>(5, -3)), 251);    // 0 - 5
  EXPECT_EQ((Absolute<short, short, ushort>(-1, -3)), 65535);
  EXPECT_EQ((Absolute<uchar, short, uchar>(100, 300)), 101);  // b is 44, k is 255: 100 - 255
  EXPECT_EQ((Absolute<uchar, short, uchar>(20, 300)), 235);
}

TEST(ChanDiffChange2, UnsignedShortReferenceIsClippedAtTheEndOfANarrowerOutput) {
  EXPECT_EQ((Absolute<uchar, ushort, uchar>(100, 256)), 101);      // b is 0, k is 255
  EXPECT_EQ((Absolute<uchar, ushort, uchar>(100, 511)), 155);      // b is 255
  EXPECT_EQ((Absolute<short, ushort, short>(10, 65535)), -32757);  // b is -1, k is 32767
  EXPECT_EQ((Absolute<short, ushort, short>(-10, 65535)), -32759);
}

TEST(ChanDiffChange2, FloatReferenceIsRoundedAndClippedInTheSubtractionAndTruncatedInTheComparison) {
  EXPECT_EQ((Absolute<uchar, float, uchar>(2, 2.7f)), 255);  // b is 2, k is 3
  EXPECT_EQ((Absolute<uchar, float, uchar>(3, 2.7f)), 0);
  EXPECT_EQ((Absolute<uchar, float, uchar>(0, 300.0f)), 255);  // b is 44, k is 255
  EXPECT_EQ((Absolute<short, float, short>(5, -2.5f)), 8);     // k is -3
  EXPECT_EQ((Absolute<uchar, float, uchar>(4, kNaN)), 4);
}

TEST(ChanDiffChange2, FloatImageKeepsItsFractionThroughTheSubtractionAndIsTruncatedFirstIfSigned) {
  EXPECT_EQ((Absolute<float, uchar, uchar>(2.7f, 1)), 1);
  EXPECT_EQ((Signed<float, uchar, uchar>(2.7f, 1)), 1);
  EXPECT_EQ((Absolute<float, uchar, short>(-1.5f, 1)), 2);
  EXPECT_EQ((Absolute<float, uchar, short>(2.7f, 5)), 2);
  EXPECT_EQ((Signed<float, uchar, short>(2.7f, 5)), -3);
  EXPECT_EQ((Signed<float, float, short>(2.9f, 1.1f)), 1);
}

TEST(ChanDiffChange2, FloatOutputIsAllFloatArithmetic) {
  EXPECT_EQ((Absolute<ushort, short, float>(65535, -32768)), 98303.0f);
  EXPECT_EQ((Signed<short, ushort, float>(-32768, 65535)), -98303.0f);
  EXPECT_EQ((Absolute<uchar, float, float>(1, 2.75f)), 1.75f);
  EXPECT_EQ((Signed<float, uchar, float>(0.1f, 1)), 0.1f - 1.0f);
  EXPECT_TRUE(std::isnan(Absolute<float, uchar, float>(kNaN, 1)));
}

TEST(ChanDiffChange2, IntegerDifferencesWrapAndNeverSaturate) {
  EXPECT_EQ((Signed<short, short, short>(-32768, 1)), 32767);
  EXPECT_EQ((Absolute<short, short, short>(-32768, 32767)), -1);
  EXPECT_EQ((Signed<short, uchar, uchar>(-1, 1)), 254);
  EXPECT_EQ((Signed<ushort, short, short>(65535, 1)), -2);
}

TEST(ChanDiffChange2, AbsoluteFloatDifferenceOfTheTwoZerosIsImageMinusReference) {
  EXPECT_TRUE(std::signbit(Absolute<float, float, float>(-0.0f, 0.0f)));
  EXPECT_FALSE(std::signbit(Absolute<float, float, float>(0.0f, -0.0f)));
}

/// The results, 7 or the `noData` -1, of the pixels of four that have (image bit, reference bit) = (0, 0),
/// (0, 1), (1, 0) and (1, 1).
std::vector<short> WithMasks(bool hasImageMask, bool hasReferenceMask) {
  Image<short> image({4, 1}, {}, 9), reference({4, 1}, {}, 2), out({4, 1}, {}, 77);
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
TEST(ChanDiffChange2, SetBitOfTheReferenceMaskExcludesThePixel) {
  EXPECT_EQ(WithMasks(true, true), (std::vector<short>{-1, -1, 7, -1}));
  EXPECT_EQ(WithMasks(false, true), (std::vector<short>{7, -1, 7, -1}));
  EXPECT_EQ(WithMasks(true, false), (std::vector<short>{-1, -1, 7, 7}));
  EXPECT_EQ(WithMasks(false, false), (std::vector<short>{7, 7, 7, 7}));
}

TEST(ChanDiffChange2, EachMaskIsLookedUpByItsOwnGeometry) {
  Image<short> image({3, 2}, {1, 1}, 9), reference({3, 2}, {}, 5), out({3, 2}, {}, 77);
  Mask imageMask(3, 2, {4, 2}), referenceMask(5, 4, {0, 3}, false);
  imageMask.SetValid(1, 1, false);
  referenceMask.SetValid(2, 0, true);
  ChanDiffChange2(eDIFF2_SIGNED).Process(&image, &reference, &imageMask, &referenceMask, &out);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) {
      const bool isExcluded = (x == 1 && y == 1) || (x == 2 && y == 0);
      EXPECT_EQ(out.At(x, y), isExcluded ? 0 : 4) << x << ", " << y;
    }
  }
}

TEST(ChanDiffChange2, MaskedPixelHoldsNoDataInEachChannelOfTheImage) {
  const ChanDiffChange2 op = Testing(-9.4f, {}, {});
  EXPECT_EQ((ChangePixel<uchar, short, short>(op, {1, 2}, {5, 6, 7}, 3, false)),
            (std::vector<short>{-9, -9, tests::kUnwritten}));
  EXPECT_EQ((ChangePixel<uchar, short, uchar>(op, {1}, {5}, 1, false)), (std::vector<uchar>{0}));
}

TEST(ChanDiffChange2, NoDataIs0ByDefault) {
  const ChanDiffChange2 op(eDIFF2_SIGNED);
  EXPECT_EQ((ChangePixel<uchar, short, float>(op, {9}, {5}, 1, false)), (std::vector<float>{0.0f}));
}

TEST(ChanDiffChange2, NoDataTestIsPerSample) {
  const ChanDiffChange2 op = Testing(-9.0f, {0, 5, 0}, {0, 0, 8});
  EXPECT_EQ((ChangePixel<short, uchar, short>(op, {10, 5, 30}, {1, 1, 8}, 3)),
            (std::vector<short>{9, -9, -9}));
  EXPECT_EQ((ChangePixel<float, float, float>(op, {10.5f, 6, 30}, {1, 1, 7}, 3)),
            (std::vector<float>{9.5f, 5, 23}));
}

TEST(ChanDiffChange2, NoDataOfTheReferenceIsComparedInItsOwnType) {
  EXPECT_EQ((ChangePixel<uchar, short, short>(Testing(-9.0f, {300}, {-3}), {253}, {-3}, 1)),
            (std::vector<short>{-9}));
  EXPECT_EQ((ChangePixel<uchar, float, short>(Testing(-9.0f, {0}, {2.5f}), {1}, {2.5f}, 1)),
            (std::vector<short>{-9}));
  EXPECT_EQ((ChangePixel<uchar, float, short>(Testing(-9.0f, {0}, {kNaN}), {1}, {kNaN}, 1)),
            (std::vector<short>{1}));
}

TEST(ChanDiffChange2, ImgNoDataOfAnotherLengthSwitchesTheTestOffForBothRasters) {
  for (const std::size_t length : {0u, 1u, 2u, 4u}) {
    const ChanDiffChange2 op = Testing(-9.0f, std::vector<float>(length, 5.0f), {8, 8, 8});
    EXPECT_EQ((ChangePixel<short, uchar, short>(op, {5, 5, 5}, {1, 8, 8}, 3)),
              (std::vector<short>{4, -3, -3}))
        << length;
  }
}

TEST(ChanDiffChange2, ComplexImageAndReferenceGiveTheirRealParts) {
  Image<short> image({2, 1, 2}, {1, 0}, 0, true);
  Image<float> reference({2, 1, 3}, {0, 1}, 0.0f, true), out({2, 1, 2});
  image.SetPixel(0, 0, {10, -1000, 20, 3000, 30, 1, 40, 1});
  reference.SetPixel(0, 0, {1.5f, 99.0f, 2.5f, 99.0f, 0, 0, 3.5f, 99.0f, 4.5f, 99.0f});
  ChanDiffChange2(eDIFF2_SIGNED).Process(&image, &reference, nullptr, nullptr, &out);
  EXPECT_EQ(std::vector<float>(out.Elements(), out.Elements() + 4),
            (std::vector<float>{8.5f, 17.5f, 26.5f, 35.5f}));
}

TEST(ChanDiffChange2, ReferenceOf5ChannelsUnderAnImageOf3ContributesItsFirst3) {
  Image<uchar> image({2, 1, 3}), out({2, 1, 4}, {}, 77);
  Image<short> reference({2, 1, 5});
  image.Set([](int x, int, std::uint32_t c) { return 100 + 10 * x + static_cast<int>(c); });
  reference.Set([](int x, int, std::uint32_t c) { return x + 2 * static_cast<int>(c); });
  ChanDiffChange2(eDIFF2_SIGNED).Process(&image, &reference, nullptr, nullptr, &out);
  EXPECT_EQ(tests::Bytes(out), (std::vector<uchar>{100, 99, 98, 77, 109, 108, 107, 77}));
}

TEST(ChanDiffChange2, WidthOrHeightOrChannelsOf0WriteNothing) {
  Image<short> out({4, 3, 2}, {1, 1});
  FillBytes(out);
  Image<short> noRows({4, 0, 2}, {1, 1}, 5), noColumns({0, 3, 2}, {1, 1}, 5), noChannels({4, 3, 0}, {1, 1});
  Image<float> reference({4, 3, 2}, {1, 1}, 9);
  Mask mask(4, 3, {1, 1}, false);
  const ChanDiffChange2 op(eDIFF2_SIGNED);
  op.Process(&noRows, &reference, nullptr, nullptr, &out);
  op.Process(&noColumns, &reference, nullptr, nullptr, &out);
  op.Process(&noChannels, &reference, nullptr, nullptr, &out);
  op.Process(&noChannels, &reference, &mask, nullptr, &out);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(ChanDiffChange2, OutputMayTakeThePlaceOfEitherDate) {
  Image<float> image({3, 1, 2}, {}, 1.0f), reference({3, 1, 2}, {}, 3.0f);
  const ChanDiffChange2 op(eDIFF2_SIGNED);
  op.Process(&image, &reference, nullptr, nullptr, &image);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(image.Elements()[i], -2.0f) << i;
  op.Process(&image, &reference, nullptr, nullptr, &reference);
  for (int i = 0; i < 6; ++i) EXPECT_EQ(reference.Elements()[i], -5.0f) << i;
}

// ---- failures

struct ChanDiffChange2Failure : ::testing::Test {
  Image<short> image{{3, 2, 2}, {1, 1}, 7};
  Image<uchar> reference{{3, 2, 2}, {1, 1}, 5};
  Image<float> out{{3, 2, 2}, {1, 1}};
  const ChanDiffChange2 op{eDIFF2_SIGNED};

  ChanDiffChange2Failure() { FillBytes(out); }
};

TEST_F(ChanDiffChange2Failure, NullRastersAreInvalidPointers) {
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { op.Process(nullptr, &reference, nullptr, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterRef is invalid pointer",
                                [&] { op.Process(&image, nullptr, nullptr, nullptr, &out); }));
  EXPECT_TRUE(Throws<Exception>("poRasterOut is invalid pointer",
                                [&] { op.Process(&image, &reference, nullptr, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(ChanDiffChange2Failure, OutputCannotBeComplex) {
  Image<float> complex({3, 2, 2}, {}, 77.0f, true);
  EXPECT_TRUE(Throws<Exception>("Output cannot be complex",
                                [&] { op.Process(&image, &reference, nullptr, nullptr, &complex); }));
  EXPECT_EQ(complex.At(0, 0), 77.0f);
}

TEST_F(ChanDiffChange2Failure, TypesOutsideTheShortListAreInvalid) {
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

struct ChanDiffChange2Differential : ::testing::TestWithParam<PixelType> {};

TEST_P(ChanDiffChange2Differential, AgreesWithTheTwinBitForBit) {
  tests::ChangeLimits limits;
  limits.isOfThreeTypes = true;
  limits.hasTwoMasks = true;
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), limits)) {
    ChanDiffChange2 op(static_cast<DiffType2>(c.parameters.type));
    SetNoDataOf(c.parameters, op);
    ASSERT_TRUE(Agree(
        c,
        [&](Raster* image, Raster* reference, Mask* imageMask, Mask* referenceMask, Raster* out) {
          op.Process(image, reference, imageMask, referenceMask, out);
        },
        [&](const Raster& image, const Raster& reference, const Mask* imageMask, const Mask* referenceMask,
            Raster& out) {
          reference::ChanDiffChange2(c.parameters, image, reference, imageMask, referenceMask, out);
        }));
  }
}

INSTANTIATE_TEST_SUITE_P(From, ChanDiffChange2Differential, ::testing::ValuesIn(tests::kShortPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
