#include "processes/gridmill/kernels/syntheticblue.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/random.h"

// Each function against the formula in `double`, one pixel after the other. All triples of bytes are tried
// where the tests are optimised or GRIDMILL_EXHAUSTIVE is set in the environment, else every seventh pair of
// the first two.
namespace orvik::kernels {
namespace {

using PixelTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;

constexpr std::size_t kGuard = 8;  // elements on each side of a target

double SlowBlue(double s0, double s1, double s2) {
  const double a = s0 * 0.873393;
  const double b = a + 13.9054;
  const double c = b - s1 * 0.138254;
  return c - s2 * 0.100616;
}

unsigned char SlowBin(double blue) {
  if (!(blue > -2147483649.0 && blue < 2147483648.0)) return 0;  // the most negative number
  const int whole = static_cast<int>(blue);
  return static_cast<unsigned char>(std::clamp(whole, 0, 255));
}

template <class Sample>
Sample AnySample(tests::Random& random) {
  const std::uint64_t bits = random.Bits();
  if (bits % 8 != 0) return static_cast<Sample>((bits >> 8) % 128);
  if constexpr (std::is_integral_v<Sample>) {
    const Sample limits[] = {std::numeric_limits<Sample>::min(), std::numeric_limits<Sample>::max()};
    return bits % 16 == 0 ? limits[(bits >> 8) % 2] : static_cast<Sample>(bits >> (8 + (bits >> 8) % 56));
  } else {
    using Limits = std::numeric_limits<Sample>;
    constexpr Sample special[] = {Limits::quiet_NaN(),    Limits::infinity(),      -Limits::infinity(),
                                  Limits::max(),          Limits::lowest(),        Limits::denorm_min(),
                                  Sample{-0.0f},          Sample{-15.92f},         Sample{-15.93f},
                                  Sample{2458782720.0f},  Sample{2458782464.0f},   Sample{-2458782720.0f},
                                  Sample{16.5f},          Sample{-17.2f},          Sample{300.25f},
                                  Sample{15532700000.0f}, Sample{-15532700000.0f}, Sample{275.9f}};
    return special[(bits >> 8) % std::size(special)];
  }
}

bool Same(double a, double b) {
  return (std::isnan(a) && std::isnan(b)) || std::memcmp(&a, &b, sizeof(a)) == 0;
}

/// Three channels, each with a start of its own.
template <class Sample>
struct Pixels {
  std::vector<Sample> channel[3];
  std::size_t count;

  Pixels(std::size_t pixels, tests::Random& random) : count(pixels) {
    for (std::size_t c = 0; c < 3; ++c)
      for (std::size_t i = 0; i < c + count; ++i) channel[c].push_back(AnySample<Sample>(random));
  }

  const Sample* At(std::size_t c) const { return channel[c].data() + c; }

