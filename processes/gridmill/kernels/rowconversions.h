#pragma once

#include <cstddef>
#include <cstdint>
#include <type_traits>

/// The staged row: samples are loaded as `float` or `double` into scratch that stays in the first-level
/// cache, computed on, and stored as the output's type. One copy for all operators, built for several
/// instruction sets.
namespace orvik::kernels {

/// Pixels or samples that go through the stages together.
inline constexpr std::size_t kBlock = 256;

/// Asks for the samples three blocks of `count` ahead, which may lie beyond the buffer. Images in main memory
/// gain.
template <class Sample>
inline void PrefetchAhead(const Sample* block, std::size_t count) {
  const auto ahead = reinterpret_cast<std::uintptr_t>(block) + 3 * count * sizeof(Sample);
  for (std::size_t byte = 0; byte < count * sizeof(Sample); byte += 64)
    __builtin_prefetch(reinterpret_cast<const void*>(ahead + byte));
}

/// Converts `count` samples, `stride` elements apart, to `float` or `double`.
template <class In, class Value>
void LoadRow(const In* source, std::size_t stride, std::size_t count, Value* target);

/// The samples as `float`: those of a dense `float` row where they stand, others converted into `scratch`.
template <class In>
const float* FloatRow(const In* source, std::size_t stride, std::size_t count, float* scratch);

/// Copies `count` samples, `stride` elements apart.
template <class Sample>
void CopyRow(const Sample* source, std::size_t stride, std::size_t count, Sample* target);

/// Stores `PlainCast<Out>` of `count` samples of any type.
template <class Value, class Out>
void StoreCast(const Value* values, std::size_t count, Out* target);

/// Stores `ClipTo<Out>` of `count` values of any type.
template <class Value, class Out>
void StoreClipped(const Value* values, std::size_t count, Out* target);

/// Stores `ClipTo<Out>` of a value where `valid` is not 0, and `other` elsewhere. `Value` is `float`,
/// `double` or `int`.
template <class Value, class Out>
void StoreClippedWhere(const Value* values, const unsigned char* valid, Out other, std::size_t count,
                       Out* target);

/// Replaces the samples where `valid` is 0 by `other`.
template <class Out>
void ReplaceMasked(const unsigned char* valid, Out other, std::size_t count, Out* target);

/// Stores `count` pixels of three or four samples, each from a plane of its own.
template <std::size_t samples, class Sample>
void StorePixels(const Sample (&planes)[samples][kBlock], std::size_t count, Sample* target);

/// Stores `ClipTo<Out>` of planes of values as pixels, and `excluded` in all samples of those where `valid`
/// is 0. A null `valid` excludes none.
template <std::size_t samples, class Out>
void StorePixelsWhere(const double (&planes)[samples][kBlock], const unsigned char* valid, Out excluded,
                      std::size_t count, Out* target) {
  Out clipped[samples][kBlock];
  for (std::size_t c = 0; c < samples; ++c) {
    if (valid != nullptr) {
      StoreClippedWhere(planes[c], valid, excluded, count, clipped[c]);
    } else {
      StoreClipped(planes[c], count, clipped[c]);
    }
  }
  StorePixels(clipped, count, target);
}

/// The samples as plain casts to `Out`: where they stand if that keeps their bits, else in `scratch`.
template <class Out, class In>
const Out* CastedRow(const In* source, std::size_t count, Out* scratch) {
  constexpr bool integers = std::is_integral_v<In> && std::is_integral_v<Out>;
  if constexpr (std::is_same_v<In, Out> || (integers && sizeof(In) == sizeof(Out))) {
    return reinterpret_cast<const Out*>(source);
  } else {
    StoreCast(source, count, scratch);
    return scratch;
  }
}

/// The samples as `ClipTo<Out>`: where they stand if the types are the same, else in `scratch`.
template <class Out, class In>
const Out* ClippedRow(const In* source, std::size_t count, Out* scratch) {
  if constexpr (std::is_same_v<In, Out>) {
    return source;
  } else {
    StoreClipped(source, count, scratch);
    return scratch;
  }
}

}  // namespace orvik::kernels
