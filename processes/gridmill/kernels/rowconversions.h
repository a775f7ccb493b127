#pragma once

#include <cstddef>
#include <cstdint>

/// The staged row: samples are loaded as `float` into scratch that stays in the first-level cache, computed
/// on, and stored as the output's type. One copy for all operators, built for several instruction sets.
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

/// Converts `count` samples, `stride` elements apart, to `float`.
template <class In>
void LoadRow(const In* source, std::size_t stride, std::size_t count, float* target);

/// The samples as `float`: those of a dense `float` row where they stand, others converted into `scratch`.
template <class In>
const float* FloatRow(const In* source, std::size_t stride, std::size_t count, float* scratch);

/// Stores `ClipTo<Out>` of `count` values. `Value` is `float` or `int`.
template <class Value, class Out>
void StoreClipped(const Value* values, std::size_t count, Out* target);

/// Stores `ClipTo<Out>` of a value where `valid` is not 0, and `other` elsewhere.
template <class Value, class Out>
void StoreClippedWhere(const Value* values, const unsigned char* valid, Out other, std::size_t count,
                       Out* target);

}  // namespace orvik::kernels
