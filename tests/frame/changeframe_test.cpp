#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <malloc.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/chandiffchange.h"
#include "processes/gridmill/chandiffchange2.h"
#include "processes/gridmill/chanratiochange.h"
#include "processes/gridmill/chanratiochange2.h"
#include "processes/gridmill/combchange.h"
#include "processes/gridmill/intenratiochange.h"
#include "processes/gridmill/magnitudechange.h"
#include "processes/gridmill/singlechange.h"
#include "processes/gridmill/tasseledcapchange.h"
#include "tests/support/changecases.h"
#include "tests/support/changepixel.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

// What the ten change operators have in common in front of their inner processors.
namespace orvik::changedetection {
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

using TwoTypeOperators = ::testing::Types<SingleChange, ChanDiffChange, CombChange, IntenRatioChange,
                                          MagnitudeChange, TCGNChange, TCSBChange>;
using ThreeTypeOperators = ::testing::Types<ChanDiffChange2, ChanRatioChange, ChanRatioChange2>;
using AllOperators =
    ::testing::Types<SingleChange, ChanDiffChange, CombChange, IntenRatioChange, MagnitudeChange, TCGNChange,
                     TCSBChange, ChanDiffChange2, ChanRatioChange, ChanRatioChange2>;
using NoDataOperators = ::testing::Types<ChanDiffChange, IntenRatioChange, MagnitudeChange, TCGNChange,
                                         TCSBChange, ChanDiffChange2, ChanRatioChange, ChanRatioChange2>;

template <class Operator, class... Others>
constexpr bool kIsOneOf = (std::is_same_v<Operator, Others> || ...);
template <class Operator>
constexpr bool kIsOfThreeTypes = kIsOneOf<Operator, ChanDiffChange2, ChanRatioChange, ChanRatioChange2>;

/// An operator of the signed form image against reference, where it has one.
template <class Operator>
Operator Make() {
  if constexpr (kIsOneOf<Operator, TCGNChange, TCSBChange>) {
    return Operator("QuickBird", "QuickBird", eDIFF_FORWARD);
  } else if constexpr (std::is_constructible_v<Operator, DiffType2>) {
    return Operator(eDIFF2_SIGNED);
  } else {
    return Operator(eDIFF_FORWARD);
  }
}

/// Sets the parameter that `Observe` sees, to 1 or 2.
template <class Operator>
void Set(Operator& op, int value) {
  if constexpr (std::is_same_v<Operator, SingleChange>) {
    op.SetType(static_cast<DiffType>(value));
  } else {
    op.SetNoData(static_cast<float>(value));
  }
}

template <class Operator>
Operator Make(int value) {
  auto op = Make<Operator>();
  Set(op, value);
  return op;
}

// ---- rasters

constexpr std::uint32_t kImageChannels = 4;
constexpr std::uint32_t kOutChannels = 8;
constexpr int kImageValue = 10;
constexpr int kReferenceValue = 11;

/// A raster whose whole buffer holds one number in elements of the type `readAs`. Its margins leave room for
/// elements that are wider than its own.
struct Tile : Raster {
  Tile(const DataType& type, std::uint32_t channels, int number, const DataType& readAs)
      : Raster(RasterInfo(3, 2, channels, type), {4, 4}) {
    FillBytes(*this);
    tests::WithPixelType(readAs, [&]<class T>() {
      std::fill_n(reinterpret_cast<T*>(data), dataSize / sizeof(T), static_cast<T>(number));
    });
  }
  Tile(const DataType& type, std::uint32_t channels, int number) : Tile(type, channels, number, type) {}

  /// The first sample of pixel (0, 0).
  double First() const {
    double value = 0.0;
    tests::WithPixelType(dataType, [&]<class T>() {
      value = static_cast<double>(reinterpret_cast<const T*>(data)[FirstElement()]);
    });
    return value;
  }

 private:
  std::size_t FirstElement() const {
    return std::size_t{marginY * bufferWidth + marginX} * channels * (dataType.isComplex ? 2 : 1);
  }
};

/// The types of image, reference and output.
struct Types {
  DataType image = tessel::eDT_16S;
  DataType reference = tessel::eDT_16S;
  DataType out = tessel::eDT_16S;
};

/// An image, a reference and an output that are fit for each operator.
template <class Operator>
struct Dates {
  Tile image, reference, out;

