#include "processes/gridmill/filterslp.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <thread>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/filterslp_reference.h"
#include "tests/support/cases.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::filters {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::Throws;
using tests::WithPixelType;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr const char* kMarginMessage = "The Margin of the input raster is too small";

/// The corners of a cell: the pixel, the one to its right, the one below, the one across.
struct Cell {
  double z00, z10, z01, z11;
};

/// The slope of one cell.
template <class Out, class In = float>
Out Slope(const FilterSlp& filter, const Cell& cell, bool isValid = true) {
  Image<In> in({1, 1}, {1, 1});
  in.At(0, 0) = static_cast<In>(cell.z00);
  in.At(1, 0) = static_cast<In>(cell.z10);
  in.At(0, 1) = static_cast<In>(cell.z01);
  in.At(1, 1) = static_cast<In>(cell.z11);
  Mask mask(1, 1, {1, 1});
  mask.SetValid(0, 0, isValid);
  Image<Out> out({1, 1});
  filter.Process(&in, &mask, &out);
  return out.At(0, 0);
}

constexpr Cell kFlat = {7, 7, 7, 7};
constexpr Cell kRiseAlongX = {5, 6, 5, 6};
constexpr Cell kRiseAlongY = {5, 5, 6, 6};

/// A cell that rises along x by `rise`.
Cell RiseAlongX(double rise) { return {0, rise, 0, rise}; }

// ---- golden

TEST(FilterSlp, FlatCellGivesExactlyZeroForAllTypes) {
  for (const PixelType& inType : tests::kPixelTypes) {
    for (const PixelType& outType : tests::kPixelTypes) {
      tests::WithPixelTypes(inType.element, outType.element, [&]<class In, class Out>() {
        EXPECT_EQ((Slope<Out, In>(FilterSlp(), kFlat)), Out{0}) << inType << " -> " << outType;
      });
    }
  }
}

TEST(FilterSlp, RiseEqualToTheSpacingInOneDirectionGives45Degrees) {
  for (const PixelType& outType : tests::kPixelTypes) {
    WithPixelType(outType.element, [&]<class Out>() {
      if constexpr (std::is_same_v<Out, float>) {
        EXPECT_FLOAT_EQ((Slope<float, short>(FilterSlp(), kRiseAlongX)), 45.0f);
        EXPECT_FLOAT_EQ((Slope<float, short>(FilterSlp(), kRiseAlongY)), 45.0f);
      } else {
        EXPECT_EQ((Slope<Out, short>(FilterSlp(), kRiseAlongX)), Out{45}) << outType;
        EXPECT_EQ((Slope<Out, short>(FilterSlp(), kRiseAlongY)), Out{45}) << outType;
        EXPECT_EQ((Slope<Out, short>(FilterSlp(30, 30), RiseAlongX(30))), Out{45}) << outType;
      }
    });
  }
}

// Deliberate: every output but 32-bit `float`, `double` included, holds whole degrees.
TEST(FilterSlp, EveryOutputBut32BitFloatDoubleIncludedHoldsWholeDegrees) {
  const Cell cell = RiseAlongX(0.56808);  // the tangent of 29.6 degrees
  for (const PixelType& outType : tests::kPixelTypes) {
    WithPixelType(outType.element, [&]<class Out>() {
      if constexpr (std::is_same_v<Out, float>) {
        EXPECT_NEAR(Slope<float>(FilterSlp(), cell), 29.6, 0.001);
      } else {
        EXPECT_EQ(Slope<Out>(FilterSlp(), cell), Out{30}) << outType;
      }
    });
  }
  EXPECT_EQ(Slope<double>(FilterSlp(), RiseAlongX(0.5635)), 29.0);  // 29.4 degrees
}

TEST(FilterSlp, SpacingsAndScaleActOnTheirOwnDirection) {
  EXPECT_EQ(Slope<int>(FilterSlp(2, 1), kRiseAlongX), 27);
  EXPECT_EQ(Slope<int>(FilterSlp(2, 1), kRiseAlongY), 45);
  EXPECT_EQ(Slope<int>(FilterSlp(1, 2), kRiseAlongX), 45);
  EXPECT_EQ(Slope<int>(FilterSlp(1, 2), kRiseAlongY), 27);
  EXPECT_EQ(Slope<int>(FilterSlp(2, 2, 2), kRiseAlongX), 45);
  EXPECT_EQ(Slope<int>(FilterSlp(2, 2, 4), kRiseAlongX), 63);
}

