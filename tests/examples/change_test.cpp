// The program that compares two dates, run as a user runs it, on rasters that the tests make.

#include <array>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <limits>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

std::size_t At(int x, int y) { return static_cast<std::size_t>(y * width + x); }

double Before(int x, int y, int band) { return 20.0 + (x * 7 + y * 3 + band * 11) % 90; }
double After(int x, int y, int band) { return 10.0 + (x * 5 + y * 13 + band * 17) % 120; }

class Change : public ExamplesFixture {
 protected:
  void MakeDates(int bands, GDALDataType type = GDT_Byte) const {
    Make("before.tif", {.bands = bands, .type = type, .value = Before});
    Make("after.tif", {.bands = bands, .type = type, .value = After});
  }

  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(CHANGE, arguments); }

  double NoDataOf(const std::string& name, int band = 1) const {
    return Open(name)->GetRasterBand(band)->GetNoDataValue();
  }
};

TEST_F(Change, DifferenceIsAfterMinusBefore) {
  MakeDates(3);
  ExpectDone("difference before.tif after.tif out/d.tif");
  ASSERT_EQ(Open("out/d.tif")->GetRasterCount(), 3);
  for (const int band : {1, 2, 3}) {
    const std::vector<double> values = Values("out/d.tif", band);
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x) ASSERT_EQ(values[At(x, y)], After(x, y, band) - Before(x, y, band));
  }
  EXPECT_STREQ(Open("out/d.tif")->GetRasterBand(2)->GetDescription(), "difference of band 2");
}

TEST_F(Change, RatioIsAfterDividedByBefore) {
  MakeDates(2);
  ExpectDone("ratio before.tif after.tif out/r.tif");
  for (const int band : {1, 2}) {
    const std::vector<double> values = Values("out/r.tif", band);
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x)
        ASSERT_EQ(values[At(x, y)], static_cast<float>(After(x, y, band) / Before(x, y, band)));
  }
}

TEST_F(Change, ARatioToZeroIsNoData) {
  Make("before.tif", {.type = GDT_Byte, .value = [](int x, int, int) { return x < 2 ? 0.0 : 4.0; }});
  Make("after.tif", {.type = GDT_Byte, .value = [](int x, int, int) { return x == 0 ? 0.0 : 10.0; }});
  ExpectDone("ratio before.tif after.tif out/r.tif");
  const std::vector<double> values = Values("out/r.tif");
  EXPECT_TRUE(std::isnan(values[0]));
  EXPECT_TRUE(std::isnan(values[1]));
  EXPECT_EQ(values[2], 2.5);
  ExpectDone("ratio before.tif after.tif out/stated.tif --nodata -1");
  EXPECT_EQ(Values("out/stated.tif")[0], -1.0);
  EXPECT_EQ(Values("out/stated.tif")[1], -1.0);
}

TEST_F(Change, MagnitudeHasBothDatesAndTheirDifference) {
  Make("before.tif", {.bands = 2, .type = GDT_Byte, .value = [](int, int, int b) { return b + 2.0; }});
  Make("after.tif", {.bands = 2, .type = GDT_Byte, .value = [](int, int, int b) { return 2 * b + 4.0; }});
  ExpectDone("magnitude before.tif after.tif out/m.tif");
  const DatasetPtr out = Open("out/m.tif");
  ASSERT_EQ(out->GetRasterCount(), 3);
  const std::array<std::string, 3> names = {"magnitude after", "magnitude before", "magnitude difference"};
  const std::array<double, 3> expected = {10.0, 5.0, 5.0};
  for (const int band : {1, 2, 3}) {
    EXPECT_EQ(out->GetRasterBand(band)->GetDescription(), names[static_cast<std::size_t>(band) - 1]);
    EXPECT_EQ(Values("out/m.tif", band)[At(5, 7)], expected[static_cast<std::size_t>(band) - 1]);
  }
}

TEST_F(Change, MagnitudeOfWideSamplesDoesNotWrap) {
  for (const GDALDataType type : {GDT_UInt16, GDT_Int32, GDT_UInt32, GDT_Int64, GDT_UInt64, GDT_Float64}) {
    Make("before.tif", {.type = type, .value = [](int, int, int) { return 60000.0; }});
    Make("after.tif", {.type = type, .value = [](int, int, int) { return 50000.0; }});
    ExpectDone("magnitude before.tif after.tif out/m.tif");
    EXPECT_EQ(Values("out/m.tif", 1)[0], 50000.0) << GDALGetDataTypeName(type);
    EXPECT_EQ(Values("out/m.tif", 2)[0], 60000.0) << GDALGetDataTypeName(type);
    EXPECT_EQ(Values("out/m.tif", 3)[0], -10000.0) << GDALGetDataTypeName(type);
  }
}

TEST_F(Change, SingleIsTheDifferenceOfOneBand) {
  MakeDates(3);
  ExpectDone("single before.tif after.tif out/s.tif --bands 2 --before-bands 3");
  ASSERT_EQ(Open("out/s.tif")->GetRasterCount(), 1);
  EXPECT_STREQ(Open("out/s.tif")->GetRasterBand(1)->GetDescription(), "difference of band 2 (3 before)");
  const std::vector<double> values = Values("out/s.tif");
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) ASSERT_EQ(values[At(x, y)], After(x, y, 2) - Before(x, y, 3));
  ExpectDone("single before.tif after.tif out/first.tif --type Int16");
  EXPECT_EQ(Values("out/first.tif")[At(8, 9)], After(8, 9, 1) - Before(8, 9, 1));
}

