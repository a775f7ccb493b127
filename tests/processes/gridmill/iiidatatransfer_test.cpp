#include "processes/gridmill/iiidatatransfer.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <ostream>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "tests/reference/iiidatatransfer_reference.h"
#include "tests/support/compare.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::gridmill {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::Bytes;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;
using tests::SameBits;
using tests::Size;

using Columns = std::vector<int>;

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

/// An operator from one region to another, each x, y, width, height.
IIIDataTransfer Between(std::vector<unsigned int> source, std::vector<unsigned int> target) {
  IIIDataTransfer transfer;
  transfer.SetInRegion(source);
  transfer.SetOutRegion(target);
  return transfer;
}

/// An operator that takes pixel (x, y) to pixel (x, y).
IIIDataTransfer Straight() { return Between({0, 0, 100, 100}, {0, 0, 100, 100}); }

/// One axis of both regions and of both rasters.
struct Axis {
  unsigned int inStart = 0, inExtent = 100, outStart = 0, outExtent = 100;
  unsigned int inOrigin = 0, outOrigin = 0;
};

/// The input columns that the output columns get. It also sees that rows are treated alike.
Columns ColumnsOf(const Axis& a, unsigned int inLength, unsigned int outLength) {
  Image<int> wide({inLength, 1}, {0, 0, a.inOrigin, 7}), tall({1, inLength}, {0, 0, 7, a.inOrigin});
  wide.Set([](int x, int, std::uint32_t) { return x; });
  tall.Set([](int, int y, std::uint32_t) { return y; });
  Image<int> columns({outLength, 1}, {0, 0, a.outOrigin, 3}, 77);
  Image<int> rows({1, outLength}, {0, 0, 3, a.outOrigin}, 77);
  Between({a.inStart, 7, a.inExtent, 9}, {a.outStart, 3, a.outExtent, 9}).Process(&wide, nullptr, &columns);
  Between({7, a.inStart, 9, a.inExtent}, {3, a.outStart, 9, a.outExtent}).Process(&tall, nullptr, &rows);
  const Columns found(columns.Elements(), columns.Elements() + outLength);
  EXPECT_EQ(Columns(rows.Elements(), rows.Elements() + outLength), found);
  return found;
}

/// A sample of one type as it arrives in the other.
template <class Out, class In>
Out Moved(In sample) {
  Image<In> in({1, 1}, {}, sample);
  Image<Out> out({1, 1}, {}, Out{77});
  Straight().Process(&in, nullptr, &out);
  return out.At(0, 0);
}

template <class T>
std::vector<T> ElementsOf(Image<T>& image) {
  return {image.Elements(), image.Elements() + image.dataSize / sizeof(T)};
}

// ---- golden: positions

TEST(IIIDataTransfer, EqualRegionsWithoutOriginsGiveAStraightCopyOfTheOverlap) {
  Image<short> in({3, 2, 2});
  in.Set([](int x, int y, std::uint32_t c) { return 100 * y + 10 * x + static_cast<int>(c); });
  Image<short> same({3, 2, 2}), smaller({2, 1, 2}), larger({4, 3, 2});
  Between({0, 0, 3, 2}, {0, 0, 3, 2}).Process(&in, nullptr, &same);
  EXPECT_EQ(ElementsOf(same), ElementsOf(in));
  Between({0, 0, 3, 2}, {0, 0, 3, 2}).Process(&in, nullptr, &smaller);
  EXPECT_EQ(ElementsOf(smaller), (std::vector<short>{0, 1, 10, 11}));
  Between({0, 0, 3, 2}, {0, 0, 3, 2}).Process(&in, nullptr, &larger);
  EXPECT_EQ(ElementsOf(larger), (std::vector<short>{0,   1,   10,  11,  20,  21,  20,  21,   //
                                                    100, 101, 110, 111, 120, 121, 120, 121,  //
                                                    100, 101, 110, 111, 120, 121, 120, 121}));
}

TEST(IIIDataTransfer, WithAScaleOf2TheOutputColumns0123GetTheInputColumns0112) {
  EXPECT_EQ(ColumnsOf({.inExtent = 4, .outExtent = 8}, 4, 8), (Columns{0, 1, 1, 2, 2, 3, 3, 3}));
}

TEST(IIIDataTransfer, CoordinateRoundsToTheNearestPixelWithTiesGoingUp) {
  EXPECT_EQ(ColumnsOf({.inExtent = 4, .outExtent = 12}, 9, 9), (Columns{0, 0, 1, 1, 1, 2, 2, 2, 3}));
  EXPECT_EQ(ColumnsOf({.inExtent = 8, .outExtent = 4}, 8, 4), (Columns{0, 2, 4, 6}));
  EXPECT_EQ(ColumnsOf({.inExtent = 3, .outExtent = 2}, 9, 6), (Columns{0, 2, 3, 5, 6, 8}));
  EXPECT_EQ(ColumnsOf({.inExtent = 5, .outExtent = 8}, 6, 8), (Columns{0, 1, 1, 2, 3, 3, 4, 4}));
}

TEST(IIIDataTransfer, ScaleAndPositionAreQuotientsInDouble) {
  const Columns narrow = ColumnsOf({.inExtent = 17, .outExtent = 6}, 200, 40);
  EXPECT_EQ(narrow[9], 26);   // the product with the reciprocal lies below 25.5
  EXPECT_EQ(narrow[15], 43);  // the same
  EXPECT_EQ(narrow[21], 59);  // of an exact quotient 60
  EXPECT_EQ(ColumnsOf({.inExtent = 13, .outExtent = 6}, 200, 40)[27], 59);  // by the inverse scale 58
}

