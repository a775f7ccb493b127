#include "processes/gridmill/magnitudechange.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/reference/magnitudechange_reference.h"
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

/// The result for one pixel: the lengths and their difference.
template <class Out, class In>
std::vector<Out> Lengths(const MagnitudeChange& magnitude, const std::vector<In>& image,
                         const std::vector<In>& reference, bool isValid = true) {
  Image<In> i({1, 1, static_cast<std::uint32_t>(image.size())});
  std::copy(image.begin(), image.end(), i.Elements());
  Image<In> r({1, 1, static_cast<std::uint32_t>(reference.size())});
  std::copy(reference.begin(), reference.end(), r.Elements());
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1, 3}, {}, 77);
  magnitude.Process(&i, &r, &mask, &out);
  return {out.Elements(), out.Elements() + 3};
}

/// The length of a pixel.
template <class Out, class In>
Out Length(const std::vector<In>& pixel) {
  return Lengths<Out, In>(MagnitudeChange(eDIFF_FORWARD), pixel, {})[0];
}

/// An operator with a test for 0 in an image of `channels` and in any reference, and -5 for no-data.
MagnitudeChange WithNoDataOfZero(std::size_t channels) {
  MagnitudeChange magnitude(eDIFF_FORWARD);
  magnitude.SetNoData(-5.0f);
  magnitude.SetImgNoData(std::vector<float>(channels, 0.0f));
  magnitude.SetRefNoData(std::vector<float>(8, 0.0f));
  return magnitude;
}

// ---- golden

TEST(MagnitudeChange, Pixel3And4Against6And8Gives5And10AndMinus5Forward) {
  const MagnitudeChange magnitude(eDIFF_FORWARD);
  EXPECT_EQ((Lengths<float, float>(magnitude, {3, 4}, {6, 8})), (std::vector<float>{5, 10, -5}));
  EXPECT_EQ((Lengths<float, short>(magnitude, {3, 4}, {6, 8})), (std::vector<float>{5, 10, -5}));
}

TEST(MagnitudeChange, TheSameBackwardOrAbsoluteGives5And10And5) {
  const MagnitudeChange backward(eDIFF_BACKWARD), absolute(eDIFF_ABSOLUTE);
  const std::vector<float> expected = {5, 10, 5};
  EXPECT_EQ((Lengths<float, float>(backward, {3, 4}, {6, 8})), expected);
  EXPECT_EQ((Lengths<float, float>(absolute, {3, 4}, {6, 8})), expected);
  EXPECT_EQ((Lengths<float, float>(absolute, {6, 8}, {3, 4})), (std::vector<float>{10, 5, 5}));
  EXPECT_EQ((Lengths<float, float>(backward, {6, 8}, {3, 4})), (std::vector<float>{10, 5, -5}));
}

TEST(MagnitudeChange, TheSameForwardInUnsignedCharGives5And10And0) {
  const MagnitudeChange magnitude(eDIFF_FORWARD);
  EXPECT_EQ((Lengths<unsigned char, short>(magnitude, {3, 4}, {6, 8})),
            (std::vector<unsigned char>{5, 10, 0}));
}