TEST(FilterSlp, MarginTakesPartInTheLastColumnAndTheLastRow) {
  Image<short> in({3, 3}, {1, 1}, 5);
  for (int i = -1; i <= 3; ++i) {
    in.At(i, -1) = 1000;
    in.At(-1, i) = 1000;
    in.At(3, i) = 6;
    in.At(i, 3) = 6;
  }
  Image<short> out({3, 3}, {1, 2}, 77);
  FilterSlp().Process(&in, nullptr, &out);
  for (int y = 0; y < 2; ++y) {
    EXPECT_EQ(out.At(0, y), 0);
    EXPECT_EQ(out.At(1, y), 0);
    EXPECT_EQ(out.At(2, y), 45);
  }
  EXPECT_EQ(out.At(0, 2), 45);
  EXPECT_EQ(out.At(1, 2), 45);
  EXPECT_EQ(out.At(2, 2), 35);  // corners 5 6 / 6 6: nx and ny are -0.5
  EXPECT_EQ(out.At(-1, 1), 77);
  EXPECT_EQ(out.At(3, 1), 77);
  EXPECT_EQ(out.At(1, -1), 77);
  EXPECT_EQ(out.At(1, 3), 77);
}

TEST(FilterSlp, MaskedPixelGivesBackgroundThroughClipToInAllChannels) {
  Image<short> in({2, 1, 3}, {1, 1});
  in.Set([](int x, int y, std::uint32_t c) { return x * (static_cast<int>(c) + 1) + y; });
  Mask mask(2, 1, {1, 1});
  mask.SetValid(1, 0, false);
  FilterSlp filter;
  filter.SetBackground(200.5f);
  Image<unsigned char> out({2, 1, 3}, {}, 77);
  filter.Process(&in, &mask, &out);
  for (std::uint32_t c = 0; c < 3; ++c) {
    EXPECT_EQ(out.At(1, 0, c), 201) << c;
    EXPECT_LE(out.At(0, 0, c), 90) << c;
  }
}

TEST(FilterSlp, BackgroundIsClippedInSinglePrecision) {
  FilterSlp filter;
  filter.SetBackground(-9999.75f);
  EXPECT_EQ(Slope<char>(filter, kRiseAlongX, false), -128);
  EXPECT_EQ(Slope<unsigned char>(filter, kRiseAlongX, false), 0);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX, false), -10000);
  EXPECT_EQ(Slope<unsigned short>(filter, kRiseAlongX, false), 0);
  EXPECT_EQ(Slope<int>(filter, kRiseAlongX, false), -10000);
  EXPECT_EQ(Slope<unsigned int>(filter, kRiseAlongX, false), 0u);
  EXPECT_EQ(Slope<float>(filter, kRiseAlongX, false), -9999.75f);
  FilterSlp odd;
  odd.SetBackground(8388609.0f);  // in single precision the sum with 0.5 is a tie and rounds up
  EXPECT_EQ(Slope<int>(odd, kRiseAlongX, false), 8388610);
}

// Deliberate: a `double` output holds whole degrees but keeps the fraction of `Background`.
TEST(FilterSlp, DoubleOutputKeepsTheFractionOfBackground) {
  FilterSlp filter;
  filter.SetBackground(-0.3f);
  EXPECT_EQ(Slope<double>(filter, kRiseAlongX, false), static_cast<double>(-0.3f));
}

TEST(FilterSlp, BackgroundOf64BitOutputsIsTruncatedAndNeverNegative) {
  FilterSlp filter;
  filter.SetBackground(-5.0f);
  EXPECT_EQ(Slope<std::int64_t>(filter, kRiseAlongX, false), 0);
  EXPECT_EQ(Slope<std::uint64_t>(filter, kRiseAlongX, false), 0u);
  FilterSlp fraction;
  fraction.SetBackground(5.9f);
  EXPECT_EQ(Slope<std::int64_t>(fraction, kRiseAlongX, false), 5);
  EXPECT_EQ(Slope<std::uint64_t>(fraction, kRiseAlongX, false), 5u);
}

