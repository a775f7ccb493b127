#include "fuzz/support/focustarget.h"
#include "processes/gridmill/vollath.h"
#include "tests/reference/vollath_reference.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  using Measure = orvik::filters::VollathEvaluation;
  using Twin = orvik::reference::VollathEvaluation;
  return orvik::fuzz::RunFocus<Measure, Twin>(
      data, size, false, [](const Measure& measure, const Twin& twin) {
        orvik::fuzz::RequireSameSums(twin.GetLeftEq(), measure.GetLeftEq());
        orvik::fuzz::RequireSameSums(twin.GetRightEq(), measure.GetRightEq());
      });
}
