#include "processes/gridmill/filterasp.h"

#include <cmath>
#include <cstdint>
#include <limits>
#include <memory>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/filterasp_reference.h"
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

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();
constexpr const char* kMarginMessage = "The Margin of the input raster is too small";

/// A filter with spacings of 1.
struct UnitAsp : FilterAsp {
  explicit UnitAsp(float xSize = 1.0f, float ySize = 1.0f) {
    SetXSIZE(xSize);
    SetYSIZE(ySize);
  }
};

/// The aspect of one cell with the corners z00, z10 / z01, z11.
template <class Out, class In = float>
Out CellAspect(const FilterAsp& filter, double z00, double z10, double z01, double z11) {
  Image<In> in({1, 1}, {1, 1});
  in.At(0, 0) = static_cast<In>(z00);
  in.At(1, 0) = static_cast<In>(z10);
  in.At(0, 1) = static_cast<In>(z01);
  in.At(1, 1) = static_cast<In>(z11);
  Image<Out> out({1, 1});
  filter.Process(&in, nullptr, &out);
  return out.At(0, 0);
}

/// The aspect of a plane that rises by `riseX` and `riseY` from pixel to pixel.
template <class Out, class In = float>
Out Aspect(const FilterAsp& filter, double riseX, double riseY) {
  return CellAspect<Out, In>(filter, 100, 100 + riseX, 100 + riseY, 100 + riseX + riseY);
}

/// The result of a pixel whose own mask bit is clear.
template <class Out>
Out Masked(const FilterAsp& filter) {
  Image<float> in({1, 1}, {1, 1});
  Mask mask(1, 1, {1, 1});
  mask.SetValid(0, 0, false);
  Image<Out> out({1, 1});
  filter.Process(&in, &mask, &out);
  return out.At(0, 0);
}

// ---- golden

TEST(FilterAsp, FlatCellGivesZeroSlope) {
  const UnitAsp filter;
  EXPECT_EQ(Aspect<short>(filter, 0, 0), 510);
  EXPECT_EQ(Aspect<unsigned short>(filter, 0, 0), 510);
  EXPECT_EQ(Aspect<int>(filter, 0, 0), 510);
  EXPECT_EQ(Aspect<unsigned int>(filter, 0, 0), 510u);
  EXPECT_EQ(Aspect<float>(filter, 0, 0), 510.0f);
  EXPECT_EQ(Aspect<double>(filter, 0, 0), 510.0);
  EXPECT_EQ(Aspect<std::int64_t>(filter, 0, 0), 510);
  EXPECT_EQ(Aspect<std::uint64_t>(filter, 0, 0), 510u);
}

// Deliberate: `ZeroSlope` is not halved on 8-bit outputs.
TEST(FilterAsp, ZeroSlopeIsNotHalvedOn8BitOutputs) {
  EXPECT_EQ(Aspect<unsigned char>(UnitAsp(), 0, 0), 255);
  EXPECT_EQ(Aspect<char>(UnitAsp(), 0, 0), 127);
  UnitAsp filter;
  filter.SetZeroSlope(100.0f);
  EXPECT_EQ(Aspect<unsigned char>(filter, 0, 0), 100);
  EXPECT_EQ(Aspect<char>(filter, 0, 0), 100);
}

TEST(FilterAsp, DirectionsAreExactOnAFloatOutput) {
  EXPECT_EQ(Aspect<float>(UnitAsp(), -1, 0), 90.0f);
  EXPECT_EQ(Aspect<float>(UnitAsp(), 0, -1), 180.0f);
  EXPECT_EQ(Aspect<float>(UnitAsp(), 1, 0), 270.0f);
  EXPECT_EQ(Aspect<float>(UnitAsp(), 0, 1), 0.0f);
  EXPECT_EQ(Aspect<float>(UnitAsp(), -1, -1), 135.0f);
}

