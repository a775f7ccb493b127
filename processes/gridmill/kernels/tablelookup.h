#pragma once

#include <cstddef>
#include <type_traits>

/// Narrow integers replaced by entries of tables.
namespace orvik::kernels {

/// Entries of a table: one for each value that the bits of a sample can have.
template <class Sample>
inline constexpr std::size_t kTableEntries = std::size_t{1} << (8 * sizeof(Sample));

/// Pixels of a number of channels that the compiler knows, four at a time.
template <std::size_t channels, class Index, class Out>
void LookUpPixels(const Index* samples, const Out* tables, std::size_t pixels, Out* target) {
  constexpr std::size_t group = 4 * channels;
  const std::size_t count = pixels * channels;
  std::size_t i = 0;
  for (; i + group <= count; i += group)
    for (std::size_t k = 0; k < group; ++k)
      target[i + k] = tables[k % channels * kTableEntries<Index> + samples[i + k]];
  for (; i < count; ++i) target[i] = tables[i % channels * kTableEntries<Index> + samples[i]];
}

/// Replaces `count` samples of dense pixels, the first of them of channel 0, by entries of their channel's
/// table.
template <class Sample, class Out>
void LookUpRow(const Sample* samples, const Out* tables, std::size_t channels, std::size_t count,
               Out* target) {
  using Index = std::make_unsigned_t<Sample>;
  const auto* const index = reinterpret_cast<const Index*>(samples);
  if (channels == 1) return LookUpPixels<1>(index, tables, count, target);
  if (channels == 3) return LookUpPixels<3>(index, tables, count / 3, target);
  if (channels == 4) return LookUpPixels<4>(index, tables, count / 4, target);
  for (std::size_t i = 0; i < count; i += channels)
    for (std::size_t c = 0; c < channels; ++c)
      target[i + c] = tables[c * kTableEntries<Index> + index[i + c]];
}

}  // namespace orvik::kernels
