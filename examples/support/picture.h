#pragma once

#include <string>

#include "gdal.h"
#include "palette.h"
#include "quantity.h"
#include "scale.h"

namespace examples {

/// How a raster is shown.
struct PictureStyle {
  Ramp ramp = GreyRamp;
  Span span = Span::values;
  std::string title = {};
  std::string caption = {};
  std::string legend = {};  ///< heads the legend; empty: the name of the quantity
  std::string note = {};    ///< stands below it
  std::string unit = {};    ///< stands below that; empty: the unit of the quantity
  std::string top = {};     ///< what the upper end of the ramp means
  std::string bottom = {};  ///< what the lower end means
};

/// Draws a band as a PNG file with a title, a legend and, where the coordinates are lengths, a scale bar.
///
/// Small rasters are enlarged by a whole factor, large ones reduced. No-data is transparent. Directions get a
/// compass rose as their legend.
void DrawPicture(GDALDataset& dataset, int band, const Quantity& quantity, const PictureStyle& style,
                 const std::string& png);

}  // namespace examples
