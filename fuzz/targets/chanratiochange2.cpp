#include "processes/gridmill/chanratiochange2.h"

#include "fuzz/support/changetarget.h"
#include "tests/reference/chanratiochange2_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::ChanRatioChange2;
  static constexpr bool isOfThreeTypes = true;

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType>(parameters.type));
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::ChanRatioChange2(parameters, *dates.image, *dates.reference, dates.mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
