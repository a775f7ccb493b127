#pragma once

#include <array>
#include <cstddef>

#include "basic/exceptions/throw.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/policy.h"

namespace orvik::frame {

/// The rasters of a call in their order: input, (reference,) output.
template <std::size_t N>
using Rasters = std::array<tessel::Raster*, N>;

/// The messages of the null tests, in the order of `Rasters`.
template <std::size_t N>
inline constexpr std::array<const char*, N> kNullMessages{};
template <>
inline constexpr std::array<const char*, 2> kNullMessages<2>{"poRasterIn is invalid pointer",
                                                             "poRasterOut is invalid pointer"};
template <>
inline constexpr std::array<const char*, 3> kNullMessages<3>{
    "poRasterIn is invalid pointer", "poRasterRef is invalid pointer", "poRasterOut is invalid pointer"};

/// @throws Exception with the message of the first test that fails
template <Guards guards, std::size_t N>
void Guard(const Rasters<N>& rasters) {
  if constexpr (guards == Guards::kRasters) {
    for (std::size_t i = 0; i < N; ++i)
      if (rasters[i] == nullptr) Throw<Exception>(kNullMessages<N>[i], ORVIK_HERE);
    if (rasters.back()->dataType.isComplex) Throw<Exception>("Output cannot be complex", ORVIK_HERE);
  }
  if constexpr (guards == Guards::kInputChannels) {
    if (rasters.front() == nullptr) Throw<Exception>(kNullMessages<N>.front(), ORVIK_HERE);
    if (rasters.front()->channels < 1)
      Throw<Exception>("poRasterIn must have minimum 1 channels.", ORVIK_HERE);
  }
}

}  // namespace orvik::frame
