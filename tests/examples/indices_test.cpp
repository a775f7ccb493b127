// The program of the vegetation indices, run as a user runs it, on rasters that the tests make.

#include <algorithm>
#include <cmath>
#include <functional>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

std::size_t At(int x, int y) { return static_cast<std::size_t>(y * width + x); }

// Counts that differ from band to band, some of them 0.
double Count(int x, int y, int band) { return (x * (3 + band) + y * 7 + band * 29) % 200; }

const std::string sixRoles = " --roles blue,green,red,nir,swir1,swir2";
const std::string sevenRoles = " --roles blue,green,red,red-edge,nir,swir1,swir2";

// Seven bands of a pixel, in the order of the roles.
using Pixel = std::vector<double>;

double Ndvi(const Pixel& p) { return p[4] + p[2] == 0.0 ? 0.0 : (p[4] - p[2]) / (p[4] + p[2]); }

double Gemi(const Pixel& p) {
  const double n = p[4], r = p[2], d = n + r + 0.5;
  const double eta = d == 0.0 ? 0.0 : ((n * n - r * r) * 2.0 + n * 1.5 + r * 0.5) / d;
  return r == 1.0 ? 0.0 : (1.0 - eta * 0.25) * eta - (r - 0.125) / (1.0 - r);
}

// The indices in the order of OUTPUT's bands.
struct Golden {
  std::string argument;
  std::string name;
  std::function<double(const Pixel&)> value;
};

const std::vector<Golden> golden = {
    {"ngrdi", "NGRDI",
     [](const Pixel& p) { return p[1] + p[2] == 0.0 ? 0.0 : (p[1] - p[2]) / (p[1] + p[2]); }},
    {"excess-green", "excess green",
     [](const Pixel& p) { return (p[1] + 255.0 - (p[2] + p[0]) * 0.5) * 0.5; }},
    {"dvi", "DVI", [](const Pixel& p) { return p[4] - p[2]; }},
    {"rvi", "RVI", [](const Pixel& p) { return p[2] == 0.0 ? 0.0 : p[4] / p[2]; }},
    {"ndvi", "NDVI", Ndvi},
    {"tvi", "TVI", [](const Pixel& p) { return p[4] + p[2] == 0.0 ? 0.0 : std::sqrt(Ndvi(p) + 0.5); }},
    {"savi", "SAVI",
     [](const Pixel& p) { return std::clamp((p[4] - p[2]) / (p[4] + p[2] + 0.5) * 1.5, -1.0, 1.0); }},
    {"msavi2", "MSAVI2",
     [](const Pixel& p) {
       return ((p[4] + 1.0) * 2.0 - std::sqrt(std::pow(2.0 * p[4] + 1.0, 2) - 8.0 * (p[4] - p[2]))) * 0.5;
     }},
    {"gemi", "GEMI", Gemi},
    {"greenness", "greenness",
     [](const Pixel& p) {
       return -0.2848 * p[0] - 0.2435 * p[1] - 0.5436 * p[2] + 0.7243 * p[4] + 0.084 * p[5] - 1.18 * p[6];
     }},
    {"mcari", "MCARI",
     [](const Pixel& p) { return p[2] == 0.0 ? 0.0 : (p[3] - p[2] - 0.2 * (p[3] - p[1])) * (p[3] / p[2]); }},
    {"mtvi1", "MTVI1", [](const Pixel& p) { return 1.2 * (1.2 * (p[4] - p[1]) - 2.5 * (p[2] - p[1])); }}};

Pixel PixelAt(int x, int y, double factor = 1.0, double offset = 0.0) {
  Pixel pixel;
  for (int band = 1; band <= 7; ++band) pixel.push_back(Count(x, y, band) * factor + offset);
  return pixel;
}