  explicit Dates(const Types& types)
      : image(types.image, kImageChannels, kImageValue),
        reference(types.reference, kImageChannels, kReferenceValue,
                  kIsOfThreeTypes<Operator> ? types.reference : types.image),
        out(types.out, kOutChannels, tests::kUnwritten) {}

  void Run(const Operator& op, Mask* mask) { tests::Run(op, &image, &reference, mask, &out); }
};

/// The parameter of `Set` that the inner processor runs with: written to an excluded pixel, or the direction
/// of the difference.
template <class Operator>
int Observe(const Operator& op, const Types& types = {}) {
  Dates<Operator> dates(types);
  Mask mask(3, 2, {4, 4}, std::is_same_v<Operator, SingleChange>);
  dates.Run(op, &mask);
  if (std::is_same_v<Operator, SingleChange>) return dates.out.First() > 0 ? eDIFF_FORWARD : eDIFF_BACKWARD;
  return static_cast<int>(dates.out.First());
}

template <class Operator>
class ChangeFrame : public ::testing::Test {};
TYPED_TEST_SUITE(ChangeFrame, AllOperators, );

// ---- parameters

TYPED_TEST(ChangeFrame, ParameterSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ChangeFrame, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheImageChanges) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, {.image = tessel::eDT_32F, .reference = tessel::eDT_32F}), 2);
  EXPECT_EQ(Observe(op), 2);
}

TYPED_TEST(ChangeFrame, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheOutputChanges) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, {.out = tessel::eDT_32F}), 2);
  EXPECT_EQ(Observe(op), 2);
}

TYPED_TEST(ChangeFrame, ProcessorIsOfTheTypesOfEachCall) {
  const auto op = Make<TypeParam>(1);
  for (const PixelType& image : tests::kShortPixelTypes) {
    for (const PixelType& out : tests::kShortPixelTypes)
      EXPECT_EQ(Observe(op, {image.element, image.element, out.element}), 1) << image << ' ' << out;
  }
}

TYPED_TEST(ChangeFrame, CopyMadeBeforeTheFirstProcessIsIndependent) {
  auto original = Make<TypeParam>(1);
  TypeParam copy(original);
  auto assigned = Make<TypeParam>(2);
  assigned = original;
  Set(original, 2);
  EXPECT_EQ(Observe(copy), 1);
  EXPECT_EQ(Observe(assigned), 1);
  EXPECT_EQ(Observe(original), 2);
}

TYPED_TEST(ChangeFrame, NullMaskExcludesNothing) {
  auto op = Make<TypeParam>(2);
  Dates<TypeParam> masked({}), unmasked({});
  Mask mask(3, 2, {4, 4}, true);
  masked.Run(op, &mask);
  unmasked.Run(op, nullptr);
  EXPECT_EQ(tests::Bytes(masked.out), tests::Bytes(unmasked.out));
  EXPECT_NE(unmasked.out.First(), tests::kUnwritten);
}

TYPED_TEST(ChangeFrame, HeightOf0WritesNothingAndDoesNotLookAtTheOutputsGeometry) {
  Raster image(RasterInfo(3, 0, kImageChannels, tessel::eDT_16S), {}, nullptr);
  Raster reference(RasterInfo(3, 5, kImageChannels, tessel::eDT_16S), {}, nullptr);
  Raster out(RasterInfo(4000000000u, 4000000000u, 0, tessel::eDT_16S), {4000000000u, 1}, nullptr);
  const auto op = Make<TypeParam>(1);
  tests::Run(op, &image, &reference, nullptr, &out);
  Mask mask(0, 0);
  tests::Run(op, &image, &reference, &mask, &out);
  Dates<TypeParam> dates({});
  FillBytes(dates.out);
  tests::Run(op, &image, &dates.reference, nullptr, &dates.out);
  EXPECT_TRUE(IsUntouched(dates.out));
}

// ---- failed dispatch

/// A call that the dispatcher refuses, for the type of the image or of the output.
template <class Operator>
void FailToDispatch(const Operator& op, bool forImage) {
  Dates<Operator> dates({});
  FillBytes(dates.out);
  Raster bits(RasterInfo(3, 2, kOutChannels, tessel::eDT_BIT), {4, 4});
  FillBytes(bits);
  Raster* const image = forImage ? &bits : static_cast<Raster*>(&dates.image);
  Raster* const out = forImage ? static_cast<Raster*>(&dates.out) : &bits;
  const char* const message =
      kIsOfThreeTypes<Operator> ? "Invalid type requested." : "Invalid type to dispatch.";
  EXPECT_TRUE(Throws<Exception>(message, [&] { tests::Run(op, image, &dates.reference, nullptr, out); }));
  EXPECT_TRUE(IsUntouched(*out));
}

