#include "processes/gridmill/kernels/orderedsums.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

// While the magnitude of a sum stays between two powers of two, what a run of terms adds to it, rounding by
// rounding, depends on the sum in one respect only: whether it is an even or an odd multiple of its last
// place, which decides where a term halfway between two multiples goes. So all runs of a block are added at
// the same time, each to an even and to an odd number of the same last place, and then the sum takes from one
// run after the other what it would have got. A block in which the sum may leave its two powers is added term
// after term.

constexpr std::size_t kLanes = 4;
/// Registers whose additions overlap.
constexpr std::size_t kGroups = 2;
/// Above that many, the channels by themselves keep enough additions on the way.
constexpr std::size_t kFewChannels = 7;

static_assert(kRoomAfterTerms >= kGroups * kFewChannels + kLanes);

using Lanes = double __attribute__((vector_size(8 * kLanes)));
using Bits = std::int64_t __attribute__((vector_size(8 * kLanes)));

/// A sum before a block.
struct Start {
  double power;  ///< the power of two at or below its magnitude; 0 for 0

  explicit Start(double sum = 0.0)
      : power(std::bit_cast<double>(std::bit_cast<std::uint64_t>(sum) & 0x7FF0000000000000u)) {}

  /// Numbers with the last place of the sum, far from both powers.
  double Even() const { return 1.5 * power; }
  double Odd() const { return 1.5 * power + power * 0x1p-52; }
};

/// One run of terms for each lane.
template <bool nonNegative>
struct Runs {
  Lanes even, odd;
  Lanes size = {};  ///< the sum of the magnitudes

  GRIDMILL_INLINE void Add(const Lanes& terms) {
    even += terms;
    odd += terms;
    if constexpr (!nonNegative) {
      const Bits magnitude = Bits{} + INT64_MAX;
      size += reinterpret_cast<Lanes>(reinterpret_cast<Bits>(terms) & magnitude);
    }
  }
};

/// A sum on its way through the runs of a block.
template <bool nonNegative>
class Resolved {
 public:
  Resolved(double before, const Start& start) : start_(start), before_(before), sum_(before) {}

  GRIDMILL_INLINE void Take(const Runs<nonNegative>& runs, std::size_t lane) {
    const double even = runs.even[lane] - start_.Even(), odd = runs.odd[lane] - start_.Odd();
    sum_ += (std::bit_cast<std::uint64_t>(sum_) & 1) == 0 ? even : odd;
    size_ += nonNegative ? even : runs.size[lane];
  }

  /// True if neither the sum nor a run can have left its two powers on the way.
  bool Holds() const {
    const double forward = std::signbit(before_) ? before_ - sum_ : sum_ - before_;
    const double up = 0.5 * (size_ + forward), down = 0.5 * (size_ - forward);
    const double from = std::fabs(before_);
    // Far more than all roundings of a block.
    const double margin = start_.power * 0x1p-30;
    return size_ < 0.49 * start_.power && from + up + margin < 2.0 * start_.power &&
           (nonNegative || from - down - margin > start_.power);
  }

  double Sum() const { return sum_; }

 private:
  Start start_;
  double before_, sum_;
  double size_ = 0.0;
};

/// Adds `length` terms, `stride` apart, to each run of each group; the groups follow each other.
template <bool nonNegative>
GRIDMILL_INLINE void AddRuns(const double* terms, std::size_t stride, std::size_t length,
                             Runs<nonNegative>* group) {
  for (std::size_t i = 0; i < length; ++i) {
    for (std::size_t g = 0; g < kGroups; ++g) {
      Lanes lanes;
      std::memcpy(&lanes, terms + (g * length + i) * stride, sizeof lanes);
      group[g].Add(lanes);
    }
  }
}