  double Blue(std::size_t i) const {
    return SlowBlue(static_cast<double>(At(0)[i]), static_cast<double>(At(1)[i]),
                    static_cast<double>(At(2)[i]));
  }
};

std::vector<std::size_t> Counts() {
  std::vector<std::size_t> counts;
  for (std::size_t count = 0; count <= 135; ++count) counts.push_back(count);
  counts.insert(counts.end(), {255, 256, 257, 383, 384, 385, 1000});
  return counts;
}

template <class Sample>
class SyntheticBlueOf : public ::testing::Test {
 protected:
  tests::Random random_{51};
};
TYPED_TEST_SUITE(SyntheticBlueOf, PixelTypes);

TYPED_TEST(SyntheticBlueOf, RowIsTheFormula) {
  constexpr double sentinel = -12345.0;
  for (const std::size_t count : Counts()) {
    const Pixels<TypeParam> pixels(count, this->random_);
    std::vector<double> blue(count + 2 * kGuard + 1, sentinel);
    double* const target = blue.data() + kGuard + count % 2;
    SyntheticBlueRow(pixels.At(0), pixels.At(1), pixels.At(2), count, target);
    for (std::size_t i = 0; i < count; ++i)
      ASSERT_TRUE(Same(target[i], pixels.Blue(i)))
          << target[i] << " is not " << pixels.Blue(i) << ", pixel " << i << " of " << count;
    for (double* p = blue.data(); p < target; ++p) ASSERT_EQ(*p, sentinel);
    for (double* p = target + count; p < blue.data() + blue.size(); ++p) ASSERT_EQ(*p, sentinel);
  }
}

TYPED_TEST(SyntheticBlueOf, BinIsTheFormulaTruncatedAndLimited) {
  for (const std::size_t count : Counts()) {
    for (int round = 0; round < 4; ++round) {
      const Pixels<TypeParam> pixels(count, this->random_);
      std::vector<unsigned char> expected(count + 2 * kGuard + 3, 0xA5);
      std::vector<unsigned char> bins = expected;
      const std::size_t first = kGuard + count % 4;
      for (std::size_t i = 0; i < count; ++i) expected[first + i] = SlowBin(pixels.Blue(i));
      BlueBinRow(pixels.At(0), pixels.At(1), pixels.At(2), count, bins.data() + first);
      ASSERT_EQ(bins, expected) << count << " pixels";
    }
  }
}

TEST(BlueBinRow, LimitsOf32BitsAndNaN) {
  const double least = -2147483648.0, most = 2147483648.0;
  struct Case {
    double s1;
    int bin;
  };
  // The blue is 13.9054 - s1 * 0.138254.
  const Case cases[] = {{std::numeric_limits<double>::quiet_NaN(), 0},
                        {-std::numeric_limits<double>::infinity(), 0},
                        {std::numeric_limits<double>::infinity(), 0},
                        {-(most + 10) / 0.138254, 0},
                        {-(most - 20) / 0.138254, 255},
                        {-(most - 0.5 - 13.9054) / 0.138254, 255},
                        {-(most + 0.5 - 13.9054) / 0.138254, 0},
                        {-(least - 20) / 0.138254, 0},
                        {-(255.9 - 13.9054) / 0.138254, 255},
                        {-(254.9 - 13.9054) / 0.138254, 254},
                        {-(0.9 - 13.9054) / 0.138254, 0},
                        {-(1.1 - 13.9054) / 0.138254, 1},
                        {-(-0.9 - 13.9054) / 0.138254, 0},
                        {-(-1.1 - 13.9054) / 0.138254, 0}};
  for (const Case& c : cases) {
    const double zero = 0.0;
    unsigned char bin = 0xA5;
    BlueBinRow(&zero, &c.s1, &zero, 1, &bin);
    EXPECT_EQ(bin, c.bin) << c.s1;
    EXPECT_EQ(bin, SlowBin(SlowBlue(0.0, c.s1, 0.0))) << c.s1;
  }
}

// ---- all triples of bytes

int PairStep() {
#ifdef __OPTIMIZE__
  return 1;
#else
  return std::getenv("GRIDMILL_EXHAUSTIVE") == nullptr ? 7 : 1;
#endif
}

/// Calls `take(s0, s1)` for the pairs that are tried.
template <class Take>
void ForPairs(Take take) {
  for (int pair = 0; pair < 65536; pair += PairStep())
    take(static_cast<unsigned char>(pair >> 8), static_cast<unsigned char>(pair & 255));
}

TEST(BlueBinRow, AllTriplesOfBytes) {
  unsigned char s0[256], s1[256], s2[256], bins[256];
  for (int i = 0; i < 256; ++i) s2[i] = static_cast<unsigned char>(i);
  int wrong = 0;
  ForPairs([&](unsigned char first, unsigned char second) {
    std::fill_n(s0, 256, first);
    std::fill_n(s1, 256, second);
    BlueBinRow(s0, s1, s2, 256, bins);
    for (int i = 0; i < 256; ++i) wrong += bins[i] != SlowBin(SlowBlue(first, second, i));
  });
  EXPECT_EQ(wrong, 0);
}

TEST(EstimatedBlue, IsOffByLessThanTheErrorForAllTriplesOfBytes) {
  double greatest = 0.0;
  ForPairs([&greatest](unsigned char s0, unsigned char s1) {
    for (int i = 0; i < 256; ++i) {
      const double estimate = EstimatedBlue(s0, s1, static_cast<unsigned char>(i));
      greatest = std::max(greatest, std::fabs(estimate - SyntheticBlue(s0, s1, i)));
    }
  });
  EXPECT_LT(greatest, static_cast<double>(kEstimateError));
  EXPECT_GT(greatest, 1e-5);  // it is an estimate
}

TEST(SyntheticBlue, IsTheFormulaFromLeftToRight) {
  EXPECT_EQ(SyntheticBlue(0.0, 0.0, 0.0), 13.9054);
  tests::Random random(52);
  for (int i = 0; i < 1000; ++i) {
    const auto s0 = AnySample<double>(random), s1 = AnySample<double>(random), s2 = AnySample<double>(random);
    EXPECT_TRUE(Same(SyntheticBlue(s0, s1, s2), SlowBlue(s0, s1, s2))) << s0 << ", " << s1 << ", " << s2;
  }
}

}  // namespace
}  // namespace orvik::kernels
