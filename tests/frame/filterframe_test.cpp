#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/bitmapfiltering.h"
#include "processes/gridmill/intenpercent.h"
#include "processes/gridmill/mirrorimg.h"
#include "processes/gridmill/normalize.h"
#include "processes/gridmill/percentile.h"
#include "processes/gridmill/vegindex.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

// What the filters without guards have in common in front of their inner processors.
namespace orvik::filters {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tessel::RasterInfo;
using tests::FillBytes;
using tests::IsUntouched;
using tests::PixelType;
using tests::Throws;

// ---- operators

using InputComparers = ::testing::Types<BitmapFiltering, IntenPercent>;
using PairComparers = ::testing::Types<MirrorImg, Normalize, Percentile, VegIndex>;
using RealFilters = ::testing::Types<IntenPercent, MirrorImg, Normalize, Percentile, VegIndex>;
using MaskedFilters = ::testing::Types<BitmapFiltering, IntenPercent, MirrorImg, VegIndex>;
using AllFilters =
    ::testing::Types<BitmapFiltering, IntenPercent, MirrorImg, Normalize, Percentile, VegIndex>;

template <class Operator>
constexpr bool kComparesInputAlone =
    std::is_same_v<Operator, BitmapFiltering> || std::is_same_v<Operator, IntenPercent>;

template <class Operator>
constexpr const char* kDispatchMessage =
    kComparesInputAlone<Operator> ? "Invalid type to dispatch." : "Invalid type requested.";

constexpr std::uint32_t kChannels = 4;
constexpr int kSample = 10;     // of every input
constexpr int kUnwritten = 77;  // of an output before a call

/// Parameters by which the result for a pixel of `kSample` tells of `value`, which is 1 or 2.
void Set(BitmapFiltering& op, int value) {
  op.SetThresholdMin(value == 1 ? 5.0f : 15.0f);
  op.SetThresholdMax(20.0f);
}
void Set(IntenPercent& op, int value) {
  op.SetMin(value == 1 ? 0.0 : 50.0);
  op.SetMax(value == 1 ? 5.0 : 99.0);
  op.SetScale(1.0);
  op.SetNoData(-1.0);
  op.SetType(changedetection::eDIFF_ABSOLUTE);
}
void Set(MirrorImg& op, int value) {
  op.SetAxis(value == 1 ? "VERT" : "none");
  op.IsNewFile(false);
}
void Set(Normalize& op, int value) {
  op.SetMinData(std::vector<float>(kChannels, value == 1 ? 0.0f : 50.0f));
  op.SetMaxData(std::vector<float>(kChannels, value == 1 ? 5.0f : 99.0f));
}
void Set(Percentile& op, int value) {
  op.SetBinNum(1);
  op.SetMinData(std::vector<float>(kChannels, value == 1 ? 0.0f : 50.0f));
  op.SetMaxData(std::vector<float>(kChannels, value == 1 ? 5.0f : 99.0f));
  op.SetCoefficients(std::vector<int>(kChannels, 1));
}
void Set(VegIndex& op, int value) {
  std::vector<unsigned int> requests(12, 0u);
  requests[value == 1 ? eINDEX_RVI : eINDEX_DVI] = 1;
  op.SetRequestedIndex(requests);
  op.SetBandIndex({eBAND_BLUE, eBAND_GREEN, eBAND_RED, eBAND_NIR});
}

template <class Operator>
Operator Make(int value) {
  Operator op;
  Set(op, value);
  return op;
}

/// The sample of a pixel that `Set` speaks of.
template <class Operator>
constexpr std::uint32_t kTellingSample = std::is_same_v<Operator, IntenPercent> ? 3 : 0;

/// Its value for a pixel of `kSample` with the parameters of `Set(op, value)`.
template <class Operator>
int ResultOf(int value) {
  if constexpr (std::is_same_v<Operator, MirrorImg>) return value == 1 ? kSample : kUnwritten;
  if constexpr (kComparesInputAlone<Operator> && !std::is_same_v<Operator, IntenPercent>)
    return value == 1 ? 1 : 0;
  if constexpr (std::is_same_v<Operator, VegIndex>) return value == 1 ? 1 : 0;
  return value == 1 ? 100 : 0;
}

// ---- rasters

/// A raster whose whole buffer holds one number.
struct Tile : Raster {
  Tile(const DataType& type, int number) : Raster(RasterInfo(3, 2, kChannels, type), {1, 2}) {
    tests::WithPixelType(type, [&]<class T>() {
      std::fill_n(reinterpret_cast<T*>(data), dataSize / sizeof(T), static_cast<T>(number));
    });
  }

