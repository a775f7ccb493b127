#pragma once

#include <memory>
#include <string>

#include <cairo.h>

#include "palette.h"

namespace examples {

struct CairoDeleter {
  void operator()(cairo_surface_t* surface) const { cairo_surface_destroy(surface); }
  void operator()(cairo_t* context) const { cairo_destroy(context); }
};
using Surface = std::unique_ptr<cairo_surface_t, CairoDeleter>;
using Canvas = std::unique_ptr<cairo_t, CairoDeleter>;

constexpr Colour ink = {0.13, 0.14, 0.16};
constexpr Colour softInk = {0.42, 0.44, 0.47};
constexpr Colour flatColour = {0.90, 0.90, 0.88};  ///< of a cell that has no direction

enum class Align { left, centre, right };
enum class Weight { normal, bold };

void SetColour(cairo_t* canvas, const Colour& colour);

/// Draws text with its base line at `y`.
void DrawText(cairo_t* canvas, double x, double y, const std::string& text, double size, const Colour& colour,
              Weight weight = Weight::normal, Align align = Align::left);

}  // namespace examples
