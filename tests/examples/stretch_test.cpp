// The program of the contrast stretches, run as a user runs it, on rasters that the tests make.

#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

double Count(int x, int y, int band) { return 20 + (x * 7 + y * 3 + band * 11) % (90 + band); }

std::vector<double> Samples(double (*value)(int, int, int), int band) {
  std::vector<double> samples;
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) samples.push_back(value(x, y, band));
  return samples;
}

// The percentage of the samples below `value`.
double ShareBelow(const std::vector<double>& samples, double value) {
  const auto below = std::count_if(samples.begin(), samples.end(), [&](double v) { return v < value; });
  return 100.0 * static_cast<double>(below) / static_cast<double>(samples.size());
}

class Stretch : public ExamplesFixture {
 protected:
  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(STRETCH, arguments); }
};

TEST_F(Stretch, ThePercentileOfWholeNumbersIsTheShareBelow) {
  for (const GDALDataType type : {GDT_Byte, GDT_UInt16, GDT_Int16, GDT_Int32, GDT_Int64, GDT_CInt16}) {
    Make("scene.tif", {.bands = 2, .type = type, .value = Count});
    ExpectDone("percentile scene.tif out/o.tif");
    for (const int band : {1, 2}) {
      const std::vector<double> samples = Samples(Count, band), values = Values("out/o.tif", band);
      for (std::size_t i = 0; i < samples.size(); i += 7)
        ASSERT_NEAR(values[i], ShareBelow(samples, samples[i]), 1e-4) << GDALGetDataTypeName(type);
    }
  }
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(2)->GetDescription(), "percentile of band 2");
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(2)->GetUnitType(), "percent");
}

TEST_F(Stretch, ThePercentileOfFloatsIsNearTheShareBelow) {
  const auto value = [](int x, int y, int) { return std::fmod(x * 0.37 + y * 0.11, 5.0) * 0.2; };
  Make("scene.tif", {.value = value});
  ExpectDone("percentile scene.tif out/o.tif --bins 50");
  const std::vector<double> samples = Samples(+value, 1), values = Values("out/o.tif");
  double lowest = 1e9, highest = -1e9;
  for (std::size_t i = 0; i < samples.size(); i += 7) {
    ASSERT_NEAR(values[i], ShareBelow(samples, samples[i]), 2.5);  // a bin holds about 2 percent
    lowest = std::min(lowest, values[i]);
    highest = std::max(highest, values[i]);
  }
  EXPECT_LT(lowest, 3.0);
  EXPECT_GT(highest, 97.0);
}

TEST_F(Stretch, FewerBinsThanValuesAreLaidOverTheRange) {
  Make("scene.tif", {.type = GDT_Int16, .value = [](int x, int y, int) { return x * 100.0 + y; }});
  ExpectDone("percentile scene.tif out/o.tif --bins 40");
  const std::vector<double> values = Values("out/o.tif");
  EXPECT_EQ(values.front(), 0.0);
  EXPECT_EQ(values.back(), 100.0);
  EXPECT_NEAR(values[30 * width + 41], 50.0, 3.0);
}

TEST_F(Stretch, ARangeFromTheLeastToTheGreatestSample) {
  Make("scene.tif", {.bands = 2, .type = GDT_Byte, .value = Count});
  ExpectDone("normalize scene.tif out/o.tif");
  ExpectDone("normalize scene.tif out/b.tif --type Byte");
  for (const int band : {1, 2}) {
    const std::vector<double> samples = Samples(Count, band), values = Values("out/o.tif", band),
                              bytes = Values("out/b.tif", band);
    const auto [min, max] = std::minmax_element(samples.begin(), samples.end());
    for (std::size_t i = 0; i < samples.size(); ++i) {
      const double expected = 100.0 * (samples[i] - *min) / (*max - *min);
      ASSERT_NEAR(values[i], expected, 1e-5);
      ASSERT_NEAR(bytes[i], expected, 0.5001);
      ASSERT_EQ(bytes[i], std::floor(bytes[i]));
    }
  }
}

TEST_F(Stretch, TailsAreCutOffByTheSharesOfTheSamples) {
  // 100 columns of the values 0 to 99: with 10 percent cut off, 10 is the bottom and 89 the top.
  Make("scene.tif", {.width = 100, .height = 10, .type = GDT_Byte, .value = [](int x, int, int) {
                       return static_cast<double>(x);
                     }});
  ExpectDone("normalize scene.tif out/o.tif --cut 10");
  const std::vector<double> values = Values("out/o.tif");
  for (int x = 0; x < 100; ++x)
    ASSERT_NEAR(values[static_cast<std::size_t>(x)], std::clamp((x - 10) * 100.0 / 79.0, 0.0, 100.0), 1e-4)
        << x;
  ExpectDone("normalize scene.tif out/p.tif --cut 0");
  EXPECT_NEAR(Values("out/p.tif")[10], 10 * 100.0 / 99.0, 1e-4);
}

