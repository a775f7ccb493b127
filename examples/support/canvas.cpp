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
  cairo_move_to(canvas, align == Align::centre ? x - extents.x_advance / 2.0 : x, y);
  cairo_show_text(canvas, text.c_str());
}

}  // namespace examples
