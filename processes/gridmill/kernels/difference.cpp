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

template <Difference form, class Sample>
GRIDMILL_INLINE Sample DifferenceOf(Sample a, Sample b) {
  if constexpr (form == Difference::kAbsolute) return AbsoluteDifference(a, b);
  if constexpr (form == Difference::kForward) return Subtract(a, b);
  return BackwardDifference(a, b);
}

template <Difference form, class Sample>
GRIDMILL_MULTIVERSION void FormRow(const Sample* a, const Sample* b, std::size_t count, Sample* target) {
  GRIDMILL_INDEPENDENT
  for (std::size_t i = 0; i < count; ++i) target[i] = DifferenceOf<form>(a[i], b[i]);
}

template <Difference form, class Sample>
GRIDMILL_MULTIVERSION void TestedFormRow(const Sample* a, const Sample* aKeys, const Sample* b,
                                         const Sample* bKeys, const unsigned char* keep, Sample excluded,
                                         std::size_t count, Sample* target) {
  GRIDMILL_INDEPENDENT
  for (std::size_t i = 0; i < count; ++i) {
    const Sample difference = DifferenceOf<form>(a[i], b[i]);
    const bool kept = (keep[i] != 0) & (a[i] != aKeys[i]) & (b[i] != bKeys[i]);
    target[i] = kept ? difference : excluded;
  }
}

}  // namespace

template <class Sample>
void DifferenceRow(const Sample* a, const Sample* b, Difference form, std::size_t count, Sample* target) {
  if (form == Difference::kAbsolute) return FormRow<Difference::kAbsolute>(a, b, count, target);
  if (form == Difference::kForward) return FormRow<Difference::kForward>(a, b, count, target);
  FormRow<Difference::kBackward>(a, b, count, target);
}

template <class Sample>
void TestedDifferenceRow(const Sample* a, const Sample* aKeys, const Sample* b, const Sample* bKeys,
                         const unsigned char* keep, Difference form, Sample excluded, std::size_t count,
                         Sample* target) {
  using Row = void (*)(const Sample*, const Sample*, const Sample*, const Sample*, const unsigned char*,
                       Sample, std::size_t, Sample*);
  const Row row = form == Difference::kAbsolute  ? TestedFormRow<Difference::kAbsolute, Sample>
                  : form == Difference::kForward ? TestedFormRow<Difference::kForward, Sample>
                                                 : TestedFormRow<Difference::kBackward, Sample>;
  row(a, aKeys, b, bKeys, keep, excluded, count, target);
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

template void TestedDifferenceRow(const char*, const char*, const char*, const char*, const unsigned char*,
                                  Difference, char, std::size_t, char*);
template void TestedDifferenceRow(const unsigned char*, const unsigned char*, const unsigned char*,
                                  const unsigned char*, const unsigned char*, Difference, unsigned char,
                                  std::size_t, unsigned char*);
template void TestedDifferenceRow(const short*, const short*, const short*, const short*,
                                  const unsigned char*, Difference, short, std::size_t, short*);
template void TestedDifferenceRow(const unsigned short*, const unsigned short*, const unsigned short*,
                                  const unsigned short*, const unsigned char*, Difference, unsigned short,
                                  std::size_t, unsigned short*);
template void TestedDifferenceRow(const float*, const float*, const float*, const float*,
                                  const unsigned char*, Difference, float, std::size_t, float*);

}  // namespace orvik::kernels
