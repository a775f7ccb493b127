#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <thread>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>
#include <malloc.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/mask/maskdecision.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/iiidatatransfer.h"
#include "processes/gridmill/rangeclasses.h"
#include "processes/gridmill/rasterstatistics.h"
#include "processes/gridmill/spotblue.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

// What the raster services have in common in front of their inner processors.
namespace orvik::gridmill {
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

using AllServices = ::testing::Types<RasterStatistics, RangeClasses, IIIDataTransfer, SPOTBlue>;
using BuiltOnceServices = ::testing::Types<RasterStatistics, IIIDataTransfer, SPOTBlue>;
using WritingServices = ::testing::Types<RangeClasses, IIIDataTransfer, SPOTBlue>;
using BuiltOnceWriters = ::testing::Types<IIIDataTransfer, SPOTBlue>;
using MaskIgnorers = ::testing::Types<RasterStatistics, RangeClasses, IIIDataTransfer>;

template <class Operator>
constexpr bool kIsStatistics = std::is_same_v<Operator, RasterStatistics>;
template <class Operator>
constexpr bool kIsTransfer = std::is_same_v<Operator, IIIDataTransfer>;
template <class Operator>
constexpr bool kIsTwoLevel = kIsStatistics<Operator> || std::is_same_v<Operator, SPOTBlue>;

template <class Operator>
constexpr const char* kDispatchMessage =
    kIsTwoLevel<Operator> ? "Invalid type to dispatch." : "Invalid type requested.";

constexpr std::uint32_t kChannels = 4;
constexpr int kSample = 10;      // of every input
constexpr int kUnwritten = 77;   // of an output before a call
constexpr int kBackground = 55;  // of the output of a SPOTBlue

/// Parameters by which the result tells of `value`, which is 1 or 2. Each call replaces what the last one
/// set.
void Set(RasterStatistics& op, int value) {
  std::vector<unsigned int> channels(kChannels, 0u);
  if (op.channels.empty()) op.SetChans(channels);
  op.SetType(value == 1 ? 8 : 16);
  op.SetMethod(value == 1 ? eSTATISTICS_PLAIN : eSTATISTICS_SYNTHETIC_BLUE);
}
void Set(RangeClasses& op, int value) {
  op.SetNumClasses(value);
  op.SetMinRange(std::vector<float>(2, 5.0f));
  op.SetMaxRange(std::vector<float>(2, 20.0f));
  op.SetNoData(-1.0f);
}
void Set(IIIDataTransfer& op, int value) {
  std::vector<unsigned int> region = {0, 0, 3, 2};
  op.SetInRegion(region);
  op.SetOutRegion(region);
  op.SetResampleType(value == 1 ? eRESAMPLE_NEAREST : static_cast<ResampleType>(1));
}
void Set(SPOTBlue& op, int value) {
  op.min.assign(3, 0.0f);
  op.max.assign(3, 100.0f);
  op.scale.assign(3, 4.0f);
  op.backGround.assign(kChannels, static_cast<float>(kBackground));
  op.SetTrim(value == 2);
}

template <class Operator>
Operator Make(int value) {
  Operator op;
  Set(op, value);
  return op;
}

/// The value of the first sample that is written, for pixels of `kSample` and the parameters of
/// `Set(op, value)`. The blue of such a pixel is 20.25.
template <class Operator>
int ResultOf(int value) {
  if constexpr (std::is_same_v<Operator, RangeClasses>) return value;
  if constexpr (kIsTransfer<Operator>) return value == 1 ? kSample : kUnwritten;
  return value == 1 ? 20 : 81;
}

// ---- rasters

/// A raster of 3 x 2 pixels whose whole buffer holds one number, in elements of the type `readAs`. Its
/// margins leave room for elements that are wider than its own.
struct Tile : Raster {
  Tile(const DataType& type, int number, const DataType& readAs)
      : Raster(RasterInfo(3, 2, kChannels, type), {4, 4}) {
    FillBytes(*this);
    tests::WithPixelType(readAs, [&]<class T>() {
      std::fill_n(reinterpret_cast<T*>(data), dataSize / sizeof(T), static_cast<T>(number));
    });
  }
  Tile(const DataType& type, int number) : Tile(type, number, type) {}

