// The program of the focus measures, run as a user runs it, on rasters that the tests make.

#include <algorithm>
#include <cmath>
#include <sstream>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

// What the program prints for a band: the figure of the image as it is, then one for each blur.
struct Figures {
  std::vector<double> vollath;
  std::vector<double> gradient;
};

constexpr double none = -1e300;  // a pixel without data

// The pixels of an image in rows.
using Image = std::vector<std::vector<double>>;

double Vollath(const Image& image) {
  double sum = 0.0;
  for (const std::vector<double>& row : image)
    for (std::size_t x = 0; x + 2 < row.size(); ++x)
      if (row[x] != none && row[x + 1] != none && row[x + 2] != none)
        sum += row[x] * row[x + 1] - row[x] * row[x + 2];
  return sum;
}

double Gradient(const Image& image) {
  double sum = 0.0;
  for (std::size_t y = 0; y + 1 < image.size(); ++y)
    for (std::size_t x = 0; x < image[y].size(); ++x)
      if (image[y][x] != none && image[y + 1][x] != none) sum += std::pow(image[y + 1][x] - image[y][x], 2);
  return sum;
}

Image Blurred(const Image& image, int radius) {
  Image blurred = image;
  const int height = static_cast<int>(image.size()), width = static_cast<int>(image[0].size());
  for (int y = 0; y < height; ++y) {
    for (int x = 0; x < width; ++x) {
      double sum = 0.0, count = 0.0;
      for (int v = std::max(0, y - radius); v <= std::min(height - 1, y + radius); ++v) {
        for (int u = std::max(0, x - radius); u <= std::min(width - 1, x + radius); ++u) {
          const double sample = image[static_cast<std::size_t>(v)][static_cast<std::size_t>(u)];
          if (sample == none) continue;
          sum += sample;
          count += 1.0;
        }
      }
      double& to = blurred[static_cast<std::size_t>(y)][static_cast<std::size_t>(x)];
      if (to != none) to = sum / count;
    }
  }
  return blurred;
}

double Count(int x, int y, int band) { return 20 + (x * x * 7 + y * y * 13 + x * y + band * 11) % 97; }

bool Hole(int x, int y) { return (x * 5 + y * 3) % 17 == 0; }

class Focus : public ExamplesFixture {
 protected:
  // The figures of every band; percentages are skipped.
  std::vector<Figures> Measured(const std::string& arguments) const {
    const Outcome outcome = Run(FOCUS, arguments);
    EXPECT_EQ(outcome.status, 0) << outcome.errors;
    std::istringstream lines(outcome.output);
    std::vector<Figures> bands;
    for (std::string line; std::getline(lines, line);) {
      const std::size_t vollath = line.find("Vollath"), gradient = line.find("squared gradient");
      if (vollath == std::string::npos && gradient == std::string::npos) continue;
      if (vollath != std::string::npos) bands.emplace_back();
      std::istringstream words(line.substr(23));
      std::vector<double>& figures =
          vollath != std::string::npos ? bands.back().vollath : bands.back().gradient;
      for (std::string word, next; words >> word;) {
        if (word != "%") figures.push_back(std::stod(word));
        if (figures.size() > 1 && word != "%") words >> next;  // the percentage
      }
    }
    return bands;
  }

