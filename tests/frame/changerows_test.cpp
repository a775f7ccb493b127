#include "processes/gridmill/frame/changerows.h"

#include <cstddef>
#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/images.h"

namespace orvik::frame {
namespace {

using tessel::Mask;
using tessel::Raster;
using tests::Image;

/// An output in the middle of a buffer of sentinels, `shift` bytes behind an aligned address.
struct ShiftedOutput {
  std::vector<unsigned char> bytes;
  Raster raster;

  ShiftedOutput(const tests::Size& size, std::size_t shift)
      : bytes(std::size_t{size.width} * size.height * size.channels + 64, tests::kSentinel),
        raster({size.width, size.height, size.channels, tessel::eDT_8U}, {}, bytes.data() + 16 + shift) {}
};

/// Writes the image's samples plus 1.
void AddOne(Raster& image, Raster& out) {
  const std::size_t channels = image.channels;
  ChangeRows<unsigned char, unsigned char, unsigned char>(
      {image, image, out, nullptr}, SampleBlocks(channels), [channels](const auto& block) {
        for (std::size_t i = 0; i < block.pixels * channels; ++i)
          block.target[i] = static_cast<unsigned char>(block.image[i] + 1);
      });
}

TEST(ChangeRows, OutputThatCountsAsLargeHoldsTheSameBytes) {
  for (const std::uint32_t width : {0u, 1u, 4u, 5u, 16u, 21u, 22u, 64u, 683u, 2100u}) {
    Image<unsigned char> image({width, 3, 3});
    image.Set([](int x, int y, std::uint32_t c) { return 7 * x + 31 * y + static_cast<int>(c); });
    for (std::size_t shift = 0; shift < 16; ++shift) {
      ShiftedOutput expected({width, 3, 3}, shift), streamed({width, 3, 3}, shift);
      AddOne(image, expected.raster);
      streamed.raster.dataSize = std::uint64_t{1}
                                 << 30;  // read by nothing but the choice of the way to write
      AddOne(image, streamed.raster);
      EXPECT_EQ(streamed.bytes, expected.bytes) << width << " pixels, shift " << shift;
      if (width > 0) {
        EXPECT_EQ(streamed.raster.data[0], 1) << width;
      }
    }
  }
}

TEST(ChangeRows, EveryPixelComesOnceAndInOrder) {
  for (const std::size_t pixels : {std::size_t{1}, std::size_t{7}, std::size_t{256}, kMaxBlock}) {
    Image<std::int64_t> image({600, 3, 1}, {2, 1});
    image.Set([](int x, int y, std::uint32_t) { return 1000 * y + x; });
    std::vector<std::int64_t> seen;
    Image<char> out({600, 3});
    BlockShape shape = PixelBlocks(1, 1, 1);
    shape.pixels = pixels;
    ChangeRows<std::int64_t, std::int64_t, char>({image, image, out, nullptr}, shape, [&](const auto& block) {
      EXPECT_LE(block.pixels, pixels);
      EXPECT_FALSE(block.masked);
      seen.insert(seen.end(), block.image, block.image + block.pixels);
    });
    std::vector<std::int64_t> expected;
    for (std::int64_t y = 0; y < 3; ++y)
      for (std::int64_t x = 0; x < 600; ++x) expected.push_back(1000 * y + x);
    EXPECT_EQ(seen, expected);
  }
}

/// The validity of the pixels of one row under two masks, in blocks as large as they can be.
std::vector<unsigned char> ValidPixels(const Mask* mask, const Mask* referenceMask,
                                       std::uint32_t width = 19) {
  Image<char> image({width, 1});
  std::vector<unsigned char> valid;
  ChangeRows<char, char, char>({image, image, image, mask, referenceMask}, SampleBlocks(1),
                               [&](const auto& block) {
                                 if (block.masked) {
                                   valid.insert(valid.end(), block.valid, block.valid + block.pixels);
                                 } else {
                                   valid.insert(valid.end(), block.pixels, 1);
                                 }
                               });
  return valid;
}

TEST(ChangeRows, SetBitOfTheReferenceMaskExcludesThePixel) {
  Mask mask(19, 1), referenceMask(19, 1, {3, 1}, false);
  mask.SetValid(4, 0, false);
  mask.SetValid(17, 0, false);
  referenceMask.SetValid(0, 0, true);
  referenceMask.SetValid(17, 0, true);
  std::vector<unsigned char> byMask(19, 1), byReference(19, 1), byBoth(19, 1);
  byMask[4] = byMask[17] = byReference[0] = byReference[17] = byBoth[0] = byBoth[4] = byBoth[17] = 0;
  EXPECT_EQ(ValidPixels(nullptr, nullptr), std::vector<unsigned char>(19, 1));
  EXPECT_EQ(ValidPixels(&mask, nullptr), byMask);
  EXPECT_EQ(ValidPixels(nullptr, &referenceMask), byReference);
  EXPECT_EQ(ValidPixels(&mask, &referenceMask), byBoth);
}

TEST(ChangeRows, ReferenceMaskOfAFullBlockExcludesItsPixelsAlone) {
  const std::uint32_t width = kMaxBlock + 1;
  Mask referenceMask(width, 1, {}, true);
  std::vector<unsigned char> valid(width, 0);
  for (const std::uint32_t x : {0u, width - 2, width - 1}) {
    referenceMask.SetValid(static_cast<int>(x), 0, false);
    valid[x] = 1;
  }
  EXPECT_EQ(ValidPixels(nullptr, &referenceMask, width), valid);
}

TEST(SampleBlocks, HoldWholeVectorsOfPixelsAndAtLeastOne) {
  EXPECT_EQ(SampleBlocks(1).pixels, kMaxBlock);
  EXPECT_EQ(SampleBlocks(3).pixels, 640u);
  EXPECT_EQ(SampleBlocks(100).pixels, 20u);
  EXPECT_EQ(SampleBlocks(5000).pixels, 1u);
  EXPECT_EQ(SampleBlocks(0).pixels, kMaxBlock);
}

}  // namespace
}  // namespace orvik::frame