  /// The first element of pixel (0, 0), read as the type `readAs`.
  double First(const DataType& readAs) const {
    const unsigned char* const first = data + std::size_t{marginY * bufferWidth + marginX} * channels *
                                                  (dataType.isComplex ? 2 : 1) * (dataType.sizeBits / 8);
    double value = 0.0;
    tests::WithPixelType(readAs, [&]<class T>() {
      T sample;
      std::copy_n(first, sizeof(T), reinterpret_cast<unsigned char*>(&sample));
      value = static_cast<double>(sample);
    });
    return value;
  }
};

/// A type of 16 bits that no list holds.
DataType UnknownType() {
  DataType type = tessel::eDT_16S;
  type.mantissaBits = 7;
  return type;
}

std::vector<DataType> TypesOfNoPixel() {
  return {DataType(), tessel::eDT_BIT, DataType(tessel::eDT_BIT, true), UnknownType()};
}

/// The types of the rasters of a call, and those that the processor reads and writes them as.
struct Types {
  DataType in = tessel::eDT_16S;
  DataType out = tessel::eDT_16S;
  DataType readAs = in;
  DataType writtenAs = out;
};

/// The parameter that the statistics were made with, or 0 if they are those of neither.
int ObserveStatistics(RasterStatistics& op) {
  std::vector<float> least;
  op.GetMinValue(least);
  if (least.size() != kChannels || least[0] != kSample) return 0;
  const std::size_t bins = op.GetPixelCounts(2).size();
  if (bins == 256 && least[2] == kSample) return 1;
  return bins == 65536 && least[2] == 20.0f ? 2 : 0;
}

/// The parameter that the inner processor runs with, or 0 if the result is that of neither.
template <class Operator>
int Observe(Operator& op, const Types& types = {}) {
  Tile in(types.in, kSample, types.readAs), out(types.out, kUnwritten, types.writtenAs);
  op.Process(&in, nullptr, &out);
  const double result = out.First(types.writtenAs);
  if constexpr (kIsStatistics<Operator>) {
    return result == kUnwritten ? ObserveStatistics(op) : 0;
  } else {
    if (static_cast<int>(result) == ResultOf<Operator>(1)) return 1;
    return static_cast<int>(result) == ResultOf<Operator>(2) ? 2 : 0;
  }
}

/// A call that the dispatcher refuses, for the type of the input or of the output.
template <class Operator>
void FailToDispatch(const Operator& op, bool forInput, const DataType& type = tessel::eDT_BIT) {
  Tile shorts(forInput ? tessel::eDT_16S : tessel::eDT_32F, kSample);  // another input type than is cached
  FillBytes(shorts);
  Raster odd(RasterInfo(3, 2, kChannels, type), {4, 4});
  FillBytes(odd);
  Raster* const in = forInput ? &odd : static_cast<Raster*>(&shorts);
  Raster* const out = forInput ? static_cast<Raster*>(&shorts) : &odd;
  EXPECT_TRUE(Throws<Exception>(kDispatchMessage<Operator>, [&] { op.Process(in, nullptr, out); }));
  EXPECT_TRUE(IsUntouched(shorts));
  EXPECT_TRUE(IsUntouched(odd));
}

/// Whether the type of the output can be refused.
template <class Operator>
std::vector<bool> RefusedPositions() {
  if (kIsStatistics<Operator>) return {true};
  return {true, false};
}

template <class Operator>
class ServiceFrame : public ::testing::Test {};
TYPED_TEST_SUITE(ServiceFrame, AllServices, );

// ---- parameters

TYPED_TEST(ServiceFrame, ParameterSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ServiceFrame, ParameterSetBeforeTheFirstProcessIsTaken) {
  for (const int value : {1, 2}) {
    auto op = Make<TypeParam>(value);
    EXPECT_EQ(Observe(op), value);
  }
}

TYPED_TEST(ServiceFrame, AllPairsOfTypesAreDispatched) {
  for (const PixelType& in : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes) {
      for (const int value : {1, 2}) {
        auto op = Make<TypeParam>(value);
        EXPECT_EQ(Observe(op, {in.element, out.element}), value) << in << ' ' << out;
      }
    }
  }
}

