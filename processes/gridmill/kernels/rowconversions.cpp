#include "processes/gridmill/kernels/rowconversions.h"

#include <cstdint>
#include <type_traits>

#include "basic/tessel/clipto.h"
#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

template <std::size_t stride, class In>
GRIDMILL_INLINE void LoadStrided(const In* __restrict source, std::size_t count, float* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::PlainCast<float>(source[i * stride]);
}

}  // namespace

template <class In>
GRIDMILL_MULTIVERSION void LoadRow(const In* __restrict source, std::size_t stride, std::size_t count,
                                   float* __restrict target) {
  if (stride == 1) return LoadStrided<1>(source, count, target);
  if (stride == 2) return LoadStrided<2>(source, count, target);
  if (stride == 3) return LoadStrided<3>(source, count, target);
  if (stride == 4) return LoadStrided<4>(source, count, target);
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::PlainCast<float>(source[i * stride]);
}

template <class In>
const float* FloatRow(const In* source, std::size_t stride, std::size_t count, float* scratch) {
  if constexpr (std::is_same_v<In, float>) {
    if (stride == 1) return source;
  }
  LoadRow(source, stride, count, scratch);
  return scratch;
}

template <class Value, class Out>
GRIDMILL_MULTIVERSION void StoreClipped(const Value* __restrict values, std::size_t count,
                                        Out* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::ClipTo<Out>(values[i]);
}

template <class Value, class Out>
GRIDMILL_MULTIVERSION void StoreClippedWhere(const Value* __restrict values,
                                             const unsigned char* __restrict valid, Out other,
                                             std::size_t count, Out* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) {
    const Out clipped = tessel::ClipTo<Out>(values[i]);
    target[i] = valid[i] != 0 ? clipped : other;
  }
}

#define GRIDMILL_ROW_CONVERSIONS(Type)                                                                \
  template void LoadRow<Type>(const Type*, std::size_t, std::size_t, float*);                         \
  template const float* FloatRow<Type>(const Type*, std::size_t, std::size_t, float*);                \
  template void StoreClipped<float, Type>(const float*, std::size_t, Type*);                          \
  template void StoreClipped<int, Type>(const int*, std::size_t, Type*);                              \
  template void StoreClippedWhere<float, Type>(const float*, const unsigned char*, Type, std::size_t, \
                                               Type*);                                                \
  template void StoreClippedWhere<int, Type>(const int*, const unsigned char*, Type, std::size_t, Type*)

GRIDMILL_ROW_CONVERSIONS(char);
GRIDMILL_ROW_CONVERSIONS(unsigned char);
GRIDMILL_ROW_CONVERSIONS(short);
GRIDMILL_ROW_CONVERSIONS(unsigned short);
GRIDMILL_ROW_CONVERSIONS(int);
GRIDMILL_ROW_CONVERSIONS(unsigned int);
GRIDMILL_ROW_CONVERSIONS(float);
GRIDMILL_ROW_CONVERSIONS(double);
GRIDMILL_ROW_CONVERSIONS(std::int64_t);
GRIDMILL_ROW_CONVERSIONS(std::uint64_t);

#undef GRIDMILL_ROW_CONVERSIONS

}  // namespace orvik::kernels
