#include "processes/gridmill/vegindex.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/vegindex_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = filters::VegIndex;
  using Params = filters::details::VegIndexParams;
  static void Set(Bytes& bytes, Operator& op, std::uint32_t channels) {
    std::vector<unsigned int> requests(12), roles(channels);
    const std::uint64_t isRequested = bytes.Bits(2);
    for (std::size_t k = 0; k < requests.size(); ++k)
      requests[k] = (isRequested >> k & 1) != 0 ? 1u : (isRequested >> 14 & 2);
    for (unsigned int& role : roles) role = bytes.Below(9);
    op.SetRequestedIndex(requests);
    op.SetBandIndex(roles);
  }
  static std::uint32_t OutChannels(Bytes& bytes, const Shape&) { return 12 + bytes.Below(2); }
  static void Twin(const Params& params, const DataType&, const DataType&, const Raster& in, const Mask* mask,
                   Raster& out) {
    reference::VegIndex(params, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
