#pragma once

#include <cstddef>

/// Differences in the samples' own arithmetic: integers wrap modulo their range and never saturate.
namespace orvik::kernels {

enum class Difference { kAbsolute, kForward, kBackward };

/// Differences of `count` samples, of which a target may be one of the sources. Forward is a - b; absolute is
/// a - b where a >= b, else b - a; backward is b - a, of floating samples 0 - (a - b).
template <class Sample>
void DifferenceRow(const Sample* a, const Sample* b, Difference form, std::size_t count, Sample* target);

/// The same where `keep` is not 0 and neither sample is equal to its key; `excluded` elsewhere. For 8-bit,
/// 16-bit and `float` samples.
template <class Sample>
void TestedDifferenceRow(const Sample* a, const Sample* aKeys, const Sample* b, const Sample* bKeys,
                         const unsigned char* keep, Difference form, Sample excluded, std::size_t count,
                         Sample* target);

}  // namespace orvik::kernels
