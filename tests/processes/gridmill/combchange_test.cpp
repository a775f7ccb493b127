#include "processes/gridmill/combchange.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/reference/combchange_reference.h"
#include "tests/support/changecases.h"
#include "tests/support/changetwins.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::changedetection {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();

/// The result for one pixel.
template <class Out, class In, class Ref>
std::vector<Out> Combined(const CombChange& comb, const std::vector<In>& image,
                          const std::vector<Ref>& reference, bool isValid = true) {
  Image<In> i({1, 1, static_cast<std::uint32_t>(image.size())});
  std::copy(image.begin(), image.end(), i.Elements());
  Image<Ref> r({1, 1, static_cast<std::uint32_t>(reference.size())});
  std::copy(reference.begin(), reference.end(), r.Elements());
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1, static_cast<std::uint32_t>(image.size() + reference.size())});
  comb.Process(&i, &r, &mask, &out);
  return {out.Elements(), out.Elements() + image.size() + reference.size()};
}

/// What the image's channel holds where the image and the reference have a channel each.
template <class Out, class In, class Ref>
Out ImageChannel(In image, Ref reference) {
  return Combined<Out, In, Ref>(CombChange(eDIFF_FORWARD), {image}, {reference})[0];
}

/// What the reference's channel holds, likewise.
template <class Out, class In, class Ref>
Out ReferenceChannel(In image, Ref reference) {
  return Combined<Out, In, Ref>(CombChange(eDIFF_FORWARD), {image}, {reference})[1];
}

/// A 16-bit sample with these two bytes in memory.
short Text(unsigned char first, unsigned char second) {
  return static_cast<short>(static_cast<unsigned short>(first | second << 8));
}

// ---- golden

TEST(CombChange, ThreeChannelsAndTwoChannelsOfOneTypeGiveFive) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<short, short, short>(comb, {1, 2, 3}, {4, 5})), (std::vector<short>{1, 2, 3, 4, 5}));
  EXPECT_EQ((Combined<double, float, float>(comb, {1.5f, 2, 3}, {4, 5.25f})),
            (std::vector<double>{1.5, 2, 3, 4, 5.25}));
}

TEST(CombChange, MaskedPixelGetsNoDataInAllFiveChannels) {
  CombChange comb(eDIFF_FORWARD);
  comb.SetNoData(9.0f);
  EXPECT_EQ((Combined<short, short, short>(comb, {1, 2, 3}, {4, 5}, false)), std::vector<short>(5, 9));
}

TEST(CombChange, NoDataIsZeroByDefault) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<short, short, short>(comb, {1, 2, 3}, {4, 5}, false)), std::vector<short>(5, 0));
  EXPECT_EQ(comb.noData, 0.0f);
  EXPECT_TRUE(comb.imgNoData.empty() && comb.refNoData.empty());
}

TEST(CombChange, NoDataIsWrittenThroughClipTo) {
  CombChange comb(eDIFF_FORWARD);
  comb.SetNoData(-9999.5f);
  EXPECT_EQ((Combined<unsigned char, int, int>(comb, {1}, {2}, false)), std::vector<unsigned char>(2, 0));
  EXPECT_EQ((Combined<short, int, int>(comb, {1}, {2}, false)), std::vector<short>(2, -10000));
  EXPECT_EQ((Combined<float, int, int>(comb, {1}, {2}, false)), std::vector<float>(2, -9999.5f));
  EXPECT_EQ((Combined<std::int64_t, int, int>(comb, {1}, {2}, false)), std::vector<std::int64_t>(2, 0));
}

TEST(CombChange, NoDataIsRoundedInFloat) {
  CombChange comb(eDIFF_FORWARD);
  comb.SetNoData(8388609.0f);
  EXPECT_EQ((Combined<int, double, double>(comb, {1}, {2}, false)), std::vector<int>(2, 8388610));
}

