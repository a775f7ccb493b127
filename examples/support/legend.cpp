#include "legend.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <string>
#include <vector>

namespace examples {

namespace {

constexpr double full = 2.0 * std::numbers::pi;
constexpr int barHeight = 240;
constexpr double keyStep = 32.0;  // from one square to the next

void DrawBar(cairo_t* canvas, double x, double y, const Scale& scale, Ramp ramp) {
  constexpr int width = 22, height = barHeight;
  for (int row = 0; row < height; ++row) {
    SetColour(canvas, ramp(1.0 - (row + 0.5) / height));
    cairo_rectangle(canvas, x, y + row, width, 1.0);
    cairo_fill(canvas);
  }
  SetColour(canvas, softInk);
  cairo_rectangle(canvas, x - 0.5, y - 0.5, width + 1.0, height + 1.0);
  cairo_stroke(canvas);
  for (const Scale::Tick& tick : scale.Ticks()) {
    const double at = std::round(y + height - height * tick.position) - 0.5;
    cairo_move_to(canvas, x + width, at);
    cairo_line_to(canvas, x + width + 5.0, at);
    SetColour(canvas, softInk);
    cairo_stroke(canvas);
    DrawText(canvas, x + width + 10.0, at + 5.0, tick.label, 14, ink);
  }
}

void DrawRose(cairo_t* canvas, double x, double y, const Quantity& quantity, Ramp ramp) {
  constexpr double outer = 50.0, inner = 24.0;
  const double centreX = x + outer + 18.0, centreY = y + outer + 18.0;
  constexpr int parts = 360;
  cairo_set_line_width(canvas, outer - inner);
  for (int part = 0; part < parts; ++part) {
    const double from = full * (static_cast<double>(part) / parts - 0.25);
    SetColour(canvas, ramp((part + 0.5) / parts));
    cairo_new_path(canvas);
    cairo_arc(canvas, centreX, centreY, (outer + inner) / 2.0, from,
              from + 4.0 * full / parts);  // overlapping, so that no paper shines through
    cairo_stroke(canvas);
  }
  cairo_set_line_width(canvas, 1.0);
  const char* const names[] = {"N", "E", "S", "W"};
  for (int i = 0; i < 4; ++i) {
    const double angle = full * (i - 1) / 4.0;
    DrawText(canvas, centreX + (outer + 11.0) * std::cos(angle),
             centreY + 5.0 + (outer + 11.0) * std::sin(angle), names[i], 14, ink, Weight::normal,
             Align::centre);
  }
  if (!quantity.flat) return;
  SetColour(canvas, flatColour);
  cairo_rectangle(canvas, x + 0.5, centreY + outer + 34.5, 22.0, 22.0);
  cairo_fill_preserve(canvas);
  SetColour(canvas, softInk);
  cairo_stroke(canvas);
  DrawText(canvas, x + 32.0, centreY + outer + 51.0, CPLSPrintf("flat (%g)", *quantity.flat), 14, ink);
}

void DrawKeyFrame(cairo_t* canvas, double x, double y, const std::string& label) {
  cairo_rectangle(canvas, x - 0.5, y - 0.5, 23.0, 23.0);
  SetColour(canvas, softInk);
  cairo_stroke(canvas);
  DrawText(canvas, x + 32.0, y + 16.0, label, 14, ink);
}

void DrawKey(cairo_t* canvas, double x, double y, const Colour& colour, const std::string& label) {
  SetColour(canvas, colour);
  cairo_rectangle(canvas, x, y, 22.0, 22.0);
  cairo_fill(canvas);
  DrawKeyFrame(canvas, x, y, label);
}

// A square that shows what stands behind the picture, as the map does where it has no data.
void DrawNoDataKey(cairo_t* canvas, double x, double y, const std::string& label) {
  cairo_rectangle(canvas, x, y, 22.0, 22.0);
  cairo_set_operator(canvas, CAIRO_OPERATOR_CLEAR);
  cairo_fill(canvas);
  cairo_set_operator(canvas, CAIRO_OPERATOR_OVER);
  DrawKeyFrame(canvas, x, y, label);
}

// The name and up to two lines of explanation; returns the height that they end at.
double DrawHead(cairo_t* canvas, double x, double top, const Panel& panel) {
  const PictureStyle& style = panel.style;
  double y = top + 14.0;
  DrawText(canvas, x, y, style.legend.empty() ? panel.quantity.name : style.legend, 15, ink, Weight::bold);
  for (const std::string& line : {style.note, style.unit.empty() ? panel.quantity.unit : style.unit}) {
    if (line.empty()) continue;
    y += 19.0;
    DrawText(canvas, x, y, line, 13, softInk);
  }
  return std::max(y, top + 33.0);
}

// Returns where the next thing goes.
double DrawKeys(cairo_t* canvas, double x, double y, const PictureStyle& style) {
  constexpr Colour primaries[] = {{0.9, 0.1, 0.1}, {0.1, 0.75, 0.1}, {0.15, 0.25, 0.95}};
  for (std::size_t i = 0; i < style.composite.size(); ++i, y += keyStep)
    DrawKey(canvas, x, y, primaries[i], style.composite[i].label);
  for (const PictureClass& shown : style.classes) {
    DrawKey(canvas, x, y, shown.colour, shown.label);
    y += keyStep;
  }
  return y;
}

double DrawRamp(cairo_t* canvas, double x, double y, const Legend& legend) {
  const PictureStyle& style = legend.panel.style;
  if (!style.top.empty()) DrawText(canvas, x, y += 27.0, style.top, 13, ink);
  y += style.top.empty() ? 19.0 : 12.0;
  DrawBar(canvas, x, y, legend.scale, style.ramp);
  y += barHeight;
  if (!style.bottom.empty()) DrawText(canvas, x, y += 21.0, style.bottom, 13, ink);
  return y + 20.0;
}

}  // namespace

int LegendHeight(const PictureStyle& style) {
  constexpr int head = 72;
  const std::size_t keys = style.composite.size() + style.classes.size() + 1;  // and one for no-data
  return head + static_cast<int>(keyStep) * static_cast<int>(keys);
}

void DrawLegend(cairo_t* canvas, double x, double y, const Legend& legend) {
  const PictureStyle& style = legend.panel.style;
  y = DrawHead(canvas, x, y, legend.panel);
  if (legend.panel.quantity.compass) {
    DrawRose(canvas, x, y + 15.0, legend.panel.quantity, style.ramp);
    return;
  }
  const bool keys = !style.composite.empty() || !style.classes.empty();
  y = keys ? DrawKeys(canvas, x, y + 20.0, style) : DrawRamp(canvas, x, y, legend);
  if (legend.noData) DrawNoDataKey(canvas, x, y, style.noData);
}

}  // namespace examples