// Deliberate: a masked neighbour counts as level with the pixel; it does not invalidate the result.
TEST(FilterSlp, MaskedNeighbourCountsAsLevel) {
  Image<short> in({2, 2}, {1, 1}, 5);
  in.At(1, 0) = 1000;
  in.At(1, 1) = 6;
  Mask mask(2, 2, {1, 1});
  mask.SetValid(1, 0, false);
  FilterSlp filter;
  filter.SetBackground(99.0f);
  Image<float> out({2, 2});
  filter.Process(&in, &mask, &out);
  // corners 5 5 / 5 6: nx = -0.5, ny = -0.5
  EXPECT_FLOAT_EQ(out.At(0, 0), 35.26439f);
  EXPECT_EQ(out.At(1, 0), 99.0f);
}

TEST(FilterSlp, PixelWithThreeMaskedNeighboursGivesZeroAndNotBackground) {
  Image<short> in({2, 2}, {1, 1}, 500);
  in.At(0, 0) = 5;
  Mask mask(2, 2, {1, 1}, false);
  mask.SetValid(0, 0, true);
  FilterSlp filter;
  filter.SetBackground(99.0f);
  Image<short> out({2, 2});
  filter.Process(&in, &mask, &out);
  EXPECT_EQ(out.At(0, 0), 0);
  EXPECT_EQ(out.At(1, 0), 99);
  EXPECT_EQ(out.At(0, 1), 99);
  EXPECT_EQ(out.At(1, 1), 99);
}

TEST(FilterSlp, ClearMaskBitInTheMarginCountsAsLevelToo) {
  Image<short> in({1, 1}, {1, 1}, 5);
  in.At(1, 0) = in.At(1, 1) = 6;
  Mask mask(1, 1, {1, 1});
  mask.SetValid(1, 0, false);
  mask.SetValid(1, 1, false);
  Image<short> out({1, 1}, {}, 77);
  FilterSlp().Process(&in, &mask, &out);
  EXPECT_EQ(out.At(0, 0), 0);
}

TEST(FilterSlp, MaskThatExcludesEverythingGivesBackgroundEverywhere) {
  Image<short> in({37, 3, 2}, {1, 1});
  in.Set([](int x, int y, std::uint32_t c) { return x * y + static_cast<int>(c); });
  Mask mask(37, 3, {1, 1}, false);
  FilterSlp filter;
  filter.SetBackground(12.0f);
  Image<short> out({37, 3, 2});
  filter.Process(&in, &mask, &out);
  EXPECT_EQ(Bytes(out), Bytes(Image<short>({37, 3, 2}, {}, 12)));
}

// The bit at (x, y) is picked by the mask's geometry, the bytes of the corners by the input's.
TEST(FilterSlp, CornerOfAMaskOfAnotherGeometryTakesTheRememberedElevation) {
  Image<short> in({2, 1}, {1, 1}, 0);
  in.Set([](int x, int, std::uint32_t) { return x < 2 ? 10 : 11; });
  in.At(1, 0) = 99;
  in.At(1, 1) = 10;
  Mask mask(2, 1, {2, 2});  // 6 pixels in a row, where the input has 4
  const auto clear = [&](int index) { mask.SetValid(index % 6 - 2, index / 6 - 2, false); };
  clear(6);  // the input's index of pixel (1, 0)
  Image<short> out({2, 1});
  FilterSlp().Process(&in, &mask, &out);
  EXPECT_EQ(out.At(0, 0), 0);   // 10 for 99
  EXPECT_EQ(out.At(1, 0), 45);  // corners 10 11 / 10 11, with 10 for 99
}

TEST(FilterSlp, RememberedElevationIsZeroAtTheStartOfEachRow) {
  Image<short> in({1, 2}, {1, 1}, 1);
  Mask mask(1, 2, {3, 2});  // 7 pixels in a row, where the input has 3
  const auto clear = [&](int index) { mask.SetValid(index % 7 - 3, index / 7 - 2, false); };
  clear(7);  // the input's index of pixel (0, 1)
  Image<float> out({1, 2});
  FilterSlp().Process(&in, &mask, &out);
  EXPECT_FLOAT_EQ(out.At(0, 0), 0.0f);
  EXPECT_FLOAT_EQ(out.At(0, 1), 35.26439f);  // corners 0 1 / 1 1: nx = ny = -0.5
}