TEST(FilterAsp, EightBitOutputsHoldDegreesHalved) {
  EXPECT_EQ(Aspect<unsigned char>(UnitAsp(), -1, 0), 45);
  EXPECT_EQ(Aspect<unsigned char>(UnitAsp(), 0, -1), 90);
  EXPECT_EQ(Aspect<unsigned char>(UnitAsp(), 1, 0), 135);
  EXPECT_EQ(Aspect<unsigned char>(UnitAsp(), 0, 1), 0);
  EXPECT_EQ(Aspect<char>(UnitAsp(), -1, 0), 45);
  EXPECT_EQ(Aspect<char>(UnitAsp(), 0, -1), 90);
  EXPECT_EQ(Aspect<char>(UnitAsp(), 1, 0), 127);
  EXPECT_EQ(Aspect<char>(UnitAsp(), 0, 1), 0);
}

TEST(FilterAsp, WiderOutputsHoldDegrees) {
  EXPECT_EQ(Aspect<short>(UnitAsp(), 1, 0), 270);
  EXPECT_EQ(Aspect<unsigned short>(UnitAsp(), 1, 0), 270);
  EXPECT_EQ(Aspect<int>(UnitAsp(), 1, 0), 270);
  EXPECT_EQ(Aspect<unsigned int>(UnitAsp(), 1, 0), 270u);
  EXPECT_EQ(Aspect<double>(UnitAsp(), 1, 0), 270.0);
  EXPECT_EQ(Aspect<std::int64_t>(UnitAsp(), 1, 0), 270);
  EXPECT_EQ(Aspect<std::uint64_t>(UnitAsp(), 1, 0), 270u);
}

// Deliberate: an aspect of 359.7 rounds to 360 and does not wrap to 0.
TEST(FilterAsp, AspectOf359Point7RoundsTo360AndDoesNotWrapToZero) {
  const double riseX = 0.005236 * 64, riseY = 64;  // 0.3 degrees left of the top
  EXPECT_NEAR(Aspect<float>(UnitAsp(), riseX, riseY), 359.7, 0.01);
  EXPECT_EQ(Aspect<short>(UnitAsp(), riseX, riseY), 360);
  EXPECT_EQ(Aspect<unsigned short>(UnitAsp(), riseX, riseY), 360);
  EXPECT_EQ(Aspect<int>(UnitAsp(), riseX, riseY), 360);
  EXPECT_EQ(Aspect<unsigned char>(UnitAsp(), riseX, riseY), 180);
}

TEST(FilterAsp, AspectOf359Point7IsTruncatedTo359On64BitOutputs) {
  const double riseX = 0.005236 * 64, riseY = 64;
  EXPECT_EQ(Aspect<std::int64_t>(UnitAsp(), riseX, riseY), 359);
  EXPECT_EQ(Aspect<std::uint64_t>(UnitAsp(), riseX, riseY), 359u);
}

TEST(FilterAsp, FloatingOutputsHoldTheValueWithoutRounding) {
  const float aspect = Aspect<float>(UnitAsp(), -2, -1);
  EXPECT_NEAR(aspect, 116.565, 0.001);
  EXPECT_EQ(Aspect<double>(UnitAsp(), -2, -1), static_cast<double>(aspect));
  UnitAsp filter;
  filter.SetZeroSlope(-0.3f);
  filter.SetBackground(-0.7f);
  EXPECT_EQ(Aspect<double>(filter, 0, 0), static_cast<double>(-0.3f));
  EXPECT_EQ(Masked<double>(filter), static_cast<double>(-0.7f));
  EXPECT_EQ(Masked<float>(filter), -0.7f);
}

