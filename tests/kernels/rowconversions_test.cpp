#include "processes/gridmill/kernels/rowconversions.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/tessel/clipto.h"
#include "basic/tessel/plaincast.h"

// Each row function against its conversion, one element after the other: every count below two vectors of the
// widest registers, starts that are aligned and not, and sentinels on both sides of the target.
namespace orvik::kernels {
namespace {

using PixelTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;

constexpr std::size_t kGuard = 8;  // elements on each side of a target
constexpr std::size_t kMaxStride = 7;

std::vector<std::size_t> Counts() {
  std::vector<std::size_t> counts;
  for (std::size_t count = 0; count <= 70; ++count) counts.push_back(count);
  counts.insert(counts.end(), {127, 128, 129, 255, 256, 257});
  return counts;
}

template <class T>
std::vector<T> Sentinels(std::size_t count) {
  std::vector<T> memory(count);
  if (count > 0) std::memset(memory.data(), 0xA5, count * sizeof(T));
  return memory;
}

/// Equal bits in every element, any NaN for a NaN.
template <class T>
bool Same(const std::vector<T>& a, const std::vector<T>& b) {
  if (a.size() != b.size()) return false;
  for (std::size_t i = 0; i < a.size(); ++i) {
    if constexpr (std::is_floating_point_v<T>) {
      if (std::isnan(a[i]) && std::isnan(b[i])) continue;
    }
    if (std::memcmp(&a[i], &b[i], sizeof(T)) != 0) return false;
  }
  return true;
}

/// The limits of all types, ties, the special values, and random ones.
template <class T>
T AnyValue(std::mt19937_64& random) {
  if constexpr (std::is_integral_v<T>) {
    const T limits[] = {std::numeric_limits<T>::min(), std::numeric_limits<T>::max(), 0, 1, 127};
    const auto bits = random();
    return bits % 4 == 0 ? limits[bits / 4 % 5] : static_cast<T>(bits >> (bits % 64));
  } else {
    using Limits = std::numeric_limits<T>;
    constexpr T special[] = {Limits::quiet_NaN(),
                             Limits::infinity(),
                             -Limits::infinity(),
                             Limits::max(),
                             Limits::lowest(),
                             Limits::denorm_min(),
                             -0.0f,
                             126.5f,
                             127.0f,
                             127.5f,
                             -128.5f,
                             -129.0f,
                             254.5f,
                             255.0f,
                             255.5f,
                             32766.5f,
                             32767.0f,
                             -32768.5f,
                             -32769.0f,
                             65534.5f,
                             65535.0f,
                             2147483520.0f,
                             2147483648.0f,
                             -2147483648.0f,
                             -2147483904.0f,
                             4294967040.0f,
                             4294967296.0f,
                             0x1.fffffep62f,
                             0x1p63f,
                             -0x1p63f,
                             0x1.fffffep63f,
                             0x1p64f,
                             0.5f,
                             -0.5f,
                             8388609.0f};
    const auto bits = random();
    if (bits % 2 == 0) return special[bits / 2 % std::size(special)];
    return static_cast<T>((bits & 2 ? 1 : -1) * std::exp2(static_cast<double>(bits % 6600) / 100.0 - 2.0));
  }
}

template <class T>
std::vector<T> AnyValues(std::size_t count, std::mt19937_64& random) {
  std::vector<T> values(count);
  for (T& value : values) value = AnyValue<T>(random);
  return values;
}

template <class Pixel>
class RowConversionsOf : public ::testing::Test {
 protected:
  std::mt19937_64 random{6};
};
TYPED_TEST_SUITE(RowConversionsOf, PixelTypes);

// ---- loaders

TYPED_TEST(RowConversionsOf, LoadRowIsThePlainCastOfEveryStrideThSample) {
  using In = TypeParam;
  for (const std::size_t count : Counts()) {
    for (std::size_t stride = 1; stride <= kMaxStride; ++stride) {
      for (const std::size_t start : {0u, 1u}) {
        const std::size_t samples = count == 0 ? 0 : (count - 1) * stride + 1;
        const std::vector<In> source = AnyValues<In>(start + samples, this->random);
        std::vector<float> expected = Sentinels<float>(count + 2 * kGuard);
        std::vector<float> target = expected;
        for (std::size_t i = 0; i < count; ++i)
          expected[kGuard + i] = tessel::PlainCast<float>(source[start + i * stride]);
        LoadRow(source.data() + start, stride, count, target.data() + kGuard);
        ASSERT_TRUE(Same(target, expected)) << count << " samples, stride " << stride << ", start " << start;
      }
    }
  }
}

TYPED_TEST(RowConversionsOf, LoadRowStoresAtAnyAlignment) {
  using In = TypeParam;
  for (const std::size_t offset : {1u, 2u, 3u, 5u, 7u}) {
    const std::vector<In> source = AnyValues<In>(70, this->random);
    std::vector<float> expected = Sentinels<float>(offset + 70 + kGuard);
    std::vector<float> target = expected;
    for (std::size_t i = 0; i < 70; ++i) expected[offset + i] = tessel::PlainCast<float>(source[i]);
    LoadRow(source.data(), 1, 70, target.data() + offset);
    ASSERT_TRUE(Same(target, expected)) << offset;
  }
}

TYPED_TEST(RowConversionsOf, FloatRowReturnsTheSamplesAsFloat) {
  using In = TypeParam;
  for (std::size_t stride = 1; stride <= kMaxStride; ++stride) {
    const std::vector<In> source = AnyValues<In>(kBlock * stride, this->random);
    std::vector<float> scratch = Sentinels<float>(kBlock + kGuard);
    const float* const row = FloatRow(source.data(), stride, kBlock, scratch.data());
    std::vector<float> expected(kBlock);
    for (std::size_t i = 0; i < kBlock; ++i) expected[i] = tessel::PlainCast<float>(source[i * stride]);
    EXPECT_TRUE(Same(std::vector<float>(row, row + kBlock), expected)) << stride;
    const std::vector<float> behind(scratch.begin() + kBlock, scratch.end());
    EXPECT_TRUE(Same(behind, Sentinels<float>(kGuard))) << stride;
  }
}

TEST(RowConversions, FloatRowLeavesADenseFloatRowWhereItStands) {
  const std::vector<float> source(20, 1.0f);
  std::vector<float> scratch = Sentinels<float>(20);
  EXPECT_EQ(FloatRow(source.data(), 1, source.size(), scratch.data()), source.data());
  EXPECT_TRUE(Same(scratch, Sentinels<float>(20)));
  EXPECT_EQ(FloatRow(source.data(), 2, 10, scratch.data()), scratch.data());
}

// ---- storers

template <class Value, class Out>
void ExpectStoreClipped(std::mt19937_64& random) {
  for (const std::size_t count : Counts()) {
    for (const std::size_t start : {0u, 1u}) {
      const std::vector<Value> values = AnyValues<Value>(start + count, random);
      std::vector<Out> expected = Sentinels<Out>(start + count + 2 * kGuard);
      std::vector<Out> target = expected;
      for (std::size_t i = 0; i < count; ++i)
        expected[kGuard + start + i] = tessel::ClipTo<Out>(values[start + i]);
      StoreClipped(values.data() + start, count, target.data() + kGuard + start);
      ASSERT_TRUE(Same(target, expected)) << count << " values, start " << start;
    }
  }
}

TYPED_TEST(RowConversionsOf, StoreClippedIsClipToOfEveryFloat) {
  ExpectStoreClipped<float, TypeParam>(this->random);
}

TYPED_TEST(RowConversionsOf, StoreClippedIsClipToOfEveryInt) {
  ExpectStoreClipped<int, TypeParam>(this->random);
}

template <class Value, class Out>
void ExpectStoreClippedWhere(std::mt19937_64& random) {
  constexpr unsigned char validity[] = {0, 0, 0, 1, 1, 1, 2, 255};
  for (const std::size_t count : Counts()) {
    for (const std::size_t start : {0u, 1u}) {
      const std::vector<Value> values = AnyValues<Value>(start + count, random);
      std::vector<unsigned char> valid(start + count);
      for (unsigned char& byte : valid) byte = validity[random() % std::size(validity)];
      const Out other = AnyValue<Out>(random);
      std::vector<Out> expected = Sentinels<Out>(start + count + 2 * kGuard);
      std::vector<Out> target = expected;
      for (std::size_t i = start; i < start + count; ++i)
        expected[kGuard + i] = valid[i] != 0 ? tessel::ClipTo<Out>(values[i]) : other;
      StoreClippedWhere(values.data() + start, valid.data() + start, other, count,
                        target.data() + kGuard + start);
      ASSERT_TRUE(Same(target, expected)) << count << " values, start " << start;
    }
  }
}

TYPED_TEST(RowConversionsOf, StoreClippedWhereTakesTheOtherValueForFloatsThatAreMasked) {
  ExpectStoreClippedWhere<float, TypeParam>(this->random);
}

TYPED_TEST(RowConversionsOf, StoreClippedWhereTakesTheOtherValueForIntsThatAreMasked) {
  ExpectStoreClippedWhere<int, TypeParam>(this->random);
}

}  // namespace
}  // namespace orvik::kernels
