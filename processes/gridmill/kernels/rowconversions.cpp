#include "processes/gridmill/kernels/rowconversions.h"

#include <cstdint>
#include <cstring>
#include <type_traits>

#include "basic/tessel/clipto.h"
#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

template <std::size_t stride, class In, class Value>
GRIDMILL_INLINE void LoadStrided(const In* __restrict source, std::size_t count, Value* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::PlainCast<Value>(source[i * stride]);
}

template <class In, class Value>
GRIDMILL_INLINE void LoadAny(const In* __restrict source, std::size_t stride, std::size_t count,
                             Value* __restrict target) {
  if (stride == 1) return LoadStrided<1>(source, count, target);
  if (stride == 2) return LoadStrided<2>(source, count, target);
  if (stride == 3) return LoadStrided<3>(source, count, target);
  if (stride == 4) return LoadStrided<4>(source, count, target);
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::PlainCast<Value>(source[i * stride]);
}

}  // namespace

template <class In, class Value>
GRIDMILL_MULTIVERSION void LoadRow(const In* __restrict source, std::size_t stride, std::size_t count,
                                   Value* __restrict target) {
  LoadAny(source, stride, count, target);
}

template <class Sample>
GRIDMILL_MULTIVERSION void CopyRow(const Sample* __restrict source, std::size_t stride, std::size_t count,
                                   Sample* __restrict target) {
  LoadAny(source, stride, count, target);
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
GRIDMILL_MULTIVERSION void StoreCast(const Value* __restrict values, std::size_t count,
                                     Out* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::PlainCast<Out>(values[i]);
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

template <class Out>
GRIDMILL_MULTIVERSION void ReplaceMasked(const unsigned char* __restrict valid, Out other, std::size_t count,
                                         Out* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) target[i] = valid[i] != 0 ? target[i] : other;
}

namespace {

/// Four pixels of four samples of 32 bits: rows of a matrix that is transposed.
template <class Sample>
GRIDMILL_INLINE void StoreFourPixels(const Sample (&planes)[4][kBlock], std::size_t i,
                                     Sample* __restrict target) {
  using Words = std::uint32_t __attribute__((vector_size(16)));
  Words a, b, c, d;
  std::memcpy(&a, planes[0] + i, sizeof(a));
  std::memcpy(&b, planes[1] + i, sizeof(b));
  std::memcpy(&c, planes[2] + i, sizeof(c));
  std::memcpy(&d, planes[3] + i, sizeof(d));
  const Words ab01 = __builtin_shufflevector(a, b, 0, 4, 1, 5);
  const Words ab23 = __builtin_shufflevector(a, b, 2, 6, 3, 7);
  const Words cd01 = __builtin_shufflevector(c, d, 0, 4, 1, 5);
  const Words cd23 = __builtin_shufflevector(c, d, 2, 6, 3, 7);
  const Words first = __builtin_shufflevector(ab01, cd01, 0, 1, 4, 5);
  const Words second = __builtin_shufflevector(ab01, cd01, 2, 3, 6, 7);
  const Words third = __builtin_shufflevector(ab23, cd23, 0, 1, 4, 5);
  const Words fourth = __builtin_shufflevector(ab23, cd23, 2, 3, 6, 7);
  std::memcpy(target + 4 * i, &first, sizeof(first));
  std::memcpy(target + 4 * i + 4, &second, sizeof(second));
  std::memcpy(target + 4 * i + 8, &third, sizeof(third));
  std::memcpy(target + 4 * i + 12, &fourth, sizeof(fourth));
}

}  // namespace

template <std::size_t samples, class Sample>
GRIDMILL_MULTIVERSION void StorePixels(const Sample (&planes)[samples][kBlock], std::size_t count,
                                       Sample* __restrict target) {
  std::size_t i = 0;
  if constexpr (samples == 4 && sizeof(Sample) == 4)
    for (; i + 4 <= count; i += 4) StoreFourPixels(planes, i, target);
  for (; i < count; ++i)
    for (std::size_t c = 0; c < samples; ++c) target[i * samples + c] = planes[c][i];
}

#define GRIDMILL_STORES(Value, Out)                                     \
  template void StoreCast<Value, Out>(const Value*, std::size_t, Out*); \
  template void StoreClipped<Value, Out>(const Value*, std::size_t, Out*)

#define GRIDMILL_STORES_WHERE(Value, Out) \
  template void StoreClippedWhere<Value, Out>(const Value*, const unsigned char*, Out, std::size_t, Out*)

#define GRIDMILL_ROW_CONVERSIONS(Type)                                                 \
  template void LoadRow<Type, float>(const Type*, std::size_t, std::size_t, float*);   \
  template void LoadRow<Type, double>(const Type*, std::size_t, std::size_t, double*); \
  template const float* FloatRow<Type>(const Type*, std::size_t, std::size_t, float*); \
  template void CopyRow<Type>(const Type*, std::size_t, std::size_t, Type*);           \
  template void StorePixels(const Type(&)[3][kBlock], std::size_t, Type*);             \
  template void StorePixels(const Type(&)[4][kBlock], std::size_t, Type*);             \
  template void ReplaceMasked<Type>(const unsigned char*, Type, std::size_t, Type*);   \
  GRIDMILL_STORES(char, Type);                                                         \
  GRIDMILL_STORES(unsigned char, Type);                                                \
  GRIDMILL_STORES(short, Type);                                                        \
  GRIDMILL_STORES(unsigned short, Type);                                               \
  GRIDMILL_STORES(int, Type);                                                          \
  GRIDMILL_STORES(unsigned int, Type);                                                 \
  GRIDMILL_STORES(float, Type);                                                        \
  GRIDMILL_STORES(double, Type);                                                       \
  GRIDMILL_STORES(std::int64_t, Type);                                                 \
  GRIDMILL_STORES(std::uint64_t, Type);                                                \
  GRIDMILL_STORES_WHERE(float, Type);                                                  \
  GRIDMILL_STORES_WHERE(double, Type);                                                 \
  GRIDMILL_STORES_WHERE(int, Type)

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
#undef GRIDMILL_STORES_WHERE
#undef GRIDMILL_STORES

}  // namespace orvik::kernels
