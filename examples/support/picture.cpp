#include "picture.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <memory>
#include <numbers>
#include <vector>

#include <cairo.h>

#include "errors.h"

namespace examples {

namespace {

struct CairoDeleter {
  void operator()(cairo_surface_t* surface) const { cairo_surface_destroy(surface); }
  void operator()(cairo_t* context) const { cairo_destroy(context); }
};
using Surface = std::unique_ptr<cairo_surface_t, CairoDeleter>;
using Canvas = std::unique_ptr<cairo_t, CairoDeleter>;

constexpr Colour ink = {0.13, 0.14, 0.16};
constexpr Colour softInk = {0.42, 0.44, 0.47};
constexpr Colour flatColour = {0.90, 0.90, 0.88};
constexpr double full = 2.0 * std::numbers::pi;

// Sizes in pixels of the picture.
constexpr int border = 24, header = 76, footer = 56, legendWidth = 164, leastMap = 300, leastHeight = 360,
              bestMap = 900, greatestMap = 1600, barHeight = 240;

// The values as they are shown: reduced if the raster is large, north up if its rows run northwards.
struct Shown {
  int width = 0;
  int height = 0;
  int factor = 1;      // enlargement
  double reach = 1.0;  // raster pixels across one picture pixel
  std::vector<double> values;
  std::vector<unsigned char> valid;
};

Shown ReadShown(GDALRasterBand& band, const Quantity& quantity) {
  const int width = band.GetXSize(), height = band.GetYSize(), longer = std::max(width, height);
  const double reduction = std::max(1.0, static_cast<double>(longer) / greatestMap);
  const auto reduced = [&](int size) { return std::max(1, static_cast<int>(std::lround(size / reduction))); };
  Shown shown{reduced(width), reduced(height), std::max(1, bestMap / longer), 1.0, {}, {}};
  shown.reach = static_cast<double>(width) / (shown.width * shown.factor);
  shown.values.resize(static_cast<std::size_t>(shown.width) * static_cast<std::size_t>(shown.height));
  shown.valid.resize(shown.values.size());
  const auto read = [&](GDALRasterBand& from, void* to, GDALDataType type) {
    ThrowOnGdalError("reading back", from.RasterIO(GF_Read, 0, 0, width, height, to, shown.width,
                                                   shown.height, type, 0, 0, nullptr));
  };
  read(band, shown.values.data(), GDT_Float64);
  read(*band.GetMaskBand(), shown.valid.data(), GDT_Byte);
  for (double& value : shown.values)
    if (value != quantity.flat) value *= quantity.scale;
  return shown;
}

Scale ScaleFor(const Shown& shown, Span span) {
  std::vector<double> values;
  for (std::size_t i = 0; i < shown.values.size(); ++i)
    if (shown.valid[i] && std::isfinite(shown.values[i])) values.push_back(shown.values[i]);
  return Scale(std::move(values), span);
}

void SetColour(cairo_t* canvas, const Colour& colour) {
  cairo_set_source_rgb(canvas, colour.red, colour.green, colour.blue);
}

enum class Align { left, centre };

void DrawText(cairo_t* canvas, double x, double y, const std::string& text, double size, const Colour& colour,
              cairo_font_weight_t weight = CAIRO_FONT_WEIGHT_NORMAL, Align align = Align::left) {
  cairo_select_font_face(canvas, "sans-serif", CAIRO_FONT_SLANT_NORMAL, weight);
  cairo_set_font_size(canvas, size);
  cairo_text_extents_t extents;
  cairo_text_extents(canvas, text.c_str(), &extents);
  SetColour(canvas, colour);
  cairo_move_to(canvas, align == Align::centre ? x - extents.x_advance / 2.0 : x, y);
  cairo_show_text(canvas, text.c_str());
}

std::uint32_t Opaque(const Colour& colour) {
  const auto byte = [](double part) { return static_cast<std::uint32_t>(std::lround(255.0 * part)); };
  return 0xff000000u | byte(colour.red) << 16 | byte(colour.green) << 8 | byte(colour.blue);
}

Colour ColourOf(double value, const Quantity& quantity, const Scale& scale, Ramp ramp) {
  if (value == quantity.flat) return flatColour;
  return ramp(quantity.compass ? std::fmod(value, 360.0) / 360.0 : scale.Position(value));
}

Surface PaintMap(const Shown& shown, const Quantity& quantity, const Scale& scale, Ramp ramp) {
  Surface map(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, shown.width, shown.height));
  unsigned char* row = cairo_image_surface_get_data(map.get());
  std::size_t i = 0;
  for (int y = 0; y < shown.height; ++y, row += cairo_image_surface_get_stride(map.get())) {
    for (int x = 0; x < shown.width; ++x, ++i) {
      const bool seen = shown.valid[i] && !std::isnan(shown.values[i]);
      const std::uint32_t pixel = seen ? Opaque(ColourOf(shown.values[i], quantity, scale, ramp)) : 0u;
      std::memcpy(row + 4 * x, &pixel, 4);
    }
  }
  cairo_surface_mark_dirty(map.get());
  return map;
}

// Puts the map into a hole in the paper, so that no-data is transparent.
void DrawMap(cairo_t* canvas, const Surface& map, const Shown& shown, const Cell& cell) {
  const double width = shown.width * shown.factor, height = shown.height * shown.factor;
  cairo_rectangle(canvas, border, header, width, height);
  cairo_set_operator(canvas, CAIRO_OPERATOR_CLEAR);
  cairo_fill(canvas);
  cairo_set_operator(canvas, CAIRO_OPERATOR_OVER);
  cairo_save(canvas);
  cairo_translate(canvas, border + (cell.x < 0.0 ? width : 0.0), header + (cell.y > 0.0 ? height : 0.0));
  cairo_scale(canvas, cell.x < 0.0 ? -shown.factor : shown.factor,
              cell.y > 0.0 ? -shown.factor : shown.factor);
  cairo_set_source_surface(canvas, map.get(), 0.0, 0.0);
  cairo_pattern_set_filter(cairo_get_source(canvas), CAIRO_FILTER_NEAREST);
  cairo_paint(canvas);
  cairo_restore(canvas);
  SetColour(canvas, softInk);
  cairo_set_line_width(canvas, 1.0);
  cairo_rectangle(canvas, border - 0.5, header - 0.5, width + 1.0, height + 1.0);
  cairo_stroke(canvas);
}

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
             centreY + 5.0 + (outer + 11.0) * std::sin(angle), names[i], 14, ink, CAIRO_FONT_WEIGHT_NORMAL,
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

// A square that shows what stands behind the picture, as the map does where it has no data.
void DrawNoDataKey(cairo_t* canvas, double x, double y) {
  cairo_rectangle(canvas, x, y, 22.0, 22.0);
  cairo_set_operator(canvas, CAIRO_OPERATOR_CLEAR);
  cairo_fill(canvas);
  cairo_set_operator(canvas, CAIRO_OPERATOR_OVER);
  cairo_rectangle(canvas, x - 0.5, y - 0.5, 23.0, 23.0);
  SetColour(canvas, softInk);
  cairo_stroke(canvas);
  DrawText(canvas, x + 32.0, y + 16.0, "no data", 14, ink);
}

// The name and up to two lines of explanation; returns the height that they end at.
double DrawLegendHead(cairo_t* canvas, double x, const Quantity& quantity, const PictureStyle& style) {
  double y = header + 14.0;
  DrawText(canvas, x, y, style.legend.empty() ? quantity.name : style.legend, 15, ink,
           CAIRO_FONT_WEIGHT_BOLD);
  for (const std::string& line : {style.note, style.unit.empty() ? quantity.unit : style.unit}) {
    if (line.empty()) continue;
    y += 19.0;
    DrawText(canvas, x, y, line, 13, softInk);
  }
  return std::max(y, header + 33.0);
}

// The ramp stands between the words for its ends if it has some.
void DrawLegend(cairo_t* canvas, double x, const Shown& shown, const Quantity& quantity, const Scale& scale,
                const PictureStyle& style) {
  double y = DrawLegendHead(canvas, x, quantity, style);
  if (quantity.compass) {
    DrawRose(canvas, x, y + 15.0, quantity, style.ramp);
    return;
  }
  if (!style.top.empty()) DrawText(canvas, x, y += 27.0, style.top, 13, ink);
  y += style.top.empty() ? 19.0 : 12.0;
  DrawBar(canvas, x, y, scale, style.ramp);
  y += barHeight;
  if (!style.bottom.empty()) DrawText(canvas, x, y += 21.0, style.bottom, 13, ink);
  if (std::find(shown.valid.begin(), shown.valid.end(), 0) != shown.valid.end())
    DrawNoDataKey(canvas, x, y + 20.0);
}

// A bar of a round length, at most a third of the map.
void DrawScaleBar(cairo_t* canvas, const Shown& shown, const Cell& cell) {
  if (!cell.known || cell.geographic) return;
  const double unitsPerPixel = std::abs(cell.x) * shown.reach;
  const double length = NiceStep(shown.width * shown.factor * unitsPerPixel / 8.0);
  const double pixels = length / unitsPerPixel, y = header + shown.height * shown.factor + 20.0;
  SetColour(canvas, ink);
  cairo_rectangle(canvas, border, y, pixels, 5.0);
  cairo_fill(canvas);
  const bool kilometres = cell.unit == "m" && length >= 1000.0;
  const std::string label =
      CPLSPrintf("%g %s", kilometres ? length / 1000.0 : length, kilometres ? "km" : cell.unit.c_str());
  DrawText(canvas, border, y + 22.0, label, 13, ink);
}

}  // namespace