// Of the image that is walked: the input, or the output of a transfer.
TYPED_TEST(ServiceFrame, HeightOf0WritesNothingAndDoesNotLookAtTheBuffers) {
  const bool isTransfer = kIsTransfer<TypeParam>;
  const std::uint32_t huge = 4000000000u;
  Raster in(RasterInfo(3, isTransfer ? 2 : 0, kChannels, tessel::eDT_16S), {}, nullptr);
  Raster out(RasterInfo(isTransfer ? 3 : huge, isTransfer ? 0 : huge, kChannels, tessel::eDT_16S), {huge, 1},
             nullptr);
  auto op = Make<TypeParam>(1);
  op.Process(&in, nullptr, &out);
  Mask mask(0, 0);
  op.Process(&in, &mask, &out);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ServiceFrame, InputItsMarginAndTheMaskStayAsTheyWere) {
  Tile in(tessel::eDT_16S, kSample), out(tessel::eDT_32F, kUnwritten);
  const std::vector<unsigned char> before = tests::Bytes(in);
  Mask mask(3, 2, {4, 4});
  mask.SetValid(1, 1, false);
  const std::vector<unsigned char> bits = mask.bits;
  Make<TypeParam>(1).Process(&in, &mask, &out);
  EXPECT_EQ(tests::Bytes(in), before);
  EXPECT_EQ(mask.bits, bits);
}

// ---- copies

TYPED_TEST(ServiceFrame, CopyMadeBeforeTheFirstProcessIsIndependent) {
  auto original = Make<TypeParam>(1);
  TypeParam copy(original);
  TypeParam assigned;
  assigned = original;
  Set(original, 2);
  EXPECT_EQ(Observe(copy), 1);
  EXPECT_EQ(Observe(assigned), 1);
  EXPECT_EQ(Observe(original), 2);
  EXPECT_EQ(Observe(copy), 1);
}

TYPED_TEST(ServiceFrame, AssignmentBeforeTheFirstProcessReplacesAllParameters) {
  const auto original = Make<TypeParam>(1);
  auto assigned = Make<TypeParam>(2);
  assigned = original;
  const TypeParam& self = assigned;
  assigned = self;
  EXPECT_EQ(Observe(assigned), 1);
}

TYPED_TEST(ServiceFrame, CopyOutlivesTheOriginal) {
  auto original = std::make_unique<TypeParam>(Make<TypeParam>(1));
  TypeParam copy(*original);
  EXPECT_EQ(Observe(*original), 1);
  original.reset();
  EXPECT_EQ(Observe(copy), 1);
}

TYPED_TEST(ServiceFrame, CopyMadeAfterAFailedDispatchIsIndependent) {
  auto original = Make<TypeParam>(1);
  FailToDispatch(original, true);
  TypeParam copy(original);
  Set(original, 2);
  EXPECT_EQ(Observe(copy), 1);
  EXPECT_EQ(Observe(original), 2);
}

// ---- failed dispatch

TYPED_TEST(ServiceFrame, TypeThatIsNoPixelTypeIsInvalid) {
  for (const DataType& type : TypesOfNoPixel()) {
    const auto op = Make<TypeParam>(1);
    for (const bool forInput : RefusedPositions<TypeParam>()) FailToDispatch(op, forInput, type);
  }
}

TYPED_TEST(ServiceFrame, ObjectWorksAfterFailedDispatches) {
  auto op = Make<TypeParam>(1);
  for (int i = 0; i < 2; ++i) {
    for (const bool forInput : RefusedPositions<TypeParam>()) FailToDispatch(op, forInput);
  }
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ServiceFrame, CallAfterAFailedDispatchTakesTheParametersOfThatMoment) {
  for (const bool forInput : RefusedPositions<TypeParam>()) {
    auto op = Make<TypeParam>(1);
    FailToDispatch(op, forInput);
    Set(op, 2);
    EXPECT_EQ(Observe(op), 2);
  }
}

