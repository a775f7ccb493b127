// The example programs, run as a user runs them, on rasters that the tests make.

#include <cmath>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

class Examples : public ExamplesFixture {};

double WithHoles(int x, int y, int band) {
  return (x * 31 + y * 17) % 23 < 3 || (x > 60 && y > 50) ? -9999.0 : Hill(x, y, band);
}

TEST_F(Examples, TilesOfAnySizeGiveTheBitsOfTheWholeImage) {
  Make("float.tif", {.width = 61, .height = 53, .value = WithHoles, .noData = -9999.0});
  Make("short.tif", {.width = 61, .height = 53, .type = GDT_Int16, .value = WithHoles, .noData = -9999.0});
  Make("bands.tif",
       {.width = 61, .height = 53, .bands = 4, .type = GDT_Int16, .value = WithHoles, .noData = -9999.0});
  for (const std::string input : {"float.tif", "short.tif"}) {
    ExpectTilesGiveTheSameBits(TERRAIN, "slope " + input);
    ExpectTilesGiveTheSameBits(TERRAIN, "aspect " + input);
    ExpectTilesGiveTheSameBits(TERRAIN, "aspect --type Byte " + input);
  }
  ExpectTilesGiveTheSameBits(BANDMEAN, "bands.tif");
  ExpectTilesGiveTheSameBits(BANDMEAN, "--type Int16 bands.tif");
}

TEST_F(Examples, TilesGiveTheBitsOfAnImageThatIsLargerThanThey) {
  Make("large.tif", {.width = 611, .height = 307, .value = WithHoles, .noData = -9999.0});
  ExpectTilesGiveTheSameBits(TERRAIN, "slope large.tif");
  ExpectTilesGiveTheSameBits(TERRAIN, "aspect large.tif");
}

TEST_F(Examples, SlopeOfAPlaneIsItsInclination) {
  // 25 up for each row of 25 southwards: 45 degrees, falling to the north. The last row repeats its pixels.
  Make("plane.tif", {.value = [](int, int y, int) { return 25.0 * y; }});
  ASSERT_EQ(Run(TERRAIN, "slope plane.tif out/s.tif").status, 0);
  ASSERT_EQ(Run(TERRAIN, "aspect plane.tif out/a.tif").status, 0);
  const std::vector<double> slope = Values("out/s.tif"), aspect = Values("out/a.tif");
  for (std::size_t i = 0; i < 83 * 60; ++i) {
    ASSERT_NEAR(slope[i], 45.0, 1e-4);
    ASSERT_EQ(aspect[i], 0.0);
  }
  for (std::size_t i = 83 * 60; i < 83 * 61; ++i) {
    ASSERT_EQ(slope[i], 0.0);
    ASSERT_EQ(aspect[i], -1.0);
  }
}

TEST_F(Examples, SpacingsFollowTheScaleAndTheFactor) {
  Make("plane.tif", {.value = [](int x, int, int) { return 30.0 * x; }});
  ASSERT_EQ(Run(TERRAIN, "slope plane.tif out/a.tif --scale 2,1").status, 0);
  EXPECT_NEAR(Values("out/a.tif")[0], std::atan(0.5) * 180.0 / M_PI, 1e-4);
  ASSERT_EQ(Run(TERRAIN, "slope plane.tif out/b.tif --z-factor 0.5").status, 0);
  EXPECT_NEAR(Values("out/b.tif")[0], std::atan(0.5) * 180.0 / M_PI, 1e-4);
}

TEST_F(Examples, AspectIsACompassDirectionInSouthUpRastersToo) {
  const auto falls = [](int x, int y, int) { return 1000.0 - 3.0 * x - 7.0 * y; };
  Make("north.tif", {.transform = {0.0, 10.0, 0.0, 0.0, 0.0, -10.0}, .value = falls});
  Make("south.tif", {.transform = {0.0, 10.0, 0.0, 0.0, 0.0, 10.0}, .value = falls});
  Make("west.tif", {.transform = {0.0, -10.0, 0.0, 0.0, 0.0, -10.0}, .value = falls});
  const double east = std::atan2(3.0, 7.0) * 180.0 / M_PI;
  for (const auto& [name, expected] :
       {std::pair<std::string, double>{"north", 180.0 - east}, {"south", east}, {"west", 180.0 + east}}) {
    ASSERT_EQ(Run(TERRAIN, "aspect " + name + ".tif out/" + name + ".tif").status, 0);
    EXPECT_NEAR(Values("out/" + name + ".tif")[0], expected, 1e-3) << name;
  }
}

