#include "canvas.h"

namespace examples {

void SetColour(cairo_t* canvas, const Colour& colour) {
  cairo_set_source_rgb(canvas, colour.red, colour.green, colour.blue);
}

void DrawText(cairo_t* canvas, double x, double y, const std::string& text, double size, const Colour& colour,
              Weight weight, Align align) {
  cairo_select_font_face(canvas, "sans-serif", CAIRO_FONT_SLANT_NORMAL,
                         weight == Weight::bold ? CAIRO_FONT_WEIGHT_BOLD : CAIRO_FONT_WEIGHT_NORMAL);
  cairo_set_font_size(canvas, size);
  cairo_text_extents_t extents;
  cairo_text_extents(canvas, text.c_str(), &extents);
  SetColour(canvas, colour);
  const double share = align == Align::left ? 0.0 : align == Align::centre ? 0.5 : 1.0;
  cairo_move_to(canvas, x - share * extents.x_advance, y);
  cairo_show_text(canvas, text.c_str());
}

}  // namespace examples
