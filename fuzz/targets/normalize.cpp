#include "processes/gridmill/normalize.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/normalize_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::Normalize;
  using Params = filters::details::NormalizeParams;
  static void Set(Bytes& bytes, Operator& op, std::uint32_t channels) {
    op.SetMinData(FloatValues(bytes, channels));
    op.SetMaxData(FloatValues(bytes, channels));
    op.SetNoData(FloatValue(bytes));
  }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask*,
                   Raster& out) {
    reference::Normalize(params, in, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
