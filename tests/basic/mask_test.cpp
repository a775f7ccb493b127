#include "basic/tessel/mask/mask.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <random>
#include <string>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/mask/unpacktable.h"
#include "basic/tessel/samples.h"

namespace orvik::tessel {
namespace {

using Bytes = std::vector<unsigned char>;

constexpr unsigned char kSentinel = 0xA5;

/// What `RetrieveRaster` leaves in the memory of a raster of the given shape, with `spare` bytes behind it.
Bytes Retrieved(const Mask& mask, const RasterInfo& info, const RasterContext& context, std::size_t bytes,
                std::size_t spare = 16) {
  Bytes memory(bytes + spare, kSentinel);
  Raster target(info, context, memory.data());
  mask.RetrieveRaster(&target);
  return memory;
}

Bytes WithSentinels(Bytes expected, std::size_t spare = 16) {
  expected.resize(expected.size() + spare, kSentinel);
  return expected;
}

/// Randomises every bit, the padding of the last byte included.
void Randomize(Mask& mask, std::mt19937& random) {
  for (unsigned char& byte : mask.bits) byte = static_cast<unsigned char>(random());
}

// ---- golden

TEST(Mask, ThirteenPixelsAreOneGroupOfEightAndFiveBytesFromTheSecondMaskByte) {
  Mask mask(13, 1);
  mask.bits = {0xB1, 0xC7};
  EXPECT_EQ(Retrieved(mask, {13, 1, 1, eDT_8U}, {}, 13),
            WithSentinels({1, 0, 1, 1, 0, 0, 0, 1, 1, 1, 0, 0, 0}));
}

TEST(Mask, ThreePixelsComeFromTheTopThreeBitsOfTheFirstMaskByte) {
  Mask mask(3, 1);
  mask.bits = {0xBF};
  EXPECT_EQ(Retrieved(mask, {3, 1, 1, eDT_8U}, {}, 3), WithSentinels({1, 0, 1}));
}

TEST(Mask, WholeGroupsOfEightReadNoByteBehindTheBits) {
  Mask mask(16, 1);
  mask.bits = {0xFF, 0x01};
  EXPECT_EQ(Retrieved(mask, {16, 1, 1, eDT_8U}, {}, 16),
            WithSentinels({1, 1, 1, 1, 1, 1, 1, 1, 0, 0, 0, 0, 0, 0, 0, 1}));
}

TEST(Mask, MarginsAreRetrievedInTheOrderOfTheBits) {
  Mask mask(1, 1, RasterContext(1, 1), false);
  mask.SetValid(-1, -1, true);
  mask.SetValid(0, 0, true);
  mask.SetValid(1, 1, true);
  EXPECT_EQ(Retrieved(mask, {1, 1, 1, eDT_8U}, RasterContext(1, 1), 9),
            WithSentinels({1, 0, 0, 0, 1, 0, 0, 0, 1}));
}

TEST(Mask, TheTargetsOwnFieldsDecideHowManyBytesAreWritten) {
  const Mask mask(40, 40);
  EXPECT_EQ(Retrieved(mask, {2, 1, 1, eDT_8U}, RasterContext(1, 0), 4), WithSentinels({1, 1, 1, 1}));
}

TEST(Mask, TheNumberOfBytesWrapsAt32Bits) {
  const Mask mask(8, 1);
  EXPECT_EQ(Retrieved(mask, {65536, 65536, 1, eDT_8U}, {}, 0), WithSentinels({}));
}

TEST(Mask, ABitRasterGetsTheBytesAsTheyStand) {
  Mask mask(13, 1);
  mask.bits = {0xB1, 0xC7};
  EXPECT_EQ(Retrieved(mask, {13, 1, 1, eDT_BIT}, {}, 2), WithSentinels({0xB1, 0xC7}));
}

TEST(Mask, ABitRasterGetsAsManyBytesAsTheMaskHoldsWhateverItsOwnSize) {
  Mask mask(24, 1);
  mask.bits = {0x12, 0x34, 0x56};
  EXPECT_EQ(Retrieved(mask, {1, 1, 1, eDT_BIT}, {}, 3), WithSentinels({0x12, 0x34, 0x56}));
}

TEST(Mask, NothingIsRetrievedFromAnEmptyMask) {
  const Mask mask(0, 0);
  EXPECT_EQ(Retrieved(mask, {0, 0, 1, eDT_8U}, {}, 0), WithSentinels({}));
  EXPECT_EQ(Retrieved(mask, {0, 0, 1, eDT_BIT}, {}, 0), WithSentinels({}));
}

/// The type and message with which a raster of `type` is refused; empty if it is taken.
std::string Refusal(const DataType& type) {
  Bytes memory(64, kSentinel);
  Raster target({2, 2, 1, type}, {}, memory.data());
  try {
    Mask(2, 2).RetrieveRaster(&target);
  } catch (const DataException& failure) {
    EXPECT_EQ(typeid(failure), typeid(DataException));
    EXPECT_EQ(memory, Bytes(64, kSentinel));
    return failure.what();
  }
  return {};
}

constexpr char kRefusal[] = "We can only rasterize into a eDT_BIT or eDT_8U Raster";

TEST(Mask, RetrievingIntoASigned8BitRasterThrows) { EXPECT_EQ(Refusal(eDT_8S), kRefusal); }

TEST(Mask, RetrievingIntoAComplexRasterThrows) {
  EXPECT_EQ(Refusal(DataType(eDT_8U, true)), kRefusal);
  EXPECT_EQ(Refusal(DataType(eDT_BIT, true)), kRefusal);
}

TEST(Mask, RetrievingIntoAnyOtherTypeThrows) {
  for (int element = eDT_BIT; element <= eDT_64U; ++element) {
    const bool taken = element == eDT_BIT || element == eDT_8U;
    EXPECT_EQ(Refusal(static_cast<ElementType>(element)), taken ? "" : kRefusal) << element;
  }
  EXPECT_EQ(Refusal(DataType()), kRefusal);
}

TEST(Mask, EveryFieldOfTheTargetsTypeIsCompared) {
  for (const ElementType element : {eDT_BIT, eDT_8U}) {
    DataType other = element;
    other.isFloat = true;
    EXPECT_EQ(Refusal(other), kRefusal);
    other = element;
    other.mantissaBits += 1;
    EXPECT_EQ(Refusal(other), kRefusal);
    other = element;
    other.exponentBits = 1;
    EXPECT_EQ(Refusal(other), kRefusal);
  }
}

TEST(Mask, BitZeroIsBitSevenOfTheFirstByte) {
  Mask mask(16, 1, {}, false);
  mask.SetValid(0, 0, true);
  EXPECT_EQ(mask.bits, (Bytes{0x80, 0x00}));
  mask.SetValid(7, 0, true);
  EXPECT_EQ(mask.bits, (Bytes{0x81, 0x00}));
  mask.SetValid(8, 0, true);
  EXPECT_EQ(mask.bits, (Bytes{0x81, 0x80}));
}

TEST(Mask, AByteOf0x80MakesTheFirstPixelOfItsGroupValidAndTheSevenOthersInvalid) {
  Mask mask(16, 1);
  mask.bits = {0x00, 0x80};
  for (std::int32_t x = 0; x < 16; ++x) EXPECT_EQ(mask.IsValid(x, 0), x == 8) << x;
}

TEST(Mask, PixelZeroWithMargins2And1AndABufferOf14ColumnsHasTheBitIndex16) {
  Mask mask(10, 3, RasterContext(2, 1), false);
  ASSERT_EQ(mask.bufferWidth, 14u);
  EXPECT_EQ(PixelIndex(mask, 0, 0), 16u);
  mask.SetValid(0, 0, true);
  EXPECT_EQ(mask.bits[2], 0x80);
}

TEST(Mask, RowsRunOnWithoutPadding) {
  Mask mask(3, 3, {}, false);
  mask.SetValid(0, 1, true);
  mask.SetValid(2, 2, true);
  EXPECT_EQ(mask.bits, (Bytes{0x10, 0x80}));
}

TEST(Mask, ANewMaskHasEveryBitSetToTheGivenValue) {
  EXPECT_EQ(Mask(3, 3).bits, (Bytes{0xFF, 0xFF}));
  EXPECT_EQ(Mask(3, 3, {}, false).bits, (Bytes{0x00, 0x00}));
}

TEST(Mask, ANewMaskCoversItsMargins) {
  const Mask mask(5, 4, RasterContext(3, 2, 7, 9));
  EXPECT_EQ(mask.width, 5u);
  EXPECT_EQ(mask.height, 4u);
  EXPECT_EQ(mask.marginX, 3u);
  EXPECT_EQ(mask.marginY, 2u);
  EXPECT_EQ(mask.originX, 7u);
  EXPECT_EQ(mask.originY, 9u);
  EXPECT_EQ(mask.bufferWidth, 11u);
  EXPECT_EQ(mask.bufferHeight, 8u);
  EXPECT_EQ(mask.bits.size(), 11u);
}

TEST(Mask, CreateRasterMakesAnOwnedByteRasterOfTheMasksGeometry) {
  Mask mask(5, 4, RasterContext(3, 2, 7, 9), false);
  mask.SetValid(-3, -2, true);
  mask.SetValid(7, 5, true);
  const std::unique_ptr<Raster> raster(mask.CreateRaster());
  EXPECT_EQ(raster->width, 5u);
  EXPECT_EQ(raster->height, 4u);
  EXPECT_EQ(raster->channels, 1u);
  EXPECT_EQ(raster->dataType, DataType(eDT_8U));
  EXPECT_EQ(raster->marginX, 3u);
  EXPECT_EQ(raster->marginY, 2u);
  EXPECT_EQ(raster->originX, 7u);
  EXPECT_EQ(raster->originY, 9u);
  EXPECT_TRUE(raster->ownsData);
  Bytes expected(88, 0);
  expected.front() = expected.back() = 1;
  ASSERT_EQ(raster->dataSize, expected.size());
  EXPECT_EQ(Bytes(raster->data, raster->data + raster->dataSize), expected);
}

TEST(Mask, RowVOfTheUnpackTableIsTheByteVSpelledOut) {
  for (unsigned int v = 0; v < 256; ++v)
    for (unsigned int i = 0; i < 8; ++i) EXPECT_EQ(kUnpackTable[v * 8 + i], (v >> (7 - i)) & 1);
}

// ---- differential

/// Bit (x, y) by shifting, row after row without padding, the most significant bit first.
bool SlowBit(const Mask& mask, std::int64_t x, std::int64_t y) {
  const std::int64_t index = (mask.marginY + y) * mask.bufferWidth + mask.marginX + x;
  return (mask.bits[static_cast<std::size_t>(index / 8)] >> (7 - index % 8) & 1) != 0;
}

/// Calls `test(x, y)` for every pixel of the buffer.
template <class Test>
void ForEachPixel(const Mask& mask, const Test& test) {
  for (auto y = -static_cast<std::int32_t>(mask.marginY);
       y < static_cast<std::int32_t>(mask.height + mask.marginY); ++y)
    for (auto x = -static_cast<std::int32_t>(mask.marginX);
         x < static_cast<std::int32_t>(mask.width + mask.marginX); ++x)
      test(x, y);
}

Mask RandomMask(std::mt19937& random) {
  const auto below = [&](std::uint32_t bound) { return static_cast<std::uint32_t>(random() % bound); };
  Mask mask(below(40), below(7), RasterContext(below(4), below(4)));
  Randomize(mask, random);
  return mask;
}

TEST(Mask, AgreesWithShiftedBitsInEveryGeometry) {
  std::mt19937 random(1);
  for (int round = 0; round < 500; ++round) {
    const Mask mask = RandomMask(random);
    const std::unique_ptr<Raster> raster(mask.CreateRaster());
    std::size_t i = 0;
    ForEachPixel(mask, [&](std::int32_t x, std::int32_t y) {
      const bool expected = SlowBit(mask, x, y);
      ASSERT_EQ(mask.IsValid(x, y), expected);
      ASSERT_EQ(raster->data[i++], expected ? 1 : 0);
    });
    EXPECT_EQ(i, raster->dataSize);
  }
}

TEST(Mask, SettingAPixelLeavesEveryOtherBitAlone) {
  std::mt19937 random(2);
  for (int round = 0; round < 20; ++round) {
    const Mask before = RandomMask(random);
    ForEachPixel(before, [&](std::int32_t x, std::int32_t y) {
      for (const bool valid : {false, true}) {
        Mask after = before;
        after.SetValid(x, y, valid);
        ASSERT_EQ(SlowBit(after, x, y), valid);
        after.SetValid(x, y, SlowBit(before, x, y));
        ASSERT_EQ(after.bits, before.bits);
      }
    });
  }
}

}  // namespace
}  // namespace orvik::tessel