TYPED_TEST(ServiceFrame, ObjectCanBeDestroyedAfterAFailedDispatch) {
  for (const bool forInput : RefusedPositions<TypeParam>()) {
    const auto op = std::make_unique<TypeParam>(Make<TypeParam>(1));
    FailToDispatch(*op, forInput);
  }
}

// ---- threads

TYPED_TEST(ServiceFrame, TwoObjectsRunOnTwoThreadsAtOnce) {
  const auto work = [](int value, bool* isRight) {
    for (const PixelType& in : tests::kPixelTypes) {
      auto op = Make<TypeParam>(value);
      for (int i = 0; i < 20; ++i) *isRight = *isRight && Observe(op, {.in = in.element}) == value;
    }
  };
  bool isFirstRight = true, isSecondRight = true;
  std::thread first(work, 1, &isFirstRight), second(work, 2, &isSecondRight);
  first.join();
  second.join();
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

// ---- services that write

template <class Operator>
class ServiceFrameOfWriters : public ::testing::Test {};
TYPED_TEST_SUITE(ServiceFrameOfWriters, WritingServices, );

TYPED_TEST(ServiceFrameOfWriters, NullMaskExcludesNothing) {
  auto op = Make<TypeParam>(1);
  Tile in(tessel::eDT_16S, kSample), masked(tessel::eDT_16S, kUnwritten),
      unmasked(tessel::eDT_16S, kUnwritten);
  Mask mask(3, 2, {4, 4});
  op.Process(&in, &mask, &masked);
  op.Process(&in, nullptr, &unmasked);
  EXPECT_EQ(tests::Bytes(masked), tests::Bytes(unmasked));
  EXPECT_EQ(unmasked.First(tessel::eDT_16S), ResultOf<TypeParam>(1));
}

TEST(ServiceFrameOfMasks, SPOTBlueWritesTheBackgroundToExcludedPixels) {
  auto op = Make<SPOTBlue>(1);
  Tile in(tessel::eDT_16S, kSample), out(tessel::eDT_16S, kUnwritten);
  Mask mask(3, 2, {1, 0});
  mask.SetValid(0, 0, false);
  op.Process(&in, &mask, &out);
  EXPECT_EQ(out.First(tessel::eDT_16S), kBackground);
  EXPECT_EQ(Observe(op), 1);
}

template <class Operator>
class ServiceFrameOfMaskIgnorers : public ::testing::Test {};
TYPED_TEST_SUITE(ServiceFrameOfMaskIgnorers, MaskIgnorers, );

TYPED_TEST(ServiceFrameOfMaskIgnorers, MaskIsNotLookedAt) {
  Tile in(tessel::eDT_16S, kSample), out(tessel::eDT_16S, kUnwritten);
  Mask mask(3, 2, {4, 4}, false);
  mask.bits.clear();
  auto op = Make<TypeParam>(1);
  op.Process(&in, &mask, &out);
  if constexpr (kIsStatistics<TypeParam>) {
    EXPECT_EQ(ObserveStatistics(op), 1);
  } else {
    EXPECT_EQ(out.First(tessel::eDT_16S), ResultOf<TypeParam>(1));
  }
}

// ---- services that are built once

template <class Operator>
class ServiceFrameBuiltOnce : public ::testing::Test {};
TYPED_TEST_SUITE(ServiceFrameBuiltOnce, BuiltOnceServices, );

// Deliberate: built once and never again.
TYPED_TEST(ServiceFrameBuiltOnce, ParameterSetAfterTheFirstProcessIsIgnoredWhateverTheTypes) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  const DataType first = tessel::eDT_16S;
  for (const PixelType& type : tests::kPixelTypes) {
    EXPECT_EQ(Observe(op, {type.element, first, first, first}), 1) << type;
    EXPECT_EQ(Observe(op, {first, type.element, first, first}), 1) << type;
    EXPECT_EQ(Observe(op, {type.element, type.element, first, first}), 1) << type;
  }
  EXPECT_EQ(Observe(op), 1);
}

