#include "processes/gridmill/kernels/maskedcells.h"

#include <cstddef>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

using Bytes = std::vector<unsigned char>;

Bytes RandomValidity(std::size_t count, std::mt19937& random) {
  Bytes valid(count);
  for (unsigned char& byte : valid) byte = static_cast<unsigned char>(random() % 2);
  return valid;
}

TEST(AllValid, IsFalseFromTheFirstClearByteOn) {
  for (std::size_t count = 0; count <= 70; ++count) {
    Bytes valid(count + 1, 1);
    valid[count] = 0;
    EXPECT_TRUE(AllValid(valid.data(), count)) << count;
    EXPECT_FALSE(AllValid(valid.data(), count + 1)) << count;
  }
}

TEST(AllMasked, IsFalseFromTheFirstSetByteOn) {
  for (std::size_t count = 0; count <= 70; ++count) {
    Bytes valid(count + 1, 0);
    valid[count] = 1;
    EXPECT_TRUE(AllMasked(valid.data(), count)) << count;
    EXPECT_FALSE(AllMasked(valid.data(), count + 1)) << count;
  }
}

TEST(ReplicateRow, GivesEverySampleTheByteOfItsPixel) {
  std::mt19937 random(11);
  for (std::size_t channels = 1; channels <= 7; ++channels) {
    for (std::size_t pixels = 0; pixels <= 70; ++pixels) {
      const Bytes pixel = RandomValidity(pixels, random);
      Bytes expected(pixels * channels + 16, 0xA5);
      Bytes target = expected;
      for (std::size_t i = 0; i < pixels * channels; ++i) expected[8 + i] = pixel[i / channels];
      ReplicateRow(pixel.data(), channels, pixels, target.data() + 8);
      ASSERT_EQ(target, expected) << channels << " channels, " << pixels << " pixels";
    }
  }
}

TEST(LevelRow, AMaskedCornerIsItsCentre) {
  std::mt19937 random(12);
  for (std::size_t count = 0; count <= 70; ++count) {
    const Bytes valid = RandomValidity(count, random);
    std::vector<float> centre(count), corner(count), expected(count + 16, -1.0f);
    std::vector<float> target = expected;
    for (std::size_t i = 0; i < count; ++i) {
      centre[i] = static_cast<float>(i);
      corner[i] = i % 5 == 0 ? std::numeric_limits<float>::infinity() : 1000.0f + static_cast<float>(i);
      expected[8 + i] = valid[i] != 0 ? corner[i] : centre[i];
    }
    LevelRow(centre.data(), corner.data(), valid.data(), count, target.data() + 8);
    ASSERT_EQ(target, expected) << count;
  }
}

/// Notes for each pixel which way it goes: b, u or m.
struct Ways {
  std::string* ways;
  const unsigned char* mask;
  const unsigned char* maskBelow;

  void Note(std::size_t first, std::size_t count, char way) const {
    for (std::size_t i = first; i < first + count; ++i) {
      EXPECT_EQ((*ways)[i], '.') << "pixel " << i << " twice";
      (*ways)[i] = way;
    }
  }
  void Background(std::size_t first, std::size_t count) const { Note(first, count, 'b'); }
  void Unmasked(std::size_t first, std::size_t count) const { Note(first, count, 'u'); }
  void Masked(std::size_t first, std::size_t count, const unsigned char* valid,
              const unsigned char* validBelow) const {
    EXPECT_EQ(valid, mask + first);
    EXPECT_EQ(validBelow, maskBelow + first);
    Note(first, count, 'm');
  }
};

std::string WaysOf(const Bytes& mask, const Bytes& maskBelow, std::size_t pixels) {
  std::string ways(mask.size() - 1, '.');
  RunMaskedCells(Ways{&ways, mask.data(), maskBelow.data()}, mask.size() - 1, pixels, mask.data(),
                 maskBelow.data());
  return ways;
}

TEST(RunMaskedCells, BlocksWithoutAValidPixelAreBackgroundWhateverLiesBelow) {
  EXPECT_EQ(WaysOf({0, 0, 0, 0, 1}, {1, 0, 1, 0, 1}, 4), "bbbb");
}

TEST(RunMaskedCells, BlocksWithEveryCornerValidAreUnmasked) {
  EXPECT_EQ(WaysOf({1, 1, 1, 1, 1}, {1, 1, 1, 1, 1}, 4), "uuuu");
}

TEST(RunMaskedCells, TheCornerRightOfABlockCountsInBothRows) {
  EXPECT_EQ(WaysOf({1, 1, 1, 1, 0}, {1, 1, 1, 1, 1}, 4), "mmmm");
  EXPECT_EQ(WaysOf({1, 1, 1, 1, 1}, {1, 1, 1, 1, 0}, 4), "mmmm");
}

TEST(RunMaskedCells, EachBlockGoesItsOwnWayAndTheLastOneIsShorter) {
  EXPECT_EQ(WaysOf({1, 1, 1, 0, 0, 0, 1, 1, 1}, {1, 1, 1, 1, 1, 1, 1, 1, 1}, 2), "uummbbuu");
  EXPECT_EQ(WaysOf({1, 1, 1, 1, 0, 0}, {1, 1, 1, 1, 1, 1}, 3), "uuumm");
  EXPECT_EQ(WaysOf({1}, {1}, 3), "");
}

}  // namespace
}  // namespace orvik::kernels
