#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <numbers>
#include <ostream>
#include <set>
#include <string>
#include <typeinfo>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/gridmill.h"
#include "tests/support/capturedoutput.h"
#include "tests/support/changecases.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

// Every operator with every combination of its types, by way of `Process` alone.
namespace orvik {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::FillBytes;
using tests::IsUntouched;
using tests::PixelType;
using tests::Throws;

constexpr std::uint32_t kWidth = 5;
constexpr std::uint32_t kHeight = 4;
constexpr std::uint32_t kMargin = 2;
constexpr double kExcluded = 7.0;  // what excluded pixels hold where it can be chosen

/// Sample c of pixel (x, y) of the image, a number that every pixel type holds.
double Image(int x, int y, std::uint32_t c) { return 10.0 + x + 2.0 * y + 20.0 * c; }

/// The same of the reference, which lies above the image.
double Reference(int x, int y, std::uint32_t c) { return 20.0 + 2.0 * x + 3.0 * y + 20.0 * c; }

// ---- operators

/// The rasters and the mask of a call. Without a mask, or without a reference, those are null.
struct Call {
  Raster* in;
  Raster* reference;
  Mask* mask;
  Raster* out;

  bool IsValid(int x, int y) const { return mask == nullptr || mask->IsValid(x, y); }

  /// For a mask in which a set bit excludes the pixel: the same pixels.
  Mask Excluding() const {
    Mask reversed(kWidth, kHeight, {kMargin, kMargin}, false);
    if (mask != nullptr) {
      for (std::size_t i = 0; i < reversed.bits.size(); ++i)
        reversed.bits[i] = static_cast<unsigned char>(~mask->bits[i]);
    }
    return reversed;
  }
};

/// Which types an operator compares, and which it looks at.
enum class Takes {
  kPair,    ///< input and output, ten types each
  kInput,   ///< ten types of the input; the output is not looked at, the result is collected
  kDates,   ///< image and output, ten types each; the reference's type is not looked at
  kTriple,  ///< image, reference and output, four types each
};

/// What becomes of complex rasters.
enum class Complex {
  kRefused,    ///< with the message for other types
  kRealParts,  ///< of inputs and references the real parts are taken; of the output they are refused
  kElements,   ///< read and written element by element
  kPacked,     ///< the same, and rows are read by elements
};

/// The channels of the rasters of a call.
struct Channels {
  std::uint32_t in;
  std::uint32_t reference;  ///< 0: there is none
  std::uint32_t out;
};

/// Whether results keep their fraction until they are written.
enum class Results { kAsTheyAre, kTruncated };

/// One operator with workable parameters.
struct Operator {
  const char* name;
  const std::type_info* type;
  Takes takes;
  Complex complex;
  const char* refusal;  ///< what is thrown for a type outside the list
  Channels channels;

  /// Runs a new object on the rasters and checks what it has collected.
  void (*run)(const Call&);

  /// The samples that pixel (x, y) of the output gets, before they are converted to the output's type.
  std::vector<double> (*expected)(const Call&, int x, int y);
  Results results;

