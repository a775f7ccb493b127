#pragma once

#include <cstddef>

namespace orvik::kernels {

/// Copies `pixels` pixels of `pixelBytes` bytes, each from before the one copied last. Source and target do
/// not overlap.
///
/// @param last  the pixel that comes first
void ReversePixels(const unsigned char* last, std::size_t pixelBytes, std::size_t pixels,
                   unsigned char* target);

}  // namespace orvik::kernels
