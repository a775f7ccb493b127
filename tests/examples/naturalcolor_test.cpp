// The program of the natural colours, run as a user runs it, on rasters that the tests make.

#include <algorithm>
#include <cmath>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

// Green is the greatest, so that the blue stays above 0.
double Count(int x, int y, int band) {
  return (band == 1 ? 90 : 20) + (x * 7 + y * 3 + band * 37) % (90 + 20 * band);
}

double BlueOf(double green, double red, double infrared) {
  return 0.873393 * green + 13.9054 - 0.138254 * red - 0.100616 * infrared;
}

class NaturalColor : public ExamplesFixture {
 protected:
  void ExpectDone(const std::string& arguments) const {
    ExamplesFixture::ExpectDone(NATURALCOLOR, arguments);
  }
  void MakeScene(double (*value)(int, int, int) = Count,
                 double noData = std::numeric_limits<double>::infinity()) const {
    Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = value, .noData = noData});
  }
  // Red, green and blue of OUTPUT.
  std::vector<std::vector<double>> Colours(const std::string& name = "out/o.tif") const {
    return {Values(name, 1), Values(name, 2), Values(name, 3)};
  }
};

TEST_F(NaturalColor, WithoutAStretchRedAndGreenAreThoseOfTheInput) {
  MakeScene();
  ExpectDone("scene.tif out/o.tif --bands 1,2,3");
  const auto colours = Colours();
  std::size_t i = 0;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x, ++i) {
      const double green = Count(x, y, 1), red = Count(x, y, 2), infrared = Count(x, y, 3);
      ASSERT_EQ(colours[0][i], red);
      ASSERT_EQ(colours[1][i], green);
      ASSERT_EQ(colours[2][i], std::floor(std::clamp(BlueOf(green, red, infrared), 0.0, 255.0) + 0.5));
    }
  }
  const DatasetPtr out = Open("out/o.tif");
  EXPECT_EQ(out->GetRasterCount(), 3);
  EXPECT_EQ(out->GetRasterBand(1)->GetRasterDataType(), GDT_Byte);
  EXPECT_STREQ(out->GetRasterBand(1)->GetDescription(), "red from band 2");
  EXPECT_STREQ(out->GetRasterBand(2)->GetDescription(), "green from band 1");
  EXPECT_STREQ(out->GetRasterBand(3)->GetDescription(), "synthetic blue");
  int stated = 0;
  out->GetRasterBand(1)->GetNoDataValue(&stated);
  EXPECT_EQ(stated, 0);
}

TEST_F(NaturalColor, TheBandsStandInTheOrderOfTheArgument) {
  MakeScene();
  ExpectDone("scene.tif out/o.tif --bands 3,1,2");
  EXPECT_EQ(Colours()[0][5], Count(5, 0, 1));
  EXPECT_EQ(Colours()[1][5], Count(5, 0, 3));
  EXPECT_NEAR(Colours()[2][5], BlueOf(Count(5, 0, 3), Count(5, 0, 1), Count(5, 0, 2)), 0.5001);
}

// The sample that at most `percent` of all lie above.
double EndOf(std::vector<double> samples, double percent) {
  std::sort(samples.begin(), samples.end());
  const auto above = static_cast<std::size_t>(static_cast<double>(samples.size()) * percent / 100.0);
  return samples[samples.size() - 1 - above];
}

