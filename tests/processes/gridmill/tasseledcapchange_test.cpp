#include "processes/gridmill/tasseledcapchange.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <string>
#include <type_traits>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "processes/gridmill/chandiffchange.h"
#include "processes/gridmill/magnitudechange.h"
#include "tests/reference/tasseledcapchange_reference.h"
#include "tests/support/changecases.h"
#include "tests/support/changetwins.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::changedetection {
namespace {

using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The weights of one sensor, one for each band.
struct Sensor {
  const char* name;
  std::vector<double> weights;
};

/// A pixel of a sensor and its value on an axis.
struct Projected {
  const char* sensor;
  std::vector<unsigned short> pixel;
  double value;
};

struct Greenness {
  using Operator = TCGNChange;
  using Params = details::TCGNParams;
  static constexpr auto kTwin = &reference::TCGNChange;

  static std::vector<Sensor> Sensors() {
    return {{"Landsat-4 MSS", {-0.29, -0.562, 0.6, 0.49}},
            {"Landsat-5 MSS", {-0.29, -0.562, 0.6, 0.49}},
            {"Landsat-4 TM", {-0.2848, -0.2435, -0.5436, 0.7243, 0.084, -0.18}},
            {"Landsat-5 TM", {-0.2848, -0.2435, -0.5436, 0.7243, 0.084, -0.18}},
            {"Landsat-7 ETM+", {-0.3344, -0.3544, -0.4556, 0.6966, -0.0242, -0.263}},
            {"Ikonos", {-0.311, -0.356, -0.324, 0.819}},
            {"QuickBird", {-0.121, -0.331, -0.517, 0.78}}};
  }
};

struct Brightness {
  using Operator = TCSBChange;
  using Params = details::TCSBParams;
  static constexpr auto kTwin = &reference::TCSBChange;

  static std::vector<Sensor> Sensors() {
    return {{"Landsat-4 MSS", {0.433, 0.632, 0.586, 0.264}},
            {"Landsat-5 MSS", {0.433, 0.632, 0.586, 0.264}},
            {"Landsat-4 TM", {0.3037, 0.2793, 0.4343, 0.5585, 0.5082, 0.1863}},
            {"Landsat-5 TM", {0.3037, 0.2793, 0.4343, 0.5585, 0.5082, 0.1863}},
            {"Landsat-7 ETM+", {0.3561, 0.3872, 0.3904, 0.6966, 0.2286, 0.1596}},
            {"Ikonos", {0.326, 0.509, 0.56, 0.567}},
            {"QuickBird", {0.319, 0.542, 0.49, 0.604}}};
  }
};

/// The result for one pixel: the two projections and their difference.
template <class Out, class In, class Operator>
std::vector<Out> Projections(const Operator& op, const std::vector<In>& image,
                             const std::vector<In>& reference, bool isValid = true) {
  Image<In> i({1, 1, static_cast<std::uint32_t>(image.size())});
  std::copy(image.begin(), image.end(), i.Elements());
  Image<In> r({1, 1, static_cast<std::uint32_t>(reference.size())});
  std::copy(reference.begin(), reference.end(), r.Elements());
  Mask mask(1, 1, {}, isValid);
  Image<Out> out({1, 1, 3}, {}, 77);
  op.Process(&i, &r, &mask, &out);
  return {out.Elements(), out.Elements() + 3};
}

/// Passes if `call()` throws the failure of an unknown sensor, which does not say where.
template <class Call>
::testing::AssertionResult FailsForTheSensor(Call call) {
  try {
    call();
  } catch (const Exception& failure) {
    if (typeid(failure) == typeid(Exception) && failure.what() == std::string("Image type not supported") &&
        failure.File().empty() && failure.Function().empty() && failure.Line() == 0) {
      return ::testing::AssertionSuccess();
    }
    return ::testing::AssertionFailure()
           << typeid(failure).name() << " \"" << failure.what() << "\" from \"" << failure.Function()
           << "\" in \"" << failure.File() << "\":" << failure.Line();
  }
  return ::testing::AssertionFailure() << "nothing was thrown";
}

template <class Axis>
struct TasseledCapChange : ::testing::Test {
  using Operator = typename Axis::Operator;

