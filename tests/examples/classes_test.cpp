// The program of the class map, run as a user runs it, on rasters that the tests make.

#include <cmath>
#include <functional>
#include <limits>
#include <sstream>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

double Count(int x, int y, int band) { return (x * 7 + y * 3 + band * 11) % 100; }

// The number of breaks that are not above the sample, and 1.
int ClassByBreaks(const std::vector<double>& breaks, double sample) {
  int number = 1;
  for (const double value : breaks) number += sample >= value ? 1 : 0;
  return number;
}

// The numbers 1, 2, ... up to `last`, each times `step`.
std::string Numbers(int last, int step) {
  std::ostringstream text;
  for (int i = 1; i <= last; ++i) text << (i > 1 ? "," : "") << i * step;
  return text.str();
}

class Classes : public ExamplesFixture {
 protected:
  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(CLASSES, arguments); }

  void ExpectClasses(const std::string& options, const std::function<double(double)>& expected,
                     int band = 1) const {
    ExpectDone("scene.tif out/o.tif " + options);
    const std::vector<double> values = Values("out/o.tif");
    std::size_t i = 0;
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x, ++i)
        ASSERT_EQ(values[i], expected(Count(x, y, band))) << options << " " << x << " " << y;
  }
};

TEST_F(Classes, ABreakBelongsToTheClassAboveIt) {
  for (const GDALDataType type :
       {GDT_Byte, GDT_UInt16, GDT_Int16, GDT_UInt32, GDT_Int32, GDT_UInt64, GDT_Int64, GDT_Float32,
        GDT_Float64, GDT_CInt16, GDT_CInt32, GDT_CFloat32, GDT_CFloat64}) {
    Make("scene.tif", {.type = type, .value = Count});
    ExpectClasses("--breaks 0,20,33.5,70", [](double v) { return ClassByBreaks({0, 20, 33.5, 70}, v); });
  }
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), GDT_Byte);
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetNoDataValue(), 0.0);
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "classes of band 1");
}

TEST_F(Classes, TheNumberBelowABreakIsInTheClassBelow) {
  const auto value = [](int x, int, int) {
    const float at = 12.5f, low = 0.0f;
    const float values[] = {std::nextafter(at, 0.0f), at, std::nextafter(at, 99.0f),
                            std::nextafter(low, -1.0f), low};
    return static_cast<double>(values[x % 5]);
  };
  Make("scene.tif", {.value = value});
  ExpectDone("scene.tif out/o.tif --breaks 0,12.5");
  const std::vector<double> values = Values("out/o.tif");
  EXPECT_EQ(std::vector<double>(values.begin(), values.begin() + 5), (std::vector<double>{2, 3, 3, 1, 2}));
}

TEST_F(Classes, RangesMayHaveGapsAndOverlapAndOpenEnds) {
  Make("scene.tif", {.bands = 2, .type = GDT_Int16, .value = Count});
  ExpectClasses("--ranges 10:20,30:40", [](double v) {
    return v >= 10 && v < 20 ? 1.0 : v >= 30 && v < 40 ? 2.0 : 0.0;
  });
  ExpectClasses(
      "--ranges :50,20:60,90: --band 2",
      [](double v) { return v >= 90             ? 3.0
                            : v >= 20 && v < 60 ? 2.0
                            : v < 50            ? 1.0
                                                : 0.0; }, 2);
  ExpectClasses("--ranges :", [](double) { return 1.0; });
}

TEST_F(Classes, NoDataIsInNoClass) {
  const auto value = [](int x, int, int) {
    return x == 5 ? std::nan("") : x == 6 ? -9.0 : x == 7 ? HUGE_VAL : x == 8 ? -HUGE_VAL : x;
  };
  Make("scene.tif", {.value = value, .noData = -9.0});
  ExpectDone("scene.tif out/o.tif --breaks 4,10");
  const std::vector<double> values = Values("out/o.tif");
  for (int x = 0; x < 12; ++x)
    EXPECT_EQ(values[static_cast<std::size_t>(x)],
              x >= 5 && x <= 8 ? 0 : ClassByBreaks({4, 10}, static_cast<double>(x)))
        << x;
}

TEST_F(Classes, ManyClassesTakeTwoBytes) {
  const auto value = [](int x, int y, int) { return x + width * y; };
  Make("scene.tif", {.type = GDT_Int32, .value = value});
  const std::string breaks = Numbers(299, 10);
  ExpectRefused(CLASSES, "scene.tif out/o.tif --type Byte --breaks " + breaks, "--type: Byte has no room");
  ExpectDone("scene.tif out/o.tif --breaks " + breaks);
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), GDT_UInt16);
  const std::vector<double> values = Values("out/o.tif");
  for (std::size_t i = 0; i < values.size(); ++i)
    ASSERT_EQ(values[i], i < 2990 ? std::floor(static_cast<double>(i) / 10.0) + 1.0 : 300.0) << i;
}

