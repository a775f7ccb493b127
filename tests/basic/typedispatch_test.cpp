#include "basic/core/typedispatch/typedispatch.h"

#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/exceptions/exceptions.h"
#include "basic/tessel/datatype.h"

namespace orvik::typedispatch {
namespace {

using tessel::DataType;
using typeconv::priv::FullTypeList;
using typeconv::priv::NullDataType;
using typeconv::priv::ShortTypeList;
using Types = std::vector<DataType>;

/// Says for which types it was made.
struct IProbe {
  virtual ~IProbe() = default;
  virtual Types MadeFor() const = 0;
};

template <class In, class Out>
struct Probe2 : IProbe {
  Types MadeFor() const override { return {DataType::Of<In>(), DataType::Of<Out>()}; }
};

template <class In, class Ref, class Out>
struct Probe3 : IProbe {
  Types MadeFor() const override { return {DataType::Of<In>(), DataType::Of<Ref>(), DataType::Of<Out>()}; }
};

using Factory2 = Factory2Template<Probe2, IProbe>;
using Factory3 = Factory3Template<Probe3, IProbe>;

struct ProbePolicy {
  static inline bool outputWasComplex = false;

  template <class In, class Out>
  static IProbe* Create(bool outputIsComplex) {
    outputWasComplex = outputIsComplex;
    return new Probe2<In, Out>();
  }
};

Types Extended2(const Types& types, bool acceptComplex = false) {
  using Dispatcher = ExtendDispatchTypes<Factory2, 2, FullTypeList, FullTypeList, NullDataType>;
  return std::unique_ptr<IProbe>(Dispatcher::Dispatch(types, acceptComplex))->MadeFor();
}

Types Extended3(const Types& types, bool acceptComplex = false) {
  using Dispatcher = ExtendDispatchTypes<Factory3, 3, ShortTypeList, ShortTypeList, NullDataType>;
  return std::unique_ptr<IProbe>(Dispatcher::Dispatch(types, acceptComplex))->MadeFor();
}

template <class InputTypes = FullTypeList, class OutputTypes = FullTypeList>
Types TwoLevel(const DataType& in, const DataType& out) {
  using Dispatcher = details::InputDispatchType<InputTypes, OutputTypes, ProbePolicy>;
  return std::unique_ptr<IProbe>(Dispatcher::Dispatch(in, out))->MadeFor();
}

/// The failure of `dispatch`; checks that its type is `Exception` itself.
template <class Dispatch>
Exception FailureOf(const Dispatch& dispatch) {
  try {
    dispatch();
  } catch (const Exception& failure) {
    EXPECT_EQ(typeid(failure), typeid(Exception));
    return failure;
  }
  return Exception("no failure", "", "", 0);
}

constexpr char kInvalidRequest[] = "Invalid type requested.";
constexpr char kInvalidDispatch[] = "Invalid type to dispatch.";
constexpr char kNotEnough[] = "Not enough type in the vector for the dispatcher you are using.";

const std::vector<tessel::ElementType> kFullList = {
    tessel::eDT_8S,  tessel::eDT_8U,  tessel::eDT_16S, tessel::eDT_16U, tessel::eDT_32S,
    tessel::eDT_32U, tessel::eDT_32F, tessel::eDT_64F, tessel::eDT_64S, tessel::eDT_64U};
const std::vector<tessel::ElementType> kShortList = {tessel::eDT_8U, tessel::eDT_16S, tessel::eDT_16U,
                                                     tessel::eDT_32F};

template <class List>
Types EntriesOf() {
  if constexpr (std::is_same_v<List, NullDataType>) {
    return {};
  } else {
    Types entries = EntriesOf<typename List::Tail>();
    entries.insert(entries.begin(), DataType::Of<typename List::Head>());
    return entries;
  }
}

// ---- golden

TEST(TypeLists, TheFullListHoldsTheTenPixelTypesInOrder) {
  EXPECT_EQ(EntriesOf<FullTypeList>(), Types(kFullList.begin(), kFullList.end()));
}

TEST(TypeLists, TheShortListHoldsFourPixelTypesInOrder) {
  EXPECT_EQ(EntriesOf<ShortTypeList>(), Types(kShortList.begin(), kShortList.end()));
}

TEST(ExtendDispatchTypes, CreatesTheProcessorOfEveryPairOfTheFullList) {
  for (const DataType in : kFullList)
    for (const DataType out : kFullList) EXPECT_EQ(Extended2({in, out}), (Types{in, out}));
}

TEST(ExtendDispatchTypes, CreatesTheProcessorOfEveryTripleOfTheShortListInTheOrderOfTheVector) {
  for (const DataType in : kShortList)
    for (const DataType ref : kShortList)
      for (const DataType out : kShortList) EXPECT_EQ(Extended3({in, ref, out}), (Types{in, ref, out}));
}

TEST(ExtendDispatchTypes, ATypeOutsideTheListIsInvalidAtEveryPlace) {
  for (std::size_t place = 0; place < 3; ++place) {
    Types types(3, tessel::eDT_8U);
    types[place] = tessel::eDT_32S;
    EXPECT_STREQ(FailureOf([&] { Extended3(types); }).what(), kInvalidRequest) << place;
  }
}

TEST(ExtendDispatchTypes, ABitTypeAndADefaultTypeAreInvalid) {
  for (const DataType type : {DataType(tessel::eDT_BIT), DataType()}) {
    EXPECT_STREQ(FailureOf([&] { Extended2({type, tessel::eDT_8U}, true); }).what(), kInvalidRequest);
    EXPECT_STREQ(FailureOf([&] { Extended2({tessel::eDT_8U, type}, true); }).what(), kInvalidRequest);
  }
}

TEST(ExtendDispatchTypes, OneTypeForADispatcherOfTwoIsNotEnough) {
  EXPECT_STREQ(FailureOf([] { Extended2({tessel::eDT_8U}); }).what(), kNotEnough);
}

TEST(ExtendDispatchTypes, FewerTypesThanTheDispatcherPicksAreNotEnough) {
  EXPECT_STREQ(FailureOf([] { Extended2({}); }).what(), kNotEnough);
  EXPECT_STREQ(FailureOf([] { Extended3({}); }).what(), kNotEnough);
  EXPECT_STREQ(FailureOf([] { Extended3({tessel::eDT_8U}); }).what(), kNotEnough);
  EXPECT_STREQ(FailureOf([] { Extended3({tessel::eDT_8U, tessel::eDT_8U}); }).what(), kNotEnough);
}

TEST(ExtendDispatchTypes, TooFewTypesAreToldBeforeAnInvalidOne) {
  EXPECT_STREQ(FailureOf([] { Extended2({tessel::eDT_BIT}); }).what(), kNotEnough);
}

TEST(ExtendDispatchTypes, TheTestForEnoughTypesStandsAtTheEndOfTheListToo) {
  using AtEnd = ExtendDispatchTypes<Factory2, 2, FullTypeList, NullDataType, NullDataType>;
  EXPECT_STREQ(FailureOf([] { AtEnd::Dispatch({tessel::eDT_8U}, false); }).what(), kNotEnough);
  EXPECT_STREQ(FailureOf([] {
                 AtEnd::Dispatch({tessel::eDT_8U, tessel::eDT_8U}, false);
               }).what(),
               kInvalidRequest);
}

TEST(ExtendDispatchTypes, TypesBehindTheFirstNAreNotLookedAt) {
  EXPECT_EQ(Extended2({tessel::eDT_8U, tessel::eDT_32F, tessel::eDT_BIT, DataType()}),
            (Types{tessel::eDT_8U, tessel::eDT_32F}));
}

TEST(ExtendDispatchTypes, AComplexOutputIsInvalidWhereComplexIsNotAccepted) {
  const DataType complexFloat(tessel::eDT_32F, true);
  EXPECT_STREQ(FailureOf([&] { Extended2({tessel::eDT_32F, complexFloat}, false); }).what(), kInvalidRequest);
  EXPECT_STREQ(FailureOf([&] { Extended2({complexFloat, tessel::eDT_32F}, false); }).what(), kInvalidRequest);
}

TEST(ExtendDispatchTypes, AComplexTypeSelectsTheProcessorOfItsElementTypeWhereComplexIsAccepted) {
  for (const tessel::ElementType in : kFullList)
    for (const tessel::ElementType out : kFullList)
      EXPECT_EQ(Extended2({DataType(in, true), DataType(out, true)}, true), (Types{in, out}));
}

TEST(ExtendDispatchTypes, TheLastTypeIsPickedFirst) {
  const Exception output = FailureOf([] { Extended2({tessel::eDT_BIT, tessel::eDT_BIT}); });
  EXPECT_NE(output.Function().find("N = 2"), std::string::npos) << output.Function();
  const Exception input = FailureOf([] { Extended2({tessel::eDT_BIT, tessel::eDT_8U}); });
  EXPECT_NE(input.Function().find("N = 1"), std::string::npos) << input.Function();
}

TEST(InputDispatchType, CreatesTheProcessorOfEveryPairOfTheFullList) {
  for (const DataType in : kFullList)
    for (const DataType out : kFullList) EXPECT_EQ(TwoLevel(in, out), (Types{in, out}));
}

TEST(InputDispatchType, AComplexTypeAlwaysSelectsTheProcessorOfItsElementType) {
  EXPECT_EQ(TwoLevel(tessel::eDT_32F, DataType(tessel::eDT_32F, true)),
            (Types{tessel::eDT_32F, tessel::eDT_32F}));
  for (const tessel::ElementType in : kFullList)
    for (const tessel::ElementType out : kFullList)
      EXPECT_EQ(TwoLevel(DataType(in, true), DataType(out, true)), (Types{in, out}));
}

TEST(InputDispatchType, TheCreationPolicyIsToldWhetherTheOutputIsComplex) {
  TwoLevel(DataType(tessel::eDT_8U, true), tessel::eDT_32F);
  EXPECT_FALSE(ProbePolicy::outputWasComplex);
  TwoLevel(tessel::eDT_8U, DataType(tessel::eDT_32F, true));
  EXPECT_TRUE(ProbePolicy::outputWasComplex);
}

TEST(InputDispatchType, ATypeOutsideItsListIsInvalid) {
  for (const DataType type : {DataType(tessel::eDT_BIT), DataType(tessel::eDT_BIT, true), DataType()}) {
    EXPECT_STREQ(FailureOf([&] { TwoLevel(type, tessel::eDT_8U); }).what(), kInvalidDispatch);
    EXPECT_STREQ(FailureOf([&] { TwoLevel(tessel::eDT_8U, type); }).what(), kInvalidDispatch);
  }
}

TEST(InputDispatchType, InputAndOutputHaveListsOfTheirOwn) {
  EXPECT_EQ((TwoLevel<ShortTypeList, FullTypeList>(tessel::eDT_16S, tessel::eDT_64U)),
            (Types{tessel::eDT_16S, tessel::eDT_64U}));
  EXPECT_STREQ(
      FailureOf([] { TwoLevel<ShortTypeList, FullTypeList>(tessel::eDT_64U, tessel::eDT_16S); }).what(),
      kInvalidDispatch);
  EXPECT_STREQ(
      FailureOf([] { TwoLevel<FullTypeList, ShortTypeList>(tessel::eDT_16S, tessel::eDT_64U); }).what(),
      kInvalidDispatch);
}

TEST(InputDispatchType, TheInputIsTestedFirst) {
  const auto thrower = [](const DataType& in, const DataType& out) {
    const std::string function = FailureOf([&] { TwoLevel(in, out); }).Function();
    return function.substr(0, function.find('<')).find("InputDispatchType") != std::string::npos ||
           function.find("details::InputDispatchType") < function.find("details::OutputDispatchType");
  };
  EXPECT_TRUE(thrower(tessel::eDT_BIT, tessel::eDT_BIT));
  EXPECT_TRUE(thrower(tessel::eDT_BIT, tessel::eDT_8U));
  EXPECT_FALSE(thrower(tessel::eDT_8U, tessel::eDT_BIT));
}

TEST(OutputDispatchType, WalksTheOutputsOfAPickedInput) {
  using Dispatcher = details::OutputDispatchType<short, FullTypeList, ProbePolicy>;
  for (const tessel::ElementType out : kFullList) {
    const std::unique_ptr<IProbe> probe(Dispatcher::Dispatch(out));
    EXPECT_EQ(probe->MadeFor(), (Types{tessel::eDT_16S, out}));
  }
  EXPECT_STREQ(FailureOf([] { Dispatcher::Dispatch(tessel::eDT_BIT); }).what(), kInvalidDispatch);
}

TEST(Matching, ThePlainDescriptorMatchesAlwaysAndTheComplexOneWhereAccepted) {
  EXPECT_TRUE(Matches<short>(tessel::eDT_16S, false));
  EXPECT_TRUE(Matches<short>(tessel::eDT_16S, true));
  EXPECT_FALSE(Matches<short>(DataType(tessel::eDT_16S, true), false));
  EXPECT_TRUE(Matches<short>(DataType(tessel::eDT_16S, true), true));
  EXPECT_FALSE(Matches<short>(tessel::eDT_16U, true));
}

TEST(Matching, AllSixFieldsOfADescriptorHaveToAgree) {
  DataType odd = tessel::eDT_32F;
  odd.exponentBits = 5;
  EXPECT_STREQ(FailureOf([&] { Extended2({odd, tessel::eDT_8U}, true); }).what(), kInvalidRequest);
  EXPECT_STREQ(FailureOf([&] { TwoLevel(odd, tessel::eDT_8U); }).what(), kInvalidDispatch);
}

}  // namespace
}  // namespace orvik::typedispatch