TEST_F(Change, IntensityHasBothMeansAndTheirRatioInDecibels) {
  const auto before = [](int x, int, int b) { return x == 0 ? 0.0 : 5.0 * b; };
  const auto after = [](int x, int, int b) { return x < 2 ? 0.0 : x == 2 ? 50.0 * b : 20.0 * b; };
  Make("before.tif", {.bands = 3, .type = GDT_Byte, .value = before});
  Make("after.tif", {.bands = 3, .type = GDT_Byte, .value = after});
  ExpectDone("intensity before.tif after.tif out/i.tif --png out/i.png");
  const DatasetPtr out = Open("out/i.tif");
  ASSERT_EQ(out->GetRasterCount(), 4);
  EXPECT_STREQ(out->GetRasterBand(3)->GetDescription(), "intensity ratio");
  EXPECT_STREQ(out->GetRasterBand(3)->GetUnitType(), "dB");
  EXPECT_STREQ(out->GetRasterBand(1)->GetUnitType(), "");
  for (const int x : {0, 1})
    for (const int band : {1, 2, 3, 4}) EXPECT_TRUE(std::isnan(Values("out/i.tif", band)[At(x, 7)])) << x;
  const std::array<double, 4> tenfold = {100.0, 10.0, 10.0, 0.0};
  for (const int band : {1, 2, 3, 4})
    EXPECT_EQ(Values("out/i.tif", band)[At(2, 7)], tenfold[static_cast<std::size_t>(band) - 1]);
  EXPECT_NEAR(Values("out/i.tif", 3)[At(9, 7)], 10.0 * std::log10(4.0), 1e-6);
}

TEST_F(Change, CombinationHasTheBandsOfAfterThenThoseOfBefore) {
  Make("before.tif", {.bands = 2, .type = GDT_Byte, .value = Before});
  Make("after.tif", {.bands = 3, .type = GDT_Int16, .value = After});
  ExpectDone("combine before.tif after.tif out/c.tif --type Int16");
  const DatasetPtr out = Open("out/c.tif");
  ASSERT_EQ(out->GetRasterCount(), 5);
  EXPECT_STREQ(out->GetRasterBand(3)->GetDescription(), "band 3 after");
  EXPECT_STREQ(out->GetRasterBand(4)->GetDescription(), "band 1 before");
  for (int band = 1; band <= 5; ++band)
    EXPECT_EQ(Values("out/c.tif", band)[At(8, 9)], band <= 3 ? After(8, 9, band) : Before(8, 9, band - 3));
  ExpectDone("combine before.tif after.tif out/two.tif --bands 3 --before-bands 2,1");
  ASSERT_EQ(Open("out/two.tif")->GetRasterCount(), 3);
  EXPECT_EQ(Values("out/two.tif", 1)[At(8, 9)], After(8, 9, 3));
  EXPECT_EQ(Values("out/two.tif", 2)[At(8, 9)], Before(8, 9, 2));
}

TEST_F(Change, ACombinationNeedsBandsOfBothDates) {
  MakeDates(1);
  Make("alpha.tif", {.type = GDT_Byte});
  DatasetPtr(GDALDataset::Open(Path("alpha.tif").c_str(), GDAL_OF_RASTER | GDAL_OF_UPDATE))
      ->GetRasterBand(1)
      ->SetColorInterpretation(GCI_AlphaBand);
  ExpectRefused(CHANGE, "combine alpha.tif after.tif out/o.tif", "BEFORE: all bands are alpha bands");
  ExpectRefused(CHANGE, "combine before.tif alpha.tif out/o.tif", "AFTER: all bands are alpha bands");
}

TEST_F(Change, TwoMasksGiveWhatOneGives) {
  const auto value = [](int x, int y, int b) {
    return (x + y) % 7 == 0 ? 255.0 : b == 2 && x % 9 == 4 ? 60.0 : Before(x, y, b);
  };
  Make("before.tif", {.bands = 2, .type = GDT_Byte, .value = value, .noData = 255.0});
  Make("after.tif", {.bands = 2, .type = GDT_Int16, .value = After, .noData = 50.0});
  for (const std::string task : {"difference", "ratio"}) {
    ExpectDone(task + " before.tif after.tif out/one.tif --exclude 60,70");
    ExpectDone(task + " before.tif after.tif out/two.tif --exclude 60,70 --two-masks --tile 16");
    for (const int band : {1, 2}) {
      const std::vector<double> one = Values("out/one.tif", band), two = Values("out/two.tif", band);
      int values = 0, holes = 0;
      for (std::size_t i = 0; i < one.size(); ++i) {
        ASSERT_TRUE(one[i] == two[i] || (std::isnan(one[i]) && std::isnan(two[i]))) << task << " " << i;
        ++(std::isnan(one[i]) ? holes : values);
      }
      EXPECT_GT(holes, 100);
      EXPECT_GT(values, 1000);
    }
  }
}

