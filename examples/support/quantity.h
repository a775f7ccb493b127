#pragma once

#include <optional>
#include <string>
#include <vector>

namespace examples {

/// What the values of a raster mean, for its metadata, its figures and its picture.
struct Quantity {
  std::string name;       ///< "slope"
  std::string unit = {};  ///< "degrees"
  bool compass = false;   ///< directions from 0 to 360, which have neither a least nor a greatest one
  bool bitmap = false;    ///< 1 inside a range and 0 outside
  double scale = 1.0;     ///< the unit's worth of a stored 1
  std::optional<double> flat = {};  ///< the stored value of a cell that has no direction
  std::optional<double> noData =
      {};  ///< the stored value of a pixel without data; none: every pixel has data
  std::vector<std::string> classes = {};  ///< what 1, 2, ... stand for; there are no other values
};

}  // namespace examples
