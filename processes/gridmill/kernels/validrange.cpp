#include "processes/gridmill/kernels/validrange.h"

#include <cstdint>
#include <limits>
#include <type_traits>

#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::kernels {

namespace {

GRIDMILL_MULTIVERSION void KeepOthers(const int* __restrict samples, int background, std::size_t count,
                                      unsigned char* __restrict valid) {
  for (std::size_t i = 0; i < count; ++i) valid[i] &= static_cast<unsigned char>(samples[i] != background);
}

GRIDMILL_MULTIVERSION void KeepBetween(const int* __restrict samples, float lower, float upper,
                                       std::size_t count, unsigned char* __restrict valid) {
  for (std::size_t i = 0; i < count; ++i) {
    const auto value = static_cast<float>(samples[i]);
    valid[i] &= static_cast<unsigned char>((value >= lower) & (value <= upper));
  }
}

}  // namespace

GRIDMILL_MULTIVERSION void KeepWithin(const double* __restrict values, double lower, double upper,
                                      std::size_t count, unsigned char* __restrict valid) {
  for (std::size_t i = 0; i < count; ++i)
    valid[i] &= static_cast<unsigned char>(!(lower > values[i]) & !(values[i] > upper));
}

template <class In>
void KeepValidSamples(const In* samples, int background, const ValidRange* range, std::size_t count,
                      unsigned char* valid) {
  if constexpr (std::is_integral_v<In> && sizeof(In) <= 2) {
    unsigned char kept[kBlock];
    if (background >= std::numeric_limits<In>::min() && background <= std::numeric_limits<In>::max()) {
      IntegerRange<In> others(static_cast<float>(background), static_cast<float>(background), false);
      others.inside = false;
      SelectRow(samples, others, count, kept);
      KeepValid(kept, count, valid);
    }
    if (range == nullptr) return;
    SelectRow(samples, range->Of<In>(), count, kept);
    KeepValid(kept, count, valid);
  } else {
    int whole[kBlock];
    StoreCast(samples, count, whole);
    KeepOthers(whole, background, count, valid);
    if (range != nullptr) KeepBetween(whole, range->lower, range->upper, count, valid);
  }
}

template void KeepValidSamples(const char*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const unsigned char*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const short*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const unsigned short*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const int*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const unsigned int*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const float*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const double*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const std::int64_t*, int, const ValidRange*, std::size_t, unsigned char*);
template void KeepValidSamples(const std::uint64_t*, int, const ValidRange*, std::size_t, unsigned char*);

}  // namespace orvik::kernels
