#include "processes/gridmill/kernels/pixelgather.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "tests/attack/guardedpages.h"
#include "tests/support/random.h"

// Pixels one after the other. Rows end with the last byte that can be read.
namespace orvik::kernels {
namespace {

using Bytes = std::vector<unsigned char>;
using Columns = std::vector<std::uint32_t>;

constexpr std::size_t kGuard = 8;  // bytes on each side of a target
constexpr unsigned char kSentinel = 0xA5;

enum class Order : int { eASCENDING, eREPEATED, eDESCENDING, eNEAR, eJUMPS, eANY, eCONSECUTIVE, eTAIL };
constexpr Order kOrders[] = {Order::eASCENDING, Order::eREPEATED, Order::eDESCENDING,  Order::eNEAR,
                             Order::eJUMPS,     Order::eANY,      Order::eCONSECUTIVE, Order::eTAIL};

/// A column for each position, all within a row.
Columns ColumnsOf(Order order, std::size_t count, std::uint32_t rowPixels, tests::Random& random) {
  const std::uint32_t last = rowPixels - 1;
  Columns columns;
  std::uint32_t at = random.Below(rowPixels);
  for (std::uint32_t i = 0; i < count; ++i) {
    switch (order) {
      case Order::eASCENDING:
        at = i == 0 ? 0 : std::min<std::uint32_t>(last, at + 1 + random.Below(2));
        break;
      case Order::eREPEATED:
        at = std::min(last, i / 3);
        break;
      case Order::eDESCENDING:
        at = i > last ? 0 : last - i;
        break;
      case Order::eNEAR:
        at = std::min<std::uint32_t>(last, i / 2 + random.Below(2));
        break;
      case Order::eJUMPS:
        at = random.Below(20) == 0 ? random.Below(rowPixels) : std::min(last, at + 1);
        break;
      case Order::eANY:
        at = random.Below(rowPixels);
        break;
      case Order::eCONSECUTIVE:
        at = (i == 0 ? 0 : at + 1) % rowPixels;
        break;
      case Order::eTAIL:
        at = last - std::min<std::uint32_t>(last, random.Below(2));
        break;
    }
    columns.push_back(at);
  }
  return columns;
}

/// A choice from a row of random bytes. All rows lie at the same place, one after the other.
class Choice {
 public:
  Choice(Columns columns, std::size_t pixelBytes, std::uint32_t rowPixels, std::size_t offset,
         tests::Random& random)
      : columns_(std::move(columns)),
        pixelBytes_(pixelBytes),
        offset_(offset),
        row_(pages.Place(rowPixels * pixelBytes, true)),
        gather_(columns_, pixelBytes, rowPixels) {
    std::generate_n(row_, rowPixels * pixelBytes, [&] { return static_cast<unsigned char>(random.Bits()); });
  }

  void ExpectTaken(std::size_t from, std::size_t count) const {
    Bytes expected(count * pixelBytes_ + 2 * kGuard + offset_, kSentinel), target = expected;
    const std::size_t first = kGuard + offset_;
    for (std::size_t i = 0; i < count; ++i)
      for (std::size_t b = 0; b < pixelBytes_; ++b)
        expected[first + i * pixelBytes_ + b] = row_[columns_[from + i] * pixelBytes_ + b];
    gather_.Take(row_, from, count, target.data() + first);
    ASSERT_EQ(target, expected) << count << " of " << columns_.size() << " pixels of " << pixelBytes_
                                << " bytes from " << from << " on";
  }

  /// All pixels in blocks, the last one shorter.
  void ExpectBlocks(std::size_t pixels) const {
    for (std::size_t from = 0; from < columns_.size(); from += pixels)
      ASSERT_NO_FATAL_FAILURE(ExpectTaken(from, std::min(pixels, columns_.size() - from)));
  }

  const PixelGather& Gather() const { return gather_; }
  const unsigned char* Row() const { return row_; }

 private:
  static inline const attack::GuardedPages pages{1 << 16};

