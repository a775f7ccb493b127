#include "processes/gridmill/kernels/percentilespline.h"

#include <cstddef>
#include <cstdint>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "processes/gridmill/kernels/tablelookup.h"

namespace orvik::kernels {
namespace {

/// The tables of a spline through given percentages.
struct Spline {
  int bins;
  double scale;
  std::vector<double> cumulative, alpha, linear, quadratic, cubic, diagonal, mu, z;

  Spline(std::vector<double> percentages, double binsPerUnit)
      : bins(static_cast<int>(percentages.size()) - 2), scale(binsPerUnit), cumulative(percentages) {
    Solve(0.0);
  }

  /// Fills the tables, which hold `before` until then.
  void Solve(double before) {
    for (std::vector<double>* table : {&alpha, &linear, &quadratic, &cubic, &diagonal, &mu, &z})
      table->assign(cumulative.size(), before);
    SolveSpline({cumulative.data(), alpha.data(), linear.data(), quadratic.data(), cubic.data(),
                 diagonal.data(), mu.data(), z.data()},
                bins, scale);
  }

  /// The coefficients of all bins.
  std::vector<double> Coefficients() const {
    std::vector<double> all;
    for (const std::vector<double>* table : {&linear, &quadratic, &cubic})
      all.insert(all.end(), table->begin(), table->begin() + bins + 1);
    return all;
  }

  std::vector<Knot> Knots(double least) const {
    std::vector<Knot> knots;
    AppendKnots({cumulative.data(), linear.data(), quadratic.data(), cubic.data()}, bins, scale, least,
                knots);
    return knots;
  }
};

TEST(PercentileSpline, SystemIsItsOwnAndNotTheNaturalOne) {
  const Spline spline({0.0, 50.0, 100.0, 100.0}, 1.0);
  // By hand: diagonal 2 (2 - 0) = 4, mu 1/4; then 2 (2 - 1/4) = 3.5, mu 1/3.5. A natural spline has 3.75
  // there.
  EXPECT_EQ(spline.diagonal, (std::vector<double>{1.0, 4.0, 3.5, 1.0}));
  EXPECT_EQ(spline.mu[2], 1.0 / 3.5);
  EXPECT_EQ(spline.alpha, (std::vector<double>{0.0, 0.0, -150.0, 0.0}));
  EXPECT_EQ(spline.z[2], -150.0 / 3.5);
  EXPECT_EQ(spline.quadratic[2], -150.0 / 3.5);
  EXPECT_EQ(spline.quadratic[1], 0.25 * (150.0 / 3.5));
}

TEST(PercentileSpline, TablesNeedNotBeClearedBefore) {
  Spline spline({0.0, 3.0, 4.5, 70.25, 99.0, 100.0, 100.0}, 0.3);
  const std::vector<double> expected = spline.Coefficients();
  spline.Solve(std::numeric_limits<double>::quiet_NaN());
  EXPECT_EQ(spline.Coefficients(), expected);
}

TEST(PercentileSpline, ValueOnAnEdgeGivesTheKnot) {
  const Spline spline({0.0, 10.0, 30.0, 100.0, 100.0}, 0.5);
  const std::vector<Knot> knots = spline.Knots(-3.0);
  const std::vector<float> value{-3.0f, -1.0f, 1.0f, 3.0f};
  const std::vector<int> bin{0, 1, 2, 3};
  std::vector<double> percentage(4);
  SplineRow(value.data(), bin.data(), knots.data(), 4, percentage.data());
  EXPECT_EQ(percentage, (std::vector<double>{0.0, 10.0, 30.0, 100.0}));
}

TEST(PercentileSpline, EveryLengthHoldsTheSameBits) {
  const Spline spline({0.0, 3.0, 4.5, 70.25, 99.0, 100.0, 100.0}, 0.3);
  const std::vector<Knot> knots = spline.Knots(0.7);
  for (std::size_t count = 0; count <= 70; ++count) {
    std::vector<float> value(count);
    std::vector<int> bin(count);
    std::vector<double> percentage(count);
    for (std::size_t i = 0; i < count; ++i) {
      value[i] = 0.37f * static_cast<float>(i);
      bin[i] = static_cast<int>(i % 6);
    }
    SplineRow(value.data(), bin.data(), knots.data(), count, percentage.data());
    for (std::size_t i = 0; i < count; ++i) {
      const std::size_t b = i % 6;
      const double dx = double{value[i]} - (static_cast<double>(b) / 0.3 + 0.7);
      const double linear = dx * spline.linear[b] + spline.cumulative[b];
      const double quadratic = (dx * spline.quadratic[b]) * dx;
      EXPECT_EQ(percentage[i], (linear + quadratic) + ((dx * spline.cubic[b]) * dx) * dx) << i;
    }
  }
}

TEST(LookUpRow, EveryNumberOfChannelsHasItsTables) {
  for (const std::size_t channels : {1u, 2u, 3u, 4u, 5u, 7u}) {
    std::vector<std::uint16_t> tables(channels * 256);
    for (std::size_t i = 0; i < tables.size(); ++i) tables[i] = static_cast<std::uint16_t>(i * 3 + 1);
    for (std::size_t pixels = 0; pixels < 40; ++pixels) {
      std::vector<char> samples(pixels * channels);
      std::vector<std::uint16_t> target(samples.size() + 1, 0xA5A5);
      for (std::size_t i = 0; i < samples.size(); ++i) samples[i] = static_cast<char>(i * 91);
      LookUpRow(samples.data(), tables.data(), channels, samples.size(), target.data());
      for (std::size_t i = 0; i < samples.size(); ++i) {
        const std::size_t entry = i % channels * 256 + static_cast<unsigned char>(samples[i]);
        ASSERT_EQ(target[i], entry * 3 + 1) << channels << " channels, sample " << i;
      }
      ASSERT_EQ(target.back(), 0xA5A5);
    }
  }
}

}  // namespace
}  // namespace orvik::kernels
