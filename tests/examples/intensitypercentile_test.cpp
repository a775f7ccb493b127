// The program of the signed percentiles, run as a user runs it, on rasters that the tests make.

#include <cmath>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

// Two values, the first greater in even columns, and intensities of -50 to 49, each as often as the others.
double Sample(int x, int y, int band) {
  if (band == 1) return x % 2 == 0 ? 2.0 : 1.0;
  if (band == 2) return x % 2 == 0 ? 1.0 : 2.0;
  return (x + 10 * y) % 100 - 50.0;
}

class IntensityPercentile : public ExamplesFixture {
 protected:
  void SetUp() override {
    ExamplesFixture::SetUp();
    Make("in.tif", {.width = 20, .height = 20, .bands = 3, .value = Sample});
  }
};

// With a bin for each whole number the percentile is read at an edge, where it is the share that lies below.
TEST_F(IntensityPercentile, IsTheShareBelowWithTheSignOfTheGreaterValue) {
  ExpectDone(INTENSITYPERCENTILE, "in.tif out/o.tif --bins 99");
  const std::vector<double> values = Values("out/o.tif", 4);
  ASSERT_EQ(values.size(), 400u);
  for (int i = 0; i < 400; ++i) {
    const double intensity = Sample(i % 20, i / 20, 3), share = intensity + 50.0;
    const double expected = intensity == 49.0 ? 100.0 : share;
    EXPECT_NEAR(values[static_cast<std::size_t>(i)], i % 20 % 2 == 0 ? expected : -expected, 1e-3) << i;
  }
}

TEST_F(IntensityPercentile, TheThreeBandsArePassedThrough) {
  ExpectDone(INTENSITYPERCENTILE, "in.tif out/o.tif --bands 2,1,3");
  EXPECT_EQ(Values("out/o.tif", 1), Values("in.tif", 2));
  EXPECT_EQ(Values("out/o.tif", 2), Values("in.tif", 1));
  EXPECT_EQ(Values("out/o.tif", 3), Values("in.tif", 3));
}

TEST_F(IntensityPercentile, WithoutItsSignTheSizeOfTheIntensityCounts) {
  ExpectDone(INTENSITYPERCENTILE, "in.tif out/o.tif --absolute");
  const std::vector<double> values = Values("out/o.tif", 4), sizes = Values("out/o.tif", 3);
  for (std::size_t i = 0; i < values.size(); ++i) {
    if (sizes[i] == 0.0) {
      EXPECT_EQ(values[i], 0.0);
    }
    if (sizes[i] == 50.0) {
      EXPECT_EQ(std::fabs(values[i]), 100.0);
    }
    EXPECT_GE(sizes[i], 0.0);
  }
}

TEST_F(IntensityPercentile, PixelsWithoutDataNeitherCountNorAreRanked) {
  Make("in.tif", {.width = 20, .height = 20, .bands = 3, .value = [](int x, int y, int band) {
                    return y == 0 && band == 3 ? std::nan("") : Sample(x, y, band);
                  }});
  ExpectDone(INTENSITYPERCENTILE, "in.tif out/o.tif");
  const std::vector<double> values = Values("out/o.tif", 4);
  for (std::size_t i = 0; i < values.size(); ++i) EXPECT_EQ(std::isnan(values[i]), i < 20) << i;
}

TEST_F(IntensityPercentile, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  ExpectTilesGiveTheSameBits(INTENSITYPERCENTILE, "in.tif --absolute");
}

TEST_F(IntensityPercentile, WhatCannotBeRankedIsRefused) {
  ExpectRefused(INTENSITYPERCENTILE, "in.tif out/o.tif --bands 1,2", "2 bands");
  ExpectRefused(INTENSITYPERCENTILE, "in.tif out/o.tif --bands 1,2,4", "--bands");
  Make("flat.tif", {.bands = 3, .value = [](int, int, int) { return 1.0; }});
  ExpectRefused(INTENSITYPERCENTILE, "flat.tif out/o.tif", "has not two values");
}

}  // namespace
