#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "palette.h"

namespace examples {

/// How often each whole number from 0 on occurs.
struct Curve {
  std::string label;
  Colour colour;
  std::vector<std::uint64_t> counts;
};

/// A plot of counts over values.
struct Plot {
  std::string title;
  std::string caption;
  std::string valueAxis;  ///< title of the axis along the bottom
  std::string countAxis;  ///< title of the axis along the left side; the width of a column is added
  std::vector<Curve> curves;
};

/// Draws a plot as a PNG file: an area for each curve, axes with numbers and titles, and a legend.
///
/// The axis of the values spans those that occur. Where they are more than the plot has columns, a column
/// stands for a whole number of values and shows the sum of their counts.
void DrawPlot(const Plot& plot, const std::string& png);

}  // namespace examples