  Columns columns_;
  std::size_t pixelBytes_, offset_;
  unsigned char* row_;
  PixelGather gather_;
};

TEST(PixelGather, TakesThePixelsOfItsColumns) {
  tests::Random random(71);
  for (std::size_t pixelBytes = 1; pixelBytes <= 17; ++pixelBytes) {
    for (const Order order : kOrders) {
      for (const std::size_t count : {0u, 1u, 2u, 5u, 15u, 16u, 17u, 31u, 33u, 47u, 64u, 65u, 130u, 200u}) {
        const std::uint32_t rowPixels = 1 + random.Below(2 * static_cast<std::uint32_t>(count) + 3);
        const Choice choice(ColumnsOf(order, count, rowPixels, random), pixelBytes, rowPixels, count % 3,
                            random);
        ASSERT_NO_FATAL_FAILURE(choice.ExpectTaken(0, count)) << "order " << static_cast<int>(order);
        for (const std::size_t pixels : {16u, 48u, 64u, 128u})
          ASSERT_NO_FATAL_FAILURE(choice.ExpectBlocks(pixels)) << "order " << static_cast<int>(order);
      }
    }
  }
}

TEST(PixelGather, TakesEveryCountFromEveryMultipleOf16) {
  tests::Random random(72);
  for (const std::size_t pixelBytes : {1u, 2u, 3u, 4u, 5u, 7u, 8u, 12u}) {
    for (const Order order : {Order::eNEAR, Order::eREPEATED, Order::eANY}) {
      const Choice choice(ColumnsOf(order, 100, 60, random), pixelBytes, 60, 1, random);
      for (std::size_t from = 0; from <= 100; from += 16)
        for (std::size_t count = 0; from + count <= 100; ++count)
          ASSERT_NO_FATAL_FAILURE(choice.ExpectTaken(from, count));
    }
  }
}

TEST(PixelGather, RowsOfFewBytes) {
  tests::Random random(73);
  for (std::size_t pixelBytes = 1; pixelBytes <= 17; ++pixelBytes) {
    for (std::uint32_t rowPixels = 1; rowPixels * pixelBytes <= 34; ++rowPixels) {
      for (const Order order : kOrders) {
        const Choice choice(ColumnsOf(order, 70, rowPixels, random), pixelBytes, rowPixels, 2, random);
        ASSERT_NO_FATAL_FAILURE(choice.ExpectTaken(0, 70)) << rowPixels << " pixels in the row";
        ASSERT_NO_FATAL_FAILURE(choice.ExpectBlocks(16)) << rowPixels << " pixels in the row";
      }
    }
  }
}

TEST(PixelGather, NeighboursAsFarApartAsTheyCanBe) {
  tests::Random random(74);
  for (const std::size_t pixelBytes : {1u, 2u, 3u, 4u, 5u, 6u, 7u}) {
    for (std::uint32_t distance = 1; distance <= 40; ++distance) {
      for (const bool back : {false, true}) {
        Columns columns;
        for (std::uint32_t i = 0; i < 64; ++i) columns.push_back(i % 2 == (back ? 0 : 1) ? distance : 0);
        const Choice choice(columns, pixelBytes, distance + 1, 0, random);
        ASSERT_NO_FATAL_FAILURE(choice.ExpectTaken(0, 64)) << "columns " << distance << " apart";
      }
    }
  }
}

TEST(PixelGather, OneFarPixelAtEveryPosition) {
  tests::Random random(75);
  for (const std::size_t pixelBytes : {1u, 3u, 4u}) {
    for (std::size_t far = 0; far < 80; ++far) {
      Columns columns;
      for (std::uint32_t i = 0; i < 80; ++i) columns.push_back(i == far ? 4999 : i / 2);
      const Choice choice(columns, pixelBytes, 5000, 0, random);
      ASSERT_NO_FATAL_FAILURE(choice.ExpectTaken(0, 80)) << "far pixel at " << far;
      ASSERT_NO_FATAL_FAILURE(choice.ExpectBlocks(16)) << "far pixel at " << far;
    }
  }
}

TEST(PixelGather, AtIsTheFirstByteOfAPixel) {
  tests::Random random(76);
  for (const std::size_t pixelBytes : {1u, 3u, 8u, 17u}) {
    const Columns columns{4, 0, 4, 9, 2};
    const Choice choice(columns, pixelBytes, 10, 1, random);
    for (std::size_t i = 0; i < columns.size(); ++i)
      EXPECT_EQ(choice.Gather().At(choice.Row(), i), choice.Row() + columns[i] * pixelBytes) << i;
  }
}

bool FollowEachOther(const Columns& columns, std::size_t from, std::size_t count) {
  for (std::size_t i = from + 1; i < from + count; ++i)
    if (columns[i] != columns[i - 1] + 1) return false;
  return true;
}

TEST(PixelGather, IsConsecutiveWherePixelsFollowEachOther) {
  tests::Random random(77);
  int consecutive = 0;
  for (const Order order : kOrders) {
    for (const std::uint32_t rowPixels : {1u, 10u, 60u}) {
      const Columns columns = ColumnsOf(order, 50, rowPixels, random);
      const PixelGather gather(columns, 3, rowPixels);
      for (std::size_t from = 0; from < columns.size(); ++from) {
        for (std::size_t count = 1; from + count <= columns.size(); ++count) {
          const bool expected = FollowEachOther(columns, from, count);
          ASSERT_EQ(gather.IsConsecutive(from, count), expected)
              << count << " from " << from << " on, order " << static_cast<int>(order);
          consecutive += expected && count > 2;
        }
      }
    }
  }
  EXPECT_GT(consecutive, 1000);
}

}  // namespace
}  // namespace orvik::kernels