TEST(FilterAsp, BackgroundAndZeroSlopeAreClippedInSinglePrecision) {
  UnitAsp filter;
  filter.SetZeroSlope(8388609.0f);  // in single precision the sum with 0.5 is a tie and rounds up
  filter.SetBackground(-9999.75f);
  EXPECT_EQ(Aspect<int>(filter, 0, 0), 8388610);
  EXPECT_EQ(Masked<char>(filter), -128);
  EXPECT_EQ(Masked<unsigned char>(filter), 0);
  EXPECT_EQ(Masked<short>(filter), -10000);
  EXPECT_EQ(Masked<unsigned int>(filter), 0u);
  EXPECT_EQ(Masked<std::int64_t>(filter), 0);
  EXPECT_EQ(Masked<std::uint64_t>(filter), 0u);
}

TEST(FilterAsp, ClearMaskBitsInTheMarginGiveZeroSlopeAlongTheLastColumnAndRow) {
  Image<short> in({20, 3}, {1, 1});
  in.Set([](int x, int, std::uint32_t) { return 100 - x; });
  Mask mask(20, 3, {1, 1}, false);
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 20; ++x) mask.SetValid(x, y, true);
  }
  Image<short> out({20, 3}, {1, 1}, 77);
  UnitAsp().Process(&in, &mask, &out);
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 20; ++x) EXPECT_EQ(out.At(x, y), x == 19 || y == 2 ? 510 : 90) << x << ", " << y;
    EXPECT_EQ(out.At(-1, y), 77);
    EXPECT_EQ(out.At(20, y), 77);
  }
}

TEST(FilterAsp, MarginTakesPartInTheLastColumnAndTheLastRow) {
  Image<short> in({2, 2}, {1, 1}, 5);
  for (int i = -1; i <= 2; ++i) {
    in.At(i, -1) = in.At(-1, i) = 1000;
    in.At(2, i) = in.At(i, 2) = 4;
  }
  Image<short> out({2, 2});
  UnitAsp().Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 510);
  EXPECT_EQ(out.At(1, 0), 90);
  EXPECT_EQ(out.At(0, 1), 180);
  EXPECT_EQ(out.At(1, 1), 135);
}

// Deliberate: a masked neighbour gives `ZeroSlope`; a masked pixel gives `Background` whatever its
// neighbours.
TEST(FilterAsp, MaskedNeighbourGivesZeroSlopeAndAMaskedPixelGivesBackgroundWhateverItsNeighbours) {
  Image<short> in({3, 3}, {1, 1});
  in.Set([](int x, int, std::uint32_t) { return 100 - x; });
  Mask mask(3, 3, {1, 1});
  mask.SetValid(1, 1, false);
  mask.SetValid(2, 1, false);
  UnitAsp filter;
  filter.SetBackground(9.0f);
  Image<short> out({3, 3});
  filter.Process(&in, &mask, &out);
  const std::vector<short> rows(out.Elements(), out.Elements() + 9);
  EXPECT_EQ(rows, (std::vector<short>{510, 510, 510, 510, 9, 9, 90, 90, 90}));
}

TEST(FilterAsp, EachOfTheThreeNeighboursAloneGivesZeroSlope) {
  const int neighbours[3][2] = {{1, 0}, {1, 1}, {0, 1}};
  for (const auto& [x, y] : neighbours) {
    Image<short> in({1, 1}, {1, 1});
    in.Set([](int column, int, std::uint32_t) { return -column; });
    Mask mask(1, 1, {1, 1});
    mask.SetValid(x, y, false);
    Image<short> out({1, 1});
    UnitAsp().Process(&in, &mask, &out);
    EXPECT_EQ(out.At(0, 0), 510) << x << ", " << y;
  }
}

TEST(FilterAsp, MaskThatExcludesEverythingGivesBackgroundEverywhere) {
  Image<short> in({37, 3}, {1, 1});
  in.Set([](int x, int y, std::uint32_t) { return x * y; });
  Mask mask(37, 3, {1, 1}, false);
  UnitAsp filter;
  filter.SetBackground(12.0f);
  Image<short> out({37, 3});
  filter.Process(&in, &mask, &out);
  EXPECT_EQ(Bytes(out), Bytes(Image<short>({37, 3}, {}, 12)));
}

