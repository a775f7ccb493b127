// The program of the mirror, run as a user runs it, on rasters that the tests make.

#include <functional>
#include <string>
#include <vector>

#include "examplesfixture.h"

namespace {

constexpr int width = 83, height = 61;

double Count(int x, int y, int band) { return (x * 7 + y * 3 + band * 11) % 100; }

class Mirror : public ExamplesFixture {
 protected:
  // The sample that each pixel of the first band should have come from.
  void ExpectFrom(const std::string& arguments, const std::function<double(int, int)>& expected) const {
    ExpectDone(MIRROR, arguments);
    const std::vector<double> values = Values("out/o.tif");
    ASSERT_EQ(values.size(), static_cast<std::size_t>(width * height));
    std::size_t i = 0;
    for (int y = 0; y < height; ++y)
      for (int x = 0; x < width; ++x, ++i)
        ASSERT_EQ(values[i], expected(x, y)) << arguments << " " << x << " " << y;
  }
};

TEST_F(Mirror, LeftAndRightChangePlaces) {
  Make("scene.tif", {.bands = 2, .type = GDT_Byte, .value = Count});
  ExpectFrom("vert scene.tif out/o.tif", [](int x, int y) { return Count(width - 1 - x, y, 1); });
  EXPECT_EQ(Open("out/o.tif")->GetRasterCount(), 2);
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), GDT_Byte);
}

TEST_F(Mirror, TopAndBottomChangePlaces) {
  Make("scene.tif", {.type = GDT_Int16, .value = Count});
  ExpectFrom("hori scene.tif out/o.tif", [](int x, int y) { return Count(x, height - 1 - y, 1); });
}

TEST_F(Mirror, AWindowIsMirroredInItsPlace) {
  Make("scene.tif", {.value = Count});
  const auto inside = [](int x, int y) { return x >= 10 && x < 17 && y >= 5 && y < 25; };
  ExpectFrom("vert scene.tif out/o.tif --window 10,5,7,20",
             [&](int x, int y) { return Count(inside(x, y) ? 26 - x : x, y, 1); });
  ExpectFrom("hori scene.tif out/o.tif --window 10,5,7,20",
             [&](int x, int y) { return Count(x, inside(x, y) ? 29 - y : y, 1); });
}

TEST_F(Mirror, ValidityMovesWithTheSamples) {
  Make("scene.tif", {.type = GDT_Byte, .value = Count, .noData = 30.0});
  ExpectFrom("vert scene.tif out/o.tif", [](int x, int y) {
    const double value = Count(width - 1 - x, y, 1);
    return value == 30.0 ? 255.0 : value;
  });
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetNoDataValue(), 255.0);
}

TEST_F(Mirror, BandsAndTypeAreThoseAskedFor) {
  Make("scene.tif", {.bands = 3, .type = GDT_Byte, .value = Count});
  ExpectFrom("vert scene.tif out/o.tif --bands 3 --type Int32",
             [](int x, int y) { return Count(width - 1 - x, y, 3); });
  EXPECT_EQ(Open("out/o.tif")->GetRasterBand(1)->GetRasterDataType(), GDT_Int32);
}

TEST_F(Mirror, WindowsThatAreNoneAreRefused) {
  Make("scene.tif", {.value = Count});
  ExpectRefused(MIRROR, "vert scene.tif out/o.tif --window 80,0,4,5", "4 x 5 pixels at column 80, row 0");
  ExpectRefused(MIRROR, "vert scene.tif out/o.tif --window 0,0,4,0", "4 x 0 pixels");
  ExpectRefused(MIRROR, "vert scene.tif out/o.tif --window 0,0,4", "3 numbers");
}

}  // namespace
