#include "processes/gridmill/frame/frame.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>
#include <malloc.h>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/exceptions/exceptions.h"
#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"

// The contract of the frame, on toy operators whose processors record what happens to them.
namespace orvik::frame {
namespace {

using tessel::DataType;
using tessel::Raster;
using tessel::RasterContext;
using tessel::RasterInfo;

// ---- toys

/// What the processors of all toys went through since the start of a test.
struct Record {
  std::vector<std::vector<DataType>> built;
  int alive = 0;
  int deleted = 0;
};
Record record;

struct ToyParams {
  virtual ~ToyParams() = default;
  int value = 1;
};

class IToy {
 public:
  IToy() { ++record.alive; }
  IToy(const IToy&) = delete;
  IToy& operator=(const IToy&) = delete;
  virtual ~IToy() {
    --record.alive;
    ++record.deleted;
  }
  virtual int Value() const = 0;
};

template <class... Types>
class Toy : public IToy, public ToyParams {
 public:
  Toy() { record.built.push_back({DataType::Of<Types>()...}); }
  int Value() const override { return value; }
};

template <class In, class Out>
using Toy2 = Toy<In, Out>;
template <class In, class Ref, class Out>
using Toy3 = Toy<In, Ref, Out>;

struct ToyCreationPolicy {
  template <class In, class Out>
  static IToy* Create(bool) {
    return new Toy<In, Out>();
  }
};

using ExtendedPair = Extended<typedispatch::Factory2Template<Toy2, IToy>, typeconv::priv::FullTypeList>;
using ExtendedComplexPair =
    Extended<typedispatch::Factory2Template<Toy2, IToy>, typeconv::priv::FullTypeList, true>;
using ExtendedTriple = Extended<typedispatch::Factory3Template<Toy3, IToy>, typeconv::priv::ShortTypeList>;
using TwoLevelPair = TwoLevel<ToyCreationPolicy>;

/// An operator in the manner of the library's, with any policy.
template <class Policy, std::size_t N>
class ToyOperator : public ToyParams {
 public:
  /// Calls the frame with `run`, which gets the processor and the rasters.
  template <class Run>
  void Process(const Rasters<N>& rasters, Run run) const {
    frame::Process<Policy>(*this, cache_, rasters, run);
  }
  /// Calls the frame and returns the parameter that the processor ran with.
  int Process(const Rasters<N>& rasters) const {
    int result = 0;
    Process(rasters, [&](const IToy& processor, const Rasters<N>&) { result = processor.Value(); });
    return result;
  }

