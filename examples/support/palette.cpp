#include "palette.h"

#include <algorithm>
#include <cmath>
#include <numbers>

namespace examples {

namespace {

double Gamma(double linear) {
  const double part = std::clamp(linear, 0.0, 1.0);
  return part <= 0.0031308 ? 12.92 * part : 1.055 * std::pow(part, 1.0 / 2.4) - 0.055;
}

// A colour of the Oklab space by lightness, chroma and hue in turns; equal steps there look equal.
Colour Oklch(double lightness, double chroma, double hue) {
  const double a = chroma * std::cos(2.0 * std::numbers::pi * hue);
  const double b = chroma * std::sin(2.0 * std::numbers::pi * hue);
  const double l = std::pow(lightness + 0.3963377774 * a + 0.2158037573 * b, 3);
  const double m = std::pow(lightness - 0.1055613458 * a - 0.0638541728 * b, 3);
  const double s = std::pow(lightness - 0.0894841775 * a - 1.2914855480 * b, 3);
  return {Gamma(4.0767416621 * l - 3.3077115913 * m + 0.2309699292 * s),
          Gamma(-1.2684380046 * l + 2.6097574011 * m - 0.3413193965 * s),
          Gamma(-0.0041960863 * l - 0.7034186147 * m + 1.7076147010 * s)};
}

}  // namespace

Colour GreyRamp(double position) { return {position, position, position}; }

Colour HeatRamp(double position) {
  const double chroma = 0.05 + 0.12 * std::sin(std::numbers::pi * std::pow(position, 0.8));
  return Oklch(0.97 - 0.71 * position, chroma, 0.29 - 0.40 * position);
}

Colour ChangeRamp(double position) {
  const double side = 2.0 * position - 1.0, distance = std::abs(side);
  const double chroma = distance * (0.19 - 0.12 * distance);  // as far as sRGB has dark teals
  const double lightness = 0.93 - 0.52 * distance;
  return side < 0.0 ? Oklch(lightness, 1.3 * chroma, 0.15) : Oklch(lightness, chroma, 0.58);
}

Colour PlantRamp(double position) {
  const double side = 2.0 * position - 1.0;
  if (side >= 0.0) return GreenRamp(side);
  const Colour sand = GreenRamp(0.0), water = Oklch(0.42, 0.12, 0.71);
  const auto mixed = [&](double from, double to) { return from - side * (to - from); };
  return {mixed(sand.red, water.red), mixed(sand.green, water.green), mixed(sand.blue, water.blue)};
}

Colour GreenRamp(double position) {
  const double chroma = 0.03 + 0.11 * std::sin(std::numbers::pi * (0.1 + 0.7 * position)) * position;
  return Oklch(0.93 - 0.55 * position, chroma, 0.27 + 0.13 * position);
}

Colour ClassColour(std::size_t place, std::size_t count) {
  const double position = count > 1 ? static_cast<double>(place) / static_cast<double>(count - 1) : 0.5;
  return Oklch((count - place) % 2 == 1 ? 0.58 : 0.84, 0.12, 0.70 - 0.64 * position);
}

Colour CompassRamp(double position) {
  const double light = std::cos(2.0 * std::numbers::pi * (position - 315.0 / 360.0));
  return Oklch(0.70 + 0.18 * light, 0.105, 0.58 - position);
}

}  // namespace examples
