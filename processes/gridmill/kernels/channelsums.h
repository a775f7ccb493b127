#pragma once

#include <algorithm>
#include <cstddef>
#include <type_traits>

#include "processes/gridmill/kernels/multiversion.h"

/// Sums over the channels of a pixel, in `double` and in the order of the channels.
namespace orvik::kernels {

/// Each kernel hands the sums to `finish` on the way, so that roots and divisions overlap with the additions.
template <class Term, std::size_t channels, class In, class Finish>
GRIDMILL_MULTIVERSION void SumDenseRow(const In* __restrict source, Finish finish, std::size_t count,
                                       double* __restrict result) {
  for (std::size_t i = 0; i < count; ++i) {
    // A sum of few terms that `int` holds is the same number in `double`.
    std::conditional_t<Term::template kFitsInt<In>, int, double> sum = 0;
    for (std::size_t c = 0; c < channels; ++c)
      sum = sum + static_cast<decltype(sum)>(Term::Of(source[i * channels + c]));
    result[i] = finish.Of(sum);
  }
}

template <class Term, class In>
GRIDMILL_MULTIVERSION void AddChannelRow(const In* __restrict first, std::size_t stride, std::size_t count,
                                         double* __restrict sum) {
  for (std::size_t i = 0; i < count; ++i) sum[i] = sum[i] + static_cast<double>(Term::Of(first[i * stride]));
}

template <class Finish>
GRIDMILL_MULTIVERSION void FinishRow(Finish finish, std::size_t count, double* __restrict sum) {
  for (std::size_t i = 0; i < count; ++i) sum[i] = finish.Of(sum[i]);
}

/// `finish.Of` of the sums of `Term::Of` of the first `channels` samples of `count` pixels, `stride` samples
/// apart.
template <class Term, class In, class Finish>
void SumRow(const In* first, std::size_t stride, std::size_t channels, Finish finish, std::size_t count,
            double* result) {
  if (stride == channels && channels == 3) return SumDenseRow<Term, 3>(first, finish, count, result);
  if (stride == channels && channels == 4) return SumDenseRow<Term, 4>(first, finish, count, result);
  std::fill_n(result, count, 0.0);
  for (std::size_t c = 0; c < channels; ++c) AddChannelRow<Term>(first + c, stride, count, result);
  FinishRow(finish, count, result);
}

}  // namespace orvik::kernels
