#include "processes/gridmill/combchange.h"

#include "fuzz/support/changetarget.h"
#include "tests/reference/combchange_reference.h"
#include "tests/support/changetwins.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::CombChange;
  static constexpr bool takesAnyReference = true;

  static std::uint32_t Written(std::uint32_t image, std::uint32_t reference) { return image + reference; }

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType>(parameters.type));
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::CombChange(tests::ParamsOf<changedetection::details::CombParams>(parameters), *dates.image,
                          *dates.reference, dates.mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
