// The program of the transfer between regions, run as a user runs it, on rasters that the tests make.

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

double Count(int x, int y, int band) { return (x * 7 + y * 31 + band * 11) % 251; }

// The pixel of an image of `extent` pixels that output pixel `p` takes.
int Nearest(int p, double scale, int start, int extent) {
  return std::min(static_cast<int>(p / scale + start + 0.5), extent - 1);
}

struct Case {
  int x, y, width, height, toWidth, toHeight;

  std::string Arguments() const {
    return CPLSPrintf("--region %d,%d,%d,%d --to %d,%d ", x, y, width, height, toWidth, toHeight);
  }
  int Column(int p) const { return Nearest(p, static_cast<double>(toWidth) / width, x, ::width); }
  int Row(int p) const { return Nearest(p, static_cast<double>(toHeight) / height, y, ::height); }
};

const std::vector<Case> cases = {
    {0, 0, 83, 61, 83, 61},    {10, 20, 30, 25, 60, 50}, {10, 20, 30, 25, 90, 20},  {0, 0, 83, 61, 17, 9},
    {40, 30, 43, 31, 100, 77}, {82, 60, 1, 1, 5, 7},     {13, 7, 64, 48, 150, 130}, {3, 50, 80, 11, 1, 1}};

class Transfer : public ExamplesFixture {
 protected:
  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(TRANSFER, arguments); }

  void ExpectNearest(const Case& one, const std::string& name, int bands) const {
    for (int band = 1; band <= bands; ++band) {
      const std::vector<double> values = Values(name, band);
      ASSERT_EQ(values.size(), static_cast<std::size_t>(one.toWidth * one.toHeight));
      std::size_t i = 0;
      for (int y = 0; y < one.toHeight; ++y)
        for (int x = 0; x < one.toWidth; ++x, ++i)
          ASSERT_EQ(values[i], Count(one.Column(x), one.Row(y), band)) << one.Arguments() << x << " " << y;
    }
  }
};

TEST_F(Transfer, EachPixelIsTheNearestOne) {
  Make("scene.tif", {.bands = 2, .type = GDT_Byte, .value = Count});
  for (const Case& one : cases) {
    ExpectDone("scene.tif out/o.tif " + one.Arguments());
    ExpectNearest(one, "out/o.tif", 2);
  }
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), GDT_Byte);
}

TEST_F(Transfer, TilesOfAnySizeGiveTheFileOfOnePiece) {
  Make("scene.tif", {.bands = 2, .type = GDT_Byte, .value = Count});
  Make("holes.tif", {.value = Count, .noData = 17.0});
  for (const Case& one : cases) {
    for (const std::string input : {"scene.tif", "holes.tif"}) {
      ExpectDone(input + " out/whole.tif --tile 100000 " + one.Arguments());
      for (const int side : {3, 17}) {
        if (side == 3 && one.toWidth * one.toHeight > 5000) continue;
        ExpectDone(input + " out/tiled.tif --tile " + std::to_string(side) + " " + one.Arguments());
        EXPECT_TRUE(ReadText(Path("out/tiled.tif")) == ReadText(Path("out/whole.tif")))
            << input << " " << one.Arguments() << ", tiles of " << side;
      }
    }
  }
  // A list ends where the next option begins.
  ExpectTilesGiveTheSameBits(TRANSFER, cases[3].Arguments() + "--title part scene.tif");
}

TEST_F(Transfer, TwiceTheScaleRepeatsPixelsButTheFirst) {
  Make("scene.tif", {.type = GDT_Byte, .value = [](int x, int, int) { return static_cast<double>(x); }});
  ExpectDone("scene.tif out/o.tif --region 20,0,4,1 --to 8,1");
  EXPECT_EQ(Values("out/o.tif"), (std::vector<double>{20, 21, 21, 22, 22, 23, 23, 24}));
  ExpectDone("scene.tif out/p.tif --region 79,0,4,1 --to 8,1");  // up to the edge of the image
  EXPECT_EQ(Values("out/p.tif"), (std::vector<double>{79, 80, 80, 81, 81, 82, 82, 82}));
}

TEST_F(Transfer, WithoutARegionAllOfTheInputIsTaken) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count});
  ExpectDone("scene.tif out/o.tif --to 83,61");
  EXPECT_TRUE(Bits("out/o.tif") == Bits("scene.tif"));
}