// Deliberate: built once and never again.
TYPED_TEST(ServiceFrameBuiltOnce, LaterRastersAreReadAndWrittenAsTheTypesOfTheFirstOnes) {
  for (const PixelType& in : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes) {
      auto op = Make<TypeParam>(1);
      EXPECT_EQ(Observe(op, {in.element, out.element}), 1);
      const Types later = {tessel::eDT_64U, tessel::eDT_64S, in.element, out.element};
      EXPECT_EQ(Observe(op, later), 1) << in << ' ' << out;
      const Types earlier = {in.element, out.element};
      EXPECT_EQ(Observe(op, earlier), 1) << in << ' ' << out;
    }
  }
}

TYPED_TEST(ServiceFrameBuiltOnce, LaterRastersOfNarrowerTypesAreReadAndWrittenAsTheTypesOfTheFirstOnes) {
  auto op = Make<TypeParam>(1);
  const DataType first = tessel::eDT_32S;  // four narrow samples are as wide as one of these
  EXPECT_EQ(Observe(op, {first, first}), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, {tessel::eDT_8U, first, first, first}), 1);
  EXPECT_EQ(Observe(op, {first, tessel::eDT_8U, first, first}), 1);
}

TYPED_TEST(ServiceFrameBuiltOnce, LaterTypeThatIsNoPixelTypeIsNotRefused) {
  auto op = Make<TypeParam>(1);
  const DataType first = tessel::eDT_16S;
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, {UnknownType(), first, first, first}), 1);
  EXPECT_EQ(Observe(op, {first, UnknownType(), first, first}), 1);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ServiceFrameBuiltOnce, LaterComplexTypeIsNeitherRefusedNorBuiltFor) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  const DataType complex(tessel::eDT_16S, true);
  if constexpr (!kIsTransfer<TypeParam>) {
    EXPECT_EQ(Observe(op, {complex, tessel::eDT_16S}), 1);
  }
  EXPECT_EQ(Observe(op, {tessel::eDT_16S, complex}), 1);
  EXPECT_EQ(Observe(op, {complex, complex}), 1);
}

template <class Operator>
class ServiceFrameOfBuiltOnceWriters : public ::testing::Test {};
TYPED_TEST_SUITE(ServiceFrameOfBuiltOnceWriters, BuiltOnceWriters, );

TYPED_TEST(ServiceFrameOfBuiltOnceWriters, LaterOutputOfBitsIsNotRefused) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op, {.out = tessel::eDT_8U}), 1);
  Tile in(tessel::eDT_16S, kSample);
  Raster bits(RasterInfo(3, 2, 64, tessel::eDT_BIT), {1, 2});  // eight bytes to a pixel
  FillBytes(bits);
  op.Process(&in, nullptr, &bits);
  const std::size_t first = (2 * 5 + 1) * 8;
  EXPECT_EQ(bits.data[first], ResultOf<TypeParam>(1));
  EXPECT_EQ(bits.data[first - 1], tests::kSentinel);
  EXPECT_EQ(bits.data[first + kChannels], tests::kSentinel);
}

TEST(ServiceFrameOfStatistics, ResultsOfCallsWithOtherTypesAddUp) {
  auto op = Make<RasterStatistics>(1);
  const DataType first = tessel::eDT_16U;
  EXPECT_EQ(Observe(op, {.in = first}), 1);
  int calls = 1;
  for (const DataType& type : {DataType(tessel::eDT_32F), DataType(tessel::eDT_64S), UnknownType()}) {
    EXPECT_EQ(Observe(op, {.in = type, .readAs = first}), 1);
    ++calls;
  }
  for (std::uint32_t c = 0; c < kChannels; ++c)
    EXPECT_EQ(op.GetPixelCounts(static_cast<int>(c))[kSample], 6 * calls) << c;
}

TEST(ServiceFrameOfTransfers, RegionSetAfterTheFirstProcessIsIgnored) {
  tests::Image<short> in({3, 1}), out({3, 1});
  in.Set([](int x, int, std::uint32_t) { return 10 + x; });
  IIIDataTransfer op;
  std::vector<unsigned int> whole = {0, 0, 3, 1}, right = {2, 0, 1, 1};
  op.SetInRegion(right);
  op.SetOutRegion(whole);
  op.Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 12);
  op.SetInRegion(whole);
  op.Process(&in, nullptr, &out);
  EXPECT_EQ(out.At(0, 0), 12);
  EXPECT_EQ(out.At(1, 0), 12);
}

