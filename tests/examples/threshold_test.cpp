// The program of the bitmap, run as a user runs it, on rasters that the tests make.

#include <cmath>
#include <functional>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

double Count(int x, int y, int band) { return (x * 7 + y * 3 + band * 11) % 100; }

class Threshold : public ExamplesFixture {
 protected:
  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(THRESHOLD, arguments); }

  void ExpectInside(const std::string& options, const std::function<bool(double)>& inside,
                    int band = 1) const {
    ExpectDone("scene.tif out/o.tif " + options);
    const std::vector<double> values = Values("out/o.tif");
    std::size_t i = 0;
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x, ++i)
        ASSERT_EQ(values[i], inside(Count(x, y, band)) ? 1.0 : 0.0) << options << " " << x << " " << y;
  }
};

TEST_F(Threshold, BothEndsBelongToTheRange) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectInside("--min 20 --max 40", [](double v) { return v >= 20.0 && v <= 40.0; });
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), GDT_Byte);
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "20 <= band 1 <= 40");
}

TEST_F(Threshold, OneEndIsEnough) {
  Make("scene.tif", {.bands = 2, .type = GDT_Int16, .value = Count});
  ExpectInside("--min 20.5", [](double v) { return v >= 21.0; });
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "band 1 >= 20.5");
  ExpectInside(
      "--max 20 --band 2", [](double v) { return v <= 20.0; }, 2);
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "band 2 <= 20");
}

TEST_F(Threshold, EqualEndsSelectOneValue) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectInside("--min 33 --max 33", [](double v) { return v == 33.0; });
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "band 1 = 33");
}

TEST_F(Threshold, AMinimumAboveTheMaximumWrapsAndSaysSo) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectInside("--min 80 --max 10", [](double v) { return v >= 80.0 || v <= 10.0; });
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "band 1 <= 10 or >= 80");
  const Outcome outcome = Run(THRESHOLD, "scene.tif out/o.tif --min 80 --max 10");
  EXPECT_NE(outcome.output.find("band 1 <= 10 or >= 80, 83 x 61 Byte, "), std::string::npos)
      << outcome.output;
}

TEST_F(Threshold, TheFiguresSayWhichPartIsInside) {
  Make("scene.tif", {.width = 10,
                     .height = 10,
                     .type = GDT_Byte,
                     .value = [](int x, int y, int) { return y * 10.0 + x; },
                     .noData = 99.0});
  const Outcome outcome = Run(THRESHOLD, "scene.tif out/o.tif --max 32");
  EXPECT_NE(outcome.output.find("33.33 % inside, 99 of 100 pixels valid"), std::string::npos)
      << outcome.output;
}

TEST_F(Threshold, NoDataIsNeitherInsideNorOutside) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count, .noData = 30.0});
  for (const std::string noData : {"255", "7"}) {
    ExpectDone("scene.tif out/o.tif --min 20 --max 40" + (noData == "255" ? "" : " --nodata " + noData));
    const std::vector<double> values = Values("out/o.tif");
    std::size_t i = 0;
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x, ++i) {
        const double v = Count(x, y, 1);
        ASSERT_EQ(values[i], v == 30.0 ? std::stod(noData) : v >= 20.0 && v <= 40.0 ? 1.0 : 0.0);
      }
    }
    EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetNoDataValue(), std::stod(noData));
  }
}

TEST_F(Threshold, WithoutNeedThereIsNoNoDataValue) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectDone("scene.tif out/o.tif --max 10");
  int stated = 0;
  Open("out/o.tif")->GetRasterBand(1)->GetNoDataValue(&stated);
  EXPECT_EQ(stated, 0);
}

TEST_F(Threshold, NaNIsNoData) {
  Make("scene.tif", {.value = [](int x, int, int) { return x == 5 ? std::nan("") : x * 0.25; }});
  ExpectDone("scene.tif out/o.tif --min 1 --max 1.25");
  const std::vector<double> values = Values("out/o.tif");
  EXPECT_EQ(values[3], 0.0);
  EXPECT_EQ(values[4], 1.0);
  EXPECT_EQ(values[5], 255.0);
  EXPECT_EQ(values[6], 0.0);
}

TEST_F(Threshold, EveryPixelTypeIsRead) {
  for (const GDALDataType type :
       {GDT_Byte, GDT_UInt16, GDT_Int16, GDT_UInt32, GDT_Int32, GDT_UInt64, GDT_Int64, GDT_Float32,
        GDT_Float64, GDT_CInt16, GDT_CInt32, GDT_CFloat32, GDT_CFloat64}) {
    Make("scene.tif", {.type = type, .value = Count});
    ExpectInside("--min 20 --max 40", [](double v) { return v >= 20.0 && v <= 40.0; });
  }
}