  mutable ProcessorCache<IToy, N> cache_;
};

/// The defaults with a dispatcher, and one deviation each.
template <class DispatcherType>
struct Default : Defaults<ToyParams> {
  using Dispatcher = DispatcherType;
};
struct GuardsRasters : Default<ExtendedPair> {
  static constexpr Guards guards = Guards::kRasters;
};
struct GuardsThreeRasters : Default<ExtendedTriple> {
  static constexpr Guards guards = Guards::kRasters;
};
struct GuardsInputChannels : Default<ExtendedPair> {
  static constexpr Guards guards = Guards::kInputChannels;
};
struct Interprets : GuardsRasters {
  static constexpr bool interprets = true;
};
struct InterpretsThree : GuardsThreeRasters {
  static constexpr bool interprets = true;
};
struct ComparesInput : Default<TwoLevelPair> {
  static constexpr Compares compares = Compares::kInput;
};
struct ComparesNone : Default<TwoLevelPair> {
  static constexpr Compares compares = Compares::kNone;
};
struct ComparesReferenceAgainstInput : Default<TwoLevelPair> {
  static constexpr Compares compares = Compares::kReferenceAgainstInput;
};
struct SelectsInputTwice : Default<ExtendedPair> {
  static constexpr Guards guards = Guards::kInputChannels;
  static constexpr Compares compares = Compares::kInput;
  static constexpr Selects selects = Selects::kInputTwice;
};
struct SelectsInputTwiceTwoLevel : Default<TwoLevelPair> {
  static constexpr Compares compares = Compares::kNone;
  static constexpr Selects selects = Selects::kInputTwice;
};
struct LeavesAllocated : Default<ExtendedPair> {
  static constexpr Replaced replaced = Replaced::kLeftAllocated;
};
struct HandsOverChannels : Interprets {
  template <class Rasters>
  static void HandOver(const ToyParams& from, ToyParams& to, const Rasters& rasters) {
    to.value =
        100 * from.value + static_cast<int>(rasters[0]->channels) + (rasters[0]->dataType.isComplex ? 50 : 0);
  }
};
struct HandOverFails : Default<ExtendedPair> {
  template <class Rasters>
  static void HandOver(const ToyParams& from, ToyParams&, const Rasters&) {
    if (from.value == 13) throw std::runtime_error("hand-over");
  }
};

/// A small raster of the given type with defined samples.
struct Tile : Raster {
  explicit Tile(DataType type, std::uint32_t channels = 1)
      : Raster(RasterInfo(2, 2, channels, type), RasterContext()) {
    std::fill_n(data, dataSize, static_cast<unsigned char>(0));
  }
};

/// A complex raster that cannot be read: whoever interprets it faults.
struct Unreadable : Raster {
  Unreadable() : Raster(RasterInfo(2, 2, 1, DataType(tessel::eDT_32F, true)), RasterContext(), nullptr) {}
};

/// The message of the `Exception` that `call` throws, which is of no derived type.
template <class Call>
std::string MessageOf(const Call& call) {
  try {
    call();
  } catch (const Exception& failure) {
    EXPECT_EQ(typeid(failure), typeid(Exception));
    return failure.what();
  }
  return "no failure";
}

class Frame : public ::testing::Test {
 protected:
  Frame() { record = Record(); }

  Tile bytes{tessel::eDT_8U};
  Tile moreBytes{tessel::eDT_8U};
  Tile shorts{tessel::eDT_16S};
  Tile words{tessel::eDT_16U};
  Tile floats{tessel::eDT_32F};
  Tile bits{tessel::eDT_BIT};
  Tile complexFloats{DataType(tessel::eDT_32F, true)};
  Tile complexBytes{DataType(tessel::eDT_8U, true)};
};

/// The number of processors that `call` builds.
template <class Call>
std::size_t BuildsOf(const Call& call) {
  const std::size_t before = record.built.size();
  call();
  return record.built.size() - before;
}

// ---- guards

TEST_F(Frame, GuardsOfTwoRastersTestInputOutputAndComplexOutputInThisOrder) {
  const ToyOperator<GuardsRasters, 2> op;
  EXPECT_EQ(MessageOf([&] { op.Process({nullptr, nullptr}); }), "poRasterIn is invalid pointer");
  EXPECT_EQ(MessageOf([&] { op.Process({nullptr, &complexFloats}); }), "poRasterIn is invalid pointer");
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, nullptr}); }), "poRasterOut is invalid pointer");
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, &complexFloats}); }), "Output cannot be complex");
  EXPECT_EQ(MessageOf([&] { op.Process({&bytes, &floats}); }), "no failure");
}

TEST_F(Frame, GuardsOfThreeRastersTestInputReferenceOutputAndComplexOutputInThisOrder) {
  const ToyOperator<GuardsThreeRasters, 3> op;
  EXPECT_EQ(MessageOf([&] { op.Process({nullptr, nullptr, nullptr}); }), "poRasterIn is invalid pointer");
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, nullptr, nullptr}); }), "poRasterRef is invalid pointer");
  EXPECT_EQ(MessageOf([&] {
              op.Process({&bits, nullptr, &complexFloats});
            }),
            "poRasterRef is invalid pointer");
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, &bits, nullptr}); }), "poRasterOut is invalid pointer");
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, &bits, &complexFloats}); }), "Output cannot be complex");
  EXPECT_EQ(MessageOf([&] { op.Process({&bytes, &shorts, &floats}); }), "no failure");
}