  /// An element of pixel (0, 0).
  double At(std::uint32_t element) const {
    const std::size_t first =
        std::size_t{marginY * bufferWidth + marginX} * channels * (dataType.isComplex ? 2 : 1);
    double value = 0.0;
    tests::WithPixelType(dataType, [&]<class T>() {
      value = static_cast<double>(reinterpret_cast<const T*>(data)[first + element]);
    });
    return value;
  }
};

/// The parameter that the inner processor runs with, or 0 if the result is that of neither.
template <class Operator>
int Observe(const Operator& op, const DataType& inType = tessel::eDT_16S,
            const DataType& outType = tessel::eDT_16S) {
  Tile in(inType, kSample), out(outType, kUnwritten);
  op.Process(&in, nullptr, &out);
  const double result = out.At(kTellingSample<Operator>);
  if (result == ResultOf<Operator>(1)) return 1;
  return result == ResultOf<Operator>(2) ? 2 : 0;
}

/// A call that the dispatcher refuses, for the type of the input or of the output.
template <class Operator>
void FailToDispatch(const Operator& op, bool forInput) {
  Tile shorts(forInput ? tessel::eDT_16S : tessel::eDT_32F, kSample);  // another input type than is cached
  FillBytes(shorts);
  Raster bits(RasterInfo(3, 2, kChannels, tessel::eDT_BIT), {1, 2});
  FillBytes(bits);
  Raster* const in = forInput ? &bits : static_cast<Raster*>(&shorts);
  Raster* const out = forInput ? static_cast<Raster*>(&shorts) : &bits;
  EXPECT_TRUE(Throws<Exception>(kDispatchMessage<Operator>, [&] { op.Process(in, nullptr, out); }));
  EXPECT_TRUE(IsUntouched(shorts));
  EXPECT_TRUE(IsUntouched(bits));
}

template <class Operator>
class FilterFrame : public ::testing::Test {};
TYPED_TEST_SUITE(FilterFrame, AllFilters, );

// ---- parameters

TYPED_TEST(FilterFrame, ParameterSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(FilterFrame, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheInputChanges) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, tessel::eDT_32F), 2);
  EXPECT_EQ(Observe(op), 2);
  Set(op, 1);
  EXPECT_EQ(Observe(op), 2);
  EXPECT_EQ(Observe(op, tessel::eDT_16U), 1);
}

TYPED_TEST(FilterFrame, ParameterSetBeforeTheFirstProcessReplacesTheOneBefore) {
  auto op = Make<TypeParam>(2);
  Set(op, 1);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(FilterFrame, AllPairsOfTypesAreDispatched) {
  for (const PixelType& in : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes) {
      for (const int value : {1, 2})
        EXPECT_EQ(Observe(Make<TypeParam>(value), in.element, out.element), value) << in << ' ' << out;
    }
  }
}

TYPED_TEST(FilterFrame, OneObjectServesEveryTypeOfInput) {
  const auto op = Make<TypeParam>(1);
  for (int i = 0; i < 2; ++i) {
    for (const PixelType& in : tests::kPixelTypes) EXPECT_EQ(Observe(op, in.element), 1) << in;
  }
}

TYPED_TEST(FilterFrame, CopyMadeBeforeTheFirstProcessIsIndependent) {
  auto original = Make<TypeParam>(1);
  const TypeParam copy(original);
  auto assigned = Make<TypeParam>(2);
  assigned = original;
  Set(original, 2);
  EXPECT_EQ(Observe(copy), 1);
  EXPECT_EQ(Observe(assigned), 1);
  EXPECT_EQ(Observe(original), 2);
}

