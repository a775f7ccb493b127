#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/images.h"
#include "tests/support/masks.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::tests {

/// The pixel types of the change operators that know three types, in the order of the short list.
inline constexpr std::array<PixelType, 4> kShortPixelTypes = {{{"uchar", tessel::eDT_8U},
                                                               {"short", tessel::eDT_16S},
                                                               {"ushort", tessel::eDT_16U},
                                                               {"float", tessel::eDT_32F}}};

constexpr bool IsShortPixelType(const PixelType& type) {
  for (const PixelType& known : kShortPixelTypes) {
    if (known.element == type.element) return true;
  }
  return false;
}

/// Calls `function.operator()<In, Ref, Out>()` with the types of a triple of the short list.
template <class Function>
void WithShortPixelTypes(const tessel::DataType& in, const tessel::DataType& ref, const tessel::DataType& out,
                         Function function) {
  const auto with = [](const tessel::DataType& type, auto call) {
    using ShortTypes = details::PixelTypeList<unsigned char, short, unsigned short, float>;
    if (!ShortTypes::Call(type, call)) throw std::invalid_argument("no type of the short list");
  };
  with(in, [&]<class In>() {
    with(ref,
         [&]<class Ref>() { with(out, [&]<class Out>() { function.template operator()<In, Ref, Out>(); }); });
  });
}

/// What the cases of one change operator have in common. Without a deviation they are those of an operator
/// that reads and writes as many samples of a pixel as the image has channels.
struct ChangeLimits {
  using Count = std::uint32_t (*)(std::uint32_t image, std::uint32_t reference);  // both in channels

  bool isOfThreeTypes = false;  ///< the triples of the short list, complex inputs interpreted; else all pairs
  bool hasTwoMasks = false;
  std::uint32_t leastChannels = 0;  ///< of image and reference
  std::uint32_t leastRead = 0;      ///< elements of a pixel that are read whatever channels it has
  Count read = [](std::uint32_t image, std::uint32_t) { return image; };     ///< elements of the reference
  Count written = [](std::uint32_t image, std::uint32_t) { return image; };  ///< elements of the output
};

/// The parameters of a change operator. `type` may lie outside of its enum.
struct ChangeParameters {
  int type = 0;
  float noData = 0.0f;
  std::vector<float> imgNoData;
  std::vector<float> refNoData;
};

std::ostream& operator<<(std::ostream& stream, const ChangeParameters& parameters);

/// Hands all of them but `type` over to an operator.
template <class Operator>
void SetNoDataOf(const ChangeParameters& parameters, Operator& op) {
  op.SetNoData(parameters.noData);
  op.SetImgNoData(parameters.imgNoData);
  op.SetRefNoData(parameters.refNoData);
}

/// Whether the output is a raster of its own, or one that is read too.
enum class InPlace : int { eNO, eIMAGE, eREFERENCE };

/// A raster of a case and what an operator may touch of it.
struct ChangeRaster {
  tessel::DataType type;
  Size size;
  tessel::RasterContext margins;
  std::uint32_t touched = 0;  ///< elements of a pixel that are read or written, from its first sample on
};

/// One run of a change operator. All that is random in it follows from the fields.
struct ChangeCase {
  ChangeRaster image;
  ChangeRaster reference;
  ChangeRaster out;
  tessel::DataType referenceReadAs;  ///< the type as which an operator reads the reference
  InPlace inPlace = InPlace::eNO;
  MaskKind maskKind = MaskKind::eNULL;  ///< of the only mask, or of the image's
  MaskGeometry maskGeometry = MaskGeometry::eSAME;
  MaskKind referenceMaskKind = MaskKind::eNULL;
  MaskGeometry referenceMaskGeometry = MaskGeometry::eSAME;
  Fill imageFill = Fill::eBITS;
  Fill referenceFill = Fill::eBITS;
  ChangeParameters parameters;
  std::vector<double> extra;  ///< values that some samples take, among them those of the no-data vectors
  std::uint64_t seed = 0;     ///< of the samples and the mask bits
};

std::ostream& operator<<(std::ostream& stream, const ChangeCase& c);

/// The cases of one image type: all output types (and reference types), widths around the lane counts, a
/// pixel of many channels and a large image; the rest is drawn. Among them are
///
/// - references and outputs of other sizes, margins and channels than the image;
/// - in an operator of two types, complex rasters and references of any other type, bits included;
/// - outputs with fewer channels than are written. Samples then overlap, and the last one written stays;
/// - no-data vectors that match many samples, of the image's length and of another.
std::vector<ChangeCase> ChangeCasesFrom(const PixelType& image, const ChangeLimits& limits);

/// The rasters and masks of a case, the output full of sentinels. Buffers hold the bytes that are touched and
/// no more; `dataSize` counts them all, also where they reach past the raster's own size.
class ChangeScene {
 public:
  std::unique_ptr<tessel::Raster> image;
  std::unique_ptr<tessel::Raster> reference;
  std::unique_ptr<tessel::Mask> mask;
  std::unique_ptr<tessel::Mask> referenceMask;

  explicit ChangeScene(const ChangeCase& c);
  tessel::Raster* Out() const { return out_; }

 private:
  std::unique_ptr<tessel::Raster> ownOut_;
  tessel::Raster* out_;
};

namespace details {

::testing::AssertionResult Judge(const ChangeCase& c, const ChangeScene& expected, const ChangeScene& actual);

}  // namespace details

/// Compares a change operator with its twin on one case: the same bits in the whole output buffer, the
/// inputs, their margins and the masks as they were.
///
/// @param process  void(Raster* image, Raster* reference, Mask* mask, Raster* out), or with two masks
///                 void(Raster* image, Raster* reference, Mask* imageMask, Mask* referenceMask, Raster* out)
/// @param twin     void(const Raster& image, const Raster& reference, const Mask* mask, Raster& out), or with
///                 two masks in the same order
template <class Process, class Twin>
::testing::AssertionResult Agree(const ChangeCase& c, Process process, Twin twin) {
  using tessel::Mask;
  using tessel::Raster;
  const ChangeScene expected(c), actual(c);
  if constexpr (std::is_invocable_v<Process, Raster*, Raster*, Mask*, Raster*>) {
    twin(*expected.image, *expected.reference, expected.mask.get(), *expected.Out());
    process(actual.image.get(), actual.reference.get(), actual.mask.get(), actual.Out());
  } else {
    twin(*expected.image, *expected.reference, expected.mask.get(), expected.referenceMask.get(),
         *expected.Out());
    process(actual.image.get(), actual.reference.get(), actual.mask.get(), actual.referenceMask.get(),
            actual.Out());
  }
  return details::Judge(c, expected, actual);
}

}  // namespace orvik::tests