TEST_F(Examples, NoDataStaysNoData) {
  Make("holes.tif", {.type = GDT_Int16, .value = WithHoles, .noData = -9999.0});
  for (const std::string task : {"slope", "aspect"}) {
    ASSERT_EQ(Run(TERRAIN, task + " holes.tif out/" + task + ".tif").status, 0);
    const std::vector<double> values = Values("out/" + task + ".tif");
    for (int y = 0; y < 61; ++y)
      for (int x = 0; x < 83; ++x)
        ASSERT_EQ(std::isnan(values[static_cast<std::size_t>(y * 83 + x)]), WithHoles(x, y, 1) == -9999.0)
            << x << " " << y;
    int given = 0;
    EXPECT_TRUE(std::isnan(Open("out/" + task + ".tif")->GetRasterBand(1)->GetNoDataValue(&given)));
    EXPECT_EQ(given, 1);
  }
}

TEST_F(Examples, NaNIsNoDataWithoutBeingDeclared) {
  const auto value = [](int x, int y, int) { return x == 5 && y == 6 ? std::nan("") : 10.0 * y; };
  Make("nan.tif", {.value = value});
  ASSERT_EQ(Run(TERRAIN, "slope nan.tif out/s.tif --type Int16").status, 0);
  EXPECT_EQ(Values("out/s.tif")[6 * 83 + 5], -32768.0);
  EXPECT_EQ(Values("out/s.tif")[6 * 83 + 4], std::round(std::atan(10.0 / 25.0) * 180.0 / M_PI));
}

TEST_F(Examples, StatedNoDataIsWritten) {
  Make("holes.tif", {.value = WithHoles, .noData = -9999.0});
  ASSERT_EQ(Run(TERRAIN, "slope holes.tif out/s.tif --nodata -7").status, 0);
  const std::vector<double> values = Values("out/s.tif");
  EXPECT_EQ(values[0], -7.0);  // WithHoles(0, 0)
  EXPECT_EQ(Open("out/s.tif")->GetRasterBand(1)->GetNoDataValue(), -7.0);
}

TEST_F(Examples, MeanOfBands) {
  Make("bands.tif",
       {.bands = 3,
        .type = GDT_Byte,
        .value = [](int x, int y, int band) { return x == 1 && y == 0 && band == 2 ? 255.0 : x + y * band; },
        .noData = 255.0});
  ASSERT_EQ(Run(BANDMEAN, "bands.tif out/m.tif").status, 0);
  const std::vector<double> mean = Values("out/m.tif");
  EXPECT_EQ(mean[0], 0.0);
  EXPECT_TRUE(std::isnan(mean[1]));
  EXPECT_EQ(mean[83 * 2 + 3], 3.0 + 2.0 * 2.0);
  ASSERT_EQ(Run(BANDMEAN, "bands.tif out/two.tif --bands 1,2 --type Int16").status, 0);
  EXPECT_EQ(Values("out/two.tif")[1], 255.0);
  EXPECT_EQ(Values("out/two.tif")[83 * 2 + 3], 6.0);
  EXPECT_EQ(Open("out/two.tif")->GetRasterBand(1)->GetNoDataValue(), 255.0);
}

TEST_F(Examples, EveryPixelTypeIsRead) {
  Make("reference.tif", {.type = GDT_Float64});
  ASSERT_EQ(Run(TERRAIN, "slope reference.tif out/reference.tif").status, 0);
  for (const GDALDataType type :
       {GDT_Byte, GDT_UInt16, GDT_Int16, GDT_UInt32, GDT_Int32, GDT_UInt64, GDT_Int64, GDT_Float32,
        GDT_CInt16, GDT_CInt32, GDT_CFloat32, GDT_CFloat64}) {
    Make("typed.tif", {.type = type});
    ASSERT_EQ(Run(TERRAIN, "slope typed.tif out/typed.tif").status, 0) << GDALGetDataTypeName(type);
    EXPECT_TRUE(Bits("out/typed.tif") == Bits("out/reference.tif")) << GDALGetDataTypeName(type);
  }
}

TEST_F(Examples, SignedBytesAreRead) {
  GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("GTiff");
  Make("reference.tif", {.type = GDT_Int16, .value = [](int x, int y, int) { return x - y - 10.0; }});
  const char* const options[] = {"PIXELTYPE=SIGNEDBYTE", nullptr};
  {
    const DatasetPtr dataset(
        driver->Create(Path("bytes.tif").c_str(), 83, 61, 1, GDT_Byte, const_cast<char**>(options)));
    double transform[] = {500000.0, 30.0, 0.0, 4600000.0, 0.0, -25.0};
    dataset->SetGeoTransform(transform);
    std::vector<unsigned char> samples(83 * 61);
    for (int i = 0; i < 83 * 61; ++i)
      samples[static_cast<std::size_t>(i)] = static_cast<unsigned char>(i % 83 - i / 83 - 10);
    ASSERT_EQ(dataset->GetRasterBand(1)->RasterIO(GF_Write, 0, 0, 83, 61, samples.data(), 83, 61, GDT_Byte, 0,
                                                  0, nullptr),
              CE_None);
  }
  ASSERT_EQ(Run(TERRAIN, "slope reference.tif out/reference.tif").status, 0);
  ASSERT_EQ(Run(TERRAIN, "slope bytes.tif out/bytes.tif").status, 0);
  EXPECT_TRUE(Bits("out/bytes.tif") == Bits("out/reference.tif"));
}