  Image ImageOf(int width, int height, int band, bool holes) const {
    Image image(static_cast<std::size_t>(height), std::vector<double>(static_cast<std::size_t>(width)));
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x)
        image[static_cast<std::size_t>(y)][static_cast<std::size_t>(x)] =
            holes && Hole(x, y) ? none : Count(x, y, band);
    return image;
  }

  void ExpectFigures(const std::vector<Figures>& bands, bool holes) const {
    for (std::size_t i = 0; i < bands.size(); ++i) {
      const Image image = ImageOf(61, 47, static_cast<int>(i) + 1, holes);
      ASSERT_EQ(bands[i].vollath.size(), 3u);
      ASSERT_EQ(bands[i].gradient.size(), 3u);
      for (const int radius : {0, 1, 3}) {
        const Image expected = Blurred(image, radius);
        const std::size_t at = radius == 3 ? 2 : static_cast<std::size_t>(radius);
        EXPECT_NEAR(bands[i].vollath[at], Vollath(expected), 1e-5 * std::abs(Vollath(expected)));
        EXPECT_NEAR(bands[i].gradient[at], Gradient(expected), 1e-5 * Gradient(expected));
      }
      for (const std::size_t at : {1u, 2u}) {
        EXPECT_LT(bands[i].gradient[at], bands[i].gradient[at - 1]);
      }
    }
  }
};

TEST_F(Focus, FiguresAreThoseOfTheImageAndOfItsBlurs) {
  for (const GDALDataType type : {GDT_Byte, GDT_Int16, GDT_Float32, GDT_Float64, GDT_CFloat32}) {
    Make("scene.tif", {.width = 61, .height = 47, .bands = 2, .type = type, .value = Count});
    const std::vector<Figures> bands = Measured("scene.tif --blur 1,3");
    ASSERT_EQ(bands.size(), 2u);
    ExpectFigures(bands, false);
  }
}

TEST_F(Focus, PixelsWithoutDataAreLeftOutOfAllImages) {
  const auto value = [](int x, int y, int b) { return Hole(x, y) ? 255.0 : Count(x, y, b); };
  Make("scene.tif",
       {.width = 61, .height = 47, .bands = 2, .type = GDT_Byte, .value = value, .noData = 255.0});
  const std::vector<Figures> bands = Measured("scene.tif --blur 1,3");
  ASSERT_EQ(bands.size(), 2u);
  ExpectFigures(bands, true);
}

TEST_F(Focus, BothMeasuresFallWithABlur) {
  // Edges between smooth parts, as in a scene; both measures of it are far above 0.
  const auto value = [](int x, int y, int) {
    return 60.0 + 50.0 * ((x / 9 + y / 7) % 2) + 10.0 * std::sin(x * 0.3);
  };
  Make("scene.tif", {.width = 90, .height = 70, .type = GDT_Byte, .value = value});
  const std::vector<Figures> bands = Measured("scene.tif --blur 1,2,4");
  ASSERT_EQ(bands.size(), 1u);
  ASSERT_EQ(bands[0].vollath.size(), 4u);
  for (const std::size_t at : {1u, 2u, 3u}) {
    EXPECT_LT(bands[0].vollath[at], bands[0].vollath[at - 1]);
    EXPECT_LT(bands[0].gradient[at], bands[0].gradient[at - 1]);
  }
}

TEST_F(Focus, ValuesThatTheOperatorsLeaveOutByDefaultCount) {
  const auto value = [](int x, int y, int) { return x < 3 ? -32767.0 : 2e7 + 100.0 * ((x + y) % 5); };
  Make("scene.tif", {.width = 20, .height = 20, .type = GDT_Int32, .value = value});
  const std::vector<Figures> bands = Measured("scene.tif --blur 1");
  ASSERT_EQ(bands.size(), 1u);
  Image image(20, std::vector<double>(20));
  for (int y = 0; y < 20; ++y)
    for (int x = 0; x < 20; ++x)
      image[static_cast<std::size_t>(y)][static_cast<std::size_t>(x)] = value(x, y, 1);
  EXPECT_NEAR(bands[0].gradient[0], Gradient(image), 1e-5 * Gradient(image));
  EXPECT_NEAR(bands[0].vollath[0], Vollath(image), 1e-5 * std::abs(Vollath(image)));
}

