#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/filterslp.h"

namespace orvik::reference {

/// The slope, slowly: one sample after the other, step by step.
void FilterSlp(const filters::details::SlpParams& params, const tessel::Raster& in, const tessel::Mask* mask,
               tessel::Raster& out);

}  // namespace orvik::reference