TEST_F(Change, TwoMasksTakeFourTypes) {
  const std::string task = "difference before.tif after.tif out/o.tif --two-masks";
  Make("before.tif", {.type = GDT_Byte, .value = Before});
  for (const GDALDataType type : {GDT_UInt32, GDT_Int32, GDT_Float64}) {
    Make("after.tif", {.type = type, .value = After});
    ExpectRefused(CHANGE, task,
                  std::string("AFTER: has samples of ") + GDALGetDataTypeName(type) +
                      "; expected Byte, Int16, UInt16 or Float32 with --two-masks");
  }
  Make("after.tif", {.type = GDT_Byte, .value = After});
  ExpectRefused(CHANGE, task + " --type Int32",
                "--type: Int32 is not written with --two-masks; expected Int16 or Float32");
  ExpectDone(task + " --type Int16");
  EXPECT_EQ(Values("out/o.tif")[At(8, 9)], After(8, 9, 1) - Before(8, 9, 1));
}

using Weights = std::vector<double>;
const Weights greennessTm = {-0.2848, -0.2435, -0.5436, 0.7243, 0.084, -0.18};
const Weights brightnessTm = {0.3037, 0.2793, 0.4343, 0.5585, 0.5082, 0.1863};
const Weights greennessMss = {-0.29, -0.562, 0.6, 0.49};

double Projected(const Weights& weights, const std::vector<int>& bands, double (*value)(int, int, int), int x,
                 int y) {
  double sum = 0.0;
  for (std::size_t i = 0; i < weights.size(); ++i) sum += weights[i] * value(x, y, bands[i]);
  return sum;
}

TEST_F(Change, TasseledCapReadsTheSensorsBands) {
  MakeDates(7);
  const std::vector<int> bands = {1, 2, 3, 4, 5, 7};
  for (const auto& [axis, weights] :
       {std::pair<std::string, Weights>{"greenness", greennessTm}, {"brightness", brightnessTm}}) {
    ExpectDone(axis + " before.tif after.tif out/t.tif --sensor 'Landsat-5 TM'");
    const std::vector<double> after = Values("out/t.tif", 1), before = Values("out/t.tif", 2);
    const std::vector<double> change = Values("out/t.tif", 3);
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        const double a = Projected(weights, bands, After, x, y), b = Projected(weights, bands, Before, x, y);
        ASSERT_NEAR(after[At(x, y)], a, 1e-4);
        ASSERT_NEAR(before[At(x, y)], b, 1e-4);
        ASSERT_NEAR(change[At(x, y)], a - b, 1e-4);
      }
    }
    EXPECT_EQ(Open("out/t.tif")->GetRasterBand(3)->GetDescription(), axis + " difference");
  }
}

TEST_F(Change, SixBandsAreThoseOfTmWithoutTheThermalOne) {
  MakeDates(6);
  ExpectDone("greenness before.tif after.tif out/t.tif --sensor 'Landsat-5 TM'");
  EXPECT_NEAR(Values("out/t.tif", 1)[At(9, 4)], Projected(greennessTm, {1, 2, 3, 4, 5, 6}, After, 9, 4),
              1e-4);
  ExpectDone("greenness before.tif after.tif out/t.tif --sensor 'Landsat-5 TM' --bands 6,5,4,3,2,1");
  EXPECT_NEAR(Values("out/t.tif", 1)[At(9, 4)], Projected(greennessTm, {6, 5, 4, 3, 2, 1}, After, 9, 4),
              1e-4);
}

TEST_F(Change, TheDatesMayHaveUnlikeSensors) {
  Make("before.tif", {.bands = 4, .type = GDT_Int16, .value = Before});
  Make("after.tif", {.bands = 7, .type = GDT_Int16, .value = After});
  const std::string task = " --sensor 'Landsat-5 TM' --before-sensor 'Landsat-5 MSS'";
  ExpectDone("greenness before.tif after.tif out/t.tif" + task);
  EXPECT_NEAR(Values("out/t.tif", 1)[At(9, 4)], Projected(greennessTm, {1, 2, 3, 4, 5, 7}, After, 9, 4),
              1e-4);
  EXPECT_NEAR(Values("out/t.tif", 2)[At(9, 4)], Projected(greennessMss, {1, 2, 3, 4}, Before, 9, 4), 1e-4);
  // The sensor of AFTER has more bands than a pixel of BEFORE has samples.
  ExpectDone("greenness before.tif after.tif out/t.tif --exclude 50,-1" + task);
  const std::vector<double> values = Values("out/t.tif", 3);
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      bool out = false;
      for (int band = 1; band <= 4; ++band) out = out || Before(x, y, band) == 50.0;
      ASSERT_EQ(std::isnan(values[At(x, y)]), out) << x << " " << y;
    }
  }
}

