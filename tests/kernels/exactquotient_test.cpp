#include "processes/gridmill/kernels/exactquotient.h"

#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <random>

#include <gtest/gtest.h>

// Against the processor's division, which rounds correctly: the same bits, so that a wrong last bit or sign
// of zero shows.
namespace orvik::kernels {
namespace {

void ExpectQuotient(std::int64_t doubledNumerator, int doubledDivisor) {
  const double numerator = static_cast<double>(doubledNumerator) * 0.5;
  const float divisor = static_cast<float>(doubledDivisor) * 0.5f;
  const double quotient = numerator / static_cast<double>(divisor);
  ASSERT_EQ(std::bit_cast<std::uint64_t>(ExactQuotient(numerator, Divisor(divisor))),
            std::bit_cast<std::uint64_t>(quotient))
      << numerator << " / " << divisor;
}

TEST(ExactQuotient, IsTheDivisionForRandomNumeratorsOfEverySize) {
  std::mt19937_64 random(41);
  for (int i = 0; i < 5000000; ++i) {
    const std::uint64_t bits = random();
    const auto numerator = static_cast<std::int64_t>(random() >> (28 + bits % 36));
    const auto divisor = static_cast<int>((random() >> 46) >> (bits / 64 % 18));
    if (divisor == 0) continue;
    const bool negative = (bits >> 62 & 1) != 0;
    const bool negativeDivisor = bits >> 63 != 0;
    ASSERT_NO_FATAL_FAILURE(
        ExpectQuotient(negative ? -numerator : numerator, negativeDivisor ? -divisor : divisor));
  }
}

TEST(ExactQuotient, IsTheDivisionForEveryDivisorAndNumeratorsAroundItsMultiples) {
  std::mt19937_64 random(42);
  for (int divisor = 1; divisor < 1 << 18; ++divisor) {
    const auto multiple = static_cast<std::int64_t>(divisor) * static_cast<std::int64_t>(random() % 65536);
    for (int offset = -2; offset <= 2; ++offset) {
      ASSERT_NO_FATAL_FAILURE(ExpectQuotient(multiple + offset, divisor));
      ASSERT_NO_FATAL_FAILURE(ExpectQuotient(multiple + offset, -divisor));
    }
    ASSERT_NO_FATAL_FAILURE(ExpectQuotient(0, divisor));
    ASSERT_NO_FATAL_FAILURE(ExpectQuotient(0, -divisor));
  }
}

TEST(ExactQuotient, IsNaNForADivisorOfZero) {
  for (const double numerator : {-1.0, 0.0, 1.0})
    EXPECT_TRUE(std::isnan(ExactQuotient(numerator, Divisor(0.0f))));
}

}  // namespace
}  // namespace orvik::kernels