TEST(CombChange, MaskedPixelOfUnlikeTypesGetsNoDataToo) {
  CombChange comb(eDIFF_FORWARD);
  comb.SetNoData(9.0f);
  EXPECT_EQ((Combined<int, short, unsigned char>(comb, {1, 2}, {4}, false)), std::vector<int>(3, 9));
  EXPECT_EQ((Combined<int, unsigned char, short>(comb, {1}, {4, 5}, false)), std::vector<int>(3, 9));
}

TEST(CombChange, SamplesOfEqualTypesAreCopiedUnchanged) {
  const std::int64_t least = std::numeric_limits<std::int64_t>::min();
  EXPECT_EQ((ImageChannel<std::int64_t, std::int64_t, std::int64_t>(least, 0)), least);
  EXPECT_EQ((ReferenceChannel<std::int64_t, std::int64_t, std::int64_t>(0, -5)), -5);
  EXPECT_EQ((ImageChannel<std::uint64_t, std::uint64_t, std::uint64_t>(~0ull, 0)), ~0ull);
  EXPECT_EQ((ImageChannel<double, double, double>(1e300, 0)), 1e300);
  EXPECT_TRUE(std::signbit((ReferenceChannel<float, float, float>(0.0f, -0.0f))));
  EXPECT_TRUE(std::isnan((ImageChannel<float, float, float>(kNaN, 0.0f))));
}

TEST(CombChange, IntegerSamplesAreClampedAndNotRounded) {
  EXPECT_EQ((ImageChannel<unsigned char, short, short>(-5, 0)), 0);
  EXPECT_EQ((ImageChannel<unsigned char, short, short>(300, 0)), 255);
  EXPECT_EQ((ReferenceChannel<char, short, short>(0, -300)), -128);
  EXPECT_EQ((ReferenceChannel<int, unsigned int, unsigned int>(0, 4294967295u)), 2147483647);
  EXPECT_EQ((ImageChannel<std::int64_t, char, char>(-5, 0)), 0);
  EXPECT_EQ((ImageChannel<std::int64_t, char, char>(5, 0)), 5);
  EXPECT_EQ((ImageChannel<unsigned char, std::int64_t, std::int64_t>(-1, 0)), 255);
  EXPECT_EQ((ImageChannel<float, int, int>(16777217, 0)), 16777216.0f);
}

TEST(CombChange, FloatingSamplesAreRoundedInTheirOwnPrecision) {
  EXPECT_EQ((ImageChannel<unsigned char, float, float>(2.5f, 0)), 3);
  EXPECT_EQ((ReferenceChannel<short, double, double>(0, -2.5)), -3);
  EXPECT_EQ((ReferenceChannel<std::int64_t, double, double>(0, 2.9)), 2);
  EXPECT_EQ((ImageChannel<int, float, float>(8388609.0f, 0)), 8388610);
  EXPECT_EQ((ImageChannel<int, double, double>(8388609.0, 0)), 8388609);
  EXPECT_EQ((ImageChannel<int, float, float>(kNaN, 0)), -2147483647 - 1);
}

TEST(CombChange, ShortImageBesideBytesIsCopiedAndTheBytesAreWidenedAndClipped) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<short, short, unsigned char>(comb, {-300, 301}, {7, 200, 255})),
            (std::vector<short>{-300, 301, 7, 200, 255}));
  EXPECT_EQ((Combined<char, short, unsigned char>(comb, {-300, 3}, {7, 200})),
            (std::vector<char>{-128, 3, 7, 127}));
}

TEST(CombChange, ShortReferenceOfAFloatImageComesOutAsZero) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<float, float, short>(comb, {1.5f, -2.0f}, {3, 4})),
            (std::vector<float>{1.5f, -2.0f, 0.0f, 0.0f}));
  EXPECT_EQ((Combined<short, double, float>(comb, {1.5}, {3.0f})), (std::vector<short>{2, 0}));
}