TEST(FilterAsp, SpacingsLeftAtTheirDefaultGiveZeroSlopeForEveryUnmaskedPixel) {
  const FilterAsp filter;
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 510);
  EXPECT_EQ(Aspect<float>(filter, 3, -7), 510.0f);
  EXPECT_EQ(Masked<float>(filter), 0.0f);
}

TEST(FilterAsp, SpacingOfZeroAlongARowLeavesOnlyTheSignOfNx) {
  const UnitAsp filter(0.0f, 1.0f);
  EXPECT_EQ(Aspect<float>(filter, -1, -5), 90.0f);
  EXPECT_EQ(Aspect<float>(filter, -1, 5), 90.0f);
  EXPECT_EQ(Aspect<float>(filter, 1, -5), 270.0f);
  EXPECT_EQ(Aspect<float>(filter, 1, 5), 270.0f);
  EXPECT_EQ(Aspect<float>(filter, 0, 5), 510.0f);
}

TEST(FilterAsp, SpacingsAndScaleActOnTheNormal) {
  EXPECT_EQ(Aspect<short>(UnitAsp(2, 1), -1, -1), 153);  // atan2(2, 1) + 90
  EXPECT_EQ(Aspect<short>(UnitAsp(1, 2), -1, -1), 117);  // atan2(1, 2) + 90
  UnitAsp upsideDown;
  upsideDown.SetELSZ(-1.0f);
  EXPECT_EQ(Aspect<float>(upsideDown, -1, 0), 270.0f);
  UnitAsp flattened;
  flattened.SetELSZ(0.0f);
  EXPECT_EQ(Aspect<float>(flattened, -1, 0), 510.0f);
}

TEST(FilterAsp, InputOfSeveralChannelsGivesAResultForChannelZeroOnly) {
  Image<short> in({3, 2, 3}, {1, 1});
  in.Set([](int x, int y, std::uint32_t c) { return c == 0 ? -x : 10 * y + x; });
  Image<short> out({3, 2}, {}, 77);
  UnitAsp().Process(&in, nullptr, &out);
  EXPECT_EQ(Bytes(out), Bytes(Image<short>({3, 2}, {}, 90)));
}

TEST(FilterAsp, ResultsArePackedAtTheStartOfEachRowOfAnOutputOfSeveralChannels) {
  Image<short> in({3, 2, 2}, {1, 1});
  in.Set([](int x, int, std::uint32_t) { return -x; });
  Image<short> out({3, 2, 2}, {1, 0}, 77);
  UnitAsp().Process(&in, nullptr, &out);
  for (int y = 0; y < 2; ++y) {
    const std::vector<short> row(&out.At(0, y), &out.At(0, y) + 6);
    EXPECT_EQ(row, (std::vector<short>{90, 90, 90, 77, 77, 77}));
    EXPECT_EQ(out.At(-1, y), 77);
  }
}

// The bits are picked by the mask's geometry, the bytes of the corners by the input's.
TEST(FilterAsp, CornerOfAMaskOfAnotherGeometryReadsAsZero) {
  Image<short> in({1, 1}, {1, 1}, 0);
  in.At(0, 0) = in.At(0, 1) = 50;
  Mask mask(1, 1, {3, 2});  // 7 pixels in a row, where the input has 3
  const auto clear = [&](int index) { mask.SetValid(index % 7 - 3, index / 7 - 2, false); };
  Image<float> out({1, 1});
  UnitAsp().Process(&in, &mask, &out);
  EXPECT_EQ(out.At(0, 0), 90.0f);
  clear(7);  // the input's index of pixel (0, 1), whose 50 becomes 0
  UnitAsp().Process(&in, &mask, &out);
  EXPECT_EQ(out.At(0, 0), 135.0f);
  clear(4);  // that of pixel (0, 0)
  UnitAsp().Process(&in, &mask, &out);
  EXPECT_EQ(out.At(0, 0), 510.0f);
}

