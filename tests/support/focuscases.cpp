#include "tests/support/focuscases.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <limits>
#include <sstream>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"

namespace orvik::tests {
namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

constexpr std::uint32_t kWidths[] = {0,   1,   2,    3,    4,    5,    6,    7,    8,    9,
                                     15,  16,  17,   18,   31,   33,   34,   63,   64,   65,
                                     66,  127, 129,  255,  256,  257,  258,  259,  511,  513,
                                     514, 601, 1023, 1026, 2047, 2048, 2049, 2050, 2051, 4099};
constexpr std::uint32_t kHeights[] = {0, 1, 1, 2, 2, 3, 3, 4, 5, 9};
constexpr std::uint32_t kChannels[] = {1, 1, 1, 1, 2, 2, 3, 3, 4, 5, 6, 7, 8};
constexpr std::uint32_t kManyChannels[] = {16, 17, 33, 64, 129, 300};
constexpr std::size_t kSequences = 100;
constexpr std::size_t kLargestSequence = 5;

constexpr double kLows[] = {-10000000.0, -1e300, -kInfinity, -kInfinity, 0.0,    -0.0,   -1.0,    1.0,
                            2.5,         -128.0, 12.5,       100.0,      1e-320, 0x1p53, -0x1p63, kNaN};
constexpr double kHighs[] = {10000000.0, 1e300, kInfinity, kInfinity, 255.0,  256.0,  3.0,    2.5, 127.5,
                             40.0,       0.0,   65535.0,   0x1p31,    0x1p32, 0x1p63, 0x1p64, kNaN};
constexpr double kFailures[] = {-32767.0,   0.0,    1.0,     2.0,  3.0,  2.0 + 5e-10, 2.0 - 1e-9, 2.0 + 1e-9,
                                1.0 + 2e-9, 255.0,  65535.0, -1.0, 1e-9, -1e-9,       5e-10,      12.5,
                                0x1p53,     0x1p63, 0x1p64,  1e20, kNaN, kInfinity,   -kInfinity, -0.0};

FocusParameters DrawParameters(Random& random) {
  FocusParameters parameters;
  if (random.OneIn(3)) {
    parameters.low = random.OneIn(2) ? -1e300 : -kInfinity;
    parameters.high = -parameters.low;
  } else if (!random.OneIn(3)) {
    parameters.low = random.Pick(kLows);
    parameters.high = random.Pick(kHighs);
  }
  if (!random.OneIn(3)) parameters.failure = random.Pick(kFailures);
  return parameters;
}

/// Values at and around what the parameters reject.
std::vector<double> BoundariesOf(const FocusParameters& p) {
  return {p.failure,
          p.failure + 1e-9,
          p.failure - 1e-9,
          std::nextafter(p.failure + 1e-9, p.failure),
          std::nextafter(p.failure - 1e-9, p.failure),
          p.failure + 1.0,
          p.low,
          std::nextafter(p.low, kInfinity),
          p.high,
          std::nextafter(p.high, -kInfinity),
          kNaN,
          kInfinity};
}

Size DrawSize(Random& random, std::uint32_t channels) {
  Size size = {random.Pick(kWidths), random.Pick(kHeights), channels};
  if (channels > 8) size.width %= 10;
  if (size.width > 1000) size.height = std::min(size.height, 3u);
  return size;
}

FocusStep DrawStep(Random& random, std::uint32_t channels, const std::vector<double>& extra) {
  FocusStep step;
  step.size = DrawSize(random, channels);
  step.margins = {random.Below(4), random.Below(3)};
  step.maskKind = random.Pick(kMaskKinds);
  step.maskGeometry = random.OneIn(3) ? random.Pick(kMaskGeometries) : MaskGeometry::eSAME;
  if (!random.OneIn(3)) step.fill = random.Pick(kFills);
  step.extra = extra;
  step.seed = random.Bits();
  return step;
}

std::vector<FocusStep> DrawSequence(Random& random, const PixelType& first) {
  const std::uint32_t channels = random.OneIn(12) ? random.Pick(kManyChannels) : random.Pick(kChannels);
  const bool isInitialised = !random.OneIn(8);
  std::vector<FocusStep> steps;
  tessel::DataType type = first.element;
  FocusParameters parameters;
  for (std::size_t left = 1 + random.Below(kLargestSequence); left > 0; --left) {
    const bool isFirst = steps.empty();
    const bool isRebuilt = isFirst || random.OneIn(4);
    const bool isRefusedBefore = random.OneIn(10);
    const bool setsParameters = !random.OneIn(3);
    if (setsParameters) parameters = DrawParameters(random);
    if (isRebuilt && !isFirst) type = random.Pick(kPixelTypes).element;
    const bool isFewer = !isRebuilt && !isRefusedBefore && random.OneIn(6);
    FocusStep step =
        DrawStep(random, isFewer ? 1 + random.Below(channels) : channels, BoundariesOf(parameters));
    step.type = type;
    step.isRefusedBefore = isRefusedBefore;
    if (setsParameters) step.parameters = parameters;
    if (isFirst ? isInitialised : random.OneIn(6))
      step.initialised = random.OneIn(6) ? random.Below(channels) : channels;
    steps.push_back(step);
  }
  return steps;
}

/// Numbers whose products and squares are rounded in all ways as they are added: of few significant bits, so
/// that many lie halfway between two sums, at powers of two from `lowest` on.
struct Magnitudes {
  std::uint64_t significands, powers;
  int lowest;
  bool isSigned;

