#include "processes/gridmill/intenpercent.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/intenpercent_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::IntenPercent;
  using Params = filters::details::IntenPercentParams;
  static constexpr Rebuilds rebuilds = Rebuilds::kInput;
  static constexpr std::uint32_t leastChannels = 3;

  static void Set(Bytes& bytes, Operator& op, std::uint32_t) {
    op.SetMin(Value(bytes));
    op.SetMax(Value(bytes));
    op.SetNoData(Value(bytes));
    op.SetBins(Counts(bytes, bytes.Below(24)));
    const double fitting = static_cast<double>(op.Bins.size()) / (op.Max - op.Min);
    op.SetScale(bytes.OneIn(4) ? Value(bytes) : fitting);
    op.SetType(static_cast<changedetection::DiffType>(static_cast<int>(bytes.Below(5)) - 1));
  }
  static std::uint32_t OutChannels(Bytes& bytes, const Shape&) { return 4 + bytes.Below(3); }
  static void Twin(const Params& params, const DataType&, const DataType& writtenAs, const Raster& in,
                   const Mask* mask, Raster& out) {
    reference::IntenPercent(params, writtenAs, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
