#include "processes/gridmill/vegindex.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <sys/mman.h>
#include <unistd.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/conversions.h"
#include "tests/reference/vegindex_reference.h"
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

using Codes = std::vector<unsigned int>;

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr std::size_t kRoles = 7;
constexpr std::size_t kIndices = 12;
const Codes kEachRoleOnce = {0, 1, 2, 3, 4, 5, 6};

/// The bands of a pixel: blue, green, red, red edge, near infrared, first and second shortwave infrared.
using Bands = std::array<double, kRoles>;

/// Requests for the indices with the given codes.
Codes RequestsOf(const Codes& codes) {
  Codes requests(kIndices, 0);
  for (const unsigned int code : codes) requests[code] = 1;
  return requests;
}

VegIndex OperatorOf(Codes requests, Codes roles) {
  VegIndex index;
  index.SetRequestedIndex(std::move(requests));
  index.SetBandIndex(std::move(roles));
  return index;
}

/// The index with the code `code` of one pixel.
template <class Out = double, class In = float>
Out IndexOf(unsigned int code, const Bands& bands, bool isValid = true) {
  Image<In> in({1, 1, kRoles});
  for (std::size_t c = 0; c < kRoles; ++c) in.Elements()[c] = reference::PlainCast<In>(bands[c]);
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1});
  OperatorOf(RequestsOf({code}), kEachRoleOnce).Process(&in, &mask, &out);
  return out.At(0, 0);
}

/// Bands of which only green, red, red edge and near infrared count.
Bands Vegetation(double green, double red, double redEdge, double nir) {
  return {0, green, red, redEdge, nir, 0, 0};
}
Bands RedAndNir(double red, double nir) { return Vegetation(0, red, 0, nir); }

/// What `index` makes of one pixel of two channels, 1 and 3, of the type `In`, in its first output channel.
template <class Out, class In>
Out IndexOf1And3(const VegIndex& index) {
  Image<In> in({1, 1, 2});
  in.SetPixel(0, 0, {1, 3});
  Image<Out> out({1, 1, kIndices});
  index.Process(&in, nullptr, &out);
  return out.At(0, 0);
}

// ---- golden: the indices

TEST(VegIndex, NgrdiIsTheNormalisedDifferenceOfGreenAndRed) {
  EXPECT_EQ(IndexOf(eINDEX_NGRDI, Vegetation(3, 1, 0, 0)), 0.5);
  EXPECT_EQ(IndexOf(eINDEX_NGRDI, Vegetation(1, 3, 0, 0)), -0.5);
  EXPECT_EQ(IndexOf(eINDEX_NGRDI, Vegetation(0, 0, 9, 9)), 0.0);
  EXPECT_EQ(IndexOf(eINDEX_NGRDI, Vegetation(2, -2, 9, 9)), 0.0);
}

TEST(VegIndex, NgrdiHasNoLimit) {
  EXPECT_EQ(IndexOf(eINDEX_NGRDI, Vegetation(3, -1, 0, 0)), 2.0);
  EXPECT_EQ(IndexOf(eINDEX_NGRDI, Vegetation(-1, 3, 0, 0)), -2.0);
}

TEST(VegIndex, ExcessGreenIsScaledBy255ForAllPixelTypes) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class In>() {
      EXPECT_EQ((IndexOf<double, In>(eINDEX_EXCESS_GREEN, {2, 10, 4, 99, 99, 99, 99})), 131.0) << type;
      EXPECT_EQ((IndexOf<double, In>(eINDEX_EXCESS_GREEN, {0, 0, 0, 9, 9, 9, 9})), 127.5) << type;
    });
  }
}

TEST(VegIndex, DviIsTheDifferenceOfNearInfraredAndRed) {
  EXPECT_EQ(IndexOf(eINDEX_DVI, RedAndNir(0.25, 0.75)), 0.5);
  EXPECT_EQ(IndexOf(eINDEX_DVI, RedAndNir(7, 3)), -4.0);
  EXPECT_EQ(IndexOf(eINDEX_DVI, RedAndNir(-0x1p30, 1)), 0x1p30 + 1);
}

TEST(VegIndex, RviIsTheRatioOfNearInfraredAndRed) {
  EXPECT_EQ(IndexOf(eINDEX_RVI, RedAndNir(0.25, 0.75)), 3.0);
  EXPECT_EQ(IndexOf(eINDEX_RVI, RedAndNir(3, 1)), 1.0 / 3.0);
  EXPECT_EQ(IndexOf(eINDEX_RVI, RedAndNir(0, 5)), 0.0);
  EXPECT_EQ(IndexOf(eINDEX_RVI, RedAndNir(-0.0, 5)), 0.0);
}

TEST(VegIndex, NdviIsTheNormalisedDifferenceOfNearInfraredAndRed) {
  EXPECT_EQ(IndexOf(eINDEX_NDVI, RedAndNir(0.25, 0.75)), 0.5);
  EXPECT_EQ(IndexOf(eINDEX_NDVI, RedAndNir(2, 1)), -1.0 / 3.0);
  EXPECT_EQ(IndexOf(eINDEX_NDVI, RedAndNir(0, 0)), 0.0);
  EXPECT_EQ(IndexOf(eINDEX_NDVI, RedAndNir(-3, 3)), 0.0);
}