TEST_F(Change, BandsMayHaveUnlikeNumbers) {
  MakeDates(4, GDT_Int16);
  ExpectDone("difference before.tif after.tif out/d.tif --bands 4,2 --before-bands 3,2 --show 2");
  ASSERT_EQ(Open("out/d.tif")->GetRasterCount(), 2);
  EXPECT_EQ(Values("out/d.tif", 1)[At(8, 9)], After(8, 9, 4) - Before(8, 9, 3));
  EXPECT_EQ(Values("out/d.tif", 2)[At(8, 9)], After(8, 9, 2) - Before(8, 9, 2));
  EXPECT_STREQ(Open("out/d.tif")->GetRasterBand(1)->GetDescription(), "difference of band 4 (3 before)");
}

bool BeforeHole(int x, int y) { return (x + 2 * y) % 19 == 0; }
bool AfterHole(int x, int y) { return (3 * x + y) % 23 == 0; }

TEST_F(Change, NoDataOfEitherDateMasksAllBandsOfThePixel) {
  Make("before.tif",
       {.bands = 7,
        .type = GDT_Byte,
        .value = [](int x, int y, int b) { return BeforeHole(x, y) && b == 2 ? 255.0 : Before(x, y, b); },
        .noData = 255.0});
  Make("after.tif",
       {.bands = 7,
        .type = GDT_Int16,
        .value = [](int x, int y, int b) { return AfterHole(x, y) && b == 4 ? -1.0 : After(x, y, b); },
        .noData = -1.0});
  for (const std::string task :
       {"difference", "difference --two-masks", "single", "ratio", "ratio --two-masks", "intensity",
        "combine", "magnitude", "greenness --sensor 'Landsat-5 TM'",
        "brightness --sensor Ikonos --bands 1,2,3,4"}) {
    // One band alone is masked by its own holes.
    const auto masked = [&](int x, int y) {
      return task == "single" ? false : BeforeHole(x, y) || AfterHole(x, y);
    };
    ExpectDone(task + " before.tif after.tif out/o.tif");
    for (int band = 1; band <= Open("out/o.tif")->GetRasterCount(); ++band) {
      const std::vector<double> values = Values("out/o.tif", band);
      for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
          ASSERT_EQ(std::isnan(values[At(x, y)]), masked(x, y)) << task << " " << x << " " << y;
      EXPECT_TRUE(std::isnan(NoDataOf("out/o.tif", band)));
    }
  }
}

TEST_F(Change, AMaskedPixelOfASingleBandHoldsNoData) {
  Make("before.tif",
       {.value = [](int x, int y, int) { return BeforeHole(x, y) ? -5.0 : 3.0; }, .noData = -5.0});
  Make("after.tif", {.value = [](int, int, int) { return 3.0; }});
  ExpectDone("single before.tif after.tif out/o.tif --tile 16");
  const std::vector<double> values = Values("out/o.tif");
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x)
      ASSERT_EQ(std::isnan(values[At(x, y)]), BeforeHole(x, y)) << x << " " << y;
  EXPECT_EQ(values[At(1, 0)], 0.0);
}

TEST_F(Change, ABandThatIsNotComparedMasksNothing) {
  const auto value = [](int x, int y, int b) { return b == 2 ? 255.0 : Before(x, y, b); };
  Make("before.tif", {.bands = 2, .type = GDT_Byte, .value = value, .noData = 255.0});
  Make("after.tif", {.bands = 2, .type = GDT_Byte, .value = After});
  ExpectDone("difference before.tif after.tif out/d.tif --bands 1");
  EXPECT_EQ(Values("out/d.tif")[0], After(0, 0, 1) - Before(0, 0, 1));
}

TEST_F(Change, NaNIsNoDataWithoutBeingDeclared) {
  Make("before.tif", {.value = [](int x, int, int) { return x == 3 ? std::nan("") : 1.0; }});
  Make("after.tif", {.value = [](int x, int, int) { return x == 5 ? std::nan("") : 4.0; }});
  ExpectDone("magnitude before.tif after.tif out/m.tif --type Int16");
  const std::vector<double> values = Values("out/m.tif", 3);
  for (int x = 0; x < width; ++x) EXPECT_EQ(values[At(x, 0)], x == 3 || x == 5 ? -32768.0 : 3.0) << x;
}

TEST_F(Change, AnExcludedValueLeavesOutTheBandOfThePixel) {
  MakeDates(2);
  ExpectDone("difference before.tif after.tif out/d.tif --exclude 50,60");
  ExpectDone("ratio before.tif after.tif out/r.tif --exclude 50,60");
  for (const int band : {1, 2}) {
    int excluded = 0;
    const std::vector<double> difference = Values("out/d.tif", band), ratio = Values("out/r.tif", band);
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        const bool out = Before(x, y, band) == 50.0 || After(x, y, band) == 60.0;
        ASSERT_EQ(std::isnan(difference[At(x, y)]), out);
        ASSERT_EQ(std::isnan(ratio[At(x, y)]), out);
        excluded += out ? 1 : 0;
      }
    }
    EXPECT_GT(excluded, 0);
  }
}

