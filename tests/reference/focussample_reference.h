#pragma once

namespace orvik::reference {

/// True if a focus measure leaves the sample out.
inline bool IsRejected(double value, double low, double high, double failure) {
  const double d = value - failure;
  if (d > -1e-9 && d < 1e-9) return true;
  if (!(value > low)) return true;
  return !(value < high);
}

}  // namespace orvik::reference
