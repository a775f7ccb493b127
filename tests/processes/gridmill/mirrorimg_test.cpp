#include "processes/gridmill/mirrorimg.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>
#include <malloc.h>

#include "basic/exceptions/exceptions.h"
#include "tests/reference/mirrorimg_reference.h"
#include "tests/support/cases.h"
#include "tests/support/compare.h"
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
using tests::SameBits;
using tests::Throws;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// What the output's samples hold that the operator does not write.
constexpr short kUnwritten = 77;

/// A window of an image, for the mask and for the operator.
struct Rectangle {
  std::uint32_t x, y, width, height;
};

MirrorImg Mirror(const std::string& axis, bool isNewFile = false) {
  MirrorImg mirror;
  mirror.SetAxis(axis);
  mirror.IsNewFile(isNewFile);
  return mirror;
}

MirrorImg MirrorWindow(const std::string& axis, const Rectangle& window, bool isNewFile) {
  MirrorImg mirror = Mirror(axis, isNewFile);
  mirror.SetWindow({window.x, window.y, window.width, window.height});
  return mirror;
}

Mask MaskOf(const Raster& raster, const Rectangle& window) {
  Mask mask(raster.width, raster.height, raster, false);
  for (std::uint32_t y = window.y; y < window.y + window.height; ++y) {
    for (std::uint32_t x = window.x; x < window.x + window.width; ++x)
      mask.SetValid(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y), true);
  }
  return mask;
}

/// An image whose sample at (x, y) is 10 y + x, in the margin too.
struct Numbered : Image<short> {
  explicit Numbered(const tests::Size& size, const tessel::RasterContext& margins = {})
      : Image(size, margins) {
    Set([](int x, int y, std::uint32_t) { return 10 * y + x; });
  }
};

/// All elements of the image area, row by row.
std::vector<short> AreaOf(Image<short>& image) {
  std::vector<short> samples;
  for (int y = 0; y < static_cast<int>(image.height); ++y)
    samples.insert(samples.end(), &image.At(0, y), &image.At(0, y) + image.width * image.channels);
  return samples;
}

/// The area of an output of `outSize`.
std::vector<short> Mirrored(const MirrorImg& mirror, Raster& in, Mask* mask, const tests::Size& outSize) {
  Image<short> out(outSize, {}, kUnwritten);
  mirror.Process(&in, mask, &out);
  return AreaOf(out);
}

/// One sample on its way through the mirror.
template <class Out, class In>
Out Transferred(In sample) {
  Image<In> in({1, 1}, {}, sample);
  Image<Out> out({1, 1}, {}, static_cast<Out>(kUnwritten));
  Mirror("VERT").Process(&in, nullptr, &out);
  return out.At(0, 0);
}

template <class T>
T Same(T sample) {
  return Transferred<T, T>(sample);
}

// ---- golden

TEST(MirrorImg, VertReversesEachRow) {
  Numbered in({3, 2}, {1, 1});
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, nullptr, {3, 2}), (std::vector<short>{2, 1, 0, 12, 11, 10}));
}

TEST(MirrorImg, HoriReversesEachColumn) {
  Numbered in({2, 3}, {1, 1});
  EXPECT_EQ(Mirrored(Mirror("HORI"), in, nullptr, {2, 3}), (std::vector<short>{20, 21, 10, 11, 0, 1}));
}

TEST(MirrorImg, IsNewFileMakesNoDifferenceWithoutAMask) {
  Numbered in({3, 2}, {1, 1});
  for (const char* const axis : {"VERT", "HORI"}) {
    EXPECT_EQ(Mirrored(Mirror(axis, true), in, nullptr, {3, 2}),
              Mirrored(Mirror(axis, false), in, nullptr, {3, 2}))
        << axis;
  }
}

TEST(MirrorImg, MaskOfAllPixelsIsNoMask) {
  Numbered in({3, 2}, {1, 1});
  Mask mask(3, 2, {1, 1}, true);
  for (const char* const axis : {"VERT", "HORI"}) {
    for (const bool isNewFile : {false, true}) {
      EXPECT_EQ(Mirrored(Mirror(axis, isNewFile), in, &mask, {3, 2}),
                Mirrored(Mirror(axis, isNewFile), in, nullptr, {3, 2}))
          << axis << isNewFile;
    }
  }
}

