#include "tests/reference/conversions.h"

#include <cmath>
#include <cstdint>
#include <limits>

#include <gtest/gtest.h>

namespace orvik::reference {
namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr std::int64_t kLeast64 = std::numeric_limits<std::int64_t>::min();
constexpr std::int64_t kMost64 = std::numeric_limits<std::int64_t>::max();
constexpr std::uint64_t kMostU64 = std::numeric_limits<std::uint64_t>::max();
constexpr int kLeast32 = std::numeric_limits<int>::min();

TEST(ReferencePlainCast, TruncatesAndKeepsTheLowBits) {
  EXPECT_EQ(PlainCast<unsigned char>(300.7f), 44);
  EXPECT_EQ(PlainCast<unsigned char>(-1.0f), 255);
  EXPECT_EQ(PlainCast<char>(200.0), -56);
  EXPECT_EQ(PlainCast<short>(-2.9), -2);
  EXPECT_EQ(PlainCast<unsigned short>(65536.0 + 5), 5);
  EXPECT_EQ(PlainCast<short>(65536 + 7), 7);
}

TEST(ReferencePlainCast, NaNAndValuesOutOfRangeAreTheIndefiniteValue) {
  EXPECT_EQ(PlainCast<short>(kNaN), 0);
  EXPECT_EQ(PlainCast<unsigned char>(2147483648.0), 0);
  EXPECT_EQ(PlainCast<int>(kNaN), kLeast32);
  EXPECT_EQ(PlainCast<int>(2147483648.0), kLeast32);
  EXPECT_EQ(PlainCast<int>(-2147483648.9), kLeast32);
  EXPECT_EQ(PlainCast<int>(2147483647.9), 2147483647);
  EXPECT_EQ(PlainCast<unsigned int>(kNaN), 0u);
  EXPECT_EQ(PlainCast<unsigned int>(-1.0), 4294967295u);
  EXPECT_EQ(PlainCast<unsigned int>(4294967296.0 + 9), 9u);
  EXPECT_EQ(PlainCast<std::int64_t>(kNaN), kLeast64);
  EXPECT_EQ(PlainCast<std::int64_t>(kInfinity), kLeast64);
}

TEST(ReferencePlainCast, Unsigned64BitTakesTheTopBitApart) {
  EXPECT_EQ(PlainCast<std::uint64_t>(kNaN), std::uint64_t{1} << 63);
  EXPECT_EQ(PlainCast<std::uint64_t>(-1.0), kMostU64);
  EXPECT_EQ(PlainCast<std::uint64_t>(0x1p63), std::uint64_t{1} << 63);
  EXPECT_EQ(PlainCast<std::uint64_t>(0x1.8p63), std::uint64_t{3} << 62);
  EXPECT_EQ(PlainCast<std::uint64_t>(kInfinity), 0u);
}

TEST(ReferenceClipTo, FloatingValuesRoundAndSaturate) {
  EXPECT_EQ(ClipTo<char>(-128.4f), -128);
  EXPECT_EQ(ClipTo<char>(-128.0f), -128);
  EXPECT_EQ(ClipTo<char>(126.6f), 127);
  EXPECT_EQ(ClipTo<char>(-2.5f), -3);
  EXPECT_EQ(ClipTo<unsigned char>(-0.3f), 0);
  EXPECT_EQ(ClipTo<unsigned char>(254.5f), 255);
  EXPECT_EQ(ClipTo<unsigned short>(65534.4), 65534);
  EXPECT_EQ(ClipTo<int>(5.9), 6);
  EXPECT_EQ(ClipTo<int>(2147483520.0f), 2147483520);
  EXPECT_EQ(ClipTo<unsigned int>(4294967295.0), 4294967295u);
  EXPECT_EQ(ClipTo<float>(1e300), std::numeric_limits<float>::infinity());
  EXPECT_EQ(ClipTo<double>(0.1f), static_cast<double>(0.1f));
}

TEST(ReferenceClipTo, SixtyFourBitsAreTruncatedFromZeroOn) {
  EXPECT_EQ(ClipTo<std::int64_t>(-5.0), 0);
  EXPECT_EQ(ClipTo<std::int64_t>(5.9), 5);
  EXPECT_EQ(ClipTo<std::int64_t>(0x1p63), kMost64);
  EXPECT_EQ(ClipTo<std::uint64_t>(5.9), 5u);
  EXPECT_EQ(ClipTo<std::uint64_t>(0x1p64f), kMostU64);
  EXPECT_EQ(ClipTo<std::uint64_t>(0x1p63f), std::uint64_t{1} << 63);
}

TEST(ReferenceClipTo, NaNIsTheIndefiniteValueCutToTheWidth) {
  EXPECT_EQ(ClipTo<char>(kNaN), 0);
  EXPECT_EQ(ClipTo<unsigned short>(kNaN), 0);
  EXPECT_EQ(ClipTo<int>(kNaN), kLeast32);
  EXPECT_EQ(ClipTo<unsigned int>(kNaN), 0u);
  EXPECT_EQ(ClipTo<std::int64_t>(kNaN), kLeast64);
  EXPECT_EQ(ClipTo<std::uint64_t>(kNaN), std::uint64_t{1} << 63);
  EXPECT_TRUE(std::isnan(ClipTo<float>(kNaN)));
}

TEST(ReferenceClipTo, IntegersAreClampedAndNotRounded) {
  EXPECT_EQ(ClipTo<char>(short{200}), 127);
  EXPECT_EQ(ClipTo<char>(short{-200}), -128);
  EXPECT_EQ(ClipTo<unsigned char>(short{-5}), 0);
  EXPECT_EQ(ClipTo<unsigned char>(short{300}), 255);
  EXPECT_EQ(ClipTo<std::int64_t>(char{-5}), 0);
  EXPECT_EQ(ClipTo<unsigned int>(-5), 0u);
  EXPECT_EQ(ClipTo<unsigned int>(5), 5u);
  EXPECT_EQ(ClipTo<std::uint64_t>(-5), 0u);
  EXPECT_EQ(ClipTo<short>(static_cast<unsigned short>(40000)), 32767);
  EXPECT_EQ(ClipTo<char>(static_cast<unsigned char>(200)), 127);
  EXPECT_EQ(ClipTo<int>(short{-5}), -5);
  EXPECT_EQ(ClipTo<double>(-5), -5.0);
}

TEST(ReferenceClipTo, Signed64BitIsClampedAtTheUpperEndAlone) {
  EXPECT_EQ(ClipTo<std::int64_t>(kLeast64), kLeast64);
  EXPECT_EQ(ClipTo<unsigned char>(std::int64_t{-1}), 255);
  EXPECT_EQ(ClipTo<short>(std::int64_t{-65536 - 3}), -3);
  EXPECT_EQ(ClipTo<short>(std::int64_t{1} << 40), 32767);
  EXPECT_EQ(ClipTo<std::uint64_t>(std::int64_t{-1}), 0u);
  EXPECT_EQ(ClipTo<std::int64_t>(kMostU64), kMost64);
}

}  // namespace
}  // namespace orvik::reference
