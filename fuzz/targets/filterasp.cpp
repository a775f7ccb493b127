#include "processes/gridmill/filterasp.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/filterasp_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::FilterAsp;
  using Params = filters::details::AspParams;
  static constexpr std::uint32_t leastMargin = 1;
  static constexpr std::uint32_t leastChannels = 1;
  static constexpr bool isParallel = true;
  static constexpr bool takesComplex = true;
  static constexpr bool interprets = true;

  static void Set(Bytes& bytes, Operator& op, std::uint32_t) {
    op.SetXSIZE(FloatValue(bytes));
    op.SetYSIZE(FloatValue(bytes));
    op.SetELSZ(FloatValue(bytes));
    op.SetZeroSlope(FloatValue(bytes));
    op.SetBackground(FloatValue(bytes));
  }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask* mask,
                   Raster& out) {
    reference::FilterAsp(params, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