class Indices : public ExamplesFixture {
 protected:
  void MakeScene(int bands = 7, GDALDataType type = GDT_Byte) const {
    Make("scene.tif", {.bands = bands, .type = type, .value = Count});
  }

  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(INDICES, arguments); }

  // A band of OUTPUT against an index of the scaled counts. NaN stands for the root of a negative number.
  void ExpectIndex(const std::string& name, int band, const Golden& index, double factor = 1.0,
                   double offset = 0.0) const {
    const std::vector<double> values = Values(name, band);
    for (int y = 0; y < height; ++y) {
      for (int x = 0; x < width; ++x) {
        const double expected = index.value(PixelAt(x, y, factor, offset));
        ASSERT_EQ(std::isnan(values[At(x, y)]), std::isnan(expected)) << index.name << x << " " << y;
        if (std::isnan(expected)) continue;
        ASSERT_NEAR(values[At(x, y)], expected, 2e-4 * std::max(1.0, std::abs(expected)))
            << index.name << x << " " << y;
      }
    }
  }
};

TEST_F(Indices, AllTwelveInOnePass) {
  MakeScene();
  std::string all;
  for (const Golden& index : golden) all += (all.empty() ? "" : ",") + index.argument;
  ExpectDone("scene.tif out/o.tif" + sevenRoles + " --index " + all);
  const DatasetPtr out = Open("out/o.tif");
  ASSERT_EQ(out->GetRasterCount(), 12);
  for (int band = 1; band <= 12; ++band) {
    const Golden& index = golden[static_cast<std::size_t>(band) - 1];
    EXPECT_EQ(out->GetRasterBand(band)->GetDescription(), index.name);
    EXPECT_EQ(out->GetRasterBand(band)->GetRasterDataType(), GDT_Float32);
    ExpectIndex("out/o.tif", band, index);
  }
}

TEST_F(Indices, EachAlone) {
  MakeScene(7, GDT_Int16);
  for (const Golden& index : golden) {
    ExpectDone("scene.tif out/o.tif" + sevenRoles + " --index " + index.argument);
    ASSERT_EQ(Open("out/o.tif")->GetRasterCount(), 1);
    ExpectIndex("out/o.tif", 1, index);
  }
}

TEST_F(Indices, BandsStandInTheOrderOfTheCodes) {
  MakeScene();
  ExpectDone("scene.tif out/o.tif" + sevenRoles + " --index greenness,savi,ndvi");
  const DatasetPtr out = Open("out/o.tif");
  EXPECT_STREQ(out->GetRasterBand(1)->GetDescription(), "NDVI");
  EXPECT_STREQ(out->GetRasterBand(2)->GetDescription(), "SAVI");
  EXPECT_STREQ(out->GetRasterBand(3)->GetDescription(), "greenness");
  ExpectIndex("out/o.tif", 1, golden[4]);
  ExpectIndex("out/o.tif", 2, golden[6]);
  ExpectIndex("out/o.tif", 3, golden[9]);
}

TEST_F(Indices, RolesFollowTheBandsThatAreRead) {
  MakeScene();
  ExpectDone("scene.tif out/o.tif --bands 5,3 --roles nir,red --index ndvi");
  ExpectIndex("out/o.tif", 1, golden[4]);
  ExpectDone("scene.tif out/o.tif --roles other,other,red,other,nir,other,other --index ndvi");
  ExpectIndex("out/o.tif", 1, golden[4]);
}

TEST_F(Indices, TheScaleComesBeforeTheIndex) {
  MakeScene();
  ExpectDone("scene.tif out/o.tif" + sevenRoles + " --index savi,gemi --scale 0.004");
  ExpectIndex("out/o.tif", 1, golden[6], 0.004);
  ExpectDone("scene.tif out/p.tif" + sevenRoles + " --index ndvi,msavi2 --scale 0.004,0.25");
  ExpectIndex("out/p.tif", 1, golden[4], 0.004, 0.25);
  ExpectIndex("out/p.tif", 2, golden[7], 0.004, 0.25);
  ExpectDone("scene.tif out/q.tif" + sevenRoles + " --index dvi,mtvi1 --scale 2,-30");
  ExpectIndex("out/q.tif", 1, golden[2], 2.0, -30.0);
  ExpectIndex("out/q.tif", 2, golden[11], 2.0, -30.0);
}