TEST_F(Transfer, EveryPixelTypeIsKept) {
  for (const GDALDataType type :
       {GDT_Byte, GDT_UInt16, GDT_Int16, GDT_UInt32, GDT_Int32, GDT_UInt64, GDT_Int64, GDT_Float32,
        GDT_Float64, GDT_CInt16, GDT_CInt32, GDT_CFloat32, GDT_CFloat64}) {
    Make("scene.tif", {.bands = 2, .type = type, .value = Count});
    ExpectDone("scene.tif out/o.tif --to 83,61");
    EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), type);
    EXPECT_TRUE(Bits("out/o.tif") == Bits("scene.tif")) << GDALGetDataTypeName(type);
    ExpectDone("scene.tif out/o.tif " + cases[1].Arguments() + "--type Int32");
    ExpectNearest(cases[1], "out/o.tif", 2);
  }
}

TEST_F(Transfer, ImaginaryPartsAreKept) {
  GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("GTiff");
  std::vector<float> samples;
  for (int i = 0; i < 12; ++i) samples.insert(samples.end(), {1.0f * static_cast<float>(i), -0.5f});
  {
    const DatasetPtr dataset(driver->Create(Path("complex.tif").c_str(), 4, 3, 1, GDT_CFloat32, nullptr));
    ASSERT_EQ(dataset->GetRasterBand(1)->RasterIO(GF_Write, 0, 0, 4, 3, samples.data(), 4, 3, GDT_CFloat32, 0,
                                                  0, nullptr),
              CE_None);
  }
  ExpectDone("complex.tif out/o.tif --to 4,3 --tile 2");
  EXPECT_TRUE(Bits("out/o.tif") == Bits("complex.tif"));
}

TEST_F(Transfer, AnotherTypeIsAPlainCast) {
  Make("scene.tif", {.width = 3, .height = 1, .value = [](int x, int, int) { return x * 100.0 + 100.7; }});
  ExpectDone("scene.tif out/o.tif --to 3,1 --type Byte");
  EXPECT_EQ(Values("out/o.tif"), (std::vector<double>{100, 200, 44}));
}

TEST_F(Transfer, TheSamplesStayWhereTheyAreOnTheGround) {
  Make("scene.tif",
       {.type = GDT_Byte, .transform = {500000.0, 30.0, 2.0, 4600000.0, 1.0, -25.0}, .value = Count});
  const auto place = [](const double* g, double x, double y) {
    return std::pair(g[0] + g[1] * x + g[2] * y, g[3] + g[4] * x + g[5] * y);
  };
  double in[6], out[6];
  ASSERT_EQ(Open("scene.tif")->GetGeoTransform(in), CE_None);
  for (const Case& one : cases) {
    ExpectDone("scene.tif out/o.tif " + one.Arguments());
    ASSERT_EQ(Open("out/o.tif")->GetGeoTransform(out), CE_None);
    for (const int p : {0, 1, 4}) {
      // The centre of the pixel p: the centre of input pixel p / S + X, with its fraction.
      const double x = static_cast<double>(p) * one.width / one.toWidth + one.x;
      const double y = static_cast<double>(p) * one.height / one.toHeight + one.y;
      const auto there = place(out, p + 0.5, p + 0.5), here = place(in, x + 0.5, y + 0.5);
      EXPECT_NEAR(there.first, here.first, 1e-6) << one.Arguments() << p;
      EXPECT_NEAR(there.second, here.second, 1e-6) << one.Arguments() << p;
    }
  }
  EXPECT_TRUE(Open("out/o.tif")->GetSpatialRef()->IsSame(Open("scene.tif")->GetSpatialRef()));
}

TEST_F(Transfer, GroundControlPointsMoveAlong) {
  Make("scene.tif", {.type = GDT_Byte, .transform = {}, .epsg = 0, .value = Count});
  {
    const DatasetPtr scene(GDALDataset::Open(Path("scene.tif").c_str(), GDAL_OF_RASTER | GDAL_OF_UPDATE));
    GDAL_GCP points[3];
    GDALInitGCPs(3, points);
    for (int i = 0; i < 3; ++i) {
      points[i].dfGCPPixel = 10.5 + 10 * (i % 2);
      points[i].dfGCPLine = 20.5 + 10 * (i / 2);
      points[i].dfGCPX = 100.0 + i;
      points[i].dfGCPY = 200.0 + i;
    }
    OGRSpatialReference reference;
    reference.importFromEPSG(32633);
    ASSERT_EQ(scene->SetGCPs(3, points, &reference), CE_None);
    GDALDeinitGCPs(3, points);
  }
  ExpectDone("scene.tif out/o.tif --region 10,20,30,20 --to 60,40");
  const DatasetPtr out = Open("out/o.tif");
  ASSERT_EQ(out->GetGCPCount(), 3);
  EXPECT_DOUBLE_EQ(out->GetGCPs()[0].dfGCPPixel, 0.5);
  EXPECT_DOUBLE_EQ(out->GetGCPs()[1].dfGCPPixel, 20.5);
  EXPECT_DOUBLE_EQ(out->GetGCPs()[2].dfGCPLine, 20.5);
  EXPECT_EQ(out->GetGCPs()[1].dfGCPX, 101.0);
}