TEST(VegIndex, NdviAndSaviNeverLeaveTheRangeFromMinus1To1) {
  EXPECT_EQ(IndexOf(eINDEX_NDVI, RedAndNir(-1, 3)), 1.0);
  EXPECT_EQ(IndexOf(eINDEX_NDVI, RedAndNir(3, -1)), -1.0);
  EXPECT_EQ(IndexOf(eINDEX_SAVI, RedAndNir(0, 100)), 1.0);
  EXPECT_EQ(IndexOf(eINDEX_SAVI, RedAndNir(100, 0)), -1.0);
}

TEST(VegIndex, TviIsARootNarrowedToFloat) {
  EXPECT_EQ(IndexOf(eINDEX_TVI, RedAndNir(1, 3)), 1.0);
  EXPECT_EQ(IndexOf(eINDEX_TVI, RedAndNir(0, 1)), static_cast<double>(1.2247449f));
  EXPECT_EQ(IndexOf(eINDEX_TVI, RedAndNir(3, 1)), 0.0);
  EXPECT_EQ(IndexOf(eINDEX_TVI, RedAndNir(-5, 5)), 0.0);
  EXPECT_EQ(IndexOf(eINDEX_TVI, RedAndNir(-1, 3)), static_cast<double>(std::sqrt(2.5f)));  // no limit
}

TEST(VegIndex, SaviHasASoilFactorOfOneHalf) {
  EXPECT_EQ(IndexOf(eINDEX_SAVI, RedAndNir(0.25, 0.75)), 0.5);
  EXPECT_EQ(IndexOf(eINDEX_SAVI, RedAndNir(1, 2)), (1.0 / 3.5) * 1.5);
  EXPECT_EQ(IndexOf(eINDEX_SAVI, RedAndNir(0.25, -0.75)), 0.0);
}

TEST(VegIndex, Msavi2FollowsItsFormula) {
  EXPECT_EQ(IndexOf(eINDEX_MSAVI2, RedAndNir(0.25, 0.75)), 1.0);
  EXPECT_EQ(IndexOf(eINDEX_MSAVI2, RedAndNir(0, 0)), 0.5);
}

TEST(VegIndex, GemiFollowsItsFormula) {
  EXPECT_DOUBLE_EQ(IndexOf(eINDEX_GEMI, RedAndNir(0.25, 0.75)), 0.9375 - 0.125 / 0.75);
  EXPECT_EQ(IndexOf(eINDEX_GEMI, RedAndNir(0, 0)), 0.125);
}

TEST(VegIndex, GemiIs0WhereRedIsExactly1) {
  for (const double nir : {0.0, 0.5, -1.5, 1e30, kInfinity, kNaN})
    EXPECT_EQ(IndexOf(eINDEX_GEMI, RedAndNir(1, nir)), 0.0) << nir;
  EXPECT_NE(IndexOf(eINDEX_GEMI, RedAndNir(1 + 0x1p-23, 0.5)), 0.0);
}

TEST(VegIndex, GemiTakesAnEtaOf0WhereItsDivisorIs0) {
  EXPECT_EQ(IndexOf(eINDEX_GEMI, RedAndNir(0.25, -0.75)), -(0.125 / 0.75));
}

// Deliberate: the greenness weight of the second shortwave band is -1.18, not the -0.18 of the literature.
TEST(VegIndex, GreennessWeightOfTheSecondShortwaveBandIsMinus118) {
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 0, 0, 0, 0, 0, 1}), -1.18);
}

TEST(VegIndex, GreennessIsAWeightedSumOfSixBands) {
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {1, 0, 0, 0, 0, 0, 0}), -0.2848);
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 1, 0, 0, 0, 0, 0}), -0.2435);
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 0, 1, 0, 0, 0, 0}), -0.5436);
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 0, 0, 9, 0, 0, 0}), 0.0);
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 0, 0, 0, 1, 0, 0}), 0.7243);
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 0, 0, 0, 0, 1, 0}), 0.084);
}

TEST(VegIndex, GreennessIsAddedFromTheLeft) {
  // each of the last two terms is below half a unit of the sum, both together are above
  EXPECT_EQ(IndexOf(eINDEX_GREENNESS, {0, 0x1p55, 0, 0, 0, 5, -0.25}), 0x1p55 * -0.2435);
}

TEST(VegIndex, McariFollowsItsFormula) {
  EXPECT_DOUBLE_EQ(IndexOf(eINDEX_MCARI, Vegetation(0.125, 0.25, 0.5, 9)), 0.35);
  EXPECT_EQ(IndexOf(eINDEX_MCARI, Vegetation(0.125, 0, 0.5, 9)), 0.0);
}

TEST(VegIndex, Mtvi1FollowsItsFormula) {
  EXPECT_DOUBLE_EQ(IndexOf(eINDEX_MTVI1, Vegetation(0.125, 0.25, 9, 0.75)), 0.525);
}

// Deliberate: TVI and MSAVI2 do not test what is under the root; they are NaN where it is negative.
TEST(VegIndex, TviAndMsavi2AreNaNWhereTheRadicandIsNegative) {
  EXPECT_TRUE(std::isnan(IndexOf(eINDEX_TVI, RedAndNir(3, 0.5))));
  EXPECT_TRUE(std::isnan(IndexOf<float>(eINDEX_TVI, RedAndNir(3, 0.5))));
  EXPECT_TRUE(std::isnan(IndexOf(eINDEX_MSAVI2, RedAndNir(-1, 0.5))));
  EXPECT_TRUE(std::isnan(IndexOf<float>(eINDEX_MSAVI2, RedAndNir(-1, 0.5))));
}

