#include "processes/gridmill/kernels/thresholds.h"

#include <algorithm>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

template <class Unsigned>
GRIDMILL_MULTIVERSION void SelectUnsigned(const Unsigned* samples, Unsigned first, Unsigned span,
                                          Unsigned inside, Unsigned outside, std::size_t count,
                                          unsigned char* selected) {
  GRIDMILL_INDEPENDENT
  for (std::size_t i = 0; i < count; ++i) {
    const Unsigned above = static_cast<Unsigned>(samples[i] - first);
    selected[i] = static_cast<unsigned char>(above <= span ? inside : outside);
  }
}

}  // namespace

template <class Sample>
void SelectRow(const Sample* samples, const IntegerRange<Sample>& range, std::size_t count,
               unsigned char* selected) {
  using Unsigned = std::make_unsigned_t<Sample>;
  const Unsigned inside = range.inside ? 1 : 0, outside = range.inside ? 0 : 1;
  if (range.empty) {
    std::fill_n(selected, count, static_cast<unsigned char>(outside));
  } else {
    SelectUnsigned(reinterpret_cast<const Unsigned*>(samples), range.first, range.span, inside, outside,
                   count, selected);
  }
}

template void SelectRow(const char*, const IntegerRange<char>&, std::size_t, unsigned char*);
template void SelectRow(const unsigned char*, const IntegerRange<unsigned char>&, std::size_t,
                        unsigned char*);
template void SelectRow(const short*, const IntegerRange<short>&, std::size_t, unsigned char*);
template void SelectRow(const unsigned short*, const IntegerRange<unsigned short>&, std::size_t,
                        unsigned char*);

GRIDMILL_MULTIVERSION void SelectRow(const float* samples, float lower, float upper, bool wraps,
                                     std::size_t count, unsigned char* selected) {
  if (wraps) {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i)
      selected[i] = static_cast<unsigned char>((samples[i] >= lower) | (upper >= samples[i]));
  } else {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i)
      selected[i] = static_cast<unsigned char>((samples[i] >= lower) & (upper >= samples[i]));
  }
}

GRIDMILL_MULTIVERSION void KeepValid(const unsigned char* __restrict valid, std::size_t count,
                                     unsigned char* __restrict selected) {
  for (std::size_t i = 0; i < count; ++i) selected[i] &= valid[i];
}

}  // namespace orvik::kernels
