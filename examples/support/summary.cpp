#include "summary.h"

#include <cmath>
#include <limits>
#include <numbers>
#include <vector>

namespace examples {

namespace {

constexpr double degree = std::numbers::pi / 180.0;

// Adds up values, and directions as vectors.
struct Sums {
  double value = 0.0, north = 0.0, east = 0.0;

  void Add(double v) {
    value += v;
    north += std::cos(v * degree);
    east += std::sin(v * degree);
  }
  double Direction() const {
    const double angle = std::atan2(east, north) / degree;
    return angle < 0.0 ? angle + 360.0 : angle;
  }
};

}  // namespace

Summary Summarise(GDALRasterBand& band, const Quantity& quantity) {
  const int width = band.GetXSize();
  std::vector<double> values(static_cast<std::size_t>(width));
  std::vector<unsigned char> valid(values.size());
  Summary summary{.min = std::numeric_limits<double>::infinity(),
                  .max = -std::numeric_limits<double>::infinity(),
                  .classes = std::vector<std::uint64_t>(quantity.classes.size())};
  Sums sums;
  for (int y = 0; y < band.GetYSize(); ++y) {
    ThrowOnGdalError("reading back", band.RasterIO(GF_Read, 0, y, width, 1, values.data(), width, 1,
                                                   GDT_Float64, 0, 0, nullptr));
    ThrowOnGdalError("reading back", band.GetMaskBand()->RasterIO(GF_Read, 0, y, width, 1, valid.data(),
                                                                  width, 1, GDT_Byte, 0, 0, nullptr));
    for (std::size_t x = 0; x < values.size(); ++x) {
      ++summary.pixels;
      if (!valid[x]) continue;
      ++summary.valid;
      if (quantity.flat && values[x] == *quantity.flat) {
        ++summary.flat;
        continue;
      }
      const double value = values[x] * quantity.scale;
      summary.min = std::fmin(summary.min, value);
      summary.max = std::fmax(summary.max, value);
      sums.Add(value);
      if (!summary.classes.empty()) ++summary.classes[static_cast<std::size_t>(value) - 1];
    }
  }
  const auto counted = static_cast<double>(summary.valid - summary.flat);
  summary.mean = quantity.compass ? sums.Direction() : sums.value / counted;
  return summary;
}

std::string Describe(const Summary& summary, const Quantity& quantity) {
  const std::string counts =
      CPLSPrintf("%llu of %llu pixels valid", static_cast<unsigned long long>(summary.valid),
                 static_cast<unsigned long long>(summary.pixels));
  if (summary.valid == summary.flat) return "no values, " + counts;
  if (!quantity.classes.empty())
    return CPLSPrintf("%zu classes, %llu of %llu pixels in one of them", quantity.classes.size(),
                      static_cast<unsigned long long>(summary.valid),
                      static_cast<unsigned long long>(summary.pixels));
  if (quantity.bitmap) return CPLSPrintf("%.2f %% inside, ", 100.0 * summary.mean) + counts;
  std::string text = CPLSPrintf("min %.2f, %s %.2f, max %.2f", summary.min,
                                quantity.compass ? "mean direction" : "mean", summary.mean, summary.max);
  if (!quantity.unit.empty()) text += " " + quantity.unit;
  text += ", " + counts;
  if (quantity.flat)
    text += CPLSPrintf(" (%llu of them flat)", static_cast<unsigned long long>(summary.flat));
  return text;
}

std::string DescribeClasses(const Summary& summary, const Quantity& quantity) {
  std::string text;
  for (std::size_t i = 0; i < quantity.classes.size(); ++i) {
    const std::uint64_t count = summary.classes[i];
    const double share =
        summary.valid > 0 ? 100.0 * static_cast<double>(count) / static_cast<double>(summary.valid) : 0.0;
    text += CPLSPrintf("  class %zu, ", i + 1) + quantity.classes[i] +
            CPLSPrintf(": %llu pixels, %.2f %%\n", static_cast<unsigned long long>(count), share);
  }
  return text;
}

}  // namespace examples
