#include "processes/gridmill/kernels/focussums.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <random>
#include <vector>

#include <gtest/gtest.h>

#include "processes/gridmill/kernels/countedsamples.h"
#include "tests/attack/guardedpages.h"
#include "tests/reference/focussample_reference.h"

namespace orvik::kernels {
namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

struct Bounds {
  double low;
  double high;
  double failure;
};

const Bounds kBounds[] = {{-1e7, 1e7, -32767.0},
                          {-1e7, 1e7, 7.0},
                          {3.0, 100.0, 50.0},
                          {2.5, 99.5, 7.0 + 5e-10},
                          {-0.5, 1e7, 7.0 + 2e-9},
                          {0.0, 60000.0, 1e-9},
                          {-1e7, 1e7, -1e-9},
                          {-1e300, 1e300, 0.5},
                          {-kInfinity, kInfinity, kInfinity},
                          {-kInfinity, kInfinity, -kInfinity},
                          {kNaN, 100.0, 0.0},
                          {0.0, kNaN, 0.0},
                          {-1e7, 1e7, kNaN},
                          {100.0, 3.0, 50.0},
                          {-1e19, 1e19, 9007199254740993.0},
                          {-9223372036854775807.0, 18446744073709551615.0, -1.0}};

bool Counts(double value, const Bounds& b) { return !reference::IsRejected(value, b.low, b.high, b.failure); }

template <class In>
class FocusSumsTest : public testing::Test {};

using PixelTypes = testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                  double, std::int64_t, std::uint64_t>;
TYPED_TEST_SUITE(FocusSumsTest, PixelTypes);

/// The sample nearest to a number.
template <class In>
In Nearest(double value) {
  using Limits = std::numeric_limits<In>;
  if (std::is_floating_point_v<In>) return static_cast<In>(value);
  if (!(value > static_cast<double>(Limits::lowest()))) return Limits::lowest();
  return value < static_cast<double>(Limits::max()) ? static_cast<In>(value) : Limits::max();
}

template <class In>
In Neighbour(In sample, int step) {
  if constexpr (std::is_floating_point_v<In>) {
    return std::nextafter(
        sample, step < 0 ? -std::numeric_limits<In>::infinity() : std::numeric_limits<In>::infinity());
  } else {
    return static_cast<In>(static_cast<std::uint64_t>(sample) + static_cast<std::uint64_t>(step));
  }
}

/// All samples of a narrow type; of others the ends, specials, and those around a number.
template <class In>
std::vector<In> SamplesAround(const std::vector<double>& numbers) {
  using Limits = std::numeric_limits<In>;
  std::vector<In> samples = {Limits::lowest(),
                             Limits::max(),
                             Limits::min(),
                             Limits::infinity(),
                             static_cast<In>(-Limits::infinity()),
                             Limits::quiet_NaN(),
                             In{0},
                             -In{0}};
  for (const double number : numbers) {
    In below = Nearest<In>(number), above = below;
    samples.push_back(below);
    for (int i = 0; i < 600; ++i) {
      samples.push_back(below = Neighbour(below, -1));
      samples.push_back(above = Neighbour(above, 1));
    }
  }
  if (sizeof(In) <= 2)
    for (int v = 0; v < 65536; ++v) samples.push_back(static_cast<In>(v));
  return samples;
}

TYPED_TEST(FocusSumsTest, TheCountedSamplesAreThoseOfTheDefinition) {
  using In = TypeParam;
  for (const Bounds& b : kBounds) {
    const CountedSamples<In> counted(b.low, b.high, b.failure);
    bool all = true;
    for (const In sample :
         SamplesAround<In>({b.low, b.high, b.failure, b.failure + 1e-9, b.failure - 1e-9})) {
      const bool counts = Counts(static_cast<double>(sample), b);
      all &= counts;
      ASSERT_EQ(counted.Has(sample), counts ? 1 : 0)
          << static_cast<double>(sample) << " in " << b.low << ", " << b.high << ", failure " << b.failure;
    }
    if (sizeof(In) <= 2) {
      EXPECT_EQ(counted.HasAll(), all) << b.low << ", " << b.high << ", " << b.failure;
    }
  }
}

/// Random samples, some of which are special or the one that counts as a failure.
template <class In>
std::vector<In> Samples(std::size_t count, const Bounds& b, std::mt19937_64& random) {
  const double often[] = {b.failure, b.low, b.high, 7.0, 0.0};
  std::vector<In> samples(count);
  for (In& sample : samples) {
    if constexpr (std::is_floating_point_v<In>) {
      sample = static_cast<In>(static_cast<double>(random() % 2000000) / 64.0 - 1e4);
      if (random() % 200 == 0) sample = std::numeric_limits<In>::quiet_NaN();
    } else {
      sample = static_cast<In>(random() >> (random() % 64));
    }
    if (random() % 64 == 0) sample = Nearest<In>(often[random() % 5]);
  }
  return samples;
}

template <class In>
void SlowSquares(const In* upper, const In* lower, std::size_t channels, std::size_t pixels, const Bounds& b,
                 std::vector<double>& sums) {
  for (std::size_t i = 0; i < channels * pixels; ++i) {
    const double p0 = static_cast<double>(upper[i]), p1 = static_cast<double>(lower[i]);
    if (Counts(p0, b) && Counts(p1, b)) sums[i % channels] += (p1 - p0) * (p1 - p0);
  }
}

template <class In>
void SlowProducts(const In* row, std::size_t channels, std::size_t pixels, const Bounds& b,
                  std::vector<double>& left, std::vector<double>& right) {
  for (std::size_t i = 0; i < channels * pixels; ++i) {
    const double p0 = static_cast<double>(row[i]), p1 = static_cast<double>(row[i + channels]),
                 p2 = static_cast<double>(row[i + 2 * channels]);
    if (!Counts(p0, b) || !Counts(p1, b) || !Counts(p2, b)) continue;
    left[i % channels] += p1 * p0;
    right[i % channels] += p2 * p0;
  }
}

bool SameBits(const std::vector<double>& a, const std::vector<double>& b) {
  for (std::size_t i = 0; i < a.size(); ++i)
    if (std::bit_cast<std::uint64_t>(a[i]) != std::bit_cast<std::uint64_t>(b[i])) return false;
  return a.size() == b.size();
}

/// The samples where no access behind the last one is possible.
template <class In>
const In* AtTheEnd(const attack::GuardedPages& pages, const std::vector<In>& samples) {
  const std::size_t bytes = samples.size() * sizeof(In);
  unsigned char* const place = pages.Place(bytes, true);
  std::copy_n(reinterpret_cast<const unsigned char*>(samples.data()), bytes, place);
  return reinterpret_cast<const In*>(place);
}

/// Three rows after each other into the same sums, which start with `start`.
template <class In>
void ExpectThePlainLoops(std::size_t channels, std::size_t pixels, const Bounds& b, double start,
                         std::mt19937_64& random) {
  static const attack::GuardedPages pages[] = {attack::GuardedPages(1 << 19), attack::GuardedPages(1 << 19)};
  const FocusSums<In> fast{channels, CountedSamples<In>(b.low, b.high, b.failure)};
  std::vector<double> squares(channels, start), left = squares, right = squares;
  std::vector<double> slowSquares = squares, slowLeft = squares, slowRight = squares;
  for (int y = 0; y < 3; ++y) {
    const std::vector<In> upper = Samples<In>(channels * (pixels + 2), b, random);
    const std::vector<In> lower = Samples<In>(channels * pixels, b, random);
    const In *const first = AtTheEnd(pages[0], upper), *const second = AtTheEnd(pages[1], lower);
    fast.AddSquaredDifferences(first, second, pixels, squares.data());
    fast.AddNeighbourProducts(first, pixels, left.data(), right.data());
    SlowSquares(upper.data(), lower.data(), channels, pixels, b, slowSquares);
    SlowProducts(upper.data(), channels, pixels, b, slowLeft, slowRight);
  }
  const bool same = SameBits(squares, slowSquares) && SameBits(left, slowLeft) && SameBits(right, slowRight);
  ASSERT_TRUE(same) << pixels << " pixels of " << channels << ", bounds " << b.low << ", " << b.high
                    << ", failure " << b.failure << ", sums from " << start;
}

TYPED_TEST(FocusSumsTest, TheSumsAreThoseOfThePlainLoops) {
  std::mt19937_64 random(31);
  for (const Bounds& b : {kBounds[0], kBounds[1], kBounds[2]}) {
    for (const std::size_t channels : std::vector<std::size_t>{1, 2, 3, 4, 5, 6, 7, 8, 9}) {
      for (std::size_t pixels = 0; pixels <= 70; ++pixels)
        ExpectThePlainLoops<TypeParam>(channels, pixels, b, 0.0, random);
      ExpectThePlainLoops<TypeParam>(channels, 2500, b, 0.0, random);
      if (this->HasFatalFailure()) return;
    }
  }
}

TYPED_TEST(FocusSumsTest, EveryKindOfBoundsGivesTheSumsOfThePlainLoops) {
  std::mt19937_64 random(32);
  for (const Bounds& b : kBounds)
    for (const std::size_t channels : std::vector<std::size_t>{1, 3, 4, 8})
      ExpectThePlainLoops<TypeParam>(channels, 700, b, 0.0, random);
}

TYPED_TEST(FocusSumsTest, PixelsOfVeryManyChannelsGoThroughInPieces) {
  std::mt19937_64 random(33);
  for (const std::size_t channels : std::vector<std::size_t>{100, 1023, 1024, 1025, 5000})
    ExpectThePlainLoops<TypeParam>(channels, 5, kBounds[1], 0.0, random);
}

TYPED_TEST(FocusSumsTest, SumsBeyond2To53AreRoundedTermByTerm) {
  std::mt19937_64 random(34);
  for (const double start : {0x1p53 - 1e9, 0x1p53 - 1.0, 0x1p53, 0x1p54 + 4.0, 0x1p60}) {
    for (const std::size_t channels : std::vector<std::size_t>{1, 2, 3, 4, 5, 9}) {
      ExpectThePlainLoops<TypeParam>(channels, 1, kBounds[1], start, random);
      ExpectThePlainLoops<TypeParam>(channels, 1100, kBounds[0], start, random);
    }
  }
}

TEST(FocusSums, EachOfTheTwoSumsOfProductsIsRoundedTermByTermBeyond2To53) {
  const FocusSums<short> sums{1, CountedSamples<short>(-10, 10, -32767)};
  const std::vector<short> row = {1, 1, 1, 1};
  // 2^53 and 1 is halfway to the next number, and the even one is 2^53; 2^53 and 2 would be a number.
  double left = 0.0, right = 0x1p53;
  sums.AddNeighbourProducts(row.data(), 2, &left, &right);
  EXPECT_EQ(left, 2.0);
  EXPECT_EQ(right, 0x1p53);
  left = 0x1p53, right = 0.0;
  sums.AddNeighbourProducts(row.data(), 2, &left, &right);
  EXPECT_EQ(left, 0x1p53);
  EXPECT_EQ(right, 2.0);
}

TEST(CountSetInBoth, CountsTheBitsThatAreSetInBothRuns) {
  std::mt19937 random(35);
  for (std::size_t count = 0; count <= 200; ++count) {
    for (int trial = 0; trial < 12; ++trial) {
      const std::size_t first = random() % 40, second = first + random() % 70;
      // Not a byte more than the runs have: a read beyond is one beyond the vector.
      std::vector<unsigned char> bits((second + count + 7) / 8);
      for (unsigned char& byte : bits) byte = static_cast<unsigned char>(random() | random());
      const auto bit = [&](std::size_t i) { return (bits[i / 8] >> (7 - i % 8)) & 1; };
      std::size_t expected = 0;
      for (std::size_t i = 0; i < count; ++i) expected += bit(first + i) != 0 && bit(second + i) != 0;
      ASSERT_EQ(CountSetInBoth(bits.data(), first, second, count), expected)
          << count << " bits from " << first << " and " << second;
    }
  }
}

}  // namespace
}  // namespace orvik::kernels
