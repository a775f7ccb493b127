#include "fuzz/support/focustarget.h"
#include "processes/gridmill/vollath.h"
#include "tests/reference/vollath_reference.h"

namespace orvik::fuzz {
namespace {

void Run(Bytes& bytes) {
  using Measure = filters::VollathEvaluation;
  using Twin = reference::VollathEvaluation;
  RunFocus<Measure, Twin>(bytes, false, [](const Measure& measure, const Twin& twin) {
    RequireSameSums(twin.GetLeftEq(), measure.GetLeftEq());
    RequireSameSums(twin.GetRightEq(), measure.GetRightEq());
  });
}

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::Run)
