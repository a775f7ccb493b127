#include "processes/gridmill/kernels/rowconversions.h"

#include <bit>
#include <cstdint>
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

template <std::size_t bytes>
using UnsignedOf =
    std::conditional_t<bytes == 1, std::uint8_t,
                       std::conditional_t<bytes == 2, std::uint16_t,
                                          std::conditional_t<bytes == 4, std::uint32_t, std::uint64_t>>>;

/// True if two samples can be taken out of one word, the first out of its lower half.
template <class In>
inline constexpr bool kPairs = sizeof(In) <= 4 && std::endian::native == std::endian::little;

/// Dense pixels of six samples, loaded as three pairs: compilers take groups of three apart in registers, but
/// not groups of six.
template <class In>
GRIDMILL_MULTIVERSION void LoadSixPlanes(const In* first, std::size_t count,
                                         double (*__restrict planes)[kBlock]) {
  using Bits = UnsignedOf<sizeof(In)>;
  using Pair = UnsignedOf<2 * sizeof(In)>;
  struct __attribute__((packed, may_alias)) Pixel {
    Pair pairs[3];
  };
  const Pixel* const __restrict pixels = reinterpret_cast<const Pixel*>(first);
  for (std::size_t i = 0; i < count; ++i) {
    for (std::size_t k = 0; k < 3; ++k) {
      const Pair pair = pixels[i].pairs[k];
      const auto low = static_cast<Bits>(pair);
      const auto high = static_cast<Bits>(pair >> (8 * sizeof(In)));
      planes[2 * k][i] = tessel::PlainCast<double>(std::bit_cast<In>(low));
      planes[2 * k + 1][i] = tessel::PlainCast<double>(std::bit_cast<In>(high));
    }
  }
}

}  // namespace

template <class In, class Value>
GRIDMILL_MULTIVERSION void LoadRow(const In* __restrict source, std::size_t stride, std::size_t count,
                                   Value* __restrict target) {
  if (stride == 1) return LoadStrided<1>(source, count, target);
  if (stride == 2) return LoadStrided<2>(source, count, target);
  if (stride == 3) return LoadStrided<3>(source, count, target);
  if (stride == 4) return LoadStrided<4>(source, count, target);
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::PlainCast<Value>(source[i * stride]);
}

template <class In>
void LoadPlanes(const In* first, std::size_t stride, std::size_t channels, std::size_t count,
                double (*planes)[kBlock]) {
  if constexpr (kPairs<In>) {
    if (stride == 6 && channels == 6) return LoadSixPlanes(first, count, planes);
  }
  for (std::size_t c = 0; c < channels; ++c) LoadRow(first + c, stride, count, planes[c]);
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

template <std::size_t samples, class Sample>
GRIDMILL_MULTIVERSION void StorePixels(const Sample (&planes)[samples][kBlock], std::size_t count,
                                       Sample* __restrict target) {
  for (std::size_t i = 0; i < count; ++i)
    for (std::size_t c = 0; c < samples; ++c) target[i * samples + c] = planes[c][i];
}

#define GRIDMILL_STORES(Value, Out)                                     \
  template void StoreCast<Value, Out>(const Value*, std::size_t, Out*); \
  template void StoreClipped<Value, Out>(const Value*, std::size_t, Out*)

#define GRIDMILL_STORES_WHERE(Value, Out) \
  template void StoreClippedWhere<Value, Out>(const Value*, const unsigned char*, Out, std::size_t, Out*)

#define GRIDMILL_ROW_CONVERSIONS(Type)                                                                   \
  template void LoadRow<Type, float>(const Type*, std::size_t, std::size_t, float*);                     \
  template void LoadRow<Type, double>(const Type*, std::size_t, std::size_t, double*);                   \
  template void LoadPlanes<Type>(const Type*, std::size_t, std::size_t, std::size_t, double(*)[kBlock]); \
  template const float* FloatRow<Type>(const Type*, std::size_t, std::size_t, float*);                   \
  template void StorePixels(const Type(&)[3][kBlock], std::size_t, Type*);                               \
  template void StorePixels(const Type(&)[4][kBlock], std::size_t, Type*);                               \
  template void ReplaceMasked<Type>(const unsigned char*, Type, std::size_t, Type*);                     \
  GRIDMILL_STORES(char, Type);                                                                           \
  GRIDMILL_STORES(unsigned char, Type);                                                                  \
  GRIDMILL_STORES(short, Type);                                                                          \
  GRIDMILL_STORES(unsigned short, Type);                                                                 \
  GRIDMILL_STORES(int, Type);                                                                            \
  GRIDMILL_STORES(unsigned int, Type);                                                                   \
  GRIDMILL_STORES(float, Type);                                                                          \
  GRIDMILL_STORES(double, Type);                                                                         \
  GRIDMILL_STORES(std::int64_t, Type);                                                                   \
  GRIDMILL_STORES(std::uint64_t, Type);                                                                  \
  GRIDMILL_STORES_WHERE(float, Type);                                                                    \
  GRIDMILL_STORES_WHERE(double, Type);                                                                   \
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
