#pragma once

#include <cstdint>
#include <vector>

#include "basic/tessel/datatype.h"
#include "fuzz/support/bytes.h"

namespace orvik::fuzz {

/// A number for a parameter or a sample: a small whole one, one at which something changes (limits of types,
/// ties, powers of two, denormals, infinities, NaN), or any bits.
double Value(Bytes& bytes);
inline float FloatValue(Bytes& bytes) { return static_cast<float>(Value(bytes)); }

/// As many of them.
std::vector<float> FloatValues(Bytes& bytes, std::size_t count);

/// One of the ten pixel types.
tessel::DataType PixelTypeOf(Bytes& bytes);

/// One of the four types of the short list.
tessel::DataType ShortTypeOf(Bytes& bytes);

/// The counts of a histogram: small ones, zeros, and such that leave 32 bits when they are multiplied by 100
/// or added.
std::vector<int> Counts(Bytes& bytes, std::size_t bins);

}  // namespace orvik::fuzz