bool Hole(int x, int y) { return (x + 2 * y) % 19 == 0; }

TEST_F(Indices, NoDataInAnyBandMasksTheWholePixel) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) && b == 2 ? 255.0 : Count(x, y, b); };
  Make("holes.tif", {.bands = 6, .type = GDT_Byte, .value = value, .noData = 255.0});
  for (const std::string options : {"", " --nodata -9", " --type Float64 --nodata -9", " --scale 0.01"}) {
    ExpectDone("holes.tif out/o.tif" + sixRoles + " --index ndvi,savi,greenness" + options);
    const bool stated = options.find("-9") != std::string::npos;
    for (const int band : {1, 2, 3}) {
      const std::vector<double> values = Values("out/o.tif", band);
      for (int y = 0; y < height; ++y)
        for (int x = 0; x < width; ++x)
          ASSERT_EQ(stated ? values[At(x, y)] == -9.0 : std::isnan(values[At(x, y)]), Hole(x, y))
              << options << " " << x << " " << y;
      const double noData = Open("out/o.tif")->GetRasterBand(band)->GetNoDataValue();
      EXPECT_TRUE(stated ? noData == -9.0 : std::isnan(noData));
    }
  }
}

TEST_F(Indices, TheRootOfANegativeNumberIsNoData) {
  Make("water.tif", {.bands = 2, .type = GDT_Byte, .value = [](int x, int, int b) {
                       return b == 1 ? 90.0 : x < 10 ? 10.0 : 80.0;  // NDVI -0.8 and about -0.06
                     }});
  ExpectDone("water.tif out/o.tif --roles red,nir --index tvi --nodata -9");
  const std::vector<double> values = Values("out/o.tif");
  EXPECT_EQ(values[At(9, 0)], -9.0);
  EXPECT_NEAR(values[At(10, 0)], std::sqrt(0.5 - 10.0 / 170.0), 1e-6);
  ExpectDone("water.tif out/p.tif --roles red,nir --index tvi --type Float64");
  EXPECT_TRUE(std::isnan(Values("out/p.tif")[At(9, 0)]));
}

TEST_F(Indices, EveryPixelTypeIsRead) {
  MakeScene(7, GDT_Float64);
  const std::string task = sevenRoles + " --index ndvi,greenness";
  ExpectDone("scene.tif out/reference.tif" + task);
  for (const GDALDataType type :
       {GDT_Byte, GDT_UInt16, GDT_Int16, GDT_UInt32, GDT_Int32, GDT_UInt64, GDT_Int64, GDT_Float32,
        GDT_CInt16, GDT_CInt32, GDT_CFloat32, GDT_CFloat64}) {
    Make("typed.tif", {.bands = 7, .type = type, .value = Count});
    ExpectDone("typed.tif out/typed.tif" + task);
    EXPECT_TRUE(Bits("out/typed.tif") == Bits("out/reference.tif")) << GDALGetDataTypeName(type);
  }
}

TEST_F(Indices, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  Make("scene.tif", {.bands = 6, .type = GDT_Byte, .value = Count, .noData = 50.0});
  // A list ends where the next option begins.
  const std::string roles = sixRoles + " --title indices scene.tif";
  ExpectTilesGiveTheSameBits(INDICES, "--index ndvi,savi,tvi,greenness" + roles);
  ExpectTilesGiveTheSameBits(INDICES, "--index ndvi,savi --scale 0.01,-0.1" + roles);
}

