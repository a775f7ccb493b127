#pragma once

#include "canvas.h"
#include "picture.h"
#include "scale.h"

namespace examples {

/// What a legend explains.
struct Legend {
  const Panel& panel;
  const Scale& scale;  ///< of the ramp
  bool noData;         ///< the map has pixels without data
};

/// Draws a legend with its upper left corner at (x, y).
///
/// Below the name and its notes stand the ramp between the words for its ends, or a compass rose, or a square
/// for each class or for each band of a composite; then one for pixels without data if there are some.
///
/// The paper has to be `LegendHeight` high.
void DrawLegend(cairo_t* canvas, double x, double y, const Legend& legend);

/// The room that the keys of a legend take, which is more than that of a map where there are many classes.
int LegendHeight(const PictureStyle& style);

}  // namespace examples