  Magnitudes(Random& random, bool isInteger) {
    constexpr std::uint64_t kSignificands[] = {1, 2, 8, 256, 1u << 15, 1u << 24, std::uint64_t{1} << 53};
    constexpr std::uint64_t kPowers[] = {1, 2, 4, 16, 28, 60};
    constexpr int kLowest[] = {-60, -26, -10, 0, 10, 100, -520, -540, 500};
    significands = random.Pick(kSignificands);
    powers = random.Pick(kPowers);
    lowest = isInteger ? 0 : random.Pick(kLowest);
    isSigned = random.OneIn(2);
  }
  double Draw(Random& random) const {
    const auto significand = static_cast<double>(1 + random.Bits() % significands);
    const double value = std::ldexp(significand, lowest + static_cast<int>(random.Bits() % powers));
    return isSigned && random.OneIn(2) ? -value : value;
  }
};

/// Most of the samples of a row have one magnitude, so that the sums move slowly between their own.
void FillMagnitudes(tessel::Raster& raster, Random& random, const std::vector<double>& extra) {
  const Magnitudes magnitudes(random, !raster.dataType.isFloat);
  const std::uint32_t rare = 2 + random.Below(200);
  WithPixelType(raster.dataType, [&]<class T>() {
    double usual = magnitudes.Draw(random);
    for (std::uint64_t i = 0; i < raster.dataSize / sizeof(T); ++i) {
      double value = random.OneIn(2) ? usual : magnitudes.Draw(random);
      if (random.OneIn(4 * rare)) usual = value;
      if (random.OneIn(rare)) value = random.Pick(extra);
      const T sample = reference::PlainCast<T>(value);
      std::memcpy(raster.data + i * sizeof(T), &sample, sizeof(T));
    }
  });
}

/// Gives all samples of some rows a value, one that is likely to be left out.
void FillRows(tessel::Raster& raster, Random& random, double value) {
  WithPixelType(raster.dataType, [&]<class T>() {
    for (std::uint32_t y = 0; y < raster.height; ++y) {
      if (!random.OneIn(2)) continue;
      for (std::uint64_t element = 0; element < std::uint64_t{raster.width} * raster.channels; ++element)
        reference::Write(raster, 0, y, element, reference::PlainCast<T>(value));
    }
  });
}

bool IsSame(double expected, double actual) {
  if (std::isnan(expected)) return std::isnan(actual);
  return std::memcmp(&expected, &actual, sizeof expected) == 0;
}

}  // namespace

std::ostream& operator<<(std::ostream& stream, const FocusStep& step) {
  stream.precision(17);
  if (step.parameters) {
    stream << "background " << step.parameters->low << " to " << step.parameters->high << ", failure "
           << step.parameters->failure << ", ";
  }
  if (step.initialised) stream << "initialised for " << *step.initialised << " channels, ";
  if (step.isRefusedBefore) stream << "after a refused call, ";
  stream << NameOf(step.type) << ", " << step.size.width << " x " << step.size.height << " x "
         << step.size.channels << ", margins " << step.margins.marginX << ", " << step.margins.marginY
         << ", samples: " << (step.fill ? NameOf(*step.fill) : "magnitudes")
         << ", mask: " << NameOf(step.maskKind);
  if (step.maskKind != MaskKind::eNULL) stream << ' ' << NameOf(step.maskGeometry);
  return stream << ", seed " << step.seed;
}

std::vector<std::vector<FocusStep>> FocusSequencesFrom(const PixelType& first) {
  Random random(20240311 + static_cast<std::uint64_t>(first.element));
  std::vector<std::vector<FocusStep>> sequences(kSequences);
  for (std::vector<FocusStep>& sequence : sequences) sequence = DrawSequence(random, first);
  return sequences;
}

FocusScene::FocusScene(const FocusStep& step) {
  Random random(step.seed);
  in = std::make_unique<tessel::Raster>(
      tessel::RasterInfo(step.size.width, step.size.height, step.size.channels, step.type), step.margins);
  if (step.fill) {
    FillRandom(*in, *step.fill, random, step.extra);
  } else {
    FillMagnitudes(*in, random, step.extra);
  }
  if (random.OneIn(4)) FillRows(*in, random, random.Pick(step.extra));
  mask = RandomMask(*in, step.maskKind, step.maskGeometry, random);
}

::testing::AssertionResult SameSums(const std::vector<double>& expected, const std::vector<double>& actual) {
  if (expected.size() != actual.size()) {
    return ::testing::AssertionFailure() << actual.size() << " sums, expected are " << expected.size();
  }
  for (std::size_t c = 0; c < expected.size(); ++c) {
    if (IsSame(expected[c], actual[c])) continue;
    std::ostringstream message;
    message.precision(17);
    message << "sum of channel " << c << ": expected " << expected[c] << ", got " << actual[c];
    return ::testing::AssertionFailure() << message.str();
  }
  return ::testing::AssertionSuccess();
}

}  // namespace orvik::tests
