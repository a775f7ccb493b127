#include "tests/support/changecases.h"

#include <algorithm>
#include <limits>
#include <span>

#include "tests/reference/samples.h"
#include "tests/support/compare.h"

namespace orvik::tests {
namespace {

using tessel::DataType;
using tessel::Raster;
using tessel::RasterContext;
using tessel::RasterInfo;

constexpr float kNaN = std::numeric_limits<float>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

constexpr std::uint32_t kWidths[] = {0,  1,  2,  7,  8,   9,   15,  16,  17,  31,  32,
                                     33, 63, 64, 65, 127, 128, 129, 255, 256, 257, 601};
constexpr std::uint32_t kHeights[] = {1, 1, 1, 2, 3, 3, 0};
constexpr std::uint32_t kChannels[] = {1, 1, 1, 2, 2, 3, 3, 3, 4, 4, 5, 6, 7, 0};
constexpr std::uint32_t kManyChannels[] = {127, 128, 129, 255, 256, 257, 300, 1100};
constexpr std::uint32_t kLargePixels[] = {33000, 33000, 90000};
constexpr int kCasesOfAWidth = 4;

constexpr int kTypes[] = {0, 1, 2, 0, 1, 2, -1, 3, 7};
constexpr float kNoData[] = {8388609.0f, 0.0f,   0.0f,      -0.0f,      3.4e38f, -9999.0f, -1.0f,
                             2.5f,       -2.5f,  127.5f,    255.f,      300.f,   3e9f,     1e20f,
                             -1e20f,     1e-40f, kInfinity, -kInfinity, kNaN};
constexpr float kMatched[] = {0.0f,  0.0f,        1.0f,      1.0f,       2.0f,    3.0f,    3.0f,     7.0f,
                              -0.0f, -1.0f,       255.0f,    -128.0f,    300.0f,  32767.f, 65535.0f, 2.5f,
                              0.1f,  16777216.0f, 0x1p31f,   0x1p32f,    0x1p53f, 0x1p62f, 0x1p63f,  0x1p64f,
                              1e20f, 3.4e38f,     kInfinity, -kInfinity, 1e-40f,  kNaN};

std::uint32_t ElementsOf(const ChangeRaster& raster) {
  return raster.size.channels * (raster.type.isComplex ? 2 : 1);
}

// ---- parameters

/// A vector of no-data values out of `values`.
std::vector<float> DrawVector(Random& random, std::size_t length, std::span<const float> values) {
  std::vector<float> vector(length);
  for (float& entry : vector) entry = random.Pick(values);
  return vector;
}

/// The length of a vector for an image of `channels`: mostly the one that switches the test on.
std::size_t DrawLength(Random& random, std::uint32_t channels) {
  if (random.Below(8) < 5) return channels;
  const std::size_t lengths[] = {0, channels - std::min(channels, 1u), channels + 1u};
  return random.Pick(lengths);
}

/// Values that equal `value` as a `float`, and near ones that do not.
void AppendNear(float value, std::vector<double>& extra) {
  const double v = value;
  extra.insert(extra.end(), {v, v, v + 1, v - 1, v * (1 + 0x1p-30), v * (1 - 0x1p-30), v * (1 + 0x1p-22)});
}

void DrawParameters(Random& random, ChangeCase& c) {
  const std::uint32_t image = c.image.size.channels, reference = c.reference.size.channels;
  const float values[] = {random.Pick(kMatched), random.Pick(kMatched), random.Pick(kMatched)};
  c.parameters.type = random.Pick(kTypes);
  c.parameters.noData = random.Pick(kNoData);
  c.parameters.imgNoData = DrawVector(random, DrawLength(random, image), values);
  const bool isActive = c.parameters.imgNoData.size() == image;
  const std::size_t referenceLength =
      isActive ? std::max(image, reference) + (random.OneIn(4) ? 2 : 0) : DrawLength(random, reference);
  c.parameters.refNoData = DrawVector(random, referenceLength, values);
  for (const float value : values) AppendNear(value, c.extra);
}

// ---- rasters

/// The type of a reference that an operator of two types reads as the image's: mostly that type itself.
DataType DrawReferenceType(Random& random, const DataType& image) {
  if (!random.OneIn(4)) return image;
  if (random.OneIn(8)) return random.OneIn(2) ? DataType(tessel::eDT_BIT) : DataType();
  return {random.Pick(kPixelTypes).element, random.OneIn(4)};
}

RasterContext DrawMargins(Random& random) { return {random.Below(4), random.Below(3)}; }

/// The image's size, or a larger one, or unless `isLarger` one that is narrower or lower.
Size DrawSize(Random& random, Size size, bool isLarger) {
  if (random.OneIn(4)) size = {size.width + random.Below(6), size.height + random.Below(3), size.channels};
  if (!isLarger && random.OneIn(8)) {
    size.width -= std::min(size.width, random.Below(4));
    size.height -= std::min(size.height, random.Below(2));
  }
  return size;
}

std::uint32_t DrawReferenceChannels(Random& random, std::uint32_t image, bool hasAll) {
  if (random.OneIn(4)) return image + 1 + random.Below(3);
  return !hasAll && random.OneIn(6) ? random.Below(image + 1) : image;
}

std::uint32_t DrawOutChannels(Random& random, std::uint32_t written) {
  if (random.OneIn(4)) return written + 1 + random.Below(2);
  return random.OneIn(6) ? random.Below(written + 1) : written;
}

void DrawTypes(Random& random, ChangeCase& c, const ChangeLimits& limits) {
  c.image.type.isComplex = random.OneIn(6);
  if (limits.isOfThreeTypes) {
    c.reference.type.isComplex = random.OneIn(6);
  } else {
    c.reference.type = DrawReferenceType(random, c.image.type);
    c.out.type.isComplex = random.OneIn(6);
  }
  c.referenceReadAs = limits.isOfThreeTypes ? c.reference.type : c.image.type;
}

void DrawSizes(Random& random, ChangeCase& c, Size size, const ChangeLimits& limits) {
  const bool isInterpreted = limits.isOfThreeTypes && c.reference.type.isComplex;
  c.image.size = size;
  c.image.touched = std::max(limits.leastRead, size.channels);
  c.image.margins = DrawMargins(random);
  c.reference.size = DrawSize(random, size, isInterpreted);
  c.reference.size.channels =
      std::max(limits.leastChannels, DrawReferenceChannels(random, size.channels, isInterpreted));
  c.reference.touched = std::max(limits.leastRead, limits.read(size.channels, c.reference.size.channels));
  c.reference.margins = DrawMargins(random);
  c.out.size = DrawSize(random, size, false);
  c.out.touched = limits.written(size.channels, c.reference.size.channels);
  c.out.size.channels = DrawOutChannels(random, c.out.touched);
  c.out.margins = DrawMargins(random);
}

/// True if a pixel of `raster` can be overwritten with the output's once it has been read.
bool CanHoldOutput(const ChangeRaster& raster, const ChangeCase& c) {
  return raster.type == c.out.type && raster.size.width >= c.image.size.width &&
         raster.size.height >= c.image.size.height && raster.touched <= ElementsOf(raster) &&
         c.out.touched <= ElementsOf(raster);
}

void DrawInPlace(Random& random, ChangeCase& c, const ChangeLimits& limits) {
  const bool isReadAsItself = limits.isOfThreeTypes || c.reference.type == c.image.type;
  const std::uint32_t lot = random.Below(16);
  if (lot < 3 && CanHoldOutput(c.image, c)) c.inPlace = InPlace::eIMAGE;
  if (lot == 3 && isReadAsItself && CanHoldOutput(c.reference, c)) c.inPlace = InPlace::eREFERENCE;
}

ChangeCase Draw(Random& random, const ChangeCase& types, Size size, const ChangeLimits& limits) {
  ChangeCase c = types;
  size.channels = std::max(limits.leastChannels, size.channels);
  DrawTypes(random, c, limits);
  DrawSizes(random, c, size, limits);
  DrawInPlace(random, c, limits);
  DrawParameters(random, c);
  c.maskKind = random.Pick(kMaskKinds);
  c.maskGeometry = random.OneIn(3) ? random.Pick(kMaskGeometries) : MaskGeometry::eSAME;
  if (limits.hasTwoMasks) c.referenceMaskKind = random.Pick(kMaskKinds);
  c.referenceMaskGeometry = random.OneIn(3) ? random.Pick(kMaskGeometries) : MaskGeometry::eSAME;
  c.imageFill = random.Pick(kFills);
  c.referenceFill = random.OneIn(2) ? c.imageFill : random.Pick(kFills);
  c.seed = random.Bits();
  return c;
}

void AppendCases(Random& random, const ChangeCase& types, const ChangeLimits& limits,
                 std::vector<ChangeCase>& cases) {
  for (const std::uint32_t width : kWidths) {
    for (int i = 0; i < kCasesOfAWidth; ++i)
      cases.push_back(Draw(random, types, {width, random.Pick(kHeights), random.Pick(kChannels)}, limits));
  }
  cases.push_back(Draw(random, types, {1 + random.Below(5), 2, random.Pick(kManyChannels)}, limits));
  const std::uint32_t width = 300 + random.Below(400);
  cases.push_back(
      Draw(random, types, {width, random.Pick(kLargePixels) / width + 1, 1 + random.Below(4)}, limits));
}

// ---- scenes

/// A raster of zeros whose buffer holds what is touched, in elements of the type `touchedAs`, for all pixels
/// from (0, 0) to (width - 1, height - 1) of the image.
std::unique_ptr<Raster> RasterOf(const ChangeRaster& shape, const Size& image, const DataType& touchedAs) {
  const RasterInfo info(shape.size.width, shape.size.height, shape.size.channels, shape.type);
  const Raster nothing(info, shape.margins, nullptr);
  std::uint64_t bytes = nothing.dataSize;
  if (image.width > 0 && image.height > 0) {
    const std::uint64_t last = reference::PixelIndex(nothing, image.width - 1, image.height - 1);
    const std::uint64_t offset = last * ElementsOf(shape) * shape.type.sizeBits / 8;
    bytes = std::max(bytes, offset + std::uint64_t{shape.touched} * touchedAs.sizeBits / 8);
  }
  auto raster = std::make_unique<Raster>(info, shape.margins, new unsigned char[bytes]());
  raster->ownsData = true;
  raster->dataSize = bytes;
  return raster;
}

/// Fills the whole buffer with samples of the type `type`, whatever the raster's own is.
void FillAs(const DataType& type, Raster& raster, Fill fill, Random& random, std::span<const double> extra) {
  Raster samples(RasterInfo(raster.width, raster.height, raster.channels, type), raster, raster.data);
  samples.dataSize = raster.dataSize;
  FillRandom(samples, fill, random, extra);
}

bool IsPixelType(const DataType& type) {
  return std::any_of(kPixelTypes.begin(), kPixelTypes.end(),
                     [&](const PixelType& t) { return DataType(t.element, type.isComplex) == type; });
}

std::vector<unsigned char> BitsOf(const std::unique_ptr<tessel::Mask>& mask) {
  return mask ? mask->bits : std::vector<unsigned char>();
}

/// `SameBits`, also for a buffer without a pixel grid: all its elements then count as one row.
::testing::AssertionResult SameElements(const Raster& expected, const Raster& actual) {
  if (expected.channels > 0 && expected.bufferWidth > 0) return SameBits(expected, actual);
  RasterInfo row(0, 1, 1, expected.dataType);
  row.dataType.isComplex = false;
  row.width = static_cast<std::uint32_t>(expected.dataSize * 8 / row.dataType.sizeBits);
  return SameBits(Raster(row, {}, expected.data), Raster(row, {}, actual.data));
}

void Print(std::ostream& stream, const char* name, const ChangeRaster& raster) {
  stream << name << ' ' << (raster.type.isComplex ? "complex " : "") << NameOf(raster.type) << " of "
         << raster.size.width << " x " << raster.size.height << " x " << raster.size.channels << ", margins "
         << raster.margins.marginX << ", " << raster.margins.marginY << "; ";
}

void Print(std::ostream& stream, MaskKind kind, MaskGeometry geometry) {
  stream << NameOf(kind);
  if (kind != MaskKind::eNULL) stream << ' ' << NameOf(geometry);
}

void Print(std::ostream& stream, const std::vector<float>& values) {
  stream << '(';
  for (std::size_t i = 0; i < values.size(); ++i) stream << (i == 0 ? "" : ", ") << values[i];
  stream << ')';
}

}  // namespace

std::ostream& operator<<(std::ostream& stream, const ChangeParameters& parameters) {
  stream << "type " << parameters.type << ", noData " << parameters.noData << ", imgNoData ";
  Print(stream, parameters.imgNoData);
  stream << ", refNoData ";
  Print(stream, parameters.refNoData);
  return stream;
}

std::ostream& operator<<(std::ostream& stream, const ChangeCase& c) {
  constexpr const char* kInPlace[] = {"", "in place of the image; ", "in place of the reference; "};
  Print(stream, "image", c.image);
  Print(stream, "reference", c.reference);
  Print(stream, "output", c.out);
  stream << kInPlace[static_cast<int>(c.inPlace)] << "samples: " << NameOf(c.imageFill) << " and "
         << NameOf(c.referenceFill) << "; masks: ";
  Print(stream, c.maskKind, c.maskGeometry);
  stream << " and ";
  Print(stream, c.referenceMaskKind, c.referenceMaskGeometry);
  return stream << "; " << c.parameters << "; seed " << c.seed;
}

std::vector<ChangeCase> ChangeCasesFrom(const PixelType& image, const ChangeLimits& limits) {
  Random random(19891004 + static_cast<std::uint64_t>(image.element));
  std::vector<ChangeCase> cases;
  ChangeCase types;
  types.image.type = image.element;
  if (!limits.isOfThreeTypes) {
    for (const PixelType& out : kPixelTypes) {
      types.out.type = out.element;
      AppendCases(random, types, limits, cases);
    }
    return cases;
  }
  for (const PixelType& reference : kShortPixelTypes) {
    for (const PixelType& out : kShortPixelTypes) {
      types.reference.type = reference.element;
      types.out.type = out.element;
      AppendCases(random, types, limits, cases);
    }
  }
  return cases;
}

ChangeScene::ChangeScene(const ChangeCase& c) {
  Random random(c.seed);
  image = RasterOf(c.image, c.image.size, c.image.type);
  FillRandom(*image, c.imageFill, random, c.extra);
  reference = RasterOf(c.reference, c.image.size, c.referenceReadAs);
  const bool isFilledAsRead = !IsPixelType(c.reference.type) || !random.OneIn(4);
  FillAs(isFilledAsRead ? c.referenceReadAs : c.reference.type, *reference, c.referenceFill, random, c.extra);
  mask = RandomMask(*image, c.maskKind, c.maskGeometry, random);
  referenceMask = RandomMask(*image, c.referenceMaskKind, c.referenceMaskGeometry, random);
  ownOut_ = RasterOf(c.out, c.image.size, c.out.type);
  FillBytes(*ownOut_, (c.seed & 1) != 0 ? kSentinel : kOtherSentinel);
  Raster* const outs[] = {ownOut_.get(), image.get(), reference.get()};
  out_ = outs[static_cast<int>(c.inPlace)];
}

namespace details {

::testing::AssertionResult Judge(const ChangeCase& c, const ChangeScene& expected,
                                 const ChangeScene& actual) {
  const ::testing::AssertionResult sameOutput = SameElements(*expected.Out(), *actual.Out());
  if (!sameOutput) return ::testing::AssertionFailure() << c << ": output " << sameOutput.message();
  if (c.inPlace != InPlace::eIMAGE && Bytes(*expected.image) != Bytes(*actual.image))
    return ::testing::AssertionFailure() << c << ": the image was modified";
  if (c.inPlace != InPlace::eREFERENCE && Bytes(*expected.reference) != Bytes(*actual.reference))
    return ::testing::AssertionFailure() << c << ": the reference was modified";
  if (BitsOf(expected.mask) != BitsOf(actual.mask) ||
      BitsOf(expected.referenceMask) != BitsOf(actual.referenceMask))
    return ::testing::AssertionFailure() << c << ": a mask was modified";
  return ::testing::AssertionSuccess();
}

}  // namespace details
}  // namespace orvik::tests
