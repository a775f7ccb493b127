#include "processes/gridmill/kernels/logarithm.h"

#include <algorithm>
#include <atomic>
#include <bit>
#include <cfloat>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <random>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#if __has_include(<gnu/libc-version.h>)
#include <gnu/libc-version.h>
#endif

// Within 1 ulp of the platform's function and with the same decibels in single precision, where the platform
// is the one that the kernel promises that of; the table and the values that need no oracle on every
// platform. Hundreds of millions of arguments are tested where GRIDMILL_EXHAUSTIVE is set in the environment,
// which takes minutes.
namespace orvik::kernels {
namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kSmallest = std::numeric_limits<double>::denorm_min();

// ---- the kernel, built for each instruction set

GRIDMILL_INLINE void Loop(const double* __restrict x, std::size_t count, double* __restrict log10) {
  for (std::size_t i = 0; i < count; ++i) log10[i] = Log10(x[i]);
}

void BaselineLoop(const double* x, std::size_t count, double* log10) { Loop(x, count, log10); }

using RowFunction = void (*)(const double*, std::size_t, double*);

#if defined(__x86_64__) && defined(__GNUC__) && !defined(__clang__)
__attribute__((target("arch=x86-64-v3"))) void V3Loop(const double* x, std::size_t count, double* log10) {
  Loop(x, count, log10);
}
__attribute__((target("arch=x86-64-v4"))) void V4Loop(const double* x, std::size_t count, double* log10) {
  Loop(x, count, log10);
}
/// The library's row, and the loops that this processor can run.
std::vector<RowFunction> Rows() {
  std::vector<RowFunction> rows = {&Log10Row, &BaselineLoop};
  if (__builtin_cpu_supports("x86-64-v3")) rows.push_back(&V3Loop);
  if (__builtin_cpu_supports("x86-64-v4")) rows.push_back(&V4Loop);
  return rows;
}
#else
std::vector<RowFunction> Rows() { return {&Log10Row, &BaselineLoop}; }
#endif

bool Same(double a, double b) {
  if (std::isnan(a) || std::isnan(b)) return std::isnan(a) && std::isnan(b);
  return std::bit_cast<std::uint64_t>(a) == std::bit_cast<std::uint64_t>(b);
}

/// The place of a value among all of `double`, with both zeros at 0.
std::int64_t Place(double value) {
  const auto magnitude = static_cast<std::int64_t>(std::bit_cast<std::uint64_t>(value) << 1 >> 1);
  return std::signbit(value) ? -magnitude : magnitude;
}

/// How many values of `double` lie between, and one more; 0 between NaN and NaN.
std::uint64_t UlpDistance(double a, double b) {
  if (std::isnan(a) || std::isnan(b)) return std::isnan(a) && std::isnan(b) ? 0 : ~std::uint64_t{0};
  const std::int64_t first = Place(a);
  const std::int64_t second = Place(b);
  const auto difference = static_cast<std::uint64_t>(first) - static_cast<std::uint64_t>(second);
  return first < second ? 0 - difference : difference;
}

bool SameDecibels(double a, double b) {
  const auto first = static_cast<float>(10.0 * a);
  const auto second = static_cast<float>(10.0 * b);
  return first == second || (std::isnan(first) && std::isnan(second));
}

/// Collects arguments and, when a batch is full and at the end, compares the rows with each other and with
/// the platform's function.
class Checker {
 public:
  Checker() : x_(kBatch) { x_.clear(); }
  Checker(const Checker&) = delete;
  Checker& operator=(const Checker&) = delete;
  ~Checker() { Flush(); }

  void Add(double x) {
    x_.push_back(x);
    if (x_.size() == kBatch) Flush();
  }

 private:
  static constexpr std::size_t kBatch = 1024;

  void Flush() {
    std::vector<double> first(x_.size());
    std::vector<double> other(x_.size());
    rows_[0](x_.data(), x_.size(), first.data());
    for (std::size_t i = 0; i < x_.size(); ++i) {
      const double expected = std::log10(x_[i]);
      if (UlpDistance(first[i], expected) > 1) Report("more than 1 ulp from", x_[i], first[i], expected);
      if (!SameDecibels(first[i], expected)) Report("other decibels than", x_[i], first[i], expected);
    }
    for (std::size_t row = 1; row < rows_.size(); ++row) {
      rows_[row](x_.data(), x_.size(), other.data());
      for (std::size_t i = 0; i < x_.size(); ++i)
        if (!Same(other[i], first[i])) Report("not the same as the row's", x_[i], other[i], first[i]);
    }
    x_.clear();
  }

