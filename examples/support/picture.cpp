#include "picture.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <memory>
#include <optional>
#include <vector>

#include "canvas.h"
#include "errors.h"
#include "legend.h"

namespace examples {

namespace {

// Sizes in pixels of the picture.
constexpr int border = 24, header = 76, footer = 56, legendWidth = 164, leastMap = 300, leastHeight = 360,
              bestMap = 900, greatestMap = 1600;
constexpr int mostInRow = 3;

// The values of a panel as they are shown: reduced if the raster is large, north up if its rows run
// northwards.
struct Shown {
  int width = 0;
  int height = 0;
  int factor = 1;                           // enlargement
  double reach = 1.0;                       // raster pixels across one picture pixel
  std::vector<std::vector<double>> values;  // of one band, or of red, green and blue
  std::vector<unsigned char> valid;
};

std::vector<int> BandsOf(const Panel& panel) {
  if (panel.style.composite.empty()) return {panel.band};
  std::vector<int> bands;
  for (const CompositeBand& part : panel.style.composite) bands.push_back(part.band);
  return bands;
}

// `inRow`: the maps that stand side by side.
Shown ReadShown(GDALDataset& dataset, const Panel& panel, int inRow) {
  const int width = dataset.GetRasterXSize(), height = dataset.GetRasterYSize(),
            longer = std::max(width, height);
  const double reduction = std::max(1.0, static_cast<double>(longer) * inRow / greatestMap);
  const auto reduced = [&](int size) { return std::max(1, static_cast<int>(std::lround(size / reduction))); };
  Shown shown{reduced(width), reduced(height), std::max(1, bestMap / inRow / longer), 1.0, {}, {}};
  shown.reach = static_cast<double>(width) / (shown.width * shown.factor);
  const std::size_t pixels = static_cast<std::size_t>(shown.width) * static_cast<std::size_t>(shown.height);
  shown.valid.assign(pixels, 1);
  std::vector<unsigned char> ofBand(pixels);
  const auto read = [&](GDALRasterBand& from, void* to, GDALDataType type) {
    ThrowOnGdalError("reading back", from.RasterIO(GF_Read, 0, 0, width, height, to, shown.width,
                                                   shown.height, type, 0, 0, nullptr));
  };
  for (const int number : BandsOf(panel)) {
    GDALRasterBand& band = *dataset.GetRasterBand(number);
    std::vector<double>& values = shown.values.emplace_back(pixels);
    read(band, values.data(), GDT_Float64);
    read(*band.GetMaskBand(), ofBand.data(), GDT_Byte);
    for (double& value : values)
      if (value != panel.quantity.flat) value *= panel.quantity.scale;
    for (std::size_t i = 0; i < pixels; ++i)
      shown.valid[i] = shown.valid[i] != 0 && ofBand[i] != 0 && !std::isnan(values[i]);
  }
  return shown;
}

Scale ScaleFor(const Shown& shown, const std::vector<double>& band, Span span) {
  std::vector<double> values;
  for (std::size_t i = 0; i < band.size(); ++i)
    if (shown.valid[i] && std::isfinite(band[i])) values.push_back(band[i]);
  return Scale(std::move(values), span);
}

std::vector<Scale> ScalesFor(const Shown& shown, Span span) {
  std::vector<Scale> scales;
  for (const std::vector<double>& band : shown.values) scales.push_back(ScaleFor(shown, band, span));
  return scales;
}

std::uint32_t Opaque(const Colour& colour) {
  const auto byte = [](double part) { return static_cast<std::uint32_t>(std::lround(255.0 * part)); };
  return 0xff000000u | byte(colour.red) << 16 | byte(colour.green) << 8 | byte(colour.blue);
}

// None for a value that is none of the classes.
std::optional<Colour> ColourOf(const Shown& shown, std::size_t i, const Panel& panel,
                               const std::vector<Scale>& scales) {
  const PictureStyle& style = panel.style;
  const double value = shown.values[0][i];
  if (!style.composite.empty())
    return Colour{scales[0].Position(value), scales[1].Position(shown.values[1][i]),
                  scales[2].Position(shown.values[2][i])};
  for (const PictureClass& one : style.classes)
    if (value == one.value) return one.colour;
  if (!style.classes.empty()) return std::nullopt;
  if (value == panel.quantity.flat) return flatColour;
  return style.ramp(panel.quantity.compass ? std::fmod(value, 360.0) / 360.0 : scales[0].Position(value));
}

Surface PaintMap(const Shown& shown, const Panel& panel, const std::vector<Scale>& scales) {
  Surface map(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, shown.width, shown.height));
  unsigned char* row = cairo_image_surface_get_data(map.get());
  std::size_t i = 0;
  for (int y = 0; y < shown.height; ++y, row += cairo_image_surface_get_stride(map.get())) {
    for (int x = 0; x < shown.width; ++x, ++i) {
      const auto colour = shown.valid[i] ? ColourOf(shown, i, panel, scales) : std::nullopt;
      const std::uint32_t pixel = colour ? Opaque(*colour) : 0u;
      std::memcpy(row + 4 * x, &pixel, 4);
    }
  }
  cairo_surface_mark_dirty(map.get());
  return map;
}

// Puts the map into a hole in the paper, so that no-data is transparent.
void DrawMap(cairo_t* canvas, double left, double top, const Surface& map, const Shown& shown,
             const Cell& cell) {
  const double width = shown.width * shown.factor, height = shown.height * shown.factor;
  cairo_rectangle(canvas, left, top, width, height);
  cairo_set_operator(canvas, CAIRO_OPERATOR_CLEAR);
  cairo_fill(canvas);
  cairo_set_operator(canvas, CAIRO_OPERATOR_OVER);
  cairo_save(canvas);
  cairo_translate(canvas, left + (cell.x < 0.0 ? width : 0.0), top + (cell.y > 0.0 ? height : 0.0));
  cairo_scale(canvas, cell.x < 0.0 ? -shown.factor : shown.factor,
              cell.y > 0.0 ? -shown.factor : shown.factor);
  cairo_set_source_surface(canvas, map.get(), 0.0, 0.0);
  cairo_pattern_set_filter(cairo_get_source(canvas), CAIRO_FILTER_NEAREST);
  cairo_paint(canvas);
  cairo_restore(canvas);
  SetColour(canvas, softInk);
  cairo_set_line_width(canvas, 1.0);
  cairo_rectangle(canvas, left - 0.5, top - 0.5, width + 1.0, height + 1.0);
  cairo_stroke(canvas);
}

// A bar of a round length, at most a third of the map.
void DrawScaleBar(cairo_t* canvas, double left, double top, const Shown& shown, const Cell& cell) {
  if (!cell.known || cell.geographic) return;
  const double unitsPerPixel = std::abs(cell.x) * shown.reach;
  const double length = NiceStep(shown.width * shown.factor * unitsPerPixel / 8.0);
  const double pixels = length / unitsPerPixel, y = top + shown.height * shown.factor + 20.0;
  SetColour(canvas, ink);
  cairo_rectangle(canvas, left, y, pixels, 5.0);
  cairo_fill(canvas);
  const bool kilometres = cell.unit == "m" && length >= 1000.0;
  const std::string label =
      CPLSPrintf("%g %s", kilometres ? length / 1000.0 : length, kilometres ? "km" : cell.unit.c_str());
  DrawText(canvas, left, y + 22.0, label, 13, ink);
}

// How the panels stand on the paper: all of one size, in rows.
struct Layout {
  int inRow, rows;
  int mapWidth, mapHeight;

