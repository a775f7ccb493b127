#pragma once

#include <string>
#include <vector>

namespace examples {

/// How values are laid along a colour ramp.
enum class Span {
  values,     ///< from the least to the greatest, without the outermost half percent on both sides
  fromZero,   ///< from 0 to the greatest, likewise
  percent,    ///< from 0 to 100
  byte,       ///< from 0 to 255
  bothSigns,  ///< equally far to both sides of 0, so that 98 % of the values are within
  change,     ///< likewise, with the signs of increase and decrease
  factor,     ///< by an equal factor to both sides of 1, likewise, in logarithms
};

/// What the ramp spans, rounded outwards to numbers that read well.
class Scale {
 public:
  /// A mark of the legend: a place on the ramp from 0 to 1, and the value there.
  struct Tick {
    double position;
    std::string label;  ///< with ≤ or ≥ where values lie beyond
  };

  /// @param values  those that are shown, without NaN and infinities
  Scale(std::vector<double> values, Span span);

  /// The place of a value on the ramp, from 0 to 1. Values beyond the ends lie at the ends.
  double Position(double value) const;
  const std::vector<Tick>& Ticks() const { return ticks_; }

 private:
  void SpanValues(const std::vector<double>& values, bool fromZero);
  void SpanTo(double high, double step);
  void SpanChange(const std::vector<double>& values, const char* positive);
  void SpanFactor(const std::vector<double>& values);
  void AddTick(double value, const char* format);
  void MarkValuesBeyond(double least, double greatest);

  double low_ = 0.0;
  double high_ = 1.0;
  bool logarithmic_ = false;
  std::vector<Tick> ticks_;
};

/// The least 1, 2 or 5 times a power of ten that is not below a number above 0.
double NiceStep(double roughly);

}  // namespace examples
