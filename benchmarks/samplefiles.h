#pragma once

#include <cstdint>
#include <string>

#include "benchmarks/row.h"

namespace orvik::bench {

/// The edge of the sample, of which the peers in Python lay larger images like tiles.
inline constexpr std::uint32_t kSampleEdge = 512;

/// Writes what peers in Python work on and are checked against, as bytes in the machine's order:
/// "<row.python>.in" and ".out" hold the samples of the images, ".mask" the bits of the mask if there is one,
/// ".histogram" minima, maxima and counts if there are some.
/// @throws std::ios_base::failure
void WriteSample(const Row& row, const std::string& folder);

}  // namespace orvik::bench
