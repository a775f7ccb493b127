#include "processes/gridmill/kernels/logarithm.h"

#include <algorithm>

namespace orvik::kernels {

// The table is read in a pass of its own, four entries at a time: scalar copies between vector arithmetic
// cost three times as much.
GRIDMILL_MULTIVERSION void Log10Row(const double* x, std::size_t count, double* log10) {
  constexpr std::size_t block = 256;
  alignas(64) double mantissa[block];
  alignas(64) double exponent[block];
  alignas(64) std::uint64_t entry[block];
  alignas(64) Log10Entry values[block];
  for (std::size_t start = 0; start < count; start += block) {
    const std::size_t size = std::min(block, count - start);
    for (std::size_t i = 0; i < size; ++i) {
      const Log10Parts parts = SplitForLog10(x[start + i]);
      mantissa[i] = parts.mantissa;
      exponent[i] = parts.exponent;
      entry[i] = parts.entry;
    }
    for (std::size_t i = size; i % 4 != 0; ++i) entry[i] = 0;
    for (std::size_t i = 0; i < size; i += 4)
      for (std::size_t j = i; j < i + 4; ++j) values[j] = kLog10Table[entry[j]];
    for (std::size_t i = 0; i < size; ++i)
      log10[start + i] = JoinForLog10(mantissa[i], exponent[i], values[i]);
  }
}

}  // namespace orvik::kernels