TEST_F(Frame, GuardsOfInputAndChannelsTestTheInputThenItsChannelsAndNothingElse) {
  const ToyOperator<GuardsInputChannels, 2> op;
  Tile noChannels(tessel::eDT_BIT, 0);
  EXPECT_EQ(MessageOf([&] { op.Process({nullptr, &floats}); }), "poRasterIn is invalid pointer");
  EXPECT_EQ(MessageOf([&] {
              op.Process({&noChannels, nullptr});
            }),
            "poRasterIn must have minimum 1 channels.");
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, &floats}); }), "Invalid type requested.");
  EXPECT_EQ(MessageOf([&] { op.Process({&bytes, &complexFloats}); }), "Invalid type requested.");
}

TEST_F(Frame, WithoutGuardsAComplexOutputAndAPixelOfNoChannelsPass) {
  const ToyOperator<Default<TwoLevelPair>, 2> op;
  Tile noChannels(tessel::eDT_8U, 0);
  EXPECT_EQ(MessageOf([&] { op.Process({&noChannels, &complexFloats}); }), "no failure");
}

TEST_F(Frame, AComplexOutputIsRefusedBeforeTheInputIsInterpreted) {
  const ToyOperator<Interprets, 2> op;
  Unreadable unreadable;
  EXPECT_EQ(MessageOf([&] { op.Process({&unreadable, &complexFloats}); }), "Output cannot be complex");
  EXPECT_EQ(MessageOf([&] { op.Process({&unreadable, nullptr}); }), "poRasterOut is invalid pointer");
}

TEST_F(Frame, ARefusedCallLeavesTheProcessorAndItsTypes) {
  const ToyOperator<GuardsRasters, 2> op;
  op.Process({&bytes, &floats});
  EXPECT_EQ(MessageOf([&] { op.Process({&bytes, &complexFloats}); }), "Output cannot be complex");
  EXPECT_EQ(record.alive, 1);
  EXPECT_EQ(BuildsOf([&] { op.Process({&bytes, &floats}); }), 0u);
}

// ---- interpretation

TEST_F(Frame, AComplexInputIsReplacedByARealOneForTheRestOfTheCall) {
  const ToyOperator<Interprets, 2> op;
  reinterpret_cast<float*>(complexFloats.data)[2] = 7.0f;
  op.Process({&complexFloats, &bytes}, [&](const IToy&, const Rasters<2>& r) {
    EXPECT_NE(r[0], &complexFloats);
    EXPECT_EQ(r[0]->dataType, DataType(tessel::eDT_32F));
    EXPECT_EQ(reinterpret_cast<float*>(r[0]->data)[1], 7.0f);
    EXPECT_EQ(r[1], &bytes);
  });
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_32F, tessel::eDT_8U}));
}

TEST_F(Frame, ARealInputIsHandedOnAsItIs) {
  const ToyOperator<Interprets, 2> op;
  op.Process({&floats, &bytes}, [&](const IToy&, const Rasters<2>& r) { EXPECT_EQ(r[0], &floats); });
}

TEST_F(Frame, InputAndReferenceAreInterpretedEachByItself) {
  const ToyOperator<InterpretsThree, 3> op;
  op.Process({&complexFloats, &complexBytes, &shorts}, [&](const IToy&, const Rasters<3>& r) {
    EXPECT_EQ(r[0]->dataType, DataType(tessel::eDT_32F));
    EXPECT_EQ(r[1]->dataType, DataType(tessel::eDT_8U));
    EXPECT_EQ(r[2], &shorts);
  });
  op.Process({&floats, &complexBytes, &shorts}, [&](const IToy&, const Rasters<3>& r) {
    EXPECT_EQ(r[0], &floats);
    EXPECT_EQ(r[1]->dataType, DataType(tessel::eDT_8U));
  });
}

TEST_F(Frame, TheTypeComparisonSeesTheInterpretedRasters) {
  const ToyOperator<Interprets, 2> op;
  op.Process({&floats, &bytes});
  EXPECT_EQ(BuildsOf([&] { op.Process({&complexFloats, &bytes}); }), 0u);
}

TEST_F(Frame, WithoutInterpretationAComplexInputIsHandedOnAsItIs) {
  const ToyOperator<Default<ExtendedComplexPair>, 2> op;
  Unreadable unreadable;
  op.Process({&unreadable, &bytes}, [&](const IToy&, const Rasters<2>& r) { EXPECT_EQ(r[0], &unreadable); });
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_32F, tessel::eDT_8U}));
}

