#pragma once

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include <gtest/gtest.h>

#include "tests/support/random.h"

namespace orvik::tests {

/// The counts of a histogram: small ones, with gaps, all zeros, or such that leave 32 bits when they are
/// multiplied by 100 or added.
inline std::vector<int> DrawCounts(Random& random, std::uint32_t bins) {
  constexpr int kLarge[] = {2147483647, 21474836, 21474837, 42949673, 1 << 30, -1, -1000};
  const std::uint32_t kind = random.Below(8);
  std::vector<int> counts(bins);
  for (int& count : counts) {
    if (kind == 0) continue;
    count = static_cast<int>(random.Below(kind < 3 ? 5 : 1000));
    if (kind == 1 && !random.OneIn(6)) count = 0;
    if (kind == 7 && random.OneIn(4)) count = random.Pick(kLarge);
  }
  return counts;
}

/// Passes if `actual` holds the same bits as `expected`, any NaN for a NaN.
inline ::testing::AssertionResult SameBlock(const std::vector<double>& expected, const double* actual) {
  for (std::size_t i = 0; i < expected.size(); ++i) {
    const bool isSame = std::isnan(expected[i]) ? std::isnan(actual[i])
                                                : std::memcmp(&expected[i], &actual[i], sizeof(double)) == 0;
    if (!isSame) {
      return ::testing::AssertionFailure()
             << "entry " << i << ": expected " << expected[i] << ", got " << actual[i];
    }
  }
  return ::testing::AssertionSuccess();
}

}  // namespace orvik::tests