// ---- the type of the output, where it is not looked at

TEST(ServiceFrameOfStatistics, OutputIsNotLookedAt) {
  std::vector<DataType> types = TypesOfNoPixel();
  for (const PixelType& type : tests::kPixelTypes)
    types.insert(types.end(), {type.element, DataType(type.element, true)});
  for (const DataType& type : types) {
    auto op = Make<RasterStatistics>(1);
    Tile in(tessel::eDT_16S, kSample);
    Raster out(RasterInfo(3, 2, kChannels, type), {4, 4});
    FillBytes(out);
    op.Process(&in, nullptr, &out);
    op.Process(&in, nullptr, &out);
    EXPECT_TRUE(IsUntouched(out));
    EXPECT_EQ(ObserveStatistics(op), 1);
  }
}

TEST(ServiceFrameOfStatistics, OutputMayBeNull) {
  for (const PixelType& type : tests::kPixelTypes) {
    auto op = Make<RasterStatistics>(2);
    Tile in(type.element, kSample);
    op.Process(&in, nullptr, nullptr);
    EXPECT_EQ(ObserveStatistics(op), 2) << type;
    op.Process(&in, nullptr, nullptr);
    EXPECT_EQ(ObserveStatistics(op), 2) << type;
  }
}

TEST(ServiceFrameOfStatistics, InputIsRefusedAlsoWithoutAnOutput) {
  auto op = Make<RasterStatistics>(1);
  Tile odd(UnknownType(), kSample, tessel::eDT_16S);
  EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", [&] { op.Process(&odd, nullptr, nullptr); }));
  std::vector<float> values;
  op.GetMinValue(values);
  op.GetMaxValue(values);
  EXPECT_TRUE(values.empty());
  EXPECT_EQ(Observe(op), 1);
}

// ---- classes, which are built for each pair of types

TEST(ServiceFrameOfClasses, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheInputChanges) {
  auto op = Make<RangeClasses>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, {.in = tessel::eDT_16U}), 2);
  EXPECT_EQ(Observe(op), 2);
  Set(op, 1);
  EXPECT_EQ(Observe(op), 2);
}

TEST(ServiceFrameOfClasses, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheOutputChanges) {
  auto op = Make<RangeClasses>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, {.out = tessel::eDT_16U}), 2);
  EXPECT_EQ(Observe(op), 2);
}

TEST(ServiceFrameOfClasses, ProcessorIsOfTheTypesOfEachCall) {
  auto op = Make<RangeClasses>(1);
  for (const PixelType& in : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes)
      EXPECT_EQ(Observe(op, {in.element, out.element}), 1) << in << ' ' << out;
  }
}

TEST(ServiceFrameOfClasses, ObjectThatHadRunWorksAfterAFailedDispatchWithTheNewParameter) {
  for (const bool forInput : {true, false}) {
    auto op = Make<RangeClasses>(1);
    EXPECT_EQ(Observe(op), 1);
    Set(op, 2);
    FailToDispatch(op, forInput);
    EXPECT_EQ(Observe(op), 2);
  }
}

TEST(ServiceFrameOfClasses, ObjectThatHadRunCanBeReadAndDestroyedAfterAFailedDispatch) {
  for (const bool forInput : {true, false}) {
    const auto op = std::make_unique<RangeClasses>(Make<RangeClasses>(1));
    EXPECT_EQ(Observe(*op), 1);
    EXPECT_EQ(op->GetClassNumber(), 1);
    FailToDispatch(*op, forInput);
    std::vector<float> bounds;
    op->GetMinRangeValue(bounds);
    op->GetMaxRangeValue(bounds);
    EXPECT_EQ(op->GetClassNumber(), -1);
    EXPECT_TRUE(bounds.empty());
  }
}

TEST(ServiceFrameOfClasses, ComplexInputOrOutputIsInvalid) {
  for (const PixelType& type : tests::kPixelTypes) {
    const DataType complex(type.element, true);
    const auto op = Make<RangeClasses>(1);
    for (const bool forInput : {true, false}) FailToDispatch(op, forInput, complex);
    Tile both(complex, kSample);
    FillBytes(both);
    EXPECT_TRUE(Throws<Exception>("Invalid type requested.", [&] { op.Process(&both, nullptr, &both); }));
    EXPECT_TRUE(IsUntouched(both)) << type;
  }
}

