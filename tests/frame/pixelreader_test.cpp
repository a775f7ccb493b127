#include "processes/gridmill/frame/pixelreader.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::frame {
namespace {

using tessel::DataType;
using tessel::Raster;
using tests::Image;

using Samples = std::vector<unsigned char>;

/// Bytes that tell their place.
void FillPlaces(Raster& raster) {
  for (std::uint64_t i = 0; i < raster.dataSize; ++i)
    raster.data[i] = static_cast<unsigned char>(1 + (i * 7 + i / 251) % 255);
}

/// The bytes of a pixel's samples; 0 past the raster's memory.
Samples SlowPixel(const Raster& raster, std::size_t bytes, std::uint32_t x, std::uint32_t y) {
  const std::size_t parts = raster.dataType.isComplex ? 2 : 1;
  const std::size_t pixelBytes = raster.channels * parts * raster.dataType.sizeBits / 8;
  const std::size_t width = raster.width + 2 * raster.marginX;
  const std::size_t first = ((raster.marginY + y) * width + raster.marginX + x) * pixelBytes;
  Samples samples(bytes, 0);
  for (std::size_t b = 0; b < bytes; ++b)
    if (first + b < raster.dataSize) samples[b] = raster.data[first + b];
  return samples;
}

/// Reads all pixels in blocks.
void ExpectPixels(const Raster& raster, const DataType& element, std::size_t samples, std::size_t pixels) {
  PixelReader reader(raster, element, samples, pixels);
  const std::size_t sampleBytes = element.sizeBits / 8;
  for (std::uint32_t y = 0; y < raster.height; ++y) {
    for (std::uint32_t x = 0; x < raster.width; x += static_cast<std::uint32_t>(pixels)) {
      const std::size_t count = std::min<std::size_t>(pixels, raster.width - x);
      const unsigned char* const block = reader.At(x, y, count);
      for (std::uint32_t i = 0; i < count; ++i) {
        const unsigned char* const pixel = block + i * reader.Stride() * sampleBytes;
        ASSERT_EQ(Samples(pixel, pixel + samples * sampleBytes),
                  SlowPixel(raster, samples * sampleBytes, x + i, y))
            << "pixel " << x + i << ", " << y << ", " << samples << " samples of " << tests::NameOf(element)
            << " from " << raster.channels << " of " << tests::NameOf(raster.dataType);
      }
    }
  }
}

TEST(PixelReader, EveryTypeReadAsEveryOther) {
  for (const tests::PixelType& held : tests::kPixelTypes) {
    for (const tests::PixelType& read : tests::kPixelTypes) {
      for (const bool complex : {false, true}) {
        for (const std::uint32_t channels : {1u, 3u}) {
          Raster raster({7, 3, channels, DataType(held.element, complex)}, {2, 1});
          FillPlaces(raster);
          for (const std::size_t samples : {1u, 2u, 3u, 5u, 8u, 40u})
            for (const std::size_t pixels : {1u, 3u, 7u})
              ASSERT_NO_FATAL_FAILURE(ExpectPixels(raster, DataType(read.element), samples, pixels));
        }
      }
    }
  }
}

TEST(PixelReader, SamplesOfTheTypeAreReadWhereTheyStand) {
  for (const bool complex : {false, true}) {
    Image<short> image({9, 3, 2}, {1, 2}, 0, complex);
    for (std::size_t samples = 0; samples <= (complex ? 4u : 2u); ++samples) {
      PixelReader reader(image, DataType::Of<short>(), samples, 9);
      EXPECT_EQ(reader.Stride(), complex ? 4u : 2u);
      EXPECT_EQ(reader.At(0, 0, 9), reinterpret_cast<unsigned char*>(&image.At(0, 0)));
      EXPECT_EQ(reader.At(5, 2, 4), reinterpret_cast<unsigned char*>(&image.At(5, 2)));
    }
  }
}

TEST(PixelReader, OtherSamplesAreCopiedOneAfterTheOther) {
  Image<short> image({9, 3, 2});
  FillPlaces(image);
  const std::vector<unsigned char> before = tests::Bytes(image);
  for (const std::size_t samples : {1u, 3u, 7u}) {
    const DataType element = samples == 1 ? DataType::Of<unsigned short>() : DataType::Of<short>();
    PixelReader reader(image, element, samples, 9);
    EXPECT_EQ(reader.Stride(), samples);
    const unsigned char* const block = reader.At(4, 1, 5);
    EXPECT_TRUE(block + 1 <= image.data || block >= image.data + image.dataSize);
  }
  EXPECT_EQ(tests::Bytes(image), before);
}

TEST(PixelReader, MemoryEndsWhereTheRasterSaysSo) {
  for (const tests::PixelType& read : {tests::kPixelTypes[1], tests::kPixelTypes[7]}) {
    Image<unsigned char> image({5, 4});
    FillPlaces(image);
    for (std::uint64_t size = 0; size <= 20; ++size) {
      image.dataSize = size;
      for (const std::size_t samples : {2u, 3u})
        ASSERT_NO_FATAL_FAILURE(ExpectPixels(image, DataType(read.element), samples, 5)) << size << " bytes";
    }
  }
}

TEST(PixelReader, BlockOfLessLeavesNothingOfTheOneBefore) {
  Image<unsigned char> image({4, 1});
  FillPlaces(image);
  PixelReader reader(image, DataType::Of<int>(), 1, 4);
  reader.At(0, 0, 4);
  const unsigned char* const last = reader.At(3, 0, 1);
  EXPECT_EQ(Samples(last, last + 4), (Samples{image.At(3, 0), 0, 0, 0}));
}

TEST(PixelReader, ElementsAreWalkedFromTheRowsFirstOneOn) {
  for (const bool complex : {false, true}) {
    Image<int> image({6, 3, 3}, {2, 1}, 0, complex);
    for (const std::size_t samples : {0u, 1u, 5u}) {
      PixelReader reader(image, DataType::Of<int>(), samples, 6, Walk::kElements);
      EXPECT_EQ(reader.Stride(), 1u);
      for (std::uint32_t y = 0; y < 3; ++y)
        for (std::uint32_t x = 0; x < 6; ++x)
          EXPECT_EQ(reader.At(x, y, 6 - x),
                    reinterpret_cast<unsigned char*>(&image.At(0, static_cast<int>(y), x)))
              << x << ", " << y;
    }
    // The type that is read gives the steps.
    PixelReader narrow(image, DataType::Of<char>(), 1, 6, Walk::kElements);
    EXPECT_EQ(narrow.At(3, 1, 2), reinterpret_cast<unsigned char*>(&image.At(0, 1)) + 3);
  }
}

}  // namespace
}  // namespace orvik::frame