TYPED_TEST(ChangeFrame, ObjectWorksAfterAFailedDispatch) {
  const auto op = Make<TypeParam>(1);
  FailToDispatch(op, true);
  FailToDispatch(op, false);
  FailToDispatch(op, true);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ChangeFrame, ObjectThatHadRunWorksAfterAFailedDispatchWithTheNewParameter) {
  for (const bool forImage : {true, false}) {
    auto op = Make<TypeParam>(1);
    EXPECT_EQ(Observe(op), 1);
    Set(op, 2);
    FailToDispatch(op, forImage);
    EXPECT_EQ(Observe(op), 2);
  }
}

TYPED_TEST(ChangeFrame, ObjectCanBeDestroyedAfterAFailedDispatch) {
  for (const bool forImage : {true, false}) {
    const auto op = std::make_unique<TypeParam>(Make<TypeParam>(1));
    EXPECT_EQ(Observe(*op), 1);
    FailToDispatch(*op, forImage);
  }
}

TYPED_TEST(ChangeFrame, ObjectCanBeDestroyedThroughItsInterface) {
  using Interface = std::conditional_t<std::is_base_of_v<IChange, TypeParam>, IChange, IChangeProcessor>;
  auto op = std::make_unique<TypeParam>(Make<TypeParam>(1));
  EXPECT_EQ(Observe(*op), 1);
  const std::unique_ptr<Interface> owner(std::move(op));
  Dates<TypeParam> dates({});
  tests::Run(*owner, &dates.image, &dates.reference, nullptr, &dates.out);
  EXPECT_NE(dates.out.First(), tests::kUnwritten);
}

// ---- threads

TYPED_TEST(ChangeFrame, TwoObjectsRunOnTwoThreadsAtOnce) {
  const auto work = [](int value, bool* isRight) {
    const auto op = Make<TypeParam>(value);
    for (int i = 0; i < 200; ++i) {
      const PixelType& out = tests::kShortPixelTypes[static_cast<std::size_t>(i / 10 % 4)];
      *isRight = *isRight && Observe(op, {.out = out.element}) == value;
    }
  };
  bool isFirstRight = true, isSecondRight = true;
  std::thread first(work, 1, &isFirstRight), second(work, 2, &isSecondRight);
  first.join();
  second.join();
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

// ---- operators of two types

template <class Operator>
class ChangeFrameOfTwoTypes : public ::testing::Test {};
TYPED_TEST_SUITE(ChangeFrameOfTwoTypes, TwoTypeOperators, );

TYPED_TEST(ChangeFrameOfTwoTypes, AllPairsAndTheirComplexVariantsAreDispatched) {
  const auto op = Make<TypeParam>(1);
  for (const PixelType& image : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes) {
      EXPECT_EQ(Observe(op, {image.element, image.element, out.element}), 1) << image << ' ' << out;
      const Types complex = {DataType(image.element, true), DataType(image.element, true),
                             DataType(out.element, true)};
      EXPECT_EQ(Observe(op, complex), 1) << image << ' ' << out;
    }
  }
}

TYPED_TEST(ChangeFrameOfTwoTypes, ImageOrOutputOfNoPixelTypeIsAnInvalidTypeToDispatch) {
  const auto op = Make<TypeParam>(1);
  Dates<TypeParam> dates({});
  FillBytes(dates.out);
  for (const DataType type : {DataType(), DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true)}) {
    Raster odd(RasterInfo(3, 2, kOutChannels, type), {4, 4});
    FillBytes(odd);
    const auto asImage = [&] { op.Process(&odd, &dates.reference, nullptr, &dates.out); };
    const auto asOutput = [&] { op.Process(&dates.image, &dates.reference, nullptr, &odd); };
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", asImage));
    EXPECT_TRUE(Throws<Exception>("Invalid type to dispatch.", asOutput));
    EXPECT_TRUE(IsUntouched(dates.out) && IsUntouched(odd));
  }
}

