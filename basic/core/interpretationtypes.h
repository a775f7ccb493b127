#pragma once

namespace orvik::core {

/// Which real quantity to take from a complex sample.
enum OrvikInterpretationTypes : int {
  eINTERPRETATION_REAL = 0,  ///< the real part, in the element type of the input
};

}  // namespace orvik::core