TEST(VegIndex, NaNIsTheIndefiniteValueOnIntegerOutputs) {
  const Bands bands = RedAndNir(3, 0);
  EXPECT_EQ(IndexOf<char>(eINDEX_TVI, bands), 0);
  EXPECT_EQ(IndexOf<unsigned char>(eINDEX_TVI, bands), 0);
  EXPECT_EQ(IndexOf<short>(eINDEX_TVI, bands), 0);
  EXPECT_EQ(IndexOf<unsigned short>(eINDEX_TVI, bands), 0);
  EXPECT_EQ(IndexOf<int>(eINDEX_TVI, bands), std::numeric_limits<int>::min());
  EXPECT_EQ(IndexOf<unsigned int>(eINDEX_TVI, bands), 0u);
  EXPECT_EQ(IndexOf<std::int64_t>(eINDEX_TVI, bands), std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ(IndexOf<std::uint64_t>(eINDEX_TVI, bands), std::uint64_t{1} << 63);
}

// ---- golden: types

// Deliberate: samples pass through `float`, `double` ones too. An `int` of 16777217 counts as 16777216.
TEST(VegIndex, SamplesPassThroughFloatDoubleOnesToo) {
  EXPECT_EQ((IndexOf<double, int>(eINDEX_DVI, RedAndNir(0, 16777217))), 16777216.0);
  EXPECT_EQ((IndexOf<double, unsigned int>(eINDEX_DVI, RedAndNir(0, 4294967295.0))), 4294967296.0);
  EXPECT_EQ((IndexOf<double, double>(eINDEX_DVI, RedAndNir(0, 0.1))), static_cast<double>(0.1f));
  EXPECT_EQ((IndexOf<double, double>(eINDEX_DVI, RedAndNir(0, 1e300))), kInfinity);
  EXPECT_EQ((IndexOf<double, std::int64_t>(eINDEX_DVI, RedAndNir(0, -16777217))), -16777216.0);
}

TEST(VegIndex, SamplesOf64BitsAreRoundedOnceAndUnsignedOnesCountWithTheirTrueValue) {
  Image<std::int64_t> in({1, 1});
  in.At(0, 0) = (std::int64_t{1} << 60) + (std::int64_t{1} << 36) + 1;  // as a `double` a tie of `float`s
  Image<std::uint64_t> inUnsigned({1, 1}, {}, ~std::uint64_t{0});
  Image<double> out({1, 1});
  OperatorOf(RequestsOf({eINDEX_DVI}), {eBAND_NIR}).Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 0x1p60 + 0x1p37);
  OperatorOf(RequestsOf({eINDEX_DVI}), {eBAND_NIR}).Process(&inUnsigned, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 0x1p64);
}

TEST(VegIndex, NarrowSamplesAreExact) {
  EXPECT_EQ((IndexOf<double, char>(eINDEX_DVI, RedAndNir(127, -128))), -255.0);
  EXPECT_EQ((IndexOf<double, unsigned char>(eINDEX_DVI, RedAndNir(0, 255))), 255.0);
  EXPECT_EQ((IndexOf<double, short>(eINDEX_DVI, RedAndNir(32767, -32768))), -65535.0);
  EXPECT_EQ((IndexOf<double, unsigned short>(eINDEX_DVI, RedAndNir(0, 65535))), 65535.0);
}

TEST(VegIndex, ResultsAreRoundedOnIntegerOutputsUpTo32Bits) {
  EXPECT_EQ(IndexOf<char>(eINDEX_DVI, RedAndNir(0, 2.5)), 3);
  EXPECT_EQ(IndexOf<char>(eINDEX_DVI, RedAndNir(0, -2.5)), -3);
  EXPECT_EQ(IndexOf<char>(eINDEX_DVI, RedAndNir(0, 126.5)), 127);
  EXPECT_EQ(IndexOf<char>(eINDEX_DVI, RedAndNir(0, -128.75)), -128);
  EXPECT_EQ(IndexOf<unsigned char>(eINDEX_DVI, RedAndNir(0, 254.5)), 255);
  EXPECT_EQ(IndexOf<unsigned char>(eINDEX_DVI, RedAndNir(0, 300)), 255);
  EXPECT_EQ(IndexOf<unsigned char>(eINDEX_DVI, RedAndNir(0, -1)), 0);
  EXPECT_EQ(IndexOf<short>(eINDEX_DVI, RedAndNir(0, -1e6)), -32768);
  EXPECT_EQ(IndexOf<short>(eINDEX_DVI, RedAndNir(0, 1e6)), 32767);
  EXPECT_EQ(IndexOf<unsigned short>(eINDEX_DVI, RedAndNir(0, 65534.5)), 65535);
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(0, 5.5)), 6);
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(0, 3e9)), 2147483647);
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(0, -3e9)), std::numeric_limits<int>::min());
  EXPECT_EQ(IndexOf<unsigned int>(eINDEX_DVI, RedAndNir(0, 1e10)), 4294967295u);
  EXPECT_EQ(IndexOf<unsigned int>(eINDEX_DVI, RedAndNir(0, -0.25)), 0u);
}

TEST(VegIndex, ResultsAreConvertedFromDouble) {
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(1, 16777216)), 16777215);
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(-1, 16777216)), 16777217);
  EXPECT_EQ(IndexOf<unsigned int>(eINDEX_DVI, RedAndNir(128, 4294967296.0)), 4294967168u);
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(-0x1p-26, 0.5)), 1);
  EXPECT_EQ(IndexOf<int>(eINDEX_DVI, RedAndNir(0x1p-26, 0.5)), 0);
  EXPECT_EQ(IndexOf<float>(eINDEX_RVI, RedAndNir(3, 1)), static_cast<float>(1.0 / 3.0));
}

