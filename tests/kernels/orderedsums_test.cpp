#include "processes/gridmill/kernels/orderedsums.h"

#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

using Random = std::mt19937_64;

double Unit(Random& random) { return static_cast<double>(random() >> 11) * 0x1p-53; }
double Sign(Random& random) { return random() % 2 == 0 ? 1.0 : -1.0; }
double Whole(Random& random, std::uint64_t below) { return static_cast<double>(random() % below); }

struct Kind {
  std::string name;
  std::function<double(Random&)> term;
};

constexpr double kInfinity = std::numeric_limits<double>::infinity();

const Kind kPositive[] = {
    {"fractions", [](Random& r) { return Unit(r); }},
    {"one size", [](Random& r) { return 1.0 + 0x1p-6 * Unit(r); }},
    {"many sizes", [](Random& r) { return std::ldexp(Unit(r), static_cast<int>(r() % 80) - 60); }},
    {"often halfway", [](Random& r) { return 0x1p-12 * Whole(r, 64); }},
    {"integers", [](Random& r) { return Whole(r, 1u << 20); }},
    {"zeros and ones", [](Random& r) { return Whole(r, 2); }},
    {"mostly zeros", [](Random& r) { return r() % 50 == 0 ? Unit(r) : 0.0; }},
    {"tiny", [](Random& r) { return 0x1p-1074 * Whole(r, 1000); }},
    {"huge", [](Random& r) { return 0x1p1010 * Unit(r); }},
    {"some infinite", [](Random& r) { return r() % 500 == 0 ? kInfinity : Unit(r); }},
};

const Kind kSigned[] = {
    {"fractions", [](Random& r) { return Sign(r) * Unit(r); }},
    {"many sizes", [](Random& r) { return Sign(r) * std::ldexp(Unit(r), static_cast<int>(r() % 80) - 60); }},
    {"often halfway", [](Random& r) { return Sign(r) * 0x1p-12 * Whole(r, 64); }},
    {"negative", [](Random& r) { return -Unit(r); }},
    {"few negative", [](Random& r) { return r() % 20 == 0 ? -8.0 * Unit(r) : Unit(r); }},
    {"zeros of both signs", [](Random& r) { return Sign(r) * Whole(r, 2) * 0x1p-40; }},
    {"huge", [](Random& r) { return Sign(r) * 0x1p1022 * Unit(r); }},
    {"some infinite", [](Random& r) { return r() % 900 == 0 ? Sign(r) * kInfinity : Unit(r); }},
};

/// Sums before the first block: zero, ordinary ones, odd and even last places on both sides of a power of
/// two, and where one more is half of the last place.
const double kStarts[] = {0.0,
                          1.0,
                          3.14159,
                          1e6,
                          std::nextafter(1024.0, 0.0),
                          1024.0,
                          std::nextafter(1024.0, 2000.0),
                          1.5 * 0x1p41,
                          std::nextafter(1.5 * 0x1p41, 0.0),
                          0x1p53 - 1.0,
                          0x1p53 + 2.0,
                          0x1p-1030};

using Add = void (*)(double*, std::size_t, std::size_t, double*);

bool SameSum(double a, double b) {
  return (std::isnan(a) && std::isnan(b)) ||
         std::bit_cast<std::uint64_t>(a) == std::bit_cast<std::uint64_t>(b);
}

/// Adds three blocks of `pixels` pixels after each other.
void ExpectOneByOne(Add add, const Kind& kind, double start, std::size_t channels, std::size_t pixels,
                    Random& random) {
  constexpr double sentinel = 12345.0;
  std::vector<double> expected(channels), sums;
  for (double& sum : expected) sum = start == 0.0 ? 0.0 : start + start * 0x1p-52 * Whole(random, 2);
  sums = expected;
  const std::size_t count = channels * pixels;
  for (int block = 0; block < 3; ++block) {
    std::vector<double> terms(count + kRoomAfterTerms + 1, sentinel);
    for (std::size_t i = 0; i < count; ++i) {
      terms[i] = kind.term(random);
      expected[i % channels] += terms[i];
    }
    add(terms.data(), channels, count, sums.data());
    ASSERT_EQ(terms.back(), sentinel);
    for (std::size_t c = 0; c < channels; ++c)
      ASSERT_PRED2(SameSum, sums[c], expected[c])
          << kind.name << " from " << start << ", " << pixels << " pixels of " << channels << ", channel "
          << c << ", block " << block;
  }
}

