#pragma once

#include "basic/tessel/raster.h"
#include "processes/gridmill/normalize.h"

namespace orvik::reference {

/// The percentage of the range, slowly: one sample after the other, step by step.
void Normalize(const filters::details::NormalizeParams& params, const tessel::Raster& in,
               tessel::Raster& out);

}  // namespace orvik::reference
