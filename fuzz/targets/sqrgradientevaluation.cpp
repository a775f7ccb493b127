#include <cstdio>

#include "fuzz/support/focustarget.h"
#include "processes/gridmill/sqrgradient.h"
#include "tests/reference/sqrgradient_reference.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using Measure = orvik::filters::SqrGradientEvaluation;
  using Twin = orvik::reference::SqrGradientEvaluation;
  // What the operator prints goes nowhere: there are thousands of calls in a second.
  static std::FILE* const silenced = std::freopen("/dev/null", "w", stdout);
  static_cast<void>(silenced);
  return orvik::fuzz::RunFocus<Measure, Twin>(data, size, true, [](const Measure& measure, const Twin& twin) {
    orvik::fuzz::RequireSameSums(twin.GetEvaluation(), measure.GetEvaluation());
  });
}
