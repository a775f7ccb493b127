#include "processes/gridmill/rangeclasses.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/rangeclasses_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = gridmill::RangeClasses;
  using Params = gridmill::details::RangeClassesParams;
  static constexpr std::uint32_t leastChannels = 1;

  static void Set(Bytes& bytes, Operator& op, std::uint32_t) {
    const std::uint32_t classes = bytes.OneIn(8) ? 250 + bytes.Below(30) : bytes.Below(24);
    op.SetNumClasses(static_cast<int>(classes));
    op.SetMinRange(FloatValues(bytes, classes));
    op.SetMaxRange(FloatValues(bytes, classes));
    op.SetNoData(FloatValue(bytes));
  }
  static std::uint32_t OutChannels(Bytes& bytes, const Shape&) { return 1 + bytes.Below(3); }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask*,
                   Raster& out) {
    reference::RangeClasses(params, in, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