TEST(CombChange, ShortWithTheBytes0x31And0x32BesideAnIntReads12) {
  EXPECT_EQ((ImageChannel<short, short, int>(0x3231, 5)), 12);
  EXPECT_EQ((ImageChannel<double, short, int>(0x3231, 5)), 12.0);
}

TEST(CombChange, ShortOf1000BesideAnIntReads0) { EXPECT_EQ((ImageChannel<short, short, int>(1000, 5)), 0); }

TEST(CombChange, TextOfASampleIsReadUpToItsFirstByteThatIsNoDigit) {
  const auto read = [](unsigned char first, unsigned char second) {
    return ImageChannel<float, short, int>(Text(first, second), 5);
  };
  EXPECT_EQ(read('9', 'x'), 9.0f);
  EXPECT_EQ(read('x', '9'), 0.0f);
  EXPECT_EQ(read('9', 0), 9.0f);
  EXPECT_EQ(read(0, '9'), 0.0f);
  EXPECT_EQ(read(' ', '7'), 7.0f);
  EXPECT_EQ(read('\t', '7'), 7.0f);
  EXPECT_EQ(read('\r', '7'), 7.0f);
  EXPECT_EQ(read('\b', '7'), 0.0f);
  EXPECT_EQ(read('-', '7'), -7.0f);
  EXPECT_EQ(read('+', '7'), 7.0f);
  EXPECT_EQ(read('-', '-'), 0.0f);
  EXPECT_EQ(read('0', '9'), 9.0f);
  EXPECT_EQ(read(0xA0, '9'), 0.0f);
}

TEST(CombChange, EverySampleOf16BitsIsReadAsItsTwoBytes) {
  Image<unsigned short> image({256, 256});
  image.Set([](int x, int y, std::uint32_t) { return x + 256 * y; });
  Image<short> reference({256, 256});
  Image<short> out({256, 256, 2});
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  int numbers = 0;
  for (int y = 0; y < 256; ++y) {
    for (int x = 0; x < 256; ++x) {
      const char text[] = {static_cast<char>(x), static_cast<char>(y), '\0'};
      ASSERT_EQ(out.At(x, y), std::strtol(text, nullptr, 10)) << x << ", " << y;
      if (out.At(x, y) != 0) ++numbers;
    }
  }
  // A digit but 0 and anything behind it, a 0, a blank or a sign and such a digit.
  EXPECT_EQ(numbers, 9 * 256 + 9 + 6 * 9 + 2 * 9);
}

TEST(CombChange, TextIsWrittenThroughClipToInFloat) {
  EXPECT_EQ((ImageChannel<unsigned char, short, int>(Text('-', '7'), 5)), 0);
  EXPECT_EQ((ImageChannel<std::int64_t, short, int>(Text('-', '7'), 5)), 0);
  EXPECT_EQ((ImageChannel<char, unsigned short, int>(static_cast<unsigned short>(Text('-', '7')), 5)), -7);
}

TEST(CombChange, BytesOrderBeforeSignedBytes) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<short, unsigned char, char>(comb, {1, 2}, {3, -1})),
            (std::vector<short>{0, 0, 3, 255}));
  EXPECT_EQ((Combined<short, char, unsigned char>(comb, {1, -2}, {3, 255})),
            (std::vector<short>{1, -2, 3, 255}));
}

TEST(CombChange, NoDataVectorsAndTypeChangeNothing) {
  for (int type = -1; type <= 3; ++type) {
    CombChange comb(eDIFF_ABSOLUTE);
    comb.SetType(static_cast<DiffType>(type));
    comb.SetImgNoData({1.0f, 2.0f});
    comb.SetRefNoData({4.0f, 5.0f});
    comb.SetNoData(9.0f);
    EXPECT_EQ((Combined<short, short, short>(comb, {1, 2}, {4, 5})), (std::vector<short>{1, 2, 4, 5}));
    EXPECT_EQ((Combined<short, short, unsigned char>(comb, {1, 2}, {4, 5})),
              (std::vector<short>{1, 2, 4, 5}));
  }
}

