#pragma once

#include <cmath>
#include <cstddef>
#include <limits>
#include <type_traits>

/// Samples compared with two thresholds, as bytes of 0 or 1.
namespace orvik::kernels {

/// The samples of a narrow integer type from `first` on, `span` + 1 of them, or all others. The same samples
/// that lie within a range of `float` thresholds: integers of 16 bits are exact in `float`.
template <class Sample>
struct IntegerRange {
  using Unsigned = std::make_unsigned_t<Sample>;

  Unsigned first;
  Unsigned span;
  bool inside;  ///< false: 1 for all others
  bool empty;   ///< no sample from `first` on

  IntegerRange() = default;

  /// The range from `lower` to `upper`, both included, or the one that wraps around. NaN bounds nothing.
  IntegerRange(float lower, float upper, bool wraps) {
    constexpr int least = std::numeric_limits<Sample>::min(), most = std::numeric_limits<Sample>::max();
    int from = most + 1, to = least - 1;
    if (lower <= least) {
      from = least;
    } else if (lower <= most) {
      from = static_cast<int>(std::ceil(lower));
    }
    if (upper >= most) {
      to = most;
    } else if (upper >= least) {
      to = static_cast<int>(std::floor(upper));
    }
    if (wraps) Set(to + 1, from - 1);
    if (!wraps) Set(from, to);
    inside = !wraps;
  }

 private:
  void Set(int from, int to) {
    empty = from > to;
    first = static_cast<Unsigned>(from);
    span = static_cast<Unsigned>(to - from);
  }
};

/// 1 for the samples of a range.
template <class Sample>
void SelectRow(const Sample* samples, const IntegerRange<Sample>& range, std::size_t count,
               unsigned char* selected);

/// 1 for lower <= s <= upper, or if the range wraps around for lower <= s or s <= upper. NaN bounds nothing.
void SelectRow(const float* samples, float lower, float upper, bool wraps, std::size_t count,
               unsigned char* selected);

/// Clears the bytes that are not valid; both hold 0 or 1.
void KeepValid(const unsigned char* valid, std::size_t count, unsigned char* selected);

}  // namespace orvik::kernels