TEST(MagnitudeChange, EveryOtherTypeIsBackward) {
  for (const int type : {-1, 3, 4, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
    const MagnitudeChange magnitude(static_cast<DiffType>(type));
    EXPECT_EQ((Lengths<short, short>(magnitude, {3, 4}, {6, 8})), (std::vector<short>{5, 10, 5})) << type;
    EXPECT_EQ((Lengths<short, short>(magnitude, {6, 8}, {3, 4})), (std::vector<short>{10, 5, -5})) << type;
  }
}

TEST(MagnitudeChange, OneChannelOfMinus7HasTheMagnitude7) {
  EXPECT_EQ((Length<short, short>({-7})), 7);
  EXPECT_EQ((Length<int, char>({-128})), 128);
  EXPECT_EQ((Length<std::int64_t, std::int64_t>({-3037000499})), 3037000499);
  EXPECT_EQ((Lengths<short, short>(MagnitudeChange(eDIFF_FORWARD), {-7}, {7})),
            (std::vector<short>{7, 7, 0}));
}

TEST(MagnitudeChange, UnsignedShortOf50000HasNoMagnitude) {
  EXPECT_TRUE(std::isnan(Length<float, unsigned short>({50000})));
  EXPECT_TRUE(std::isnan(Length<double, unsigned short>({50000})));
  EXPECT_EQ((Length<unsigned char, unsigned short>({50000})), 0);
  EXPECT_EQ((Length<int, unsigned short>({50000})), std::numeric_limits<int>::min());
  EXPECT_EQ((Length<std::int64_t, unsigned short>({50000})), std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ((Length<std::uint64_t, unsigned short>({50000})), std::uint64_t{1} << 63);
}

TEST(MagnitudeChange, FloatOf1e30HasAnInfiniteMagnitude) {
  EXPECT_EQ((Length<float, float>({1e30f})), kInfinity);
  EXPECT_EQ((Length<double, float>({-1e30f})), static_cast<double>(kInfinity));
  EXPECT_EQ((Length<unsigned char, float>({1e30f})), 255);
  EXPECT_EQ((Length<double, double>({1e30})), 1e30);
}

TEST(MagnitudeChange, ImageOf4ChannelsBesideAReferenceOf2AreTakenOverTheirOwnChannels) {
  const MagnitudeChange magnitude(eDIFF_FORWARD);
  EXPECT_EQ((Lengths<short, short>(magnitude, {1, 1, 1, 1}, {3, 4})), (std::vector<short>{2, 5, -3}));
  EXPECT_EQ((Lengths<short, short>(magnitude, {3, 4}, {1, 1, 1, 1})), (std::vector<short>{5, 2, 3}));
}

TEST(MagnitudeChange, PixelWithANoDataChannelGetsNoDataInAllThreeChannels) {
  const MagnitudeChange magnitude = WithNoDataOfZero(3);
  const std::vector<short> excluded(3, -5);
  for (std::size_t c = 0; c < 3; ++c) {
    std::vector<short> pixel = {1, 2, 2};
    pixel[c] = 0;
    EXPECT_EQ((Lengths<short, short>(magnitude, pixel, {1, 2, 2})), excluded) << c;
    EXPECT_EQ((Lengths<short, short>(magnitude, {1, 2, 2}, pixel)), excluded) << c;
    EXPECT_EQ((Lengths<short, short>(magnitude, pixel, pixel)), excluded) << c;
  }
  EXPECT_EQ((Lengths<short, short>(magnitude, {1, 2, 2}, {1, 2, 2})), (std::vector<short>{3, 3, 0}));
}

TEST(MagnitudeChange, MaskedPixelGetsNoDataInAllThreeChannels) {
  EXPECT_EQ((Lengths<short, short>(MagnitudeChange(eDIFF_FORWARD), {1}, {2}, false)),
            std::vector<short>(3, 0));
  EXPECT_EQ((Lengths<short, short>(WithNoDataOfZero(1), {1}, {2}, false)), std::vector<short>(3, -5));
}

TEST(MagnitudeChange, NoDataIsWrittenThroughClipTo) {
  MagnitudeChange magnitude(eDIFF_FORWARD);
  magnitude.SetNoData(-9999.5f);
  EXPECT_EQ((Lengths<unsigned char, short>(magnitude, {1}, {2}, false)), std::vector<unsigned char>(3, 0));
  EXPECT_EQ((Lengths<short, unsigned char>(magnitude, {1}, {2}, false)), std::vector<short>(3, -10000));
  EXPECT_EQ((Lengths<double, unsigned char>(magnitude, {1}, {2}, false)), std::vector<double>(3, -9999.5));
}

TEST(MagnitudeChange, NoDataIsRoundedInFloat) {
  MagnitudeChange magnitude(eDIFF_FORWARD);
  magnitude.SetNoData(8388609.0f);
  EXPECT_EQ((Lengths<int, short>(magnitude, {1}, {2}, false)), std::vector<int>(3, 8388610));
}

// Deliberate: a square is formed in the sample's own arithmetic, that of `int` for 8 and 16 bits, and wraps
// there: an `unsigned short` above 46340 has a negative square, and the magnitude may be NaN.
TEST(MagnitudeChange, SquareIsFormedInTheSamplesOwnArithmeticAndWrapsThere) {
  EXPECT_EQ((Length<double, unsigned short>({46340})), 46340.0);
  EXPECT_TRUE(std::isnan(Length<double, unsigned short>({46341})));
  EXPECT_EQ((Length<double, unsigned short>({46341, 46340, 46340})), std::sqrt(2147312185.0));
  EXPECT_EQ((Length<double, short>({-32768})), 32768.0);
  EXPECT_EQ((Length<double, unsigned char>({255, 255})), std::sqrt(130050.0));
}

TEST(MagnitudeChange, NegativeSquareCountsInTheSum) {
  // 65535^2 wraps to -131071, 46340^2 stays 2147395600.
  EXPECT_EQ((Length<double, unsigned short>({65535, 46340})), std::sqrt(2147264529.0));
  EXPECT_TRUE(std::isnan(Length<double, unsigned short>({65535, 362})));
  EXPECT_EQ((Length<double, unsigned short>({65535, 363})), std::sqrt(698.0));
}

TEST(MagnitudeChange, SquareOfAnIntWrapsIn32BitsSigned) {
  EXPECT_EQ((Length<double, int>({46340})), 46340.0);
  EXPECT_EQ((Length<double, int>({-46340})), 46340.0);
  EXPECT_TRUE(std::isnan(Length<double, int>({46341})));
  EXPECT_EQ((Length<double, int>({65536})), 0.0);
  EXPECT_EQ((Length<double, int>({65538})), std::sqrt(262148.0));
  EXPECT_EQ((Length<double, int>({std::numeric_limits<int>::min()})), 0.0);
}

TEST(MagnitudeChange, SquareOfAnUnsignedIntWrapsIn32BitsUnsigned) {
  EXPECT_EQ((Length<double, unsigned int>({46341})), 46341.0);
  EXPECT_EQ((Length<double, unsigned int>({65535})), 65535.0);
  EXPECT_EQ((Length<double, unsigned int>({65536})), 0.0);
  EXPECT_EQ((Length<double, unsigned int>({4294967295u})), 1.0);
}

TEST(MagnitudeChange, SquareOf64BitsWrapsIn64Bits) {
  EXPECT_EQ((Length<double, std::int64_t>({3037000499})), std::sqrt(9223372030926249001.0));
  EXPECT_TRUE(std::isnan(Length<double, std::int64_t>({3037000500})));
  EXPECT_EQ((Length<double, std::int64_t>({std::int64_t{1} << 32})), 0.0);
  EXPECT_EQ((Length<double, std::uint64_t>({3037000500u})), std::sqrt(9223372037000250000.0));
  EXPECT_EQ((Length<double, std::uint64_t>({4294967295u})), std::sqrt(18446744065119617025.0));
  EXPECT_EQ((Length<double, std::uint64_t>({std::uint64_t{1} << 32})), 0.0);
  EXPECT_EQ((Length<double, std::uint64_t>({~0ull})), 1.0);
}

TEST(MagnitudeChange, SquareOfAFloatIsRoundedToSinglePrecision) {
  const float sample = 4097.0f;  // its square, 2^24 + 2^13 + 1, has 25 bits
  EXPECT_EQ((Length<double, float>({sample})), std::sqrt(16785408.0));
  EXPECT_EQ((Length<double, double>({4097.0})), 4097.0);
  EXPECT_EQ((Length<double, float>({1e-30f})), 0.0);
  EXPECT_EQ((Length<double, double>({1e-30})), 1e-30);
}

TEST(MagnitudeChange, SumsAndRootsAreInDouble) {
  EXPECT_EQ((Length<double, float>({4096.0f, 1.0f})), std::sqrt(16777217.0));
  EXPECT_EQ((Length<double, double>({0x1p27, 1.0, 1.0})), 0x1p27);
  EXPECT_EQ((Length<double, double>({1.0, 1.0, 0x1p27})), std::sqrt(0x1p54 + 2.0 + 2.0));
  EXPECT_EQ((Length<double, int>({1, 1})), std::sqrt(2.0));
}

TEST(MagnitudeChange, IntegerOutputsAreRoundedByClipTo) {
  const MagnitudeChange magnitude(eDIFF_FORWARD);
  EXPECT_EQ((Lengths<short, double>(magnitude, {2.5}, {5.0})), (std::vector<short>{3, 5, -3}));
  EXPECT_EQ((Lengths<char, short>(magnitude, {1}, {300})), (std::vector<char>{1, 127, -128}));
}

TEST(MagnitudeChange, OutputsOf64BitsAreTruncatedAndNeverNegative) {
  const MagnitudeChange magnitude(eDIFF_FORWARD);
  EXPECT_EQ((Lengths<std::int64_t, double>(magnitude, {2.75}, {5.5})), (std::vector<std::int64_t>{2, 5, 0}));
  EXPECT_EQ((Lengths<std::uint64_t, double>(magnitude, {5.5}, {1.75})),
            (std::vector<std::uint64_t>{5, 1, 3}));
}

TEST(MagnitudeChange, NaNAndInfiniteSamplesFollowTheArithmetic) {
  const MagnitudeChange magnitude(eDIFF_ABSOLUTE);
  EXPECT_TRUE(std::isnan(Length<float, float>({1.0f, kNaN})));
  EXPECT_EQ((Length<float, float>({1.0f, -kInfinity})), kInfinity);
  EXPECT_TRUE(std::isnan((Lengths<float, float>(magnitude, {kInfinity}, {kInfinity})[2])));
  EXPECT_EQ((Lengths<float, float>(magnitude, {1.0f}, {kInfinity})[2]), kInfinity);
}

TEST(MagnitudeChange, NoDataIsComparedInFloatAndWithoutATolerance) {
  MagnitudeChange magnitude(eDIFF_FORWARD);
  magnitude.SetNoData(-5.0f);
  magnitude.SetImgNoData({16777216.0f});
  magnitude.SetRefNoData({1.0f});
  const std::vector<float> excluded(3, -5.0f);
  EXPECT_EQ((Lengths<float, double>(magnitude, {16777217.0}, {7.0})), excluded);
  EXPECT_EQ((Lengths<float, std::uint64_t>(magnitude, {16777217}, {7})), excluded);
  EXPECT_EQ((Lengths<float, double>(magnitude, {16777218.0}, {7.0}))[0], 16777218.0f);
  EXPECT_EQ((Lengths<float, double>(magnitude, {7.0}, {1.0 + 1e-9})), excluded);
  EXPECT_EQ((Lengths<float, double>(magnitude, {7.0}, {1.0 + 1e-7}))[0], 7.0f);
}

TEST(MagnitudeChange, ZerosOfBothSignsAreNoDataOfZeroAndNaNMatchesNothing) {
  EXPECT_EQ((Lengths<short, float>(WithNoDataOfZero(1), {-0.0f}, {1.0f})), std::vector<short>(3, -5));
  MagnitudeChange magnitude(eDIFF_FORWARD);
  magnitude.SetImgNoData({kNaN});
  magnitude.SetRefNoData({kNaN});
  EXPECT_TRUE(std::isnan((Lengths<float, float>(magnitude, {kNaN}, {1.0f})[0])));
}

TEST(MagnitudeChange, NoDataTestNeedsAsManyImageEntriesAsChannelsAndGovernsBothRasters) {
  EXPECT_EQ((Lengths<short, short>(WithNoDataOfZero(2), {0, 3, 4}, {0, 6, 8})),
            (std::vector<short>{5, 10, -5}));
  EXPECT_EQ((Lengths<short, short>(WithNoDataOfZero(0), {0, 3, 4}, {0, 6, 8})),
            (std::vector<short>{5, 10, -5}));
  EXPECT_EQ((Lengths<short, short>(WithNoDataOfZero(3), {1, 3, 4}, {0})), std::vector<short>(3, -5));
}

TEST(MagnitudeChange, EachChannelHasNoDataOfItsOwnAlsoInALongerReference) {
  MagnitudeChange magnitude(eDIFF_FORWARD);
  magnitude.SetNoData(-5.0f);
  magnitude.SetImgNoData({7.0f});
  magnitude.SetRefNoData({1.0f, 2.0f, 3.0f});
  EXPECT_EQ((Lengths<short, short>(magnitude, {1}, {2, 1, 2})), (std::vector<short>{1, 3, -2}));
  EXPECT_EQ((Lengths<short, short>(magnitude, {1}, {9, 9, 3})), std::vector<short>(3, -5));
  EXPECT_EQ((Lengths<short, short>(magnitude, {7}, {9, 9, 9})), std::vector<short>(3, -5));
}

TEST(MagnitudeChange, LengthOfNoChannelsIsZero) {
  EXPECT_EQ((Lengths<short, short>(MagnitudeChange(eDIFF_FORWARD), {}, {3, 4})),
            (std::vector<short>{0, 5, -5}));
}

TEST(MagnitudeChange, EmptyNoDataVectorOfAnImageWithoutChannelsActivatesTheTest) {
  EXPECT_EQ((Lengths<short, short>(WithNoDataOfZero(0), {}, {0, 5})), std::vector<short>(3, -5));
}

TEST(MagnitudeChange, ComplexRastersGiveTheFirstElementsOfTheirPixels) {
  Image<short> image({2, 1, 2}, {}, 0, true), reference({2, 1, 1}, {}, 0, true);
  image.SetPixel(1, 0, {3, 4, 1000, 1000});
  reference.SetPixel(1, 0, {2, 1000});
  Image<short> out({2, 1, 2}, {}, 77, true);
  MagnitudeChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(std::vector<short>(&out.At(1, 0), &out.At(1, 0) + 4), (std::vector<short>{5, 2, 3, 77}));
}

TEST(MagnitudeChange, ReferenceOfAnotherTypeIsReadAsTheImagesFromItsOwnAddresses) {
  Image<short> image({2, 1}, {}, 10);
  Image<int> reference({2, 1}, {}, 0x00020001);
  reference.SetPixel(1, 0, {0x00040003});
  Image<short> out({2, 1, 3});
  MagnitudeChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 1), 1);
  EXPECT_EQ(out.At(1, 0, 1), 3);
}

