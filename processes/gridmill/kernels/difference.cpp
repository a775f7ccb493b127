#include "processes/gridmill/kernels/difference.h"

#include <cstdint>
#include <type_traits>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

template <class Sample>
GRIDMILL_INLINE Sample Subtract(Sample a, Sample b) {
  if constexpr (std::is_floating_point_v<Sample>) {
    return a - b;
  } else {
    using Unsigned = std::make_unsigned_t<Sample>;
    return static_cast<Sample>(static_cast<Unsigned>(a) - static_cast<Unsigned>(b));
  }
}

/// Deliberate: an absolute difference wraps too, so that it can come out negative.
template <class Sample>
GRIDMILL_INLINE Sample AbsoluteDifference(Sample a, Sample b) {
  const bool ordered = a >= b;
  return Subtract(ordered ? a : b, ordered ? b : a);
}

template <class Sample>
GRIDMILL_INLINE Sample BackwardDifference(Sample a, Sample b) {
  // Equal floating samples give +0, where a negation would give -0.
  if constexpr (std::is_floating_point_v<Sample>) return Sample{0} - (a - b);
  return Subtract(b, a);
}

}  // namespace

template <class Sample>
GRIDMILL_MULTIVERSION void DifferenceRow(const Sample* a, const Sample* b, Difference form, std::size_t count,
                                         Sample* target) {
  if (form == Difference::kAbsolute) {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i) target[i] = AbsoluteDifference(a[i], b[i]);
  } else if (form == Difference::kForward) {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i) target[i] = Subtract(a[i], b[i]);
  } else {
    GRIDMILL_INDEPENDENT
    for (std::size_t i = 0; i < count; ++i) target[i] = BackwardDifference(a[i], b[i]);
  }
}

template void DifferenceRow(const char*, const char*, Difference, std::size_t, char*);
template void DifferenceRow(const unsigned char*, const unsigned char*, Difference, std::size_t,
                            unsigned char*);
template void DifferenceRow(const short*, const short*, Difference, std::size_t, short*);
template void DifferenceRow(const unsigned short*, const unsigned short*, Difference, std::size_t,
                            unsigned short*);
template void DifferenceRow(const int*, const int*, Difference, std::size_t, int*);
template void DifferenceRow(const unsigned int*, const unsigned int*, Difference, std::size_t, unsigned int*);
template void DifferenceRow(const float*, const float*, Difference, std::size_t, float*);
template void DifferenceRow(const double*, const double*, Difference, std::size_t, double*);
template void DifferenceRow(const std::int64_t*, const std::int64_t*, Difference, std::size_t, std::int64_t*);
template void DifferenceRow(const std::uint64_t*, const std::uint64_t*, Difference, std::size_t,
                            std::uint64_t*);

}  // namespace orvik::kernels
