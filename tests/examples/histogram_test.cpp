// The program of the histograms, run as a user runs it, on rasters that the tests make.

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

double Count(int x, int y, int band) { return 20 + (x * 7 + y * 3 + band * 11) % (90 + band); }
double Wide(int x, int y, int band) { return (x * 701 + y * 1303 + band * 977) % 65536; }
bool Hole(int x, int y) { return (x + 2 * y) % 19 == 0; }

using Counts = std::map<int, int>;

class Histogram : public ExamplesFixture {
 protected:
  void ExpectDone(const std::string& arguments) const { ExamplesFixture::ExpectDone(HISTOGRAM, arguments); }

  // What the table says of a column, without the zeros. Its lines have to follow each other by one.
  Counts Table(const std::string& name, std::size_t column) const {
    std::istringstream lines(ReadText(Path(name)));
    std::string line, field;
    std::getline(lines, line);
    Counts counts;
    int last = -1;
    while (std::getline(lines, line)) {
      std::istringstream fields(line);
      std::vector<int> numbers;
      while (std::getline(fields, field, ',')) numbers.push_back(std::stoi(field));
      EXPECT_TRUE(last == -1 || numbers[0] == last + 1) << line;
      last = numbers[0];
      if (numbers.at(column) != 0) counts[numbers[0]] = numbers.at(column);
    }
    return counts;
  }

  // "  band 1: min 20, mean 65.12, max 110, 5063 pixels"
  static std::string Line(const std::string& name, const Counts& counts) {
    double sum = 0.0;
    int total = 0;
    for (const auto& [value, count] : counts) {
      sum += static_cast<double>(value) * count;
      total += count;
    }
    return CPLSPrintf("  %s: min %d, mean %.2f, max %d, %d pixels\n", name.c_str(), counts.begin()->first,
                      sum / total, counts.rbegin()->first, total);
  }
};

Counts CountsOf(double (*value)(int, int, int), int band, bool (*left)(int, int) = nullptr) {
  Counts counts;
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x)
      if (!left || !left(x, y)) ++counts[static_cast<int>(value(x, y, band))];
  return counts;
}

TEST_F(Histogram, EveryValueIsCounted) {
  for (const GDALDataType type : {GDT_Byte, GDT_UInt16}) {
    double (*const value)(int, int, int) = type == GDT_Byte ? Count : Wide;
    Make("scene.tif", {.bands = 3, .type = type, .value = value});
    for (const std::string tile : {"512", "7"}) {
      const Outcome outcome = Run(HISTOGRAM, "scene.tif --png out/h.png --csv out/h.csv --tile " + tile);
      ASSERT_EQ(outcome.status, 0) << outcome.errors;
      std::string expected = "out/h.png, out/h.csv:\n";
      for (const int band : {1, 2, 3}) {
        const Counts counts = CountsOf(value, band);
        EXPECT_EQ(Table("out/h.csv", static_cast<std::size_t>(band)), counts);
        expected += Line(CPLSPrintf("band %d", band), counts);
      }
      EXPECT_EQ(outcome.output, expected);
      EXPECT_EQ(ReadText(Path("out/h.csv")).find("value,band 1,band 2,band 3\n"), 0u);
    }
  }
  ExpectDone("scene.tif --png out/h.png --csv out/h.csv --bands 3,1");
  EXPECT_EQ(Table("out/h.csv", 1), CountsOf(Wide, 3));
  EXPECT_EQ(Table("out/h.csv", 2), CountsOf(Wide, 1));
}

TEST_F(Histogram, NoDataIsNotCounted) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) && b == 2 ? 255.0 : Count(x, y, b); };
  Make("scene.tif", {.bands = 2, .type = GDT_Byte, .value = value, .noData = 255.0});
  for (const std::string tile : {"512", "13"}) {
    ExpectDone("scene.tif --png out/h.png --csv out/h.csv --tile " + tile);
    EXPECT_EQ(Table("out/h.csv", 1), CountsOf(Count, 1, Hole));
    EXPECT_EQ(Table("out/h.csv", 2), CountsOf(Count, 2, Hole));
  }
}

TEST_F(Histogram, TheSyntheticBlueTakesThePlaceOfTheThirdBand) {
  Make("scene.tif", {.bands = 4, .type = GDT_Byte, .value = Count, .noData = 33.0});
  ExpectDone("scene.tif --png out/h.png --csv out/h.csv --bands 4,2,3 --synthetic-blue");
  Counts green, blue;
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      const double s[] = {Count(x, y, 4), Count(x, y, 2), Count(x, y, 3)};
      if (s[0] == 33.0 || s[1] == 33.0 || s[2] == 33.0) continue;
      ++green[static_cast<int>(s[0])];
      const double b = 0.873393 * s[0] + 13.9054 - 0.138254 * s[1] - 0.100616 * s[2];
      ++blue[std::clamp(static_cast<int>(b), 0, 255)];
    }
  }
  EXPECT_EQ(Table("out/h.csv", 1), green);
  EXPECT_EQ(Table("out/h.csv", 3), blue);
  EXPECT_EQ(ReadText(Path("out/h.csv")).find("value,green (band 4),red (band 2),synthetic blue\n"), 0u);
}