TEST(MagnitudeChange, ChannelsBehindTheThirdKeepTheirBits) {
  Image<short> image({2, 1}, {}, 40), reference({2, 1}, {}, 4);
  Image<short> out({2, 1, 5}, {}, 77);
  Mask mask(2, 1);
  mask.SetValid(1, 0, false);
  MagnitudeChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  EXPECT_EQ(std::vector<short>(&out.At(0, 0), &out.At(0, 0) + 10),
            (std::vector<short>{40, 4, 36, 77, 77, 0, 0, 0, 77, 77}));
}

TEST(MagnitudeChange, EmptyImageWritesNothing) {
  for (const tests::Size size : {tests::Size{3, 0}, tests::Size{0, 3}}) {
    Image<short> image(size, {1, 1}, 5), reference(size, {1, 1}, 6);
    Image<short> out({3, 3, 3}, {1, 1});
    FillBytes(out);
    MagnitudeChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

// ---- differential

constexpr tests::ChangeLimits kLimits = {.read = [](std::uint32_t, std::uint32_t n) { return n; },
                                         .written = [](std::uint32_t, std::uint32_t) { return 3u; }};

struct MagnitudeChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(MagnitudeChangeDifferential, AgreesWithTheTwinBitForBit) {
  for (tests::ChangeCase c : tests::ChangeCasesFrom(GetParam(), kLimits)) {
    // The samples around which squares begin to wrap.
    c.extra.insert(c.extra.end(),
                   {46340, 46341, -46341, 65535, 65536, 3037000499., 3037000500., 4294967296.});
    MagnitudeChange magnitude(static_cast<DiffType>(c.parameters.type));
    SetNoDataOf(c.parameters, magnitude);
    const auto params = tests::ParamsOf<details::MagnitudeParams>(c.parameters);
    ASSERT_TRUE(Agree(
        c,
        [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
          magnitude.Process(image, reference, mask, out);
        },
        [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
          reference::MagnitudeChange(params, image, reference, mask, out);
        }));
  }
}

INSTANTIATE_TEST_SUITE_P(From, MagnitudeChangeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