TEST(FilterSlp, SpacingOfZeroAlongARowGives90) {
  EXPECT_EQ(Slope<short>(FilterSlp(0, 1), kRiseAlongX), 90);
  EXPECT_EQ(Slope<double>(FilterSlp(0, 1), kRiseAlongX), 90.0);
  EXPECT_FLOAT_EQ(Slope<float>(FilterSlp(0, 1), kRiseAlongX), 90.0f);
  EXPECT_EQ(Slope<short>(FilterSlp(0, 1), kRiseAlongY), 0);
}

TEST(FilterSlp, SpacingsOfZeroMakeEveryCellFlat) {
  EXPECT_EQ(Slope<short>(FilterSlp(0, 0), kRiseAlongX), 0);
  EXPECT_EQ(Slope<float>(FilterSlp(0, 0), kRiseAlongY), 0.0f);
}

TEST(FilterSlp, NegativeSpacingsRunThroughTheArithmetic) {
  EXPECT_EQ(Slope<short>(FilterSlp(-1, 1), kRiseAlongX), 135);
  EXPECT_EQ(Slope<short>(FilterSlp(-1, -1), kRiseAlongX), 45);
}

TEST(FilterSlp, ElevationScaleOfZeroGivesZeroEverywhere) {
  EXPECT_EQ(Slope<short>(FilterSlp(1, 1, 0), kRiseAlongX), 0);
  EXPECT_EQ(Slope<float>(FilterSlp(1, 1, 0), {1, 20, 300, 4000}), 0.0f);
}

TEST(FilterSlp, HeightOrWidthOfZeroWritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0, 2}, tests::Size{0, 4, 2}, tests::Size{4, 4, 0}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({size.width, size.height, 2}, {1, 1});
    FillBytes(out);
    FilterSlp().Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(FilterSlp, NaNInACellGivesNaNOnAFloatOutput) {
  EXPECT_TRUE(std::isnan(Slope<float>(FilterSlp(), {kNaN, 1, 1, 1})));
  EXPECT_TRUE(std::isnan(Slope<float>(FilterSlp(), {1, kNaN, 1, 1})));
  EXPECT_TRUE(std::isnan(Slope<float>(FilterSlp(), {1, 1, kNaN, 1})));
  EXPECT_TRUE(std::isnan((Slope<float, double>(FilterSlp(), {1, 1, 1, kNaN}))));
  EXPECT_TRUE(std::isnan(Slope<float>(FilterSlp(), {kInfinity, 1, kInfinity, 1})));
}

TEST(FilterSlp, NaNInACellIsTheIndefiniteValueOnEveryOtherOutput) {
  const Cell cell = {kNaN, 1, 1, 1};
  EXPECT_EQ(Slope<double>(FilterSlp(), cell), -2147483648.0);
  EXPECT_EQ(Slope<char>(FilterSlp(), cell), -128);
  EXPECT_EQ(Slope<unsigned char>(FilterSlp(), cell), 0);
  EXPECT_EQ(Slope<short>(FilterSlp(), cell), -32768);
  EXPECT_EQ(Slope<unsigned short>(FilterSlp(), cell), 0);
  EXPECT_EQ(Slope<int>(FilterSlp(), cell), -2147483647 - 1);
  EXPECT_EQ(Slope<unsigned int>(FilterSlp(), cell), 0u);
  EXPECT_EQ(Slope<std::int64_t>(FilterSlp(), cell), 0);
  EXPECT_EQ(Slope<std::uint64_t>(FilterSlp(), cell), 0u);
}

// Deliberate: a cosine above 1 gives 0.
TEST(FilterSlp, CosineAboveOneGivesZero) {
  const FilterSlp filter(4.43e-23f, 1.0f);  // the square of nz is denormal and rounds down
  const Cell cell = RiseAlongX(1e-30);
  EXPECT_EQ(Slope<float>(filter, cell), 0.0f);
  EXPECT_EQ(Slope<double>(filter, cell), 0.0);
  EXPECT_EQ(Slope<unsigned char>(filter, cell), 0);
}

