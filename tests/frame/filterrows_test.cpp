#include "processes/gridmill/frame/filterrows.h"

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
using tests::kSentinel;

TEST(FilterRows, EveryPixelComesOnceAndInOrder) {
  for (const std::size_t pixels : {std::size_t{1}, std::size_t{7}, std::size_t{256}, kMaxBlock}) {
    Image<int> image({2100, 2, 2}, {2, 1});
    image.Set([](int x, int y, std::uint32_t c) { return 10000 * y + 4 * x + static_cast<int>(c); });
    Image<char> out({2100, 2});
    std::vector<int> seen, expected;
    FilterRows<int, char>(image, nullptr, out, {pixels}, [&](const auto& block) {
      EXPECT_LE(block.pixels, pixels);
      EXPECT_FALSE(block.masked);
      for (std::size_t i = 0; i < block.pixels; ++i) seen.push_back(block.image[i * block.stride + 1]);
    });
    for (int y = 0; y < 2; ++y)
      for (int x = 0; x < 2100; ++x) expected.push_back(10000 * y + 4 * x + 1);
    EXPECT_EQ(seen, expected);
  }
}

TEST(FilterRows, ElementsAreWalkedFromTheRowsFirstOneOn) {
  Image<short> image({5, 2, 3}, {1, 1});
  image.Set([](int x, int y, std::uint32_t c) { return 100 * y + 3 * x + static_cast<int>(c); });
  Image<short> out({5, 2}, {0, 1}, -1);
  FilterRows<short, short>(image, nullptr, out, {2, Walk::kElements}, [](const auto& block) {
    EXPECT_EQ(block.stride, 1u);
    for (std::size_t i = 0; i < block.pixels; ++i) block.target[i] = block.image[i];
  });
  for (int y = 0; y < 2; ++y)
    for (int x = 0; x < 5; ++x) EXPECT_EQ(out.At(x, y), 100 * y + x) << x << ", " << y;
}

TEST(FilterRows, MaskIsReadByItsOwnGeometry) {
  Image<char> image({19, 2}, {4, 4}), out({19, 2});
  Mask mask(19, 2, {3, 1});
  mask.SetValid(17, 0, false);
  std::vector<bool> masked;
  FilterRows<char, char>(image, &mask, out, {19}, [&](const auto& block) {
    masked.push_back(block.masked);
    if (!block.masked) return;
    for (std::size_t i = 0; i < 19; ++i) EXPECT_EQ(block.valid[i], i == 17 ? 0 : 1) << i;
  });
  EXPECT_EQ(masked, (std::vector<bool>{true, false}));
}

TEST(FilterRows, SamplesThatAreReadComeFromPixelsOfAnotherTypeAndFromTheMemoryBehind) {
  Image<unsigned char> image({5, 2, 2}, {1, 1});
  for (std::uint64_t i = 0; i < image.dataSize; ++i) image.data[i] = static_cast<unsigned char>(i + 1);
  Image<char> out({5, 2});
  Mask mask(5, 2);
  mask.SetValid(3, 1, false);
  for (const std::size_t samples : {1u, 2u, 3u}) {
    std::vector<int> seen, expected, excluded;
    FilterShape shape{3};
    shape.inSamples = samples;
    FilterRows<unsigned short, char>(image, &mask, out, shape, [&](const auto& block) {
      EXPECT_EQ(block.stride, samples);
      for (std::size_t i = 0; i < block.pixels; ++i) {
        if (block.masked && block.valid[i] == 0) excluded.push_back(block.image[i * block.stride]);
        for (std::size_t c = 0; c < samples; ++c) seen.push_back(block.image[i * block.stride + c]);
      }
    });
    for (int y = 0; y < 2; ++y) {
      for (int x = 0; x < 5; ++x) {
        const int first = static_cast<int>(&image.At(x, y) - image.data) + 1;  // the low byte of sample 0
        for (int c = 0; c < static_cast<int>(samples); ++c)
          expected.push_back((first + 2 * c) | ((first + 2 * c + 1) << 8));
      }
    }
    EXPECT_EQ(seen, expected) << samples << " samples";
    const int masked = static_cast<int>(&image.At(3, 1) - image.data) + 1;
    EXPECT_EQ(excluded, std::vector<int>{masked | ((masked + 1) << 8)});
  }
}