TEST(VegIndex, ResultsAreTruncatedOn64BitOutputsAndNegativeOnesBecome0) {
  EXPECT_EQ(IndexOf<std::int64_t>(eINDEX_DVI, RedAndNir(0, 5.9)), 5);
  EXPECT_EQ(IndexOf<std::int64_t>(eINDEX_DVI, RedAndNir(0, -5.9)), 0);
  EXPECT_EQ(IndexOf<std::int64_t>(eINDEX_DVI, RedAndNir(0, 1e30)), std::numeric_limits<std::int64_t>::max());
  EXPECT_EQ(IndexOf<std::uint64_t>(eINDEX_DVI, RedAndNir(0, 5.9)), 5u);
  EXPECT_EQ(IndexOf<std::uint64_t>(eINDEX_DVI, RedAndNir(0, -5.9)), 0u);
  EXPECT_EQ(IndexOf<std::uint64_t>(eINDEX_DVI, RedAndNir(0, 0x1p63)), std::uint64_t{1} << 63);
  EXPECT_EQ(IndexOf<std::uint64_t>(eINDEX_DVI, RedAndNir(0, 1e30)), ~std::uint64_t{0});
}

// ---- golden: the mask

// Deliberate: an excluded pixel holds `ClipTo` of -1e20: the least value of `char`, `short` and `int`, 0 for
// unsigned and 64-bit outputs.
TEST(VegIndex, ExcludedPixelHoldsClipToOfMinus1e20) {
  const Bands bands = RedAndNir(1, 3);
  EXPECT_EQ(IndexOf<char>(eINDEX_NDVI, bands, false), -128);
  EXPECT_EQ(IndexOf<unsigned char>(eINDEX_NDVI, bands, false), 0);
  EXPECT_EQ(IndexOf<short>(eINDEX_NDVI, bands, false), -32768);
  EXPECT_EQ(IndexOf<unsigned short>(eINDEX_NDVI, bands, false), 0);
  EXPECT_EQ(IndexOf<int>(eINDEX_NDVI, bands, false), std::numeric_limits<int>::min());
  EXPECT_EQ(IndexOf<unsigned int>(eINDEX_NDVI, bands, false), 0u);
  EXPECT_EQ(IndexOf<float>(eINDEX_NDVI, bands, false), -1e20f);
  EXPECT_EQ(IndexOf<double>(eINDEX_NDVI, bands, false), -1e20);
  EXPECT_EQ(IndexOf<std::int64_t>(eINDEX_NDVI, bands, false), 0);
  EXPECT_EQ(IndexOf<std::uint64_t>(eINDEX_NDVI, bands, false), 0u);
}

TEST(VegIndex, ExcludedPixelHoldsNoDataInEveryRequestedChannelWhateverItsSamples) {
  Image<float> in({3, 1, 2}, {}, 1.0f);
  in.SetPixel(1, 0, {std::numeric_limits<float>::quiet_NaN(), std::numeric_limits<float>::signaling_NaN()});
  Mask mask(3, 1);
  mask.SetValid(1, 0, false);
  Image<float> out({3, 1, 3}, {}, 77.0f);
  OperatorOf(RequestsOf({eINDEX_DVI, eINDEX_RVI}), {eBAND_RED, eBAND_NIR}).Process(&in, &mask, &out);
  EXPECT_EQ(std::vector<float>(out.Elements(), out.Elements() + 9),
            (std::vector<float>{0, 1, 77, -1e20f, -1e20f, 77, 0, 1, 77}));
}

/// A raster of two rows, one page of memory each, of which the second cannot be read.
struct HalfReadable {
  std::size_t page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
  void* memory = mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
  Raster raster;

  HalfReadable(DataType type, std::uint32_t channels)
      : raster({static_cast<std::uint32_t>(page) / (type.sizeBits / 8 * channels), 2, channels, type}, {},
               static_cast<unsigned char*>(memory)) {
    std::fill_n(raster.data, page, static_cast<unsigned char>(1));
    mprotect(raster.data + page, page, PROT_NONE);
  }
  HalfReadable(const HalfReadable&) = delete;
  HalfReadable& operator=(const HalfReadable&) = delete;
  ~HalfReadable() { munmap(memory, 2 * page); }
};

TEST(VegIndex, SamplesOfARowOfExcludedPixelsAreNotRead) {
  for (const std::uint32_t channels : {1u, 4u}) {
    for (const Codes& requests : {RequestsOf({eINDEX_RVI}), Codes(kIndices, 1)}) {
      HalfReadable in(tessel::eDT_16U, channels);
      ASSERT_NE(in.memory, MAP_FAILED);
      const std::uint32_t width = in.raster.width, indices = requests == Codes(kIndices, 1) ? kIndices : 1;
      Mask mask(width, 2);
      for (std::uint32_t x = 0; x < width; ++x) mask.SetValid(static_cast<int>(x), 1, false);
      Image<float> out({width, 2, indices});
      OperatorOf(requests, {eBAND_RED, eBAND_NIR, eBAND_GREEN, eBAND_RED_EDGE})
          .Process(&in.raster, &mask, &out);
      for (int x = 0; x < static_cast<int>(width); ++x) {
        ASSERT_NE(out.At(x, 0, indices - 1), -1e20f);
        for (std::uint32_t c = 0; c < indices; ++c) ASSERT_EQ(out.At(x, 1, c), -1e20f);
      }
    }
  }
}