TEST(ServiceFrameOfClasses, ComplexRastersAreInvalidAlsoOnceAProcessorStands) {
  for (const bool forInput : {true, false}) {
    auto op = Make<RangeClasses>(1);
    EXPECT_EQ(Observe(op), 1);
    Set(op, 2);
    FailToDispatch(op, forInput, DataType(tessel::eDT_16S, true));
    EXPECT_EQ(Observe(op), 2);
  }
}

/// Bytes that the process has allocated and not freed. Does not move where a sanitizer has its own allocator,
/// which then looks for leaks itself.
std::size_t AllocatedBytes() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

TEST(ServiceFrameOfClasses, RebuildDeletesTheOldProcessor) {
  const std::size_t bounds = 1 << 16;
  auto op = Make<RangeClasses>(1);
  op.SetMinRange(std::vector<float>(bounds, 5.0f));
  op.SetMaxRange(std::vector<float>(bounds, 20.0f));
  EXPECT_EQ(Observe(op), 1);
  const std::size_t before = AllocatedBytes();
  for (int i = 0; i < 4; ++i) {
    EXPECT_EQ(Observe(op, {.in = tessel::eDT_32F}), 1);
    EXPECT_EQ(Observe(op), 1);
  }
  FailToDispatch(op, true);
  EXPECT_LT(AllocatedBytes(), before + bounds);
}

// ---- complex rasters

TEST(ServiceFrameOfComplexRasters, StatisticsReadTheFirstElements) {
  for (const PixelType& type : tests::kPixelTypes) {
    for (const int value : {1, 2}) {
      auto op = Make<RasterStatistics>(value);
      EXPECT_EQ(Observe(op, {.in = DataType(type.element, true)}), value) << type;
    }
  }
}

TEST(ServiceFrameOfComplexRasters, StatisticsReadAsManyElementsAsThereAreChannels) {
  tests::Image<short> in({1, 1, 2}, {}, 0, true);
  in.SetPixel(0, 0, {10, 20, 30, 40});
  auto op = Make<RasterStatistics>(1);
  op.Process(&in, nullptr, nullptr);
  std::vector<float> least;
  op.GetMinValue(least);
  EXPECT_EQ(least, (std::vector<float>{10.0f, 20.0f, 100000.0f, 100000.0f}));
}

TEST(ServiceFrameOfComplexRasters, SPOTBlueReadsAndWritesThemAsTheirElements) {
  for (const PixelType& type : tests::kPixelTypes) {
    const DataType complex(type.element, true), real = tessel::eDT_16S;
    for (const int value : {1, 2}) {
      for (const Types& types : {Types{complex, real}, Types{real, complex}, Types{complex, complex}}) {
        auto op = Make<SPOTBlue>(value);
        EXPECT_EQ(Observe(op, types), value) << type;
      }
    }
  }
}

TEST(ServiceFrameOfComplexRasters, TransfersMoveThemAsTheyAre) {
  for (const PixelType& type : tests::kPixelTypes) {
    const DataType complex(type.element, true), real = tessel::eDT_16S;
    auto toComplex = Make<IIIDataTransfer>(1), fromComplex = Make<IIIDataTransfer>(1);
    EXPECT_EQ(Observe(toComplex, {real, complex}), 1) << type;
    EXPECT_EQ(Observe(fromComplex, {complex, complex}), 1) << type;
  }
}

TEST(ServiceFrameOfComplexRasters, TransfersHaveTheProcessorOfTheElementType) {
  tests::Image<float> in({2, 1, 1}, {}, 0.0f, true);
  in.Set([](int x, int, std::uint32_t c) { return 10.5 + x + 4.0 * c; });
  tests::Image<short> complexOut({2, 1, 1}, {}, 0, true), realOut({2, 1, 2});
  for (tests::Image<short>* const out : {&complexOut, &realOut}) {
    const auto op = Make<IIIDataTransfer>(1);
    op.Process(&in, nullptr, out);
    EXPECT_EQ(out->At(0, 0, 0), 10);
    EXPECT_EQ(out->At(0, 0, 1), 14);
    EXPECT_EQ(out->At(1, 0, 0), 11);
    EXPECT_EQ(out->At(1, 0, 1), 15);
  }
}

