#pragma once

#include <string>
#include <vector>

#include "gdal.h"
#include "palette.h"
#include "quantity.h"
#include "scale.h"

namespace examples {

/// A stored value that stands for a class.
struct PictureClass {
  double value;
  Colour colour;
  std::string label;
};

/// A band of a composite.
struct CompositeBand {
  int band;  ///< counts from 1
  std::string label;
};

/// How a raster is shown.
struct PictureStyle {
  Ramp ramp = GreyRamp;
  Span span = Span::values;
  std::string title = {};
  std::string caption = {};
  std::string legend = {};                    ///< heads the legend; empty: the name of the quantity
  std::string note = {};                      ///< stands below it
  std::string unit = {};                      ///< stands below that; empty: the unit of the quantity
  std::string top = {};                       ///< what the upper end of the ramp means
  std::string bottom = {};                    ///< what the lower end means
  std::vector<PictureClass> classes = {};     ///< in place of the ramp
  std::string noData = "no data";             ///< what the legend calls pixels without data
  std::vector<CompositeBand> composite = {};  ///< three bands as red, green and blue in place of the ramp
};

/// A map of a picture: a band, or the composite that its style states, and how it is shown.
struct Panel {
  int band;  ///< counts from 1
  Quantity quantity;
  PictureStyle style = {};
};

/// Draws bands as a PNG file with a title, for each a map with its legend and, where the coordinates are
/// lengths, a scale bar. Title and caption are those of the first panel.
///
/// Small rasters are enlarged by a whole factor, large ones reduced. No-data is transparent. Directions get a
/// compass rose as their legend.
void DrawPicture(GDALDataset& dataset, const std::vector<Panel>& panels, const std::string& png);

}  // namespace examples