/// The reference is compared against the remembered type of the image, so that another one never agrees.
TYPED_TEST(ChangeFrameOfTwoTypes, ReferenceOfAnotherTypeThanTheImageTakesNewParametersOnEveryCall) {
  for (const DataType other : {DataType(tessel::eDT_32F), DataType(tessel::eDT_8U), DataType(tessel::eDT_BIT),
                               DataType(tessel::eDT_16S, true)}) {
    auto op = Make<TypeParam>(1);
    const Types types = {.reference = other};
    EXPECT_EQ(Observe(op, types), 1);
    Set(op, 2);
    EXPECT_EQ(Observe(op, types), 2);
    Set(op, 1);
    EXPECT_EQ(Observe(op, types), 1);
    EXPECT_EQ(Observe(op, types), 1);
  }
}

TYPED_TEST(ChangeFrameOfTwoTypes, ReferenceOfTheImagesTypeAfterOneOfAnotherKeepsTheProcessor) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op, {.reference = tessel::eDT_32F}), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ChangeFrameOfTwoTypes, ComplexVariantOfATypeIsAnotherType) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op, {.out = DataType(tessel::eDT_16S, true)}), 2);
  const DataType complex(tessel::eDT_16S, true);
  Set(op, 1);
  EXPECT_EQ(Observe(op, {.image = complex, .reference = complex, .out = complex}), 1);
}

// ---- operators of three types

template <class Operator>
class ChangeFrameOfThreeTypes : public ::testing::Test {
 protected:
  /// The message of the failure, or an empty string.
  std::string MessageOf(Raster* image, Raster* reference, Raster* out) const {
    try {
      tests::Run(op, image, reference, nullptr, out);
    } catch (const Exception& failure) {
      return failure.what();
    }
    return "";
  }

  const Operator op = Make<Operator>(1);
  Tile shorts{tessel::eDT_16S, kImageChannels, kImageValue};
  Tile out{tessel::eDT_16S, kImageChannels, tests::kUnwritten};
  Tile complex{DataType(tessel::eDT_16S, true), kImageChannels, kImageValue};
  Tile ints{tessel::eDT_32S, kImageChannels, kImageValue};
  /// A complex raster that cannot be read: whoever interprets it faults.
  Raster unreadable{RasterInfo(3, 2, kImageChannels, DataType(tessel::eDT_16S, true)), {4, 4}, nullptr};
};
TYPED_TEST_SUITE(ChangeFrameOfThreeTypes, ThreeTypeOperators, );

TYPED_TEST(ChangeFrameOfThreeTypes, GuardsTestImageReferenceOutputAndComplexOutputInThisOrder) {
  Raster* const unreadable = &this->unreadable;
  Raster* const complex = &this->complex;
  const char* const noImage = "poRasterIn is invalid pointer";
  const char* const noReference = "poRasterRef is invalid pointer";
  EXPECT_EQ(this->MessageOf(nullptr, nullptr, nullptr), noImage);
  EXPECT_EQ(this->MessageOf(nullptr, unreadable, complex), noImage);
  EXPECT_EQ(this->MessageOf(unreadable, nullptr, nullptr), noReference);
  EXPECT_EQ(this->MessageOf(unreadable, nullptr, complex), noReference);
  EXPECT_EQ(this->MessageOf(unreadable, unreadable, nullptr), "poRasterOut is invalid pointer");
  EXPECT_EQ(this->MessageOf(unreadable, unreadable, complex), "Output cannot be complex");
  EXPECT_EQ(this->MessageOf(&this->ints, &this->ints, complex), "Output cannot be complex");
  EXPECT_EQ(this->complex.First(), kImageValue);
}

TYPED_TEST(ChangeFrameOfThreeTypes, FailedGuardLeavesTheProcessorAsItWas) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_THROW(tests::Run(op, &this->shorts, nullptr, nullptr, &this->out), Exception);
  EXPECT_THROW(tests::Run(op, &this->ints, &this->ints, nullptr, &this->complex), Exception);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ChangeFrameOfThreeTypes, ParameterSetAfterTheFirstProcessIsTakenWhenTheTypeOfTheReferenceChanges) {
  auto op = Make<TypeParam>(1);
  const Types types = {.reference = tessel::eDT_32F};
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op, types), 2);
  Set(op, 1);
  EXPECT_EQ(Observe(op, types), 2);
  EXPECT_EQ(Observe(op), 1);
}