TEST_F(Stretch, AZeroIsASampleLikeOthers) {
  const auto value = [](int x, int, int) { return x < 10 ? -20.0 : x < 20 ? 0.0 : 20.0; };
  Make("scene.tif", {.type = GDT_Int16, .value = value});
  ExpectDone("normalize scene.tif out/n.tif");
  EXPECT_EQ(Values("out/n.tif")[15], 50.0);
  ExpectDone("percentile scene.tif out/p.tif");
  EXPECT_NEAR(Values("out/p.tif")[15], 100.0 * 10 / width, 1e-4);
}

bool Hole(int x, int y) { return (x + 2 * y) % 19 == 0; }

TEST_F(Stretch, NoDataCountsInNoStatistics) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) && b == 2 ? 255.0 : Count(x, y, b); };
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = value, .noData = 255.0});
  for (const std::string task : {"percentile", "normalize"}) {
    for (const std::string type : {"Float32", "Byte", "Int16"}) {
      ExpectDone(task + " scene.tif out/o.tif --type " + type);
      const double noData = type == "Byte" ? 255.0 : -32768.0;
      for (const int band : {1, 2, 3}) {
        std::vector<double> samples;
        for (int y = 0; y < height; ++y)
          for (int x = 0; x < width; ++x)
            if (!Hole(x, y)) samples.push_back(Count(x, y, band));
        const auto [min, max] = std::minmax_element(samples.begin(), samples.end());
        const std::vector<double> values = Values("out/o.tif", band);
        std::size_t i = 0;
        for (int y = 0; y < height; ++y) {
          for (int x = 0; x < width; ++x, ++i) {
            if (Hole(x, y)) {
              ASSERT_TRUE(type == "Float32" ? std::isnan(values[i]) : values[i] == noData) << values[i];
            } else if (i % 7 == 0) {
              const double v = Count(x, y, band);
              const double expected =
                  task == "percentile" ? ShareBelow(samples, v) : 100.0 * (v - *min) / (*max - *min);
              ASSERT_NEAR(values[i], expected, type == "Float32" ? 1e-4 : 0.5001);
            }
          }
        }
      }
    }
  }
}

TEST_F(Stretch, InfinitiesCountInNoStatistics) {
  const auto value = [](int x, int y, int) {
    return x == 3 && y == 0 ? HUGE_VAL : x == 4 && y == 0 ? -HUGE_VAL : x * 0.5;
  };
  Make("scene.tif", {.value = value});
  ExpectDone("normalize scene.tif out/o.tif");
  const std::vector<double> values = Values("out/o.tif");
  EXPECT_EQ(values[3], 100.0);
  EXPECT_EQ(values[4], 0.0);
  EXPECT_EQ(values[41], 50.0);
}

TEST_F(Stretch, ALevelBandIsZero) {
  Make("scene.tif", {.type = GDT_Byte, .value = [](int, int, int) { return 7.0; }});
  for (const std::string task : {"percentile", "normalize", "normalize --cut 2"}) {
    ExpectDone(task + " scene.tif out/o.tif");
    EXPECT_EQ(Values("out/o.tif")[5], 0.0) << task;
  }
}

TEST_F(Stretch, CountsBeyondTheOperatorsRangeAreReduced) {
  // One bin of 24 million samples and one of 8: 2147483648 / 100 is the most that the operator can take.
  Make("large.tif", {.width = 8000, .height = 4000, .type = GDT_Byte, .value = [](int x, int, int) {
                       return x < 6000 ? 5.0 : 9.0;
                     }});
  ExpectDone("percentile large.tif out/o.tif --type Byte --tile 4000");
  const DatasetPtr out = Open("out/o.tif");
  int low = -1, high = -1;
  ASSERT_EQ(out->GetRasterBand(1)->RasterIO(GF_Read, 10, 10, 1, 1, &low, 1, 1, GDT_Int32, 0, 0, nullptr),
            CE_None);
  ASSERT_EQ(out->GetRasterBand(1)->RasterIO(GF_Read, 7000, 10, 1, 1, &high, 1, 1, GDT_Int32, 0, 0, nullptr),
            CE_None);
  EXPECT_EQ(low, 0);
  EXPECT_EQ(high, 75);
}

TEST_F(Stretch, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = Count, .noData = 50.0});
  Make("float.tif", {.value = [](int x, int y, int) { return std::sin(x * 0.1) * y; }});
  for (const std::string task : {"percentile", "normalize", "normalize --cut 3"}) {
    ExpectTilesGiveTheSameBits(STRETCH, task + " scene.tif");
    ExpectTilesGiveTheSameBits(STRETCH, task + " float.tif");
  }
}