TEST(MirrorImg, AxisIsAWordInAnyMixOfCases) {
  Numbered in({2, 2});
  for (const char* const axis : {"VERT", "vert", "Vert", "vErT", "VERt"})
    EXPECT_EQ(Mirrored(Mirror(axis), in, nullptr, {2, 2}), (std::vector<short>{1, 0, 11, 10})) << axis;
  for (const char* const axis : {"HORI", "hori", "Hori", "hOrI", "HORi"})
    EXPECT_EQ(Mirrored(Mirror(axis), in, nullptr, {2, 2}), (std::vector<short>{10, 11, 0, 1})) << axis;
}

TEST(MirrorImg, AnyOtherAxisWritesNothing) {
  Numbered in({3, 2}, {1, 1});
  Image<short> out({3, 2}, {1, 1});
  FillBytes(out);
  for (const char* const axis :
       {"", "V", "VER", "VERTICAL", "VERT ", " VERT", "VERTHORI", "HOR", "HORIZONTAL", "hori\n", "VORI",
        "TREV", "{ert", "HOR|", "hor~", "\xD6\xC5\xD2\xD4", "a long text that is no axis"}) {
    for (const bool isNewFile : {false, true}) {
      Mirror(axis, isNewFile).Process(&in, nullptr, &out);
      EXPECT_TRUE(IsUntouched(out)) << axis;
    }
  }
  MirrorImg unset;
  unset.IsNewFile(false);
  unset.Process(&in, nullptr, &out);
  EXPECT_TRUE(IsUntouched(out));
}

TEST(MirrorImg, WindowIsMirroredInPlaceAndTheOtherPixelsAreCopied) {
  Numbered in({5, 3}, {1, 1});
  const Rectangle window = {1, 1, 3, 2};
  Mask mask = MaskOf(in, window);
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", window, false), in, &mask, {5, 3}),
            (std::vector<short>{0, 1, 2, 3, 4, 10, 13, 12, 11, 14, 20, 23, 22, 21, 24}));
  EXPECT_EQ(Mirrored(MirrorWindow("HORI", window, false), in, &mask, {5, 3}),
            (std::vector<short>{0, 1, 2, 3, 4, 10, 21, 22, 23, 14, 20, 11, 12, 13, 24}));
}

// Deliberate: `IsNewFile` moves pixels along the flip only. The other coordinate keeps the window's offset.
TEST(MirrorImg, IsNewFileMovesPixelsAlongTheFlipOnlyTheOtherCoordinateKeepsTheWindowsOffset) {
  Numbered in({5, 3}, {1, 1});
  const Rectangle window = {2, 1, 3, 2};
  Mask mask = MaskOf(in, window);
  constexpr short o = kUnwritten;
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", window, true), in, &mask, {3, 3}),
            (std::vector<short>{o, o, o, 14, 13, 12, 24, 23, 22}));
  EXPECT_EQ(Mirrored(MirrorWindow("HORI", window, true), in, &mask, {5, 2}),
            (std::vector<short>{o, o, 22, 23, 24, o, o, 12, 13, 14}));
}

TEST(MirrorImg, NewFileKeepsWhatItHeldWhereNothingIsMirrored) {
  Numbered in({4, 2}, {1, 1});
  Mask none(4, 2, {1, 1}, false);
  Image<short> out({4, 2}, {1, 1});
  FillBytes(out);
  for (const char* const axis : {"VERT", "HORI"}) {
    Mirror(axis, true).Process(&in, &none, &out);
    EXPECT_TRUE(IsUntouched(out)) << axis;
  }
}

TEST(MirrorImg, MaskOfNoPixelsGivesACopy) {
  Numbered in({4, 2}, {1, 1});
  Mask none(4, 2, {1, 1}, false);
  for (const char* const axis : {"VERT", "HORI"})
    EXPECT_EQ(Mirrored(Mirror(axis), in, &none, {4, 2}), AreaOf(in)) << axis;
}

TEST(MirrorImg, FirstTwoEntriesOfTheWindowAreNotRead) {
  Numbered in({5, 3}, {1, 1});
  const Rectangle window = {1, 1, 3, 2}, moved = {4000000000u, 77, 3, 2};
  Mask mask = MaskOf(in, window);
  for (const char* const axis : {"VERT", "HORI"}) {
    EXPECT_EQ(Mirrored(MirrorWindow(axis, window, false), in, &mask, {5, 3}),
              Mirrored(MirrorWindow(axis, moved, false), in, &mask, {5, 3}))
        << axis;
  }
}