TEST_F(NaturalColor, TheStretchEndsWhereTheShareIsCut) {
  MakeScene();
  std::vector<double> green, red, blue, whole;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      green.push_back(Count(x, y, 1));
      red.push_back(Count(x, y, 2));
      blue.push_back(BlueOf(green.back(), red.back(), Count(x, y, 3)));
      whole.push_back(std::clamp(std::trunc(blue.back()), 0.0, 255.0));
    }
  }
  ASSERT_GT(*std::min_element(whole.begin(), whole.end()), 0.0);
  for (const double cut : {0.0, 1.0, 12.5}) {
    ExpectDone("scene.tif out/o.tif --bands 1,2,3 --cut " + std::to_string(cut));
    const auto colours = Colours();
    const auto expect = [&](const std::vector<double>& samples, const std::vector<double>& counted,
                            const std::vector<double>& values) {
      const double least = *std::min_element(counted.begin(), counted.end()), end = EndOf(counted, cut);
      for (std::size_t i = 0; i < samples.size(); ++i) {
        const double expected = std::min(255.0, 255.0 * (samples[i] - least) / (end - least));
        ASSERT_NEAR(values[i], expected, 0.501) << cut << " " << i;
      }
    };
    expect(red, red, colours[0]);
    expect(green, green, colours[1]);
    expect(blue, whole, colours[2]);
  }
}

TEST_F(NaturalColor, ANegativeBlueIsNoBackground) {
  const auto value = [](int x, int, int band) { return band == 1 ? 1.0 + x : band == 2 ? 240.0 : 255.0; };
  ASSERT_LT(BlueOf(1, 240, 255), -40.0);
  MakeScene(value);
  for (const std::string options : {"", " --cut 1"}) {
    ExpectDone("scene.tif out/o.tif --bands 1,2,3" + options);
    const auto colours = Colours();
    EXPECT_EQ(colours[1][0], options.empty() ? 1.0 : 0.0);
    EXPECT_GT(colours[1][20], colours[1][0]);  // its blue is negative too
    EXPECT_GT(colours[1][width - 1], colours[1][20]);
    EXPECT_GT(colours[2][width - 1], colours[2][0]);
    EXPECT_LE(colours[2][0], 1.0);
  }
}

TEST_F(NaturalColor, ASampleOf0IsNoBackgroundByItself) {
  MakeScene([](int x, int, int band) { return static_cast<double>(x % 3 == 0 ? 0 : 10 * band); });
  ExpectDone("scene.tif out/o.tif --bands 1,2,3");
  EXPECT_EQ(Colours()[2][3], 14.0);
  ExpectDone("scene.tif out/p.tif --bands 1,2,3 --background 0");
  EXPECT_EQ(Colours("out/p.tif")[2][3], 0.0);
  EXPECT_EQ(Open("out/p.tif")->GetRasterBand(3)->GetNoDataValue(), 0.0);
}

bool Hole(int x, int y) { return (x + 2 * y) % 19 == 0; }

TEST_F(NaturalColor, NoDataBecomesTheBackground) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) && b == 3 ? 255.0 : Count(x, y, b); };
  for (const bool declared : {true, false}) {
    declared ? MakeScene(value, 255.0) : MakeScene(value);
    for (const std::string cut : {"", " --cut 2", " --cut 0"}) {
      ExpectDone("scene.tif out/o.tif --bands 1,2,3" + cut + (declared ? "" : " --background 255"));
      const double noData = cut.empty() ? 255.0 : 0.0;
      EXPECT_EQ(Open("out/o.tif")->GetRasterBand(2)->GetNoDataValue(), noData);
      const auto colours = Colours();
      std::size_t i = 0;
      for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x, ++i)
          for (const std::vector<double>& colour : colours)
            ASSERT_EQ(colour[i] == noData, Hole(x, y)) << cut << " " << x << " " << y;
    }
  }
}

TEST_F(NaturalColor, NoDataCountsInNoStatistics) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) ? 255.0 : 50.0 + (x + b) % 10; };
  MakeScene(value, 255.0);
  ExpectDone("scene.tif out/o.tif --bands 1,2,3 --cut 0");
  const std::vector<double> red = Colours()[0];
  for (int x = 1; x < 19; ++x)
    EXPECT_NEAR(red[static_cast<std::size_t>(x)], 1.0 + 254.0 * ((x + 2) % 10) / 9.0, 0.501) << x;
}