TEST_F(Examples, GeoreferenceIsPreserved) {
  Make("dem.tif", {.bands = 2});
  for (const auto& [program, task] :
       {std::pair<std::string, std::string>{TERRAIN, "slope "}, {TERRAIN, "aspect "}, {BANDMEAN, ""}}) {
    ASSERT_EQ(Run(program, task + "dem.tif out/o.tif").status, 0);
    const DatasetPtr in = Open("dem.tif"), out = Open("out/o.tif");
    double expected[6], transform[6];
    ASSERT_EQ(in->GetGeoTransform(expected), CE_None);
    ASSERT_EQ(out->GetGeoTransform(transform), CE_None);
    EXPECT_EQ(std::memcmp(expected, transform, sizeof(transform)), 0);
    ASSERT_NE(out->GetSpatialRef(), nullptr);
    EXPECT_TRUE(out->GetSpatialRef()->IsSame(in->GetSpatialRef()));
  }
}

TEST_F(Examples, AspectSaysWhatAFlatCellHolds) {
  Make("level.tif", {.value = [](int, int, int) { return 3.0; }});
  for (const auto& [options, flat] :
       {std::pair<std::string, std::string>{"", "-1"}, {" --type Byte", "254"}, {" --flat 400", "400"}}) {
    ASSERT_EQ(Run(TERRAIN, "aspect level.tif out/a.tif" + options).status, 0);
    EXPECT_EQ(Values("out/a.tif")[0], std::stod(flat));
    EXPECT_STREQ(Open("out/a.tif")->GetRasterBand(1)->GetMetadataItem("FLAT_VALUE"), flat.c_str());
  }
}

