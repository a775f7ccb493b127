#include "fuzz/support/tasseledcaptarget.h"

namespace orvik::fuzz {
namespace {

struct Target : TasseledCapDefaults<Target> {
  using Operator = changedetection::TCGNChange;
  using Params = changedetection::details::TCGNParams;
  static constexpr auto kTwin = &reference::TCGNChange;

  static Operator Make(const SensorParameters& parameters) {
    return Operator(parameters.sensor, parameters.referenceSensor,
                    static_cast<changedetection::DiffType>(parameters.type));
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
