#pragma once

#include <cstddef>
#include <cstdint>
#include <random>
#include <span>

#include "basic/tessel/raster.h"

namespace orvik::tests {

/// Random numbers that are the same on every platform.
class Random {
 public:
  explicit Random(std::uint64_t seed) : engine_(seed) {}

  std::uint64_t Bits() { return engine_(); }
  /// A number from 0 to `count` - 1.
  std::uint32_t Below(std::uint32_t count) { return static_cast<std::uint32_t>(engine_() % count); }
  bool OneIn(std::uint32_t count) { return Below(count) == 0; }

  template <class Container>
  auto Pick(const Container& container) {
    return container[Below(static_cast<std::uint32_t>(std::size(container)))];
  }

 private:
  std::mt19937_64 engine_;
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