TEST_F(Examples, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  Make("dem.tif", {});
  std::ofstream(Path("text.tif")) << "no raster\n";
  ExpectRefused(TERRAIN, "slope missing.tif out/s.tif", "INPUT: missing.tif");
  ExpectRefused(TERRAIN, "slope text.tif out/s.tif", "INPUT: `text.tif'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --type Float16", "--type: 'Float16'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --tile 0", "--tile: '0'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --tile some", "--tile: 'some'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --band 2", "--band: there is no band 2");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --scale 0", "--scale: '0'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --z-factor inf", "--z-factor: 'inf'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --type Byte --nodata -1", "--nodata: -1");
  ExpectRefused(TERRAIN, "aspect dem.tif out/s.tif --type Byte --flat 400", "--flat: 400");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.img", "OUTPUT: 'out/s.img'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --png out/s.jpg", "--png: 'out/s.jpg'");
  ExpectRefused(TERRAIN, "slope dem.tif none/s.tif", "OUTPUT: cannot write to folder 'none'");
  ExpectRefused(TERRAIN, "slope dem.tif /proc/s.tif", "OUTPUT: cannot write to folder '/proc'");
  ExpectRefused(TERRAIN, "slope dem.tif out/s.tif --png none/s.png", "--png: cannot write to folder 'none'");
  ExpectRefused(BANDMEAN, "dem.tif out/s.tif --bands 1,2", "--bands: there is no band 2");
  EXPECT_EQ(Run(TERRAIN, "slope dem.tif out/s.tif --nonsense 3").status, 2);
  EXPECT_EQ(Run(TERRAIN, "slope dem.tif").status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Examples, CellsWithoutALengthAreRefused) {
  Make("degrees.tif", {.transform = {10.0, 0.01, 0.0, 50.0, 0.0, -0.01}, .epsg = 4326});
  Make("bare.tif", {.transform = {}, .epsg = 0});
  Make("sheared.tif", {.transform = {0.0, 10.0, 2.0, 0.0, 1.0, -10.0}});
  // The remedy is worked out for the centre of the raster, at 50 - 61 / 2 x 0.01 degrees.
  const double degree = 6378137.0 * M_PI / 180.0;
  const std::string remedy =
      CPLSPrintf("--scale %.0f,%.0f", degree * std::cos(49.695 * M_PI / 180.0), degree);
  for (const std::string task : {"slope ", "aspect "}) {
    ExpectRefused(TERRAIN, task + "degrees.tif out/s.tif", remedy);
    ExpectRefused(TERRAIN, task + "bare.tif out/s.tif", "has no georeference");
    ExpectRefused(TERRAIN, task + "sheared.tif out/s.tif", "is rotated or sheared");
  }
  EXPECT_EQ(Run(TERRAIN, "slope degrees.tif out/a.tif " + remedy).status, 0);
  EXPECT_EQ(Run(TERRAIN, "slope bare.tif out/b.tif --scale 30").status, 0);
}

TEST_F(Examples, TheInputIsNeverOverwritten) {
  Make("dem.tif", {});
  fs::create_symlink("dem.tif", Path("link.tif"));
  fs::create_hard_link(Path("dem.tif"), Path("twin.tif"));
  const std::string before = ReadText(Path("dem.tif"));
  for (const std::string output : {"dem.tif", "./out/../dem.tif", "link.tif", "twin.tif"})
    ExpectRefused(TERRAIN, "slope dem.tif " + output, "OUTPUT: '" + output + "'");
  EXPECT_TRUE(ReadText(Path("dem.tif")) == before);
}

TEST_F(Examples, AFullDiskLeavesTheOldOutput) {
  Make("dem.tif", {.width = 400, .height = 400});
  std::ofstream(Path("out/s.tif")) << "the old file\n";
  std::ofstream(Path("out/s.png")) << "the old picture\n";
  const Outcome outcome = Run(TERRAIN, "slope dem.tif out/s.tif --png out/s.png", "ulimit -f 100 &&");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_NE(outcome.errors.find("'out/s.tif'"), std::string::npos) << outcome.errors;
  EXPECT_EQ(ReadText(Path("out/s.tif")), "the old file\n");
  EXPECT_EQ(ReadText(Path("out/s.png")), "the old picture\n");
  EXPECT_EQ(Outputs().size(), 2u);
}

TEST_F(Examples, AnInputThatBreaksOffLeavesNoOutput) {
  Make("dem.tif", {.width = 400, .height = 400});
  fs::resize_file(Path("dem.tif"), 300000);
  const Outcome outcome = Run(TERRAIN, "slope dem.tif out/s.tif");
  EXPECT_EQ(outcome.status, 1);
  EXPECT_NE(outcome.errors.find("reading INPUT"), std::string::npos) << outcome.errors;
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Examples, ASignalLeavesNoOutput) {
  Make("dem.tif", {.width = 1500, .height = 1500});
  // One-pixel tiles take minutes; the signal comes once the temporary file is there.
  const std::string script =
      "'" TERRAIN
      "' slope dem.tif out/s.tif --tile 1 & p=$!; "
      "until [ -n \"$(ls -A out)\" ]; do sleep 0.01; done; kill -TERM $p; wait $p; exit $?";
  std::ofstream(Path("run.sh")) << script;
  EXPECT_EQ(Run("/bin/sh", "run.sh").status, 128 + SIGTERM);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Examples, ThePictureShowsNoDataAsTransparent) {
  Make("holes.tif", {.value = WithHoles, .noData = -9999.0});
  for (const std::string task : {"slope", "aspect"}) {
    ASSERT_EQ(Run(TERRAIN, task + " holes.tif out/s.tif --png out/" + task + ".png --title 'A title'").status,
              0);
    const DatasetPtr picture = Open("out/" + task + ".png");
    ASSERT_TRUE(picture);
    ASSERT_EQ(picture->GetRasterCount(), 4);
    EXPECT_GE(picture->GetRasterXSize(), 800);
    double histogram[2] = {0.0, 0.0};
    std::vector<unsigned char> row(static_cast<std::size_t>(picture->GetRasterXSize()));
    const int width = picture->GetRasterXSize();
    for (int y = 0; y < picture->GetRasterYSize(); ++y) {
      ASSERT_EQ(picture->GetRasterBand(4)->RasterIO(GF_Read, 0, y, width, 1, row.data(), width, 1, GDT_Byte,
                                                    0, 0, nullptr),
                CE_None);
      for (const unsigned char alpha : row) histogram[alpha == 0 ? 0 : 1] += 1.0;
    }
    int holes = 0;
    for (int i = 0; i < 83 * 61; ++i) holes += WithHoles(i % 83, i / 83, 1) == -9999.0 ? 1 : 0;
    EXPECT_NEAR(histogram[0], holes * 10.0 * 10.0, 600.0);  // enlarged by 10; the frame covers half pixels
  }
}

TEST_F(Examples, ProgressIsOnePlainLineWithoutATerminal) {
  Make("dem.tif", {});
  const Outcome outcome = Run(TERRAIN, "slope dem.tif out/s.tif --tile 16");
  ASSERT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.errors, "slope: 24 tiles\n");
  EXPECT_EQ(outcome.output.find('\r'), std::string::npos);
  EXPECT_NE(outcome.output.find("5063 of 5063 pixels valid"), std::string::npos) << outcome.output;
}

TEST_F(Examples, HelpExplainsItself) {
  const Outcome outcome = Run(TERRAIN, "aspect --help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word : {"--scale", "--tile", "--flat", "edge pixel is repeated", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
