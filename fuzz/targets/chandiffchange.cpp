#include "processes/gridmill/chandiffchange.h"

#include "fuzz/support/changetarget.h"
#include "tests/reference/chandiffchange_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::ChanDiffChange;

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType>(parameters.type));
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::ChanDiffChange(parameters, *dates.image, *dates.reference, dates.mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