TEST(FilterSlp, EachCornerIsConvertedToFloatByItself) {
  EXPECT_EQ((Slope<float, double>(FilterSlp(), {16777216, 16777217, 16777216, 16777217})), 0.0f);
  EXPECT_EQ((Slope<float, std::int64_t>(FilterSlp(), {16777216, 16777217, 16777216, 16777217})), 0.0f);
  EXPECT_EQ((Slope<short, std::uint64_t>(FilterSlp(), {0x1p63, 0x1p63, 0x1p63, 0})), 90);
  EXPECT_EQ((Slope<short, unsigned char>(FilterSlp(255, 255), {0, 255, 0, 255})), 45);
  EXPECT_EQ((Slope<short, char>(FilterSlp(1, 1), {-1, 0, -1, 0})), 45);
}

TEST(FilterSlp, ChannelsAreTreatedByThemselves) {
  Image<short> in({2, 1, 3}, {1, 1});
  in.Set([](int x, int, std::uint32_t c) { return x * static_cast<int>(c); });
  Image<short> out({2, 1, 3});
  FilterSlp().Process(&in, nullptr, &out);
  for (int x = 0; x < 2; ++x) {
    EXPECT_EQ(out.At(x, 0, 0), 0);
    EXPECT_EQ(out.At(x, 0, 1), 45);
    EXPECT_EQ(out.At(x, 0, 2), 63);
  }
}

TEST(FilterSlp, OutputRowsAreSteppedByTheChannelsOfTheInput) {
  Image<short> in({2, 2, 2}, {1, 1});
  in.Set([](int x, int, std::uint32_t c) { return x * (static_cast<int>(c) + 1); });
  Image<short> out({2, 2, 3}, {1, 0}, 77);
  FilterSlp().Process(&in, nullptr, &out);
  for (int y = 0; y < 2; ++y) {
    const std::vector<short> row(&out.At(0, y), &out.At(0, y) + 6);
    EXPECT_EQ(row, (std::vector<short>{45, 63, 45, 63, 77, 77}));
  }
}

TEST(FilterSlp, ComplexInputGivesTheSlopeOfItsRealParts) {
  Image<short> in({2, 1}, {1, 1}, 0, true);
  in.Set([](int x, int y, std::uint32_t part) { return part == 0 ? x : 100 * y; });
  Image<short> out({2, 1});
  FilterSlp().Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 45);
  EXPECT_EQ(out.At(1, 0), 45);
}

TEST(FilterSlp, SpacingsAndScaleAreOneAndBackgroundIsZeroByDefault) {
  FilterSlp set(9, 9, 9);
  set.SetXSIZE(1);
  set.SetYSIZE(1);
  set.SetELSZ(1);
  const Cell cell = {0, 1, 3, 5};
  EXPECT_EQ(Slope<float>(set, cell), Slope<float>(FilterSlp(), cell));
  EXPECT_NE(Slope<float>(FilterSlp(), cell), Slope<float>(FilterSlp(9, 9), cell));
  EXPECT_EQ(Slope<float>(FilterSlp(), cell, false), 0.0f);
}

// ---- failures

struct FilterSlpFailure : ::testing::Test {
  Image<short> in{{3, 2, 2}, {1, 1}, 7};
  Image<short> out{{3, 2, 2}, {1, 1}};
  const FilterSlp filter;

  FilterSlpFailure() { FillBytes(out); }
};