TYPED_TEST(FilterFrame, HeightOf0WritesNothingAndDoesNotLookAtTheBuffers) {
  Raster in(RasterInfo(3, 0, kChannels, tessel::eDT_16S), {}, nullptr);
  Raster out(RasterInfo(4000000000u, 4000000000u, kChannels, tessel::eDT_16S), {4000000000u, 1}, nullptr);
  const auto op = Make<TypeParam>(1);
  op.Process(&in, nullptr, &out);
  Mask mask(0, 0);
  op.Process(&in, &mask, &out);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(FilterFrame, InputAndItsMarginStayAsTheyWere) {
  Tile in(tessel::eDT_16S, kSample), out(tessel::eDT_32F, kUnwritten);
  const std::vector<unsigned char> before = tests::Bytes(in);
  Mask mask(3, 2, {1, 2});
  mask.SetValid(1, 1, false);
  const std::vector<unsigned char> bits = mask.bits;
  Make<TypeParam>(1).Process(&in, &mask, &out);
  EXPECT_EQ(tests::Bytes(in), before);
  EXPECT_EQ(mask.bits, bits);
}

// ---- failed dispatch

TYPED_TEST(FilterFrame, InputOrOutputOfNoPixelTypeIsInvalid) {
  for (const DataType& type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    const auto op = Make<TypeParam>(1);
    Tile shorts(tessel::eDT_16S, kSample);
    FillBytes(shorts);
    Raster odd(RasterInfo(3, 2, kChannels, type), {1, 2});
    FillBytes(odd);
    const auto asInput = [&] { op.Process(&odd, nullptr, &shorts); };
    const auto asOutput = [&] { op.Process(&shorts, nullptr, &odd); };
    EXPECT_TRUE(Throws<Exception>(kDispatchMessage<TypeParam>, asInput));
    EXPECT_TRUE(Throws<Exception>(kDispatchMessage<TypeParam>, asOutput));
    EXPECT_TRUE(IsUntouched(shorts) && IsUntouched(odd));
  }
}

TYPED_TEST(FilterFrame, ObjectWorksAfterAFailedDispatch) {
  const auto op = Make<TypeParam>(1);
  FailToDispatch(op, true);
  FailToDispatch(op, false);
  FailToDispatch(op, false);
  FailToDispatch(op, true);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(FilterFrame, ObjectThatHadRunWorksAfterAFailedDispatchWithTheNewParameter) {
  for (const bool forInput : {true, false}) {
    auto op = Make<TypeParam>(1);
    EXPECT_EQ(Observe(op), 1);
    Set(op, 2);
    FailToDispatch(op, forInput);
    EXPECT_EQ(Observe(op), 2);
  }
}

TYPED_TEST(FilterFrame, ObjectCanBeDestroyedAfterAFailedDispatch) {
  for (const bool forInput : {true, false}) {
    const auto op = std::make_unique<TypeParam>(Make<TypeParam>(1));
    EXPECT_EQ(Observe(*op), 1);
    FailToDispatch(*op, forInput);
  }
}

// ---- threads

TYPED_TEST(FilterFrame, TwoObjectsRunOnTwoThreadsAtOnce) {
  const auto work = [](int value, bool* isRight) {
    const auto op = Make<TypeParam>(value);
    for (int i = 0; i < 200; ++i) {
      const PixelType& in = tests::kPixelTypes[static_cast<std::size_t>(i / 20)];
      *isRight = *isRight && Observe(op, in.element) == value;
    }
  };
  bool isFirstRight = true, isSecondRight = true;
  std::thread first(work, 1, &isFirstRight), second(work, 2, &isSecondRight);
  first.join();
  second.join();
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

// ---- filters that look at the mask

template <class Operator>
class FilterFrameWithMask : public ::testing::Test {};
TYPED_TEST_SUITE(FilterFrameWithMask, MaskedFilters, );

TYPED_TEST(FilterFrameWithMask, NullMaskExcludesNothing) {
  const auto op = Make<TypeParam>(1);
  Tile in(tessel::eDT_16S, kSample), masked(tessel::eDT_16S, kUnwritten),
      unmasked(tessel::eDT_16S, kUnwritten);
  Mask mask(3, 2, {1, 2});
  op.Process(&in, &mask, &masked);
  op.Process(&in, nullptr, &unmasked);
  EXPECT_EQ(tests::Bytes(masked), tests::Bytes(unmasked));
  EXPECT_NE(unmasked.At(0), kUnwritten);
}

// ---- filters that refuse complex rasters

template <class Operator>
class FilterFrameOfRealRasters : public ::testing::Test {};
TYPED_TEST_SUITE(FilterFrameOfRealRasters, RealFilters, );

TYPED_TEST(FilterFrameOfRealRasters, ComplexInputOrOutputIsInvalid) {
  for (const PixelType& type : tests::kPixelTypes) {
    const auto op = Make<TypeParam>(1);
    Tile shorts(tessel::eDT_16S, kSample), complex(DataType(type.element, true), kSample);
    FillBytes(shorts);
    FillBytes(complex);
    const auto asInput = [&] { op.Process(&complex, nullptr, &shorts); };
    const auto asOutput = [&] { op.Process(&shorts, nullptr, &complex); };
    const auto asBoth = [&] { op.Process(&complex, nullptr, &complex); };
    EXPECT_TRUE(Throws<Exception>(kDispatchMessage<TypeParam>, asInput)) << type;
    EXPECT_TRUE(Throws<Exception>(kDispatchMessage<TypeParam>, asOutput)) << type;
    EXPECT_TRUE(Throws<Exception>(kDispatchMessage<TypeParam>, asBoth)) << type;
    EXPECT_TRUE(IsUntouched(shorts) && IsUntouched(complex)) << type;
  }
}

TYPED_TEST(FilterFrameOfRealRasters, ObjectWorksAfterAComplexInputWasRefused) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  Tile complex(DataType(tessel::eDT_16S, true), kSample), out(tessel::eDT_16S, kUnwritten);
  EXPECT_THROW(op.Process(&complex, nullptr, &out), Exception);
  EXPECT_EQ(Observe(op), 2);
}

TEST(FilterFrameOfComplexRasters, BitmapFilteringReadsAndWritesThemAsTheirElements) {
  for (const PixelType& type : tests::kPixelTypes) {
    const DataType complex(type.element, true);
    for (const int value : {1, 2}) {
      const auto op = Make<BitmapFiltering>(value);
      EXPECT_EQ(Observe(op, complex, tessel::eDT_16S), value) << type;
      EXPECT_EQ(Observe(op, tessel::eDT_16S, complex), value) << type;
      EXPECT_EQ(Observe(Make<BitmapFiltering>(value), complex, complex), value) << type;
    }
  }
}

// ---- filters that compare input and output

template <class Operator>
class FilterFrameOfPairs : public ::testing::Test {};
TYPED_TEST_SUITE(FilterFrameOfPairs, PairComparers, );

TYPED_TEST(FilterFrameOfPairs, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheOutputChanges) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, tessel::eDT_16S, tessel::eDT_32F), 2);
  EXPECT_EQ(Observe(op), 2);
}