/// Bytes that the process has allocated and not freed. Does not move where a sanitizer has its own allocator,
/// which then looks for leaks itself.
std::size_t AllocatedBytes() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

TEST_F(Frame, AnInterpretedRasterIsFreedAlsoWhenTheRunThrows) {
  const ToyOperator<Interprets, 2> op;
  op.Process({&floats, &bytes});
  const std::uint32_t size = 1 << 20;
  Raster large(RasterInfo(size, 1, 1, DataType(tessel::eDT_32F, true)), RasterContext());
  std::fill_n(large.data, large.dataSize, static_cast<unsigned char>(0));
  const std::size_t before = AllocatedBytes();
  bool ran = false;
  EXPECT_THROW(op.Process({&large, &bytes},
                          [&](const IToy&, const Rasters<2>&) {
                            ran = true;
                            throw std::runtime_error("run");
                          }),
               std::runtime_error);
  EXPECT_TRUE(ran);
  EXPECT_LT(AllocatedBytes(), before + size);
  EXPECT_EQ(BuildsOf([&] { op.Process({&floats, &bytes}); }), 0u);
}

TEST_F(Frame, AnInterpretedRasterIsFreedAlsoWhenTheDispatchFails) {
  const ToyOperator<Interprets, 2> op;
  const std::uint32_t size = 1 << 20;
  Raster large(RasterInfo(size, 1, 1, DataType(tessel::eDT_32F, true)), RasterContext());
  std::fill_n(large.data, large.dataSize, static_cast<unsigned char>(0));
  const std::size_t before = AllocatedBytes();
  EXPECT_EQ(MessageOf([&] { op.Process({&large, &bits}); }), "Invalid type requested.");
  EXPECT_LT(AllocatedBytes(), before + size);
}

// ---- rebuild

TEST_F(Frame, TheFirstCallBuildsTheProcessorOfTheTypesOfTheRasters) {
  const ToyOperator<Default<ExtendedPair>, 2> extended;
  extended.Process({&bytes, &floats});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_8U, tessel::eDT_32F}));
  const ToyOperator<Default<TwoLevelPair>, 2> twoLevel;
  twoLevel.Process({&shorts, &bytes});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_8U}));
  const ToyOperator<Default<ExtendedTriple>, 3> triple;
  triple.Process({&shorts, &bytes, &floats});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_8U, tessel::eDT_32F}));
}

TEST_F(Frame, TheTwoLevelDispatcherOfThreeRastersTakesInputAndOutput) {
  const ToyOperator<Default<TwoLevelPair>, 3> op;
  op.Process({&shorts, &bytes, &floats});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_32F}));
}

TEST_F(Frame, OtherRastersOfTheSameTypesKeepTheProcessor) {
  const ToyOperator<Default<ExtendedPair>, 2> op;
  op.Process({&bytes, &floats});
  EXPECT_EQ(BuildsOf([&] { op.Process({&moreBytes, &floats}); }), 0u);
}

TEST_F(Frame, AnotherInputOrOutputTypeRebuildsAndDeletesTheOldProcessor) {
  const ToyOperator<Default<ExtendedPair>, 2> op;
  op.Process({&bytes, &floats});
  op.Process({&shorts, &floats});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_32F}));
  op.Process({&shorts, &bytes});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_8U}));
  EXPECT_EQ(record.deleted, 2);
  EXPECT_EQ(record.alive, 1);
}

TEST_F(Frame, EachOfThreeTypesIsComparedWithItsOwnRememberedOne) {
  const ToyOperator<Default<ExtendedTriple>, 3> op;
  op.Process({&bytes, &shorts, &floats});
  EXPECT_EQ(BuildsOf([&] { op.Process({&bytes, &shorts, &floats}); }), 0u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&words, &shorts, &floats}); }), 1u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&words, &bytes, &floats}); }), 1u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&words, &bytes, &shorts}); }), 1u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&words, &bytes, &shorts}); }), 0u);
  EXPECT_EQ(record.alive, 1);
}

