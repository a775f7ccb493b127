#include "processes/gridmill/kernels/changenodata.h"

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

template <class Sample>
GRIDMILL_MULTIVERSION void ClearEqual(const Sample* __restrict samples, const Sample* __restrict keys,
                                      std::size_t count, unsigned char* __restrict keep) {
  for (std::size_t i = 0; i < count; ++i) keep[i] &= static_cast<unsigned char>(samples[i] != keys[i]);
}

template <class Sample>
GRIDMILL_MULTIVERSION void ClearEqual(const Sample* __restrict samples, const Sample* __restrict keys,
                                      const unsigned char* __restrict never, std::size_t count,
                                      unsigned char* __restrict keep) {
  for (std::size_t i = 0; i < count; ++i)
    keep[i] &= static_cast<unsigned char>((samples[i] != keys[i]) | never[i]);
}

GRIDMILL_MULTIVERSION void ClearEqual(const float* __restrict samples, float key, std::size_t count,
                                      unsigned char* __restrict keep) {
  for (std::size_t i = 0; i < count; ++i) keep[i] &= static_cast<unsigned char>(samples[i] != key);
}

template void ClearEqual(const char*, const char*, std::size_t, unsigned char*);
template void ClearEqual(const unsigned char*, const unsigned char*, std::size_t, unsigned char*);
template void ClearEqual(const short*, const short*, std::size_t, unsigned char*);
template void ClearEqual(const unsigned short*, const unsigned short*, std::size_t, unsigned char*);
template void ClearEqual(const float*, const float*, std::size_t, unsigned char*);
template void ClearEqual(const char*, const char*, const unsigned char*, std::size_t, unsigned char*);
template void ClearEqual(const unsigned char*, const unsigned char*, const unsigned char*, std::size_t,
                         unsigned char*);
template void ClearEqual(const short*, const short*, const unsigned char*, std::size_t, unsigned char*);
template void ClearEqual(const unsigned short*, const unsigned short*, const unsigned char*, std::size_t,
                         unsigned char*);

}  // namespace orvik::kernels