// Deliberate: only `noData` has an effect.
TEST(CombChange, OnlyNoDataHasAnEffect) {
  const CombChange plain(eDIFF_ABSOLUTE);
  CombChange full(eDIFF_BACKWARD);
  full.SetImgNoData({7.0f});
  full.SetRefNoData({7.0f});
  for (const bool isValid : {true, false}) {
    EXPECT_EQ((Combined<int, int, int>(plain, {7}, {7}, isValid)),
              (Combined<int, int, int>(full, {7}, {7}, isValid)));
  }
  CombChange other(eDIFF_ABSOLUTE);
  other.SetNoData(3.0f);
  EXPECT_EQ((Combined<int, int, int>(other, {7}, {7}, false)), std::vector<int>(2, 3));
}

// Deliberate: beside an image that does not order below it, a reference of another type is read byte by byte
// as `unsigned char` if it has 8 bits, and comes out as 0 if it has more.
TEST(CombChange, ReferenceOf8BitsIsReadByteByByteAndComesOutAs0IfItHasMore) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<int, int, char>(comb, {-9}, {-1, 5})), (std::vector<int>{-9, 255, 5}));
  EXPECT_EQ((Combined<int, int, unsigned char>(comb, {-9}, {255, 5})), (std::vector<int>{-9, 255, 5}));
  EXPECT_EQ((Combined<int, int, short>(comb, {-9}, {1, 5})), (std::vector<int>{-9, 0, 0}));
  EXPECT_EQ((Combined<int, int, unsigned int>(comb, {-9}, {1, 5})), (std::vector<int>{-9, 0, 0}));
  EXPECT_EQ((Combined<double, double, std::int64_t>(comb, {-9}, {1})), (std::vector<double>{-9, 0}));
}

// Deliberate: an image that orders below its reference is read as decimal text: the two bytes of a 16-bit
// sample through `atoi`, so that 0x3231 gives 12 and most samples give 0; other widths give 0. The reference
// is then read in elements of the image's type.
TEST(CombChange, ImageThatOrdersBelowItsReferenceIsReadAsDecimalText) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<int, short, int>(comb, {0x3231, 1000}, {0x00020001, 0x00040003})),
            (std::vector<int>{12, 0, 1, 2}));
  EXPECT_EQ((Combined<int, unsigned short, short>(comb, {0x3231}, {-1})), (std::vector<int>{12, 65535}));
  EXPECT_EQ((Combined<int, unsigned char, short>(comb, {'1', '2'}, {0x0201})), (std::vector<int>{0, 0, 1}));
  EXPECT_EQ((Combined<int, int, double>(comb, {0x3231}, {1.0})), (std::vector<int>{0, 0}));
  EXPECT_EQ((Combined<int, int, std::int64_t>(comb, {0x3231}, {-7})), (std::vector<int>{0, -7}));
  EXPECT_EQ((Combined<double, std::uint64_t, double>(comb, {0x3231}, {2.0})),
            (std::vector<double>{0, 0x1p62}));
}

TEST(CombChange, PiecesOfAWiderReferenceAreReadFromTheAddressOfItsPixel) {
  Image<short> image({2, 1, 2}, {1, 1}, 0x3231);
  Image<int> reference({2, 1, 3}, {2, 0});
  reference.SetPixel(0, 0, {0x00020001, 0x00040003, 0x00060005});
  reference.SetPixel(1, 0, {0x00080007, 0x000A0009, 0x000C000B});
  Image<short> out({2, 1, 6}, {0, 1}, 77);
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  const std::vector<short> expected = {12, 12, 1, 2, 3, 77, 12, 12, 7, 8, 9, 77};
  EXPECT_EQ(std::vector<short>(&out.At(0, 0), &out.At(0, 0) + 12), expected);
}