TEST(IIIDataTransfer, StartAndOriginAreAddedBeforeTheHalfPixel) {
  // 1 / S is 0.499999875, which becomes 0.5 next to 4294967295
  const Axis far = {4294967295u, 2000000, 0, 4000001, 4294967295u, 0};
  EXPECT_EQ(ColumnsOf(far, 3, 2), (Columns{0, 1}));
  EXPECT_EQ(ColumnsOf({.inExtent = 2000000, .outExtent = 4000001}, 3, 2), (Columns{0, 0}));
}

TEST(IIIDataTransfer, SourceRegionIsInCoordinatesOfTheInputsWholeImage) {
  EXPECT_EQ(ColumnsOf({.inStart = 12, .inOrigin = 10}, 9, 4), (Columns{2, 3, 4, 5}));
  EXPECT_EQ(ColumnsOf({.inStart = 12}, 19, 4), (Columns{12, 13, 14, 15}));
}

TEST(IIIDataTransfer, TargetRegionIsInCoordinatesOfTheOutputsWholeImage) {
  EXPECT_EQ(ColumnsOf({.outStart = 100, .outOrigin = 100}, 9, 4), (Columns{0, 1, 2, 3}));
  EXPECT_EQ(ColumnsOf({.outStart = 97, .outOrigin = 100}, 9, 4), (Columns{3, 4, 5, 6}));
  EXPECT_EQ(ColumnsOf({.inExtent = 4, .outStart = 97, .outExtent = 8, .outOrigin = 100}, 9, 4),
            (Columns{2, 2, 3, 3}));
  EXPECT_EQ(ColumnsOf({.inStart = 31, .outStart = 96, .inOrigin = 33, .outOrigin = 100}, 9, 4),
            (Columns{2, 3, 4, 5}));
}

TEST(IIIDataTransfer, OriginsAndStartsAreUnsigned) {
  constexpr unsigned int kFar = 4294967290u;
  EXPECT_EQ(ColumnsOf({.inStart = kFar, .inOrigin = kFar - 2}, 9, 4), (Columns{2, 3, 4, 5}));
  EXPECT_EQ(ColumnsOf({.outStart = kFar, .outOrigin = kFar + 1}, 9, 4), (Columns{1, 2, 3, 4}));
  EXPECT_EQ(ColumnsOf({.outStart = kFar, .outOrigin = 1}, 19, 4), (Columns{7, 8, 9, 10}));
  EXPECT_EQ(ColumnsOf({.inStart = kFar}, 9, 2), (Columns{0, 0}));  // leaves 32 bits
  EXPECT_EQ(ColumnsOf({.inStart = 2147483646}, 9, 3), (Columns{8, 8, 0}));
}

TEST(IIIDataTransfer, ExtentsAreUnsigned) {
  EXPECT_EQ(ColumnsOf({.inExtent = 2147483648u, .outExtent = 4294967295u}, 9, 4), (Columns{0, 1, 1, 2}));
  EXPECT_EQ(ColumnsOf({.inExtent = 4294967295u, .outExtent = 4294967295u}, 9, 4), (Columns{0, 1, 2, 3}));
}

// Deliberate: input pixels past the edges of `inRegion` are taken too; only the input's own extent is a
// limit.
TEST(IIIDataTransfer, InputPixelsPastTheEdgesOfTheRegionAreTakenTooOnlyTheInputsOwnExtentIsALimit) {
  EXPECT_EQ(ColumnsOf({.inStart = 1, .inExtent = 2, .outExtent = 2}, 6, 8),
            (Columns{1, 2, 3, 4, 5, 5, 5, 5}));
  EXPECT_EQ(ColumnsOf({.inStart = 3, .inExtent = 2, .outStart = 2, .outExtent = 2, .outOrigin = 2}, 5, 4),
            (Columns{3, 4, 4, 4}));
}

TEST(IIIDataTransfer, PositionBeforeTheInputBecomes0) {
  EXPECT_EQ(ColumnsOf({.inOrigin = 3}, 9, 6), (Columns{0, 0, 0, 0, 1, 2}));
  EXPECT_EQ(ColumnsOf({.inOrigin = 4000000000u}, 9, 2), (Columns{0, 0}));
}

TEST(IIIDataTransfer, MarginsAreNeitherReadNorWritten) {
  Image<short> in({2, 2}, {2, 1}, -9);
  in.At(0, 0) = 1;
  in.At(1, 0) = 2;
  in.At(0, 1) = 3;
  in.At(1, 1) = 4;
  Image<short> out({3, 3}, {1, 2}, 77);
  Between({0, 0, 2, 2}, {1, 1, 2, 2}).Process(&in, nullptr, &out);
  for (int y = -2; y < 5; ++y) {
    for (int x = -1; x < 4; ++x) {
      const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 3;
      const int expected = (y == 2 ? 3 : 1) + (x == 2 ? 1 : 0);
      EXPECT_EQ(out.At(x, y), isInside ? expected : 77) << x << ", " << y;
    }
  }
}

