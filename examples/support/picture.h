#pragma once

#include <string>

#include "gdal.h"
#include "palette.h"
#include "quantity.h"

namespace examples {

/// How a raster is shown.
struct PictureStyle {
  Ramp ramp = GreyRamp;
  bool fromZero = false;  ///< the ramp begins at 0, not at the least values of the raster
  std::string title = {};
  std::string caption = {};
};

/// Draws a one-band raster as a PNG file with a title, a legend and, where the coordinates are lengths, a
/// scale bar.
///
/// Small rasters are enlarged by a whole factor, large ones reduced. No-data is transparent. The ramp leaves
/// out the lowest and the highest half percent of the values; directions get a compass rose as their legend.
void DrawPicture(GDALDataset& dataset, const Quantity& quantity, const PictureStyle& style,
                 const std::string& png);

}  // namespace examples
