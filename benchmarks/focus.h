#pragma once

namespace orvik::bench {

/// The samples that a focus measure accepts.
struct Accepted {
  double low;
  double high;
  double failure;

  bool Holds(double sample) const {
    const double delta = sample - failure;
    if (delta > -1e-9 && delta < 1e-9) return false;
    return sample > low && sample < high;
  }
};

/// All samples of the scenes.
inline constexpr Accepted kByDefault{-10000000.0, 10000000.0, -32767.0};
/// All but no-data and the brightest.
inline constexpr Accepted kBytesButNoData{-1.0, 220.0, 0.0};
inline constexpr Accepted kButNoData{-1.0, 28000.0, 0.0};

}  // namespace orvik::bench
