#include "processes/gridmill/kernels/validrange.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "processes/gridmill/kernels/rowconversions.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::kernels {
namespace {

using Bytes = std::vector<unsigned char>;

const float kNaN = std::numeric_limits<float>::quiet_NaN();
const float kInfinity = std::numeric_limits<float>::infinity();

const float kLimits[] = {kNaN,   -kInfinity, kInfinity,      -129.0f,  -128.0f,  -127.5f,       -0.5f,
                         -0.0f,  0.0f,       7.0f,           7.5f,     126.5f,   127.0f,        254.5f,
                         255.0f, 256.0f,     -2147483648.0f, 65535.0f, 32767.0f, 2147483648.0f, 1e20f};

const int kBackgrounds[] = {0,   7,      -1,    127,   -128,
                            255, 256,    32767, 65535, 65536 + 7,
                            300, -32768, 128,   5,     std::numeric_limits<int>::max(),
                            -7,  -129,   65536, 1,     std::numeric_limits<int>::min()};

constexpr std::size_t kGuard = 8;  // bytes on each side

/// A sample as a whole number of 32 bits.
template <class In>
int Whole(In sample) {
  if constexpr (std::is_integral_v<In>) return static_cast<int>(sample);
  const auto wide = static_cast<double>(sample);
  const bool fits = wide > -2147483649.0 && wide < 2147483648.0;
  return fits ? static_cast<int>(wide) : std::numeric_limits<int>::min();
}

bool LeavesRange(float value, float least, float most) { return least > value || value > most; }

template <class In>
In AnySample(tests::Random& random) {
  const std::uint64_t bits = random.Bits();
  const int background = kBackgrounds[(bits >> 8) % std::size(kBackgrounds)];
  const float limit = kLimits[(bits >> 8) % std::size(kLimits)];
  if (bits % 3 == 0) return static_cast<In>(background);
  if constexpr (std::is_integral_v<In>) {
    return static_cast<In>(bits >> (8 + (bits >> 8) % 56));
  } else {
    if (bits % 3 == 1) return static_cast<In>(limit);
    return static_cast<In>(background) + (bits % 2 == 0 ? In{0.9f} : In{-0.9f});
  }
}

struct Rule {
  int background;
  float least, most;
  bool ranged;
};

template <class In>
void ExpectKept(const std::vector<In>& samples, std::size_t first, const Rule& rule, tests::Random& random) {
  const std::size_t count = samples.size() - first;
  Bytes valid(count + 2 * kGuard + first, 0xA5);
  for (std::size_t i = 0; i < count; ++i) valid[kGuard + first + i] = random.Bits() % 4 != 0;
  Bytes expected = valid;
  for (std::size_t i = 0; i < count; ++i) {
    const int whole = Whole(samples[first + i]);
    const bool leaves = rule.ranged && LeavesRange(static_cast<float>(whole), rule.least, rule.most);
    if (whole == rule.background || leaves) expected[kGuard + first + i] = 0;
  }
  const ValidRange range(rule.least, rule.most);
  KeepValidSamples(samples.data() + first, rule.background, rule.ranged ? &range : nullptr, count,
                   valid.data() + kGuard + first);
  ASSERT_EQ(valid, expected) << count << " samples, background " << rule.background << ", " << rule.least
                             << " to " << rule.most << (rule.ranged ? "" : ", no range");
}

class KeepValidSamplesOf : public ::testing::TestWithParam<tests::PixelType> {};

TEST_P(KeepValidSamplesOf, IsTheLoop) {
  tests::WithPixelType(GetParam().element, []<class In>() {
    tests::Random random(61);
    for (int round = 0; round < 8; ++round) {
      for (std::size_t count = 0; count <= kBlock; count += count < 135 || count > 250 ? 1 : 23) {
        const std::size_t first = count % 5;
        std::vector<In> samples(first + count);
        for (In& sample : samples) sample = AnySample<In>(random);
        const Rule rule{kBackgrounds[random.Bits() % std::size(kBackgrounds)],
                        kLimits[random.Bits() % std::size(kLimits)],
                        kLimits[random.Bits() % std::size(kLimits)], random.Bits() % 4 != 0};
        ASSERT_NO_FATAL_FAILURE(ExpectKept(samples, first, rule, random));
      }
    }
  });
}

INSTANTIATE_TEST_SUITE_P(Types, KeepValidSamplesOf, ::testing::ValuesIn(tests::kPixelTypes),
                         [](const auto& info) { return info.param.name; });

template <class In>
void ExpectEverySample() {
  tests::Random random(62);
  std::vector<In> samples;
  for (int s = std::numeric_limits<In>::min(); s <= std::numeric_limits<In>::max(); ++s)
    samples.push_back(static_cast<In>(s));
  for (const float least : kLimits)
    for (const float most : kLimits)
      for (const bool ranged : {true, false})
        ASSERT_NO_FATAL_FAILURE(ExpectKept(samples, 0, {-1000, least, most, ranged}, random));
  for (const int background : kBackgrounds)
    for (const bool ranged : {true, false})
      ASSERT_NO_FATAL_FAILURE(ExpectKept(samples, 0, {background, -7.0f, 126.0f, ranged}, random));
}

TEST(KeepValidSamples, EveryByteAndEveryLimit) {
  ExpectEverySample<char>();
  ExpectEverySample<unsigned char>();
}

TEST(KeepValidSamples, OnlyTheLow32BitsOf64Count) {
  const std::vector<std::int64_t> samples{7, (std::int64_t{1} << 32) + 7, (std::int64_t{1} << 31) + 7,
                                          -(std::int64_t{1} << 32) + 7, 8};
  Bytes valid(5, 1);
  KeepValidSamples(samples.data(), 7, nullptr, 5, valid.data());
  EXPECT_EQ(valid, (Bytes{0, 0, 1, 0, 1}));
}

TEST(KeepValidSamples, AFractionIsCutOffBeforeTheRangeIsJudged) {
  const ValidRange range(3.0f, 9.0f);
  const std::vector<float> samples{2.9f, 3.0f, 9.9f, 10.0f, 7.9f, 6.9f, kNaN};
  Bytes valid(7, 1);
  KeepValidSamples(samples.data(), 7, &range, 7, valid.data());
  EXPECT_EQ(valid, (Bytes{0, 1, 1, 0, 0, 1, 0}));
}

TEST(ValidRange, ALimitOfNaNIsNone) {
  const ValidRange range(kNaN, kNaN);
  EXPECT_EQ(range.lower, -kInfinity);
  EXPECT_EQ(range.upper, kInfinity);
  const ValidRange kept(-3.5f, 1e20f);
  EXPECT_EQ(kept.lower, -3.5f);
  EXPECT_EQ(kept.upper, 1e20f);
}

TEST(KeepWithin, IsTheLoopAndNaNIsWithin) {
  tests::Random random(63);
  std::vector<double> specials(std::begin(kLimits), std::end(kLimits));
  specials.insert(specials.end(), {std::nextafter(7.0, 0.0), std::nextafter(7.0, 9.0), 1e300, -1e300, 6.9});
  std::size_t count = 0;
  for (const double lower : specials) {
    for (const double upper : specials) {
      count = (count + 1) % 137;
      const std::size_t first = count % 3;
      std::vector<double> values(first + count);
      Bytes valid(count + 2 * kGuard + first, 0xA5);
      for (double& value : values) value = specials[random.Bits() % specials.size()];
      for (std::size_t i = 0; i < count; ++i) valid[kGuard + first + i] = random.Bits() % 4 != 0;
      Bytes expected = valid;
      for (std::size_t i = 0; i < count; ++i)
        if (lower > values[first + i] || values[first + i] > upper) expected[kGuard + first + i] = 0;
      KeepWithin(values.data() + first, lower, upper, count, valid.data() + kGuard + first);
      ASSERT_EQ(valid, expected) << count << " values, " << lower << " to " << upper;
    }
  }
}

}  // namespace
}  // namespace orvik::kernels