TEST(FilterAsp, NaNInACellGivesNaNThroughClipTo) {
  const UnitAsp filter;
  EXPECT_TRUE(std::isnan(CellAspect<float>(filter, kNaN, 1, 1, 1)));
  EXPECT_TRUE(std::isnan(CellAspect<double>(filter, 1, kNaN, 1, 1)));
  EXPECT_TRUE(std::isnan(CellAspect<float>(filter, 1, 1, kNaN, 1)));
  EXPECT_EQ(CellAspect<char>(filter, 1, 1, 1, kNaN), 0);
  EXPECT_EQ(CellAspect<unsigned char>(filter, kNaN, 1, 1, 1), 0);
  EXPECT_EQ(CellAspect<short>(filter, kNaN, 1, 1, 1), 0);
  EXPECT_EQ(CellAspect<unsigned short>(filter, kNaN, 1, 1, 1), 0);
  EXPECT_EQ(CellAspect<int>(filter, kNaN, 1, 1, 1), -2147483647 - 1);
  EXPECT_EQ(CellAspect<unsigned int>(filter, kNaN, 1, 1, 1), 0u);
  EXPECT_EQ(CellAspect<std::int64_t>(filter, kNaN, 1, 1, 1), std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ(CellAspect<std::uint64_t>(filter, kNaN, 1, 1, 1), std::uint64_t{1} << 63);
}

TEST(FilterAsp, EachCornerIsConvertedToFloatByItself) {
  EXPECT_EQ((CellAspect<float, double>(UnitAsp(), 16777217, 16777216, 16777217, 16777216)), 510.0f);
  EXPECT_EQ((CellAspect<float, std::int64_t>(UnitAsp(), 16777217, 16777216, 16777217, 16777216)), 510.0f);
  EXPECT_EQ((CellAspect<float, std::uint64_t>(UnitAsp(), 0x1p63, 0, 0x1p63, 0)), 90.0f);
  EXPECT_EQ((CellAspect<float, unsigned char>(UnitAsp(), 255, 0, 255, 0)), 90.0f);
  EXPECT_EQ((CellAspect<float, char>(UnitAsp(), 0, -1, 0, -1)), 90.0f);
}

TEST(FilterAsp, ComplexInputGivesTheAspectOfItsRealParts) {
  Image<short> in({2, 1}, {1, 1}, 0, true);
  in.Set([](int x, int y, std::uint32_t part) { return part == 0 ? -x : 100 * y; });
  Image<short> out({2, 1});
  UnitAsp().Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 90);
  EXPECT_EQ(out.At(1, 0), 90);
}

TEST(FilterAsp, HeightOrWidthOfZeroWritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0, 2}, tests::Size{0, 4, 2}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({size.width, size.height}, {1, 1});
    FillBytes(out);
    UnitAsp().Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

// ---- failures

struct FilterAspFailure : ::testing::Test {
  Image<short> in{{3, 2, 2}, {1, 1}, 7};
  Image<short> out{{3, 2}, {1, 1}};
  const UnitAsp filter;

  FilterAspFailure() { FillBytes(out); }
};

