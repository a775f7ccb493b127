#include "basic/tessel/mask/maskrow.h"

#include <cstddef>
#include <cstdint>
#include <random>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::tessel {
namespace {

using Bytes = std::vector<unsigned char>;

/// A mask with exactly the bytes that hold `bits` random bits: a read behind them is one behind the vector's
/// memory, which the address sanitizer sees.
Mask MaskOfBits(std::size_t bits, std::mt19937& random) {
  Mask mask(static_cast<std::uint32_t>(bits), 1);
  Bytes exact((bits + 7) / 8);
  for (unsigned char& byte : exact) byte = static_cast<unsigned char>(random());
  mask.bits.swap(exact);
  return mask;
}

TEST(UnpackBits, SpreadsTheBitsFromEveryPhaseOverCountBytesAndNoMore) {
  std::mt19937 random(5);
  for (std::uint32_t first = 0; first < 24; ++first) {
    for (std::size_t count = 0; count <= 40; ++count) {
      const Mask mask = MaskOfBits(first + count, random);
      Bytes expected(count + 16, 0xA5);
      for (std::size_t i = 0; i < count; ++i) {
        const std::size_t bit = first + i;
        expected[8 + i] = static_cast<unsigned char>(mask.bits[bit / 8] >> (7 - bit % 8) & 1);
      }
      Bytes target(count + 16, 0xA5);
      UnpackBits(mask, first, count, target.data() + 8);
      ASSERT_EQ(target, expected) << "first " << first << ", count " << count;
    }
  }
}

TEST(UnpackBits, OfAnEmptyMaskReadsNothing) {
  const Mask mask(0, 0);
  unsigned char target = 0xA5;
  UnpackBits(mask, 0, 0, &target);
  EXPECT_EQ(target, 0xA5);
}

TEST(HasGeometryOf, IsTrueWhereEveryPixelHasTheSameIndexInMaskAndRaster) {
  const Raster raster({10, 5, 3, eDT_16S}, RasterContext(2, 1));
  EXPECT_TRUE(HasGeometryOf(Mask(10, 5, RasterContext(2, 1)), raster));
  EXPECT_TRUE(HasGeometryOf(Mask(10, 9, RasterContext(2, 1, 7, 8)), raster))
      << "rows and origin do not matter";
  EXPECT_FALSE(HasGeometryOf(Mask(11, 5, RasterContext(2, 1)), raster));
  EXPECT_FALSE(HasGeometryOf(Mask(10, 5, RasterContext(2, 2)), raster));
  EXPECT_FALSE(HasGeometryOf(Mask(12, 5, RasterContext(1, 1)), raster))
      << "the same row length by other margins";
}

TEST(MaskBytes, AreLookedUpByTheGeometryOfTheRaster) {
  std::mt19937 random(10);
  Mask mask(6, 5, RasterContext(1, 2));
  for (unsigned char& byte : mask.bits) byte = static_cast<unsigned char>(random());
  const MaskBytes bytes(&mask);
  const Raster same({6, 5, 1, eDT_8U}, RasterContext(1, 2));
  const Raster other({4, 3, 1, eDT_8U}, RasterContext(0, 1));
  EXPECT_EQ(MaskBytes::Pitch(same), 8u);
  EXPECT_EQ(MaskBytes::Pitch(other), 4u);
  const auto bit = [&](std::uint32_t index) { return mask.bits[index / 8] >> (7 - index % 8) & 1; };
  for (std::uint32_t y = 0; y < 3; ++y) {
    for (std::uint32_t x = 0; x < 4; ++x) {
      EXPECT_EQ(*bytes.At(same, x, y), bit((2 + y) * 8 + 1 + x));
      EXPECT_EQ(*(bytes.At(same, x, y) + MaskBytes::Pitch(same)), bit((3 + y) * 8 + 1 + x));
      EXPECT_EQ(*bytes.At(other, x, y), bit((1 + y) * 4 + x));
    }
  }
}

}  // namespace
}  // namespace orvik::tessel