/// The place of a pixel type in the order by width, signedness, floating and significand.
int RankOf(const PixelType& type) {
  constexpr tessel::ElementType kOrder[] = {
      tessel::eDT_8U,  tessel::eDT_8S,  tessel::eDT_16U, tessel::eDT_16S, tessel::eDT_32U,
      tessel::eDT_32S, tessel::eDT_32F, tessel::eDT_64U, tessel::eDT_64S, tessel::eDT_64F};
  return static_cast<int>(std::ranges::find(kOrder, type.element) - kOrder);
}

/// True if an image of ones keeps its samples beside a reference of this type.
bool KeepsItsSamples(const DataType& imageType, const DataType& referenceType) {
  Raster image({1, 1, 1, imageType}, {});
  tests::WithPixelType(imageType, [&]<class T>() {
    const T ones[] = {T(1), T(1)};
    std::copy_n(reinterpret_cast<const unsigned char*>(ones), image.dataSize, image.data);
  });
  Raster reference({1, 1, 1, referenceType}, {});
  FillBytes(reference, 0);
  Image<int> out({1, 1, 2}, {}, 77);
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 1), 0);
  EXPECT_TRUE(out.At(0, 0) == 0 || out.At(0, 0) == 1) << out.At(0, 0);
  return out.At(0, 0) == 1;
}

TEST(CombChange, TypesAreOrderedByWidthSignednessFloatingAndSignificand) {
  for (const PixelType& a : tests::kPixelTypes) {
    for (const PixelType& b : tests::kPixelTypes) {
      for (const bool complex : {false, true}) {
        EXPECT_EQ(KeepsItsSamples({a.element, complex}, {b.element, complex}), RankOf(a) >= RankOf(b))
            << a << " beside " << b;
      }
    }
  }
}

TEST(CombChange, ComplexityDecidesLast) {
  for (const PixelType& a : tests::kPixelTypes) {
    for (const PixelType& b : tests::kPixelTypes) {
      EXPECT_EQ(KeepsItsSamples(a.element, {b.element, true}), RankOf(a) > RankOf(b)) << a << " beside " << b;
      EXPECT_EQ(KeepsItsSamples({a.element, true}, b.element), RankOf(a) >= RankOf(b))
          << a << " beside " << b;
    }
  }
}

TEST(CombChange, SignificandDecidesBeforeComplexityAndTheExponentTakesNoPart) {
  DataType narrow = tessel::eDT_32F, wide = tessel::eDT_32F, otherExponent = tessel::eDT_32F;
  narrow.mantissaBits = 10;
  narrow.isComplex = true;
  wide.mantissaBits = 24;
  EXPECT_TRUE(KeepsItsSamples(tessel::eDT_32F, narrow));
  EXPECT_FALSE(KeepsItsSamples({tessel::eDT_32F, true}, wide));
  for (const std::uint32_t exponentBits : {0u, 7u, 9u}) {
    otherExponent.exponentBits = exponentBits;
    EXPECT_TRUE(KeepsItsSamples(tessel::eDT_32F, otherExponent));
  }
}

TEST(CombChange, ReferenceThatDiffersInTheExponentAloneIsNotRead) {
  Image<float> image({1, 1}, {}, 2.5f), reference({1, 1}, {}, 3.5f), out({1, 1, 2});
  reference.dataType.exponentBits = 9;
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(0, 0, 0), 2.5f);
  EXPECT_EQ(out.At(0, 0, 1), 0.0f);
}

TEST(CombChange, ReferenceOfSingleBitsComesOutAsZero) {
  for (const DataType type : {DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true), DataType()}) {
    Image<unsigned char> image({9, 2}, {}, 5);
    const Image<unsigned char> bits({9, 2}, {}, 0xFF);
    Raster reference({9, 2, 1, type}, {}, bits.data);
    Image<short> out({9, 2, 2}, {}, 77);
    CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
    for (int x = 0; x < 9; ++x) {
      EXPECT_EQ(out.At(x, 1, 0), 5) << x;
      EXPECT_EQ(out.At(x, 1, 1), 0) << x;
    }
  }
}

