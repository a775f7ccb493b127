#include "processes/gridmill/chanratiochange.h"

#include "fuzz/support/changetarget.h"
#include "tests/reference/chanratiochange_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::ChanRatioChange;
  static constexpr bool isOfThreeTypes = true;
  static constexpr bool hasTwoMasks = true;

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType2>(parameters.type));
  }
  static void Process(const Operator& op, const Dates& dates, Raster* out) {
    op.Process(dates.image, dates.reference, dates.mask, dates.referenceMask, out);
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::ChanRatioChange(parameters, *dates.image, *dates.reference, dates.mask, dates.referenceMask,
                               out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