TEST_F(Frame, ADifferenceInAnyFieldOfATypeRebuilds) {
  const ToyOperator<Default<ExtendedComplexPair>, 2> op;
  op.Process({&floats, &bytes});
  EXPECT_EQ(BuildsOf([&] { op.Process({&complexFloats, &bytes}); }), 1u);
  EXPECT_EQ(record.built[0], record.built[1]);
}

TEST_F(Frame, WhereOnlyTheInputIsComparedTheFirstOutputTypeStays) {
  const ToyOperator<ComparesInput, 2> op;
  op.Process({&bytes, &floats});
  EXPECT_EQ(BuildsOf([&] { op.Process({&bytes, &shorts}); }), 0u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&shorts, &bytes}); }), 1u);
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_8U}));
  EXPECT_EQ(record.alive, 1);
}

TEST_F(Frame, WhereNoTypeIsComparedTheProcessorIsBuiltOnceAndNeverAgain) {
  const ToyOperator<ComparesNone, 2> op;
  op.Process({&bytes, &floats});
  EXPECT_EQ(BuildsOf([&] { op.Process({&shorts, &bytes}); }), 0u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&bits, &bits}); }), 0u);
  EXPECT_EQ(record.deleted, 0);
}

TEST_F(Frame, TheReferenceIsComparedWithTheRememberedInput) {
  const ToyOperator<ComparesReferenceAgainstInput, 3> op;
  op.Process({&bytes, &bytes, &floats});
  EXPECT_EQ(BuildsOf([&] { op.Process({&bytes, &bytes, &floats}); }), 0u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&bytes, &shorts, &floats}); }), 1u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&bytes, &shorts, &floats}); }), 1u) << "the same reference again";
  EXPECT_EQ(BuildsOf([&] {
              op.Process({&bytes, &bytes, &floats});
            }),
            0u)
      << "the reference was never remembered";
  EXPECT_EQ(BuildsOf([&] { op.Process({&shorts, &bytes, &floats}); }), 1u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&shorts, &shorts, &floats}); }), 0u);
  EXPECT_EQ(BuildsOf([&] { op.Process({&shorts, &shorts, &bytes}); }), 1u);
  EXPECT_EQ(record.alive, 1);
}

TEST_F(Frame, WhereTheInputSelectsTwiceTheOutputIsNeverLookedAt) {
  const ToyOperator<SelectsInputTwice, 2> extended;
  extended.Process({&shorts, nullptr});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_16S, tessel::eDT_16S}));
  EXPECT_EQ(BuildsOf([&] { extended.Process({&shorts, &bytes}); }), 0u);
  EXPECT_EQ(BuildsOf([&] { extended.Process({&floats, nullptr}); }), 1u);
  const ToyOperator<SelectsInputTwiceTwoLevel, 2> twoLevel;
  twoLevel.Process({&floats, nullptr});
  EXPECT_EQ(record.built.back(), (std::vector<DataType>{tessel::eDT_32F, tessel::eDT_32F}));
  EXPECT_EQ(BuildsOf([&] { twoLevel.Process({&bytes, nullptr}); }), 0u);
}

TEST_F(Frame, WhereTheInputSelectsTwiceTheRunStillGetsTheOutput) {
  const ToyOperator<SelectsInputTwice, 2> op;
  op.Process({&shorts, &bits}, [&](const IToy&, const Rasters<2>& r) { EXPECT_EQ(r[1], &bits); });
  op.Process({&shorts, nullptr}, [&](const IToy&, const Rasters<2>& r) { EXPECT_EQ(r[1], nullptr); });
}

TEST_F(Frame, AReplacedProcessorThatIsLeftAllocatedIsNotDeleted) {
  IToy* first = nullptr;
  {
    const ToyOperator<LeavesAllocated, 2> op;
    op.Process({&bytes, &floats});
    first = op.cache_.processor;
    op.Process({&shorts, &floats});
    EXPECT_EQ(record.deleted, 0);
    EXPECT_EQ(record.alive, 2);
    EXPECT_NE(op.cache_.processor, first);
  }
  EXPECT_EQ(record.deleted, 1) << "the last one goes with the operator";
  delete first;
}