TEST_F(Change, AnExcludedValueLeavesOutThePixelOfTheOthers) {
  MakeDates(4, GDT_Int16);
  for (const std::string task :
       {"magnitude", "greenness --sensor QuickBird", "brightness --sensor QuickBird"}) {
    ExpectDone(task + " before.tif after.tif out/o.tif --exclude 50 --type Int32");
    int excluded = 0;
    for (const int channel : {1, 2, 3}) {
      const std::vector<double> values = Values("out/o.tif", channel);
      for (int y = 0; y < height; ++y) {
        for (int x = 0; x < width; ++x) {
          bool out = false;
          for (int band = 1; band <= 4; ++band)
            out = out || Before(x, y, band) == 50.0 || After(x, y, band) == 50.0;
          ASSERT_EQ(values[At(x, y)] == -2147483648.0, out) << task;
          excluded += out ? 1 : 0;
        }
      }
    }
    EXPECT_GT(excluded, 0);
    EXPECT_EQ(NoDataOf("out/o.tif", 3), -2147483648.0);
  }
}

TEST_F(Change, IntegerTypesHoldEveryDifference) {
  const auto low = [](int x, int, int) { return x == 0 ? 0.0 : 65535.0; };
  const auto high = [](int x, int, int) { return x == 0 ? 65535.0 : x == 1 ? 0.0 : 32767.0; };
  Make("before.tif", {.type = GDT_UInt16, .value = low});
  Make("after.tif", {.type = GDT_UInt16, .value = high});
  ExpectDone("difference before.tif after.tif out/d.tif --type Int32");
  EXPECT_EQ(Values("out/d.tif")[0], 65535.0);
  EXPECT_EQ(Values("out/d.tif")[1], -65535.0);
  EXPECT_EQ(Values("out/d.tif")[2], -32768.0);  // a difference like others, and not the no-data value
  EXPECT_NE(NoDataOf("out/d.tif"), -32768.0);
  ExpectDone("difference before.tif after.tif out/stated.tif --type Int32 --nodata -1000000");
  EXPECT_EQ(NoDataOf("out/stated.tif"), -1000000.0);
}

TEST_F(Change, UnlikeTypesAreReadInOneThatHoldsBoth) {
  const std::vector<GDALDataType> types = {GDT_Byte,   GDT_UInt16,   GDT_Int16,   GDT_UInt32,  GDT_Int32,
                                           GDT_UInt64, GDT_Int64,    GDT_Float32, GDT_Float64, GDT_CInt16,
                                           GDT_CInt32, GDT_CFloat32, GDT_CFloat64};
  Make("after.tif", {.type = GDT_Byte, .value = After});
  for (const GDALDataType type : types) {
    Make("before.tif", {.type = type, .value = Before});
    for (const std::string task : {"difference", "ratio", "magnitude"}) {
      ExpectDone(task + " before.tif after.tif out/o.tif");
      const double a = After(7, 3, 1), b = Before(7, 3, 1);
      EXPECT_EQ(Values("out/o.tif", task == "magnitude" ? 3 : 1)[At(7, 3)],
                task == "ratio" ? static_cast<float>(a / b) : a - b)
          << GDALGetDataTypeName(type) << " " << task;
    }
  }
}

TEST_F(Change, TilesOfAnySizeGiveTheSameOutput) {
  Make("before.tif", {.bands = 6, .type = GDT_Byte, .value = Before, .noData = 50.0});
  Make("after.tif", {.bands = 6, .type = GDT_Byte, .value = After, .noData = 60.0});
  for (const std::string task : {"difference", "single", "ratio", "intensity", "magnitude", "combine",
                                 "greenness --sensor 'Landsat-7 ETM+'"}) {
    ExpectDone(task + " before.tif after.tif out/whole.tif");
    for (const int side : {1, 7, 64}) {
      ExpectDone(task + " before.tif after.tif out/tiled.tif --tile " + std::to_string(side));
      for (int band = 1; band <= Open("out/whole.tif")->GetRasterCount(); ++band) {
        const std::vector<double> whole = Values("out/whole.tif", band),
                                  tiled = Values("out/tiled.tif", band);
        for (std::size_t i = 0; i < whole.size(); ++i)
          ASSERT_TRUE(whole[i] == tiled[i] || (std::isnan(whole[i]) && std::isnan(tiled[i]))) << task << side;
      }
    }
  }
}

TEST_F(Change, RastersOnUnlikeGridsAreRefused) {
  MakeDates(1);
  const std::string task = "difference before.tif other.tif out/d.tif";
  Make("other.tif", {.width = 82, .type = GDT_Byte});
  ExpectRefused(CHANGE, task,
                "AFTER: 'other.tif' has 82 x 61 pixels; expected 83 x 61 as in BEFORE 'before.tif'");
  Make("other.tif", {.transform = {500015.0, 30.0, 0.0, 4600000.0, 0.0, -25.0}});
  ExpectRefused(CHANGE, task, "AFTER: 'other.tif' lies up to 0.6 pixels beside BEFORE 'before.tif'");
  Make("other.tif", {.transform = {500000.0, 30.1, 0.0, 4600000.0, 0.0, -25.0}});
  ExpectRefused(CHANGE, task, "AFTER: 'other.tif' lies up to 0.332 pixels beside BEFORE");
  Make("other.tif", {.transform = {}});
  ExpectRefused(CHANGE, task, "AFTER: 'other.tif' has no georeference");
  Make("other.tif", {.epsg = 32634});
  ExpectRefused(CHANGE, task,
                "AFTER: 'other.tif' is in WGS 84 / UTM zone 34N; expected WGS 84 / UTM zone 33N");
}