TEST_F(FilterAspFailure, NullInputIsAnInvalidPointer) {
  EXPECT_TRUE(
      Throws<Exception>("poRasterIn is invalid pointer", [&] { filter.Process(nullptr, nullptr, &out); }));
  EXPECT_TRUE(
      Throws<Exception>("poRasterIn is invalid pointer", [&] { filter.Process(nullptr, nullptr, nullptr); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(FilterAspFailure, NullOutputIsAnInvalidPointer) {
  EXPECT_TRUE(
      Throws<Exception>("poRasterOut is invalid pointer", [&] { filter.Process(&in, nullptr, nullptr); }));
}

TEST_F(FilterAspFailure, OutputCannotBeComplex) {
  for (const PixelType& type : tests::kPixelTypes) {
    Raster complex({3, 2, 1, DataType(type.element, true)}, {1, 1});
    FillBytes(complex);
    EXPECT_TRUE(Throws<Exception>("Output cannot be complex", [&] {
      filter.Process(&in, nullptr, &complex);
    })) << type;
    EXPECT_TRUE(IsUntouched(complex));
  }
}

TEST_F(FilterAspFailure, TypesOutsideTheListAreInvalid) {
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&odd, nullptr, &out); }));
    EXPECT_TRUE(IsUntouched(out));
    if (type.isComplex) continue;
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&in, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

TEST_F(FilterAspFailure, MarginOfZeroInOneDirectionFails) {
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

TEST_F(FilterAspFailure, MarginOfAComplexInputIsTestedToo) {
  Image<short> barren({3, 2}, {1, 0}, 7, true);
  EXPECT_TRUE(Throws<ParameterException>(kMarginMessage, [&] { filter.Process(&barren, nullptr, &out); }));
  EXPECT_TRUE(IsUntouched(out));
}

TEST_F(FilterAspFailure, MarginFailureNamesTheInput) {
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

TEST_F(FilterAspFailure, TypesComeBeforeTheMargin) {
  Image<short> barren({3, 2}, {}, 7);
  Raster odd({3, 2, 1, DataType(tessel::eDT_BIT)}, {});
  EXPECT_TRUE(
      Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&barren, nullptr, &odd); }));
}

// ---- differential

FilterAsp DrawFilter(tests::Random& random) {
  constexpr float kUsual[] = {1.0f, 1.0f, 2.0f, 0.5f, 30.0f, 12.5f, -1.0f};
  constexpr float kOdd[] = {0.0f,  -0.0f,   -30.0f, 1e-30f,    1e-40f,     4.43e-23f,
                            1e20f, 3.4e38f, -1e20f, kInfinity, -kInfinity, kNaN};
  constexpr float kWritten[] = {510.0f,   0.0f,     -1.0f,      0.5f,  2.5f,  -0.5f,  -2.5f,     127.5f,
                                -9999.0f, 65535.0f, 8388609.0f, 1e10f, 1e20f, -1e20f, kInfinity, kNaN};
  const auto draw = [&] { return random.OneIn(4) ? random.Pick(kOdd) : random.Pick(kUsual); };
  FilterAsp filter;
  filter.SetXSIZE(draw());
  filter.SetYSIZE(draw());
  filter.SetELSZ(draw());
  filter.SetZeroSlope(random.Pick(kWritten));
  filter.SetBackground(random.Pick(kWritten));
  return filter;
}

struct FilterAspDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(FilterAspDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : tests::CasesFrom(GetParam(), {.leastMargin = 1, .leastChannels = 1})) {
    tests::Random random(~c.seed);
    const FilterAsp filter = DrawFilter(random);
    const ::testing::AssertionResult result = Agree(
        c, {}, [&](Raster* in, Mask* mask, Raster* out) { filter.Process(in, mask, out); },
        [&](const Raster& in, const Mask* mask, Raster& out) {
          reference::FilterAsp(filter, in, mask, out);
        });
    ASSERT_TRUE(result) << "XSIZE " << filter.XSIZE << ", YSIZE " << filter.YSIZE << ", ELSZ " << filter.ELSZ
                        << ", ZeroSlope " << filter.ZeroSlope << ", Background " << filter.Background;
  }
}

INSTANTIATE_TEST_SUITE_P(From, FilterAspDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

// ---- contract

TEST(FilterAspContract, ParameterSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  UnitAsp filter;
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
  filter.SetELSZ(-1.0f);
  filter.SetXSIZE(0.0f);
  filter.SetYSIZE(0.0f);
  filter.SetZeroSlope(1.0f);
  filter.SetBackground(9.0f);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
  EXPECT_EQ(Aspect<short>(filter, 0, 0), 510);
  EXPECT_EQ(Masked<short>(filter), 0);
}

TEST(FilterAspContract, ParametersSetAfterTheFirstProcessAreTakenWhenATypeChanges) {
  UnitAsp filter;
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
  filter.SetELSZ(-1.0f);
  filter.SetZeroSlope(1.0f);
  filter.SetBackground(9.0f);
  EXPECT_EQ(Aspect<int>(filter, -1, 0), 270);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 270);
  EXPECT_EQ(Aspect<short>(filter, 0, 0), 1);
  EXPECT_EQ(Masked<short>(filter), 9);
  filter.SetELSZ(1.0f);
  EXPECT_EQ((Aspect<short, int>(filter, -1, 0)), 90);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
}