  /// The number of its combinations of types.
  std::size_t Combinations() const { return takes == Takes::kTriple ? 64 : 100; }
};

void PrintTo(const Operator& op, std::ostream* stream) { *stream << op.name; }

constexpr const char* kRequested = "Invalid type requested.";
constexpr const char* kToDispatch = "Invalid type to dispatch.";

std::vector<double> AllExcluded(std::size_t samples) { return std::vector<double>(samples, kExcluded); }

std::vector<double> Nothing(const Call&, int, int) { return {}; }

/// One sample, with the excluded pixels.
template <class Value>
std::vector<double> OneSample(const Call& call, int x, int y, Value value) {
  return call.IsValid(x, y) ? std::vector<double>{value()} : AllExcluded(1);
}

template <class Op>
void RunDates(Op op, const Call& call) {
  op.SetNoData(static_cast<float>(kExcluded));
  op.Process(call.in, call.reference, call.mask, call.out);
}

template <class Op>
void RunTwoMasks(Op op, const Call& call) {
  op.SetNoData(static_cast<float>(kExcluded));
  Mask excluding = call.Excluding();
  op.Process(call.in, call.reference, call.mask, &excluding, call.out);
}

// -- filters

void RunAverage(const Call& call) {
  filters::AverageChannels(static_cast<float>(kExcluded)).Process(call.in, call.mask, call.out, nullptr);
}
std::vector<double> Average(const Call& call, int x, int y) {
  return OneSample(call, x, y, [&] { return Image(x, y, 0) + 30.0; });
}

void RunBitmap(const Call& call) {
  filters::BitmapFiltering(14.0f, 18.0f).Process(call.in, call.mask, call.out);
}
std::vector<double> Bitmap(const Call& call, int x, int y) {
  const double sample = Image(x, y, 0);
  return {call.IsValid(x, y) && sample >= 14.0 && sample <= 18.0 ? 1.0 : 0.0};
}

void RunSlope(const Call& call) {
  filters::FilterSlp slope;
  slope.SetBackground(static_cast<float>(kExcluded));
  slope.Process(call.in, call.mask, call.out);
}
std::vector<double> Slope(const Call& call, int x, int y) {
  const double degrees = std::acos(1.0 / std::sqrt(6.0)) * 180.0 / std::numbers::pi;
  return OneSample(call, x, y, [&] { return degrees; });
}

void RunAspect(const Call& call) {
  filters::FilterAsp aspect;
  aspect.SetXSIZE(1.0f);
  aspect.SetYSIZE(1.0f);
  aspect.SetBackground(static_cast<float>(kExcluded));
  aspect.Process(call.in, call.mask, call.out);
}
std::vector<double> Aspect(const Call& call, int x, int y) {
  const double degrees = std::atan2(-2.0, -1.0) * 180.0 / std::numbers::pi + 450.0;
  return OneSample(call, x, y, [&] { return call.out->dataType.sizeBits == 8 ? degrees / 2.0 : degrees; });
}

void RunIntenPercent(const Call& call) {
  filters::IntenPercent percent;
  percent.SetMin(0.0);
  percent.SetMax(128.0);
  percent.SetScale(1.0);
  percent.SetNoData(kExcluded);
  percent.SetType(changedetection::eDIFF_ABSOLUTE);
  percent.SetBins(std::vector<int>(128, 1));  // every sample lies at the edge of a bin
  percent.Process(call.in, call.mask, call.out);
}
std::vector<double> IntenPercents(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(4);
  return {Image(x, y, 0), Image(x, y, 1), Image(x, y, 2), Image(x, y, 2) / 1.28};
}

void RunMirror(const Call& call) {
  filters::MirrorImg mirror;
  mirror.SetAxis("VERT");
  mirror.IsNewFile(false);
  mirror.Process(call.in, call.mask, call.out);
}
std::vector<double> Mirror(const Call& call, int x, int y) {
  const bool startsLater = !call.IsValid(0, y);
  const int source = !startsLater ? static_cast<int>(kWidth) - 1 - x : x == 0 ? 0 : 6 - x;
  return {Image(source, y, 0), Image(source, y, 1)};
}

void RunNormalize(const Call& call) {
  filters::Normalize normalize;
  normalize.SetMinData({0.0f, 10.0f});
  normalize.SetMaxData({100.0f, 60.0f});
  normalize.SetNoData(-1.0f);
  normalize.Process(call.in, call.mask, call.out);
}
std::vector<double> Percentages(const Call&, int x, int y) {
  return {Image(x, y, 0), (Image(x, y, 1) - 10.0) * 2.0};
}

void RunPercentile(const Call& call) {
  filters::Percentile percentile;
  percentile.SetBinNum(64);
  percentile.SetMinData({0.0f, 0.0f});
  percentile.SetMaxData({64.0f, 64.0f});
  percentile.SetNoData(-1.0f);
  percentile.SetCoefficients(std::vector<int>(128, 1));  // every sample lies at the edge of a bin
  percentile.Process(call.in, call.mask, call.out);
}
std::vector<double> Percentiles(const Call&, int x, int y) {
  return {Image(x, y, 0) / 0.64, Image(x, y, 1) / 0.64};
}

void RunVegIndex(const Call& call) {
  filters::VegIndex index;
  std::vector<unsigned int> requests(12, 0u);
  requests[filters::eINDEX_EXCESS_GREEN] = requests[filters::eINDEX_DVI] = requests[filters::eINDEX_RVI] = 1;
  index.SetRequestedIndex(requests);
  index.SetBandIndex({filters::eBAND_BLUE, filters::eBAND_GREEN, filters::eBAND_RED, filters::eBAND_NIR});
  index.Process(call.in, call.mask, call.out);
}
std::vector<double> Indices(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return std::vector<double>(3, static_cast<double>(-1e20f));
  return {127.5, 20.0, Image(x, y, 3) / Image(x, y, 2)};
}

/// The columns at which a row is read that counts as many positions as `Counts` says, from the left end on.
template <class Counts>
int Positions(int end, Counts counts) {
  int positions = 0;
  for (int x = 0; x < end; ++x) positions += counts(x) ? 1 : 0;
  return positions;
}

void RunSqrGradient(const Call& call) {
  filters::SqrGradientEvaluation gradient;
  gradient.InitEvaluation(call.in->channels);
  const tests::CapturedOutput output;
  gradient.Process(call.in, call.mask, call.out);
  double sum = 0.0;
  for (int y = 0; y + 1 < static_cast<int>(kHeight); ++y) {
    const auto counts = [&](int x) { return call.IsValid(x, y) && call.IsValid(x, y + 1); };
    sum += 4.0 * Positions(kWidth, counts);
  }
  EXPECT_EQ(gradient.GetEvaluation(), std::vector<double>(call.in->channels, sum));
}

void RunVollath(const Call& call) {
  filters::VollathEvaluation vollath;
  vollath.Process(call.in, call.mask, call.out);
  std::vector<double> left(call.in->channels, 0.0), right = left;
  for (int y = 0; y < static_cast<int>(kHeight); ++y) {
    const auto counts = [&](int x) { return call.IsValid(x, y) && call.IsValid(x + 1, y); };
    for (int x = 0, end = Positions(kWidth - 2, counts); x < end; ++x) {
      for (std::uint32_t c = 0; c < call.in->channels; ++c) {
        left[c] += Image(x, y, c) * Image(x + 1, y, c);
        right[c] += Image(x, y, c) * Image(x + 2, y, c);
      }
    }
  }
  EXPECT_EQ(vollath.GetLeftEq(), left);
  EXPECT_EQ(vollath.GetRightEq(), right);
}

// -- two dates

using namespace changedetection;

void RunSingle(const Call& call) {
  SingleChange(eDIFF_FORWARD).Process(call.in, call.reference, call.mask, call.out);
}
std::vector<double> Single(const Call& call, int x, int y) {
  return {call.IsValid(x, y) ? Reference(x, y, 0) - Image(x, y, 0) : 0.0};
}

void RunChanDiff(const Call& call) { RunDates(ChanDiffChange(eDIFF_BACKWARD), call); }
void RunChanDiff2(const Call& call) { RunTwoMasks(ChanDiffChange2(eDIFF2_ABSOLUTE), call); }
std::vector<double> Differences(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(2);
  return {Reference(x, y, 0) - Image(x, y, 0), Reference(x, y, 1) - Image(x, y, 1)};
}

void RunChanRatio(const Call& call) { RunTwoMasks(ChanRatioChange(eDIFF2_SIGNED), call); }
void RunChanRatio2(const Call& call) { RunDates(ChanRatioChange2(eDIFF_FORWARD), call); }
std::vector<double> Ratios(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(2);
  return {Image(x, y, 0) / Reference(x, y, 0), Image(x, y, 1) / Reference(x, y, 1)};
}

void RunComb(const Call& call) { RunDates(CombChange(eDIFF_FORWARD), call); }
std::vector<double> Combination(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(3);
  return {Image(x, y, 0), Image(x, y, 1), Reference(x, y, 0)};
}

void RunIntenRatio(const Call& call) { RunDates(IntenRatioChange(eDIFF_FORWARD), call); }
std::vector<double> IntenRatio(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(4);
  const double image = Image(x, y, 0) + 10.0, reference = Reference(x, y, 0) + 10.0;
  return {image, reference, 10.0 * std::log10(image / reference), 0.0};
}

void RunMagnitude(const Call& call) { RunDates(MagnitudeChange(eDIFF_BACKWARD), call); }
std::vector<double> Magnitude(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(3);
  const double image = std::hypot(Image(x, y, 0), Image(x, y, 1));
  const double reference = std::hypot(Reference(x, y, 0), Reference(x, y, 1));
  return {image, reference, reference - image};
}

/// The tasseled cap of both dates with the weights of "QuickBird".
std::vector<double> TasseledCap(const Call& call, int x, int y, const std::array<double, 4>& weights) {
  if (!call.IsValid(x, y)) return AllExcluded(3);
  double image = 0.0, reference = 0.0;
  for (std::uint32_t c = 0; c < 4; ++c) {
    image += weights[c] * Image(x, y, c);
    reference += weights[c] * Reference(x, y, c);
  }
  return {image, reference, image - reference};
}
void RunGreenness(const Call& call) { RunDates(TCGNChange("QuickBird", "QuickBird", eDIFF_FORWARD), call); }
std::vector<double> Greenness(const Call& call, int x, int y) {
  return TasseledCap(call, x, y, {-0.121, -0.331, -0.517, 0.78});
}
void RunBrightness(const Call& call) { RunDates(TCSBChange("QuickBird", "QuickBird", eDIFF_FORWARD), call); }
std::vector<double> Brightness(const Call& call, int x, int y) {
  return TasseledCap(call, x, y, {0.319, 0.542, 0.49, 0.604});
}

// -- raster services

void RunStatistics(const Call& call) {
  gridmill::RasterStatistics statistics;
  std::vector<unsigned int> channels = {0, 1, 2};
  statistics.SetChans(channels);
  statistics.SetType(8);
  statistics.SetMethod(gridmill::eSTATISTICS_PLAIN);
  statistics.Process(call.in, call.mask, call.out);
  std::vector<float> least, greatest, expectedLeast, expectedGreatest;
  statistics.GetMinValue(least);
  statistics.GetMaxValue(greatest);
  for (std::uint32_t c = 0; c < channels.size(); ++c) {
    std::vector<int> counts(256, 0);
    for (int y = 0; y < static_cast<int>(kHeight); ++y)
      for (int x = 0; x < static_cast<int>(kWidth); ++x) ++counts[static_cast<std::size_t>(Image(x, y, c))];
    EXPECT_EQ(statistics.GetPixelCounts(static_cast<int>(c)), counts);
    expectedLeast.push_back(static_cast<float>(Image(0, 0, c)));
    expectedGreatest.push_back(static_cast<float>(Image(kWidth - 1, kHeight - 1, c)));
  }
  EXPECT_EQ(least, expectedLeast);
  EXPECT_EQ(greatest, expectedGreatest);
}

void RunClasses(const Call& call) {
  gridmill::RangeClasses classes;
  classes.SetNumClasses(3);
  classes.SetMinRange({8.0f, 13.5f, 16.0f});
  classes.SetMaxRange({17.0f, 19.0f, 18.0f});
  classes.SetNoData(12.0f);
  classes.Process(call.in, call.mask, call.out);
  EXPECT_EQ(classes.GetClassNumber(), 3);
  std::vector<float> bounds;
  classes.GetMinRangeValue(bounds);
  classes.GetMaxRangeValue(bounds);
  EXPECT_EQ(bounds, (std::vector<float>{8.0f, 13.5f, 16.0f, 17.0f, 19.0f, 18.0f}));
}
std::vector<double> Classes(const Call&, int x, int y) {
  static constexpr int kClassOf[] = {1, 1, 0, 1, 2, 2, 2, 3, 2, 0, 0};  // of samples from 10 on
  return {static_cast<double>(kClassOf[static_cast<std::size_t>(Image(x, y, 0)) - 10])};
}

void RunTransfer(const Call& call) {
  gridmill::IIIDataTransfer transfer;
  std::vector<unsigned int> from = {0, 0, kWidth, kHeight}, to = {0, 0, 2 * kWidth, 2 * kHeight};
  transfer.SetInRegion(from);
  transfer.SetOutRegion(to);
  transfer.SetResampleType(eRESAMPLE_NEAREST);
  transfer.Process(call.in, call.mask, call.out);
}
std::vector<double> Transfer(const Call& call, int x, int y) {
  std::vector<double> samples;
  for (std::uint32_t c = 0; c < call.in->channels * (call.in->dataType.isComplex ? 2 : 1); ++c)
    samples.push_back(Image((x + 1) / 2, (y + 1) / 2, c));
  return samples;
}

void RunBlue(const Call& call) {
  gridmill::SPOTBlue blue;
  std::vector<float> least(3, 0.0f), greatest(3, 200.0f), background(3, static_cast<float>(kExcluded));
  blue.SetMin(least);
  blue.SetMax(greatest);
  blue.SetBackGround(background);
  blue.SetTrim(false);
  blue.Process(call.in, call.mask, call.out);
}
std::vector<double> Blue(const Call& call, int x, int y) {
  if (!call.IsValid(x, y)) return AllExcluded(3);
  const double green = Image(x, y, 0), red = Image(x, y, 1), infrared = Image(x, y, 2);
  return {red, green, green * 0.873393 + 13.9054 - red * 0.138254 - infrared * 0.100616};
}

// -- the table

/// The names of the classes, one by one.
constexpr const char* kClasses[] = {"AverageChannels",  "BitmapFiltering", "ChanDiffChange",
                                    "ChanDiffChange2",  "ChanRatioChange", "ChanRatioChange2",
                                    "CombChange",       "FilterAsp",       "FilterSlp",
                                    "IIIDataTransfer",  "IntenPercent",    "IntenRatioChange",
                                    "MagnitudeChange",  "MirrorImg",       "Normalize",
                                    "Percentile",       "RangeClasses",    "RasterStatistics",
                                    "SPOTBlue",         "SingleChange",    "SqrGradientEvaluation",
                                    "TCGNChange",       "TCSBChange",      "VegIndex",
                                    "VollathEvaluation"};

/// The row of the class `Op`.
template <class Op>
Operator Row(const char* name, Takes takes, Complex complex, const char* refusal, const Channels& channels,
             void (*run)(const Call&), std::vector<double> (*expected)(const Call&, int, int),
             Results results = Results::kAsTheyAre) {
  return {name, &typeid(Op), takes, complex, refusal, channels, run, expected, results};
}

std::vector<Operator> Filters() {
  using namespace filters;
  using enum Takes;
  using enum Complex;
  return {
      Row<AverageChannels>("AverageChannels", kPair, kRealParts, kRequested, {4, 0, 1}, RunAverage, Average),
      Row<BitmapFiltering>("BitmapFiltering", kPair, kPacked, kToDispatch, {1, 0, 1}, RunBitmap, Bitmap),
      Row<FilterSlp>("FilterSlp", kPair, kRealParts, kToDispatch, {1, 0, 1}, RunSlope, Slope,
                     Results::kTruncated),
      Row<FilterAsp>("FilterAsp", kPair, kRealParts, kToDispatch, {1, 0, 1}, RunAspect, Aspect),
      Row<IntenPercent>("IntenPercent", kPair, kRefused, kToDispatch, {3, 0, 5}, RunIntenPercent,
                        IntenPercents, Results::kTruncated),
      Row<MirrorImg>("MirrorImg", kPair, kRefused, kRequested, {2, 0, 2}, RunMirror, Mirror),
      Row<Normalize>("Normalize", kPair, kRefused, kRequested, {2, 0, 2}, RunNormalize, Percentages),
      Row<Percentile>("Percentile", kPair, kRefused, kRequested, {2, 0, 2}, RunPercentile, Percentiles,
                      Results::kTruncated),
      Row<VegIndex>("VegIndex", kPair, kRefused, kRequested, {4, 0, 4}, RunVegIndex, Indices),
      Row<SqrGradientEvaluation>("SqrGradientEvaluation", kInput, kRefused, kRequested, {2, 0, 1},
                                 RunSqrGradient, Nothing),
      Row<VollathEvaluation>("VollathEvaluation", kInput, kRefused, kRequested, {2, 0, 1}, RunVollath,
                             Nothing),
  };
}

std::vector<Operator> Changes() {
  using enum Takes;
  using enum Complex;
  return {
      Row<SingleChange>("SingleChange", kDates, kElements, kToDispatch, {1, 1, 2}, RunSingle, Single),
      Row<ChanDiffChange>("ChanDiffChange", kDates, kElements, kToDispatch, {2, 2, 2}, RunChanDiff,
                          Differences),
      Row<ChanDiffChange2>("ChanDiffChange2", kTriple, kRealParts, kRequested, {2, 2, 2}, RunChanDiff2,
                           Differences),
      Row<ChanRatioChange>("ChanRatioChange", kTriple, kRealParts, kRequested, {2, 2, 2}, RunChanRatio,
                           Ratios),
      Row<ChanRatioChange2>("ChanRatioChange2", kTriple, kRealParts, kRequested, {2, 2, 2}, RunChanRatio2,
                            Ratios),
      Row<CombChange>("CombChange", kDates, kElements, kToDispatch, {2, 1, 3}, RunComb, Combination),
      Row<IntenRatioChange>("IntenRatioChange", kDates, kElements, kToDispatch, {2, 2, 4}, RunIntenRatio,
                            IntenRatio),
      Row<MagnitudeChange>("MagnitudeChange", kDates, kElements, kToDispatch, {2, 2, 3}, RunMagnitude,
                           Magnitude),
      Row<TCGNChange>("TCGNChange", kDates, kElements, kToDispatch, {4, 4, 3}, RunGreenness, Greenness),
      Row<TCSBChange>("TCSBChange", kDates, kElements, kToDispatch, {4, 4, 3}, RunBrightness, Brightness),
  };
}

std::vector<Operator> Services() {
  using namespace gridmill;
  using enum Takes;
  using enum Complex;
  return {
      Row<RasterStatistics>("RasterStatistics", kInput, kElements, kToDispatch, {3, 0, 1}, RunStatistics,
                            Nothing),
      Row<RangeClasses>("RangeClasses", kPair, kRefused, kRequested, {1, 0, 1}, RunClasses, Classes),
      Row<IIIDataTransfer>("IIIDataTransfer", kPair, kElements, kRequested, {2, 0, 4}, RunTransfer, Transfer),
      Row<SPOTBlue>("SPOTBlue", kPair, kElements, kToDispatch, {3, 0, 3}, RunBlue, Blue),
  };
}

std::vector<Operator> Operators() {
  std::vector<Operator> all;
  for (const std::vector<Operator>& some : {Filters(), Changes(), Services()})
    all.insert(all.end(), some.begin(), some.end());
  return all;
}

std::vector<Operator> OperatorsOnTwoDates() {
  std::vector<Operator> all = Operators();
  std::erase_if(all, [](const Operator& op) { return op.takes != Takes::kDates; });
  return all;
}

// ---- rasters

std::uint32_t ElementsOf(const Raster& raster) {
  return raster.channels * (raster.dataType.isComplex ? 2 : 1);
}

/// Calls `function(index, x, y, c)` for each element of the buffer, margins included, in their order.
template <class Function>
void ForEachElement(const Raster& raster, Function function) {
  std::size_t index = 0;
  const int margin = static_cast<int>(kMargin);
  for (int y = -margin; y < static_cast<int>(raster.height) + margin; ++y) {
    for (int x = -margin; x < static_cast<int>(raster.width) + margin; ++x)
      for (std::uint32_t c = 0; c < ElementsOf(raster); ++c) function(index++, x, y, c);
  }
}

/// All elements of the buffer as numbers.
std::vector<double> Numbers(const Raster& raster) {
  std::vector<double> numbers;
  tests::WithPixelType(raster.dataType, [&]<class T>() {
    const T* const elements = reinterpret_cast<const T*>(raster.data);
    numbers.assign(elements, elements + raster.dataSize / sizeof(T));
  });
  return numbers;
}

void SetNumbers(Raster& raster, const std::vector<double>& numbers) {
  tests::WithPixelType(raster.dataType, [&]<class T>() {
    std::transform(numbers.begin(), numbers.end(), reinterpret_cast<T*>(raster.data),
                   [](double number) { return static_cast<T>(number); });
  });
}

/// Sets the samples of an image or of a reference; those of a complex one to where the operator looks for
/// them.
void FillSamples(Raster& raster, Complex complex, double (*sample)(int x, int y, std::uint32_t c)) {
  std::vector<double> numbers(raster.dataSize / (raster.dataType.sizeBits / 8));
  ForEachElement(raster, [&](std::size_t i, int x, int y, std::uint32_t c) {
    if (raster.dataType.isComplex && complex == Complex::kPacked) {
      numbers[i] = sample(2 * x + static_cast<int>(c), y, 0);
    } else if (raster.dataType.isComplex && complex == Complex::kRealParts) {
      numbers[i] = c % 2 == 0 ? sample(x, y, c / 2) : 1.0;
    } else {
      numbers[i] = sample(x, y, c % 4);
    }
  });
  SetNumbers(raster, numbers);
}

/// The types of the rasters of a call.
struct Types {
  DataType in = tessel::eDT_16S;
  DataType reference = tessel::eDT_16S;
  DataType out = tessel::eDT_16S;
};

bool IsPixelType(const DataType& type) {
  return std::any_of(tests::kPixelTypes.begin(), tests::kPixelTypes.end(), [&](const PixelType& known) {
    return type == known.element || type == DataType(known.element, true);
  });
}

/// The rasters and the mask of a call, those of no pixel type and the output full of sentinels.
struct Scene {
  Raster in, reference, out;
  Mask mask{kWidth, kHeight, {kMargin, kMargin}};
  bool hasReference;

