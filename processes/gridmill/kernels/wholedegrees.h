#pragma once

#include <cstddef>

#include "basic/tessel/plaincast.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/trigonometry.h"

namespace orvik::kernels {

/// The definition: the arc cosine in degrees, rounded by a term of 0.5; NaN gives the most negative value.
GRIDMILL_INLINE int RoundedDegrees(float cosine) {
  return tessel::PlainCast<int>(Acos(cosine) * 57.29578f + 0.5f);
}

/// `RoundedDegrees` of `count` cosines.
void RoundedDegreesRow(const float* cosine, std::size_t count, int* degrees);

}  // namespace orvik::kernels