TEST_F(Stretch, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = Count});
  Make("empty.tif",
       {.bands = 2, .type = GDT_Byte, .value = [](int, int, int) { return 9.0; }, .noData = 9.0});
  const std::string files = " scene.tif out/o.tif";
  for (const std::string task : {"percentile", "normalize"}) {
    ExpectRefused(STRETCH, task + " missing.tif out/o.tif", "INPUT: missing.tif");
    ExpectRefused(STRETCH, task + " empty.tif out/o.tif", "INPUT: band 1 has no valid pixel; expected");
    ExpectRefused(STRETCH, task + files + " --bins 0", "--bins: '0' is not usable; expected a whole number");
    ExpectRefused(STRETCH, task + files + " --bands 4", "--bands: there is no band 4");
    ExpectRefused(STRETCH, task + files + " --show 4", "--show: band 4 is not stretched; expected one of");
    ExpectRefused(STRETCH, task + files + " --show 1,2", "--show: two bands make no picture; expected three");
    ExpectRefused(STRETCH, task + files + " --bands 1,2 --show 3", "--show: band 3 is not stretched");
    ExpectRefused(STRETCH, task + files + " --type Float16", "--type: 'Float16'");
    ExpectRefused(STRETCH, task + files + " --type Byte --nodata -1", "--nodata: -1");
    ExpectRefused(STRETCH, task + files + " --tile 0", "--tile: '0'");
    ExpectRefused(STRETCH, task + " scene.tif out/o.img", "OUTPUT: 'out/o.img'");
    ExpectRefused(STRETCH, task + " scene.tif scene.tif", "OUTPUT: 'scene.tif' is also");
    ExpectRefused(STRETCH, task + files + " --png out/o.jpg", "--png: 'out/o.jpg'");
  }
  ExpectRefused(STRETCH, "normalize" + files + " --cut 50", "--cut: '50' is not usable; expected a number");
  ExpectRefused(STRETCH, "normalize" + files + " --cut -1", "--cut: '-1' is not usable; expected a number");
  EXPECT_EQ(Run(STRETCH, "percentile" + files + " --cut 1").status, 2);
  EXPECT_EQ(Run(STRETCH, "other" + files).status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Stretch, ThreeBandsAreRedGreenAndBlue) {
  const auto value = [](int x, int, int band) { return x / 21 == band || x < 2 ? 90.0 : 10.0; };
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = value});
  const Outcome outcome = Run(STRETCH, "normalize scene.tif out/o.tif --show 2,1,3 --png out/o.png");
  ASSERT_EQ(outcome.status, 0) << outcome.errors;
  EXPECT_EQ(outcome.errors, "statistics: 1 tile\nshare of range: 1 tile\n");
  EXPECT_NE(outcome.output.find("out/o.tif: share of range, 3 bands, 83 x 61 Float32, in "),
            std::string::npos);
  const DatasetPtr picture = Open("out/o.png");
  ASSERT_TRUE(picture);
  const auto colour = [&](int x) {
    std::vector<int> parts(3);
    for (int band = 1; band <= 3; ++band)
      EXPECT_EQ(picture->GetRasterBand(band)->RasterIO(GF_Read, 24 + 10 * x + 5, 76 + 305, 1, 1,
                                                       &parts[static_cast<std::size_t>(band) - 1], 1, 1,
                                                       GDT_Int32, 0, 0, nullptr),
                CE_None);
    return parts;
  };
  EXPECT_EQ(colour(1), (std::vector<int>{255, 255, 255}));
  EXPECT_EQ(colour(10), (std::vector<int>{0, 0, 0}));
  EXPECT_EQ(colour(30), (std::vector<int>{0, 255, 0}));  // band 1
  EXPECT_EQ(colour(50), (std::vector<int>{255, 0, 0}));  // band 2
  EXPECT_EQ(colour(70), (std::vector<int>{0, 0, 255}));  // band 3
}

TEST_F(Stretch, GeoreferenceIsPreserved) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectDone("percentile scene.tif out/o.tif");
  double transform[6];
  ASSERT_EQ(Open("out/o.tif")->GetGeoTransform(transform), CE_None);
  EXPECT_EQ(transform[3], 4600000.0);
  EXPECT_TRUE(Open("out/o.tif")->GetSpatialRef()->IsSame(Open("scene.tif")->GetSpatialRef()));
}

TEST_F(Stretch, HelpSaysWhatIsCounted) {
  for (const std::string task : {"percentile", "normalize"}) {
    const Outcome outcome = Run(STRETCH, task + " --help");
    EXPECT_EQ(outcome.status, 0);
    for (const std::string word :
         {"--bins", "--show", "statistics are those of the valid pixels", "Exit status"})
      EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
  }
}

}  // namespace
