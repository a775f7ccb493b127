#include "processes/gridmill/singlechange.h"

#include "fuzz/support/changetarget.h"
#include "tests/reference/singlechange_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::SingleChange;
  static constexpr std::uint32_t leastChannels = 1;

  static std::uint32_t Written(std::uint32_t, std::uint32_t) { return 1; }
  static void Set(const tests::ChangeParameters& parameters, Operator& op) {
    op.SetType(static_cast<changedetection::DiffType>(parameters.type));
  }

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType>(parameters.type));
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::SingleChange(parameters.type, *dates.image, *dates.reference, dates.mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