TEST(FilterRows, SamplesPastTheMemoryAre0) {
  Image<unsigned char> image({3, 1}, {}, 9), out({3, 1});
  FilterShape shape{3};
  shape.inSamples = 2;
  FilterRows<unsigned char, unsigned char>(image, nullptr, out, shape, [](const auto& block) {
    EXPECT_EQ(block.stride, 2u);
    for (std::size_t i = 0; i < block.pixels; ++i) block.target[i] = block.image[i * block.stride + 1];
  });
  EXPECT_EQ(tests::Bytes(out), (std::vector<unsigned char>{9, 9, 0}));
}

/// Writes 1, 2, 3, ... to two samples of each pixel of a row of four, in blocks of three.
void WritePairs(Raster& out, Walk walk) {
  Image<unsigned char> image({4, 1});
  unsigned char next = 1;
  FilterRows<unsigned char, unsigned char>(image, nullptr, out, {3, Walk::kPixels, 2, walk},
                                           [&next](const auto& block) {
                                             for (std::size_t i = 0; i < 2 * block.pixels; ++i)
                                               block.target[i] = next++;
                                           });
}

TEST(PixelWriter, SamplesThatAreNotWrittenKeepTheirBits) {
  Image<unsigned char> out({4, 1, 3}, {1, 1}, kSentinel);
  WritePairs(out, Walk::kPixels);
  for (int x = 0; x < 4; ++x) {
    EXPECT_EQ(out.At(x, 0, 0), 2 * x + 1);
    EXPECT_EQ(out.At(x, 0, 1), 2 * x + 2);
    EXPECT_EQ(out.At(x, 0, 2), kSentinel);
  }
  EXPECT_EQ(out.At(-1, 0, 2), kSentinel);
  EXPECT_EQ(out.At(4, 0, 0), kSentinel);
}

TEST(PixelWriter, PackedSamplesFollowEachOtherWhateverTheChannels) {
  Image<unsigned char> out({4, 1, 3}, {1, 1}, kSentinel);
  WritePairs(out, Walk::kElements);
  for (int i = 0; i < 12; ++i) EXPECT_EQ((&out.At(0, 0))[i], i < 8 ? i + 1 : kSentinel) << i;
}

TEST(PixelWriter, NextPixelPrevailsWhereOneHasLessRoom) {
  Image<unsigned char> out({5, 1}, {}, kSentinel);
  WritePairs(out, Walk::kPixels);
  const std::vector<unsigned char> expected{1, 3, 5, 7, 8};
  EXPECT_EQ(std::vector<unsigned char>(out.data, out.data + 5), expected);
}

TEST(PixelWriter, RasterOfAnotherTypeIsAddressedByItsOwnFields) {
  Image<unsigned int> out({4, 1}, {}, 0);
  WritePairs(out, Walk::kPixels);
  for (int x = 0; x < 4; ++x) {
    const auto low = static_cast<unsigned int>(2 * x + 1);
    EXPECT_EQ(out.At(x, 0), low | ((low + 1) << 8)) << x;
  }
}

TEST(PixelWriter, OutputThatCountsAsLargeHoldsTheSameBytes) {
  for (const Walk walk : {Walk::kPixels, Walk::kElements}) {
    Image<unsigned char> expected({4, 1, 2}, {1, 1}, kSentinel), streamed({4, 1, 2}, {1, 1}, kSentinel);
    WritePairs(expected, walk);
    const std::uint64_t size = streamed.dataSize;
    streamed.dataSize = std::uint64_t{1} << 30;  // read by nothing but the choice of the way to write
    WritePairs(streamed, walk);
    EXPECT_EQ(std::vector<unsigned char>(streamed.data, streamed.data + size),
              std::vector<unsigned char>(expected.data, expected.data + size));
    EXPECT_EQ(streamed.At(3, 0, 1), 8);
  }
}

TEST(DensePixels, HoldWholeVectorsAndAtLeastOne) {
  EXPECT_EQ(DensePixels(1, 4096), kMaxBlock);
  EXPECT_EQ(DensePixels(3, 1024), 320u);
  EXPECT_EQ(DensePixels(100, 1024), 10u);
  EXPECT_EQ(DensePixels(5000, 1024), 1u);
  EXPECT_EQ(DensePixels(0, 1024), 1024u);
}

}  // namespace
}  // namespace orvik::frame
