#pragma once

#include <algorithm>
#include <cstddef>

#include "processes/gridmill/kernels/multiversion.h"

/// Sums over the channels of a pixel, in `double` and in the order of the channels.
namespace orvik::kernels {

template <class Term, std::size_t channels, class In>
GRIDMILL_MULTIVERSION void SumDenseRow(const In* __restrict source, std::size_t count,
                                       double* __restrict sum) {
  for (std::size_t i = 0; i < count; ++i) {
    double s = 0.0;
    for (std::size_t c = 0; c < channels; ++c)
      s = s + static_cast<double>(Term::Of(source[i * channels + c]));
    sum[i] = s;
  }
}

template <class Term, class In>
GRIDMILL_MULTIVERSION void AddChannelRow(const In* __restrict first, std::size_t stride, std::size_t count,
                                         double* __restrict sum) {
  for (std::size_t i = 0; i < count; ++i) sum[i] = sum[i] + static_cast<double>(Term::Of(first[i * stride]));
}

/// Sums of `Term::Of` of the first `channels` samples of `count` pixels, `stride` samples apart.
template <class Term, class In>
void SumRow(const In* first, std::size_t stride, std::size_t channels, std::size_t count, double* sum) {
  if (stride == channels && channels == 3) return SumDenseRow<Term, 3>(first, count, sum);
  if (stride == channels && channels == 4) return SumDenseRow<Term, 4>(first, count, sum);
  std::fill_n(sum, count, 0.0);
  for (std::size_t c = 0; c < channels; ++c) AddChannelRow<Term>(first + c, stride, count, sum);
}

}  // namespace orvik::kernels