TEST(MirrorImg, WindowOfMoreThanFourEntriesIsTakenByTheThirdAndTheFourth) {
  Numbered in({5, 3}, {1, 1});
  const Rectangle window = {1, 1, 3, 2};
  Mask mask = MaskOf(in, window);
  MirrorImg mirror = Mirror("VERT");
  mirror.SetWindow({9, 9, 3, 2, 1, 1, 1});
  EXPECT_EQ(Mirrored(mirror, in, &mask, {5, 3}),
            Mirrored(MirrorWindow("VERT", window, false), in, &mask, {5, 3}));
}

TEST(MirrorImg, MaskWithoutAWindowIsMirroredAboutTheWholeRaster) {
  Numbered in({4, 1}, {1, 1});
  Mask mask(4, 1, {1, 1}, false);
  mask.SetValid(0, 0, true);
  mask.SetValid(1, 0, true);
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, &mask, {4, 1}), (std::vector<short>{3, 2, 2, 3}));
}

TEST(MirrorImg, RowOrColumnWithoutAMarkedPixelIsNoStartForTheNext) {
  Numbered in({3, 3}, {1, 1});
  Mask rows(3, 3, {1, 1}), columns(3, 3, {1, 1});
  for (int i = 0; i < 3; ++i) {
    rows.SetValid(i, 1, false);
    columns.SetValid(1, i, false);
  }
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, &rows, {3, 3}),
            (std::vector<short>{2, 1, 0, 10, 11, 12, 22, 21, 20}));
  EXPECT_EQ(Mirrored(Mirror("HORI"), in, &columns, {3, 3}),
            (std::vector<short>{20, 1, 22, 10, 11, 12, 0, 21, 2}));
}

TEST(MirrorImg, EachRowAndColumnStartsAtItsOwnFirstMarkedPixel) {
  Numbered in({3, 3}, {2, 2});
  Mask mask(3, 3, {2, 2});
  mask.SetValid(0, 1, false);
  mask.SetValid(0, 2, false);
  mask.SetValid(1, 2, false);
  MirrorImg vert = MirrorWindow("VERT", {0, 0, 1, 1}, true), hori = MirrorWindow("HORI", {0, 0, 1, 1}, true);
  EXPECT_EQ(Mirrored(vert, in, &mask, {3, 3}),
            (std::vector<short>{0, -1, -2, 11, 10, kUnwritten, 22, kUnwritten, kUnwritten}));
  EXPECT_EQ(Mirrored(hori, in, &mask, {3, 3})[0], 0);
  EXPECT_EQ(Mirrored(hori, in, &mask, {3, 3})[1], 1);
  EXPECT_EQ(Mirrored(hori, in, &mask, {3, 3})[2], 2);
}

// Deliberate: marked pixels with a gap between them are counted as if they had none.
TEST(MirrorImg, MarkedPixelsWithAGapBetweenThemAreCountedAsIfTheyHadNone) {
  Numbered row({5, 1}, {1, 1});
  Mask mask(5, 1, {1, 1});
  mask.SetValid(1, 0, false);
  EXPECT_EQ(Mirrored(Mirror("VERT"), row, &mask, {5, 1}), (std::vector<short>{4, 3, 2, 1, kUnwritten}));
  EXPECT_EQ(Mirrored(Mirror("VERT", true), row, &mask, {5, 1}), (std::vector<short>{4, 3, 2, 1, kUnwritten}));
  Numbered column({1, 5}, {1, 1});
  Mask upright(1, 5, {1, 1});
  upright.SetValid(0, 1, false);
  EXPECT_EQ(Mirrored(Mirror("HORI"), column, &upright, {1, 5}),
            (std::vector<short>{40, 30, 20, 10, kUnwritten}));
  EXPECT_EQ(Mirrored(Mirror("HORI", true), column, &upright, {1, 5}),
            (std::vector<short>{40, 30, 20, 10, kUnwritten}));
}

TEST(MirrorImg, CopyOfAnUnmarkedPixelIsOverwrittenByALaterOne) {
  Numbered in({5, 1}, {1, 1});
  Mask mask(5, 1, {1, 1});
  mask.SetValid(1, 0, false);
  mask.SetValid(2, 0, false);
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, &mask, {5, 1}),
            (std::vector<short>{4, 3, 2, kUnwritten, kUnwritten}));
}

