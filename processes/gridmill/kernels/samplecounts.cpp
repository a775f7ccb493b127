#include "processes/gridmill/kernels/samplecounts.h"

#include <algorithm>
#include <limits>
#include <type_traits>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::kernels {

namespace {

/// Minima and maxima side by side, which need not be taken in order: two registers of the widest kind.
template <class Sample>
inline constexpr std::size_t kSideBySide = 128 / sizeof(Sample);

/// Takes samples at one place each.
template <std::size_t lanes, class Sample>
GRIDMILL_INLINE void TakeLanes(const Sample* least, const Sample* greatest, Sample* low, Sample* high) {
  for (std::size_t k = 0; k < lanes; ++k) {
    low[k] = least[k] < low[k] ? least[k] : low[k];
    high[k] = greatest[k] > high[k] ? greatest[k] : high[k];
  }
}

/// Takes the upper half of the places into the lower one, until there is one place.
template <std::size_t lanes, class Sample>
GRIDMILL_INLINE void FoldLanes(Sample* low, Sample* high) {
  if constexpr (lanes > 1) {
    TakeLanes<lanes / 2>(low + lanes / 2, high + lanes / 2, low, high);
    FoldLanes<lanes / 2>(low, high);
  }
}

template <class Sample>
GRIDMILL_MULTIVERSION void ExtremesOf(const Sample* samples, std::size_t count, Sample& least,
                                      Sample& greatest) {
  constexpr std::size_t lanes = kSideBySide<Sample>;
  Sample low[lanes], high[lanes];
  std::fill_n(low, lanes, least);
  std::fill_n(high, lanes, greatest);
  std::size_t i = 0;
  for (; i + lanes <= count; i += lanes) TakeLanes<lanes>(samples + i, samples + i, low, high);
  for (; i < count; ++i) TakeLanes<1>(samples + i, samples + i, low, high);
  FoldLanes<lanes>(low, high);
  least = low[0];
  greatest = high[0];
}

/// The first of the zeros, which keeps its sign.
float FirstZero(const float* samples, std::size_t count) {
  return *std::find(samples, samples + count, 0.0f);
}

/// True if the sample has a bin.
template <class Sample>
GRIDMILL_INLINE bool HasBin(Sample sample, std::size_t bins, std::size_t& bin) {
  if constexpr (std::is_floating_point_v<Sample>) {
    return HasBin(tessel::PlainCast<int>(sample), bins, bin);
  } else {
    bin = static_cast<std::size_t>(sample);
    return bin < bins;
  }
}

/// Counts samples that all have a bin, every second one in a table that may be the same one.
template <class Sample>
// NOLINTNEXTLINE(readability-non-const-parameter): counted up by a subscript that depends on the type
inline void CountAll(const Sample* samples, std::size_t stride, std::size_t count, std::uint32_t* even,
                     // NOLINTNEXTLINE(readability-non-const-parameter): likewise
                     std::uint32_t* odd) {
  constexpr std::size_t together = 8;
  std::size_t i = 0;
  for (; i + together <= count; i += together) {
    for (std::size_t k = 0; k < together; k += 2) {
      ++even[samples[(i + k) * stride]];
      ++odd[samples[(i + k + 1) * stride]];
    }
  }
  for (; i < count; ++i) ++even[samples[i * stride]];
}

}  // namespace

template <class Sample>
void TakeExtremes(const Sample* samples, std::size_t count, Extremes& extremes) {
  if constexpr (std::is_integral_v<Sample> && sizeof(Sample) <= 2) {
    if (count == 0) return;
    Sample least = samples[0], greatest = samples[0];
    ExtremesOf(samples, count, least, greatest);
    extremes.Take(least);
    extremes.Take(greatest);
  } else {
    for (std::size_t i = 0; i < count; i += kBlock) {
      const std::size_t some = std::min(kBlock, count - i);
      float scratch[kBlock];
      const float* const values = FloatRow(samples + i, 1, some, scratch);
      float least = extremes.least, greatest = extremes.greatest;
      ExtremesOf(values, some, least, greatest);
      if (least < extremes.least) extremes.least = least == 0.0f ? FirstZero(values, some) : least;
      if (greatest > extremes.greatest)
        extremes.greatest = greatest == 0.0f ? FirstZero(values, some) : greatest;
    }
  }
}

template <class Sample>
void CountSamples(const Sample* samples, std::size_t count, std::vector<int>& bins) {
  const std::size_t size = bins.size();
  // Unsigned counts may wrap.
  auto* const counts = reinterpret_cast<unsigned int*>(bins.data());
  if constexpr (std::is_same_v<Sample, unsigned short>) {
    if (size > std::numeric_limits<Sample>::max()) return CountAll(samples, 1, count, counts, counts);
  }
  for (std::size_t i = 0; i < count; ++i) {
    std::size_t bin;
    if (HasBin(samples[i], size, bin)) ++counts[bin];
  }
}

void ByteCounts::Count(const unsigned char* bytes, std::size_t stride, std::size_t count) {
  std::uint32_t* const even = tables_[0].data();
  std::uint32_t* const odd = tables_[1].data();
  if (stride == 1) return CountAll(bytes, 1, count, even, odd);
  if (stride == 3) return CountAll(bytes, 3, count, even, odd);
  if (stride == 4) return CountAll(bytes, 4, count, even, odd);
  CountAll(bytes, stride, count, even, odd);
}

void ByteCounts::AddTo(std::vector<int>& bins, Extremes& extremes) const {
  auto* const counts = reinterpret_cast<unsigned int*>(bins.data());
  for (std::size_t i = 0; i < 256; ++i) {
    const std::uint32_t count = tables_[0][i] + tables_[1][i];
    if (i < bins.size()) counts[i] += count;
    if (count != 0) extremes.Take(static_cast<float>(i));
  }
}

template void TakeExtremes(const char*, std::size_t, Extremes&);
template void TakeExtremes(const unsigned char*, std::size_t, Extremes&);
template void TakeExtremes(const short*, std::size_t, Extremes&);
template void TakeExtremes(const unsigned short*, std::size_t, Extremes&);
template void TakeExtremes(const int*, std::size_t, Extremes&);
template void TakeExtremes(const unsigned int*, std::size_t, Extremes&);
template void TakeExtremes(const float*, std::size_t, Extremes&);
template void TakeExtremes(const double*, std::size_t, Extremes&);
template void TakeExtremes(const std::int64_t*, std::size_t, Extremes&);
template void TakeExtremes(const std::uint64_t*, std::size_t, Extremes&);

template void CountSamples(const char*, std::size_t, std::vector<int>&);
template void CountSamples(const unsigned char*, std::size_t, std::vector<int>&);
template void CountSamples(const short*, std::size_t, std::vector<int>&);
template void CountSamples(const unsigned short*, std::size_t, std::vector<int>&);
template void CountSamples(const int*, std::size_t, std::vector<int>&);
template void CountSamples(const unsigned int*, std::size_t, std::vector<int>&);
template void CountSamples(const float*, std::size_t, std::vector<int>&);
template void CountSamples(const double*, std::size_t, std::vector<int>&);
template void CountSamples(const std::int64_t*, std::size_t, std::vector<int>&);
template void CountSamples(const std::uint64_t*, std::size_t, std::vector<int>&);

}  // namespace orvik::kernels
