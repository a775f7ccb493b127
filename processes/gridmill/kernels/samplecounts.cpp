#include "processes/gridmill/kernels/samplecounts.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <type_traits>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::kernels {

namespace {

/// Minima and maxima side by side, which need not be taken in order.
inline constexpr std::size_t kSideBySide = 64;

template <class Sample>
GRIDMILL_MULTIVERSION void ExtremesOf(const Sample* samples, std::size_t count, Sample& least,
                                      Sample& greatest) {
  Sample low[kSideBySide], high[kSideBySide];
  std::fill_n(low, kSideBySide, least);
  std::fill_n(high, kSideBySide, greatest);
  std::size_t i = 0;
  for (; i + kSideBySide <= count; i += kSideBySide) {
    for (std::size_t k = 0; k < kSideBySide; ++k) {
      const Sample s = samples[i + k];
      low[k] = s < low[k] ? s : low[k];
      high[k] = s > high[k] ? s : high[k];
    }
  }
  for (std::size_t k = 0; i < count; ++i, ++k) {
    low[k] = samples[i] < low[k] ? samples[i] : low[k];
    high[k] = samples[i] > high[k] ? samples[i] : high[k];
  }
  for (std::size_t k = 0; k < kSideBySide; ++k) {
    least = low[k] < least ? low[k] : least;
    greatest = high[k] > greatest ? high[k] : greatest;
  }
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
  if constexpr (std::is_same_v<Sample, unsigned char> || std::is_same_v<Sample, unsigned short>) {
    if (size > std::numeric_limits<Sample>::max()) {
      for (std::size_t i = 0; i < count; ++i) ++counts[samples[i]];
      return;
    }
  }
  for (std::size_t i = 0; i < count; ++i) {
    std::size_t bin;
    if (HasBin(samples[i], size, bin)) ++counts[bin];
  }
}

void ByteCounts::Count(const unsigned char* bytes, std::size_t count) {
  std::size_t i = 0;
  for (; i + 8 <= count; i += 8) {
    std::uint64_t word;
    std::memcpy(&word, bytes + i, sizeof(word));
    for (std::size_t k = 0; k < 8; ++k) ++tables_[k % 4][word >> (8 * k) & 255];
  }
  for (; i < count; ++i) ++tables_[0][bytes[i]];
}

void ByteCounts::AddTo(std::vector<int>& bins) const {
  auto* const counts = reinterpret_cast<unsigned int*>(bins.data());
  const std::size_t size = std::min<std::size_t>(bins.size(), 256);
  for (std::size_t i = 0; i < size; ++i)
    counts[i] += tables_[0][i] + tables_[1][i] + tables_[2][i] + tables_[3][i];
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
