#pragma once

#include <cstddef>

#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/thresholds.h"

/// Red, green and a synthetic blue of 8-bit pixels, by way of estimates in `float`.
namespace orvik::kernels {

/// (value - offset) factor.
struct Trim {
  float offset;
  float factor;
};

/// What makes a pixel background, and what becomes of the others.
struct ByteColours {
  int background[3];  ///< of green, red and near infrared; one that is no byte excludes none
  IntegerRange<unsigned char> range[2];  ///< valid green and red; none that wraps
  float least, greatest;                 ///< valid blue; NaN is no limit
  bool trims;                            ///< false: red and green are kept, and blue is limited to 0 to 255
  Trim trim[3];                          ///< of green, red and blue
  unsigned char written[3];              ///< to a background pixel's red, green and blue

  /// Makes red, green and blue of at most `kBlock` pixels from green, red and near infrared. Returns false,
  /// with the bands not to be used, if an estimate is so near to a limit that the exact blue may lie on its
  /// other side, if the trim makes all estimates too coarse, or if no green or red is valid.
  ///
  /// @param valid  0: background, 1: to be judged; changed
  bool Make(const unsigned char (*planes)[kBlock], unsigned char* valid, std::size_t count,
            unsigned char (*bands)[kBlock]) const;
};

}  // namespace orvik::kernels