// Deliberate: a pixel left of the target region wraps. With a scale up to about 2 it gets the first column,
// with a larger one the last; above the region it is the same with rows.
TEST(IIIDataTransfer, PixelLeftOfTheTargetRegionGetsTheFirstColumnWithAScaleUpToAbout2ElseTheLast) {
  EXPECT_EQ(ColumnsOf({.inExtent = 8, .outStart = 3, .outExtent = 4}, 7, 6), (Columns{0, 0, 0, 0, 2, 4}));
  EXPECT_EQ(ColumnsOf({.inExtent = 8, .outStart = 3, .outExtent = 8}, 7, 6), (Columns{0, 0, 0, 0, 1, 2}));
  EXPECT_EQ(ColumnsOf({.inStart = 2, .inExtent = 4, .outStart = 3, .outExtent = 8}, 7, 6),
            (Columns{0, 0, 0, 2, 3, 3}));
  EXPECT_EQ(ColumnsOf({.inExtent = 4, .outStart = 3, .outExtent = 12}, 7, 6), (Columns{6, 6, 6, 0, 0, 1}));
  EXPECT_EQ(ColumnsOf({.inExtent = 4, .outStart = 3, .outExtent = 12}, 1, 4), (Columns{0, 0, 0, 0}));
}

TEST(IIIDataTransfer, WithAScaleOf2OnlyPositionsFrom2147483648OnWrapToTheFirstColumn) {
  // 4294967294 / 2 + 0.5 stays below 2147483648, 4294967295 / 2 + 0.5 does not
  EXPECT_EQ(ColumnsOf({.inExtent = 4, .outStart = 3, .outExtent = 8}, 7, 5), (Columns{6, 6, 0, 0, 1}));
}

TEST(IIIDataTransfer, PixelsAboveAndLeftOfTheRegionWrapByTheScaleOfTheirOwnAxis) {
  Image<short> in({5, 5});
  in.Set([](int x, int y, std::uint32_t) { return 10 * y + x; });
  Image<short> out({2, 2});
  Between({1, 1, 3, 3}, {1, 1, 9, 3}).Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<short>{4, 1, 14, 11}));
  Between({1, 1, 3, 3}, {1, 1, 3, 9}).Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<short>{40, 41, 10, 11}));
}

TEST(IIIDataTransfer, TargetRegionOfExtent0GivesTheFirstColumnThroughout) {
  EXPECT_EQ(ColumnsOf({.inStart = 4, .inExtent = 3, .outExtent = 0}, 9, 4), (Columns{0, 0, 0, 0}));
  EXPECT_EQ(ColumnsOf({.inStart = 4, .inExtent = 3, .outStart = 2, .outExtent = 0}, 9, 4),
            (Columns{0, 0, 0, 0}));
}

TEST(IIIDataTransfer, SourceRegionOfExtent0GivesThePixelAtItsStartThroughout) {
  EXPECT_EQ(ColumnsOf({.inStart = 4, .inExtent = 0}, 9, 4), (Columns{4, 4, 4, 4}));
  EXPECT_EQ(ColumnsOf({.inStart = 14, .inExtent = 0, .outStart = 2, .inOrigin = 9}, 9, 4),
            (Columns{5, 5, 5, 5}));
  EXPECT_EQ(ColumnsOf({.inStart = 20, .inExtent = 0}, 9, 2), (Columns{8, 8}));
}

TEST(IIIDataTransfer, RegionsOfExtent0OnBothSidesGiveTheFirstColumnThroughout) {
  EXPECT_EQ(ColumnsOf({.inStart = 4, .inExtent = 0, .outExtent = 0}, 9, 4), (Columns{0, 0, 0, 0}));
}

TEST(IIIDataTransfer, RegionsAndResampleTypeAre0ByDefault) {
  EXPECT_EQ(IIIDataTransfer().inRegion, details::Region{});
  EXPECT_EQ(IIIDataTransfer().outRegion, details::Region{});
  EXPECT_EQ(IIIDataTransfer().resampleType, 0);
  EXPECT_TRUE(IIIDataTransfer().inReserved.empty());
  EXPECT_TRUE(IIIDataTransfer().outReserved.empty());
}

TEST(IIIDataTransfer, WholeOutputIsWalkedNotJustTheTargetRegion) {
  Image<short> in({4, 4}, {}, 5);
  Image<short> out({7, 6}, {}, 77);
  Between({1, 1, 2, 2}, {2, 2, 2, 2}).Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), std::vector<short>(7 * 6, 5));
}

TEST(IIIDataTransfer, FirstFourEntriesOfARegionAreTaken) {
  std::vector<unsigned int> source = {1, 2, 3, 4, 5, 6}, target = {7, 8, 9, 10, 11};
  details::IIIParams params;
  params.SetInRegion(source);
  params.SetOutRegion(target);
  EXPECT_EQ(params.inRegion, (details::Region{1, 2, 3, 4}));
  EXPECT_EQ(params.outRegion, (details::Region{7, 8, 9, 10}));
  EXPECT_EQ(source.size(), 6u);
}

TEST(IIIDataTransfer, ResampleTypeOtherThan0LeavesTheOutputUntouched) {
  for (const int type : {1, 2, 3, -1, 255, 256, 2147483647}) {
    IIIDataTransfer transfer = Straight();
    transfer.SetResampleType(static_cast<ResampleType>(type));
    Image<short> in({5, 3}, {}, 5);
    Image<short> out({5, 3}, {1, 1});
    FillBytes(out);
    transfer.Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out)) << type;
  }
}