TEST_F(Classes, TheFiguresAreTheSharesOfTheClasses) {
  Make("scene.tif", {.width = 10,
                     .height = 10,
                     .type = GDT_Byte,
                     .value = [](int x, int y, int) { return y * 10.0 + x; },
                     .noData = 99.0});
  const Outcome outcome = Run(CLASSES, "scene.tif out/o.tif --breaks 33,66 --unit m");
  for (const std::string line :
       {"out/o.tif: classes of band 1, 10 x 10 Byte, 3 classes, 99 of 100 pixels in one of them, in ",
        "\n  class 1, below 33 m: 33 pixels, 33.33 %\n", "\n  class 2, 33 to < 66 m: 33 pixels, 33.33 %\n",
        "\n  class 3, 66 m or more: 33 pixels, 33.33 %\n"})
    EXPECT_NE(outcome.output.find(line), std::string::npos) << line << "\n" << outcome.output;
  const Outcome ranges = Run(CLASSES, "scene.tif out/o.tif --ranges 10:20,200:300");
  EXPECT_NE(ranges.output.find("2 classes, 10 of 100 pixels"), std::string::npos) << ranges.output;
  EXPECT_NE(ranges.output.find("class 2, 200 to < 300: 0 pixels, 0.00 %"), std::string::npos);
}

TEST_F(Classes, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  Make("scene.tif", {.type = GDT_Int16, .value = Count, .noData = 30.0});
  ExpectTilesGiveTheSameBits(CLASSES, "--breaks 20,40,60 --unit m scene.tif");
  ExpectTilesGiveTheSameBits(CLASSES, "--ranges 20:40,30:60 --unit m scene.tif");
}

TEST_F(Classes, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  const auto refused = [&](const std::string& options, const std::string& message) {
    ExpectRefused(CLASSES, "scene.tif out/o.tif " + options, message);
  };
  refused("", "--breaks: is missing, and --ranges too; expected one of them");
  refused("--breaks 1,2 --ranges 1:2", "--ranges: stands beside --breaks; expected one of them");
  refused("--breaks 1,two", "--breaks: 'two' is not usable; expected a number");
  refused("--breaks 1,nan", "--breaks: 'nan' is not usable; expected a number");
  refused("--breaks 5,5", "--breaks: 5 does not lie above 5 before it; expected numbers that rise");
  refused("--breaks 1,1.00000001", "--breaks: 1 does not lie above 1");
  refused("--ranges 1", "--ranges: '1' is not usable; expected LO:HI");
  refused("--ranges 1:2:3", "--ranges: '1:2:3' is not usable; expected LO:HI");
  refused("--ranges 1:x", "--ranges: '1:x' is not usable; expected LO:HI");
  refused("--ranges 2:1", "--ranges: '2:1' is empty in single precision; expected LO:HI with LO below HI");
  refused("--breaks 1 --band 2", "--band: there is no band 2");
  refused("--breaks 1 --band 0", "--band: '0'");
  refused("--breaks 1 --type Float32", "--type: 'Float32' is not usable; expected one of Byte, UInt16");
  refused("--breaks 1 --tile 0", "--tile: '0'");
  refused("--breaks 1 --png out/o.jpg", "--png: 'out/o.jpg'");
  refused("--breaks " + Numbers(29, 1) + " --png out/o.png",
          "--png: a legend has no room for 30 classes; expected");
  ExpectRefused(CLASSES, "missing.tif out/o.tif --breaks 1", "INPUT: missing.tif");
  ExpectRefused(CLASSES, "scene.tif out/o.img --breaks 1", "OUTPUT: 'out/o.img'");
  ExpectRefused(CLASSES, "scene.tif none/o.tif --breaks 1", "OUTPUT: cannot write to folder 'none'");
  ExpectRefused(CLASSES, "scene.tif scene.tif --breaks 1", "OUTPUT: 'scene.tif' is also");
  EXPECT_EQ(Run(CLASSES, "scene.tif out/o.tif --breaks 1 --nodata 3").status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Classes, ThePictureHasAColourForEachClass) {
  Make("scene.tif",
       {.type = GDT_Byte, .value = [](int x, int, int) { return x / 20 * 10.0; }, .noData = 40.0});
  ExpectDone("scene.tif out/o.tif --breaks 10,20,30 --png out/o.png");
  const DatasetPtr picture = Open("out/o.png");
  ASSERT_TRUE(picture);
  std::vector<std::vector<int>> colours;
  for (const int x : {10, 30, 50, 70, 81}) {
    std::vector<int>& colour = colours.emplace_back(4);
    for (int band = 1; band <= 4; ++band)
      ASSERT_EQ(picture->GetRasterBand(band)->RasterIO(GF_Read, 24 + 10 * x + 5, 76 + 305, 1, 1,
                                                       &colour[static_cast<std::size_t>(band) - 1], 1, 1,
                                                       GDT_Int32, 0, 0, nullptr),
                CE_None);
  }
  for (std::size_t i = 0; i < 4; ++i) {
    EXPECT_EQ(colours[i][3], 255);
    for (std::size_t k = 0; k < i; ++k) EXPECT_NE(colours[i], colours[k]);
  }
  EXPECT_EQ(colours[4][3], 0);
}

TEST_F(Classes, GeoreferenceIsPreserved) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectDone("scene.tif out/o.tif --breaks 10");
  double transform[6];
  ASSERT_EQ(Open("out/o.tif")->GetGeoTransform(transform), CE_None);
  EXPECT_EQ(transform[3], 4600000.0);
  EXPECT_TRUE(Open("out/o.tif")->GetSpatialRef()->IsSame(Open("scene.tif")->GetSpatialRef()));
}

TEST_F(Classes, HelpSaysWhereABreakBelongs) {
  const Outcome outcome = Run(CLASSES, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word :
       {"--breaks", "--ranges", "equal to a break is in the\nclass that begins there", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