  void Report(const char* what, double x, double result, double expected) {
    if (++reports_ > 10) return;
    char text[200];
    std::snprintf(text, sizeof(text), "of %a: %a, %s %a", x, result, what, expected);
    ADD_FAILURE() << text;
  }

  const std::vector<RowFunction> rows_ = Rows();
  std::vector<double> x_;
  int reports_ = 0;
};

// ---- arguments

using Random = std::mt19937_64;

/// 0 to 1.
double Fraction(Random& random) { return static_cast<double>(random() >> 11) * 0x1p-53; }

double AnyBits(Random& random) { return std::bit_cast<double>(random()); }

double AnyDenormal(Random& random) {
  const std::uint64_t bits = random() >> 12;
  return std::bit_cast<double>(bits >> random() % 52);
}

/// Around 1 in every order of magnitude, on both sides.
double NearOne(Random& random) {
  const double difference = std::ldexp(Fraction(random), -static_cast<int>(random() % 54));
  return random() % 2 == 0 ? 1.0 + difference : 1.0 - difference * 0.5;
}

/// The quotient of two channel means, as the operator divides them. `channels` is 1 to 4.
template <class Sample>
double QuotientOfMeans(Random& random, Sample sample) {
  const auto channels = random() % 4 + 1;
  double s = 0.0;
  double t = 0.0;
  for (std::uint64_t c = 0; c < channels; ++c) {
    s += sample(random);
    t += sample(random);
  }
  return (s / static_cast<double>(channels)) / (t / static_cast<double>(channels));
}

double ShortSample(Random& random) { return static_cast<double>(random() % 65536); }
double FloatSample(Random& random) {
  return static_cast<double>(
      static_cast<float>(std::ldexp(Fraction(random), static_cast<int>(random() % 12))));
}

/// Where the logarithm's first digits are 1.00 to 1.16 in binary and 1 ulp of it is up to 1.74 of the result:
/// nowhere is the bound of 1 ulp tighter.
double Critical(Random& random) {
  const double logarithm = std::ldexp(1.0 + 0.16 * Fraction(random), -1 - static_cast<int>(random() % 20));
  return std::exp(random() % 2 == 0 ? logarithm : -logarithm);
}

void AddEachKind(Checker& checker, Random& random) {
  checker.Add(AnyBits(random));
  checker.Add(AnyDenormal(random));
  checker.Add(NearOne(random));
  checker.Add(0.5 + 1.5 * Fraction(random));
  checker.Add(Critical(random));
  checker.Add(QuotientOfMeans(random, ShortSample));
  checker.Add(QuotientOfMeans(random, FloatSample));
}

std::vector<double> SpecialValues() {
  using Limits = std::numeric_limits<double>;
  return {0.0,  -0.0, kInfinity, -kInfinity, kNaN,       -1.0, Limits::lowest(), -kSmallest, kSmallest,
          0.5,  2.0,  1.0,       10.0,       0x1p-1022,  0.75, Limits::max(),    1.5,        1.0 + 0x1p-52,
          1e-5, 1e5,  0x1p-1023, 0x1p-1073,  -0x1p-1022, 0.25, 1.0 - 0x1p-53,    3.0};
}

// ---- what needs no oracle

TEST(Logarithm, ZerosGiveMinusInfinity) {
  EXPECT_EQ(Log10(0.0), -kInfinity);
  EXPECT_EQ(Log10(-0.0), -kInfinity);
}

TEST(Logarithm, InfinityGivesInfinity) { EXPECT_EQ(Log10(kInfinity), kInfinity); }

TEST(Logarithm, NegativeValuesAndNaNGiveNaN) {
  for (const double x :
       {-1.0, -kInfinity, -kSmallest, -0x1p-1022, std::numeric_limits<double>::lowest(), kNaN, -kNaN})
    EXPECT_TRUE(std::isnan(Log10(x))) << x;
}

TEST(Logarithm, OneGivesPlusZero) { EXPECT_TRUE(Same(Log10(1.0), 0.0)); }

TEST(Logarithm, PowersOfTenGiveTheirExponents) {
  for (int power = -307; power <= 308; ++power) {
    const double x = std::strtod(("1e" + std::to_string(power)).c_str(), nullptr);
    EXPECT_EQ(Log10(x), static_cast<double>(power));
  }
}

TEST(Logarithm, PowersOfTwoGiveMultiplesOfTheLogarithmOfTwo) {
  constexpr double logarithm = 3.01029995663981195214e-01;  // rounded
  constexpr double rest = -2.80372e-18;                     // what the rounding took
  for (int power = -1074; power <= 1023; ++power) {
    const double expected = std::fma(power, logarithm, power * rest);
    EXPECT_LE(UlpDistance(Log10(std::ldexp(1.0, power)), expected), 1u) << power;
  }
}

TEST(Logarithm, TheSmallestNumbersHaveTheirLogarithms) {
  EXPECT_DOUBLE_EQ(Log10(kSmallest), -323.306215343115804);
  EXPECT_DOUBLE_EQ(Log10(3 * kSmallest), -322.829094088396142);
  EXPECT_DOUBLE_EQ(Log10(0x1p-1022), -307.652655568588784);
  EXPECT_DOUBLE_EQ(Log10(std::numeric_limits<double>::max()), 308.254715559916744);
}

TEST(Logarithm, ReciprocalsAreExactInSingleAndTheirLogarithmsNearlyInDoublePrecision) {
  if (LDBL_MANT_DIG < 64) GTEST_SKIP() << "no type here is more precise than double";
  EXPECT_EQ(std::size(kLog10Table), SplitForLog10(std::nextafter(2.0, 1.0)).entry + 1);
  EXPECT_EQ(SplitForLog10(0.5).entry, 0u);
  for (const Log10Entry& entry : kLog10Table) {
    EXPECT_EQ(static_cast<double>(static_cast<float>(entry.reciprocal)), entry.reciprocal);
    const long double exact = -std::log(static_cast<long double>(entry.reciprocal));
    EXPECT_LE(std::fabs(exact - static_cast<long double>(entry.logarithm)), std::fabs(exact) * 0x1p-61L);
  }
}

TEST(Logarithm, EveryIntervalLiesAroundTheReciprocalOfItsEntry) {
  for (std::uint64_t step = 0; step < 1 << 13; ++step) {
    const double mantissa = std::bit_cast<double>(0x3FE0000000000000u + (step << 40));
    const Log10Parts parts = SplitForLog10(mantissa);
    EXPECT_LT(std::fabs(kLog10Table[parts.entry].reciprocal * mantissa - 1.0), 0.00773) << mantissa;
  }
}

TEST(Logarithm, ErrorStaysBelowOneAndThreeQuartersUlp) {
  if (LDBL_MANT_DIG < 64) GTEST_SKIP() << "no type here is more precise than double";
  Random random(3);
  for (int i = 0; i < 300'000; ++i) {
    const double x = i % 3 == 0   ? NearOne(random)
                     : i % 3 == 1 ? Critical(random)
                                  : std::fabs(AnyBits(random));
    const long double exact = std::log10(static_cast<long double>(x));
    if (!std::isfinite(exact) || exact == 0.0L) continue;
    const long double ulp = std::ldexp(1.0L, std::ilogb(exact) - 52);
    ASSERT_LE(std::fabs(static_cast<long double>(Log10(x)) - exact), 1.75L * ulp) << x;
  }
}

// ---- the row

std::vector<std::size_t> Counts() {
  std::vector<std::size_t> counts;
  for (std::size_t count = 0; count <= 70; ++count) counts.push_back(count);
  counts.insert(counts.end(), {127, 128, 129, 255, 256, 257, 259, 511, 512, 513, 1000});
  return counts;
}

std::vector<double> AnyArguments(std::size_t count, Random& random) {
  const std::vector<double> special = SpecialValues();
  std::vector<double> arguments(count);
  for (double& x : arguments)
    x = random() % 3 == 0 ? special[random() % special.size()] : std::exp2(20.0 * Fraction(random) - 10.0);
  return arguments;
}

void ExpectSame(const std::vector<double>& result, const std::vector<double>& expected, std::size_t count) {
  for (std::size_t i = 0; i < expected.size(); ++i)
    ASSERT_TRUE(Same(result[i], expected[i])) << "element " << i << " of " << count;
}

TEST(Logarithm, RowIsTheScalarFormAndStoresNothingBesides) {
  constexpr std::size_t guard = 8;
  constexpr double sentinel = -12345.0;
  Random random(4);
  for (const std::size_t count : Counts()) {
    for (const std::size_t start : {0u, 1u, 3u}) {
      const std::vector<double> x = AnyArguments(start + count, random);
      std::vector<double> expected(start + count + 2 * guard, sentinel);
      std::vector<double> result = expected;
      for (std::size_t i = 0; i < count; ++i) expected[guard + start + i] = Log10(x[start + i]);
      Log10Row(x.data() + start, count, result.data() + guard + start);
      ExpectSame(result, expected, count);
    }
  }
}

TEST(Logarithm, RowMayBeInPlace) {
  Random random(5);
  for (const std::size_t count : Counts()) {
    std::vector<double> row = AnyArguments(count, random);
    std::vector<double> expected(count);
    std::transform(row.begin(), row.end(), expected.begin(), [](double x) { return Log10(x); });
    Log10Row(row.data(), count, row.data());
    ExpectSame(row, expected, count);
  }
}

// ---- the platform's function

class LogarithmOracle : public ::testing::Test {
 protected:
  void SetUp() override {
#ifdef __GLIBC__
    const std::string version = gnu_get_libc_version();
    if (version != "2.36") GTEST_SKIP() << "the oracle is the GNU C library 2.36, this one is " << version;
#else
    GTEST_SKIP() << "the oracle is the GNU C library 2.36";
#endif
  }
};

class LogarithmExhaustive : public LogarithmOracle {
 protected:
  void SetUp() override {
    LogarithmOracle::SetUp();
    if (std::getenv("GRIDMILL_EXHAUSTIVE") == nullptr) GTEST_SKIP() << "GRIDMILL_EXHAUSTIVE is not set";
  }
};

TEST_F(LogarithmOracle, SpecialValuesAndTheirNeighboursAreThePlatformsWithin1Ulp) {
  Checker checker;
  for (const double centre : SpecialValues()) {
    double below = centre;
    double above = centre;
    for (int i = 0; i < 3000; ++i) {
      checker.Add(below);
      checker.Add(above);
      below = std::nextafter(below, -kInfinity);
      above = std::nextafter(above, kInfinity);
    }
  }
}

TEST_F(LogarithmOracle, BothSidesOfEveryIntervalAreThePlatformsWithin1Ulp) {
  Checker checker;
  for (std::uint64_t entry = 0; entry <= std::size(kLog10Table); ++entry) {
    const std::uint64_t border = 0x3FE0000000000000u - 0x00002AAA80000000u + (entry << 46);
    for (std::uint64_t i = 0; i < 4000; ++i) {
      checker.Add(std::bit_cast<double>(border - 2000 + i));
      checker.Add(std::ldexp(std::bit_cast<double>(border - 2000 + i), static_cast<int>(i % 40) - 20));
    }
  }
}

TEST_F(LogarithmOracle, PowersOfTenAndTwoAreThePlatformsWithin1Ulp) {
  Checker checker;
  for (int power = -323; power <= 308; ++power)
    checker.Add(std::strtod(("1e" + std::to_string(power)).c_str(), nullptr));
  for (int power = -1074; power <= 1023; ++power) checker.Add(std::ldexp(1.0, power));
}

TEST_F(LogarithmOracle, QuotientsOfMeansOf8BitSamplesAreThePlatformsWithin1Ulp) {
  Checker checker;
  for (const auto& [m, n] : {std::pair(1, 1), std::pair(3, 3), std::pair(4, 4), std::pair(1, 3)})
    for (int s = 0; s <= 255 * m; ++s)
      for (int t = 0; t <= 255 * n; ++t) {
        const double imageMean = static_cast<double>(s) / m;
        const double referenceMean = static_cast<double>(t) / n;
        checker.Add(imageMean / referenceMean);
      }
}

TEST_F(LogarithmOracle, RandomArgumentsAreThePlatformsWithin1Ulp) {
  Checker checker;
  Random random(6);
  for (int i = 0; i < 300'000; ++i) AddEachKind(checker, random);
}

TEST_F(LogarithmExhaustive, HundredsOfMillionsOfRandomArgumentsAreThePlatformsWithin1Ulp) {
  constexpr std::uint64_t parts = 300;
  std::atomic<std::uint64_t> next{0};
  std::vector<std::thread> threads;
  for (unsigned int i = 0; i < std::max(1u, std::thread::hardware_concurrency()); ++i)
    threads.emplace_back([&] {
      for (std::uint64_t part = next++; part < parts; part = next++) {
        Checker checker;
        Random random(1000 + part);
        for (int j = 0; j < 143'000; ++j) AddEachKind(checker, random);
      }
    });
  for (std::thread& thread : threads) thread.join();
}

}  // namespace
}  // namespace orvik::kernels