TEST(MirrorImg, SourceThatLeavesTheImageIsReadByLinearAddress) {
  Numbered in({4, 3}, {0, 1});
  // Without a mask sources run from the window's end to below 0: there stands the end of the row above.
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", {0, 0, 2, 1}, false), in, nullptr, {4, 3}),
            (std::vector<short>{1, 0, -7, -8, 11, 10, 3, 2, 21, 20, 13, 12}));
  // A window beyond the image's end: there stands the start of the row below.
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", {0, 0, 6, 1}, false), in, nullptr, {4, 3}),
            (std::vector<short>{11, 10, 3, 2, 21, 20, 13, 12, 31, 30, 23, 22}));
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", {0, 0, 0, 1}, false), in, nullptr, {4, 3})[4], 3);
  EXPECT_EQ(Mirrored(MirrorWindow("HORI", {0, 0, 1, 2}, false), in, nullptr, {4, 3}),
            (std::vector<short>{10, 11, 12, 13, 0, 1, 2, 3, -10, -9, -8, -7}));
  EXPECT_EQ(Mirrored(MirrorWindow("HORI", {0, 0, 1, 4}, false), in, nullptr, {4, 3}),
            (std::vector<short>{30, 31, 32, 33, 20, 21, 22, 23, 10, 11, 12, 13}));
}

TEST(MirrorImg, SourceThatLeavesTheImageReadsItsMargin) {
  Numbered in({2, 2}, {2, 2});
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", {0, 0, 1, 1}, false), in, nullptr, {2, 2}),
            (std::vector<short>{0, -1, 10, 9}));
  EXPECT_EQ(Mirrored(MirrorWindow("VERT", {0, 0, 4, 1}, false), in, nullptr, {2, 2}),
            (std::vector<short>{3, 2, 13, 12}));
  EXPECT_EQ(Mirrored(MirrorWindow("HORI", {0, 0, 1, 1}, false), in, nullptr, {2, 2}),
            (std::vector<short>{0, 1, -10, -9}));
  Mask mask(2, 2, {2, 2}, false);
  mask.SetValid(1, 1, true);
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, &mask, {2, 2}), (std::vector<short>{0, 1, 10, 12}));
  EXPECT_EQ(Mirrored(Mirror("HORI"), in, &mask, {2, 2}), (std::vector<short>{0, 1, 10, 21}));
}

TEST(MirrorImg, PixelsMoveWithAllTheirChannels) {
  Image<short> in({3, 2, 2}, {1, 0});
  in.Set([](int x, int y, std::uint32_t c) { return 100 * static_cast<int>(c) + 10 * y + x; });
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, nullptr, {3, 2, 2}),
            (std::vector<short>{2, 102, 1, 101, 0, 100, 12, 112, 11, 111, 10, 110}));
  EXPECT_EQ(Mirrored(Mirror("HORI"), in, nullptr, {3, 2, 2}),
            (std::vector<short>{10, 110, 11, 111, 12, 112, 0, 100, 1, 101, 2, 102}));
}

TEST(MirrorImg, VertStepsOutputRowsByTheChannelsOfTheInputAndHoriByTheOutputs) {
  Numbered in({3, 2}, {1, 0});
  constexpr short o = kUnwritten;
  EXPECT_EQ(Mirrored(Mirror("VERT"), in, nullptr, {3, 2, 2}),
            (std::vector<short>{2, 1, 0, o, o, o, 12, 11, 10, o, o, o}));
  EXPECT_EQ(Mirrored(Mirror("HORI"), in, nullptr, {3, 2, 2}),
            (std::vector<short>{10, o, 11, o, 12, o, 0, o, 1, o, 2, o}));
  Mask mask(3, 2, {1, 0});
  EXPECT_EQ(Mirrored(Mirror("VERT", true), in, &mask, {3, 2, 2}),
            (std::vector<short>{2, 1, 0, o, o, o, 12, 11, 10, o, o, o}));
  EXPECT_EQ(Mirrored(Mirror("HORI", true), in, &mask, {3, 2, 2}),
            (std::vector<short>{10, o, 11, o, 12, o, 0, o, 1, o, 2, o}));
}

TEST(MirrorImg, MaskBitsArePickedByTheMasksOwnGeometry) {
  Numbered in({3, 2}, {1, 1});
  Mask mask(3, 2, {4, 2});
  mask.SetValid(0, 1, false);
  MirrorImg mirror = MirrorWindow("VERT", {0, 0, 2, 2}, false);
  EXPECT_EQ(Mirrored(mirror, in, &mask, {3, 2}), (std::vector<short>{1, 0, -1, 10, 12, 11}));
}

