#include "processes/gridmill/kernels/samplecounts.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/random.h"

// Each function against a loop over the samples in their order. Memory around the samples holds extremes.
namespace orvik::kernels {
namespace {

using PixelTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;

const float kNaN = std::numeric_limits<float>::quiet_NaN();
const float kInfinity = std::numeric_limits<float>::infinity();

/// Every count below two vectors of the widest kind, and some around whole blocks.
std::vector<std::size_t> Counts() {
  std::vector<std::size_t> counts;
  for (std::size_t count = 0; count <= 140; ++count) counts.push_back(count);
  counts.insert(counts.end(), {191, 255, 256, 257, 300, 511, 512, 513, 1000});
  return counts;
}

/// Small numbers, limits, and any bits. Floating samples are mostly special.
template <class Sample>
Sample AnySample(tests::Random& random) {
  const std::uint64_t bits = random.Bits();
  if (bits % 2 == 0) return static_cast<Sample>((bits >> 8) % 300);
  if constexpr (std::is_integral_v<Sample>) {
    const Sample limits[] = {std::numeric_limits<Sample>::min(), std::numeric_limits<Sample>::max(), 0, 1};
    return bits % 8 == 1 ? limits[(bits >> 8) % 4] : static_cast<Sample>(bits >> (8 + (bits >> 8) % 56));
  } else {
    using Limits = std::numeric_limits<Sample>;
    constexpr Sample special[] = {Limits::quiet_NaN(),   Limits::infinity(),    -Limits::infinity(),
                                  Limits::max(),         Limits::lowest(),      Limits::denorm_min(),
                                  Limits::denorm_min(),  Sample{-0.99f},        Sample{-1.0f},
                                  Sample{-0.0f},         Sample{0.0f},          Sample{255.99f},
                                  Sample{256.0f},        Sample{65535.5f},      Sample{65536.0f},
                                  Sample{2147483648.0f}, Sample{4294967808.0f}, Sample{-4294966784.0f}};
    return special[(bits >> 8) % std::size(special)];
  }
}

/// Samples that begin anywhere, with `around` before and behind.
template <class Sample>
class Row {
 public:
  Row(std::size_t count, std::size_t offset, Sample around)
      : memory_(count + 2 * kAround + offset, around), first_(kAround + offset), count_(count) {}

  Sample& operator[](std::size_t i) { return memory_[first_ + i]; }
  const Sample* Data() const { return memory_.data() + first_; }
  std::size_t Count() const { return count_; }

