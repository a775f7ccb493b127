#include "fuzz/support/tasseledcaptarget.h"

namespace orvik::fuzz {
namespace {

struct Target : TasseledCapDefaults<Target> {
  using Operator = changedetection::TCSBChange;
  using Params = changedetection::details::TCSBParams;
  static constexpr auto kTwin = &reference::TCSBChange;

  static Operator Make(const SensorParameters& parameters) {
    return Operator(parameters.sensor, parameters.referenceSensor,
                    static_cast<changedetection::DiffType>(parameters.type));
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunChange<orvik::fuzz::Target>)
