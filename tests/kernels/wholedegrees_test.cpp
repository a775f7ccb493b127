#include "processes/gridmill/kernels/wholedegrees.h"

#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <random>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

float FromBits(std::uint64_t bits) { return std::bit_cast<float>(static_cast<std::uint32_t>(bits)); }

constexpr std::uint64_t kOne = std::bit_cast<std::uint32_t>(1.0f);

/// One cosine to a row: a neighbour in doubt would have the whole row computed by the definition.
bool Agrees(float cosine) {
  int degrees = -1;
  RoundedDegreesRow(&cosine, 1, &degrees);
  return degrees == RoundedDegrees(cosine);
}

TEST(RoundedDegreesRow, AgreesWithTheDefinitionOnASubsetOfAllCosines) {
  for (std::uint64_t bits = 0; bits <= kOne; bits += 251) {
    ASSERT_TRUE(Agrees(FromBits(bits))) << FromBits(bits);
    ASSERT_TRUE(Agrees(-FromBits(bits))) << -FromBits(bits);
  }
}

TEST(RoundedDegreesRow, AgreesWithTheDefinitionAroundEveryHalfDegree) {
  for (int half = 1; half < 360; half += 2) {
    const auto centre = static_cast<float>(std::cos(half * 0.5 * 3.14159265358979323846 / 180.0));
    const auto bits = std::bit_cast<std::uint32_t>(centre);
    for (std::uint32_t step = 0; step < 4000; ++step) {
      ASSERT_TRUE(Agrees(FromBits(bits + step))) << half << " halves and " << step;
      ASSERT_TRUE(Agrees(FromBits(bits - step))) << half << " halves less " << step;
    }
  }
}

TEST(RoundedDegreesRow, AgreesWithTheDefinitionBeyondOneAndForNaN) {
  using Limits = std::numeric_limits<float>;
  for (const float cosine : {std::nextafter(1.0f, 2.0f), -std::nextafter(1.0f, 2.0f), 2.0f, -2.0f,
                             Limits::max(), Limits::infinity(), -Limits::infinity(), Limits::quiet_NaN(),
                             0.0f, -0.0f, Limits::denorm_min(), -Limits::denorm_min()})
    EXPECT_TRUE(Agrees(cosine)) << cosine;
}

TEST(RoundedDegreesRow, AgreesWithTheDefinitionInRowsOfAnyLength) {
  std::mt19937 random(15);
  for (std::size_t count = 0; count <= 300; ++count) {
    std::vector<float> cosine(count);
    for (float& c : cosine) c = FromBits(random() % (kOne + 1) | (random() % 2) << 31);
    if (count % 3 == 2) cosine[count / 2] = std::numeric_limits<float>::quiet_NaN();
    std::vector<int> expected(count + 16, -7);
    std::vector<int> target = expected;
    for (std::size_t i = 0; i < count; ++i) expected[8 + i] = RoundedDegrees(cosine[i]);
    RoundedDegreesRow(cosine.data(), count, target.data() + 8);
    ASSERT_EQ(target, expected) << count;
  }
}

TEST(RoundedDegreesRowExhaustive, AgreesWithTheDefinitionOnEveryCosine) {
  if (std::getenv("GRIDMILL_EXHAUSTIVE") == nullptr) GTEST_SKIP() << "GRIDMILL_EXHAUSTIVE is not set";
  for (std::uint64_t bits = 0; bits <= kOne; ++bits) {
    ASSERT_TRUE(Agrees(FromBits(bits))) << FromBits(bits);
    ASSERT_TRUE(Agrees(-FromBits(bits))) << -FromBits(bits);
  }
}

}  // namespace
}  // namespace orvik::kernels
