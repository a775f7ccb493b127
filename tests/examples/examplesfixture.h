#pragma once

#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <limits>
#include <memory>
#include <sstream>
#include <string>
#include <vector>

#include <gdal_priv.h>
#include <gtest/gtest.h>
#include <ogr_spatialref.h>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

struct Closer {
  void operator()(GDALDataset* dataset) const { GDALClose(dataset); }
};
using DatasetPtr = std::unique_ptr<GDALDataset, Closer>;

struct Outcome {
  int status;
  std::string output;
  std::string errors;
};

inline std::string ReadText(const fs::path& path) {
  std::ifstream file(path);
  std::ostringstream text;
  text << file.rdbuf();
  return text.str();
}

// Elevations without symmetry, with level places among them, as whole numbers.
inline double Hill(int x, int y, int band) {
  const double height = 40.0 * std::sin(0.21 * x + 0.4 * band) * std::cos(0.13 * y) + 0.3 * x + 50.0;
  return x % 11 < 3 && y % 7 < 3 ? 60.0 : std::floor(height);
}

// Runs a program in a folder of the test's own, on rasters that the test makes.
class ExamplesFixture : public testing::Test {
 protected:
  void SetUp() override {
    GDALAllRegister();
    const testing::TestInfo& info = *testing::UnitTest::GetInstance()->current_test_info();
    folder_ =
        fs::path(testing::TempDir()) / ("examples_" + std::string(info.name()) + std::to_string(getpid()));
    fs::create_directories(folder_ / "out");
  }
  void TearDown() override { fs::remove_all(folder_); }

  std::string Path(const std::string& name) const { return (folder_ / name).string(); }

  // Runs a program in the folder of the test. Standard error is a file, hence no terminal.
  Outcome Run(const std::string& program, const std::string& arguments,
              const std::string& before = "") const {
    const std::string command = "cd '" + folder_.string() + "' && " + before + " '" + program + "' " +
                                arguments + " > stdout.txt 2> stderr.txt";
    const int status = std::system(command.c_str());
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, ReadText(folder_ / "stdout.txt"),
            ReadText(folder_ / "stderr.txt")};
  }

  struct Recipe {
    int width = 83;
    int height = 61;
    int bands = 1;
    GDALDataType type = GDT_Float32;
    std::vector<double> transform = {500000.0, 30.0, 0.0, 4600000.0, 0.0, -25.0};
    int epsg = 32633;
    std::function<double(int, int, int)> value = Hill;
    double noData = std::numeric_limits<double>::infinity();  // none
  };

  void Make(const std::string& name, const Recipe& recipe) const {
    GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("GTiff");
    const DatasetPtr dataset(
        driver->Create(Path(name).c_str(), recipe.width, recipe.height, recipe.bands, recipe.type, nullptr));
    ASSERT_TRUE(dataset);
    std::vector<double> transform = recipe.transform;
    if (!transform.empty()) {
      ASSERT_EQ(dataset->SetGeoTransform(transform.data()), CE_None);
    }
    OGRSpatialReference reference;
    if (recipe.epsg != 0) {
      ASSERT_EQ(reference.importFromEPSG(recipe.epsg), OGRERR_NONE);
      ASSERT_EQ(dataset->SetSpatialRef(&reference), CE_None);
    }
    std::vector<double> row(static_cast<std::size_t>(recipe.width));
    for (int band = 1; band <= recipe.bands; ++band) {
      GDALRasterBand& to = *dataset->GetRasterBand(band);
      if (!std::isinf(recipe.noData)) to.SetNoDataValue(recipe.noData);
      for (int y = 0; y < recipe.height; ++y) {
        for (int x = 0; x < recipe.width; ++x) row[static_cast<std::size_t>(x)] = recipe.value(x, y, band);
        ASSERT_EQ(to.RasterIO(GF_Write, 0, y, recipe.width, 1, row.data(), recipe.width, 1, GDT_Float64, 0, 0,
                              nullptr),
                  CE_None);
      }
    }
  }

  DatasetPtr Open(const std::string& name) const {
    return DatasetPtr(GDALDataset::Open(Path(name).c_str(), GDAL_OF_RASTER));
  }

  // The samples of all bands as they are stored.
  std::vector<unsigned char> Bits(const std::string& name) const {
    const DatasetPtr dataset = Open(name);
    if (!dataset) return {};
    const GDALDataType type = dataset->GetRasterBand(1)->GetRasterDataType();
    const int width = dataset->GetRasterXSize(), height = dataset->GetRasterYSize();
    const int bands = dataset->GetRasterCount(), size = GDALGetDataTypeSizeBytes(type);
    std::vector<unsigned char> bits(static_cast<std::size_t>(width) *
                                    static_cast<std::size_t>(height * size * bands));
    EXPECT_EQ(dataset->RasterIO(GF_Read, 0, 0, width, height, bits.data(), width, height, type, bands,
                                nullptr, 0, 0, 0, nullptr),
              CE_None);
    return bits;
  }

  std::vector<double> Values(const std::string& name, int number = 1) const {
    const DatasetPtr dataset = Open(name);
    if (!dataset || number > dataset->GetRasterCount()) return {};
    GDALRasterBand& band = *dataset->GetRasterBand(number);
    const int width = band.GetXSize(), height = band.GetYSize();
    std::vector<double> values(static_cast<std::size_t>(width) * static_cast<std::size_t>(height));
    EXPECT_EQ(
        band.RasterIO(GF_Read, 0, 0, width, height, values.data(), width, height, GDT_Float64, 0, 0, nullptr),
        CE_None);
    return values;
  }

  void ExpectDone(const std::string& program, const std::string& arguments) const {
    const Outcome outcome = Run(program, arguments);
    ASSERT_EQ(outcome.status, 0) << arguments << "\n" << outcome.errors;
  }

  // What is in the folder for outputs, hidden files included.
  std::vector<std::string> Outputs() const {
    std::vector<std::string> names;
    for (const fs::directory_entry& entry : fs::directory_iterator(folder_ / "out"))
      names.push_back(entry.path().filename().string());
    return names;
  }

  void ExpectRefused(const std::string& program, const std::string& arguments,
                     const std::string& message) const {
    const Outcome outcome = Run(program, arguments);
    EXPECT_EQ(outcome.status, 2) << arguments;
    EXPECT_NE(outcome.errors.find(message), std::string::npos) << arguments << "\n" << outcome.errors;
    EXPECT_NE(outcome.errors.find("expected"), std::string::npos) << outcome.errors;
    EXPECT_TRUE(Outputs().empty()) << arguments;
  }

  void ExpectTilesGiveTheSameBits(const std::string& program, const std::string& arguments) const {
    const Outcome whole = Run(program, arguments + " out/whole.tif --tile 100000");
    ASSERT_EQ(whole.status, 0) << whole.errors;
    const std::vector<unsigned char> expected = Bits("out/whole.tif");
    ASSERT_FALSE(expected.empty());
    for (const int side : {1, 7, 64, 250}) {
      ASSERT_EQ(Run(program, arguments + " out/tiled.tif --tile " + std::to_string(side)).status, 0);
      EXPECT_TRUE(Bits("out/tiled.tif") == expected) << arguments << ", tiles of " << side;
    }
  }

  fs::path folder_;
};
