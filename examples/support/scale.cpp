#include "scale.h"

#include <algorithm>
#include <cmath>

#include <cpl_string.h>

namespace examples {

namespace {

// The distance within which 98 % of the values lie. Outliers do not fade the rest.
double CommonDistance(std::vector<double> distances) {
  if (distances.empty()) return 0.0;
  const auto at = distances.begin() + static_cast<std::ptrdiff_t>((distances.size() - 1) * 98 / 100);
  std::nth_element(distances.begin(), at, distances.end());
  return *at;
}

// A round limit of a scale, and the number of round parts that it is cut into.
struct Limit {
  double value;
  int parts;
};

Limit NiceLimit(double least) {
  if (least <= 0.0) return {1.0, 2};
  const double power = std::pow(10.0, std::floor(std::log10(least)));
  for (const Limit& limit :
       {Limit{1.0, 2}, {1.5, 3}, {2.0, 2}, {3.0, 3}, {4.0, 2}, {5.0, 5}, {6.0, 3}, {8.0, 4}})
    if (least <= limit.value * power) return {limit.value * power, limit.parts};
  return {10.0 * power, 2};
}

// The factors that a legend names, up to the first that is not below `least`.
std::vector<double> NiceFactors(double least) {
  std::vector<double> factors = {1.01, 1.02, 1.05, 1.1, 1.2, 1.5, 2.0, 3.0, 5.0, 10.0};
  while (factors.back() < least) factors.push_back(10.0 * factors.back());
  factors.erase(std::find_if(factors.begin(), factors.end(), [&](double f) { return f >= least; }) + 1,
                factors.end());
  return factors;
}

}  // namespace

double NiceStep(double roughly) {
  const double power = std::pow(10.0, std::floor(std::log10(roughly)));
  for (const double factor : {1.0, 2.0, 5.0})
    if (roughly <= factor * power) return factor * power;
  return 10.0 * power;
}

Scale::Scale(std::vector<double> values, Span span) {
  std::sort(values.begin(), values.end());
  if (span == Span::percent) {
    SpanTo(100.0, 20.0);
  } else if (span == Span::byte) {
    SpanTo(255.0, 51.0);
  } else if (span == Span::change || span == Span::bothSigns) {
    SpanChange(values, span == Span::change ? "+%.6g" : "%.6g");
  } else if (span == Span::factor) {
    SpanFactor(values);
  } else {
    SpanValues(values, span == Span::fromZero);
  }
  if (!values.empty()) MarkValuesBeyond(values.front(), values.back());
}

double Scale::Position(double value) const {
  if (logarithmic_ && value <= 0.0) return 0.0;
  const double position =
      logarithmic_ ? std::log(value / low_) / std::log(high_ / low_) : (value - low_) / (high_ - low_);
  return std::clamp(position, 0.0, 1.0);
}

void Scale::SpanValues(const std::vector<double>& values, bool fromZero) {
  double step = 1.0;
  if (!values.empty()) {
    const std::size_t tail = values.size() / 200;
    low_ = fromZero ? 0.0 : values[tail];
    high_ = values[values.size() - 1 - tail];
    if (high_ <= low_) {
      high_ = low_ + 1.0;
    } else {
      step = NiceStep((high_ - low_) / 6.0);
      low_ = std::floor(low_ / step) * step;
      high_ = std::ceil(high_ / step) * step;
    }
  }
  const auto last = static_cast<int>(std::lround((high_ - low_) / step));
  for (int i = 0; i <= last; ++i) AddTick(low_ + i * step, "%.6g");
}

void Scale::SpanTo(double high, double step) {
  high_ = high;
  for (int i = 0; i * step <= high; ++i) AddTick(i * step, "%.6g");
}

void Scale::SpanChange(const std::vector<double>& values, const char* positive) {
  std::vector<double> distances;
  for (const double value : values) distances.push_back(std::abs(value));
  const Limit limit = NiceLimit(CommonDistance(std::move(distances)));
  low_ = -limit.value;
  high_ = limit.value;
  for (int i = -limit.parts; i <= limit.parts; ++i)
    AddTick(limit.value * i / limit.parts, i > 0 ? positive : "%.6g");
}

void Scale::SpanFactor(const std::vector<double>& values) {
  std::vector<double> distances;
  for (const double value : values)
    if (value > 0.0) distances.push_back(std::abs(std::log(value)));
  const std::vector<double> factors = NiceFactors(std::exp(CommonDistance(std::move(distances))));
  high_ = factors.back();
  low_ = 1.0 / high_;
  logarithmic_ = true;
  AddTick(1.0, "%.3g");
  double last = 2.0;  // no tick stands nearer than an eighth of the bar to the next
  for (auto factor = factors.rbegin(); factor != factors.rend(); ++factor) {
    const double position = Position(*factor);
    if (last - position < 0.125 || position < 0.625) continue;
    AddTick(*factor, "%.3g");
    AddTick(1.0 / *factor, "%.2g");
    last = position;
  }
}

void Scale::AddTick(double value, const char* format) {
  const std::string amount = CPLSPrintf(format, std::abs(value));
  ticks_.push_back({Position(value), value < 0.0 ? "−" + amount : amount});
}

void Scale::MarkValuesBeyond(double least, double greatest) {
  for (Tick& tick : ticks_) {
    if (tick.position == 0.0 && least < low_) tick.label = "≤ " + tick.label;
    if (tick.position == 1.0 && greatest > high_) tick.label = "≥ " + tick.label;
  }
}

}  // namespace examples