TEST(MirrorImg, MarginIsNotWritten) {
  Numbered in({3, 2}, {1, 1});
  Mask mask(3, 2, {1, 1});
  for (const char* const axis : {"VERT", "HORI"}) {
    for (Mask* const given : {static_cast<Mask*>(nullptr), &mask}) {
      Image<short> out({3, 2}, {2, 1}, kUnwritten);
      Mirror(axis).Process(&in, given, &out);
      for (int y = -1; y < 3; ++y) {
        for (int x = -2; x < 5; ++x) {
          const bool isInside = x >= 0 && x < 3 && y >= 0 && y < 2;
          EXPECT_EQ(out.At(x, y) != kUnwritten, isInside) << axis << x << ", " << y;
        }
      }
    }
  }
}

TEST(MirrorImg, SizeOfZeroWritesNothing) {
  for (const tests::Size size : {tests::Size{4, 0, 2}, tests::Size{0, 4, 2}, tests::Size{4, 4, 0}}) {
    Image<short> in(size, {1, 1}, 5);
    Image<short> out({size.width, size.height, 2}, {1, 1});
    FillBytes(out);
    Mask mask(size.width, size.height, {1, 1}), none(size.width, size.height, {1, 1}, false);
    for (const char* const axis : {"VERT", "HORI"}) {
      for (Mask* const given : {static_cast<Mask*>(nullptr), &mask, &none}) {
        Mirror(axis, false).Process(&in, given, &out);
        Mirror(axis, true).Process(&in, given, &out);
      }
    }
    EXPECT_TRUE(IsUntouched(out));
  }
}

// ---- the way through float

TEST(MirrorImg, FloatSamplesAreTheSamplesThemselves) {
  for (const float sample : {0.1f, -2.5f, 1e-45f, 3.4e38f, kInfinity, -kInfinity, 16777215.0f})
    EXPECT_EQ(Same(sample), sample);
  EXPECT_TRUE(std::signbit(Same(-0.0f)));
  EXPECT_TRUE(std::isnan(Same(kNaN)));
}

/// Mirrors every value of an integer type of 16 bits and less.
template <class T>
void ExpectUnchanged() {
  constexpr int kLeast = std::numeric_limits<T>::min(), kMost = std::numeric_limits<T>::max();
  Image<T> in({kMost - kLeast + 1, 1});
  Image<T> out({kMost - kLeast + 1, 1});
  in.Set([](int x, int, std::uint32_t) { return kLeast + x; });
  Mirror("VERT").Process(&in, nullptr, &out);
  for (int x = 0; x <= kMost - kLeast; ++x) ASSERT_EQ(out.At(x, 0), kMost - x);
}

TEST(MirrorImg, NarrowIntegersAreUnchanged) {
  ExpectUnchanged<char>();
  ExpectUnchanged<unsigned char>();
  ExpectUnchanged<short>();
  ExpectUnchanged<unsigned short>();
}

// Deliberate: every sample goes through `float` and `ClipTo`, between equal types too. `double`, 32-bit and
// 64-bit samples lose precision, and a negative 64-bit signed sample becomes 0.
TEST(MirrorImg, EverySampleGoesThroughFloatAndClipToBetweenEqualTypesToo) {
  EXPECT_EQ(Same(0.1), static_cast<double>(0.1f));
  EXPECT_EQ(Same(16777217.0), 16777216.0);
  EXPECT_EQ(Same(1e300), std::numeric_limits<double>::infinity());
  EXPECT_EQ(Same(16777217), 16777216);
  EXPECT_EQ(Same(16777217u), 16777216u);
  EXPECT_EQ(Same(8388609), 8388610);  // the 0.5 is added in `float` and rounds up
  EXPECT_EQ(Same(-8388609), -8388610);
  EXPECT_EQ(Same(8388609u), 8388610u);
  EXPECT_EQ(Same(8388607), 8388607);
  EXPECT_EQ(Same(4194303), 4194303);
  EXPECT_EQ(Same(2147483647), 2147483647);
  EXPECT_EQ(Same(-2147483647 - 1), -2147483647 - 1);
  EXPECT_EQ(Same(4294967295u), 4294967295u);
  EXPECT_EQ(Same(std::int64_t{16777217}), 16777216);
  EXPECT_EQ(Same(std::int64_t{8388609}), 8388609);
  EXPECT_EQ(Same(std::int64_t{-5}), 0);
  EXPECT_EQ(Same(std::numeric_limits<std::int64_t>::min()), 0);
  EXPECT_EQ(Same(std::numeric_limits<std::int64_t>::max()), std::numeric_limits<std::int64_t>::max());
  EXPECT_EQ(Same(std::uint64_t{16777217}), 16777216u);
  EXPECT_EQ(Same(~std::uint64_t{0}), ~std::uint64_t{0});
}

