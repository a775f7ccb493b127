#include "processes/gridmill/mirrorimg.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/mirrorimg_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::MirrorImg;
  using Params = filters::details::MirrorImgParams;
  static void Set(Bytes& bytes, Operator& op, std::uint32_t) {
    constexpr const char* kAxes[] = {"VERT", "HORI", "vert", "HoRi", "", "VERTICAL"};
    op.SetAxis(bytes.Pick(kAxes));
    op.IsNewFile(bytes.OneIn(2));
    op.SetWindow({});
    if (bytes.OneIn(2)) op.SetWindow({bytes.Byte(), bytes.Byte(), bytes.Below(81), bytes.Below(25)});
  }

  /// Room for all sources, also of a window that is larger than the image.
  static void Widen(Shape& in) {
    in.margins.marginX += 2;
    in.margins.marginY = 28;
  }
  static std::uint32_t OutChannels(Bytes&, const Shape& in) { return in.channels; }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask* mask,
                   Raster& out) {
    reference::MirrorImg(params, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