// ---- what is copied with an object

TEST(ServiceFrameOfCopies, StatisticsHaveTheirOwnLists) {
  struct : tessel::IMaskDecision {
    bool IsPixelValid(const void*) override { return false; }
  } none;
  auto original = Make<RasterStatistics>(2);
  original.SetMask(&none);
  RasterStatistics copy(original), assigned;
  assigned = original;
  original.channels.clear();
  original.minValues.clear();
  original.maxValues.clear();
  original.histograms.clear();
  for (RasterStatistics* const other : {&copy, &assigned}) {
    EXPECT_EQ(other->channels.size(), kChannels);
    EXPECT_EQ(other->minValues.size(), kChannels);
    EXPECT_EQ(other->maxValues.size(), kChannels);
    EXPECT_EQ(other->histograms.size(), kChannels);
    EXPECT_EQ(other->histograms.back().size(), 65536u);
    EXPECT_EQ(other->channelCount, static_cast<int>(kChannels));
    EXPECT_EQ(other->histogramType, 16);
    EXPECT_EQ(other->method, eSTATISTICS_SYNTHETIC_BLUE);
    EXPECT_EQ(other->maskDecision, &none);
    other->SetMask(nullptr);
    EXPECT_EQ(Observe(*other), 2);
  }
}

TEST(ServiceFrameOfCopies, ClassesHaveTheirOwnBounds) {
  auto original = Make<RangeClasses>(2);
  RangeClasses copy(original), assigned;
  assigned = original;
  original.minRange.assign(2, 1000.0f);
  original.maxRange.clear();
  original.classValues.clear();
  for (RangeClasses* const other : {&copy, &assigned}) {
    EXPECT_EQ(other->minRange, std::vector<float>(2, 5.0f));
    EXPECT_EQ(other->maxRange, std::vector<float>(2, 20.0f));
    EXPECT_EQ(other->classValues, (std::vector<int>{1, 2}));
    EXPECT_EQ(other->noData, -1.0f);
    EXPECT_EQ(Observe(*other), 2);
  }
}

TEST(ServiceFrameOfCopies, TransfersHaveTheirOwnRegions) {
  auto original = Make<IIIDataTransfer>(1);
  original.inReserved = {1, 2};
  original.outReserved = {3};
  IIIDataTransfer copy(original), assigned;
  assigned = original;
  std::vector<unsigned int> other = {9, 9, 9, 9};
  original.SetInRegion(other);
  original.SetOutRegion(other);
  original.inReserved.clear();
  original.outReserved.clear();
  for (const IIIDataTransfer* const held : {&copy, &assigned}) {
    EXPECT_EQ(held->inRegion, (details::Region{0, 0, 3, 2}));
    EXPECT_EQ(held->outRegion, (details::Region{0, 0, 3, 2}));
    EXPECT_EQ(held->inReserved, (std::vector<unsigned int>{1, 2}));
    EXPECT_EQ(held->outReserved, (std::vector<unsigned int>{3}));
    EXPECT_EQ(held->resampleType, eRESAMPLE_NEAREST);
  }
}

TEST(ServiceFrameOfCopies, SPOTBluesHaveTheirOwnBands) {
  auto original = Make<SPOTBlue>(2);
  SPOTBlue copy(original), assigned;
  assigned = original;
  original.min.assign(3, 1000.0f);
  original.max.clear();
  original.scale.clear();
  original.backGround.clear();
  for (SPOTBlue* const other : {&copy, &assigned}) {
    EXPECT_EQ(other->min, std::vector<float>(3, 0.0f));
    EXPECT_EQ(other->max, std::vector<float>(3, 100.0f));
    EXPECT_EQ(other->scale, std::vector<float>(3, 4.0f));
    EXPECT_EQ(other->backGround, std::vector<float>(kChannels, kBackground));
    EXPECT_EQ(Observe(*other), 2);
  }
}

}  // namespace
}  // namespace orvik::gridmill