void ExpectOneByOne(Add add, const Kind& kind, double start) {
  Random random(21);
  for (std::size_t pixels = 0; pixels <= 70; ++pixels) ExpectOneByOne(add, kind, start, 1, pixels, random);
  for (const std::size_t channels : std::vector<std::size_t>{1, 2, 3, 4, 5, 6, 7, 8, 9, 40})
    for (const std::size_t pixels : {std::size_t{1}, std::size_t{5}, std::size_t{25}, kMostTerms / channels})
      ExpectOneByOne(add, kind, start, channels, pixels, random);
}

TEST(AddInOrder, HasTheBitsOfOneAdditionAfterTheOther) {
  for (const double start : kStarts) {
    for (const Kind& kind : kPositive) ExpectOneByOne(AddInOrder, kind, start);
    for (const Kind& kind : kSigned) {
      ExpectOneByOne(AddInOrder, kind, start);
      if (start != 0.0) ExpectOneByOne(AddInOrder, kind, -start);
    }
    if (HasFatalFailure()) return;
  }
}

TEST(AddSquaresInOrder, HasTheBitsOfOneAdditionAfterTheOther) {
  for (const double start : kStarts) {
    for (const Kind& kind : kPositive) ExpectOneByOne(AddSquaresInOrder, kind, start);
    if (HasFatalFailure()) return;
  }
}

/// Terms halfway between two multiples of the sum's last place go to the even one: they round the sum up and
/// down in turn, or not at all, depending on where it starts.
TEST(AddInOrder, HalfwayTermsGoWhereTheSumIsEven) {
  for (const double odd : {0.0, 1.0}) {
    std::vector<double> terms(kMostTerms + kRoomAfterTerms, 0x1p-53);
    double sum = 1.0 + odd * 0x1p-52;
    AddInOrder(terms.data(), 1, kMostTerms, &sum);
    EXPECT_EQ(sum, 1.0 + 2.0 * odd * 0x1p-52);
  }
}

/// A sum that passes a power of two within a block, upwards, downwards, and there and back.
TEST(AddInOrder, PassesAPowerOfTwo) {
  Random random(22);
  for (const double drift : {1.0, -1.0, 0.0}) {
    for (int trial = 0; trial < 200; ++trial) {
      std::vector<double> terms(kMostTerms + kRoomAfterTerms);
      double sum = 64.0 - drift * 0.5 * static_cast<double>(trial % 10), expected = sum;
      for (std::size_t i = 0; i < kMostTerms; ++i) {
        terms[i] = drift != 0.0 ? drift * 0x1p-8 * Unit(random) : 0x1p-4 * Sign(random) * Unit(random);
        expected += terms[i];
      }
      AddInOrder(terms.data(), 1, kMostTerms, &sum);
      ASSERT_PRED2(SameSum, sum, expected) << drift << ", trial " << trial;
    }
  }
}

/// Below the power the last place is half as much, so that the first term counts. The others are rounded up.
TEST(AddInOrder, DipsBelowAPowerOfTwo) {
  for (const double sign : {1.0, -1.0}) {
    for (const std::size_t channels : std::vector<std::size_t>{1, 4}) {
      std::vector<double> terms(kMostTerms + kRoomAfterTerms, sign * 0.75 * 0x1p-52);
      for (std::size_t c = 0; c < channels; ++c) terms[c] = sign * -0x1p-53;
      std::vector<double> sums(channels, sign);
      double expected = sign;
      for (std::size_t i = 0; i < kMostTerms; i += channels) expected += terms[i];
      AddInOrder(terms.data(), channels, kMostTerms, sums.data());
      EXPECT_EQ(sums, std::vector<double>(channels, expected));
    }
  }
}

}  // namespace
}  // namespace orvik::kernels