TEST_F(Focus, OnlyTheTableIsOnStandardOutput) {
  Make("scene.tif", {.width = 61, .height = 47, .bands = 3, .type = GDT_Byte, .value = Count});
  const Outcome outcome = Run(FOCUS, "scene.tif --bands 3,1");
  EXPECT_EQ(outcome.status, 0);
  EXPECT_EQ(outcome.errors, "");
  EXPECT_EQ(std::count(outcome.output.begin(), outcome.output.end(), '\n'), 6);
  EXPECT_EQ(outcome.output.find("BEFORE"), std::string::npos) << outcome.output;
  EXPECT_EQ(outcome.output.rfind("scene.tif: 61 x 47 pixels, cells of 30 x 25 m\n", 0), 0u) << outcome.output;
  EXPECT_NE(outcome.output.find("\n3 "), std::string::npos);
  EXPECT_EQ(outcome.output.find("\n2 "), std::string::npos);
}

TEST_F(Focus, ThePictureShowsTheBandAndEachBlur) {
  Make("scene.tif", {.width = 61, .height = 47, .type = GDT_Byte, .value = Count, .noData = 30.0});
  const std::string task = "scene.tif --blur ";
  const std::string without = Run(FOCUS, task + "1,2").output;
  const Outcome two = Run(FOCUS, task + "1,2 --png out/two.png");
  ASSERT_EQ(two.status, 0) << two.errors;
  EXPECT_EQ(two.output, without);
  ASSERT_EQ(Run(FOCUS, task + "1 --png out/one.png").status, 0);
  ASSERT_EQ(Run(FOCUS, task + "9 --png out/wide.png").status, 0);
  const DatasetPtr one = Open("out/one.png"), three = Open("out/two.png");
  EXPECT_GT(three->GetRasterXSize() * one->GetRasterYSize(), one->GetRasterXSize() * three->GetRasterYSize());
  EXPECT_NE(Bits("out/one.png"), Bits("out/wide.png"));
}

TEST_F(Focus, BadArgumentsAreRefusedBeforeAnythingIsPrinted) {
  Make("scene.tif", {.bands = 2, .type = GDT_Byte});
  for (const auto& [arguments, message] :
       {std::pair<std::string, std::string>{"missing.tif", "INPUT: missing.tif"},
        {"scene.tif --bands 3", "--bands: there is no band 3 in INPUT; expected a band from 1 to 2"},
        {"scene.tif --png out/f.png", "--png: 2 bands are measured; expected one, as with --bands 4"},
        {"scene.tif --bands 1 --png out/f.jpg", "--png: 'out/f.jpg'"},
        {"scene.tif --blur 0", "--blur: '0' is not usable; expected a whole number from 1 to 1000"},
        {"scene.tif --blur wide", "--blur: 'wide' is not usable; expected a whole number from 1 to 1000"}}) {
    ExpectRefused(FOCUS, arguments, message);
    EXPECT_EQ(Run(FOCUS, arguments).output, "");
  }
  EXPECT_EQ(Run(FOCUS, "").status, 2);
}

TEST_F(Focus, ARasterThatIsTooLargeIsRefused) {
  Make("small.tif", {.width = 4, .height = 4, .type = GDT_Byte});
  std::ofstream(Path("large.vrt"))
      << "<VRTDataset rasterXSize=\"20000\" rasterYSize=\"20000\"><VRTRasterBand dataType=\"Byte\" "
         "band=\"1\">"
         "<SimpleSource><SourceFilename relativeToVRT=\"1\">small.tif</SourceFilename></SimpleSource>"
         "</VRTRasterBand></VRTDataset>";
  ExpectRefused(FOCUS, "large.vrt",
                "INPUT: a band of it takes more than 2 GiB in double precision; expected");
}

TEST_F(Focus, HelpSaysWhatToCompare) {
  const Outcome outcome = Run(FOCUS, "--help");
  EXPECT_EQ(outcome.status, 0);
  for (const std::string word : {"over the same pixels", "Both fall with a blur", "--blur", "Exit status"})
    EXPECT_NE(outcome.output.find(word), std::string::npos) << word;
}

}  // namespace