TYPED_TEST(ChangeFrameOfThreeTypes, AllTriplesAreDispatched) {
  const auto op = Make<TypeParam>(1);
  for (const PixelType& image : tests::kShortPixelTypes) {
    for (const PixelType& reference : tests::kShortPixelTypes) {
      for (const PixelType& out : tests::kShortPixelTypes)
        EXPECT_EQ(Observe(op, {image.element, reference.element, out.element}), 1)
            << image << ' ' << reference << ' ' << out;
    }
  }
}

TYPED_TEST(ChangeFrameOfThreeTypes, TypesOutsideTheShortListAreInvalid) {
  std::vector<DataType> invalid = {DataType(), DataType(tessel::eDT_BIT)};
  for (const PixelType& type : tests::kPixelTypes)
    if (!tests::IsShortPixelType(type)) invalid.emplace_back(type.element);
  ASSERT_EQ(invalid.size(), 8u);
  FillBytes(this->out);
  for (const DataType& type : invalid) {
    Raster odd(RasterInfo(3, 2, kImageChannels, type), {4, 4});
    FillBytes(odd);
    EXPECT_EQ(this->MessageOf(&odd, &this->shorts, &this->out), "Invalid type requested.");
    EXPECT_EQ(this->MessageOf(&this->shorts, &odd, &this->out), "Invalid type requested.");
    EXPECT_EQ(this->MessageOf(&this->shorts, &this->shorts, &odd), "Invalid type requested.");
    EXPECT_TRUE(IsUntouched(this->out) && IsUntouched(odd));
  }
}

TYPED_TEST(ChangeFrameOfThreeTypes, ComplexRastersOfATypeOutsideTheShortListAreInvalidToo) {
  for (const PixelType& type : tests::kPixelTypes) {
    if (tests::IsShortPixelType(type)) continue;
    Tile odd(DataType(type.element, true), kImageChannels, kImageValue);
    EXPECT_EQ(this->MessageOf(&odd, &this->shorts, &this->out), "Invalid type requested.") << type;
    EXPECT_EQ(this->MessageOf(&this->shorts, &odd, &this->out), "Invalid type requested.") << type;
  }
}

TYPED_TEST(ChangeFrameOfThreeTypes, ObjectWorksAfterAFailedDispatchForTheReference) {
  auto op = Make<TypeParam>(1);
  EXPECT_EQ(Observe(op), 1);
  Set(op, 2);
  EXPECT_THROW(tests::Run(op, &this->shorts, &this->ints, nullptr, &this->out), Exception);
  EXPECT_EQ(Observe(op), 2);
}

TYPED_TEST(ChangeFrameOfThreeTypes, ComplexImageAndReferenceGiveWhatTheirRealPartsGive) {
  for (const bool isImageComplex : {false, true}) {
    Dates<TypeParam> real({});
    Tile image(DataType(tessel::eDT_16S, isImageComplex), kImageChannels, kImageValue);
    Tile reference(DataType(tessel::eDT_16S, true), kImageChannels, kReferenceValue);
    Tile fromComplex(tessel::eDT_16S, kOutChannels, tests::kUnwritten);
    auto* const elements = reinterpret_cast<short*>(reference.data);
    for (std::size_t i = 1; i < reference.dataSize / sizeof(short); i += 2) elements[i] = -999;
    real.Run(this->op, nullptr);
    tests::Run(this->op, &image, &reference, nullptr, &fromComplex);
    EXPECT_EQ(tests::Bytes(real.out), tests::Bytes(fromComplex));
  }
}

TYPED_TEST(ChangeFrameOfThreeTypes, CacheHoldsTheTypesOfTheInterpretedRasters) {
  auto op = Make<TypeParam>(1);
  const DataType complex(tessel::eDT_16S, true);
  EXPECT_EQ(Observe(op, {.image = complex}), 1);
  Set(op, 2);
  EXPECT_EQ(Observe(op), 1);
  EXPECT_EQ(Observe(op, {.image = complex, .reference = complex}), 1);
  EXPECT_EQ(Observe(op, {.reference = complex}), 1);
}

/// Bytes that the process has allocated and not freed. Does not move where a sanitizer has its own allocator,
/// which then looks for leaks itself.
std::size_t AllocatedBytes() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