  /// A pixel with 1 in the band `band`.
  static std::vector<double> Unit(std::size_t bands, std::size_t band) {
    std::vector<double> pixel(bands, 0.0);
    pixel[band] = 1.0;
    return pixel;
  }
  static double WeightOf(const std::string& sensor, std::size_t band) {
    for (const Sensor& row : Axis::Sensors()) {
      if (row.name == sensor) return row.weights[band];
    }
    return kNaN;
  }
  /// An operator with a test for 0 in an image of `channels` and in any reference, and -5 for no-data.
  static Operator WithNoDataOfZero(std::size_t channels) {
    Operator op("Ikonos", "Ikonos", eDIFF_FORWARD);
    op.SetNoData(-5.0f);
    op.SetImgNoData(std::vector<float>(channels, 0.0f));
    op.SetRefNoData(std::vector<float>(8, 0.0f));
    return op;
  }
};

struct AxisNames {
  template <class Axis>
  static std::string GetName(int) {
    return std::is_same_v<Axis, Greenness> ? "Greenness" : "Brightness";
  }
};

using Axes = ::testing::Types<Greenness, Brightness>;
TYPED_TEST_SUITE(TasseledCapChange, Axes, AxisNames);

// ---- golden: weights and sums

TYPED_TEST(TasseledCapChange, WeightOfEverySensorAndBandIsTheListedOne) {
  for (const Sensor& sensor : TypeParam::Sensors()) {
    const std::size_t bands = sensor.weights.size();
    const std::vector<double> zero(bands, 0.0);
    for (std::size_t band = 0; band < bands; ++band) {
      const double weight = sensor.weights[band];
      const std::vector<double> unit = this->Unit(bands, band);
      const typename TypeParam::Operator op(sensor.name, sensor.name, eDIFF_FORWARD);
      EXPECT_EQ((Projections<double, double>(op, unit, zero)), (std::vector<double>{weight, 0.0, weight}))
          << sensor.name << ", band " << band;
      EXPECT_EQ((Projections<double, double>(op, zero, unit)), (std::vector<double>{0.0, weight, -weight}))
          << sensor.name << ", band " << band;
    }
  }
}

// The pixels of a sensor together tell the stated order from every other one, of 15 orders of four terms and
// of 945 of six.

TEST(TCGNChange, GreennessIsSummedInTheStatedOrder) {
  const std::vector<Projected> pixels = {
      {"Landsat-4 MSS", {196, 17, 66, 31}, -0x1.7353f7ced9163p+3},
      {"Landsat-5 MSS", {196, 17, 66, 31}, -0x1.7353f7ced9163p+3},
      {"Landsat-4 TM", {61154, 49912, 16281, 51473, 17636, 12446}, -0x1.da62dfa43fe3fp+10},
      {"Landsat-4 TM", {53862, 19835, 33587, 58143, 65139, 48947}, 0x1.5a93dd97f6300p+8},
      {"Landsat-5 TM", {61154, 49912, 16281, 51473, 17636, 12446}, -0x1.da62dfa43fe3fp+10},
      {"Landsat-5 TM", {53862, 19835, 33587, 58143, 65139, 48947}, 0x1.5a93dd97f6300p+8},
      {"Landsat-7 ETM+", {44693, 33281, 32635, 59316, 25762, 7613}, -0x1.6c587e28240b7p+11},
      {"Landsat-7 ETM+", {38194, 1420, 31475, 58806, 13712, 25116}, 0x1.90b96f0068db7p+12},
      {"Ikonos", {229, 38, 219, 233}, 0x1.18fdf3b645a20p+5},
      {"QuickBird", {43, 152, 151, 96}, -0x1.d59db22d0e560p+5}};
  for (const auto& [sensor, pixel, value] : pixels) {
    const TCGNChange op(sensor, sensor, eDIFF_FORWARD);
    EXPECT_EQ((Projections<double, unsigned short>(op, pixel, pixel)), (std::vector<double>{value, value, 0}))
        << sensor;
  }
}

TEST(TCSBChange, BrightnessIsARunningSum) {
  const std::vector<Projected> pixels = {
      {"Landsat-4 MSS", {86, 174, 10, 71}, 0x1.579eb851eb853p+7},
      {"Landsat-5 MSS", {86, 174, 10, 71}, 0x1.579eb851eb853p+7},
      {"Landsat-4 TM", {31807, 56816, 4734, 52590, 41911, 27462}, 0x1.45ab53a29c779p+16},
      {"Landsat-4 TM", {24391, 64857, 5169, 23297, 34622, 18270}, 0x1.e2a1f573eab37p+15},
      {"Landsat-4 TM", {40480, 18141, 12015, 47365, 14300, 10586}, 0x1.c73ee985f06f7p+15},
      {"Landsat-5 TM", {31807, 56816, 4734, 52590, 41911, 27462}, 0x1.45ab53a29c779p+16},
      {"Landsat-5 TM", {24391, 64857, 5169, 23297, 34622, 18270}, 0x1.e2a1f573eab37p+15},
      {"Landsat-5 TM", {40480, 18141, 12015, 47365, 14300, 10586}, 0x1.c73ee985f06f7p+15},
      {"Landsat-7 ETM+", {47351, 45425, 43911, 49165, 7859, 14029}, 0x1.5f150a5119cdfp+16},
      {"Landsat-7 ETM+", {63182, 53217, 25911, 31245, 63278, 42053}, 0x1.77a2a9e1b089bp+16},
      {"Landsat-7 ETM+", {59432, 15249, 64879, 1856, 44470, 58405}, 0x1.1dd914467381dp+16},
      {"Ikonos", {117, 228, 240, 102}, 0x1.5a6d916872b03p+8},
      {"QuickBird", {251, 114, 250, 5}, 0x1.0b6083126e978p+8}};
  for (const auto& [sensor, pixel, value] : pixels) {
    const TCSBChange op(sensor, sensor, eDIFF_FORWARD);
    EXPECT_EQ((Projections<double, unsigned short>(op, pixel, pixel)), (std::vector<double>{value, value, 0}))
        << sensor;
  }
}

// Deliberate: the weights stand as they are; the Ikonos weight of band 3 is -0.324.
TEST(TCGNChange, WeightsStandAsTheyAreTheIkonosWeightOfBand3IsMinus0324) {
  const TCGNChange op("Ikonos", "Ikonos", eDIFF_FORWARD);
  EXPECT_EQ((Projections<double, short>(op, {0, 0, 1, 0}, {0, 0, 1000, 0})[0]), -0.324);
  EXPECT_EQ((Projections<double, short>(op, {0, 0, 1, 0}, {0, 0, 1000, 0})[1]), -324.0);
}

// Deliberate: the weights stand as they are; the ETM+ weight of band 2 is 0.3872.
TEST(TCSBChange, WeightsStandAsTheyAreTheEtmWeightOfBand2Is03872) {
  const TCSBChange op("Landsat-7 ETM+", "Landsat-7 ETM+", eDIFF_FORWARD);
  EXPECT_EQ((Projections<double, short>(op, {0, 1, 0, 0, 0, 0}, {0, 10000, 0, 0, 0, 0})[0]), 0.3872);
  EXPECT_EQ((Projections<double, short>(op, {0, 1, 0, 0, 0, 0}, {0, 10000, 0, 0, 0, 0})[1]), 3872.0);
}

TEST(TCGNChange, QuickBirdPixelOf100InTheLastBandHasTheGreenness78) {
  const TCGNChange op("QuickBird", "QuickBird", eDIFF_FORWARD);
  EXPECT_EQ((Projections<short, short>(op, {0, 0, 0, 100}, {0, 0, 0, 0})), (std::vector<short>{78, 0, 78}));
}

TEST(TCSBChange, QuickBirdPixelOf100InTheLastBandHasTheBrightness60Point4) {
  const TCSBChange op("QuickBird", "QuickBird", eDIFF_FORWARD);
  EXPECT_EQ((Projections<float, short>(op, {0, 0, 0, 100}, {0, 0, 0, 0})),
            (std::vector<float>{60.4f, 0, 60.4f}));
}

// ---- golden: sensors

TYPED_TEST(TasseledCapChange, ImageAndReferenceMayNameDifferentSensorsAndEachUsesItsOwnRow) {
  for (const Sensor& image : TypeParam::Sensors()) {
    for (const Sensor& reference : TypeParam::Sensors()) {
      const typename TypeParam::Operator op(image.name, reference.name, eDIFF_FORWARD);
      const double a = image.weights[3], b = reference.weights[3];
      EXPECT_EQ((Projections<double, double>(op, this->Unit(image.weights.size(), 3),
                                             this->Unit(reference.weights.size(), 3))),
                (std::vector<double>{a, b, a - b}))
          << image.name << ", " << reference.name;
    }
  }
}

TYPED_TEST(TasseledCapChange, NameWithATrailingBlankOrInAnotherCaseIsUnknown) {
  const std::vector<double> pixel(6, 1.0);
  for (const std::string name :
       {"Ikonos ", " Ikonos", "ikonos", "IKONOS", "Quickbird", "Landsat-7 ETM", "Landsat-7 ETM+ ",
        "Landsat-4 tm", "Landsat 4 TM", "Landsat-6 TM", "Landsat-3 MSS", "Landsat-5", ""}) {
    const typename TypeParam::Operator image(name, "Ikonos", eDIFF_FORWARD);
    EXPECT_TRUE(FailsForTheSensor([&] { Projections<double, double>(image, pixel, pixel); })) << name;
    const typename TypeParam::Operator reference("Ikonos", name, eDIFF_FORWARD);
    EXPECT_TRUE(FailsForTheSensor([&] { Projections<double, double>(reference, pixel, pixel); })) << name;
    const typename TypeParam::Operator both(name, name, eDIFF_FORWARD);
    EXPECT_TRUE(FailsForTheSensor([&] { Projections<double, double>(both, pixel, pixel); })) << name;
  }
}

TYPED_TEST(TasseledCapChange, NameThatGoesOnBehindAZeroByteIsUnknown) {
  const std::vector<double> pixel(4, 1.0);
  const typename TypeParam::Operator op(std::string("Ikonos\0", 7), "Ikonos", eDIFF_FORWARD);
  EXPECT_TRUE(FailsForTheSensor([&] { Projections<double, double>(op, pixel, pixel); }));
}

TYPED_TEST(TasseledCapChange, HeightOfZeroReturnsAtOnceAlsoForAnUnknownSensor) {
  for (const tests::Size size : {tests::Size{3, 0, 4}, tests::Size{0, 3, 4}}) {
    Image<short> image(size, {1, 1}, 5), reference(size, {1, 1}, 6);
    Image<short> out({3, 3, 3}, {1, 1});
    FillBytes(out);
    const typename TypeParam::Operator known("Ikonos", "Ikonos", eDIFF_FORWARD);
    known.Process(&image, &reference, nullptr, &out);
    const typename TypeParam::Operator unknown("Nikonos", "Nikonos", eDIFF_FORWARD);
    EXPECT_NO_THROW(unknown.Process(&image, &reference, nullptr, &out));
    EXPECT_TRUE(IsUntouched(out));
  }
}

/// A row of ten pixels, the first valid one with the index 4, the one with the index 7 invalid.
struct RowOfTen {
  Image<short> image{{10, 2, 4}, {1, 0}, 3}, reference{{10, 2, 4}, {}, 3};
  Image<short> out{{10, 2, 4}, {}, 77};
  Mask mask{10, 2};

