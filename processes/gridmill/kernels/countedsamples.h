#pragma once

#include <bit>
#include <cstdint>
#include <limits>
#include <type_traits>

#include "processes/gridmill/kernels/multiversion.h"

/// Which samples a focus measure counts, decided once for a type instead of once for each sample.
namespace orvik::kernels {

/// The finite values of a pixel type in their order, both zeros as one.
template <class In>
struct OrderedValues {
  using Index = std::uint64_t;

  static constexpr In kLowest = std::numeric_limits<In>::lowest();
  static constexpr In kHighest = std::numeric_limits<In>::max();

  static constexpr In At(Index index) {
    if constexpr (std::is_floating_point_v<In>) {
      return index < kZero ? -Magnitude(kZero - index) : Magnitude(index - kZero);
    } else {
      return static_cast<In>(static_cast<Index>(kLowest) + index);
    }
  }

  static constexpr Index Last() {
    if constexpr (std::is_floating_point_v<In>) return 2 * kZero;
    return static_cast<Index>(kHighest) - static_cast<Index>(kLowest);
  }

  /// The first index whose value satisfies what all greater values satisfy too; `found` tells if there is
  /// one.
  template <class Test>
  static Index First(Test test, bool& found) {
    Index from = 0, to = Last();
    while (from < to) {
      const Index middle = from + (to - from) / 2;
      if (test(static_cast<double>(At(middle)))) {
        to = middle;
      } else {
        from = middle + 1;
      }
    }
    found = test(static_cast<double>(At(from)));
    return from;
  }

 private:
  using Bits = std::conditional_t<sizeof(In) == 4, std::uint32_t, std::uint64_t>;

  static constexpr In Magnitude(Index bits) { return std::bit_cast<In>(static_cast<Bits>(bits)); }

  /// The index of zero: as many magnitudes lie below it as above.
  static constexpr Index kZero = [] {
    if constexpr (std::is_floating_point_v<In>) return Index{std::bit_cast<Bits>(kHighest)};
    return Index{0};
  }();
};

/// The samples from `first` to `last`, both included; none if they are the wrong way round.
template <class In>
struct SampleSpan {
  using Values = OrderedValues<In>;

  In first = Values::kHighest;
  In last = Values::kLowest;

  SampleSpan() = default;

  /// The samples that, as `double`, satisfy both tests: `from` holds for all greater values too, `to` for all
  /// lesser ones.
  template <class From, class To>
  SampleSpan(From from, To to) {
    bool begins, ends;
    const auto begin = Values::First(from, begins);
    const auto end = Values::First([to](double v) { return !to(v); }, ends);
    if (!begins || (ends && end == 0)) return;
    first = Values::At(begin);
    last = ends ? Values::At(end - 1) : Values::kHighest;
  }

  bool IsEmpty() const { return !(first <= last); }
  bool HasAll() const { return first == Values::kLowest && last == Values::kHighest; }

  /// 1 if the sample is one of them, else 0: numbers that combine without branches.
  GRIDMILL_INLINE int Has(In sample) const { return (sample >= first) & (sample <= last); }
};

/// The samples strictly between two bounds, but for those within 1e-9 of `failure`. All tests are on
/// `double`, whose order the samples keep: they come to two spans of samples. NaN and infinities are in
/// neither.
template <class In>
struct CountedSamples {
  SampleSpan<In> range;
  SampleSpan<In> failures;

  CountedSamples(double low, double high, double failure)
      : range([low](double v) { return v > low; }, [high](double v) { return v < high; }),
        failures([failure](double v) { return v - failure > -1e-9; },
                 [failure](double v) { return v - failure < 1e-9; }) {}

  bool HasAll() const { return std::is_integral_v<In> && range.HasAll() && failures.IsEmpty(); }

  /// 1 if the sample counts, else 0.
  GRIDMILL_INLINE int Has(In sample) const { return range.Has(sample) & (failures.Has(sample) ^ 1); }
};

}  // namespace orvik::kernels
