#include "processes/gridmill/kernels/changenodata.h"

#include <cstddef>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::kernels {
namespace {

using Bytes = std::vector<unsigned char>;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();

/// The bytes of samples after the test, all of which were 1.
template <class Sample>
Bytes Kept(const NoDataTest<Sample>& test, const std::vector<Sample>& samples) {
  Bytes keep(samples.size(), 1);
  test.Clear(samples.data(), samples.size(), keep.data());
  return keep;
}

TEST(NoDataTest, SampleThatEqualsTheEntryOfItsChannelIsNoData) {
  EXPECT_EQ(Kept(NoDataTest<short>({5, 7}, 2, 3), {5, 5, 7, 7, 5, 7}), (Bytes{0, 1, 1, 0, 0, 0}));
  EXPECT_EQ(Kept(NoDataTest<float>({5, 0.5f}, 2, 3), {5, 5, 0.5f, 0.5f, 5, 0.5f}), (Bytes{0, 1, 1, 0, 0, 0}));
  EXPECT_EQ(Kept(NoDataTest<int>({5, 7}, 2, 2), {5, 5, 7, 7}), (Bytes{0, 1, 1, 0}));
}

TEST(NoDataTest, ChannelsWithoutAnEntryAreNotTested) {
  EXPECT_EQ(Kept(NoDataTest<short>({5}, 3, 2), {5, 5, 0, 5, 0, 5}), (Bytes{0, 1, 1, 0, 1, 1}));
  EXPECT_EQ(Kept(NoDataTest<float>({5}, 2, 2), {5, 5, 5, kNaN}), (Bytes{0, 1, 0, 1}));
  EXPECT_EQ(Kept(NoDataTest<unsigned char>({}, 2, 2), {0, 5, 255, 0}), (Bytes{1, 1, 1, 1}));
}

TEST(NoDataTest, KeysAreThereIfEveryChannelHasOneThatASampleCanBe) {
  const NoDataTest<short> all({5, -7}, 2, 3);
  ASSERT_NE(all.Keys(), nullptr);
  EXPECT_EQ(std::vector<short>(all.Keys(), all.Keys() + 6), (std::vector<short>{5, -7, 5, -7, 5, -7}));
  EXPECT_EQ(NoDataTest<short>({5, 0.5f}, 2, 3).Keys(), nullptr);
  EXPECT_EQ(NoDataTest<short>({5, 70000}, 2, 3).Keys(), nullptr);
  EXPECT_EQ(NoDataTest<short>({5}, 2, 3).Keys(), nullptr);
  EXPECT_NE(NoDataTest<float>({5}, 2, 3).Keys(), nullptr);
}

/// The parameters of a choice.
struct Values {
  std::vector<float> imgNoData, refNoData;
};

/// True if a choice for two channels has keys, which it has for both dates or for none.
bool HasKeys(const Values& values) {
  const SampleChoice<short, short> choice(values, 2, 4);
  EXPECT_EQ(choice.ImageKeys() != nullptr, choice.ReferenceKeys() != nullptr);
  return choice.ImageKeys() != nullptr;
}

TEST(SampleChoice, HasKeysOfBothDatesOrOfNone) {
  EXPECT_TRUE(HasKeys({{5, 6}, {7, 8}}));
  EXPECT_TRUE(HasKeys({{5, 6}, {7, 8, 9}}));
  EXPECT_FALSE(HasKeys({{5, 6, 7}, {7, 8}}));
  EXPECT_FALSE(HasKeys({{}, {7, 8}}));
  EXPECT_FALSE(HasKeys({{5, 0.5f}, {7, 8}}));
  EXPECT_FALSE(HasKeys({{5, 6}, {7, 0.5f}}));
  EXPECT_FALSE(HasKeys({{5, 6}, {7}}));
}

}  // namespace
}  // namespace orvik::kernels