TEST(IIIDataTransfer, OutputOfHeightOrWidth0IsUntouched) {
  for (const Size size : {Size{4, 0}, Size{0, 4}, Size{0, 0}}) {
    Image<short> in({4, 4}, {1, 1}, 5);
    Image<short> out(size, {1, 1});
    FillBytes(out);
    Straight().Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(IIIDataTransfer, InputOfHeightOrWidthOrChannels0LeavesTheOutputUntouched) {
  for (const Size size : {Size{4, 0}, Size{0, 4}, Size{0, 0}, Size{4, 4, 0}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({4, 4}, {1, 1});
    FillBytes(out);
    Straight().Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
  }
}

TEST(IIIDataTransfer, MaskIsIgnored) {
  Image<short> in({5, 3}, {1, 1}, 5);
  Mask excluding(5, 3, {1, 1}, false);
  Mask none(0, 0);
  for (Mask* mask : {&excluding, &none}) {
    Image<short> out({5, 3}, {}, 77);
    Straight().Process(&in, mask, &out);
    EXPECT_EQ(ElementsOf(out), std::vector<short>(15, 5));
  }
}

// ---- golden: samples

TEST(IIIDataTransfer, FurtherOutputChannelsKeepWhatTheyHeld) {
  Image<short> in({2, 2, 2});
  in.Set([](int x, int y, std::uint32_t c) { return 100 * y + 10 * x + static_cast<int>(c); });
  Image<int> out({3, 3, 4});
  out.Set([](int x, int y, std::uint32_t c) { return 1000 + 100 * y + 10 * x + static_cast<int>(c); });
  Between({0, 0, 2, 2}, {0, 0, 4, 4}).Process(&in, nullptr, &out);  // rows 1 and 2 get the same
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 3; ++x) {
      const int source = (y > 0 ? 100 : 0) + (x > 0 ? 10 : 0), held = 1000 + 100 * y + 10 * x;
      EXPECT_EQ(out.At(x, y, 0), source);
      EXPECT_EQ(out.At(x, y, 1), source + 1);
      EXPECT_EQ(out.At(x, y, 2), held + 2);
      EXPECT_EQ(out.At(x, y, 3), held + 3);
    }
  }
}

TEST(IIIDataTransfer, ComplexSamplesAreMovedAsTheyAre) {
  Image<float> in({2, 1, 2}, {}, 0, true);
  in.SetPixel(0, 0, {1.5f, -2.5f, 3.5f, -4.5f});
  in.SetPixel(1, 0, {5.5f, -6.5f, 7.5f, -8.5f});
  Image<double> out({3, 1, 2}, {}, 77, true);
  Straight().Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out),
            (std::vector<double>{1.5, -2.5, 3.5, -4.5, 5.5, -6.5, 7.5, -8.5, 5.5, -6.5, 7.5, -8.5}));
  Image<short> whole({1, 1, 2}, {}, 77, true);
  Straight().Process(&in, nullptr, &whole);
  EXPECT_EQ(ElementsOf(whole), (std::vector<short>{1, -2, 3, -4}));
}

TEST(IIIDataTransfer, ComplexInputFillsARealOutputOfTwiceTheChannels) {
  Image<short> in({2, 1}, {}, 0, true);
  in.SetPixel(0, 0, {1, 2});
  in.SetPixel(1, 0, {3, 4});
  Image<float> out({2, 1, 3}, {}, 77);
  Straight().Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<float>{1, 2, 77, 3, 4, 77}));
}

TEST(IIIDataTransfer, RealInputFillsTheFirstElementsOfAComplexOutput) {
  Image<short> in({2, 1, 3});
  in.SetPixel(0, 0, {1, 2, 3});
  in.SetPixel(1, 0, {4, 5, 6});
  Image<float> out({2, 1, 3}, {}, 77, true);
  Straight().Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<float>{1, 2, 3, 77, 77, 77, 4, 5, 6, 77, 77, 77}));
}

TEST(IIIDataTransfer, WiderSamplesLoseTheirHighBits) {
  EXPECT_EQ((Moved<unsigned char, short>(300)), 44);
  EXPECT_EQ((Moved<unsigned char, short>(-1)), 255);
  EXPECT_EQ((Moved<char, unsigned char>(200)), -56);
  EXPECT_EQ((Moved<short, int>(70000)), 4464);
  EXPECT_EQ((Moved<short, unsigned short>(65535)), -1);
  EXPECT_EQ((Moved<int, unsigned int>(4294967295u)), -1);
  EXPECT_EQ((Moved<int, std::int64_t>(0x123456789ABCDEF0)), static_cast<int>(0x9ABCDEF0));
  EXPECT_EQ((Moved<unsigned short, std::uint64_t>(0x123456789ABCDEF0u)), 0xDEF0);
}

TEST(IIIDataTransfer, NarrowerSamplesAreExtendedByTheirOwnSign) {
  EXPECT_EQ((Moved<unsigned short, char>(-1)), 65535);
  EXPECT_EQ((Moved<int, char>(-128)), -128);
  EXPECT_EQ((Moved<int, unsigned char>(255)), 255);
  EXPECT_EQ((Moved<unsigned int, short>(-2)), 4294967294u);
  EXPECT_EQ((Moved<std::int64_t, int>(-3)), -3);
  EXPECT_EQ((Moved<std::uint64_t, char>(-1)), 18446744073709551615u);
  EXPECT_EQ((Moved<std::int64_t, unsigned int>(4294967295u)), 4294967295);
}