TEST(VegIndex, MaskBitsArePickedByTheMasksOwnGeometry) {
  Image<short> in({3, 2}, {1, 1}, 9), out({3, 2}, {2, 0}, 77);
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  OperatorOf(RequestsOf({eINDEX_DVI}), {eBAND_NIR}).Process(&in, &mask, &out);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, y), x == 1 && y == 1 ? -32768 : 9) << x << ", " << y;
  }
}

// ---- golden: requests and roles

TEST(VegIndex, RequestedIndicesComeInTheOrderOfTheirCodes) {
  Image<float> in({1, 1, 2});
  in.SetPixel(0, 0, {1, 3});
  Image<double> out({1, 1, 2});
  OperatorOf(RequestsOf({eINDEX_GREENNESS, eINDEX_NDVI}), {eBAND_RED, eBAND_NIR}).Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 0), 0.5);
  EXPECT_EQ(out.At(0, 0, 1), -0.5436 + 3 * 0.7243);
}

// Deliberate: only a request of exactly 1 counts.
TEST(VegIndex, OnlyARequestOfExactly1Counts) {
  Codes requests(kIndices, 2);
  requests[eINDEX_DVI] = 1;
  requests[eINDEX_NGRDI] = 4294967295u;
  requests[eINDEX_RVI] = 0;
  Image<float> in({1, 1, 2});
  in.SetPixel(0, 0, {1, 3});
  Image<float> out({1, 1, kIndices}, {}, 77.0f);
  OperatorOf(requests, {eBAND_RED, eBAND_NIR}).Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 0), 2.0f);
  for (std::uint32_t c = 1; c < kIndices; ++c) EXPECT_EQ(out.At(0, 0, c), 77.0f) << c;
}

TEST(VegIndex, WithNoRequestNothingIsWritten) {
  Image<float> in({30, 3, 2}, {1, 1}, 3.0f);
  Image<float> out({30, 3, 2}, {1, 1});
  Mask mask(30, 3, {1, 1}, false);
  for (const unsigned int entry : {0u, 2u}) {
    FillBytes(out);
    OperatorOf(Codes(kIndices, entry), {eBAND_RED, eBAND_NIR}).Process(&in, nullptr, &out);
    OperatorOf(Codes(kIndices, entry), {eBAND_RED, eBAND_NIR}).Process(&in, &mask, &out);
    EXPECT_TRUE(IsUntouched(out)) << entry;
  }
}

TEST(VegIndex, EntriesBehindTheTwelfthAndRolesBehindTheLastChannelAreIgnored) {
  Codes requests = RequestsOf({eINDEX_DVI});
  requests.insert(requests.end(), {1, 1, 1});
  EXPECT_EQ((IndexOf1And3<float, short>(OperatorOf(requests, {eBAND_RED, eBAND_NIR, eBAND_NIR}))), 2.0f);
}

// Deliberate: a band without a channel is 0 at every pixel; of two channels with one role the later counts.
TEST(VegIndex, BandWithoutAChannelIs0AtEveryPixel) {
  Image<float> in({3, 1});
  in.SetPixel(0, 0, {5.0f, 0.0f, 0.25f});
  Image<float> out({3, 1, 2});
  OperatorOf(RequestsOf({eINDEX_DVI, eINDEX_NDVI}), {eBAND_RED}).Process(&in, nullptr, &out);
  EXPECT_EQ(std::vector<float>(out.Elements(), out.Elements() + 6),
            (std::vector<float>{-5, -1, 0, 0, -0.25f, -1}));
}

TEST(VegIndex, OfTwoChannelsWithOneRoleTheLaterCounts) {
  const Codes requests = RequestsOf({eINDEX_DVI});
  EXPECT_EQ((IndexOf1And3<float, short>(OperatorOf(requests, {eBAND_NIR, eBAND_NIR}))), 3.0f);
  EXPECT_EQ((IndexOf1And3<float, short>(OperatorOf(requests, {eBAND_RED, eBAND_RED}))), -3.0f);
}

TEST(VegIndex, ChannelOfAnotherRoleIsUsedByNoIndex) {
  const Codes requests = RequestsOf({eINDEX_DVI});
  for (const unsigned int role : {7u, 8u, 255u, 4294967295u})
    EXPECT_EQ((IndexOf1And3<float, short>(OperatorOf(requests, {eBAND_NIR, role}))), 1.0f) << role;
}

TEST(VegIndex, ZeroChannelsGiveTheIndicesOfBandsOf0) {
  Image<float> in({2, 1, 0});
  Image<double> out({2, 1, kIndices});
  OperatorOf(Codes(kIndices, 1), {}).Process(&in, nullptr, &out);
  for (int x = 0; x < 2; ++x) {
    const std::vector<double> pixel(&out.At(x, 0), &out.At(x, 0) + kIndices);
    EXPECT_EQ(pixel, (std::vector<double>{0, 127.5, 0, 0, 0, 0, 0, 0.5, 0.125, 0, 0, 0}));
  }
}

