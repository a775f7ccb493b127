#include "processes/gridmill/kernels/thresholds.h"

#include <cstddef>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

const float kNaN = std::numeric_limits<float>::quiet_NaN();
const float kInfinity = std::numeric_limits<float>::infinity();

bool Selects(float s, float lower, float upper, bool wraps) {
  return wraps ? s >= lower || upper >= s : s >= lower && upper >= s;
}

/// Every sample of a type against the comparison in `float`.
template <class Sample>
void ExpectEverySample(float lower, float upper, bool wraps) {
  const int least = std::numeric_limits<Sample>::min(), most = std::numeric_limits<Sample>::max();
  std::vector<Sample> samples;
  for (int s = least; s <= most; ++s) samples.push_back(static_cast<Sample>(s));
  std::vector<unsigned char> selected(samples.size());
  SelectRow(samples.data(), IntegerRange<Sample>(lower, upper, wraps), samples.size(), selected.data());
  for (std::size_t i = 0; i < samples.size(); ++i)
    ASSERT_EQ(selected[i], Selects(static_cast<float>(samples[i]), lower, upper, wraps))
        << int{samples[i]} << " in " << lower << " to " << upper << (wraps ? ", wrapped" : "");
}

template <class Sample>
class IntegerThresholds : public ::testing::Test {};
using NarrowTypes = ::testing::Types<char, unsigned char, short, unsigned short>;
TYPED_TEST_SUITE(IntegerThresholds, NarrowTypes);

TYPED_TEST(IntegerThresholds, SelectTheSamplesThatFloatSelects) {
  const float bounds[] = {kNaN,     -kInfinity, -1e20f,   -32769.0f, -32768.5f, -32768.0f, -129.0f,
                          -128.5f,  -128.0f,    -1.0f,    -0.5f,     -0.0f,     0.0f,      0.5f,
                          5.0f,     126.5f,     127.0f,   127.5f,    255.0f,    255.5f,    256.0f,
                          32767.0f, 32767.5f,   65535.0f, 65535.5f,  65536.0f,  3e9f,      kInfinity};
  for (const float lower : bounds)
    for (const float upper : bounds)
      for (const bool wraps : {false, true}) ExpectEverySample<TypeParam>(lower, upper, wraps);
}

TEST(FloatThresholds, SelectWhatTheComparisonSelects) {
  const std::vector<float> samples{kNaN,       -kInfinity, -7.0f, -0.0f, 0.0f,
                                   4.9999995f, 5.0f,       9.5f,  10.0f, kInfinity};
  for (const float lower : samples) {
    for (const float upper : samples) {
      for (const bool wraps : {false, true}) {
        std::vector<unsigned char> selected(samples.size());
        SelectRow(samples.data(), lower, upper, wraps, samples.size(), selected.data());
        for (std::size_t i = 0; i < samples.size(); ++i)
          EXPECT_EQ(selected[i], Selects(samples[i], lower, upper, wraps)) << samples[i];
      }
    }
  }
}

TEST(KeepValid, ClearsTheBytesThatAreNotValid) {
  for (std::size_t count = 0; count < 150; ++count) {
    std::vector<unsigned char> valid(count), selected(count), expected(count);
    for (std::size_t i = 0; i < count; ++i) {
      valid[i] = i % 3 != 0;
      selected[i] = i % 2 != 0;
      expected[i] = i % 3 != 0 && i % 2 != 0;
    }
    KeepValid(valid.data(), count, selected.data());
    EXPECT_EQ(selected, expected);
  }
}

}  // namespace
}  // namespace orvik::kernels