TEST_F(Frame, AReplacedProcessorIsLeftAllocatedAlsoWhenTheRebuildFails) {
  const ToyOperator<LeavesAllocated, 2> op;
  op.Process({&bytes, &floats});
  const std::unique_ptr<IToy> first(op.cache_.processor);
  EXPECT_EQ(MessageOf([&] { op.Process({&bits, &floats}); }), "Invalid type requested.");
  EXPECT_EQ(record.deleted, 0);
  EXPECT_EQ(op.cache_.processor, nullptr);
}

// ---- hand-over

TEST_F(Frame, TheParametersTravelWhenTheProcessorIsBuilt) {
  ToyOperator<Default<ExtendedPair>, 2> op;
  op.value = 5;
  EXPECT_EQ(op.Process({&bytes, &floats}), 5);
}

TEST_F(Frame, AParameterChangedAfterTheFirstCallTakesEffectWithTheNextChangeOfTypes) {
  // Deliberate: the parameters travel only when a processor is built, and only types decide on that.
  ToyOperator<Default<TwoLevelPair>, 2> op;
  op.value = 5;
  EXPECT_EQ(op.Process({&bytes, &floats}), 5);
  op.value = 6;
  EXPECT_EQ(op.Process({&bytes, &floats}), 5);
  EXPECT_EQ(op.Process({&shorts, &floats}), 6);
}

TEST_F(Frame, APolicysOwnHandOverSeesTheInterpretedRasters) {
  ToyOperator<HandsOverChannels, 2> op;
  op.value = 2;
  Tile threeChannels(DataType(tessel::eDT_32F, true), 3);
  EXPECT_EQ(op.Process({&threeChannels, &bytes}), 203);
}

TEST_F(Frame, AFailedHandOverLeavesNoProcessorBehind) {
  ToyOperator<HandOverFails, 2> op;
  op.Process({&bytes, &floats});
  op.value = 13;
  EXPECT_THROW(op.Process({&shorts, &floats}), std::runtime_error);
  EXPECT_EQ(record.alive, 0);
  EXPECT_EQ(op.cache_.processor, nullptr);
  op.value = 1;
  EXPECT_EQ(BuildsOf([&] { op.Process({&shorts, &floats}); }), 1u);
}

// ---- failed dispatch

template <class Policy>
class FailedDispatch : public Frame {};
using DispatchPolicies = ::testing::Types<Default<ExtendedPair>, Default<TwoLevelPair>>;
TYPED_TEST_SUITE(FailedDispatch, DispatchPolicies);

TYPED_TEST(FailedDispatch, OfTheFirstCallLeavesAnOperatorThatWorks) {
  const ToyOperator<TypeParam, 2> op;
  EXPECT_THROW(op.Process({&this->bits, &this->floats}), Exception);
  EXPECT_THROW(op.Process({&this->floats, &this->bits}), Exception);
  EXPECT_EQ(op.cache_.processor, nullptr);
  op.Process({&this->bytes, &this->floats});
  EXPECT_EQ(record.alive, 1);
}

TYPED_TEST(FailedDispatch, OfALaterCallDeletesTheOldProcessorAndLeavesAnOperatorThatWorks) {
  const ToyOperator<TypeParam, 2> op;
  op.Process({&this->bytes, &this->floats});
  EXPECT_THROW(op.Process({&this->bits, &this->floats}), Exception);
  EXPECT_EQ(record.deleted, 1);
  EXPECT_EQ(record.alive, 0);
  EXPECT_EQ(op.cache_.processor, nullptr);
  EXPECT_EQ(op.cache_.types, Types<2>());
  EXPECT_EQ(BuildsOf([&] { op.Process({&this->bytes, &this->floats}); }), 1u);
  EXPECT_EQ(record.alive, 1);
}

TYPED_TEST(FailedDispatch, IsRepeatedByTheSameCall) {
  const ToyOperator<TypeParam, 2> op;
  op.Process({&this->bytes, &this->floats});
  for (int i = 0; i < 3; ++i) EXPECT_THROW(op.Process({&this->bytes, &this->bits}), Exception);
  EXPECT_EQ(record.deleted, 1);
}