TEST_F(FilterSlpFailure, NullInputIsAnInvalidPointer) {
  EXPECT_TRUE(
      Throws<Exception>("poRasterIn is invalid pointer", [&] { filter.Process(nullptr, nullptr, &out); }));
  EXPECT_TRUE(
      Throws<Exception>("poRasterIn is invalid pointer", [&] { filter.Process(nullptr, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(FilterSlpFailure, NullOutputIsAnInvalidPointer) {
  EXPECT_TRUE(
      Throws<Exception>("poRasterOut is invalid pointer", [&] { filter.Process(&in, nullptr, nullptr); }));
}

TEST_F(FilterSlpFailure, OutputCannotBeComplex) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster complex({3, 2, 2, DataType(type.element, true)}, {1, 1});
    FillBytes(complex);
    EXPECT_TRUE(Throws<Exception>("Output cannot be complex", [&] {
      filter.Process(&in, nullptr, &complex);
    })) << type;
    EXPECT_TRUE(IsUntouched(complex));
  }
}

TEST_F(FilterSlpFailure, TypesOutsideTheListAreInvalid) {
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd({3, 2, 2, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&odd, nullptr, &out); }));
    EXPECT_TRUE(IsUntouched(out));
    if (type.isComplex) continue;
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&in, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

TEST_F(FilterSlpFailure, MarginOfZeroInOneDirectionFails) {
  const tessel::RasterContext kTooSmall[] = {{0, 1}, {1, 0}, {0, 0}, {0, 9}, {9, 0}};
  for (const tessel::RasterContext& margins : kTooSmall) {
    for (const tests::Size size : {tests::Size{3, 2, 2}, tests::Size{0, 2, 2}, tests::Size{3, 0, 2}}) {
      Image<short> barren(size, margins, 7);
      EXPECT_TRUE(
          Throws<ParameterException>(kMarginMessage, [&] { filter.Process(&barren, nullptr, &out); }));
      EXPECT_TRUE(IsUntouched(out));
    }
  }
}

TEST_F(FilterSlpFailure, MarginOfAComplexInputIsTestedToo) {
  Image<short> barren({3, 2, 2}, {1, 0}, 7, true);
  EXPECT_TRUE(Throws<ParameterException>(kMarginMessage, [&] { filter.Process(&barren, nullptr, &out); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(FilterSlpFailure, MarginFailureNamesTheInput) {
  Image<short> barren({3, 2}, {0, 1}, 7);
  try {
    filter.Process(&barren, nullptr, &out);
    FAIL() << "nothing was thrown";
  } catch (const ParameterException& failure) {
    EXPECT_EQ(failure.Parameter(), "poRasterIn");
    EXPECT_EQ(static_cast<int>(failure.Kind()), 1);
    EXPECT_EQ(failure.Given(), "");
    EXPECT_EQ(failure.Expected(), "");
  }
}

TEST_F(FilterSlpFailure, TypesComeBeforeTheMargin) {
  Image<short> barren({3, 2, 2}, {}, 7);
  Raster odd({3, 2, 2, DataType(tessel::eDT_BIT)}, {});
  EXPECT_TRUE(
      Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&barren, nullptr, &odd); }));
}

TEST(FilterSlp, MarginOfTheOutputDoesNotMatter) {
  Image<short> in({2, 1}, {1, 1}, 7);
  Image<short> out({2, 1}, {0, 0}, 77);
  FilterSlp().Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 0);
  EXPECT_EQ(out.At(1, 0), 0);
}

// ---- differential

FilterSlp DrawFilter(tests::Random& random) {
  constexpr float kUsual[] = {1.0f, 1.0f, 2.0f, 0.5f, 30.0f, 12.5f, -1.0f};
  constexpr float kOdd[] = {0.0f,  -0.0f,   -30.0f, 1e-30f,    1e-40f,     4.43e-23f,
                            1e20f, 3.4e38f, -1e20f, kInfinity, -kInfinity, kNaN};
  constexpr float kBackgrounds[] = {0.0f,   -1.0f,     0.5f,       2.5f,       -0.5f, -2.5f,
                                    127.5f, -9999.0f,  65535.0f,   8388609.0f, 1e10f, 1e20f,
                                    -1e20f, kInfinity, -kInfinity, kNaN};
  const auto draw = [&] { return random.OneIn(4) ? random.Pick(kOdd) : random.Pick(kUsual); };
  const float xSize = draw(), ySize = draw(), scale = draw();
  FilterSlp filter(xSize, ySize, scale);
  filter.SetBackground(random.Pick(kBackgrounds));
  return filter;
}

struct FilterSlpDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(FilterSlpDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c :
       tests::CasesFrom(GetParam(), {.leastMargin = 1, .outputHasInputChannels = true})) {
    tests::Random random(~c.seed);
    const FilterSlp filter = DrawFilter(random);
    const ::testing::AssertionResult result = Agree(
        c, {}, [&](Raster* in, Mask* mask, Raster* out) { filter.Process(in, mask, out); },
        [&](const Raster& in, const Mask* mask, Raster& out) {
          reference::FilterSlp(filter, in, mask, out);
        });
    ASSERT_TRUE(result) << "XSIZE " << filter.XSIZE << ", YSIZE " << filter.YSIZE << ", ELSZ " << filter.ELSZ
                        << ", Background " << filter.Background;
  }
}

INSTANTIATE_TEST_SUITE_P(From, FilterSlpDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

// ---- contract

TEST(FilterSlpContract, ParameterSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  FilterSlp filter;
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
  filter.SetELSZ(0.0f);
  filter.SetXSIZE(100.0f);
  filter.SetYSIZE(0.0f);
  filter.SetBackground(9.0f);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX, false), 0);
}