TEST_F(NaturalColor, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  MakeScene(Count, 50.0);
  ExpectTilesGiveTheSameBits(NATURALCOLOR, "--bands 1,2,3 --cut 1 scene.tif");
  ExpectTilesGiveTheSameBits(NATURALCOLOR, "--bands 1,2,3 --background 60 scene.tif");
}

TEST_F(NaturalColor, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  MakeScene();
  Make("short.tif", {.bands = 3, .type = GDT_Int16, .value = Count});
  Make("empty.tif",
       {.bands = 3, .type = GDT_Byte, .value = [](int, int, int) { return 9.0; }, .noData = 9.0});
  const std::string files = "scene.tif out/o.tif";
  const auto refused = [&](const std::string& arguments, const std::string& message) {
    ExpectRefused(NATURALCOLOR, arguments, message);
  };
  refused("missing.tif out/o.tif --bands 1,2,3", "INPUT: missing.tif");
  refused("short.tif out/o.tif --bands 1,2,3", "INPUT: band 1 has samples of type Int16");
  refused("empty.tif out/o.tif --bands 1,2,3 --cut 1", "INPUT: has no valid pixel; expected a raster");
  refused(files + " --bands 1,2", "--bands: 2 bands; expected three, for green, red and near infrared");
  refused(files + " --bands 1,2,3,1", "--bands: 4 bands; expected three");
  refused(files + " --bands 1,2,4", "--bands: there is no band 4");
  refused(files + " --bands 1,2,3 --cut 50", "--cut: '50' is not usable; expected a number from 0");
  refused(files + " --bands 1,2,3 --background 256", "--background: '256' is not usable; expected a whole");
  refused(files + " --bands 1,2,3 --background 1.5", "--background: '1.5' is not usable");
  refused(files + " --bands 1,2,3 --type UInt16", "--type: 'UInt16' is not usable; expected one of Byte");
  refused(files + " --bands 1,2,3 --tile 0", "--tile: '0'");
  refused(files + " --bands 1,2,3 --png out/o.jpg", "--png: 'out/o.jpg'");
  refused("scene.tif out/o.img --bands 1,2,3", "OUTPUT: 'out/o.img'");
  refused("scene.tif none/o.tif --bands 1,2,3", "OUTPUT: cannot write to folder 'none'");
  refused("scene.tif scene.tif --bands 1,2,3", "OUTPUT: 'scene.tif' is also");
  EXPECT_EQ(Run(NATURALCOLOR, files).status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(NaturalColor, ThePictureShowsTheColoursAsTheyAre) {
  MakeScene([](int x, int, int band) { return x < 40 ? 60.0 * band : 20.0; });
  const Outcome outcome = Run(NATURALCOLOR, "scene.tif out/o.tif --bands 1,2,3 --png out/o.png");
  ASSERT_EQ(outcome.status, 0) << outcome.errors;
  EXPECT_NE(outcome.output.find("natural colour, blue synthetic, 3 bands, 83 x 61 Byte"), std::string::npos);
  EXPECT_NE(outcome.output.find("\n  band 3, synthetic blue: min "), std::string::npos) << outcome.output;
  const DatasetPtr picture = Open("out/o.png");
  ASSERT_TRUE(picture);
  const double expected[] = {120.0, 60.0, std::floor(BlueOf(60, 120, 180) + 0.5)};
  for (int band = 1; band <= 3; ++band) {
    int value = 0;
    ASSERT_EQ(picture->GetRasterBand(band)->RasterIO(GF_Read, 24 + 105, 76 + 105, 1, 1, &value, 1, 1,
                                                     GDT_Int32, 0, 0, nullptr),
              CE_None);
    EXPECT_EQ(value, expected[band - 1]);
  }
}

TEST_F(NaturalColor, HelpSaysThatTheBlueIsSynthetic) {
  const Outcome outcome = Run(NATURALCOLOR, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word : {"The blue is no measurement", "--cut", "--background", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
