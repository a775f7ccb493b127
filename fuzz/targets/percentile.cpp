#include "processes/gridmill/percentile.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/percentile_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::Percentile;
  using Params = filters::details::PercentileParams;
  /// The number of bins and of splines stays: the tables keep their length.
  static void Set(Bytes& bytes, Operator& op, std::uint32_t channels) {
    if (op.MaxData.empty()) op.SetBinNum(static_cast<int>(bytes.Below(24)));
    op.SetMinData(FloatValues(bytes, channels + 1));
    op.SetMaxData(FloatValues(bytes, channels + 1));
    op.SetNoData(FloatValue(bytes));
    op.SetCoefficients(Counts(bytes, static_cast<std::size_t>(op.BinNum) * (channels + 1)));
  }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask*,
                   Raster& out) {
    reference::Percentile(params, in, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