TYPED_TEST(FilterFrameOfPairs, ProcessorIsOfTheTypesOfEachCall) {
  const auto op = Make<TypeParam>(1);
  for (const PixelType& in : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes)
      EXPECT_EQ(Observe(op, in.element, out.element), 1) << in << ' ' << out;
  }
}

TYPED_TEST(FilterFrameOfPairs, ComplexOutputIsInvalidAlsoOnceAProcessorStands) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  Tile in(tessel::eDT_16S, kSample), complex(DataType(tessel::eDT_16S, true), kUnwritten);
  EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { op.Process(&in, nullptr, &complex); }));
  EXPECT_EQ(Observe(op), 2);
}

// ---- filters that compare the input alone

template <class Operator>
class FilterFrameOfInputs : public ::testing::Test {};
TYPED_TEST_SUITE(FilterFrameOfInputs, InputComparers, );

// Deliberate: only a change of the input's type rebuilds.
TYPED_TEST(FilterFrameOfInputs, OnlyAChangeOfTheInputsTypeRebuilds) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  for (const DataType& type : {DataType(tessel::eDT_16U), DataType(tessel::eDT_16S, true)})
    EXPECT_EQ(Observe(op, tessel::eDT_16S, type), 1);
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op, tessel::eDT_16U), 2);
}

TYPED_TEST(FilterFrameOfInputs, LaterOutputOfNoPixelTypeIsNotRefused) {
  const auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op, tessel::eDT_16S, tessel::eDT_8U), 1);
  Tile in(tessel::eDT_16S, kSample);
  Raster bits(RasterInfo(3, 2, 32, tessel::eDT_BIT), {1, 2});  // four bytes to a pixel
  FillBytes(bits);
  op.Process(&in, nullptr, &bits);
  const std::size_t first = (2 * 5 + 1) * 4;
  EXPECT_EQ(bits.data[first + kTellingSample<TypeParam>], ResultOf<TypeParam>(1));
  EXPECT_EQ(bits.data[first - 1], tests::kSentinel);
  EXPECT_EQ(bits.data[first + 12], tests::kSentinel);
}

}  // namespace
}  // namespace orvik::filters
