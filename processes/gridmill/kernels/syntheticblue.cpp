#include "processes/gridmill/kernels/syntheticblue.h"

#include <algorithm>
#include <cstdint>
#include <type_traits>

namespace orvik::kernels {

namespace {

/// Pixels that are estimated together.
constexpr std::size_t kEstimated = 128;

/// The bins of bytes by an estimate. Returns false if one is so near to a whole number that the exact blue
/// may lie on its other side.
GRIDMILL_MULTIVERSION bool EstimatedBinRow(const unsigned char* __restrict s0,
                                           const unsigned char* __restrict s1,
                                           const unsigned char* __restrict s2, std::size_t count,
                                           unsigned char* __restrict bins) {
  int near = 0;
  for (std::size_t i = 0; i < count; ++i) {
    const float b = EstimatedBlue(s0[i], s1[i], s2[i]);
    const int whole = static_cast<int>(b);
    const float fraction = b - static_cast<float>(whole);
    // Of a negative blue, which has bin 0, the fraction is negative or 0.
    near |= static_cast<int>(fraction >= -kEstimateError) & static_cast<int>(fraction < kEstimateError);
    near |= static_cast<int>(fraction > 1.0f - kEstimateError);
    bins[i] = static_cast<unsigned char>(whole < 0 ? 0 : whole);
  }
  return near == 0;
}

}  // namespace

template <class Sample>
GRIDMILL_MULTIVERSION void SyntheticBlueRow(const Sample* __restrict s0, const Sample* __restrict s1,
                                            const Sample* __restrict s2, std::size_t count,
                                            double* __restrict blue) {
  for (std::size_t i = 0; i < count; ++i)
    blue[i] =
        SyntheticBlue(static_cast<double>(s0[i]), static_cast<double>(s1[i]), static_cast<double>(s2[i]));
}

namespace {

template <class Sample>
GRIDMILL_MULTIVERSION void ExactBinRow(const Sample* __restrict s0, const Sample* __restrict s1,
                                       const Sample* __restrict s2, std::size_t count,
                                       unsigned char* __restrict bins) {
  for (std::size_t i = 0; i < count; ++i) {
    const double b =
        SyntheticBlue(static_cast<double>(s0[i]), static_cast<double>(s1[i]), static_cast<double>(s2[i]));
    // Truncation keeps the order: the limits can come first.
    const bool fits = (b >= 0.0) & (b < 2147483648.0);
    const double held = fits ? b : 0.0;
    bins[i] = static_cast<unsigned char>(static_cast<int>(held > 255.0 ? 255.0 : held));
  }
}

}  // namespace

template <class Sample>
void BlueBinRow(const Sample* s0, const Sample* s1, const Sample* s2, std::size_t count,
                unsigned char* bins) {
  if constexpr (std::is_same_v<Sample, unsigned char>) {
    for (std::size_t i = 0; i < count; i += kEstimated) {
      const std::size_t some = std::min(kEstimated, count - i);
      if (!EstimatedBinRow(s0 + i, s1 + i, s2 + i, some, bins + i))
        ExactBinRow(s0 + i, s1 + i, s2 + i, some, bins + i);
    }
  } else {
    ExactBinRow(s0, s1, s2, count, bins);
  }
}

template void SyntheticBlueRow(const char*, const char*, const char*, std::size_t, double*);
template void SyntheticBlueRow(const unsigned char*, const unsigned char*, const unsigned char*, std::size_t,
                               double*);
template void SyntheticBlueRow(const short*, const short*, const short*, std::size_t, double*);
template void SyntheticBlueRow(const unsigned short*, const unsigned short*, const unsigned short*,
                               std::size_t, double*);
template void SyntheticBlueRow(const int*, const int*, const int*, std::size_t, double*);
template void SyntheticBlueRow(const unsigned int*, const unsigned int*, const unsigned int*, std::size_t,
                               double*);
template void SyntheticBlueRow(const float*, const float*, const float*, std::size_t, double*);
template void SyntheticBlueRow(const double*, const double*, const double*, std::size_t, double*);
template void SyntheticBlueRow(const std::int64_t*, const std::int64_t*, const std::int64_t*, std::size_t,
                               double*);
template void SyntheticBlueRow(const std::uint64_t*, const std::uint64_t*, const std::uint64_t*, std::size_t,
                               double*);

template void BlueBinRow(const char*, const char*, const char*, std::size_t, unsigned char*);
template void BlueBinRow(const unsigned char*, const unsigned char*, const unsigned char*, std::size_t,
                         unsigned char*);
template void BlueBinRow(const short*, const short*, const short*, std::size_t, unsigned char*);
template void BlueBinRow(const unsigned short*, const unsigned short*, const unsigned short*, std::size_t,
                         unsigned char*);
template void BlueBinRow(const int*, const int*, const int*, std::size_t, unsigned char*);
template void BlueBinRow(const unsigned int*, const unsigned int*, const unsigned int*, std::size_t,
                         unsigned char*);
template void BlueBinRow(const float*, const float*, const float*, std::size_t, unsigned char*);
template void BlueBinRow(const double*, const double*, const double*, std::size_t, unsigned char*);
template void BlueBinRow(const std::int64_t*, const std::int64_t*, const std::int64_t*, std::size_t,
                         unsigned char*);
template void BlueBinRow(const std::uint64_t*, const std::uint64_t*, const std::uint64_t*, std::size_t,
                         unsigned char*);

}  // namespace orvik::kernels