TEST_F(Change, AGridMayBeOffByAThousandthOfAPixel) {
  MakeDates(1);
  Make("after.tif", {.transform = {500000.03, 30.0, 0.0, 4600000.0, 0.0, -25.0}, .epsg = 0});
  ExpectDone("difference before.tif after.tif out/d.tif");
  ASSERT_NE(Open("out/d.tif")->GetSpatialRef(), nullptr);  // of BEFORE, as AFTER has none
}

TEST_F(Change, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  MakeDates(2);
  Make("three.tif", {.bands = 3, .type = GDT_Byte});
  Make("float.tif", {.bands = 2});
  Make("wide.tif", {.bands = 2, .type = GDT_UInt16});
  const std::string dates = " before.tif after.tif out/o.tif";
  ExpectRefused(CHANGE, "difference missing.tif after.tif out/o.tif", "BEFORE: missing.tif");
  ExpectRefused(CHANGE, "difference before.tif missing.tif out/o.tif", "AFTER: missing.tif");
  ExpectRefused(CHANGE, "ratio before.tif three.tif out/o.tif",
                "AFTER: 3 bands are to be compared with 2 of BEFORE");
  ExpectRefused(CHANGE, "ratio before.tif three.tif out/o.tif --bands 3",
                "--bands: there is no band 3 in BEFORE");
  ExpectRefused(CHANGE, "magnitude" + dates + " --bands 1,3", "--bands: there is no band 3 in AFTER");
  ExpectRefused(CHANGE, "ratio" + dates + " --bands 1,2 --before-bands 1",
                "--before-bands: 2 bands are to be compared with 1 of BEFORE");
  ExpectRefused(CHANGE, "ratio" + dates + " --bands 1,2 --before-bands 3,1",
                "--before-bands: there is no band 3 in BEFORE");
  ExpectRefused(CHANGE, "ratio" + dates + " --bands 1 --show 2",
                "--show: band 2 is not compared; expected one of 1");
  ExpectRefused(CHANGE, "single" + dates + " --bands 3", "--bands: there is no band 3 in AFTER");
  ExpectRefused(CHANGE, "combine" + dates + " --show 1,2,5",
                "--show: there is no band 5 in OUTPUT; expected a band from 1 to 4");
  ExpectRefused(CHANGE, "combine" + dates + " --show 1,2", "--show: two bands make no picture");
  ExpectRefused(CHANGE, "intensity before.tif three.tif out/o.tif",
                "AFTER: 3 bands are to be compared with 2 of BEFORE");
  ExpectRefused(CHANGE, "single before.tif float.tif out/o.tif --type Int16",
                "--type: differences of Float32 do not fit into Int16");
  ExpectRefused(CHANGE, "ratio" + dates + " --type Int16", "--type: 'Int16'");
  ExpectRefused(CHANGE, "magnitude" + dates + " --type Byte", "--type: 'Byte'");
  ExpectRefused(CHANGE, "difference before.tif float.tif out/o.tif --type Int32",
                "--type: differences of Float32 do not fit into Int32");
  ExpectRefused(CHANGE, "difference before.tif wide.tif out/o.tif --type Int16",
                "--type: differences of UInt16 do not fit into Int16; expected Int32");
  ExpectRefused(CHANGE, "difference" + dates + " --type Int16 --nodata nan", "--nodata: nan");
  ExpectRefused(CHANGE, "difference" + dates + " --exclude 1e300", "--exclude: '1e300'");
  ExpectRefused(CHANGE, "difference" + dates + " --tile 0", "--tile: '0'");
  ExpectRefused(CHANGE, "difference before.tif after.tif out/o.img", "OUTPUT: 'out/o.img'");
  ExpectRefused(CHANGE, "difference" + dates + " --png out/o.jpg", "--png: 'out/o.jpg'");
  ExpectRefused(CHANGE, "difference before.tif after.tif none/o.tif",
                "OUTPUT: cannot write to folder 'none'");
  EXPECT_EQ(Run(CHANGE, "difference before.tif after.tif").status, 2);
  EXPECT_EQ(Run(CHANGE, "other" + dates).status, 2);
  EXPECT_EQ(Run(CHANGE, "single" + dates + " --exclude 1").status, 2);
  EXPECT_EQ(Run(CHANGE, "single" + dates + " --bands 1,2").status, 2);
  EXPECT_EQ(Run(CHANGE, "combine" + dates + " --exclude 1").status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Change, SensorsAndTheirBandsAreChecked) {
  MakeDates(5);
  const std::string task = "greenness before.tif after.tif out/o.tif";
  const std::string names =
      "expected one of Landsat-4 MSS, Landsat-5 MSS, Landsat-4 TM, Landsat-5 TM, Landsat-7 ETM+, Ikonos, "
      "QuickBird";
  ExpectRefused(CHANGE, task, "--sensor: is missing; " + names);
  ExpectRefused(CHANGE, task + " --sensor 'Landsat-5 tm'",
                "--sensor: 'Landsat-5 tm' is not usable; " + names);
  ExpectRefused(CHANGE, task + " --sensor Ikonos --before-sensor Spot",
                "--before-sensor: 'Spot' is not usable; " + names);
  ExpectRefused(CHANGE, task + " --sensor 'Landsat-5 TM'",
                "AFTER: has 5 bands that are not alpha; expected the 6 bands of Landsat-5 TM");
  ExpectRefused(CHANGE, task + " --sensor Ikonos",
                "AFTER: has 5 bands that are not alpha; expected the 4 bands of Ikonos");
  ExpectRefused(CHANGE, task + " --sensor Ikonos --bands 1,2,3", "--bands: 3 bands for AFTER");
  ExpectRefused(CHANGE, task + " --sensor Ikonos --bands 1,2,3,4 --before-bands 1",
                "--before-bands: 1 bands for BEFORE");
}

TEST_F(Change, SignedBytesAreReadAsSuchOrRefused) {
  GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("GTiff");
  const char* const options[] = {"PIXELTYPE=SIGNEDBYTE", nullptr};
  for (const auto& [name, value] :
       {std::pair<std::string, unsigned char>{"before.tif", 10}, {"after.tif", 246}}) {
    const DatasetPtr dataset(
        driver->Create(Path(name).c_str(), width, height, 1, GDT_Byte, const_cast<char**>(options)));
    std::vector<unsigned char> samples(width * height, value);  // 246 is -10
    ASSERT_EQ(dataset->GetRasterBand(1)->RasterIO(GF_Write, 0, 0, width, height, samples.data(), width,
                                                  height, GDT_Byte, 0, 0, nullptr),
              CE_None);
  }
  Make("unsigned.tif", {.type = GDT_Byte, .transform = {}, .epsg = 0});
  ExpectRefused(CHANGE, "ratio before.tif after.tif out/o.tif", "BEFORE: has signed bytes");
  ExpectRefused(CHANGE, "difference before.tif unsigned.tif out/o.tif",
                "AFTER: only one of the dates has signed bytes");
  ExpectDone("difference before.tif after.tif out/d.tif");
  EXPECT_EQ(Values("out/d.tif")[0], -20.0);
}

TEST_F(Change, TheInputsAreNeverOverwritten) {
  MakeDates(1);
  fs::create_symlink("after.tif", Path("link.tif"));
  std::ofstream(Path("stack.vrt"))
      << "<VRTDataset rasterXSize=\"83\" rasterYSize=\"61\"><GeoTransform>500000, 30, 0, 4600000, 0, "
         "-25</GeoTransform>"
         "<VRTRasterBand dataType=\"Byte\" band=\"1\"><SimpleSource><SourceFilename "
         "relativeToVRT=\"1\">before.tif"
         "</SourceFilename></SimpleSource></VRTRasterBand></VRTDataset>";
  const std::string before = ReadText(Path("before.tif")), after = ReadText(Path("after.tif"));
  for (const std::string output : {"before.tif", "after.tif", "./out/../after.tif", "link.tif"})
    ExpectRefused(CHANGE, "ratio before.tif after.tif " + output, "OUTPUT: '" + output + "'");
  ExpectRefused(CHANGE, "ratio stack.vrt after.tif before.tif", "OUTPUT: 'before.tif'");
  EXPECT_TRUE(ReadText(Path("before.tif")) == before);
  EXPECT_TRUE(ReadText(Path("after.tif")) == after);
}

TEST_F(Change, ADateThatBreaksOffLeavesTheOldOutput) {
  Make("before.tif", {.width = 400, .height = 400});
  Make("after.tif", {.width = 400, .height = 400});
  fs::resize_file(Path("after.tif"), 300000);
  std::ofstream(Path("out/o.tif")) << "the old file\n";
  const Outcome outcome = Run(CHANGE, "magnitude before.tif after.tif out/o.tif --png out/o.png");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_NE(outcome.errors.find("reading AFTER"), std::string::npos) << outcome.errors;
  EXPECT_EQ(ReadText(Path("out/o.tif")), "the old file\n");
  EXPECT_EQ(Outputs().size(), 1u);
}

// Red, green, blue and alpha of the picture where the map shows a pixel. Without a transparent pixel it has
// no alpha. The map begins at (24, 76) and is
// enlarged by 10.
std::array<int, 4> ColourAt(GDALDataset& picture, int x, int y) {
  std::array<int, 4> colour = {0, 0, 0, 255};
  for (int band = 1; band <= picture.GetRasterCount(); ++band)
    EXPECT_EQ(picture.GetRasterBand(band)->RasterIO(GF_Read, 24 + 10 * x + 5, 76 + 10 * y + 5, 1, 1,
                                                    &colour[static_cast<std::size_t>(band) - 1], 1, 1,
                                                    GDT_Int32, 0, 0, nullptr),
              CE_None);
  return colour;
}

// Three columns of brown, teal and grey, in this order, and a transparent one.
void ExpectDiverging(GDALDataset& picture) {
  const std::array<int, 4> down = ColourAt(picture, 10, 30), up = ColourAt(picture, 40, 30);
  const std::array<int, 4> level = ColourAt(picture, 60, 30), none = ColourAt(picture, 80, 30);
  EXPECT_GT(down[0], down[2] + 50);
  EXPECT_GT(up[2], up[0] + 50);
  EXPECT_NEAR(level[0], level[2], 3);
  EXPECT_GT(level[0], 200);
  EXPECT_LT(level[0], 245) << "no colour of the map may be taken for white paper";
  const auto luminance = [](const std::array<int, 4>& c) { return 0.21 * c[0] + 0.72 * c[1] + 0.07 * c[2]; };
  EXPECT_NEAR(luminance(down), luminance(up), 15.0);
  EXPECT_EQ(none[3], 0);
  EXPECT_EQ(level[3], 255);
}

TEST_F(Change, ThePictureDivergesFromNoChange) {
  const auto step = [](int x) { return x < 25 ? 0 : x < 50 ? 1 : x < 75 ? 2 : 3; };
  Make("before.tif", {.bands = 2, .type = GDT_Byte, .value = [](int, int, int) { return 40.0; }});
  Make("after.tif", {.bands = 2,
                     .type = GDT_Byte,
                     .value =
                         [=](int x, int, int) {
                           return std::array{20.0, 80.0, 40.0, 255.0}[static_cast<std::size_t>(step(x))];
                         },
                     .noData = 255.0});
  ExpectDone("ratio before.tif after.tif out/o.tif --png out/o.png");
  ExpectDiverging(*Open("out/o.png"));
  Make("after.tif", {.bands = 2,
                     .type = GDT_Byte,
                     .value =
                         [=](int x, int, int) {
                           return std::array{20.0, 60.0, 40.0, 255.0}[static_cast<std::size_t>(step(x))];
                         },
                     .noData = 255.0});
  for (const std::string task : {"difference", "single", "magnitude"}) {
    ExpectDone(task + " before.tif after.tif out/o.tif --png out/" + task + ".png");
    ExpectDiverging(*Open("out/" + task + ".png"));
  }
}

TEST_F(Change, ACombinationShowsTwoDatesAsColours) {
  // Half of the columns are brighter after.
  Make("before.tif", {.type = GDT_Byte, .value = [](int, int y, int) { return 2.0 * y; }});
  Make("after.tif",
       {.type = GDT_Byte, .value = [](int x, int y, int) { return x < 40 ? 250.0 - y : 2.0 * y; }});
  const Outcome outcome = Run(CHANGE, "combine before.tif after.tif out/c.tif --show 1,2,2 --png out/c.png");
  ASSERT_EQ(outcome.status, 0) << outcome.errors;
  EXPECT_NE(outcome.output.find("Combination, 2 bands, 83 x 61 Float32"), std::string::npos)
      << outcome.output;
  const std::array<int, 4> brighter = ColourAt(*Open("out/c.png"), 10, 10);
  EXPECT_GT(brighter[0], brighter[1] + 100);
  EXPECT_EQ(brighter[1], brighter[2]);
}

TEST_F(Change, FiguresAndPictureAreThoseOfTheBandToShow) {
  Make("before.tif", {.bands = 2, .type = GDT_Byte, .value = [](int, int, int) { return 40.0; }});
  Make("after.tif",
       {.bands = 2, .type = GDT_Byte, .value = [](int, int, int b) { return b == 1 ? 30.0 : 60.0; }});
  const Outcome first = Run(CHANGE, "difference before.tif after.tif out/o.tif --png out/1.png");
  EXPECT_NE(first.output.find("difference of band 1 (band 1 of 2), 83 x 61 Float32, min -10.00, mean -10.00"),
            std::string::npos)
      << first.output;
  const Outcome second = Run(CHANGE, "difference before.tif after.tif out/o.tif --png out/2.png --show 2");
  EXPECT_NE(second.output.find("difference of band 2 (band 2 of 2), 83 x 61 Float32, min 20.00, mean 20.00"),
            std::string::npos)
      << second.output;
  const std::array<int, 4> down = ColourAt(*Open("out/1.png"), 40, 30),
                           up = ColourAt(*Open("out/2.png"), 40, 30);
  EXPECT_GT(down[0], down[2]);
  EXPECT_GT(up[2], up[0]);
}

TEST_F(Change, GeoreferenceIsPreserved) {
  MakeDates(1);
  ExpectDone("difference before.tif after.tif out/o.tif");
  double transform[6];
  ASSERT_EQ(Open("out/o.tif")->GetGeoTransform(transform), CE_None);
  EXPECT_EQ(transform[0], 500000.0);
  EXPECT_EQ(transform[5], -25.0);
  EXPECT_TRUE(Open("out/o.tif")->GetSpatialRef()->IsSame(Open("before.tif")->GetSpatialRef()));
}

TEST_F(Change, HelpSaysWhatTheSignMeans) {
  for (const std::string task :
       {"difference", "ratio", "intensity", "magnitude", "greenness", "brightness"}) {
    const Outcome outcome = Run(CHANGE, task + " --help");
    EXPECT_EQ(outcome.status, 0);
    for (const std::string word :
         {"Positive is an increase from BEFORE to AFTER", "--exclude", "Exit status"})
      EXPECT_NE(outcome.output.find(word), std::string::npos) << task << ": " << word;
  }
}

}  // namespace