// The colour of a pixel of the plot.
std::vector<int> ColourAt(GDALDataset& plot, int x, int y) {
  std::vector<int> colour(3);
  for (int band = 1; band <= 3; ++band)
    EXPECT_EQ(
        plot.GetRasterBand(band)->RasterIO(GF_Read, x, y, 1, 1, &colour[static_cast<std::size_t>(band) - 1],
                                           1, 1, GDT_Int32, 0, 0, nullptr),
        CE_None);
  return colour;
}

TEST_F(Histogram, ThePlotIsHighWhereTheCountsAre) {
  // 61 x 60 samples of 100, as many of 120 but a third, and none between.
  Make("scene.tif", {.type = GDT_Byte, .value = [](int x, int, int) {
                       return x < 60 ? 100.0 : x < 80 ? 120.0 : x == 80 ? 80.0 : 140.0;
                     }});
  ExpectDone("scene.tif --png out/h.png");
  const DatasetPtr plot = Open("out/h.png");
  ASSERT_TRUE(plot);
  // From 80 to 140 along 708 pixels from column 104 on; 0 to 4000 along 460 pixels upwards from row 544 on.
  const auto column = [](int value) { return 104 + static_cast<int>((value - 80 + 0.5) * 708 / 61); };
  const auto row = [](double count) { return 544 - static_cast<int>(count * 460 / 4000); };
  const std::vector<int> area = ColourAt(*plot, column(100), row(300));
  EXPECT_GT(area[2], area[0] + 30);  // blue
  EXPECT_EQ(ColourAt(*plot, column(100), row(3300)), area);
  EXPECT_EQ(ColourAt(*plot, column(120), row(300)), area);
  EXPECT_EQ(ColourAt(*plot, column(100), row(3850)), (std::vector<int>{255, 255, 255}));
  EXPECT_EQ(ColourAt(*plot, column(120), row(1400)), (std::vector<int>{255, 255, 255}));
  EXPECT_EQ(ColourAt(*plot, column(110), row(300)), (std::vector<int>{255, 255, 255}));
}

TEST_F(Histogram, BadArgumentsAreRefusedBeforeAnythingIsWritten) {
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = Count});
  Make("short.tif", {.type = GDT_Int16, .value = Count});
  Make("float.tif", {.type = GDT_Float32, .value = Count});
  Make("many.tif", {.bands = 9, .type = GDT_Byte, .value = Count});
  Make("empty.tif", {.type = GDT_Byte, .value = [](int, int, int) { return 9.0; }, .noData = 9.0});
  const auto refused = [&](const std::string& arguments, const std::string& message) {
    ExpectRefused(HISTOGRAM, arguments, message);
  };
  refused("missing.tif --png out/h.png", "INPUT: missing.tif");
  refused("short.tif --png out/h.png --csv out/h.csv",
          "INPUT: band 1 has samples of type Int16, and only whole numbers from 0 to 65535 have a bin");
  refused("float.tif --png out/h.png", "INPUT: band 1 has samples of type Float32");
  refused("empty.tif --png out/h.png --csv out/h.csv", "INPUT: has no valid pixel; expected a raster with");
  refused("many.tif --png out/h.png", "--bands: 9 bands are too many for a plot; expected at most 8");
  refused("scene.tif --png out/h.png --bands 4", "--bands: there is no band 4");
  refused("scene.tif --png out/h.png --bands 1,2 --synthetic-blue",
          "--synthetic-blue: 2 bands; expected three --bands");
  refused("scene.tif --png out/h.png --tile 0", "--tile: '0'");
  refused("scene.tif --png out/h.jpg", "--png: 'out/h.jpg'");
  refused("scene.tif --png none/h.png", "--png: cannot write to folder 'none'");
  refused("scene.tif --png out/h.png --csv out/h.txt", "--csv: 'out/h.txt'");
  refused("scene.tif --png out/h.png --csv none/h.csv", "--csv: cannot write to folder 'none'");
  EXPECT_EQ(Run(HISTOGRAM, "scene.tif").status, 2);
  EXPECT_EQ(Run(HISTOGRAM, "scene.tif --csv out/h.csv").status, 2);
  EXPECT_TRUE(Outputs().empty());
}

TEST_F(Histogram, AFullDiskLeavesTheOldFiles) {
  Make("scene.tif", {.type = GDT_UInt16, .value = Wide});
  std::ofstream(Path("out/h.png")) << "the old plot\n";
  std::ofstream(Path("out/h.csv")) << "the old table\n";
  const Outcome outcome =
      Run(HISTOGRAM, "scene.tif --png out/h.png --csv out/h.csv", "trap '' XFSZ; ulimit -f 200 &&");
  EXPECT_EQ(outcome.status, 1) << outcome.errors;
  EXPECT_EQ(ReadText(Path("out/h.png")), "the old plot\n");
  EXPECT_EQ(ReadText(Path("out/h.csv")), "the old table\n");
  EXPECT_EQ(Outputs().size(), 2u);
}

TEST_F(Histogram, HelpSaysWhatIsCounted) {
  const Outcome outcome = Run(HISTOGRAM, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word :
       {"--synthetic-blue", "--csv", "one of the bands that are read", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