TEST(VegIndex, HeightOrWidthOfZeroLeavesTheOutputUntouched) {
  for (const tests::Size size : {tests::Size{4, 0, 2}, tests::Size{0, 4, 2}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({size.width, size.height, 2}, {1, 1});
    FillBytes(out);
    OperatorOf(RequestsOf({eINDEX_DVI, eINDEX_RVI}), {eBAND_RED, eBAND_NIR}).Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(VegIndex, LargerOutputKeepsItsOtherPixelsAndChannels) {
  Image<short> in({3, 2}, {1, 2}, 15);
  Image<short> out({5, 4, 2}, {2, 1}, 77);
  OperatorOf(RequestsOf({eINDEX_DVI}), {eBAND_NIR}).Process(&in, nullptr, &out);
  for (int y = -1; y < 5; ++y) {
    for (int x = -2; x < 7; ++x) {
      const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 2;
      EXPECT_EQ(out.At(x, y, 0), isInside ? 15 : 77) << x << ", " << y;
      EXPECT_EQ(out.At(x, y, 1), 77) << x << ", " << y;
    }
  }
}

TEST(VegIndex, InputThatCountsAsLargerThanTheCachesHasTheSameIndices) {
  for (const bool alone : {false, true}) {
    Image<unsigned short> in({700, 2, 4});
    in.Set([](int x, int y, std::uint32_t c) { return (y + 3) * (c == 2 ? x % 7 + 2 : 1); });
    in.dataSize = std::uint64_t{1} << 30;
    const std::uint32_t indices = alone ? 1 : 2;
    Image<float> out({700, 2, indices});
    OperatorOf(RequestsOf(alone ? Codes{eINDEX_RVI} : Codes{eINDEX_DVI, eINDEX_RVI}),
               {eBAND_GREEN, eBAND_RED, eBAND_NIR, eBAND_BLUE})
        .Process(&in, nullptr, &out);
    for (int x = 0; x < 700; ++x) {
      for (int y = 0; y < 2; ++y) {
        const int ratio = x % 7 + 2, difference = (y + 3) * (ratio - 1);
        ASSERT_EQ(out.At(x, y, indices - 1), static_cast<float>(ratio)) << x << ", " << y;
        ASSERT_EQ(out.At(x, y), static_cast<float>(alone ? ratio : difference)) << x << ", " << y;
      }
    }
  }
}

TEST(VegIndex, ParametersAreEmptyByDefault) {
  const VegIndex index;
  EXPECT_TRUE(index.requestedIndex.empty());
  EXPECT_TRUE(index.bandIndex.empty());
}

// ---- failures

TEST(VegIndexFailure, TypesOutsideTheListAreInvalidComplexOnesIncluded) {
  std::vector<DataType> types = {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)};
  for (const PixelType& type : tests::kPixelTypes) types.push_back(DataType(type.element, true));
  Image<short> real({3, 2}, {1, 1}, 7);
  FillBytes(real);
  for (const DataType& type : types) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    const VegIndex index = OperatorOf(RequestsOf({eINDEX_DVI}), {eBAND_NIR});
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { index.Process(&odd, nullptr, &real); }));
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { index.Process(&real, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(odd));
    EXPECT_TRUE(IsUntouched(real));
  }
}

// ---- differential

/// Values that bring divisors and radicands to 0 and below, and quotients to the middle between integers.
constexpr double kFew[] = {0, 1, -1, 0.25, -0.75, 3, 5, 2, -0.5};
constexpr double kOdd[] = {0, -0.0, 1, kInfinity, -kInfinity, kNaN, 1e38, -3.4e38, 1e-40};
constexpr double kExtra[] = {0,    1,     -1,   0.25,  -0.25,     -0.75, 0.5,       -0.5,  2,
                             3,    -3,    5,    7,     255,       -255,  65535,     32767, -32768,
                             1e38, -1e38, 1e20, 1e-40, 16777217., 1e300, kInfinity, kNaN,  -0.0};

Codes DrawRequests(tests::Random& random) {
  constexpr unsigned int kOthers[] = {0, 0, 2, 3, 255, 4294967295u};
  const std::uint32_t kind = random.Below(8);
  Codes requests(kIndices);
  for (unsigned int& entry : requests) {
    const bool isRequested = kind == 0 || (kind != 1 && random.OneIn(kind < 5 ? 2 : 6));
    entry = isRequested ? 1 : random.Pick(kOthers);
  }
  if (random.OneIn(3)) requests[random.Below(kIndices)] = 1;
  if (random.OneIn(4)) requests.push_back(1);
  return requests;
}

/// A role for each channel: mostly each once, sometimes repeated, unused or missing.
Codes DrawRoles(tests::Random& random, std::uint32_t channels) {
  constexpr unsigned int kUnused[] = {7, 8, 100, 4294967295u};
  Codes shuffled = kEachRoleOnce;
  for (std::uint32_t i = kRoles; i > 1; --i) std::swap(shuffled[i - 1], shuffled[random.Below(i)]);
  Codes roles(channels + (random.OneIn(4) ? 3 : 0));
  for (std::size_t c = 0; c < roles.size(); ++c) {
    roles[c] = c < kRoles ? shuffled[c] : random.Below(9);
    if (random.OneIn(8)) roles[c] = random.OneIn(2) ? random.Pick(kUnused) : random.Below(kRoles);
  }
  return roles;
}

/// A case without what this operator refuses, with more channels and sometimes wider than all blocks.
tests::Case Adapted(tests::Case c, const VegIndex& index, tests::Random& random) {
  c.in.isComplex = false;
  if (c.size.channels < 10 && random.OneIn(60))
    c.size = {2000 + random.Below(2200), 1 + random.Below(2), c.size.channels};
  const auto last = index.requestedIndex.begin() + kIndices;
  const auto requested = static_cast<std::uint32_t>(std::count(index.requestedIndex.begin(), last, 1u));
  c.outChannels = requested + (random.OneIn(3) ? 1 + random.Below(3) : 0);
  return c;
}

/// Makes the operator take the output for one that is larger than the caches.
constexpr std::uint64_t kLarge = std::uint64_t{1} << 30;

