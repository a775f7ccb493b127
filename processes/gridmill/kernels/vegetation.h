#pragma once

#include <cstddef>

#include "processes/gridmill/kernels/rowconversions.h"

/// Vegetation indices of a block of pixels. Each is computed in `double` from band values widened to it, and
/// stored as a `Value`, `float` or `double`.
///
/// Narrow are bands that are integers of at most 16 bits, signed or not. Their functions give the same bits
/// faster.
namespace orvik::kernels {

inline constexpr std::size_t kBandRoles = 7;
inline constexpr std::size_t kVegetationIndices = 12;

/// The bands of a block in the order of their roles: blue, green, red, red edge, near infrared, first and
/// second shortwave infrared.
using BandPlanes = float[kBandRoles][kBlock];

/// True if the index with this code reads the band with this role.
bool IndexReads(std::size_t code, std::size_t role);

/// The index with this code.
template <class Value>
void VegetationRow(std::size_t code, const BandPlanes& bands, std::size_t count, Value* index);
void NarrowVegetationRow(std::size_t code, const BandPlanes& bands, std::size_t count, float* index);

/// All indices as pixels of twelve samples. Bands are read up to a multiple of 16 pixels, at most `kBlock`.
void VegetationPixels(const BandPlanes& bands, std::size_t count, float* target);
void NarrowVegetationPixels(const BandPlanes& bands, std::size_t count, float* target);

/// Where a pixel of four samples has its bands; what an index does not read may be anything below 4.
struct NarrowPixelBands {
  std::size_t green;
  std::size_t red;
  std::size_t nir;
};

/// True if `NarrowPixelRow` computes the index with this code.
bool HasPixelRow(std::size_t code);

/// The index straight from any number of dense pixels of four 16-bit samples.
template <class In>
void NarrowPixelRow(std::size_t code, const In* pixels, const NarrowPixelBands& bands, std::size_t count,
                    float* index);

}  // namespace orvik::kernels
