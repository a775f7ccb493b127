#include "processes/gridmill/kernels/focussums.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <numeric>
#include <type_traits>

#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/orderedsums.h"

namespace orvik::kernels {

namespace {

/// Integer terms that go through together at most.
constexpr std::size_t kIntegerTerms = 2048;

/// Above that many channels, terms are `double`.
constexpr std::size_t kFewChannels = 7;

/// Some samples of a row: those of whole pixels, or some of one pixel.
struct Block {
  std::size_t first;     ///< the index of the first in the row
  std::size_t channel;   ///< the channel of the first
  std::size_t channels;  ///< after which the channel is the same again
  std::size_t count;
};

/// Calls `run(block)` for all samples of a row, at most `terms` at a time.
template <class Run>
void ForBlocks(std::size_t channels, std::size_t pixels, std::size_t terms, Run run) {
  if (channels > terms) {
    for (std::size_t x = 0; x < pixels; ++x) {
      for (std::size_t c = 0; c < channels; c += terms) {
        const std::size_t some = std::min(terms, channels - c);
        run(Block{x * channels + c, c, some, some});
      }
    }
    return;
  }
  // Pixels by the eight fill whole registers, whatever the channels.
  const std::size_t fitting = terms / channels;
  const std::size_t step = fitting < 8 ? fitting : fitting & ~std::size_t{7};
  for (std::size_t x = 0; x < pixels; x += step)
    run(Block{x * channels, 0, channels, channels * std::min(step, pixels - x)});
}

// ---- any samples: terms as `double`, 0 for those that do not count

template <class In>
GRIDMILL_MULTIVERSION void SquaredDifferences(const In* __restrict upper, const In* __restrict lower,
                                              CountedSamples<In> counted, std::size_t count,
                                              double* __restrict terms) {
  for (std::size_t i = 0; i < count; ++i) {
    const double difference = static_cast<double>(lower[i]) - static_cast<double>(upper[i]);
    const int counts = counted.Has(upper[i]) & counted.Has(lower[i]);
    terms[i] = counts != 0 ? difference * difference : 0.0;
  }
}

template <class In>
GRIDMILL_MULTIVERSION void NeighbourProducts(const In* __restrict row, std::size_t channels,
                                             CountedSamples<In> counted, std::size_t count,
                                             double* __restrict left, double* __restrict right) {
  const In* const next = row + channels;
  const In* const last = next + channels;
  for (std::size_t i = 0; i < count; ++i) {
    const double p0 = static_cast<double>(row[i]);
    const double p1 = static_cast<double>(next[i]), p2 = static_cast<double>(last[i]);
    const int counts = counted.Has(row[i]) & counted.Has(next[i]) & counted.Has(last[i]);
    left[i] = counts != 0 ? p1 * p0 : 0.0;
    right[i] = counts != 0 ? p2 * p0 : 0.0;
  }
}

// ---- narrow samples: terms as integers

template <class In>
constexpr bool kNarrow = std::is_integral_v<In> && sizeof(In) <= 2;

/// No term of samples of a type is larger.
template <class In>
constexpr double kLargestTerm = sizeof(In) == 1 ? 0x1p16 : 0x1p32;

template <class In>
using Square = std::conditional_t<sizeof(In) == 1, std::uint16_t, std::uint32_t>;
template <class In>
using Product = std::conditional_t<std::is_signed_v<In>, std::make_signed_t<Square<In>>, Square<In>>;

/// @tparam tested  false: all samples count
template <bool tested, class In>
GRIDMILL_MULTIVERSION void IntegerSquares(const In* __restrict upper, const In* __restrict lower,
                                          CountedSamples<In> counted, std::size_t count,
                                          Square<In>* __restrict terms) {
  for (std::size_t i = 0; i < count; ++i) {
    const auto difference = static_cast<unsigned int>(lower[i] - upper[i]);
    const int counts = tested ? counted.Has(upper[i]) & counted.Has(lower[i]) : 1;
    terms[i] = static_cast<Square<In>>(counts != 0 ? difference * difference : 0u);
  }
}

template <bool tested, class In>
GRIDMILL_MULTIVERSION void IntegerProducts(const In* __restrict row, std::size_t channels,
                                           CountedSamples<In> counted, std::size_t count,
                                           Product<In>* __restrict left, Product<In>* __restrict right) {
  using Factor = std::conditional_t<std::is_signed_v<In>, int, unsigned int>;
  const In* const next = row + channels;
  const In* const last = next + channels;
  for (std::size_t i = 0; i < count; ++i) {
    const Factor p0 = row[i], p1 = next[i], p2 = last[i];
    const int counts = tested ? counted.Has(row[i]) & counted.Has(next[i]) & counted.Has(last[i]) : 1;
    left[i] = static_cast<Product<In>>(counts != 0 ? p1 * p0 : Factor{0});
    right[i] = static_cast<Product<In>>(counts != 0 ? p2 * p0 : Factor{0});
  }
}

/// Adds the terms of each channel, whose sums stay below 2^53.
template <class Term>
GRIDMILL_MULTIVERSION void AddIntegers(const Term* terms, std::size_t channels, std::size_t count,
                                       double* sums) {
  using Wide = std::conditional_t<sizeof(Term) == 2, std::uint32_t, std::uint64_t>;
  using Sum = std::conditional_t<std::is_signed_v<Term>, std::make_signed_t<Wide>, Wide>;
  constexpr std::size_t kLanes = 32 / sizeof(Sum);
  typedef Term Terms __attribute__((vector_size(kLanes * sizeof(Term))));
  typedef Sum Sums __attribute__((vector_size(kLanes * sizeof(Sum))));
  const std::size_t step = std::lcm(channels, kLanes);
  const std::size_t whole = count - count % step;
  for (std::size_t phase = 0; phase < step && whole != 0; phase += kLanes) {
    Sums sum = {};
    for (std::size_t i = phase; i < whole; i += step) {
      Terms some;
      std::memcpy(&some, terms + i, sizeof some);
      sum += __builtin_convertvector(some, Sums);
    }
    for (std::size_t lane = 0; lane < kLanes; ++lane)
      sums[(phase + lane) % channels] += static_cast<double>(sum[lane]);
  }
  for (std::size_t i = whole; i < count; ++i) sums[i % channels] += static_cast<double>(terms[i]);
}

/// True if `pixels` terms more keep all sums integers that a `double` holds.
template <class In>
bool StayExact(const double* sums, std::size_t channels, std::size_t pixels) {
  const double more = static_cast<double>(pixels) * kLargestTerm<In>;
  return std::all_of(sums, sums + channels, [more](double sum) { return std::fabs(sum) + more <= 0x1p53; });
}

// ---- bits

/// The 56 bits from `index` on, in the lower bits of the result.
GRIDMILL_INLINE std::uint64_t BitsFrom(const unsigned char* bits, std::size_t index) {
  std::uint64_t word = 0;
  for (std::size_t i = 0; i < 8; ++i) word = (word << 8) | bits[index / 8 + i];
  return (word << (index & 7)) >> 8;
}

/// The bit with `index`, 0 or 1.
GRIDMILL_INLINE unsigned int BitAt(const unsigned char* bits, std::size_t index) {
  return (bits[index / 8] >> (7 - (index & 7))) & 1u;
}

}  // namespace

template <class In>
void FocusSums<In>::AddSquaredDifferences(const In* upper, const In* lower, std::size_t pixels,
                                          double* sums) const {
  if constexpr (kNarrow<In>) {
    if (channels <= kFewChannels && StayExact<In>(sums, channels, pixels)) {
      const auto terms = counted.HasAll() ? IntegerSquares<false, In> : IntegerSquares<true, In>;
      return ForBlocks(channels, pixels, kIntegerTerms, [&](const Block& block) {
        Square<In> squares[kIntegerTerms];
        terms(upper + block.first, lower + block.first, counted, block.count, squares);
        AddIntegers(squares, channels, block.count, sums);
      });
    }
  }
  ForBlocks(channels, pixels, kMostTerms, [&](const Block& block) {
    double squares[kMostTerms + kRoomAfterTerms];
    SquaredDifferences(upper + block.first, lower + block.first, counted, block.count, squares);
    AddSquaresInOrder(squares, block.channels, block.count, sums + block.channel);
  });
}

template <class In>
void FocusSums<In>::AddNeighbourProducts(const In* row, std::size_t pixels, double* left,
                                         double* right) const {
  if constexpr (kNarrow<In>) {
    if (channels <= kFewChannels && StayExact<In>(left, channels, pixels) &&
        StayExact<In>(right, channels, pixels)) {
      const auto terms = counted.HasAll() ? IntegerProducts<false, In> : IntegerProducts<true, In>;
      return ForBlocks(channels, pixels, kIntegerTerms, [&](const Block& block) {
        Product<In> lefts[kIntegerTerms], rights[kIntegerTerms];
        terms(row + block.first, channels, counted, block.count, lefts, rights);
        AddIntegers(lefts, channels, block.count, left);
        AddIntegers(rights, channels, block.count, right);
      });
    }
  }
  ForBlocks(channels, pixels, kMostTerms, [&](const Block& block) {
    double lefts[kMostTerms + kRoomAfterTerms], rights[kMostTerms + kRoomAfterTerms];
    NeighbourProducts(row + block.first, channels, counted, block.count, lefts, rights);
    AddInOrder(lefts, block.channels, block.count, left + block.channel);
    AddInOrder(rights, block.channels, block.count, right + block.channel);
  });
}

GRIDMILL_MULTIVERSION std::size_t CountSetInBoth(const unsigned char* bits, std::size_t first,
                                                 std::size_t second, std::size_t count) {
  constexpr std::size_t step = 56;
  int set = 0;
  std::size_t i = 0;
  // 8 bytes reach at most 8 bits further.
  for (; i + step + 8 <= count; i += step)
    set += std::popcount(BitsFrom(bits, first + i) & BitsFrom(bits, second + i));
  for (; i < count; ++i) set += static_cast<int>(BitAt(bits, first + i) & BitAt(bits, second + i));
  return static_cast<std::size_t>(set);
}

template struct FocusSums<char>;
template struct FocusSums<unsigned char>;
template struct FocusSums<short>;
template struct FocusSums<unsigned short>;
template struct FocusSums<int>;
template struct FocusSums<unsigned int>;
template struct FocusSums<float>;
template struct FocusSums<double>;
template struct FocusSums<std::int64_t>;
template struct FocusSums<std::uint64_t>;

}  // namespace orvik::kernels
