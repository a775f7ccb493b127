#include "processes/gridmill/iiidatatransfer.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/iiidatatransfer_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = gridmill::IIIDataTransfer;
  using Params = gridmill::details::IIIParams;
  static constexpr Rebuilds rebuilds = Rebuilds::kNever;
  static constexpr bool takesComplex = true;
  static constexpr bool writesComplex = true;

  /// Regions, most of them from a few pixels to a few dozen.
  static std::vector<unsigned int> DrawRegion(Bytes& bytes) {
    std::vector<unsigned int> region = {bytes.Below(8), bytes.Below(8), bytes.Below(64), bytes.Below(16)};
    if (bytes.OneIn(8)) region[bytes.Below(4)] = static_cast<unsigned int>(bytes.Bits(4));
    return region;
  }
  static void Set(Bytes& bytes, Operator& op, std::uint32_t) {
    std::vector<unsigned int> source = DrawRegion(bytes), target = DrawRegion(bytes);
    op.SetInRegion(source);
    op.SetOutRegion(target);
  }

  /// There is a pixel to take.
  static void Widen(Shape& in) {
    in.width += 1;
    in.height += 1;
  }

  /// Enough for complex inputs too.
  static std::uint32_t OutChannels(Bytes& bytes, const Shape& in) { return 2 * in.channels + bytes.Below(2); }
  static void Reshape(Bytes& bytes, Shape& out) {
    out.width = bytes.Below(64);
    out.height = bytes.Below(16);
    out.margins.originX = bytes.Below(16);
    out.margins.originY = bytes.Below(16);
  }
  static void Twin(const Params& params, const DataType& readAs, const DataType& writtenAs, const Raster& in,
                   const Mask*, Raster& out) {
    reference::IIIDataTransfer(params, readAs, writtenAs, in, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
