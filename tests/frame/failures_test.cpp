#include <cstdint>
#include <ostream>
#include <string>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/gridmill.h"

// Each failure that a caller can meet, through the public operators: its exact type and its message.
namespace orvik {
namespace {

using tessel::DataType;
using tessel::Raster;
using tessel::RasterContext;

struct Failure {
  const std::type_info* type;
  std::string message;

  friend bool operator==(const Failure& a, const Failure& b) {
    return *a.type == *b.type && a.message == b.message;
  }
  friend std::ostream& operator<<(std::ostream& stream, const Failure& failure) {
    return stream << failure.type->name() << " \"" << failure.message << '"';
  }
};

template <class Action>
Failure FailureOf(const Action& action) {
  try {
    action();
  } catch (const Exception& failure) {
    return {&typeid(failure), failure.what()};
  }
  return {&typeid(void), "no failure"};
}

Failure Plain(const char* message) { return {&typeid(Exception), message}; }

Raster MakeRaster(DataType type, std::uint32_t margin = 1) {
  return Raster({3, 2, 1, type}, RasterContext(margin, margin));
}

void Call(const filters::AverageChannels& op, Raster* in, Raster* out) {
  op.Process(in, nullptr, out, nullptr);
}
void Call(const filters::FilterSlp& op, Raster* in, Raster* out) { op.Process(in, nullptr, out); }
void Call(const filters::FilterAsp& op, Raster* in, Raster* out) { op.Process(in, nullptr, out); }

template <class Operator>
class GuardedOperator : public ::testing::Test {};
using GuardedOperators = ::testing::Types<filters::AverageChannels, filters::FilterSlp, filters::FilterAsp>;
TYPED_TEST_SUITE(GuardedOperator, GuardedOperators);

TYPED_TEST(GuardedOperator, ANullInputIsToldFirst) {
  EXPECT_EQ(FailureOf([] { Call(TypeParam(), nullptr, nullptr); }), Plain("poRasterIn is invalid pointer"));
}

TYPED_TEST(GuardedOperator, ANullOutputIsTold) {
  Raster in = MakeRaster(tessel::eDT_BIT);
  EXPECT_EQ(FailureOf([&] { Call(TypeParam(), &in, nullptr); }), Plain("poRasterOut is invalid pointer"));
}

TYPED_TEST(GuardedOperator, AComplexOutputIsRefused) {
  Raster in = MakeRaster(tessel::eDT_BIT);
  Raster out = MakeRaster(DataType(tessel::eDT_32F, true));
  EXPECT_EQ(FailureOf([&] { Call(TypeParam(), &in, &out); }), Plain("Output cannot be complex"));
}

TEST(Failures, TheExtendedDispatcherKnowsNoBitType) {
  Raster bits = MakeRaster(tessel::eDT_BIT);
  Raster bytes = MakeRaster(tessel::eDT_8U);
  EXPECT_EQ(FailureOf([&] { Call(filters::AverageChannels(), &bits, &bytes); }),
            Plain("Invalid type requested."));
  EXPECT_EQ(FailureOf([&] { Call(filters::AverageChannels(), &bytes, &bits); }),
            Plain("Invalid type requested."));
}

template <class Operator>
class TerrainOperator : public ::testing::Test {};
using TerrainOperators = ::testing::Types<filters::FilterSlp, filters::FilterAsp>;
TYPED_TEST_SUITE(TerrainOperator, TerrainOperators);

TYPED_TEST(TerrainOperator, TheTwoLevelDispatcherKnowsNoBitType) {
  Raster bits = MakeRaster(tessel::eDT_BIT);
  Raster bytes = MakeRaster(tessel::eDT_8U);
  EXPECT_EQ(FailureOf([&] { Call(TypeParam(), &bits, &bytes); }), Plain("Invalid type to dispatch."));
  EXPECT_EQ(FailureOf([&] { Call(TypeParam(), &bytes, &bits); }), Plain("Invalid type to dispatch."));
}

TYPED_TEST(TerrainOperator, AMarginBelow1IsAFailureOfTheParameterPoRasterIn) {
  const Failure expected{&typeid(ParameterException), "The Margin of the input raster is too small"};
  Raster out = MakeRaster(tessel::eDT_8U);
  for (const RasterContext& context : {RasterContext(0, 0), RasterContext(1, 0), RasterContext(0, 1)}) {
    Raster in({3, 2, 1, tessel::eDT_8U}, context);
    EXPECT_EQ(FailureOf([&] { Call(TypeParam(), &in, &out); }), expected);
  }
  Raster in = MakeRaster(tessel::eDT_8U, 0);
  try {
    Call(TypeParam(), &in, &out);
    FAIL() << "no failure";
  } catch (const ParameterException& failure) {
    EXPECT_EQ(failure.Parameter(), "poRasterIn");
    EXPECT_EQ(static_cast<int>(failure.Kind()), 1);
    EXPECT_EQ(failure.Given(), "");
    EXPECT_EQ(failure.Expected(), "");
    EXPECT_NE(failure.Function().find("Process"), std::string::npos);
    EXPECT_NE(failure.File().find("filter"), std::string::npos);
    EXPECT_GT(failure.Line(), 0u);
  }
}

template <class Operator>
class UnguardedOperator : public ::testing::Test {};
using UnguardedOperators =
    ::testing::Types<filters::MirrorImg, filters::Normalize, filters::Percentile, filters::VegIndex>;
TYPED_TEST_SUITE(UnguardedOperator, UnguardedOperators);

TYPED_TEST(UnguardedOperator, TheExtendedDispatcherKnowsNeitherBitNorComplexTypes) {
  const Failure expected = Plain("Invalid type requested.");
  Raster bytes = MakeRaster(tessel::eDT_8U);
  for (const DataType type : {DataType(tessel::eDT_BIT), DataType(tessel::eDT_8U, true), DataType()}) {
    Raster odd = MakeRaster(type);
    EXPECT_EQ(FailureOf([&] { TypeParam().Process(&odd, nullptr, &bytes); }), expected);
    EXPECT_EQ(FailureOf([&] { TypeParam().Process(&bytes, nullptr, &odd); }), expected);
  }
}

template <class Operator>
class HalfComparedOperator : public ::testing::Test {};
using HalfComparedOperators = ::testing::Types<filters::BitmapFiltering, filters::IntenPercent>;
TYPED_TEST_SUITE(HalfComparedOperator, HalfComparedOperators);

TYPED_TEST(HalfComparedOperator, TheTwoLevelDispatcherKnowsNoBitType) {
  const Failure expected = Plain("Invalid type to dispatch.");
  Raster bits = MakeRaster(tessel::eDT_BIT);
  Raster bytes = MakeRaster(tessel::eDT_8U);
  EXPECT_EQ(FailureOf([&] { TypeParam().Process(&bits, nullptr, &bytes); }), expected);
  EXPECT_EQ(FailureOf([&] { TypeParam().Process(&bytes, nullptr, &bits); }), expected);
}

TEST(Failures, IntenPercentKnowsNoComplexTypes) {
  const Failure expected = Plain("Invalid type to dispatch.");
  Raster complex = MakeRaster(DataType(tessel::eDT_32F, true));
  Raster bytes = MakeRaster(tessel::eDT_8U);
  EXPECT_EQ(FailureOf([&] { filters::IntenPercent().Process(&complex, nullptr, &bytes); }), expected);
  EXPECT_EQ(FailureOf([&] { filters::IntenPercent().Process(&bytes, nullptr, &complex); }), expected);
}

template <class Operator>
class FocusMeasure : public ::testing::Test {};
using FocusMeasures = ::testing::Types<filters::SqrGradientEvaluation, filters::VollathEvaluation>;
TYPED_TEST_SUITE(FocusMeasure, FocusMeasures);

TYPED_TEST(FocusMeasure, ANullInputIsToldFirstThenThatChannelsAreMissingThenTheType) {
  Raster noChannels({3, 2, 0, DataType(tessel::eDT_BIT)}, {});
  Raster bits = MakeRaster(tessel::eDT_BIT);
  Raster complex = MakeRaster(DataType(tessel::eDT_8U, true));
  EXPECT_EQ(FailureOf([] { TypeParam().Process(nullptr, nullptr, nullptr); }),
            Plain("poRasterIn is invalid pointer"));
  EXPECT_EQ(FailureOf([&] { TypeParam().Process(&noChannels, nullptr, nullptr); }),
            Plain("poRasterIn must have minimum 1 channels."));
  EXPECT_EQ(FailureOf([&] { TypeParam().Process(&bits, nullptr, nullptr); }),
            Plain("Invalid type requested."));
  EXPECT_EQ(FailureOf([&] { TypeParam().Process(&complex, nullptr, nullptr); }),
            Plain("Invalid type requested."));
}

TEST(Failures, AMaskGoesIntoBitAndByteRastersOnly) {
  Raster target = MakeRaster(tessel::eDT_16U);
  const Failure expected{&typeid(DataException), "We can only rasterize into a eDT_BIT or eDT_8U Raster"};
  EXPECT_EQ(FailureOf([&] { tessel::Mask(3, 2).RetrieveRaster(&target); }), expected);
}

TEST(Failures, ARefusedCallWritesNothing) {
  std::vector<unsigned char> memory(5 * 4, 0xA5);
  Raster out({3, 2, 1, tessel::eDT_8U}, RasterContext(1, 1), memory.data());
  Raster in = MakeRaster(tessel::eDT_8U, 0);
  FailureOf([&] { Call(filters::FilterSlp(), &in, &out); });
  FailureOf([&] { Call(filters::FilterAsp(), &in, &out); });
  Raster bits = MakeRaster(tessel::eDT_BIT);
  FailureOf([&] { Call(filters::AverageChannels(), &bits, &out); });
  EXPECT_EQ(memory, std::vector<unsigned char>(5 * 4, 0xA5));
}

}  // namespace
}  // namespace orvik
