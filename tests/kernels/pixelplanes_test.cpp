#include "processes/gridmill/kernels/pixelplanes.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <random>
#include <vector>

#include <gtest/gtest.h>

// Buffers end with the last sample that may be read or written, for the sanitizers to see.
namespace orvik::kernels {
namespace {

using PixelTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;

constexpr std::size_t kGuard = 8;  // samples on each side of a target

template <class Sample>
class PixelPlanesOf : public ::testing::Test {
 protected:
  /// Samples of random bits.
  std::vector<Sample> Random(std::size_t count) {
    std::vector<Sample> samples(count);
    for (Sample& sample : samples) {
      const std::uint64_t bits = random_();
      std::memcpy(&sample, &bits, sizeof(Sample));
    }
    return samples;
  }

 private:
  std::mt19937_64 random_{31};
};
TYPED_TEST_SUITE(PixelPlanesOf, PixelTypes);

std::vector<std::size_t> Counts() {
  std::vector<std::size_t> counts;
  for (std::size_t count = 0; count <= 40; ++count) counts.push_back(count);
  counts.insert(counts.end(), {63, 64, 65, 250, 255, 256});
  return counts;
}

template <class Sample>
bool SameBits(const Sample* a, const Sample* b, std::size_t count) {
  return count == 0 || std::memcmp(a, b, count * sizeof(Sample)) == 0;
}

TYPED_TEST(PixelPlanesOf, SplitPixelsPutsEachChannelIntoItsPlane) {
  for (const std::size_t count : Counts()) {
    for (std::size_t stride = 1; stride <= 19; stride += stride < 9 ? 1 : 5) {
      for (std::size_t channels = 1; channels <= std::min(stride, kSplitChannels<TypeParam>); ++channels) {
        const std::size_t samples = count == 0 ? 0 : (count - 1) * stride + channels;
        const std::vector<TypeParam> pixels = this->Random(samples);
        std::vector<TypeParam> memory(kSplitChannels<TypeParam> * kBlock);
        const auto planes = reinterpret_cast<TypeParam(*)[kBlock]>(memory.data());
        SplitPixels(pixels.data(), stride, channels, count, planes);
        for (std::size_t c = 0; c < channels; ++c)
          for (std::size_t i = 0; i < count; ++i)
            ASSERT_TRUE(SameBits(&planes[c][i], &pixels[i * stride + c], 1))
                << "channel " << c << " of " << channels << ", stride " << stride << ", pixel " << i << " of "
                << count;
      }
    }
  }
}

TYPED_TEST(PixelPlanesOf, JoinPixelsPutsEachPlaneIntoItsSample) {
  for (const std::size_t count : Counts()) {
    for (std::size_t samples = 0; samples <= 20; ++samples) {
      std::vector<std::vector<TypeParam>> planes(samples);
      std::vector<const TypeParam*> pointers;
      for (auto& plane : planes) {
        plane = this->Random(count);
        pointers.push_back(plane.data());
      }
      std::vector<TypeParam> expected = this->Random(samples * count + 2 * kGuard);
      std::vector<TypeParam> target = expected;
      for (std::size_t i = 0; i < count; ++i)
        for (std::size_t c = 0; c < samples; ++c) expected[kGuard + i * samples + c] = planes[c][i];
      JoinPixels(pointers.data(), samples, count, target.data() + kGuard);
      ASSERT_TRUE(SameBits(target.data(), expected.data(), target.size()))
          << samples << " samples, " << count << " pixels";
    }
  }
}

TEST(PixelPlanes, SplitTriplesPutsEachByteIntoItsPlane) {
  std::mt19937_64 random(32);
  for (const std::size_t count : Counts()) {
    std::vector<unsigned char> pixels(3 * count);
    for (unsigned char& byte : pixels) byte = static_cast<unsigned char>(random());
    std::vector<std::vector<unsigned char>> planes(3, std::vector<unsigned char>(count + 2 * kGuard, 77));
    SplitTriples(pixels.data(), count, planes[0].data() + kGuard, planes[1].data() + kGuard,
                 planes[2].data() + kGuard);
    for (std::size_t c = 0; c < 3; ++c) {
      std::vector<unsigned char> expected(count + 2 * kGuard, 77);
      for (std::size_t i = 0; i < count; ++i) expected[kGuard + i] = pixels[3 * i + c];
      EXPECT_EQ(planes[c], expected) << count << " pixels, channel " << c;
    }
  }
}

}  // namespace
}  // namespace orvik::kernels