  RowOfTen() {
    for (const int x : {0, 1, 2, 3, 7}) mask.SetValid(x, 0, false);
  }
  /// What the output holds if the pixels from `end` on keep their bits.
  bool IsExcludedUpTo(int end) {
    bool isRight = true;
    for (int x = 0; x < 20; ++x) {
      for (std::uint32_t c = 0; c < 4; ++c)
        isRight = isRight && out.At(x % 10, x / 10, c) == (x < end && c < 3 ? -5 : 77);
    }
    return isRight;
  }
};

TYPED_TEST(TasseledCapChange, OutputWrittenBeforeTheThrowStaysAndTheRestKeepsItsBits) {
  for (const bool isImage : {true, false}) {
    RowOfTen row;
    typename TypeParam::Operator op(isImage ? "Nikonos" : "Ikonos", isImage ? "Ikonos" : "Nikonos",
                                    eDIFF_FORWARD);
    op.SetNoData(-5.0f);
    EXPECT_TRUE(FailsForTheSensor([&] { op.Process(&row.image, &row.reference, &row.mask, &row.out); }));
    EXPECT_TRUE(row.IsExcludedUpTo(4));
  }
}

TYPED_TEST(TasseledCapChange, NoDataPixelsBeforeTheThrowAreWrittenToo) {
  RowOfTen row;
  for (int x = 0; x < 15; ++x) row.image.At(x % 10, x / 10, 2) = 9;
  typename TypeParam::Operator op("Nikonos", "Nikonos", eDIFF_FORWARD);
  op.SetNoData(-5.0f);
  op.SetImgNoData({1.0f, 1.0f, 9.0f, 1.0f});
  op.SetRefNoData(std::vector<float>(4, 1.0f));
  EXPECT_TRUE(FailsForTheSensor([&] { op.Process(&row.image, &row.reference, nullptr, &row.out); }));
  EXPECT_TRUE(row.IsExcludedUpTo(15));
}

TYPED_TEST(TasseledCapChange, UnknownNameGoesUnnoticedIfEveryPixelIsMaskedOrNoData) {
  RowOfTen row;
  for (int x = 4; x < 20; ++x) row.reference.At(x % 10, x / 10, 3) = 9;
  typename TypeParam::Operator op("Nikonos", "Nikonos", eDIFF_FORWARD);
  op.SetNoData(-5.0f);
  op.SetImgNoData(std::vector<float>(4, 1.0f));
  op.SetRefNoData(std::vector<float>(4, 9.0f));
  EXPECT_NO_THROW(op.Process(&row.image, &row.reference, &row.mask, &row.out));
  EXPECT_TRUE(row.IsExcludedUpTo(20));
}

TYPED_TEST(TasseledCapChange, ObjectWorksAfterTheThrowWithTheParametersOfThatBuild) {
  const std::vector<double> pixel = this->Unit(4, 3);
  const double weight = this->WeightOf("Ikonos", 3);
  typename TypeParam::Operator op("Nikonos", "Nikonos", eDIFF_FORWARD);
  op.SetNoData(-5.0f);
  EXPECT_TRUE(FailsForTheSensor([&] { Projections<double, double>(op, pixel, pixel); }));
  op.SetSensorType("Ikonos");
  op.SetRefSensorType("Ikonos");
  op.SetNoData(-6.0f);
  EXPECT_EQ((Projections<double, double>(op, pixel, pixel, false)), std::vector<double>(3, -5.0));
  EXPECT_TRUE(FailsForTheSensor([&] { Projections<double, double>(op, pixel, pixel); }));
  EXPECT_EQ((Projections<float, double>(op, pixel, pixel)[0]), static_cast<float>(weight));
  EXPECT_EQ((Projections<double, double>(op, pixel, pixel)[1]), weight);
  EXPECT_EQ((Projections<double, double>(op, pixel, pixel, false)), std::vector<double>(3, -6.0));
}

TYPED_TEST(TasseledCapChange, SensorSetAfterTheFirstProcessIsIgnoredWhileTheTypesStay) {
  const std::vector<double> pixel = this->Unit(4, 3);
  typename TypeParam::Operator op("Ikonos", "QuickBird", eDIFF_FORWARD);
  const double a = this->WeightOf("Ikonos", 3), b = this->WeightOf("QuickBird", 3);
  EXPECT_EQ((Projections<double, double>(op, pixel, pixel)), (std::vector<double>{a, b, a - b}));
  op.SetSensorType("QuickBird");
  op.SetRefSensorType("Nikonos");
  EXPECT_EQ((Projections<double, double>(op, pixel, pixel)), (std::vector<double>{a, b, a - b}));
  EXPECT_TRUE(FailsForTheSensor([&] { Projections<float, double>(op, pixel, pixel); }));
  op.SetRefSensorType("Ikonos");
  EXPECT_EQ((Projections<double, double>(op, pixel, pixel)), (std::vector<double>{b, a, b - a}));
}

TYPED_TEST(TasseledCapChange, SensorsAndTypeComeFromTheConstructorAndNoDataIsZero) {
  typename TypeParam::Operator op("a", "b", eDIFF_BACKWARD);
  EXPECT_EQ(op.sensorType, "a");
  EXPECT_EQ(op.refSensorType, "b");
  EXPECT_EQ(op.type, eDIFF_BACKWARD);
  EXPECT_EQ(op.noData, 0.0f);
  EXPECT_TRUE(op.imgNoData.empty() && op.refNoData.empty());
  op.SetSensorType("c");
  op.SetRefSensorType("d");
  op.SetSensorType(op.sensorType);
  op.SetRefSensorType(op.refSensorType);
  EXPECT_EQ(op.sensorType, "c");
  EXPECT_EQ(op.refSensorType, "d");
}

// ---- golden: the difference

TYPED_TEST(TasseledCapChange, AbsoluteDifferenceIsNeverNegative) {
  const typename TypeParam::Operator op("Ikonos", "Ikonos", eDIFF_ABSOLUTE);
  const std::vector<double> low = {0, 0, 0, 10}, high = {0, 0, 0, 30};
  const std::vector<double> forth = Projections<double, double>(op, low, high);
  const std::vector<double> back = Projections<double, double>(op, high, low);
  EXPECT_EQ(forth[2], forth[1] - forth[0]);
  EXPECT_EQ(back[2], forth[2]);
  EXPECT_GT(forth[2], 0.0);
  EXPECT_FALSE(std::signbit(Projections<double, double>(op, low, low)[2]));
}

TYPED_TEST(TasseledCapChange, BackwardDifferenceIsBMinusA) {
  const typename TypeParam::Operator op("Ikonos", "Ikonos", eDIFF_BACKWARD);
  const std::vector<double> result = Projections<double, double>(op, {0, 0, 0, 30}, {0, 0, 0, 10});
  EXPECT_EQ(result[2], result[1] - result[0]);
  EXPECT_LT(result[2], 0.0);
}

// Deliberate: a `type` of 3 means image minus reference, where `ChanDiffChange` and `MagnitudeChange` take
// every value but 0 and 1 as the reverse.
TYPED_TEST(TasseledCapChange, TypeOf3MeansImageMinusReferenceWhereOthersTakeItAsTheReverse) {
  for (const int type : {1, 3, 4, -1, std::numeric_limits<int>::max(), std::numeric_limits<int>::min()}) {
    const typename TypeParam::Operator op("Ikonos", "Ikonos", static_cast<DiffType>(type));
    const std::vector<double> result = Projections<double, double>(op, {0, 0, 0, 30}, {0, 0, 0, 10});
    EXPECT_EQ(result[2], result[0] - result[1]) << type;
    EXPECT_GT(result[2], 0.0) << type;
  }
  const MagnitudeChange magnitude(static_cast<DiffType>(3));
  EXPECT_EQ((Projections<double, double>(magnitude, {30}, {10}))[2], -20.0);
  const ChanDiffChange difference(static_cast<DiffType>(3));
  EXPECT_EQ((Projections<double, double>(difference, {30}, {10}))[0], -20.0);
}

TYPED_TEST(TasseledCapChange, Channel0DependsOnlyOnTheImageAndChannel1OnlyOnTheReference) {
  const typename TypeParam::Operator op("Landsat-4 TM", "Ikonos", eDIFF_FORWARD);
  const std::vector<float> image = {1, 2, 3, 4, 5, 6}, reference = {9, 8, 7, 6};
  const std::vector<float> result = Projections<float, float>(op, image, reference);
  EXPECT_EQ((Projections<float, float>(op, image, {kNaN, 1, 2, 3}))[0], result[0]);
  EXPECT_EQ((Projections<float, float>(op, {1, 1, 1, kInfinity, 1, 1}, reference))[1], result[1]);
}

// ---- golden: no-data and masks

TYPED_TEST(TasseledCapChange, PixelWithOneMatchingChannelInEitherRasterIsExcludedWhole) {
  const typename TypeParam::Operator op = this->WithNoDataOfZero(4);
  const std::vector<short> excluded(3, -5);
  for (std::size_t c = 0; c < 4; ++c) {
    std::vector<short> pixel = {1, 2, 3, 4};
    pixel[c] = 0;
    EXPECT_EQ((Projections<short, short>(op, pixel, {1, 2, 3, 4})), excluded) << c;
    EXPECT_EQ((Projections<short, short>(op, {1, 2, 3, 4}, pixel)), excluded) << c;
    EXPECT_EQ((Projections<short, short>(op, pixel, pixel)), excluded) << c;
  }
  EXPECT_NE((Projections<short, short>(op, {1, 2, 3, 40}, {1, 2, 3, 40})), excluded);
}

TYPED_TEST(TasseledCapChange, ChannelsBeyondTheSensorsRowTakePartInTheNoDataTestAlone) {
  const typename TypeParam::Operator op = this->WithNoDataOfZero(5);
  const std::vector<double> pixel = {0.5, 0.25, 2, 1};
  const std::vector<double> expected = Projections<double, double>(
      typename TypeParam::Operator("Ikonos", "Ikonos", eDIFF_FORWARD), pixel, pixel);
  const std::vector<double> more = {0.5, 0.25, 2, 1, 99}, less = {0.5, 0.25, 2, 1, 0};
  EXPECT_EQ((Projections<double, double>(op, more, more)), expected);
  EXPECT_EQ((Projections<double, double>(op, less, more)), std::vector<double>(3, -5.0));
  EXPECT_EQ((Projections<double, double>(op, more, less)), std::vector<double>(3, -5.0));
}

TYPED_TEST(TasseledCapChange, ReferenceIsTestedOverAsManyChannelsAsTheImageHas) {
  const typename TypeParam::Operator op = this->WithNoDataOfZero(4);
  const std::vector<short> excluded(3, -5);
  EXPECT_NE((Projections<short, short>(op, {1, 1, 1, 9}, {1, 1, 1, 9, 0})), excluded);
  EXPECT_EQ((Projections<short, short>(op, {1, 1, 1, 9}, {1, 1, 1, 0, 1})), excluded);
}

TYPED_TEST(TasseledCapChange, TestOfAReferenceWithFewerChannelsGoesOnInTheNextPixel) {
  const typename TypeParam::Operator op = this->WithNoDataOfZero(6);
  Image<short> image({3, 1, 6}, {}, 1), reference({3, 1, 4}, {1, 0}, 1);
  Image<short> out({3, 1, 3}, {}, 77);
  reference.At(3, 0, 2) = 0;
  op.Process(&image, &reference, nullptr, &out);
  for (int x = 0; x < 3; ++x) EXPECT_NE(out.At(x, 0), -5) << x;
  reference.At(3, 0, 1) = 0;
  op.Process(&image, &reference, nullptr, &out);
  for (int x = 0; x < 3; ++x) EXPECT_EQ(out.At(x, 0) == -5, x == 2) << x;
}

TYPED_TEST(TasseledCapChange, NoDataTestNeedsAsManyImageEntriesAsChannelsAndGovernsBothRasters) {
  const std::vector<short> excluded(3, -5);
  for (const std::size_t entries : {0u, 3u, 5u}) {
    const typename TypeParam::Operator op = this->WithNoDataOfZero(entries);
    EXPECT_NE((Projections<short, short>(op, {0, 1, 1, 9}, {0, 1, 1, 9})), excluded) << entries;
  }
}

TYPED_TEST(TasseledCapChange, EachChannelHasNoDataOfItsOwn) {
  typename TypeParam::Operator op("Ikonos", "Ikonos", eDIFF_FORWARD);
  op.SetNoData(-5.0f);
  op.SetImgNoData({1, 2, 3, 4});
  op.SetRefNoData({5, 6, 7, 8});
  const std::vector<short> excluded(3, -5);
  EXPECT_NE((Projections<short, short>(op, {2, 1, 4, 50}, {1, 2, 3, 4})), excluded);
  EXPECT_EQ((Projections<short, short>(op, {2, 2, 4, 50}, {1, 2, 3, 4})), excluded);
  EXPECT_EQ((Projections<short, short>(op, {2, 1, 4, 50}, {1, 2, 3, 8})), excluded);
}

TYPED_TEST(TasseledCapChange, ZerosOfBothSignsAreNoDataOfZeroAndNaNMatchesNothing) {
  const typename TypeParam::Operator zero = this->WithNoDataOfZero(4);
  EXPECT_EQ((Projections<short, float>(zero, {1, -0.0f, 1, 1}, {1, 1, 1, 1})), std::vector<short>(3, -5));
  typename TypeParam::Operator nan("Ikonos", "Ikonos", eDIFF_FORWARD);
  nan.SetImgNoData(std::vector<float>(4, kNaN));
  nan.SetRefNoData(std::vector<float>(4, kNaN));
  EXPECT_TRUE(std::isnan((Projections<float, float>(nan, {1, kNaN, 1, 1}, {1, 1, 1, 1}))[0]));
}

TYPED_TEST(TasseledCapChange, MaskedPixelGetsNoDataInAllThreeChannels) {
  const typename TypeParam::Operator plain("Ikonos", "Ikonos", eDIFF_FORWARD);
  EXPECT_EQ((Projections<short, short>(plain, {1, 2, 3, 4}, {1, 2, 3, 4}, false)), std::vector<short>(3, 0));
  EXPECT_EQ((Projections<short, short>(this->WithNoDataOfZero(4), {1, 2, 3, 4}, {1, 2, 3, 4}, false)),
            std::vector<short>(3, -5));
}

/// What a masked pixel holds.
template <class Out, class Operator>
Out Excluded(float noData) {
  Operator op("Ikonos", "Ikonos", eDIFF_FORWARD);
  op.SetNoData(noData);
  return Projections<Out, short>(op, {1, 2, 3, 4}, {1, 2, 3, 4}, false)[1];
}

TYPED_TEST(TasseledCapChange, NoDataIsWrittenThroughClipToInFloat) {
  using Operator = typename TypeParam::Operator;
  EXPECT_EQ((Excluded<unsigned char, Operator>(-9999.5f)), 0);
  EXPECT_EQ((Excluded<short, Operator>(-9999.5f)), -10000);
  EXPECT_EQ((Excluded<double, Operator>(0.1f)), static_cast<double>(0.1f));
  EXPECT_EQ((Excluded<int, Operator>(8388609.0f)), 8388610);
  EXPECT_EQ((Excluded<int, Operator>(2147483520.0f)), 2147483520);
  EXPECT_EQ((Excluded<int, Operator>(2147483648.0f)), 2147483647);
  EXPECT_EQ((Excluded<unsigned int, Operator>(4294967040.0f)), 4294967040u);
  EXPECT_EQ((Excluded<unsigned int, Operator>(4294967296.0f)), 4294967295u);
  EXPECT_EQ((Excluded<std::int64_t, Operator>(-9999.5f)), 0);
  EXPECT_EQ((Excluded<std::int64_t, Operator>(2.75f)), 2);
}

// ---- golden: arithmetic

TYPED_TEST(TasseledCapChange, SampleCountsAsNoDataByItsFloatRoundingAndAValidOneKeepsAllItsDigits) {
  typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  op.SetNoData(-5.0f);
  op.SetImgNoData(std::vector<float>(4, 16777216.0f));
  op.SetRefNoData(std::vector<float>(4, 3.0f));
  const double weight = this->WeightOf("QuickBird", 3);
  const std::vector<double> excluded(3, -5.0);
  EXPECT_EQ((Projections<double, int>(op, {0, 0, 0, 16777217}, {0, 0, 0, 0})), excluded);
  EXPECT_EQ((Projections<double, double>(op, {0, 0, 0, 16777216.5}, {0, 0, 0, 0})), excluded);
  EXPECT_EQ((Projections<double, std::uint64_t>(op, {0, 0, 0, 16777217}, {0, 0, 0, 0})), excluded);
  EXPECT_EQ((Projections<double, int>(op, {0, 0, 0, 16777219}, {0, 0, 0, 0}))[0], weight * 16777219.0);
  EXPECT_EQ((Projections<double, double>(op, {0, 0, 0, 0.1}, {0, 0, 0, 0}))[0], weight * 0.1);
  EXPECT_EQ((Projections<double, std::int64_t>(op, {0, 0, 0, (std::int64_t{1} << 53) - 1}, {0, 0, 0, 0}))[0],
            weight * 9007199254740991.0);
}

TYPED_TEST(TasseledCapChange, SamplesOf64BitsRoundOnlyInTheConversionToDouble) {
  const typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  const double weight = this->WeightOf("QuickBird", 3);
  EXPECT_EQ((Projections<double, std::uint64_t>(op, {0, 0, 0, ~0ull}, {0, 0, 0, 0}))[0], weight * 0x1p64);
  EXPECT_EQ((Projections<double, std::int64_t>(op, {0, 0, 0, (std::int64_t{1} << 53) + 1}, {0, 0, 0, 0}))[0],
            weight * 0x1p53);
  EXPECT_EQ((Projections<double, std::int64_t>(op, {0, 0, 0, (std::int64_t{1} << 53) + 3}, {0, 0, 0, 0}))[0],
            weight * 9007199254740996.0);
}

TYPED_TEST(TasseledCapChange, ValuesAreRoundedByClipToFromDouble) {
  const typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  const double weight = this->WeightOf("QuickBird", 3);
  const std::vector<double> ten = {0, 0, 0, 10.5 / weight}, twenty = {0, 0, 0, 20.25 / weight};
  const std::vector<double> far = {0, 0, 0, 8388609.0 / weight};
  EXPECT_EQ((Projections<int, double>(op, far, far))[0], 8388609);
  EXPECT_EQ((Projections<short, double>(op, twenty, ten))[0], 20);
  EXPECT_EQ((Projections<short, double>(op, ten, twenty))[2], -10);
  EXPECT_EQ((Projections<unsigned char, double>(op, ten, twenty))[2], 0);
  EXPECT_EQ((Projections<char, double>(op, {0, 0, 0, -1000}, {0, 0, 0, 1000}))[0], -128);
}

TYPED_TEST(TasseledCapChange, NegativeDifferenceIs0InA64BitSignedOutputAndNothingIsRounded) {
  const typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  const double weight = this->WeightOf("QuickBird", 3);
  const std::vector<double> ten = {0, 0, 0, 10.75 / weight}, twenty = {0, 0, 0, 20.75 / weight};
  EXPECT_EQ((Projections<std::int64_t, double>(op, ten, twenty)), (std::vector<std::int64_t>{10, 20, 0}));
  EXPECT_EQ((Projections<std::uint64_t, double>(op, ten, twenty)), (std::vector<std::uint64_t>{10, 20, 0}));
}

TYPED_TEST(TasseledCapChange, NaNAndInfiniteSamplesFollowTheArithmetic) {
  const typename TypeParam::Operator op("Ikonos", "Ikonos", eDIFF_FORWARD);
  EXPECT_TRUE(std::isnan((Projections<float, float>(op, {1, kNaN, 1, 1}, {1, 1, 1, 1}))[0]));
  EXPECT_EQ((Projections<float, float>(op, {1, 1, 1, kInfinity}, {1, 1, 1, 1}))[2], kInfinity);
  EXPECT_EQ((Projections<int, float>(op, {1, 1, 1, kNaN}, {1, 1, 1, 1}))[0], std::numeric_limits<int>::min());
}

// ---- golden: rasters

TYPED_TEST(TasseledCapChange, ComplexRastersGiveTheFirstElementsOfTheirPixels) {
  Image<short> image({2, 1, 2}, {}, 0, true), reference({2, 1, 3}, {}, 0, true);
  image.SetPixel(1, 0, {0, 0, 0, 1000});
  reference.SetPixel(1, 0, {0, 0, 0, 100, 7, 7});
  Image<float> out({2, 1, 2}, {}, 77, true);
  const typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  op.Process(&image, &reference, nullptr, &out);
  const double weight = this->WeightOf("QuickBird", 3);
  EXPECT_EQ(out.At(1, 0, 0), static_cast<float>(weight * 1000));
  EXPECT_EQ(out.At(1, 0, 1), static_cast<float>(weight * 100));
  EXPECT_EQ(out.At(1, 0, 2), static_cast<float>(weight * 1000 - weight * 100));
  EXPECT_EQ(out.At(1, 0, 3), 77.0f);
}

TYPED_TEST(TasseledCapChange, ReferenceOfAnotherTypeIsReadAsTheImagesFromItsOwnAddresses) {
  Image<short> image({2, 1, 4});
  Image<int> reference({2, 1, 4});
  reference.SetPixel(1, 0, {0, 100 << 16, 1, 1});
  Image<float> out({2, 1, 3});
  const typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  op.Process(&image, &reference, nullptr, &out);
  EXPECT_EQ(out.At(1, 0, 1), static_cast<float>(this->WeightOf("QuickBird", 3) * 100));
}

TYPED_TEST(TasseledCapChange, ChannelsBehindTheThirdKeepTheirBits) {
  Image<short> image({2, 1, 4}), reference({2, 1, 4});
  Image<short> out({2, 1, 5}, {}, 77);
  Mask mask(2, 1);
  mask.SetValid(1, 0, false);
  const typename TypeParam::Operator op("QuickBird", "QuickBird", eDIFF_FORWARD);
  op.Process(&image, &reference, &mask, &out);
  EXPECT_EQ(std::vector<short>(&out.At(0, 0), &out.At(0, 0) + 10),
            (std::vector<short>{0, 0, 0, 77, 77, 0, 0, 0, 77, 77}));
}

// ---- differential

constexpr tests::ChangeLimits kLimits = {.leastRead = 6,
                                         .written = [](std::uint32_t, std::uint32_t) { return 3u; }};

/// A sensor of the table, now and then none.
std::string DrawSensor(tests::Random& random) {
  constexpr const char* kNames[] = {"Landsat-4 MSS",  "Landsat-5 MSS", "Landsat-4 TM", "Landsat-5 TM",
                                    "Landsat-7 ETM+", "Ikonos",        "QuickBird",    "Nikonos"};
  return random.Pick(kNames);
}

constexpr auto AreZeros = [](auto expected, auto actual) { return expected == 0 && actual == 0; };

/// Compares operator and twin on one case: the same bits, and a failure where the twin stops. The sign of a
/// backward difference of zero is left open.
template <class Axis>
::testing::AssertionResult AgreesWithTheTwin(tests::ChangeCase c) {
  const bool isSignOpen = c.out.type.isFloat && c.parameters.type == eDIFF_BACKWARD;
  if (isSignOpen) c.out.size.channels = std::max(c.out.size.channels, 3u);
  tests::Random random(~c.seed);
  auto params = tests::ParamsOf<typename Axis::Params>(c.parameters);
  params.sensorType = DrawSensor(random);
  params.refSensorType = DrawSensor(random);
  typename Axis::Operator op(params.sensorType, params.refSensorType, params.type);
  SetNoDataOf(c.parameters, op);
  const tests::ChangeScene expected(c);
  const bool isDone =
      Axis::kTwin(params, *expected.image, *expected.reference, expected.mask.get(), *expected.Out());
  bool hasFailed = false;
  const auto process = [&](Raster* image, Raster* reference, Mask* mask, Raster* out) {
    const auto run = [&] { op.Process(image, reference, mask, out); };
    if (isDone) run();
    if (!isDone) hasFailed = bool{FailsForTheSensor(run)};
    if (!isSignOpen) return;
    tests::WithPixelType(out->dataType, [&]<class T>() {
      tests::Settle<T>(*expected.Out(), *out, c.image.size, 2, AreZeros);
    });
  };
  const auto twin = [&](const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
    Axis::kTwin(params, image, reference, mask, out);
  };
  const ::testing::AssertionResult result = Agree(c, process, twin);
  if (result && hasFailed == isDone) return ::testing::AssertionFailure() << c << ": no failure";
  return result;
}

struct TasseledCapChangeDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(TasseledCapChangeDifferential, GreennessAgreesWithTheTwinBitForBit) {
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), kLimits))
    ASSERT_TRUE(AgreesWithTheTwin<Greenness>(c));
}

TEST_P(TasseledCapChangeDifferential, BrightnessAgreesWithTheTwinBitForBit) {
  for (const tests::ChangeCase& c : tests::ChangeCasesFrom(GetParam(), kLimits))
    ASSERT_TRUE(AgreesWithTheTwin<Brightness>(c));
}

INSTANTIATE_TEST_SUITE_P(From, TasseledCapChangeDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

}  // namespace
}  // namespace orvik::changedetection