TYPED_TEST(FailedDispatch, LeavesAnOperatorThatCanBeDestroyed) {
  {
    const ToyOperator<TypeParam, 2> op;
    op.Process({&this->bytes, &this->floats});
    EXPECT_THROW(op.Process({&this->bits, &this->floats}), Exception);
  }
  EXPECT_EQ(record.deleted, 1);
  EXPECT_EQ(record.alive, 0);
}

TEST_F(Frame, TheTwoDispatchersFailWithMessagesOfTheirOwn) {
  const ToyOperator<Default<ExtendedPair>, 2> extended;
  EXPECT_EQ(MessageOf([&] { extended.Process({&bits, &bytes}); }), "Invalid type requested.");
  EXPECT_EQ(MessageOf([&] { extended.Process({&complexFloats, &bytes}); }), "Invalid type requested.");
  const ToyOperator<Default<TwoLevelPair>, 2> twoLevel;
  EXPECT_EQ(MessageOf([&] { twoLevel.Process({&bits, &bytes}); }), "Invalid type to dispatch.");
  EXPECT_EQ(MessageOf([&] { twoLevel.Process({&complexFloats, &bytes}); }), "no failure");
}

// ---- copies and the end

TEST_F(Frame, TheDestructorDeletesTheProcessorOnce) {
  {
    const ToyOperator<Default<ExtendedPair>, 2> op;
    op.Process({&bytes, &floats});
  }
  EXPECT_EQ(record.deleted, 1);
  EXPECT_EQ(record.alive, 0);
}

TEST_F(Frame, AnOperatorThatNeverRanHasNothingToDelete) {
  { const ToyOperator<Default<ExtendedPair>, 2> op; }
  EXPECT_EQ(record.deleted, 0);
}

TEST_F(Frame, AnOperatorThatHasNotRunYetCanBeCopied) {
  ToyOperator<Default<ExtendedPair>, 2> op;
  op.value = 5;
  {
    const ToyOperator<Default<ExtendedPair>, 2> copy(op);
    op.value = 6;
    EXPECT_EQ(copy.Process({&bytes, &floats}), 5);
    EXPECT_EQ(op.Process({&bytes, &floats}), 6);
    EXPECT_EQ(record.alive, 2);
  }
  EXPECT_EQ(record.alive, 1);
}

TEST_F(Frame, ACopyIsShallow) {
  // Deliberate: a copy is shallow. It shares the processor, and an assignment does not delete what it
  // overwrites.
  ProcessorCache<IToy, 2> cache;
  cache.processor = new Toy<short, float>();
  cache.types = {tessel::eDT_16S, tessel::eDT_32F};
  ProcessorCache<IToy, 2> copy(cache);
  EXPECT_EQ(copy.processor, cache.processor);
  EXPECT_EQ(copy.types, cache.types);
  copy.processor = nullptr;

  ProcessorCache<IToy, 2> assigned;
  assigned.processor = new Toy<char, char>();
  const std::unique_ptr<IToy> overwritten(assigned.processor);
  assigned = cache;
  EXPECT_EQ(record.deleted, 0);
  EXPECT_EQ(assigned.processor, cache.processor);
  EXPECT_EQ(assigned.types, cache.types);
  assigned.processor = nullptr;
}

TEST_F(Frame, ACopiedProcessorServesTheCopy) {
  ToyOperator<Default<ExtendedPair>, 2> op;
  op.Process({&bytes, &floats});
  ToyOperator<Default<ExtendedPair>, 2> copy(op);
  EXPECT_EQ(BuildsOf([&] { copy.Process({&bytes, &floats}); }), 0u);
  copy.cache_.processor = nullptr;  // both would delete it
}

TEST_F(Frame, DefaultsAreNoGuardsNoInterpretationAllComparedAllSelectingAndDeleted) {
  using Policy = Default<ExtendedPair>;
  static_assert(Policy::guards == Guards::kNone);
  static_assert(!Policy::interprets);
  static_assert(Policy::compares == Compares::kAll);
  static_assert(Policy::selects == Selects::kAll);
  static_assert(Policy::replaced == Replaced::kDeleted);
}

}  // namespace
}  // namespace orvik::frame