  Scene(const Operator& op, const Types& types)
      : in({kWidth, kHeight, op.channels.in, types.in}, {kMargin, kMargin}),
        reference({kWidth, kHeight, op.channels.reference, types.reference}, {kMargin, kMargin}),
        out({kWidth, kHeight, op.channels.out, types.out}, {kMargin, kMargin}),
        hasReference(op.channels.reference != 0) {
    for (Raster* const raster : {&in, &reference, &out}) FillBytes(*raster);
    if (IsPixelType(types.in)) FillSamples(in, op.complex, Image);
    if (IsPixelType(types.reference)) FillSamples(reference, op.complex, Reference);
    mask.SetValid(0, 0, false);  // no other pixel's cell holds this one
  }

  Call With(bool isMasked) {
    return {&in, hasReference ? &reference : nullptr, isMasked ? &mask : nullptr, &out};
  }
};

// ---- verdicts

/// A number within the range of `ClipTo`.
double Clipped(double value, const DataType& type) {
  if (type.isFloat) return value;
  const int bits = static_cast<int>(type.sizeBits);
  const double least = type.isSigned && bits < 64 ? -std::ldexp(1.0, bits - 1) : 0.0;
  return std::clamp(value, least, std::ldexp(1.0, type.isSigned ? bits - 1 : bits) - 1.0);
}

/// Whether `stored` is what an output of this type holds for the result `value`. Integers of 64 bits are
/// truncated, others rounded.
bool IsStored(double value, double stored, const DataType& type, Results results) {
  const double wanted = Clipped(value, type), error = std::abs(stored - wanted);
  if (results == Results::kTruncated && value != kExcluded) return error < 1.0;
  if (type.isFloat) return error <= 1e-5 * std::max(1.0, std::abs(wanted));
  return type.sizeBits == 64 ? stored <= wanted + 1e-4 && error < 1.0 : error <= 0.5 + 1e-4;
}

/// Runs an operator and compares the whole buffer of the output: results in the samples that are written,
/// sentinels in the others and in the margin.
::testing::AssertionResult Works(const Operator& op, const Types& types, bool isMasked) {
  Scene scene(op, types);
  const Call call = scene.With(isMasked);
  const std::vector<double> before = Numbers(scene.out);
  op.run(call);
  const std::vector<double> after = Numbers(scene.out);
  ::testing::AssertionResult verdict = ::testing::AssertionSuccess();
  ForEachElement(scene.out, [&](std::size_t i, int x, int y, std::uint32_t c) {
    if (!verdict) return;
    const bool isInside = x >= 0 && y >= 0 && x < static_cast<int>(kWidth) && y < static_cast<int>(kHeight);
    const std::vector<double> expected = isInside ? op.expected(call, x, y) : std::vector<double>();
    const bool isWritten = c < expected.size();
    if (isWritten ? IsStored(expected[c], after[i], types.out, op.results) : after[i] == before[i]) return;
    verdict = ::testing::AssertionFailure()
              << tests::NameOf(types.in) << ' ' << tests::NameOf(types.reference) << ' '
              << tests::NameOf(types.out) << (isMasked ? ", masked" : "") << ": sample " << c << " of (" << x
              << ", " << y << ") is " << after[i] << ", not " << (isWritten ? expected[c] : before[i]);
  });
  return verdict;
}

/// Calls `visit(types)` for each combination of types that an operator has.
template <class Visit>
void ForEachCombination(const Operator& op, Visit visit) {
  if (op.takes == Takes::kTriple) {
    for (const PixelType& in : tests::kShortPixelTypes) {
      for (const PixelType& reference : tests::kShortPixelTypes)
        for (const PixelType& out : tests::kShortPixelTypes)
          visit(Types{in.element, reference.element, out.element});
    }
    return;
  }
  for (const PixelType& in : tests::kPixelTypes)
    for (const PixelType& out : tests::kPixelTypes) visit(Types{in.element, in.element, out.element});
}

/// The types that an operator takes for one raster.
std::vector<DataType> Listed(const Operator& op) {
  std::vector<DataType> types;
  for (const PixelType& type : tests::kPixelTypes)
    if (op.takes != Takes::kTriple || tests::IsShortPixelType(type)) types.push_back(type.element);
  return types;
}

/// Real types that an operator does not take: none, one bit, a descriptor of nothing, and what else is in the
/// full list alone.
std::vector<DataType> Unlisted(const Operator& op) {
  DataType unknown = tessel::eDT_16S;
  unknown.mantissaBits = 7;
  std::vector<DataType> types = {DataType(), tessel::eDT_BIT, unknown};
  for (const PixelType& type : tests::kPixelTypes)
    if (op.takes == Takes::kTriple && !tests::IsShortPixelType(type)) types.push_back(type.element);
  return types;
}

/// Passes if a call with these types throws the message and writes nothing.
::testing::AssertionResult IsRefused(const Operator& op, const Types& types, const char* message) {
  Scene scene(op, types);
  const ::testing::AssertionResult isThrown = Throws<Exception>(message, [&] { op.run(scene.With(false)); });
  if (!isThrown || IsUntouched(scene.out)) return isThrown;
  return ::testing::AssertionFailure() << "the output was written";
}

// ---- tests

TEST(AllOperators, EachClassHasItsRow) {
  std::set<std::string> names;
  for (const Operator& op : Operators()) {
    names.insert(op.name);
    const std::string name = op.name;
    EXPECT_NE(std::string(op.type->name()).find(std::to_string(name.size()) + name + "E"), std::string::npos)
        << name << " is the row of " << op.type->name();
  }
  EXPECT_EQ(names, std::set<std::string>(std::begin(kClasses), std::end(kClasses)));
  EXPECT_EQ(names.size(), 25u);
  EXPECT_EQ(Operators().size(), 25u);
}

TEST(AllOperators, RowsMakeAllInnerProcessors) {
  std::size_t pairs = 0, triples = 0;
  for (const Operator& op : Operators()) (op.takes == Takes::kTriple ? triples : pairs) += op.Combinations();
  EXPECT_EQ(pairs, 22u * 100u);
  EXPECT_EQ(triples, 3u * 64u);
}

class EachOperator : public ::testing::TestWithParam<Operator> {};
INSTANTIATE_TEST_SUITE_P(AllOperators, EachOperator, ::testing::ValuesIn(Operators()),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_P(EachOperator, RunsWithEachCombinationOfItsTypes) {
  const Operator& op = GetParam();
  std::size_t run = 0;
  ForEachCombination(op, [&](const Types& types) {
    ASSERT_NO_THROW({
      EXPECT_TRUE(Works(op, types, false));
      EXPECT_TRUE(Works(op, types, true));
    }) << tests::NameOf(types.in)
       << ' ' << tests::NameOf(types.reference) << ' ' << tests::NameOf(types.out);
    ++run;
  });
  EXPECT_EQ(run, op.Combinations());
}

TEST_P(EachOperator, RefusesATypeOutsideItsListInEachPosition) {
  const Operator& op = GetParam();
  const DataType listed = tessel::eDT_16S;
  for (const DataType& type : Unlisted(op)) {
    EXPECT_TRUE(IsRefused(op, {type, type, listed}, op.refusal)) << type.sizeBits;
    if (op.takes == Takes::kInput) {
      Scene scene(op, {listed, listed, type});
      EXPECT_NO_THROW(op.run(scene.With(false))) << type.sizeBits;
      EXPECT_TRUE(IsUntouched(scene.out)) << type.sizeBits;
    } else {
      EXPECT_TRUE(IsRefused(op, {listed, listed, type}, op.refusal)) << type.sizeBits;
    }
    if (op.takes == Takes::kTriple) {
      EXPECT_TRUE(IsRefused(op, {listed, type, listed}, op.refusal)) << type.sizeBits;
    }
  }
}

TEST_P(EachOperator, TakesOrRefusesComplexInputs) {
  const Operator& op = GetParam();
  for (const DataType& type : Listed(op)) {
    DataType complex = type;
    complex.isComplex = true;
    if (op.complex == Complex::kRefused) {
      EXPECT_TRUE(IsRefused(op, {complex, complex, type}, op.refusal)) << tests::NameOf(type);
      continue;
    }
    for (const bool isMasked : {false, true}) {
      EXPECT_TRUE(Works(op, {complex, complex, type}, isMasked));
      if (op.takes != Takes::kTriple) continue;
      EXPECT_TRUE(Works(op, {complex, type, type}, isMasked));
      EXPECT_TRUE(Works(op, {type, complex, type}, isMasked));
    }
  }
}

TEST_P(EachOperator, TakesOrRefusesComplexOutputs) {
  const Operator& op = GetParam();
  const char* const refusal = op.complex == Complex::kRealParts ? "Output cannot be complex" : op.refusal;
  const bool isTaken =
      op.takes == Takes::kInput || op.complex == Complex::kElements || op.complex == Complex::kPacked;
  for (const DataType& type : Listed(op)) {
    DataType complex = type;
    complex.isComplex = true;
    if (!isTaken) {
      EXPECT_TRUE(IsRefused(op, {type, type, complex}, refusal)) << tests::NameOf(type);
      EXPECT_TRUE(IsRefused(op, {complex, complex, complex}, refusal)) << tests::NameOf(type);
      continue;
    }
    for (const bool isMasked : {false, true}) {
      EXPECT_TRUE(Works(op, {type, type, complex}, isMasked));
      if (op.complex != Complex::kRefused) {
        EXPECT_TRUE(Works(op, {complex, complex, complex}, isMasked));
      }
    }
  }
}

class EachOperatorOnTwoDates : public ::testing::TestWithParam<Operator> {};
INSTANTIATE_TEST_SUITE_P(AllOperators, EachOperatorOnTwoDates, ::testing::ValuesIn(OperatorsOnTwoDates()),
                         [](const auto& info) { return std::string(info.param.name); });

TEST_P(EachOperatorOnTwoDates, DoesNotLookAtTheTypeOfTheReference) {
  const Operator& op = GetParam();
  for (const DataType& type : Unlisted(op)) {
    if (type.sizeBits < 16) continue;  // its pixels have no place of their own
    Scene scene(op, {tessel::eDT_16S, type, tessel::eDT_16S});
    EXPECT_NO_THROW(op.run(scene.With(false)));
    EXPECT_FALSE(IsUntouched(scene.out));
  }
}

}  // namespace
}  // namespace orvik