struct VegIndexDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(VegIndexDifferential, AgreesWithTheTwinBitForBit) {
  for (tests::Case drawn : tests::CasesFrom(GetParam(), {})) {
    tests::Random random(~drawn.seed);
    if (drawn.size.channels < 5 && random.OneIn(2)) drawn.size.channels = 5 + random.Below(5);
    const VegIndex index = OperatorOf(DrawRequests(random), DrawRoles(random, drawn.size.channels));
    const tests::Case c = Adapted(drawn, index, random);
    const bool isLarge = random.OneIn(4);
    const auto process = [&](Raster* in, Mask* mask, Raster* out) {
      const std::uint64_t size = out->dataSize;
      if (isLarge) out->dataSize = kLarge;
      index.Process(in, mask, out);
      out->dataSize = size;
    };
    const auto twin = [&](const Raster& in, const Mask* mask, Raster& out) {
      reference::VegIndex(index, in, mask, out);
    };
    ASSERT_TRUE(Agree(c, kExtra, process, twin))
        << "requestedIndex " << ::testing::PrintToString(index.requestedIndex) << ", bandIndex "
        << ::testing::PrintToString(index.bandIndex);
  }
}

/// Compares operator and twin on one input and all indices, for all output types.
::testing::AssertionResult AgreesForAllOutputs(const Codes& roles, Raster& in) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster expected({in.width, in.height, kIndices, type.element}, {});
    Raster actual({in.width, in.height, kIndices, type.element}, {});
    const VegIndex index = OperatorOf(Codes(kIndices, 1), roles);
    reference::VegIndex(index, in, nullptr, expected);
    index.Process(&in, nullptr, &actual);
    ::testing::AssertionResult result = tests::SameBits(expected, actual);
    if (!result) return result << ", from " << tests::NameOf(in.dataType);
  }
  return ::testing::AssertionSuccess();
}

TEST_P(VegIndexDifferential, AgreesWithTheTwinOnAllCombinationsOfAFewValues) {
  constexpr std::size_t kValues = std::size(kFew);
  tests::Random random(20240501);
  tests::WithPixelType(GetParam().element, [&]<class T>() {
    for (const double* values : {kFew, kOdd}) {
      Image<T> in({kValues * kValues, kValues * kValues, kRoles});
      for (std::size_t i = 0; i < in.dataSize / sizeof(T); ++i) {
        const std::size_t pixel = i / kRoles, role = i % kRoles;
        std::size_t which = random.Below(kValues);
        if (role == eBAND_RED) which = pixel % kValues;
        if (role == eBAND_NIR) which = pixel / kValues % kValues;
        if (role == eBAND_GREEN) which = pixel / (kValues * kValues) % kValues;
        if (role == eBAND_RED_EDGE) which = pixel / (kValues * kValues * kValues);
        in.Elements()[i] = reference::PlainCast<T>(values[which]);
      }
      EXPECT_TRUE(AgreesForAllOutputs(kEachRoleOnce, in));
    }
  });
}

/// The types of at most 16 bits.
struct VegIndexOfNarrowSamples : ::testing::TestWithParam<PixelType> {};

TEST_P(VegIndexOfNarrowSamples, AgreesWithTheTwinOnPairsOfRedAndNearInfraredOverTheWholeRange) {
  tests::WithPixelType(GetParam().element, [&]<class T>() {
    Image<T> in({256, 256, 3});
    in.Set([](int x, int y, std::uint32_t c) {
      const int far = sizeof(T) == 1 ? 1 : 251;  // over the whole range of 16 bits
      return far * (c == 0 ? x : c == 1 ? y : x ^ y);
    });
    EXPECT_TRUE(AgreesForAllOutputs({eBAND_RED, eBAND_NIR, eBAND_GREEN}, in));
  });
}

TEST_P(VegIndexDifferential, AgreesWithTheTwinOnManyRandomPixelsOfSevenBands) {
  tests::Random random(20240503);
  for (const tests::Fill fill : {tests::Fill::eBITS, tests::Fill::eMIXED}) {
    Raster in({5000, 4, kRoles, GetParam().element}, {});
    tests::FillRandom(in, fill, random, kExtra);
    EXPECT_TRUE(AgreesForAllOutputs(kEachRoleOnce, in));
  }
}

/// Compares operator and twin on one index of pixels of a few channels.
::testing::AssertionResult AgreesOnPixelsOf(std::uint32_t channels, tests::Random& random, const DataType& in,
                                            const DataType& out, unsigned int code) {
  constexpr std::uint32_t kWidths[] = {1, 7, 63, 64, 257, 300, 2049};
  tests::Case c;
  c.in = in;
  c.out = out;
  c.size = {random.Pick(kWidths), 1 + random.Below(2), channels};
  c.inMargins = {random.Below(2), random.Below(2)};
  c.maskKind = random.OneIn(2) ? tests::MaskKind::eNULL : random.Pick(tests::kMaskKinds);
  c.fill = random.OneIn(2) ? tests::Fill::eBITS : random.Pick(tests::kFills);
  c.seed = random.Bits();
  Codes roles = random.OneIn(3) ? DrawRoles(random, channels) : Codes{eBAND_RED, eBAND_GREEN, eBAND_NIR};
  if (roles.size() < channels) roles.resize(channels, 9);
  std::swap(roles[0], roles[random.Below(channels)]);
  const VegIndex index = OperatorOf(RequestsOf({code}), roles);
  ::testing::AssertionResult result = Agree(
      c, kExtra, [&](Raster* image, Mask* mask, Raster* target) { index.Process(image, mask, target); },
      [&](const Raster& image, const Mask* mask, Raster& target) {
        reference::VegIndex(index, image, mask, target);
      });
  return result << ", code " << code << ", bandIndex " << ::testing::PrintToString(roles);
}