TEST_F(Indices, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  MakeScene(6);
  const std::string files = "scene.tif out/o.tif";
  const auto refused = [&](const std::string& arguments, const std::string& message) {
    ExpectRefused(INDICES, arguments, message);
  };
  refused("missing.tif out/o.tif" + sixRoles + " --index ndvi", "INPUT: missing.tif");
  refused(files + sixRoles + " --index evi", "--index: 'evi' is not usable; expected one of ngrdi");
  refused(files + " --roles blue,green,infrared --index ndvi", "--roles: 'infrared' is not usable");
  refused(files + " --roles red,nir --index ndvi", "--roles: 2 roles for 6 bands; expected one for each");
  refused(files + " --roles red,nir,red,other,other,other --index ndvi", "--roles: 'red' stands twice");
  refused(files + sixRoles + " --index ndvi,mcari",
          "--roles: mcari needs the role 'red-edge'; expected a band that has it");
  refused(files + sixRoles + " --index ndvi,savi --show tvi",
          "--show: 'tvi' is not computed; expected one of ndvi, savi");
  refused(files + sixRoles + " --index ndvi --scale 0", "--scale: a factor of 0");
  refused(files + sixRoles + " --index ndvi --scale some", "--scale: 'some' is not usable");
  refused(files + sixRoles + " --index ndvi --bands 7", "--bands: there is no band 7");
  refused(files + sixRoles + " --index ndvi --type Int16",
          "--type: 'Int16' is not usable; expected one of Float32, Float64");
  refused(files + sixRoles + " --index ndvi --tile 0", "--tile: '0'");
  refused(files + sixRoles + " --index ndvi --png out/o.jpg", "--png: 'out/o.jpg'");
  refused("scene.tif out/o.img" + sixRoles + " --index ndvi", "OUTPUT: 'out/o.img'");
  refused("scene.tif none/o.tif" + sixRoles + " --index ndvi", "OUTPUT: cannot write to folder 'none'");
  refused("scene.tif scene.tif" + sixRoles + " --index ndvi", "OUTPUT: 'scene.tif' is also 'scene.tif'");
  for (const std::string& arguments : {files + " --index ndvi", files + sixRoles}) {
    const Outcome outcome = Run(INDICES, arguments);
    EXPECT_EQ(outcome.status, 2);
    EXPECT_NE(outcome.errors.find("is required"), std::string::npos) << outcome.errors;
  }
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Indices, FiguresAndPictureAreThoseToShow) {
  MakeScene(6);
  const std::string task = "scene.tif out/o.tif" + sixRoles + " --index ndvi,savi,greenness";
  const Outcome all = Run(INDICES, task + " --png out/all.png");
  EXPECT_NE(all.output.find("out/o.tif: NDVI, SAVI, greenness, 3 bands, 83 x 61 Float32, in "),
            std::string::npos)
      << all.output;
  for (const std::string line : {"\n  band 1, NDVI: min ", "\n  band 2, SAVI: ", "\n  band 3, greenness: "})
    EXPECT_NE(all.output.find(line), std::string::npos) << all.output;
  EXPECT_EQ(all.errors, "NDVI, SAVI, greenness: 1 tile\n");
  const Outcome one = Run(INDICES, task + " --png out/one.png --show savi");
  EXPECT_NE(one.output.find("SAVI (band 2 of 3), 83 x 61 Float32, min "), std::string::npos) << one.output;
  EXPECT_EQ(one.output.find("NDVI ("), std::string::npos);
  EXPECT_GT(Open("out/all.png")->GetRasterXSize(), 1500);  // three maps side by side
  EXPECT_LT(Open("out/one.png")->GetRasterXSize(), 1100);
}

TEST_F(Indices, GeoreferenceIsPreserved) {
  MakeScene(6);
  ExpectDone("scene.tif out/o.tif" + sixRoles + " --index ndvi");
  double transform[6];
  ASSERT_EQ(Open("out/o.tif")->GetGeoTransform(transform), CE_None);
  EXPECT_EQ(transform[3], 4600000.0);
  EXPECT_TRUE(Open("out/o.tif")->GetSpatialRef()->IsSame(Open("scene.tif")->GetSpatialRef()));
}

TEST_F(Indices, HelpSaysWhatTheUnitsAre) {
  const Outcome outcome = Run(INDICES, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word :
       {"--roles", "--scale", "presume reflectances", "-1.18 and not -0.18", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