void DrawPicture(GDALDataset& dataset, int band, const Quantity& quantity, const PictureStyle& style,
                 const std::string& png) {
  const Shown shown = ReadShown(*dataset.GetRasterBand(band), quantity);
  const Cell cell = CellOf(dataset);
  const Scale scale = ScaleFor(shown, style.span);
  const int mapWidth = shown.width * shown.factor, mapHeight = shown.height * shown.factor;
  const int width = border + std::max(mapWidth, leastMap) + border + legendWidth;
  Surface paper(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, width,
                                           header + std::max(mapHeight, leastHeight) + footer));
  Canvas canvas(cairo_create(paper.get()));
  cairo_set_source_rgb(canvas.get(), 1.0, 1.0, 1.0);
  cairo_paint(canvas.get());
  DrawText(canvas.get(), border, 36.0, style.title, 22, ink, CAIRO_FONT_WEIGHT_BOLD);
  DrawText(canvas.get(), border, 60.0, style.caption, 13, softInk);
  DrawMap(canvas.get(), PaintMap(shown, quantity, scale, style.ramp), shown, cell);
  DrawLegend(canvas.get(), border + std::max(mapWidth, leastMap) + border, shown, quantity, scale, style);
  DrawScaleBar(canvas.get(), shown, cell);
  const cairo_status_t status = cairo_surface_write_to_png(paper.get(), png.c_str());
  if (status != CAIRO_STATUS_SUCCESS)
    throw Failure(std::string("writing the picture: ") + cairo_status_to_string(status));
}

}  // namespace examples