  int PanelWidth() const { return border + mapWidth + border + legendWidth; }
  int PanelHeight() const { return mapHeight + footer; }
  double Left(int panel) const { return panel % inRow * PanelWidth() + border; }
  double Top(int panel) const { return header + panel / inRow * PanelHeight(); }
};

void DrawPanel(cairo_t* canvas, GDALDataset& dataset, const Panel& panel, const Shown& shown, double left,
               double top, int mapWidth) {
  const Cell cell = CellOf(dataset);
  const std::vector<Scale> scales = ScalesFor(shown, panel.style.span);
  const bool noData = std::find(shown.valid.begin(), shown.valid.end(), 0) != shown.valid.end();
  DrawMap(canvas, left, top, PaintMap(shown, panel, scales), shown, cell);
  DrawLegend(canvas, left + mapWidth + border, top, {panel, scales[0], noData});
  DrawScaleBar(canvas, left, top, shown, cell);
}

}  // namespace

void DrawPicture(GDALDataset& dataset, const std::vector<Panel>& panels, const std::string& png) {
  const int count = static_cast<int>(panels.size()), inRow = std::min(count, mostInRow);
  std::vector<Shown> shown;
  int tallest = 0;
  for (const Panel& panel : panels) {
    shown.push_back(ReadShown(dataset, panel, inRow));
    tallest = std::max(tallest, LegendHeight(panel.style));
  }
  const Layout layout{inRow, (count + inRow - 1) / inRow,
                      std::max(shown[0].width * shown[0].factor, leastMap),
                      std::max({shown[0].height * shown[0].factor, leastHeight, tallest})};
  Surface paper(cairo_image_surface_create(CAIRO_FORMAT_ARGB32, layout.PanelWidth() * inRow,
                                           header + layout.PanelHeight() * layout.rows));
  Canvas canvas(cairo_create(paper.get()));
  cairo_set_source_rgb(canvas.get(), 1.0, 1.0, 1.0);
  cairo_paint(canvas.get());
  const PictureStyle& style = panels.front().style;
  DrawText(canvas.get(), border, 36.0, style.title, 22, ink, Weight::bold);
  DrawText(canvas.get(), border, 60.0, style.caption, 13, softInk);
  for (int i = 0; i < count; ++i) {
    const auto at = static_cast<std::size_t>(i);
    DrawPanel(canvas.get(), dataset, panels[at], shown[at], layout.Left(i), layout.Top(i), layout.mapWidth);
  }
  const cairo_status_t status = cairo_surface_write_to_png(paper.get(), png.c_str());
  if (status != CAIRO_STATUS_SUCCESS)
    throw Failure(std::string("writing the picture: ") + cairo_status_to_string(status));
}

}  // namespace examples
