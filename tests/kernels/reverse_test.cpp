#include "processes/gridmill/kernels/reverse.h"

#include <cstddef>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

TEST(ReversePixels, EveryPixelSizeAndLength) {
  constexpr unsigned char kGuard = 0xA5;
  for (const std::size_t bytes : {1u, 2u, 3u, 4u, 5u, 6u, 7u, 8u, 9u, 12u, 16u, 24u, 33u}) {
    for (std::size_t pixels = 1; pixels < 200; pixels += pixels < 70 ? 1 : 17) {
      std::vector<unsigned char> source(bytes * pixels), target(bytes * pixels + 64, kGuard);
      for (std::size_t i = 0; i < source.size(); ++i) source[i] = static_cast<unsigned char>(i * 7 + i / 256);
      ReversePixels(source.data() + (pixels - 1) * bytes, bytes, pixels, target.data());
      for (std::size_t i = 0; i < source.size(); ++i)
        ASSERT_EQ(target[i], source[(pixels - 1 - i / bytes) * bytes + i % bytes])
            << pixels << " pixels of " << bytes << " bytes, byte " << i;
      for (std::size_t i = source.size(); i < target.size(); ++i) ASSERT_EQ(target[i], kGuard);
    }
  }
}

TEST(ReversePixels, OfNoPixelsOrOfPixelsWithoutBytesWritesNothing) {
  const std::vector<unsigned char> source(64, 1);
  for (const std::size_t bytes : {0u, 1u, 2u, 3u, 4u, 5u, 8u, 16u}) {
    std::vector<unsigned char> target(64, 0xA5);
    ReversePixels(source.data(), bytes, 0, target.data());
    ReversePixels(source.data(), 0, bytes, target.data());
    EXPECT_EQ(target, std::vector<unsigned char>(64, 0xA5)) << bytes;
  }
}

}  // namespace
}  // namespace orvik::kernels