 private:
  static constexpr std::size_t kAround = 128;
  std::vector<Sample> memory_;
  std::size_t first_, count_;
};

bool SameBits(float a, float b) { return std::memcmp(&a, &b, sizeof(a)) == 0; }

template <class Sample>
void ExpectExtremes(const Row<Sample>& row, const Extremes& start) {
  Extremes expected = start, extremes = start;
  for (std::size_t i = 0; i < row.Count(); ++i) {
    const auto sample = static_cast<float>(row.Data()[i]);
    if (sample < expected.least) expected.least = sample;
    if (sample > expected.greatest) expected.greatest = sample;
  }
  TakeExtremes(row.Data(), row.Count(), extremes);
  ASSERT_TRUE(SameBits(extremes.least, expected.least))
      << extremes.least << " is not " << expected.least << ", " << row.Count() << " samples";
  ASSERT_TRUE(SameBits(extremes.greatest, expected.greatest))
      << extremes.greatest << " is not " << expected.greatest << ", " << row.Count() << " samples";
}

const Extremes kStarts[] = {{100000.0f, -100000.0f},
                            {kInfinity, -kInfinity},
                            {0.0f, 0.0f},
                            {-0.0f, -0.0f},
                            {kNaN, kNaN},
                            {-kInfinity, kInfinity},
                            {3.5f, 4.5f}};

template <class Sample>
class SampleCountsOf : public ::testing::Test {
 protected:
  tests::Random random_{41};
};
TYPED_TEST_SUITE(SampleCountsOf, PixelTypes);

TYPED_TEST(SampleCountsOf, ExtremesAreThoseOfTheLoop) {
  using Limits = std::numeric_limits<TypeParam>;
  for (const std::size_t count : Counts()) {
    for (const TypeParam around : {Limits::lowest(), Limits::max()}) {
      Row<TypeParam> row(count, count % 7, around);
      for (std::size_t i = 0; i < count; ++i) row[i] = AnySample<TypeParam>(this->random_);
      for (const Extremes& start : kStarts) ASSERT_NO_FATAL_FAILURE(ExpectExtremes(row, start));
      // Few values, among which there are no others: the limits would be in nearly every row.
      for (std::size_t i = 0; i < count; ++i) row[i] = static_cast<TypeParam>(40 + this->random_.Bits() % 80);
      for (const Extremes& start : kStarts) ASSERT_NO_FATAL_FAILURE(ExpectExtremes(row, start));
    }
  }
}

TYPED_TEST(SampleCountsOf, OneSampleIsFoundAtEveryPlace) {
  for (const std::size_t count : {1u, 31u, 64u, 100u, 127u, 128u, 200u, 256u, 300u}) {
    for (std::size_t place = 0; place < count; ++place) {
      for (const int value : {1, 101}) {
        Row<TypeParam> row(count, place % 3, TypeParam{60});
        for (std::size_t i = 0; i < count; ++i) row[i] = TypeParam{50};
        row[place] = static_cast<TypeParam>(value);
        ASSERT_NO_FATAL_FAILURE(ExpectExtremes(row, kStarts[0])) << "at " << place;
      }
    }
  }
}

TEST(TakeExtremes, FirstZeroMetStays) {
  tests::Random random(42);
  for (const std::size_t count : Counts()) {
    for (const float other : {1.0f, -1.0f, kNaN}) {
      Row<float> row(count, count % 5, other);
      Row<double> wide(count, 0, other);
      for (std::size_t zeros = 1; zeros < 40; zeros *= 3) {
        for (std::size_t i = 0; i < count; ++i) {
          row[i] = random.Bits() % zeros == 0 ? (random.Bits() % 2 == 0 ? 0.0f : -0.0f) : other;
          wide[i] = row[i] == 0.0f ? std::copysign(1e-60, row[i]) : row[i];  // a zero as `float`
        }
        for (const Extremes& start : kStarts) {
          ASSERT_NO_FATAL_FAILURE(ExpectExtremes(row, start));
          ASSERT_NO_FATAL_FAILURE(ExpectExtremes(wide, start));
        }
      }
    }
  }
}

// ---- counts

/// The bin of a sample; negative or beyond the bins if it has none.
template <class Sample>
double SlowBin(Sample sample) {
  if constexpr (std::is_integral_v<Sample>) return static_cast<double>(sample);
  const auto wide = static_cast<double>(sample);
  return wide > -2147483649.0 && wide < 2147483648.0 ? std::trunc(wide) : -1.0;
}

/// Counts as if they had no limit, wrapped to 32 bits.
int Plus(int count, std::int64_t more) { return static_cast<int>(static_cast<std::uint32_t>(count + more)); }

/// Bins that are not 0, some of them full.
std::vector<int> FilledBins(std::size_t count) {
  std::vector<int> bins(count);
  for (std::size_t i = 0; i < count; ++i)
    bins[i] = i % 3 == 0 ? std::numeric_limits<int>::max() : i % 3 == 1 ? -1 : static_cast<int>(i);
  return bins;
}

const std::size_t kBins[] = {0, 1, 7, 127, 128, 255, 256, 257, 65535, 65536, 65537};

TYPED_TEST(SampleCountsOf, SamplesWithABinAreCounted) {
  for (const std::size_t size : kBins) {
    std::vector<int> bins = FilledBins(size), expected = bins;
    for (const std::size_t count : Counts()) {
      if (size > 300 && count % 8 > 1) continue;
      Row<TypeParam> row(count, count % 7, TypeParam{1});
      for (std::size_t i = 0; i < count; ++i) {
        row[i] = AnySample<TypeParam>(this->random_);
        const double bin = SlowBin(row[i]);
        if (bin < 0.0 || bin >= static_cast<double>(size)) continue;
        int& counted = expected[static_cast<std::size_t>(bin)];
        counted = Plus(counted, 1);
      }
      CountSamples(row.Data(), count, bins);
    }
    ASSERT_TRUE(bins == expected) << size << " bins";
  }
}

TEST(CountSamples, ACountWraps) {
  std::vector<int> bins{std::numeric_limits<int>::max(), std::numeric_limits<int>::max()};
  const float samples[] = {0.0f, -0.5f, 1.9f};
  CountSamples(samples, 3, bins);
  EXPECT_EQ(bins[0], std::numeric_limits<int>::min() + 1);
  EXPECT_EQ(bins[1], std::numeric_limits<int>::min());
}

// ---- bytes

TEST(ByteCounts, CountEveryByteAtItsStride) {
  tests::Random random(43);
  for (std::size_t stride = 1; stride <= 9; ++stride) {
    ByteCounts counts;
    std::vector<int> expected = FilledBins(256);
    std::vector<int> bins = expected;
    for (const std::size_t count : Counts()) {
      // Long runs of one byte, and random ones. The last byte is the last one that may be read.
      std::vector<unsigned char> bytes(count == 0 ? 0 : (count - 1) * stride + 1);
      for (auto& byte : bytes) byte = static_cast<unsigned char>(count % 2 == 0 ? 77 : random.Bits());
      for (std::size_t i = 0; i < count; ++i)
        expected[bytes[i * stride]] = Plus(expected[bytes[i * stride]], 1);
      counts.Count(bytes.data(), stride, count);
    }
    Extremes extremes{1e5f, -1e5f};
    counts.AddTo(bins, extremes);
    EXPECT_EQ(bins, expected) << "stride " << stride;
    EXPECT_EQ(extremes.least, 0.0f);
    EXPECT_EQ(extremes.greatest, 255.0f);
  }
}

TEST(ByteCounts, BytesWithoutABinAreExtremesAllTheSame) {
  const std::vector<unsigned char> bytes{9, 200, 9, 3, 254, 9, 3, 100, 9, 3};
  ByteCounts counts;
  counts.Count(bytes.data() + 1, 1, 9);
  counts.Count(bytes.data(), 1, 1);
  for (const std::size_t size : kBins) {
    std::vector<int> bins = FilledBins(size), expected = bins;
    for (const unsigned char byte : bytes)
      if (byte < size) expected[byte] = Plus(expected[byte], 1);
    Extremes extremes{1e5f, -1e5f};
    counts.AddTo(bins, extremes);
    EXPECT_TRUE(bins == expected) << size << " bins";
    EXPECT_EQ(extremes.least, 3.0f);
    EXPECT_EQ(extremes.greatest, 254.0f);
  }
}

TEST(ByteCounts, ExtremesAreOnlyReplacedByStrictlyBetterBytes) {
  for (int byte = 0; byte < 256; ++byte) {
    for (const std::size_t place : {0u, 1u}) {  // in one table or in the other
      std::vector<unsigned char> bytes(place + 8, 128);
      bytes[place] = static_cast<unsigned char>(byte);
      ByteCounts counts;
      counts.Count(bytes.data(), 1, bytes.size());
      for (const Extremes& start : kStarts) {
        std::vector<int> none;
        Extremes expected = start, extremes = start;
        for (const int value : {byte, 128}) {
          if (static_cast<float>(value) < expected.least) expected.least = static_cast<float>(value);
          if (static_cast<float>(value) > expected.greatest) expected.greatest = static_cast<float>(value);
        }
        counts.AddTo(none, extremes);
        ASSERT_TRUE(SameBits(extremes.least, expected.least)) << byte;
        ASSERT_TRUE(SameBits(extremes.greatest, expected.greatest)) << byte;
      }
    }
  }
}

TEST(ByteCounts, NothingCountedChangesNothing) {
  ByteCounts counts;
  counts.Count(nullptr, 1, 0);
  std::vector<int> bins = FilledBins(256);
  Extremes extremes{1e5f, -1e5f};
  counts.AddTo(bins, extremes);
  EXPECT_EQ(bins, FilledBins(256));
  EXPECT_EQ(extremes.least, 1e5f);
  EXPECT_EQ(extremes.greatest, -1e5f);
}

}  // namespace
}  // namespace orvik::kernels