TEST(IIIDataTransfer, FloatingSamplesAreTruncatedAndKeepTheirLowBits) {
  EXPECT_EQ((Moved<unsigned char, float>(300.7f)), 44);
  EXPECT_EQ((Moved<unsigned char, float>(-1.5f)), 255);
  EXPECT_EQ((Moved<char, float>(-2.9f)), -2);
  EXPECT_EQ((Moved<char, double>(200.9)), -56);
  EXPECT_EQ((Moved<short, float>(70000.0f)), 4464);
  EXPECT_EQ((Moved<unsigned short, double>(-1.0)), 65535);
  EXPECT_EQ((Moved<int, float>(2.9f)), 2);
  EXPECT_EQ((Moved<int, double>(-2147483648.9)), -2147483647 - 1);
  EXPECT_EQ((Moved<std::int64_t, double>(-2.9)), -2);
  EXPECT_EQ((Moved<std::uint64_t, float>(2.9f)), 2u);
}

TEST(IIIDataTransfer, FloatingSamplesOutOfRangeGiveTheMostNegativeIntegerCutToTheWidth) {
  constexpr int kIndefinite = std::numeric_limits<int>::min();
  for (const double sample : {kNaN, kInfinity, -kInfinity, 1e300, -1e300, 3e9}) {
    EXPECT_EQ((Moved<int, double>(sample)), kIndefinite) << sample;
    EXPECT_EQ((Moved<short, double>(sample)), 0) << sample;
    EXPECT_EQ((Moved<unsigned short, double>(sample)), 0) << sample;
    EXPECT_EQ((Moved<char, double>(sample)), 0) << sample;
    EXPECT_EQ((Moved<unsigned char, double>(sample)), 0) << sample;
    EXPECT_EQ((Moved<int, float>(static_cast<float>(sample))), kIndefinite) << sample;
    EXPECT_EQ((Moved<unsigned char, float>(static_cast<float>(sample))), 0) << sample;
  }
  EXPECT_EQ((Moved<std::int64_t, float>(std::numeric_limits<float>::quiet_NaN())),
            std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ((Moved<std::int64_t, double>(0x1p63)), std::numeric_limits<std::int64_t>::min());
}

TEST(IIIDataTransfer, UnsignedIntOf32BitsKeepsTheLowBitsOf64) {
  EXPECT_EQ((Moved<unsigned int, float>(-1.0f)), 4294967295u);
  EXPECT_EQ((Moved<unsigned int, double>(4294967295.5)), 4294967295u);
  EXPECT_EQ((Moved<unsigned int, double>(4294967298.0)), 2u);
  EXPECT_EQ((Moved<unsigned int, double>(kNaN)), 0u);
}

TEST(IIIDataTransfer, UnsignedIntegersOf64BitsKeepTheirTrueValue) {
  constexpr std::uint64_t kMost = std::numeric_limits<std::uint64_t>::max();
  EXPECT_EQ((Moved<double, std::uint64_t>(kMost)), 0x1p64);
  EXPECT_EQ((Moved<float, std::uint64_t>(kMost)), 0x1p64f);
  EXPECT_EQ((Moved<double, std::uint64_t>(std::uint64_t{1} << 63)), 0x1p63);
  EXPECT_EQ((Moved<float, std::uint64_t>(0x8000008000000001u)), 0x1.000002p63f);  // rounded once
  EXPECT_EQ((Moved<std::uint64_t, double>(1e19)), 10000000000000000000u);
  EXPECT_EQ((Moved<std::uint64_t, float>(0x1p63f)), std::uint64_t{1} << 63);
  EXPECT_EQ((Moved<std::uint64_t, double>(-1.0)), kMost);
  EXPECT_EQ((Moved<std::uint64_t, double>(kNaN)), std::uint64_t{1} << 63);
}

TEST(IIIDataTransfer, IntegersAreRoundedToFloatingSamples) {
  EXPECT_EQ((Moved<float, int>(2147483647)), 2147483648.0f);
  EXPECT_EQ((Moved<float, int>(16777217)), 16777216.0f);
  EXPECT_EQ((Moved<double, int>(16777217)), 16777217.0);
  EXPECT_EQ((Moved<double, std::int64_t>(9007199254740993)), 9007199254740992.0);
  EXPECT_EQ((Moved<float, std::int64_t>(-9007199254740993)), -9007199254740992.0f);
  EXPECT_EQ((Moved<float, unsigned int>(4294967295u)), 4294967296.0f);
  EXPECT_EQ((Moved<float, double>(1e300)), static_cast<float>(kInfinity));
  EXPECT_EQ((Moved<float, double>(0.1)), 0.1f);
  EXPECT_EQ((Moved<double, float>(0.1f)), static_cast<double>(0.1f));
}

// ---- golden: one processor for all calls

// Deliberate: built once and never again. Neither another type nor a setter after the first `Process` takes
// effect.
TEST(IIIDataTransfer, BuiltOnceAndNeverAgainSettersAfterTheFirstProcessTakeNoEffect) {
  Image<int> in({9, 9});
  in.Set([](int x, int y, std::uint32_t) { return 10 * y + x; });
  Image<int> out({2, 1});
  IIIDataTransfer transfer = Between({1, 1, 3, 3}, {0, 0, 3, 3});
  transfer.Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<int>{11, 12}));
  std::vector<unsigned int> source = {5, 5, 8, 8}, target = {0, 0, 4, 4};
  transfer.SetInRegion(source);
  transfer.SetOutRegion(target);
  transfer.SetResampleType(static_cast<ResampleType>(1));
  std::fill_n(out.Elements(), 2, 77);
  transfer.Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<int>{11, 12}));
  Image<float> other({2, 1}, {}, 77);
  transfer.Process(&in, nullptr, &other);
  EXPECT_EQ(std::bit_cast<int>(other.At(0, 0)), 11);
  EXPECT_EQ(std::bit_cast<int>(other.At(1, 0)), 12);
}

