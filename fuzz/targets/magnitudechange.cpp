#include "processes/gridmill/magnitudechange.h"

#include "fuzz/support/changetarget.h"
#include "tests/reference/magnitudechange_reference.h"
#include "tests/support/changetwins.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::MagnitudeChange;
  static std::uint32_t Written(std::uint32_t, std::uint32_t) { return 3; }

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType>(parameters.type));
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::MagnitudeChange(tests::ParamsOf<changedetection::details::MagnitudeParams>(parameters),
                               *dates.image, *dates.reference, dates.mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
