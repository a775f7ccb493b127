#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <ostream>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/images.h"
#include "tests/support/masks.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::tests {

/// The parameters of a focus measure.
struct FocusParameters {
  double low = -10000000.0;
  double high = 10000000.0;
  double failure = -32767.0;
};

/// One call on a focus measure and what the caller does before it.
struct FocusStep {
  std::optional<FocusParameters> parameters;  ///< set before
  std::optional<std::uint32_t> initialised;   ///< `InitEvaluation` is called before, with so many channels
  bool isRefusedBefore = false;               ///< a call comes before that the dispatcher refuses
  tessel::DataType type;
  Size size;
  tessel::RasterContext margins;
  MaskKind maskKind = MaskKind::eNULL;
  MaskGeometry maskGeometry = MaskGeometry::eSAME;
  std::optional<Fill> fill;   ///< none: few significant bits at powers of two that are far apart
  std::vector<double> extra;  ///< values that some samples take
  std::uint64_t seed = 0;     ///< of the samples and the mask bits
};

std::ostream& operator<<(std::ostream& stream, const FocusStep& step);

/// Calls that follow each other on one object, for many objects. The first call of each has the input type
/// `first`. The channels stay what they were at the last build, or become fewer.
std::vector<std::vector<FocusStep>> FocusSequencesFrom(const PixelType& first);

/// The raster and the mask of a call.
struct FocusScene {
  std::unique_ptr<tessel::Raster> in;
  std::unique_ptr<tessel::Mask> mask;

  explicit FocusScene(const FocusStep& step);
};

/// Passes if two vectors of sums hold the same bits. Where `expected` holds a NaN, any NaN will do.
::testing::AssertionResult SameSums(const std::vector<double>& expected, const std::vector<double>& actual);

/// Does to a focus measure, or to its twin, what comes before the call.
template <class Measure>
void Prepare(const FocusStep& step, Measure& measure) {
  if (step.parameters) {
    measure.SetBackground(step.parameters->low, step.parameters->high);
    measure.SetFailure(step.parameters->failure);
  }
  if (step.initialised) measure.InitEvaluation(*step.initialised);
  if (!step.isRefusedBefore) return;
  if constexpr (requires { measure.FailToDispatch(); }) {
    measure.FailToDispatch();
  } else {
    tessel::Raster complex({1, 1, 1, tessel::DataType(tessel::eDT_32F, true)}, {});
    EXPECT_THROW(measure.Process(&complex, nullptr, nullptr), Exception);
  }
}

}  // namespace orvik::tests