TEST(IIIDataTransfer, BuiltOnceAndNeverAgainLaterRastersAreReadAndWrittenAsTheFirstTypes) {
  const IIIDataTransfer transfer = Straight();
  Image<unsigned char> in({2, 1}, {}, 5), out({2, 1});
  transfer.Process(&in, nullptr, &out);
  Image<short> later({2, 1, 2});  // pixels of 4 bytes, of which the first 2 are read
  later.SetPixel(0, 0, {0x0201, 0x0403});
  later.SetPixel(1, 0, {0x0605, 0x0807});
  Image<int> target({2, 1}, {}, 0x5A5A5A5A);
  transfer.Process(&later, nullptr, &target);
  EXPECT_EQ(ElementsOf(target), (std::vector<int>{0x5A5A0201, 0x5A5A0605}));
}

TEST(IIIDataTransfer, BuiltOnceAndNeverAgainALaterComplexInputHasTwiceTheElements) {
  const IIIDataTransfer transfer = Straight();
  Image<short> in({2, 1}, {}, 5), out({2, 1});
  transfer.Process(&in, nullptr, &out);
  Image<short> complex({2, 1}, {}, 0, true);
  complex.SetPixel(0, 0, {1, 2});
  complex.SetPixel(1, 0, {3, 4});
  Image<short> target({2, 1, 3}, {}, 77);
  transfer.Process(&complex, nullptr, &target);
  EXPECT_EQ(ElementsOf(target), (std::vector<short>{1, 2, 77, 3, 4, 77}));
}

TEST(IIIDataTransfer, WiderElementsOfTheFirstOutputOverlapInALaterOneTheNextPixelAndTheNextRowPrevail) {
  const IIIDataTransfer transfer = Between({0, 0, 1, 1}, {0, 0, 100000, 100000});
  Image<unsigned char> in({1, 1}, {}, 5);
  Image<int> first({1, 1});
  transfer.Process(&in, nullptr, &first);
  for (const unsigned int width : {5u, 5000u}) {
    Image<unsigned char> later({width, 3}, {0, 1}, 77);
    transfer.Process(&in, nullptr, &later);
    std::vector<unsigned char> expected(5 * width, 77);
    std::fill_n(expected.begin() + width, 3 * width, static_cast<unsigned char>(5));
    std::fill_n(expected.begin() + 4 * width, 3, static_cast<unsigned char>(0));
    EXPECT_TRUE(ElementsOf(later) == expected) << width;
  }
}

TEST(IIIDataTransfer, MoreElementsThanALaterOutputsPixelHoldsOverlapTheNextPixelAndTheNextRowPrevail) {
  const IIIDataTransfer transfer = Straight();
  Image<short> in({1, 1}, {}, 5), first({1, 1});
  transfer.Process(&in, nullptr, &first);
  for (const unsigned int width : {2u, 5000u}) {
    Image<short> complex({width, 1}, {}, 0, true);
    complex.Set([](int x, int, std::uint32_t c) { return c == 0 ? x : -x; });
    Image<short> later({width, 3}, {0, 1}, 77);
    transfer.Process(&complex, nullptr, &later);
    std::vector<short> expected(width, 77);
    for (unsigned int i = 0; i < 3 * width; ++i) expected.push_back(static_cast<short>(i % width));
    expected.push_back(static_cast<short>(1 - static_cast<int>(width)));
    expected.resize(5 * width, 77);
    EXPECT_TRUE(ElementsOf(later) == expected) << width;
  }
}

TEST(IIIDataTransfer, LaterRastersHaveSizesChannelsAndOriginsOfTheirOwn) {
  const IIIDataTransfer transfer = Straight();
  Image<short> small({1, 1}, {}, 5), first({1, 1});
  transfer.Process(&small, nullptr, &first);
  Image<short> in({4, 2, 2}, {1, 0, 10, 20});
  in.Set([](int x, int y, std::uint32_t c) { return 100 * y + 10 * x + static_cast<int>(c); });
  Image<short> out({2, 2, 2}, {0, 0, 12, 20}, 77);
  transfer.Process(&in, nullptr, &out);
  EXPECT_EQ(ElementsOf(out), (std::vector<short>{20, 21, 30, 31, 120, 121, 130, 131}));
}

// ---- differential

/// One transfer. All that is random in its samples follows from the seed.
struct Transfer {
  DataType in, out;
  Size inSize, outSize;
  tessel::RasterContext inContext, outContext;
  std::vector<unsigned int> source, target;
  tests::Fill fill = tests::Fill::eBITS;
  bool isLarge = false;  ///< the output is taken for one that is larger than the caches
  std::uint64_t seed = 0;
};