TEST(CombChange, ComplexRastersGiveTheFirstElementsOfTheirPixels) {
  Image<short> image({2, 1, 2}, {}, 0, true), reference({2, 1, 1}, {}, 0, true);
  image.SetPixel(1, 0, {1, 2, 3, 4});
  reference.SetPixel(1, 0, {5, 6});
  Image<int> out({2, 1, 3});
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(std::vector<int>(&out.At(1, 0), &out.At(1, 0) + 3), (std::vector<int>{1, 2, 5}));
}

TEST(CombChange, ComplexImageBesideARealReferenceIsOfUnlikeType) {
  Image<char> image({2, 1, 2}, {}, 0, true), reference({2, 1, 2});
  image.SetPixel(1, 0, {1, 2, 3, 4});
  reference.SetPixel(1, 0, {-1, 6});
  Image<int> out({2, 1, 4});
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(std::vector<int>(&out.At(1, 0), &out.At(1, 0) + 4), (std::vector<int>{1, 2, 255, 6}));
}

TEST(CombChange, RealImageOrdersBeforeItsComplexVariant) {
  Image<short> image({2, 1, 2}), reference({2, 1, 2}, {}, 0, true);
  image.SetPixel(1, 0, {0x3231, 3});
  reference.SetPixel(1, 0, {5, 6, 7, 8});
  Image<int> out({2, 1, 4});
  CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(std::vector<int>(&out.At(1, 0), &out.At(1, 0) + 4), (std::vector<int>{12, 0, 5, 6}));
}

TEST(CombChange, RealImageBesideItsComplexVariantReads0ForEveryPairOfTypesButOf16Bits) {
  for (const PixelType& type : tests::kPixelTypes) {
    for (const PixelType& written : tests::kPixelTypes) {
      tests::WithPixelTypes(type.element, written.element, [&]<class In, class Out>() {
        Image<In> image({2, 1}, {}, In('1')), reference({2, 1}, {}, In(6), true);
        Image<Out> out({2, 1, 2}, {}, Out(77));
        CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
        const Out spelt = sizeof(In) == 2 ? Out(1) : Out(0);
        EXPECT_EQ(std::vector<Out>(out.Elements(), out.Elements() + 4),
                  (std::vector<Out>{spelt, 6, spelt, 6}))
            << type << " to " << written;
      });
    }
  }
}

TEST(CombChange, ComplexOutputGetsItsFirstElementsWritten) {
  Image<short> image({2, 1}, {}, 5), reference({2, 1}, {}, 6);
  Image<short> out({2, 1, 2}, {}, 77, true);
  Mask mask(2, 1);
  mask.SetValid(1, 0, false);
  CombChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  EXPECT_EQ(std::vector<short>(&out.At(0, 0), &out.At(0, 0) + 8),
            (std::vector<short>{5, 6, 77, 77, 0, 0, 77, 77}));
}

TEST(CombChange, ChannelsBehindTheTwoDatesKeepTheirBits) {
  Image<short> image({2, 1, 2}, {}, 5), reference({2, 1}, {}, 6);
  Image<short> out({2, 1, 5}, {}, 77);
  Mask mask(2, 1);
  mask.SetValid(1, 0, false);
  CombChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  EXPECT_EQ(std::vector<short>(&out.At(0, 0), &out.At(0, 0) + 10),
            (std::vector<short>{5, 5, 6, 77, 77, 0, 0, 0, 77, 77}));
}

TEST(CombChange, DateOfNoChannelsAddsNone) {
  const CombChange comb(eDIFF_FORWARD);
  EXPECT_EQ((Combined<short, short, short>(comb, {}, {4, 5})), (std::vector<short>{4, 5}));
  EXPECT_EQ((Combined<short, short, short>(comb, {1, 2, 3}, {})), (std::vector<short>{1, 2, 3}));
  EXPECT_EQ((Combined<short, short, short>(comb, {1, 2, 3}, {}, false)), (std::vector<short>{0, 0, 0}));
}