TEST_P(VegIndexDifferential, AgreesWithTheTwinOnOneIndexOfPixelsOfThreeToFiveChannels) {
  constexpr std::uint32_t kChannels[] = {4, 4, 3, 4, 4, 4, 5, 4};
  tests::Random random(20240504);
  for (unsigned int code = 0; code < kIndices; ++code) {
    for (const PixelType& out : tests::kPixelTypes) {
      const std::size_t trials = out.element == tessel::eDT_32F ? std::size(kChannels) : 3;
      for (std::size_t trial = 0; trial < trials; ++trial)
        ASSERT_TRUE(AgreesOnPixelsOf(kChannels[trial], random, GetParam().element, out.element, code));
    }
  }
}

TEST_P(VegIndexDifferential, AgreesWithTheTwinWhereInputAndOutputAreOneRaster) {
  tests::Random random(20240502);
  for (int i = 0; i < 60; ++i) {
    const VegIndex index = OperatorOf(DrawRequests(random), DrawRoles(random, kIndices));
    const auto last = index.requestedIndex.begin() + kIndices;
    const auto requested = static_cast<std::uint32_t>(std::count(index.requestedIndex.begin(), last, 1u));
    const std::uint32_t channels =
        std::min<std::uint32_t>(kIndices, std::max(1u, requested + random.Below(2)));
    const tessel::RasterInfo info(random.Below(700), 1 + random.Below(3), channels, GetParam().element);
    Raster in(info, {1, 1}), expected(info, {1, 1});
    tests::FillRandom(in, random.Pick(tests::kFills), random, kExtra);
    std::copy_n(in.data, in.dataSize, expected.data);
    const std::unique_ptr<Mask> mask =
        RandomMask(in, random.Pick(tests::kMaskKinds), tests::MaskGeometry::eSAME, random);
    reference::VegIndex(index, in, mask.get(), expected);
    index.Process(&in, mask.get(), &in);
    ASSERT_TRUE(tests::SameBits(expected, in)) << ::testing::PrintToString(index.requestedIndex) << ", "
                                               << ::testing::PrintToString(index.bandIndex);
  }
}

INSTANTIATE_TEST_SUITE_P(From, VegIndexDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());
INSTANTIATE_TEST_SUITE_P(From, VegIndexOfNarrowSamples,
                         ::testing::ValuesIn(tests::kPixelTypes.begin(), tests::kPixelTypes.begin() + 4),
                         ::testing::PrintToStringParamName());

// ---- contract

const Codes kRedAndNir = {eBAND_RED, eBAND_NIR};

TEST(VegIndexContract, ParametersSetAfterTheFirstProcessAreIgnoredWhileTheTypesStay) {
  VegIndex index = OperatorOf(RequestsOf({eINDEX_DVI}), kRedAndNir);
  EXPECT_EQ((IndexOf1And3<float, short>(index)), 2.0f);
  index.SetBandIndex({eBAND_NIR, eBAND_RED});
  index.SetRequestedIndex(RequestsOf({eINDEX_RVI}));
  EXPECT_EQ((IndexOf1And3<float, short>(index)), 2.0f);
}

TEST(VegIndexContract, ParametersSetAfterTheFirstProcessAreTakenWhenATypeChanges) {
  VegIndex index = OperatorOf(RequestsOf({eINDEX_DVI}), kRedAndNir);
  EXPECT_EQ((IndexOf1And3<float, short>(index)), 2.0f);
  index.SetBandIndex({eBAND_NIR, eBAND_RED});
  EXPECT_EQ((IndexOf1And3<double, short>(index)), -2.0);
  EXPECT_EQ((IndexOf1And3<float, short>(index)), -2.0f);
  index.SetRequestedIndex(RequestsOf({eINDEX_NDVI}));
  EXPECT_EQ((IndexOf1And3<float, int>(index)), -0.5f);
  EXPECT_EQ((IndexOf1And3<float, short>(index)), -0.5f);
}

/// A call that the dispatcher refuses.
void FailToDispatch(const VegIndex& index) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {});
  Image<float> out({1, 1});
  EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { index.Process(&bits, nullptr, &out); }));
}

TEST(VegIndexContract, ObjectWorksAfterAFailedDispatchWithTheNewParameters) {
  VegIndex index = OperatorOf(RequestsOf({eINDEX_DVI}), kRedAndNir);
  FailToDispatch(index);
  EXPECT_EQ((IndexOf1And3<float, short>(index)), 2.0f);
  index.SetRequestedIndex(RequestsOf({eINDEX_RVI}));
  FailToDispatch(index);
  EXPECT_EQ((IndexOf1And3<float, short>(index)), 3.0f);
}

TEST(VegIndexContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto index = std::make_unique<VegIndex>(OperatorOf(RequestsOf({eINDEX_DVI}), kRedAndNir));
  EXPECT_EQ((IndexOf1And3<float, short>(*index)), 2.0f);
  FailToDispatch(*index);
}

TEST(VegIndexContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  const VegIndex original = OperatorOf(RequestsOf({eINDEX_DVI}), kRedAndNir);
  VegIndex copy(original), assigned;
  assigned = original;
  copy.SetRequestedIndex(RequestsOf({eINDEX_RVI}));
  EXPECT_EQ((IndexOf1And3<float, short>(original)), 2.0f);
  EXPECT_EQ((IndexOf1And3<float, short>(copy)), 3.0f);
  EXPECT_EQ((IndexOf1And3<float, short>(assigned)), 2.0f);
}

}  // namespace
}  // namespace orvik::filters
