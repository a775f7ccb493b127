#include "processes/gridmill/intenratiochange.h"

#include <cmath>

#include "fuzz/support/changetarget.h"
#include "tests/reference/intenratiochange_reference.h"
#include "tests/support/changetwins.h"

namespace orvik::fuzz {
namespace {

using tessel::Raster;

struct Target : ChangeDefaults {
  using Operator = changedetection::IntenRatioChange;
  static std::uint32_t Written(std::uint32_t, std::uint32_t) { return 4; }

  /// True if the decibels, whose logarithm may be off by one unit in the last place, are off by two at most.
  static bool IsNear(double expected, double actual) {
    double low = expected, high = expected;
    for (int i = 0; i < 2; ++i) {
      low = std::nextafter(low, -HUGE_VAL);
      high = std::nextafter(high, HUGE_VAL);
    }
    return std::isfinite(expected) && expected != 0 && actual >= low && actual <= high;
  }
  static void Settle(const tests::ChangeParameters&, const Dates& dates, const Raster& expected,
                     Raster& actual) {
    if (expected.dataType.sizeBits != 64 || !expected.dataType.isFloat) return;
    const tests::Size area = {dates.image->width, dates.image->height};
    tests::Settle<double>(expected, actual, area, 2, IsNear);
  }

  static Operator Make(const tests::ChangeParameters& parameters) {
    return Operator(static_cast<changedetection::DiffType>(parameters.type));
  }
  static void Twin(const tests::ChangeParameters& parameters, const Dates& dates, Raster& out) {
    reference::IntenRatioChange(tests::ParamsOf<changedetection::details::IntenRatioParams>(parameters),
                                *dates.image, *dates.reference, dates.mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