bool Hole(int x, int y) { return (x + 2 * y) % 19 == 0; }

TEST_F(Transfer, NoDataMovesWithThePixels) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) && b == 2 ? 255.0 : Count(x, y, b); };
  Make("holes.tif", {.bands = 2, .type = GDT_Byte, .value = value, .noData = 255.0});
  for (const auto& [options, noData] : {std::pair<std::string, double>{"", 255.0},
                                        {"--nodata 253", 253.0},
                                        {"--type Float32", 255.0},
                                        {"--type Int16 --nodata -1", -1.0}}) {
    ExpectDone("holes.tif out/o.tif " + cases[4].Arguments() + options);
    EXPECT_EQ(Open("out/o.tif")->GetRasterBand(2)->GetNoDataValue(), noData);
    for (const int band : {1, 2}) {
      const std::vector<double> values = Values("out/o.tif", band);
      std::size_t i = 0;
      for (int y = 0; y < cases[4].toHeight; ++y)
        for (int x = 0; x < cases[4].toWidth; ++x, ++i)
          ASSERT_EQ(values[i] == noData, Hole(cases[4].Column(x), cases[4].Row(y))) << options;
    }
  }
  Make("nan.tif", {.value = [](int x, int y, int) { return Hole(x, y) ? std::nan("") : x; }});
  ExpectDone("nan.tif out/p.tif --to 83,61");
  EXPECT_TRUE(std::isnan(Values("out/p.tif")[0]));
  EXPECT_EQ(Values("out/p.tif")[1], 1.0);
}

TEST_F(Transfer, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = Count});
  const auto refused = [&](const std::string& options, const std::string& message) {
    ExpectRefused(TRANSFER, "scene.tif out/o.tif " + options, message);
  };
  refused("--region 1,2,3 --to 5,5", "--region: 3 numbers; expected four: X,Y,W,H");
  refused("--region 1,2,0,3 --to 5,5", "--region: 0 x 3 pixels; expected at least one pixel");
  refused("--region 80,0,4,1 --to 5,5",
          "--region: 4 x 1 pixels at column 80, row 0 leave INPUT; expected a region within its 83 x 61");
  refused("--region 0,61,1,1 --to 5,5", "--region: 1 x 1 pixels at column 0, row 61 leave INPUT");
  refused("--region 0,0,83,62 --to 5,5", "--region: 83 x 62 pixels at column 0, row 0 leave INPUT");
  refused("--region 0,-1,3,3 --to 5,5", "--region: '-1' is not usable; expected a whole number from 0");
  refused("--region a,0,3,3 --to 5,5", "--region: 'a' is not usable; expected a whole number");
  refused("--to 5", "--to: 1 number; expected two: W,H");
  refused("--to 5,0", "--to: '0' is not usable; expected a whole number from 1");
  refused("--to 5,5 --bands 4", "--bands: there is no band 4");
  refused("--to 5,5 --show 4", "--show: band 4 is not transferred; expected one of the --bands");
  refused("--to 5,5 --show 1,2", "--show: two bands make no picture");
  refused("--to 5,5 --type Float16", "--type: 'Float16'");
  refused("--to 5,5 --nodata -1", "--nodata: -1 does not fit into outputs of type Byte");
  refused("--to 5,5 --tile 0", "--tile: '0'");
  refused("--to 5,5 --png out/o.jpg", "--png: 'out/o.jpg'");
  refused("--to 100000,100000 --tile 100000", "--tile: a tile of side 100000 takes more than 2 GiB");
  ExpectRefused(TRANSFER, "missing.tif out/o.tif --to 5,5", "INPUT: missing.tif");
  ExpectRefused(TRANSFER, "scene.tif out/o.img --to 5,5", "OUTPUT: 'out/o.img'");
  ExpectRefused(TRANSFER, "scene.tif none/o.tif --to 5,5", "OUTPUT: cannot write to folder 'none'");
  ExpectRefused(TRANSFER, "scene.tif scene.tif --to 5,5", "OUTPUT: 'scene.tif' is also");
  EXPECT_EQ(Run(TRANSFER, "scene.tif out/o.tif").status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Transfer, HelpSaysWhichPixelIsTaken) {
  const Outcome outcome = Run(TRANSFER, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word : {"--region", "--to", "0, 1, 1, 2, 2", "plain cast", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