TEST(CombChange, EveryRasterAndTheMaskHaveMarginsOfTheirOwn) {
  Image<short> image({3, 2}, {2, 1}), reference({4, 3}, {0, 3});
  image.Set([](int x, int y, std::uint32_t) { return 10 + x + 3 * y; });
  reference.Set([](int x, int y, std::uint32_t) { return 100 + x + 3 * y; });
  Mask mask(3, 2, {4, 2});
  mask.SetValid(1, 1, false);
  Image<int> out({3, 2, 2}, {1, 4}, 77);
  CombChange(eDIFF_FORWARD).Process(&image, &reference, &mask, &out);
  for (int y = -4; y < 6; ++y) {
    for (int x = -1; x < 4; ++x) {
      const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 2, isMasked = x == 1 && y == 1;
      EXPECT_EQ(out.At(x, y, 0), !isInside ? 77 : isMasked ? 0 : 10 + x + 3 * y) << x << ", " << y;
      EXPECT_EQ(out.At(x, y, 1), !isInside ? 77 : isMasked ? 0 : 100 + x + 3 * y) << x << ", " << y;
    }
  }
}

TEST(CombChange, EmptyImageWritesNothing) {
  for (const tests::Size size : {tests::Size{3, 0}, tests::Size{0, 3}}) {
    Image<short> image(size, {1, 1}, 5), reference(size, {1, 1}, 6);
    Image<short> out({3, 3, 2}, {1, 1});
    FillBytes(out);
    CombChange(eDIFF_FORWARD).Process(&image, &reference, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

// ---- differential

constexpr tests::ChangeLimits kLimits = {.read = [](std::uint32_t, std::uint32_t n) { return n; },
                                         .written = [](std::uint32_t m, std::uint32_t n) { return m + n; }};

::testing::AssertionResult AgreesWithTheTwin(const tests::ChangeCase& c) {
  CombChange comb(static_cast<DiffType>(c.parameters.type));
  SetNoDataOf(c.parameters, comb);
  const auto params = tests::ParamsOf<details::CombParams>(c.parameters);
  return Agree(
      c,
      [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
        comb.Process(image, reference, mask, out);
      },
      [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
        reference::CombChange(params, image, reference, mask, out);
      });
}

struct CombChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(CombChangeDifferential, AgreesWithTheTwinBitForBit) {
  for (tests::ChangeCase c : tests::ChangeCasesFrom(GetParam(), kLimits)) {
    // The image's samples would overwrite the reference's before these are read.
    if (c.inPlace == tests::InPlace::eREFERENCE) c.inPlace = tests::InPlace::eNO;
    ASSERT_TRUE(AgreesWithTheTwin(c));
  }
}

/// The pixel types, their complex variants and what is no pixel type.
std::vector<DataType> ReferenceTypes() {
  std::vector<DataType> types = {tessel::eDT_BIT, {tessel::eDT_BIT, true}, DataType()};
  for (const PixelType& type : tests::kPixelTypes) {
    types.emplace_back(type.element);
    types.emplace_back(type.element, true);
  }
  return types;
}

TEST_P(CombChangeDifferential, AgreesWithTheTwinForEveryTypeOfTheReference) {
  const std::vector<DataType> referenceTypes = ReferenceTypes();
  const std::size_t count = referenceTypes.size();
  std::size_t i = 0;
  for (tests::ChangeCase c : tests::ChangeCasesFrom(GetParam(), kLimits)) {
    c.inPlace = tests::InPlace::eNO;
    c.reference.type = referenceTypes[i % count];
    c.image.type.isComplex = i / count % 2 == 1;
    for (const char* text : {"12", "-7", " 9", "4x", "+5", "0"}) {
      c.extra.push_back(Text(static_cast<unsigned char>(text[0]), static_cast<unsigned char>(text[1])));
    }
    ASSERT_TRUE(AgreesWithTheTwin(c));
    ++i;
  }
}

INSTANTIATE_TEST_SUITE_P(From, CombChangeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