TEST(FilterSlpContract, ParametersSetAfterTheFirstProcessAreTakenWhenATypeChanges) {
  FilterSlp filter;
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
  filter.SetELSZ(0.0f);
  filter.SetBackground(9.0f);
  EXPECT_EQ(Slope<int>(filter, kRiseAlongX), 0);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 0);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX, false), 9);
  filter.SetELSZ(1.0f);
  EXPECT_EQ((Slope<short, int>(filter, kRiseAlongX)), 45);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
}

TEST(FilterSlpContract, CacheHoldsTheTypesOfTheInterpretedRaster) {
  FilterSlp filter;
  Image<float> complex({1, 1}, {1, 1}, 0, true);
  complex.Set([](int x, int, std::uint32_t part) { return part == 0 ? x : 0; });
  Image<short> out({1, 1});
  filter.Process(&complex, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 45);
  filter.SetELSZ(0.0f);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
  filter.Process(&complex, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 45);
}

/// A call that the dispatcher refuses.
void FailToDispatch(const FilterSlp& filter) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {1, 1});
  Image<short> out({1, 1});
  EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&bits, nullptr, &out); }));
}

TEST(FilterSlpContract, ObjectWorksAfterAFailedDispatch) {
  const FilterSlp filter;
  FailToDispatch(filter);
  FailToDispatch(filter);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
}

TEST(FilterSlpContract, ObjectThatHadRunWorksAfterAFailedDispatchWithTheNewParameters) {
  FilterSlp filter;
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
  filter.SetELSZ(0.0f);
  FailToDispatch(filter);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 0);
}

TEST(FilterSlpContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto filter = std::make_unique<FilterSlp>();
  EXPECT_EQ(Slope<short>(*filter, kRiseAlongX), 45);
  FailToDispatch(*filter);
}

TEST(FilterSlpContract, RefusedMarginLeavesTheProcessorWithTheParametersOfThatMoment) {
  FilterSlp filter;
  Image<float> barren({1, 1});
  Image<short> out({1, 1});
  EXPECT_THROW(filter.Process(&barren, nullptr, &out), ParameterException);
  filter.SetELSZ(0.0f);
  EXPECT_EQ(Slope<short>(filter, kRiseAlongX), 45);
}

TEST(FilterSlpContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  const FilterSlp original;
  FilterSlp copy(original), assigned(0, 0, 0);
  assigned = original;
  copy.SetELSZ(0.0f);
  EXPECT_EQ(Slope<short>(original, kRiseAlongX), 45);
  EXPECT_EQ(Slope<short>(copy, kRiseAlongX), 0);
  EXPECT_EQ(Slope<short>(assigned, kRiseAlongX), 45);
}

TEST(FilterSlpContract, TwoObjectsRunOnTwoThreadsAtOnce) {
  const auto work = [](float scale, bool* isRight) {
    const FilterSlp filter(1, 1, scale);
    Image<short> in({300, 130}, {1, 1});
    in.Set([](int x, int, std::uint32_t) { return x; });
    Image<short> out({300, 130});
    for (int i = 0; i < 20; ++i) {
      out.At(150, 30) = out.At(299, 129) = -1;
      filter.Process(&in, nullptr, &out);
      const short expected = scale == 1.0f ? 45 : 0;
      *isRight = *isRight && out.At(150, 30) == expected && out.At(299, 129) == expected;
    }
  };
  bool isFirstRight = true, isSecondRight = true;
  std::thread first(work, 1.0f, &isFirstRight), second(work, 0.0f, &isSecondRight);
  first.join();
  second.join();
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

}  // namespace
}  // namespace orvik::filters