TEST(MirrorImg, SamplesOfOtherTypesAreRoundedAndSaturatedInFloat) {
  EXPECT_EQ((Transferred<unsigned char, float>(2.5f)), 3);
  EXPECT_EQ((Transferred<unsigned char, short>(300)), 255);
  EXPECT_EQ((Transferred<unsigned char, short>(-300)), 0);
  EXPECT_EQ((Transferred<char, float>(-2.5f)), -3);
  EXPECT_EQ((Transferred<int, double>(8388609.0)), 8388610);
  EXPECT_EQ((Transferred<int, float>(kNaN)), -2147483647 - 1);
  EXPECT_EQ((Transferred<unsigned char, float>(kNaN)), 0);
  EXPECT_EQ((Transferred<std::int64_t, double>(5.9)), 5);
  EXPECT_EQ((Transferred<unsigned char, std::int64_t>(-1)), 0);
  EXPECT_EQ((Transferred<double, int>(16777217)), 16777216.0);
  EXPECT_EQ((Transferred<float, double>(1e300)), kInfinity);
  EXPECT_TRUE(std::signbit(Transferred<double, float>(-0.0f)));
}

TEST(MirrorImg, CopiedPixelsGoThroughFloatToo) {
  Image<double> in({2, 1}, {}, 0.1);
  Mask none(2, 1, {}, false);
  for (const char* const axis : {"VERT", "HORI"}) {
    Image<double> out({2, 1});
    Mirror(axis).Process(&in, &none, &out);
    EXPECT_EQ(out.At(0, 0), static_cast<double>(0.1f)) << axis;
    EXPECT_EQ(out.At(1, 0), static_cast<double>(0.1f)) << axis;
  }
}

// ---- failures

TEST(MirrorImgFailure, TypesOutsideTheListAndComplexOnesAreInvalid) {
  Image<short> in({3, 2}, {1, 1}, 1);
  Image<short> out({3, 2}, {1, 1});
  FillBytes(out);
  const MirrorImg mirror = Mirror("VERT");
  std::vector<DataType> invalid = {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)};
  for (const PixelType& type : tests::kPixelTypes) invalid.emplace_back(type.element, true);
  for (const DataType& type : invalid) {
    Raster odd({3, 2, 1, type}, {1, 1});
    FillBytes(odd);
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { mirror.Process(&odd, nullptr, &out); }));
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { mirror.Process(&in, nullptr, &odd); }));
    EXPECT_TRUE(IsUntouched(out));
    EXPECT_TRUE(IsUntouched(odd));
  }
}

TEST(MirrorImgFailure, TypesAreTestedWhateverTheAxis) {
  Image<short> in({3, 2}, {1, 1}, 1);
  Raster bits({3, 2, 1, tessel::eDT_BIT}, {1, 1});
  EXPECT_TRUE(
      Throws<Exception>("Invalid type requested.", [&] { MirrorImg().Process(&in, nullptr, &bits); }));
}

// ---- differential

std::string DrawAxis(tests::Random& random) {
  constexpr const char* kWords[] = {"VERT", "vert", "VerT", "HORI", "hori", "HoRi"};
  constexpr const char* kOthers[] = {"", "VER", "HORIZONTAL", "x"};
  return random.OneIn(20) ? random.Pick(kOthers) : random.Pick(kWords);
}

/// A length of a window about that of an image, from 0 to twice as long.
std::uint32_t DrawLength(tests::Random& random, std::uint32_t length) {
  return random.OneIn(3) ? random.Below(2 * length + 1) : length - random.Below(length / 2 + 1);
}

MirrorImg DrawMirror(tests::Random& random, const tests::Size& size) {
  MirrorImg mirror = Mirror(DrawAxis(random), random.OneIn(2));
  if (random.OneIn(3)) return mirror;
  mirror.SetWindow(
      {random.Below(9), random.Below(9), DrawLength(random, size.width), DrawLength(random, size.height)});
  return mirror;
}

/// The cases of one input type, with rows longer than any block and with margins that hold all sources.
std::vector<tests::Case> CasesOf(const PixelType& in) {
  std::vector<tests::Case> cases = tests::CasesFrom(in, {.outputHasInputChannels = true});
  for (tests::Case& c : cases) {
    tests::Random random(c.seed + 1);
    if (c.size.width == 601) c.size.width = 2040 + random.Below(200);
    if (c.maskKind != tests::MaskKind::eNULL) c.outChannels = c.size.channels;
    c.in.isComplex = false;
    c.inMargins.marginY = 2 * c.size.height + 4;
  }
  return cases;
}

