#include "processes/gridmill/averagechannels.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/averagechannels_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::AverageChannels;
  using Params = filters::details::AverageChannelsParams;
  static constexpr bool isParallel = true;
  static constexpr bool takesComplex = true;
  static constexpr bool interprets = true;

  static void Set(Bytes& bytes, Operator& op, std::uint32_t) { op.SetNodata(FloatValue(bytes)); }
  static std::uint32_t OutChannels(Bytes& bytes, const Shape&) { return 1 + bytes.Below(3); }
  static void Process(const Operator& op, Raster* in, Mask* mask, Raster* out) {
    op.Process(in, mask, out, nullptr);
  }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask* mask,
                   Raster& out) {
    reference::AverageChannels(params.noData, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
