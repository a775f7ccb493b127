#include <cstdint>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include "basic/exceptions/exceptions.h"
#include "fuzz/support/bytes.h"
#include "fuzz/support/digest.h"
#include "fuzz/support/scene.h"
#include "fuzz/support/values.h"
#include "processes/gridmill/gridmill.h"

// Any sequence of types and failures leaves an object that can be used again and destroyed.
namespace orvik::fuzz {
namespace {

using namespace changedetection;
using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

constexpr std::uint32_t kChannels = 6;  // enough for every operator

/// The rasters of a call, any of which may be null.
struct Call {
  Raster* in;
  Raster* reference;
  Raster* out;
};

template <class Op>
struct Maker {
  static Op Make() { return Op(); }
};
template <class Op>
requires std::is_constructible_v<Op, DiffType> && std::is_base_of_v<IChange, Op>
struct Maker<Op> {
  static Op Make() { return Op(eDIFF_FORWARD); }
};
template <class Op>
requires std::is_constructible_v<Op, DiffType2> && std::is_base_of_v<IChangeProcessor, Op>
struct Maker<Op> {
  static Op Make() { return Op(eDIFF2_SIGNED); }
};
template <class Op>
requires std::is_constructible_v<Op, std::string, std::string, DiffType>
struct Maker<Op> {
  static Op Make() { return Op("Landsat-5 TM", "QuickBird", eDIFF_FORWARD); }
};

template <>
struct Maker<filters::Normalize> {
  static filters::Normalize Make() {
    filters::Normalize normalize;
    normalize.SetMinData(std::vector<float>(kChannels, 0.0f));
    normalize.SetMaxData(std::vector<float>(kChannels, 100.0f));
    return normalize;
  }
};
template <>
struct Maker<filters::Percentile> {
  static filters::Percentile Make() {
    filters::Percentile percentile;
    percentile.SetBinNum(4);
    percentile.SetMinData(std::vector<float>(kChannels, 0.0f));
    percentile.SetMaxData(std::vector<float>(kChannels, 100.0f));
    percentile.SetCoefficients(std::vector<int>(std::size_t{4} * kChannels, 5));
    return percentile;
  }
};
template <>
struct Maker<filters::VegIndex> {
  static filters::VegIndex Make() {
    filters::VegIndex index;
    index.SetRequestedIndex({0, 0, 1, 1, 1, 0, 0, 0, 0, 0, 0, 0});
    index.SetBandIndex({0, 1, 2, 3, 4, 5});
    return index;
  }
};
template <>
struct Maker<filters::MirrorImg> {
  static filters::MirrorImg Make() {
    filters::MirrorImg mirror;
    mirror.SetAxis("HORI");
    mirror.IsNewFile(false);
    return mirror;
  }
};
template <>
struct Maker<gridmill::SPOTBlue> {
  static gridmill::SPOTBlue Make() {
    gridmill::SPOTBlue blue;
    std::vector<float> min(3, 0.0f), max(3, 255.0f), background(kChannels, -1.0f);
    blue.SetMin(min);
    blue.SetMax(max);
    blue.SetBackGround(background);
    blue.SetTrim(false);
    return blue;
  }
};

template <class Op>
void Process(const Op& op, const Call& call) {
  if constexpr (requires { op.Process(call.in, call.reference, nullptr, nullptr, call.out); }) {
    op.Process(call.in, call.reference, nullptr, nullptr, call.out);
  } else if constexpr (requires { op.Process(call.in, call.reference, nullptr, call.out); }) {
    op.Process(call.in, call.reference, nullptr, call.out);
  } else if constexpr (requires { op.Process(call.in, nullptr, call.out, nullptr); }) {
    op.Process(call.in, nullptr, call.out, nullptr);
  } else {
    op.Process(call.in, nullptr, call.out);
  }
}

/// A type of any kind: a pixel type, a complex one, bits, or none.
DataType AnyType(Bytes& bytes) {
  const std::uint32_t kind = bytes.Below(8);
  if (kind == 6) return DataType(tessel::eDT_BIT, bytes.OneIn(2));
  if (kind == 7) return DataType();
  DataType type = kind < 2 ? ShortTypeOf(bytes) : PixelTypeOf(bytes);
  type.isComplex = kind == 5;
  return type;
}

/// A small raster with room for elements of any type.
Buffer RasterOf(const DataType& type, std::uint32_t margin) {
  return Buffer({3, 2, kChannels, type, {margin, margin}}, true);
}

/// An output, with the channels of both dates for CombChange.
Buffer OutputOf(const DataType& type) { return Buffer({3, 2, 2 * kChannels, type, {}}, true); }

/// The output of a call that has to succeed.
template <class Op>
std::vector<unsigned char> Output(const Op& op, const DataType& type) {
  const Buffer in = RasterOf(type, 1), reference = RasterOf(type, 1), out = OutputOf(type);
  Process(op, {in.Get(), reference.Get(), out.Get()});
  Observed().Add(*out, type);
  return BytesOf(*out);
}

/// @tparam hasGuards   null rasters are a failure
/// @tparam isRebuilt   a change of types builds a new processor
template <class Op, bool hasGuards, bool isRebuilt>
void RunSequence(Bytes& bytes) {
  const auto op = std::make_unique<Op>(Maker<Op>::Make());
  bool isBuilt = false;
  for (std::uint32_t i = 0, calls = bytes.Below(12); i < calls && (isRebuilt || !isBuilt); ++i) {
    const DataType imageType = AnyType(bytes);
    const DataType referenceType = bytes.OneIn(2) ? AnyType(bytes) : imageType;
    const Buffer in = RasterOf(imageType, bytes.Below(2)), reference = RasterOf(referenceType, 1);
    const Buffer out = OutputOf(AnyType(bytes));
    const std::uint32_t null = hasGuards ? bytes.Below(8) : 0;
    try {
      Process(*op, {null == 5 ? nullptr : in.Get(), null == 6 ? nullptr : reference.Get(),
                    null == 7 ? nullptr : out.Get()});
      isBuilt = true;
    } catch (const Exception&) {
    }
  }
  if (isBuilt && !isRebuilt) return;  // what comes now would be read as the first call's types
  if (isBuilt) Output(*op, tessel::eDT_16S);
  if (Output(*op, tessel::eDT_32F) != Output(Maker<Op>::Make(), tessel::eDT_32F))
    Fail("an object does not give what a fresh one does");
}

using Sequence = void (*)(Bytes&);
constexpr Sequence kSequences[] = {&RunSequence<filters::FilterSlp, true, true>,
                                   &RunSequence<filters::FilterAsp, true, true>,
                                   &RunSequence<filters::AverageChannels, true, true>,
                                   &RunSequence<filters::BitmapFiltering, false, true>,
                                   &RunSequence<filters::IntenPercent, false, true>,
                                   &RunSequence<gridmill::RangeClasses, false, true>,
                                   &RunSequence<filters::Normalize, false, true>,
                                   &RunSequence<filters::Percentile, false, true>,
                                   &RunSequence<filters::VegIndex, false, true>,
                                   &RunSequence<filters::MirrorImg, false, true>,
                                   &RunSequence<gridmill::SPOTBlue, false, false>,
                                   &RunSequence<ChanDiffChange, false, true>,
                                   &RunSequence<ChanDiffChange2, true, true>,
                                   &RunSequence<ChanRatioChange, true, true>,
                                   &RunSequence<ChanRatioChange2, true, true>,
                                   &RunSequence<CombChange, false, true>,
                                   &RunSequence<SingleChange, false, true>,
                                   &RunSequence<MagnitudeChange, false, true>,
                                   &RunSequence<IntenRatioChange, false, true>,
                                   &RunSequence<TCGNChange, false, true>,
                                   &RunSequence<TCSBChange, false, true>};

void Run(Bytes& bytes) { bytes.Pick(kSequences)(bytes); }

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::Run)
