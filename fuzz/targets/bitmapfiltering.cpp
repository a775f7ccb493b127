#include "processes/gridmill/bitmapfiltering.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/bitmapfiltering_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::BitmapFiltering;
  using Params = filters::details::BitFParams;
  static constexpr Rebuilds rebuilds = Rebuilds::kInput;
  static constexpr std::uint32_t leastChannels = 1;
  static constexpr bool takesComplex = true;
  static constexpr bool writesComplex = true;

  static void Set(Bytes& bytes, Operator& op, std::uint32_t) {
    op.SetThresholdMin(FloatValue(bytes));
    op.SetThresholdMax(bytes.OneIn(4) ? op.thresholdMin : FloatValue(bytes));
  }
  static std::uint32_t OutChannels(Bytes& bytes, const Shape&) { return 1 + bytes.Below(3); }
  static void Twin(const Params& params, const DataType&, const DataType& writtenAs, const Raster& in,
                   const Mask* mask, Raster& out) {
    reference::BitmapFiltering(params, writtenAs, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
