#include <cstdio>

#include "fuzz/support/focustarget.h"
#include "processes/gridmill/sqrgradient.h"
#include "tests/reference/sqrgradient_reference.h"

namespace orvik::fuzz {
namespace {

void Run(Bytes& bytes) {
  using Measure = filters::SqrGradientEvaluation;
  using Twin = reference::SqrGradientEvaluation;
  // What the operator prints goes nowhere: there are thousands of calls in a second.
  static std::FILE* const silenced = std::freopen("/dev/null", "w", stdout);
  static_cast<void>(silenced);
  RunFocus<Measure, Twin>(bytes, true, [](const Measure& measure, const Twin& twin) {
    RequireSameSums(twin.GetEvaluation(), measure.GetEvaluation());
  });
}

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::Run)