void Print(std::ostream& stream, const DataType& type, const Size& size, const tessel::RasterContext& context,
           const std::vector<unsigned int>& region) {
  stream << (type.isComplex ? "complex " : "") << tests::NameOf(type) << " of " << size.width << " x "
         << size.height << " x " << size.channels << ", margins " << context.marginX << ", "
         << context.marginY << ", origin " << context.originX << ", " << context.originY << ", region "
         << ::testing::PrintToString(region);
}

std::ostream& operator<<(std::ostream& stream, const Transfer& t) {
  Print(stream, t.in, t.inSize, t.inContext, t.source);
  stream << " -> ";
  Print(stream, t.out, t.outSize, t.outContext, t.target);
  return stream << ", samples: " << NameOf(t.fill) << (t.isLarge ? ", large" : "") << ", seed " << t.seed;
}

/// Extents of both regions.
struct Extents {
  unsigned int in, out;
};

/// One axis of a transfer, and how long the rasters are.
struct DrawnAxis {
  Axis axis;
  unsigned int inLength = 1;
  unsigned int outLength = 1;
};

Extents DrawExtents(tests::Random& random) {
  constexpr unsigned int kMost = 4294967295u;
  constexpr Extents kUsual[] = {{1, 1},         {100, 100},
                                {1, 2},         {50, 100},
                                {1, 3},         {20, 60},
                                {2, 1},         {100, 50},
                                {150, 100},     {3, 2},
                                {100, 137},     {137, 100},
                                {7, 5},         {10, 16},
                                {255, 256},     {17, 6},
                                {13, 6},        {37, 6},
                                {6, 17},        {5, 8},
                                {64, 256},      {1u << 31, kMost},
                                {kMost, kMost}, {2000000, 4000001}};
  constexpr Extents kOdd[] = {{1000, 13}, {3, 300}, {1, 100}, {1, kMost}, {kMost, 1},
                              {0, 100},   {100, 0}, {0, 0},   {3, 8}};
  if (random.OneIn(12)) return {1 + random.Below(50), 1 + random.Below(50)};
  return random.OneIn(5) ? random.Pick(kOdd) : random.Pick(kUsual);
}

/// How far a region starts behind the origin of its raster; before it if negative.
unsigned int DrawShift(tests::Random& random, unsigned int length) {
  const unsigned int distance = random.Below(random.OneIn(2) ? 4 : length + 2);
  switch (random.Below(10)) {
    case 0:
      return distance;
    case 1:
    case 2:
      return 0u - distance;
    case 3:
      return random.OneIn(6) ? static_cast<unsigned int>(random.Bits()) : 0u;
    default:
      return 0;
  }
}

DrawnAxis DrawAxis(tests::Random& random, unsigned int outLength) {
  constexpr unsigned int kOrigins[] = {0, 0, 0, 1, 5, 100, 65536, 2147483640u, 4294967290u};
  constexpr unsigned int kLengths[] = {1, 2, 3, 5, 8, 16, 33, 100, 257};
  const Extents extents = DrawExtents(random);
  DrawnAxis drawn;
  drawn.outLength = outLength;
  const double wanted = extents.out == 0 ? 1 : outLength * (double{1} * extents.in / extents.out);
  const bool isWhole = wanted < 3000 && !random.OneIn(4);  // all of the output lies in the input
  drawn.inLength = isWhole ? static_cast<unsigned int>(wanted) + 1 + random.Below(3) : random.Pick(kLengths);
  drawn.axis.inOrigin = random.Pick(kOrigins);
  drawn.axis.outOrigin = random.Pick(kOrigins);
  drawn.axis.inStart = drawn.axis.inOrigin + DrawShift(random, drawn.inLength);
  drawn.axis.outStart = drawn.axis.outOrigin + DrawShift(random, outLength);
  drawn.axis.inExtent = extents.in;
  drawn.axis.outExtent = extents.out;
  return drawn;
}

/// Channels of the output, enough for the input's elements.
std::uint32_t DrawOutChannels(tests::Random& random, const Transfer& t) {
  const bool isSplit = t.in.isComplex && !t.out.isComplex;
  return (isSplit ? 2 : 1) * t.inSize.channels + (random.OneIn(4) ? 1 + random.Below(2) : 0);
}

Transfer DrawTransfer(tests::Random& random, const DataType& in, const DataType& out, unsigned int width) {
  constexpr unsigned int kHeights[] = {1, 1, 2, 3, 4, 5, 9, 0};
  constexpr std::uint32_t kChannels[] = {1, 1, 1, 2, 2, 3, 3, 3, 4, 4, 5, 6, 7, 16, 0};
  const DrawnAxis x = DrawAxis(random, width), y = DrawAxis(random, random.Pick(kHeights));
  Transfer t;
  t.in = in;
  t.out = out;
  t.in.isComplex = random.OneIn(5);
  t.out.isComplex = random.OneIn(t.in.isComplex ? 2 : 6);
  const bool hasManyChannels = width < 40 && random.OneIn(25);
  t.inSize = {x.inLength, std::min(y.inLength, hasManyChannels ? 2u : 40u),
              hasManyChannels ? 290 + random.Below(20) : random.Pick(kChannels)};
  t.outSize = {x.outLength, y.outLength, DrawOutChannels(random, t)};
  t.inContext = {random.Below(4), random.Below(3), x.axis.inOrigin, y.axis.inOrigin};
  t.outContext = {random.Below(4), random.Below(3), x.axis.outOrigin, y.axis.outOrigin};
  t.source = {x.axis.inStart, y.axis.inStart, x.axis.inExtent, y.axis.inExtent};
  t.target = {x.axis.outStart, y.axis.outStart, x.axis.outExtent, y.axis.outExtent};
  t.fill = random.Pick(tests::kFills);
  t.isLarge = random.OneIn(4);
  t.seed = random.Bits();
  return t;
}

