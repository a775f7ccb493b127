#pragma once

#include <cstddef>
#include <cstdint>
#include <iterator>
#include <span>

#include "basic/tessel/raster.h"

namespace orvik::tests {

/// Random numbers that are the same on every platform: SplitMix64, of Steele, Lea and Flood (2014), "Fast
/// splittable pseudorandom number generators". Most of the time of a test goes into its samples.
class Random {
 public:
  explicit Random(std::uint64_t seed) : state_(seed) {}

  std::uint64_t Bits() {
    state_ += 0x9e3779b97f4a7c15;
    std::uint64_t bits = state_;
    bits = (bits ^ (bits >> 30)) * 0xbf58476d1ce4e5b9;
    bits = (bits ^ (bits >> 27)) * 0x94d049bb133111eb;
    return bits ^ (bits >> 31);
  }

  /// A number from 0 to `count` - 1.
  std::uint32_t Below(std::uint32_t count) {
    return static_cast<std::uint32_t>((Bits() >> 32) * count >> 32);
  }
  bool OneIn(std::uint32_t count) { return Below(count) == 0; }

  template <class Container>
  auto Pick(const Container& container) {
    return container[Below(static_cast<std::uint32_t>(std::size(container)))];
  }

 private:
  std::uint64_t state_;
};

/// What the samples of a random raster are like.
enum class Fill : int {
  eBITS,      ///< any bits: for floating types NaNs, infinities and all magnitudes
  eEXTREMES,  ///< type limits, ties, powers of two, NaN, infinities, denormals
  eFEW,       ///< integers from 0 to 3: many equal neighbours
  eSMOOTH,    ///< a tilted plane with some noise
  eMIXED      ///< smooth, with extremes here and there
};
inline constexpr Fill kFills[] = {Fill::eBITS, Fill::eEXTREMES, Fill::eFEW, Fill::eSMOOTH, Fill::eMIXED};

const char* NameOf(Fill fill);

/// Fills the whole buffer, margins included. Some samples become one of `extra`, cast to the pixel type.
void FillRandom(tessel::Raster& raster, Fill fill, Random& random, std::span<const double> extra = {});

}  // namespace orvik::tests