TEST(FilterAspContract, CacheHoldsTheTypesOfTheInterpretedRaster) {
  UnitAsp filter;
  Image<float> complex({1, 1}, {1, 1}, 0, true);
  complex.Set([](int x, int, std::uint32_t part) { return part == 0 ? -x : 0; });
  Image<short> out({1, 1});
  filter.Process(&complex, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 90);
  filter.SetELSZ(-1.0f);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
  filter.Process(&complex, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 90);
}

/// A call that the dispatcher refuses.
void FailToDispatch(const FilterAsp& filter) {
  Raster bits({1, 1, 1, DataType(tessel::eDT_BIT)}, {1, 1});
  Image<short> out({1, 1});
  EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { filter.Process(&bits, nullptr, &out); }));
}

TEST(FilterAspContract, ObjectWorksAfterAFailedDispatch) {
  const UnitAsp filter;
  FailToDispatch(filter);
  FailToDispatch(filter);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
}

TEST(FilterAspContract, ObjectThatHadRunWorksAfterAFailedDispatchWithTheNewParameters) {
  UnitAsp filter;
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
  filter.SetELSZ(-1.0f);
  FailToDispatch(filter);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 270);
}

TEST(FilterAspContract, ObjectCanBeDestroyedAfterAFailedDispatch) {
  const auto filter = std::make_unique<UnitAsp>();
  EXPECT_EQ(Aspect<short>(*filter, -1, 0), 90);
  FailToDispatch(*filter);
}

TEST(FilterAspContract, RefusedMarginLeavesTheProcessorWithTheParametersOfThatMoment) {
  UnitAsp filter;
  Image<float> barren({1, 1});
  Image<short> out({1, 1});
  EXPECT_THROW(filter.Process(&barren, nullptr, &out), ParameterException);
  filter.SetELSZ(-1.0f);
  EXPECT_EQ(Aspect<short>(filter, -1, 0), 90);
}

TEST(FilterAspContract, CopyMadeBeforeTheFirstProcessIsIndependent) {
  const UnitAsp original;
  UnitAsp copy(original), assigned(0, 0);
  assigned = original;
  copy.SetELSZ(-1.0f);
  EXPECT_EQ(Aspect<short>(original, -1, 0), 90);
  EXPECT_EQ(Aspect<short>(copy, -1, 0), 270);
  EXPECT_EQ(Aspect<short>(assigned, -1, 0), 90);
}

TEST(FilterAspContract, TwoObjectsRunOnTwoThreadsAtOnce) {
  const auto work = [](float scale, bool* isRight) {
    UnitAsp filter;
    filter.SetELSZ(scale);
    Image<short> in({300, 130}, {1, 1});
    in.Set([](int x, int, std::uint32_t) { return -x; });
    Image<short> out({300, 130});
    for (int i = 0; i < 20; ++i) {
      out.At(150, 30) = out.At(299, 129) = -1;
      filter.Process(&in, nullptr, &out);
      const short expected = scale == 1.0f ? 90 : 270;
      *isRight = *isRight && out.At(150, 30) == expected && out.At(299, 129) == expected;
    }
  };
  bool isFirstRight = true, isSecondRight = true;
  std::thread first(work, 1.0f, &isFirstRight), second(work, -1.0f, &isSecondRight);
  first.join();
  second.join();
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

}  // namespace
}  // namespace orvik::filters