/// Makes the operator take the output for one that is larger than the caches.
constexpr std::uint64_t kLarge = std::uint64_t{1} << 30;

/// Compares the operator with its twin: the same bits in the whole output, the input as it was.
///
/// @param readAs, writtenAs  the types of an earlier call
::testing::AssertionResult Agrees(const Transfer& t, const DataType& readAs, const DataType& writtenAs) {
  tests::Random random(t.seed);
  Raster in({t.inSize.width, t.inSize.height, t.inSize.channels, t.in}, t.inContext);
  FillRandom(in, t.fill, random);
  Raster expected({t.outSize.width, t.outSize.height, t.outSize.channels, t.out}, t.outContext);
  FillRandom(expected, tests::Fill::eSMOOTH, random);  // each element holds a number of its own
  Raster actual(expected, expected);
  std::copy_n(expected.data, expected.dataSize, actual.data);
  const std::vector<unsigned char> before = Bytes(in);
  const IIIDataTransfer transfer = Between(t.source, t.target);
  if (readAs != t.in || writtenAs != t.out) {
    Raster firstIn({1, 1, 1, readAs}, {}), firstOut({0, 0, 1, writtenAs}, {});
    transfer.Process(&firstIn, nullptr, &firstOut);
  }
  reference::IIIDataTransfer(transfer, readAs, writtenAs, in, expected);
  const std::uint64_t size = actual.dataSize;
  if (t.isLarge) actual.dataSize = kLarge;
  transfer.Process(&in, nullptr, &actual);
  actual.dataSize = size;
  const ::testing::AssertionResult sameOutput = SameBits(expected, actual);
  if (!sameOutput) return ::testing::AssertionFailure() << t << ": output " << sameOutput.message();
  if (Bytes(in) != before) return ::testing::AssertionFailure() << t << ": the input was modified";
  return ::testing::AssertionSuccess();
}

constexpr unsigned int kWidths[] = {0,  1,  2,  3,  7,  8,   9,   15,  16,  17,  31,
                                    32, 33, 63, 64, 65, 127, 128, 129, 255, 257, 601};

struct IIIDataTransferDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(IIIDataTransferDifferential, AgreesWithTheTwinBitForBit) {
  tests::Random random(20240601 + static_cast<std::uint64_t>(GetParam().element));
  for (const PixelType& out : tests::kPixelTypes) {
    for (const unsigned int width : kWidths) {
      for (int i = 0; i < 3; ++i) {
        const Transfer t = DrawTransfer(random, GetParam().element, out.element, width);
        ASSERT_TRUE(Agrees(t, t.in, t.out));
      }
    }
    Transfer wide = DrawTransfer(random, GetParam().element, out.element, 2040 + random.Below(200));
    ASSERT_TRUE(Agrees(wide, wide.in, wide.out));
  }
}

TEST_P(IIIDataTransferDifferential, AgreesWithTheTwinBitForBitWhereEarlierRastersHadOtherTypes) {
  tests::Random random(20240602 + static_cast<std::uint64_t>(GetParam().element));
  for (const PixelType& out : tests::kPixelTypes) {
    for (int i = 0; i < 12; ++i) {
      const unsigned int width = i == 0 ? 1030 + random.Below(1200) : random.Pick(kWidths);
      Transfer t = DrawTransfer(random, GetParam().element, out.element, width);
      // room for elements wider than the rasters' own, which reach into the next row where there is none
      t.inContext.marginX = t.outContext.marginX = width > 600 ? random.Below(2) : 8;
      t.inContext.marginY = t.outContext.marginY = 4;
      const DataType readAs(random.Pick(tests::kPixelTypes).element, random.OneIn(4));
      const DataType writtenAs(random.Pick(tests::kPixelTypes).element, random.OneIn(4));
      ASSERT_TRUE(Agrees(t, readAs, writtenAs))
          << "first types " << tests::NameOf(readAs) << ", " << tests::NameOf(writtenAs);
    }
  }
}

INSTANTIATE_TEST_SUITE_P(From, IIIDataTransferDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

TEST(IIIDataTransferOfManySamples, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  const IIIDataTransfer transfer = Between({31, 42, 150, 1}, {197, 290, 737, 5});
  Raster in({700, 680, 3, tessel::eDT_8U}, {1, 0, 30, 40});
  FillRandom(in, tests::Fill::eBITS, random);
  Raster expected({3400, 3400, 3, tessel::eDT_8U}, {3, 1, 200, 300}), actual(expected, expected);
  FillBytes(expected);
  FillBytes(actual);
  reference::IIIDataTransfer(transfer, in, expected);
  transfer.Process(&in, nullptr, &actual);
  EXPECT_TRUE(Bytes(expected) == Bytes(actual));
}

static_assert(std::is_base_of_v<details::IIIParams, IIIDataTransfer>);
static_assert(!std::is_polymorphic_v<IIIDataTransfer>);
static_assert(sizeof(ResampleType) == 4);

}  // namespace
}  // namespace orvik::gridmill
