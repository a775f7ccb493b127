#include "plot.h"

#include <algorithm>
#include <cmath>

#include <cpl_string.h>

#include "canvas.h"
#include "errors.h"
#include "scale.h"

namespace examples {

namespace {

// Sizes in pixels of the picture.
constexpr int width = 1000, height = 620, left = 104, right = 188, top = 84, bottom = 76;
constexpr int plotWidth = width - left - right, plotHeight = height - top - bottom;

// The columns of the plot: each stands for `step` values, the first one from `low` on.
struct Columns {
  std::size_t low;
  std::size_t step;
  std::size_t count;

  double Width() const { return static_cast<double>(plotWidth) / static_cast<double>(count); }
  double Left(std::size_t column) const { return left + Width() * static_cast<double>(column); }
  // The middle of the place of a value.
  double Middle(double value) const {
    return left + Width() * (value + 0.5 - static_cast<double>(low)) / static_cast<double>(step);
  }
};

Columns ColumnsFor(const std::vector<Curve>& curves) {
  std::size_t low = SIZE_MAX, high = 0;
  for (const Curve& curve : curves)
    for (std::size_t value = 0; value < curve.counts.size(); ++value)
      if (curve.counts[value] > 0) {
        low = std::min(low, value);
        high = std::max(high, value);
      }
  if (low > high) low = high = 0;
  const std::size_t values = high - low + 1, step = (values - 1) / plotWidth + 1;
  return {low, step, (values - 1) / step + 1};
}

std::vector<double> Sums(const Curve& curve, const Columns& columns) {
  std::vector<double> sums(columns.count);
  const std::size_t end = std::min(curve.counts.size(), columns.low + columns.count * columns.step);
  for (std::size_t value = columns.low; value < end; ++value)
    sums[(value - columns.low) / columns.step] += static_cast<double>(curve.counts[value]);
  return sums;
}

// Whole numbers with a thin space between groups of three digits.
std::string Grouped(double number) {
  std::string text = CPLSPrintf("%.0f", number);
  for (std::size_t place = text.size(); place > 3;) text.insert(place -= 3, "\u2009");
  return text;
}

// The outline of the columns, along the bottom at both ends.
void Trace(cairo_t* canvas, const std::vector<double>& sums, const Columns& columns, double most) {
  const double base = top + plotHeight;
  cairo_new_path(canvas);
  cairo_move_to(canvas, columns.Left(0), base);
  for (std::size_t i = 0; i < sums.size(); ++i) {
    const double y = base - plotHeight * sums[i] / most;
    cairo_line_to(canvas, columns.Left(i), y);
    cairo_line_to(canvas, columns.Left(i + 1), y);
  }
  cairo_line_to(canvas, columns.Left(sums.size()), base);
}

void DrawCurves(cairo_t* canvas, const Plot& plot, const std::vector<std::vector<double>>& sums,
                const Columns& columns, double most) {
  for (std::size_t i = 0; i < sums.size(); ++i) {  // all areas, then all outlines
    const Colour& colour = plot.curves[i].colour;
    Trace(canvas, sums[i], columns, most);
    cairo_set_source_rgba(canvas, colour.red, colour.green, colour.blue, sums.size() > 3 ? 0.12 : 0.25);
    cairo_fill(canvas);
  }
  cairo_set_line_width(canvas, columns.Width() < 2.0 ? 0.6 : 1.5);
  cairo_set_line_join(canvas, CAIRO_LINE_JOIN_ROUND);
  for (std::size_t i = 0; i < sums.size(); ++i) {
    Trace(canvas, sums[i], columns, most);
    SetColour(canvas, plot.curves[i].colour);
    cairo_stroke(canvas);
  }
}

void Line(cairo_t* canvas, double x0, double y0, double x1, double y1, const Colour& colour) {
  cairo_move_to(canvas, x0, y0);
  cairo_line_to(canvas, x1, y1);
  SetColour(canvas, colour);
  cairo_stroke(canvas);
}

// The numbers of the counts, with a line across the plot at each.
void DrawCountAxis(cairo_t* canvas, double most, double step) {
  constexpr Colour grid = {0.89, 0.90, 0.91};
  for (int i = 0; i * step <= most; ++i) {
    const double y = std::round(top + plotHeight - plotHeight * i * step / most) + 0.5;
    Line(canvas, left, y, left + plotWidth, y, grid);
    DrawText(canvas, left - 10.0, y + 4.5, Grouped(i * step), 13, ink, Weight::normal, Align::right);
  }
}

void DrawValueAxis(cairo_t* canvas, const Columns& columns) {
  const auto low = static_cast<double>(columns.low);
  const double high = low + static_cast<double>(columns.count * columns.step) - 1.0;
  const double step = std::max(1.0, NiceStep((high - low) / 8.0));
  const double base = top + plotHeight + 0.5;
  Line(canvas, left, base, left + plotWidth, base, softInk);
  for (double value = std::ceil(low / step) * step; value <= high; value += step) {
    const double x = std::round(columns.Middle(value)) + 0.5;
    Line(canvas, x, base, x, base + 5.0, softInk);
    DrawText(canvas, x, base + 21.0, Grouped(value), 13, ink, Weight::normal, Align::centre);
  }
}

void DrawTitles(cairo_t* canvas, const Plot& plot, const Columns& columns) {
  DrawText(canvas, 24.0, 36.0, plot.title, 22, ink, Weight::bold);
  DrawText(canvas, 24.0, 60.0, plot.caption, 13, softInk);
  DrawText(canvas, left + plotWidth / 2.0, height - 22.0, plot.valueAxis, 14, ink, Weight::normal,
           Align::centre);
  const std::string count =
      columns.step > 1 ? plot.countAxis + CPLSPrintf(" in %zu values", columns.step) : plot.countAxis;
  cairo_save(canvas);
  cairo_translate(canvas, 30.0, top + plotHeight / 2.0);
  cairo_rotate(canvas, -std::acos(0.0));
  DrawText(canvas, 0.0, 0.0, count, 14, ink, Weight::normal, Align::centre);
  cairo_restore(canvas);
}

void DrawKeys(cairo_t* canvas, const std::vector<Curve>& curves) {
  double y = top;
  for (const Curve& curve : curves) {
    SetColour(canvas, curve.colour);
    cairo_rectangle(canvas, width - right + 24.0, y, 22.0, 12.0);
    cairo_fill(canvas);
    DrawText(canvas, width - right + 56.0, y + 11.0, curve.label, 14, ink);
    y += 26.0;
  }
}

}  // namespace

void DrawPlot(const Plot& plot, const std::string& png) {
  const Columns columns = ColumnsFor(plot.curves);
  std::vector<std::vector<double>> sums;
  double greatest = 1.0;
  for (const Curve& curve : plot.curves) {
    sums.push_back(Sums(curve, columns));
    greatest = std::max(greatest, *std::max_element(sums.back().begin(), sums.back().end()));
  }
  const double step = std::max(1.0, NiceStep(greatest / 6.0)), most = std::ceil(greatest / step) * step;
  const Surface paper(cairo_image_surface_create(CAIRO_FORMAT_RGB24, width, height));
  const Canvas canvas(cairo_create(paper.get()));
  cairo_set_source_rgb(canvas.get(), 1.0, 1.0, 1.0);
  cairo_paint(canvas.get());
  cairo_set_line_width(canvas.get(), 1.0);
  DrawCountAxis(canvas.get(), most, step);
  DrawCurves(canvas.get(), plot, sums, columns, most);
  cairo_set_line_width(canvas.get(), 1.0);
  DrawValueAxis(canvas.get(), columns);
  DrawTitles(canvas.get(), plot, columns);
  DrawKeys(canvas.get(), plot.curves);
  const cairo_status_t status = cairo_surface_write_to_png(paper.get(), png.c_str());
  if (status != CAIRO_STATUS_SUCCESS)
    throw Failure(std::string("writing the plot: ") + cairo_status_to_string(status));
}

}  // namespace examples