TYPED_TEST(ChangeFrameOfThreeTypes, InterpretedRastersAreFreedAlsoWhenTheDispatchFails) {
  const std::uint32_t size = 1 << 20;
  Raster large(RasterInfo(size, 1, 1, DataType(tessel::eDT_16S, true)), {});
  Raster largeOut(RasterInfo(size, 1, 1, tessel::eDT_16S), {});
  FillBytes(large);
  tests::Run(this->op, &large, &large, nullptr, &largeOut);
  const std::size_t before = AllocatedBytes();
  tests::Run(this->op, &large, &large, nullptr, &largeOut);
  EXPECT_LT(AllocatedBytes(), before + size);
  EXPECT_EQ(this->MessageOf(&large, &large, &this->ints), "Invalid type requested.");
  EXPECT_LT(AllocatedBytes(), before + size);
}

// ---- operators with a no-data test

template <class Operator>
class ChangeFrameNoData : public ::testing::Test {
 protected:
  static constexpr int kNoData = 5;

  /// An operator that writes `kNoData`, with vectors for the test.
  static Operator Testing(std::vector<float> imgNoData, std::vector<float> refNoData) {
    auto op = Make<Operator>();
    op.SetNoData(kNoData);
    op.SetImgNoData(std::move(imgNoData));
    op.SetRefNoData(std::move(refNoData));
    return op;
  }

  /// True if the first sample of a valid pixel is no-data.
  static bool Hits(const Operator& op) {
    Dates<Operator> dates({});
    dates.Run(op, nullptr);
    return dates.out.First() == kNoData;
  }

  const std::vector<float> none = {0, 0, 0, 0};
  const std::vector<float> image = {kImageValue, 0, 0, 0};
  const std::vector<float> reference = {kReferenceValue, 0, 0, 0};
};
TYPED_TEST_SUITE(ChangeFrameNoData, NoDataOperators, );

TYPED_TEST(ChangeFrameNoData, EitherVectorExcludes) {
  EXPECT_FALSE(this->Hits(this->Testing(this->none, this->none)));
  EXPECT_TRUE(this->Hits(this->Testing(this->image, this->none)));
  EXPECT_TRUE(this->Hits(this->Testing(this->none, this->reference)));
}

TYPED_TEST(ChangeFrameNoData, ImgNoDataOfAnotherLengthSwitchesTheTestOffForBothRasters) {
  for (const std::size_t length : {0u, 1u, 2u, 3u, 5u, 8u}) {
    const std::vector<float> values(length, kImageValue);
    EXPECT_FALSE(this->Hits(this->Testing(values, this->reference))) << length;
  }
}

TYPED_TEST(ChangeFrameNoData, LengthOfRefNoDataIsNotConsulted) {
  EXPECT_TRUE(this->Hits(this->Testing(this->none, {kReferenceValue, 0, 0, 0, 7, 7})));
  EXPECT_FALSE(this->Hits(this->Testing({}, {})));
  EXPECT_FALSE(this->Hits(this->Testing({0, 0}, {kReferenceValue})));
}

TYPED_TEST(ChangeFrameNoData, VectorsAreCopiedByValue) {
  std::vector<float> imgNoData = this->image, refNoData = this->reference;
  auto original = this->Testing(imgNoData, this->none);
  const TypeParam copy(original);
  auto assigned = this->Testing({}, {});
  assigned = original;
  imgNoData.assign(4, 0.0f);
  original.SetImgNoData(imgNoData);
  original.SetRefNoData(refNoData);
  refNoData.clear();
  EXPECT_TRUE(this->Hits(copy));
  EXPECT_TRUE(this->Hits(assigned));
  EXPECT_TRUE(this->Hits(original));
  EXPECT_EQ(original.refNoData, this->reference);
}

TYPED_TEST(ChangeFrameNoData, ProcessorKeepsTheVectorsOfItsBuild) {
  auto op = this->Testing(this->image, this->none);
  EXPECT_TRUE(this->Hits(op));
  op.SetImgNoData(this->none);
  EXPECT_TRUE(this->Hits(op));
  op.SetImgNoData({});
  EXPECT_TRUE(this->Hits(op));
  EXPECT_EQ(Observe(op, {.out = tessel::eDT_32F}), this->kNoData);
  EXPECT_FALSE(this->Hits(op));
}

}  // namespace
}  // namespace orvik::changedetection
