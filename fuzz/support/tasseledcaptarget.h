#pragma once

#include <string>

#include "basic/exceptions/exceptions.h"
#include "fuzz/support/changetarget.h"
#include "processes/gridmill/tasseledcapchange.h"
#include "tests/reference/tasseledcapchange_reference.h"
#include "tests/support/changetwins.h"

namespace orvik::fuzz {

/// The parameters of a tasseled-cap operator.
struct SensorParameters : tests::ChangeParameters {
  std::string sensor, referenceSensor;
};

/// What both tasseled-cap targets have in common. One of them adds `Operator`, `Params` and `kTwin`.
///
/// An unknown sensor is a failure in the middle of an image: what stands then is compared, too.
template <class Target>
struct TasseledCapDefaults : ChangeDefaults {
  using Parameters = SensorParameters;
  static constexpr std::uint32_t leastChannels = 6;

  static std::uint32_t Written(std::uint32_t, std::uint32_t) { return 3; }
  static void DrawMore(Bytes& bytes, SensorParameters& parameters) {
    constexpr const char* kNames[] = {"Landsat-4 MSS",  "Landsat-5 MSS", "Landsat-4 TM", "Landsat-5 TM",
                                      "Landsat-7 ETM+", "Ikonos",        "QuickBird",    "Nikonos"};
    parameters.sensor = bytes.Pick(kNames);
    parameters.referenceSensor = bytes.Pick(kNames);
  }
  template <class Operator>
  static void Set(const SensorParameters& parameters, Operator& op) {
    ChangeDefaults::Set(parameters, op);
    op.SetSensorType(parameters.sensor);
    op.SetRefSensorType(parameters.referenceSensor);
  }
  template <class Operator>
  static void Process(const Operator& op, const Dates& dates, tessel::Raster* out) {
    hasFailed_ = false;
    try {
      op.Process(dates.image, dates.reference, dates.mask, out);
    } catch (const Exception&) {
      hasFailed_ = true;
    }
  }
  static void Twin(const SensorParameters& parameters, const Dates& dates, tessel::Raster& out) {
    auto params = tests::ParamsOf<typename Target::Params>(parameters);
    params.sensorType = parameters.sensor;
    params.refSensorType = parameters.referenceSensor;
    isDone_ = Target::kTwin(params, *dates.image, *dates.reference, dates.mask, out);
  }

  /// The sign of a backward difference of zero is left open.
  static void Settle(const SensorParameters& parameters, const Dates& dates, const tessel::Raster& expected,
                     tessel::Raster& actual) {
    if (hasFailed_ == isDone_) Fail("an unknown sensor is a failure for one of the two alone");
    if (!expected.dataType.isFloat || parameters.type != changedetection::eDIFF_BACKWARD) return;
    const tests::Size area = {dates.image->width, dates.image->height};
    tests::WithPixelType(expected.dataType, [&]<class T>() {
      tests::Settle<T>(expected, actual, area, 2, [](T a, T b) { return a == T{0} && b == T{0}; });
    });
  }

 private:
  static inline bool isDone_ = false;
  static inline bool hasFailed_ = false;
};

}  // namespace orvik::fuzz