/// Puts the terms of four runs of an even length side by side. Pairs: what every x86-64 processor has.
GRIDMILL_INLINE void PutSideBySide(const double* __restrict terms, std::size_t length,
                                   double* __restrict target) {
  using Pair = double __attribute__((vector_size(16)));
  for (std::size_t i = 0; i < length; i += 2) {
    for (std::size_t lane = 0; lane < kLanes; lane += 2) {
      Pair a, b;
      std::memcpy(&a, terms + lane * length + i, sizeof a);
      std::memcpy(&b, terms + (lane + 1) * length + i, sizeof b);
      const Pair first = __builtin_shufflevector(a, b, 0, 2), second = __builtin_shufflevector(a, b, 1, 3);
      std::memcpy(target + kLanes * i + lane, &first, sizeof first);
      std::memcpy(target + kLanes * (i + 1) + lane, &second, sizeof second);
    }
  }
}

/// One channel: each lane has a run of `length` terms.
template <bool nonNegative>
GRIDMILL_MULTIVERSION bool AddOneChannel(const double* terms, std::size_t length, double* sum) {
  double side[kMostTerms + kRoomAfterTerms];
  for (std::size_t g = 0; g < kGroups; ++g)
    PutSideBySide(terms + g * kLanes * length, length, side + g * kLanes * length);
  const Start start(*sum);
  Runs<nonNegative> group[kGroups];
  // cppcheck-suppress constVariable ; the braces on the right hide the assignment from it
  for (auto& runs : group) runs = {Lanes{} + start.Even(), Lanes{} + start.Odd()};
  AddRuns(side, kLanes, length, group);
  Resolved<nonNegative> resolved(*sum, start);
  for (const auto& runs : group)
    for (std::size_t lane = 0; lane < kLanes; ++lane) resolved.Take(runs, lane);
  if (!resolved.Holds()) return false;
  *sum = resolved.Sum();
  return true;
}

/// Up to four of the channels: each has a lane, and a run of `length` terms in each group.
template <bool nonNegative>
GRIDMILL_MULTIVERSION void AddSomeChannels(const double* terms, std::size_t channels, std::size_t length,
                                           std::size_t some, double* sums) {
  Start start[kLanes];
  Lanes even = {}, odd = {};
  for (std::size_t c = 0; c < some; ++c) {
    start[c] = Start(sums[c]);
    even[c] = start[c].Even();
    odd[c] = start[c].Odd();
  }
  Runs<nonNegative> group[kGroups];
  for (auto& runs : group) runs = {even, odd};
  AddRuns(terms, channels, length, group);
  for (std::size_t c = 0; c < some; ++c) {
    Resolved<nonNegative> resolved(sums[c], start[c]);
    for (const auto& runs : group) resolved.Take(runs, c);
    if (resolved.Holds()) {
      sums[c] = resolved.Sum();
    } else {
      for (std::size_t i = 0; i < kGroups * length; ++i) sums[c] += terms[i * channels + c];
    }
  }
}

GRIDMILL_MULTIVERSION void AddOneByOne(const double* __restrict terms, std::size_t channels,
                                       std::size_t count, double* __restrict sums) {
  for (std::size_t i = 0; i < count; i += channels)
    for (std::size_t c = 0; c < channels; ++c) sums[c] += terms[i + c];
}

template <bool nonNegative>
void AddTerms(double* terms, std::size_t channels, std::size_t count, double* sums) {
  if (channels > kFewChannels || count < kRoomAfterTerms) return AddOneByOne(terms, channels, count, sums);
  // Terms of 0 fill the last runs.
  std::fill_n(terms + count, kRoomAfterTerms, 0.0);
  if (channels == 1) {
    constexpr std::size_t step = kGroups * kLanes * 2;
    const std::size_t length = (count + step - 1) / step * 2;
    if (!AddOneChannel<nonNegative>(terms, length, sums)) AddOneByOne(terms, 1, count, sums);
    return;
  }
  const std::size_t length = (count / channels + kGroups - 1) / kGroups;
  for (std::size_t c = 0; c < channels; c += kLanes)
    AddSomeChannels<nonNegative>(terms + c, channels, length, std::min(kLanes, channels - c), sums + c);
}

}  // namespace

void AddInOrder(double* terms, std::size_t channels, std::size_t count, double* sums) {
  AddTerms<false>(terms, channels, count, sums);
}

void AddSquaresInOrder(double* terms, std::size_t channels, std::size_t count, double* sums) {
  AddTerms<true>(terms, channels, count, sums);
}

}  // namespace orvik::kernels
