#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/filterasp.h"

namespace orvik::reference {

/// The aspect, slowly: one pixel after the other, step by step.
void FilterAsp(const filters::details::AspParams& params, const tessel::Raster& in, const tessel::Mask* mask,
               tessel::Raster& out);

}  // namespace orvik::reference
