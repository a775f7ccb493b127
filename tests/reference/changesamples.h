#pragma once

#include <cstdint>
#include <type_traits>
#include <vector>

#include "basic/tessel/raster.h"
#include "tests/support/changecases.h"

namespace orvik::reference {

/// The no-data test of the change operators: for both rasters on or off.
class NoDataTest {
 public:
  NoDataTest(const tests::ChangeParameters& parameters, const tessel::Raster& image)
      : parameters_(parameters), isActive_(image.channels == parameters.imgNoData.size()) {}

  template <class T>
  bool HitsImage(T sample, std::uint32_t c) const {
    return isActive_ && static_cast<float>(sample) == parameters_.imgNoData.at(c);
  }
  template <class T>
  bool HitsReference(T sample, std::uint32_t c) const {
    return isActive_ && static_cast<float>(sample) == parameters_.refNoData.at(c);
  }

 private:
  const tests::ChangeParameters& parameters_;
  bool isActive_;
};

/// a - b, which wraps in an integer.
template <class T>
T Difference(T a, T b) {
  if constexpr (std::is_floating_point_v<T>) return a - b;
  return static_cast<T>(static_cast<std::uint64_t>(a) - static_cast<std::uint64_t>(b));
}

/// Calls `pixel(x, y)` for all pixels of the image area, row after row.
template <class Pixel>
void ForEachPixel(const tessel::Raster& image, Pixel pixel) {
  for (std::uint32_t y = 0; y < image.height; ++y) {
    for (std::uint32_t x = 0; x < image.width; ++x) pixel(x, y);
  }
}

}  // namespace orvik::reference