std::string Describe(const MirrorImg& mirror) {
  std::string text = "axis \"" + mirror.Axis + (mirror.isNewFile ? "\", new file" : "\"");
  for (const unsigned int entry : mirror.Window) text += ", " + std::to_string(entry);
  return text;
}

struct MirrorImgDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(MirrorImgDifferential, AgreesWithTheTwinBitForBit) {
  for (const tests::Case& c : CasesOf(GetParam())) {
    tests::Random random(~c.seed);
    const MirrorImg mirror = DrawMirror(random, c.size);
    const ::testing::AssertionResult result = Agree(
        c, {}, [&](Raster* in, Mask* mask, Raster* out) { mirror.Process(in, mask, out); },
        [&](const Raster& in, const Mask* mask, Raster& out) {
          reference::MirrorImg(mirror, in, mask, out);
        });
    ASSERT_TRUE(result) << Describe(mirror);
  }
}

/// A window at a place of its own, for a mask and an operator, in an output of the size that it needs.
struct WindowCase {
  Rectangle window;
  bool isVert, isNewFile, hasGaps;
  std::unique_ptr<Raster> in, expected, actual;

  WindowCase(const PixelType& inType, const PixelType& outType, tests::Random& random) {
    const tests::Size size = {1 + random.Below(90), 1 + random.Below(9), 1 + random.Below(7)};
    window = {random.Below(size.width), random.Below(size.height), 0, 0};
    window.width = 1 + random.Below(size.width - window.x);
    window.height = 1 + random.Below(size.height - window.y);
    isVert = random.OneIn(2);
    isNewFile = random.OneIn(2);
    hasGaps = random.OneIn(3);
    std::uint32_t width = size.width, height = size.height;
    if (isNewFile) (isVert ? width : height) = isVert ? window.width : window.height;
    const tessel::RasterContext margins{random.Below(4), random.Below(4)};
    in = std::make_unique<Raster>(tessel::RasterInfo(size.width, size.height, size.channels, inType.element),
                                  margins);
    FillRandom(*in, random.Pick(tests::kFills), random);
    const tessel::RasterInfo info(width + random.Below(3), height + random.Below(3), size.channels,
                                  outType.element);
    const tessel::RasterContext outMargins{random.Below(4), random.Below(4)};
    expected = std::make_unique<Raster>(info, outMargins);
    actual = std::make_unique<Raster>(info, outMargins);
    FillBytes(*expected);
    FillBytes(*actual);
  }

  MirrorImg Operator() const { return MirrorWindow(isVert ? "VERT" : "HORI", window, isNewFile); }

  /// Sources of a window with gaps stay within it.
  Mask MaskWithGaps(tests::Random& random) const {
    Mask mask = MaskOf(*in, window);
    for (std::uint32_t y = 0; hasGaps && y < in->height; ++y) {
      for (std::uint32_t x = window.x + 1; x < in->width; ++x)
        if (y > window.y && random.OneIn(3)) mask.SetValid(static_cast<int>(x), static_cast<int>(y), false);
    }
    return mask;
  }
};

TEST_P(MirrorImgDifferential, AgreesWithTheTwinOnWindowsThatTheMaskMarks) {
  tests::Random random(static_cast<std::uint64_t>(GetParam().element));
  for (const PixelType& outType : tests::kPixelTypes) {
    for (int i = 0; i < 120; ++i) {
      const WindowCase c(GetParam(), outType, random);
      Mask mask = c.MaskWithGaps(random);
      const MirrorImg mirror = c.Operator();
      reference::MirrorImg(mirror, *c.in, &mask, *c.expected);
      mirror.Process(c.in.get(), &mask, c.actual.get());
      ASSERT_TRUE(SameBits(*c.expected, *c.actual)) << Describe(mirror) << ", gaps " << c.hasGaps;
    }
  }
}