TEST_F(Threshold, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  Make("scene.tif", {.type = GDT_Int16, .value = Count, .noData = 30.0});
  ExpectTilesGiveTheSameBits(THRESHOLD, "scene.tif --min 20 --max 40");
  ExpectTilesGiveTheSameBits(THRESHOLD, "scene.tif --min 80 --max 10");
}

TEST_F(Threshold, TheNameOfTheBandIsThatOfTheInput) {
  Make("bands.tif", {.bands = 2, .type = GDT_Byte, .value = Count});
  ExamplesFixture::ExpectDone(INDICES, "bands.tif ndvi.tif --roles red,nir --index ndvi");
  ExpectDone("ndvi.tif out/o.tif --min 0.2");
  EXPECT_STREQ(Open("out/o.tif")->GetRasterBand(1)->GetDescription(), "NDVI >= 0.2");
}

TEST_F(Threshold, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  Make("scene.tif", {.bands = 2, .type = GDT_Byte});
  const std::string files = "scene.tif out/o.tif ";
  ExpectRefused(THRESHOLD, "missing.tif out/o.tif --min 1", "INPUT: missing.tif");
  ExpectRefused(THRESHOLD, files, "--min: is missing, and --max too; expected one of them or both");
  ExpectRefused(THRESHOLD, files + "--min low", "--min: 'low' is not usable; expected a number");
  ExpectRefused(THRESHOLD, files + "--max nan", "--max: 'nan' is not usable; expected a number");
  ExpectRefused(THRESHOLD, files + "--max 1e300", "--max: '1e300' is not usable; expected a number");
  ExpectRefused(THRESHOLD, files + "--min 1 --band 3", "--band: there is no band 3 in INPUT");
  ExpectRefused(THRESHOLD, files + "--min 1 --type Float32", "--type: 'Float32' is not usable");
  ExpectRefused(THRESHOLD, files + "--min 1 --nodata 1", "--nodata: 0 and 1 are the values of the bitmap");
  ExpectRefused(THRESHOLD, files + "--min 1 --nodata 256", "--nodata: 256 does not fit");
  ExpectRefused(THRESHOLD, files + "--min 1 --tile 0", "--tile: '0'");
  ExpectRefused(THRESHOLD, "scene.tif out/o.img --min 1", "OUTPUT: 'out/o.img'");
  ExpectRefused(THRESHOLD, "scene.tif scene.tif --min 1", "OUTPUT: 'scene.tif' is also");
  ExpectRefused(THRESHOLD, files + "--min 1 --png out/o.jpg", "--png: 'out/o.jpg'");
  EXPECT_TRUE(Outputs().empty());
}

// The colour of a picture where the map shows a pixel; it begins at (24, 76) and is enlarged by 10.
std::vector<int> ColourAt(GDALDataset& picture, int x, int y) {
  std::vector<int> colour(4, 255);
  for (int band = 1; band <= picture.GetRasterCount(); ++band)
    EXPECT_EQ(picture.GetRasterBand(band)->RasterIO(GF_Read, 24 + 10 * x + 5, 76 + 10 * y + 5, 1, 1,
                                                    &colour[static_cast<std::size_t>(band) - 1], 1, 1,
                                                    GDT_Int32, 0, 0, nullptr),
              CE_None);
  return colour;
}

TEST_F(Threshold, ThePictureHasAColourForEachSide) {
  const auto value = [](int x, int, int) { return x < 20 ? 5.0 : x < 60 ? 50.0 : 99.0; };
  Make("scene.tif", {.type = GDT_Byte, .value = value, .noData = 99.0});
  ExpectDone("scene.tif out/o.tif --min 40 --max 60 --png out/o.png");
  const DatasetPtr picture = Open("out/o.png");
  ASSERT_TRUE(picture);
  const std::vector<int> outside = ColourAt(*picture, 10, 30), inside = ColourAt(*picture, 40, 30);
  EXPECT_GT(outside[1], inside[1] + 100);
  EXPECT_EQ(inside[3], 255);
  EXPECT_EQ(ColourAt(*picture, 70, 30)[3], 0);
}

TEST_F(Threshold, HelpSaysThatARangeMayWrap) {
  const Outcome outcome = Run(THRESHOLD, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word : {"wraps around", "--min", "--max", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
