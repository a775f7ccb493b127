#pragma once

#include <cmath>
#include <cstddef>
#include <limits>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"

/// Means of the channels of narrow unsigned samples in integer arithmetic: sums of them are exact in `float`,
/// so that the results are those of the `float` arithmetic, bit for bit.
namespace orvik::kernels {

/// True if a sample counts as no-data. The bound of 1e-9 is one on a double; no `float` lies between it and
/// the `float` next to it, so that this decides alike. NaN never counts.
GRIDMILL_INLINE bool IsNoData(float sample, float noData) { return std::fabs(sample - noData) <= 1e-9f; }

/// The one sample of an integer type that counts as no-data.
template <class In>
struct NoDataSample {
  bool exists;  ///< false: `noData` is further than 1e-9 from every sample
  In sample;

  explicit NoDataSample(float noData) {
    const int nearest = tessel::PlainCast<int>(noData);
    exists = nearest >= std::numeric_limits<In>::min() && nearest <= std::numeric_limits<In>::max() &&
             IsNoData(static_cast<float>(nearest), noData);
    sample = static_cast<In>(exists ? nearest : 0);
  }
};

/// Means of three 8-bit channels, rounded to 8 bits; `substitute` where a channel is no-data.
void RoundedMeanRow3(const unsigned char* source, NoDataSample<unsigned char> noData,
                     unsigned char substitute, std::size_t count, unsigned char* target);

/// Means of four 16-bit channels; `substitute` where a channel is no-data.
void MeanRow4(const unsigned short* source, NoDataSample<unsigned short> noData, float substitute,
              std::size_t count, float* mean);

}  // namespace orvik::kernels