INSTANTIATE_TEST_SUITE_P(From, MirrorImgDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

TEST(MirrorImgOfManyPixels, AgreesWithTheTwinOnAnOutputLargerThanTheCaches) {
  tests::Random random(11);
  Raster in({2100, 2050, 1, tessel::eDT_8U}, {});
  FillRandom(in, tests::Fill::eSMOOTH, random);
  Raster expected({2100, 2050, 1, tessel::eDT_64F}, {3, 1}), actual(expected, expected);
  for (const char* const axis : {"VERT", "HORI"}) {
    FillBytes(expected);
    FillBytes(actual);
    reference::MirrorImg(Mirror(axis), in, nullptr, expected);
    Mirror(axis).Process(&in, nullptr, &actual);
    EXPECT_TRUE(SameBits(expected, actual)) << axis;
  }
}

// ---- contract

/// Bytes that the process has allocated and not freed.
std::size_t AllocatedBytes() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

/// False where a sanitizer has its own allocator.
bool AreBytesCounted() {
  const std::size_t before = AllocatedBytes();
  const std::vector<char> block(1 << 22);
  return AllocatedBytes() >= before + block.size();
}

/// The processors that `use(mirror)` leaves behind when the operator is gone.
template <class Use>
std::size_t ProcessorsLeftBehind(Use use) {
  constexpr std::size_t kEntries = 1 << 20;
  const std::size_t before = AllocatedBytes();
  {
    MirrorImg mirror = Mirror("none");
    mirror.SetWindow(std::vector<unsigned int>(kEntries, 1));
    use(mirror);
  }
  return (AllocatedBytes() - before) / (kEntries * sizeof(unsigned int));
}

// Deliberate: a rebuild leaves the old processor allocated.
TEST(MirrorImgContract, RebuildLeavesTheOldProcessorAllocated) {
  if (!AreBytesCounted()) GTEST_SKIP() << "the allocator counts for itself";
  Image<short> shorts({1, 1}), out({1, 1});
  Image<float> floats({1, 1});
  Raster bits({1, 1, 1, tessel::eDT_BIT}, {});
  EXPECT_EQ(ProcessorsLeftBehind([&](const MirrorImg&) {}), 0u);
  EXPECT_EQ(ProcessorsLeftBehind([&](const MirrorImg& mirror) {
              mirror.Process(&shorts, nullptr, &out);
              mirror.Process(&shorts, nullptr, &out);
            }),
            0u);
  EXPECT_EQ(ProcessorsLeftBehind([&](const MirrorImg& mirror) {
              mirror.Process(&shorts, nullptr, &out);
              mirror.Process(&floats, nullptr, &out);
              mirror.Process(&shorts, nullptr, &floats);
            }),
            2u);
  EXPECT_EQ(ProcessorsLeftBehind([&](const MirrorImg& mirror) {
              mirror.Process(&shorts, nullptr, &out);
              EXPECT_THROW(mirror.Process(&bits, nullptr, &out), Exception);
            }),
            1u);
}

TEST(MirrorImgContract, EveryParameterTravelsWithARebuild) {
  Numbered in({4, 2}, {2, 2});
  Mask mask = MaskOf(in, {1, 0, 2, 2});
  MirrorImg mirror = MirrorWindow("VERT", {1, 0, 2, 2}, false);
  const std::vector<short> first = {0, 2, 1, 3, 10, 12, 11, 13};
  EXPECT_EQ(Mirrored(mirror, in, &mask, {4, 2}), first);
  mirror.SetAxis("HORI");
  mirror.SetWindow({0, 0, 0, 3});
  mirror.IsNewFile(true);
  EXPECT_EQ(Mirrored(mirror, in, &mask, {4, 2}), first);
  Image<float> out({4, 2}, {}, kUnwritten);
  mirror.Process(&in, &mask, &out);
  EXPECT_EQ(std::vector<float>(&out.At(0, 0), &out.At(0, 0) + 8),
            (std::vector<float>{kUnwritten, 21, 22, kUnwritten, kUnwritten, 11, 12, kUnwritten}));
}

TEST(MirrorImgContract, ParametersAreCopiedByValue) {
  MirrorImg original = MirrorWindow("VERT", {1, 0, 2, 2}, true);
  MirrorImg copy(original), assigned;
  assigned = original;
  original.SetAxis("HORI");
  original.SetWindow({});
  original.IsNewFile(false);
  for (const MirrorImg* const made : {&copy, &assigned}) {
    EXPECT_EQ(made->Axis, "VERT");
    EXPECT_EQ(made->Window, (std::vector<unsigned int>{1, 0, 2, 2}));
    EXPECT_TRUE(made->isNewFile);
  }
}

static_assert(std::is_base_of_v<details::MirrorImgParams, MirrorImg>);
static_assert(!std::is_polymorphic_v<MirrorImg>);

}  // namespace
}  // namespace orvik::filters
