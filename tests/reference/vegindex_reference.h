#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/vegindex.h"

namespace orvik::reference {

/// The vegetation indices, slowly: one pixel after the other, step by step.
void VegIndex(const filters::details::VegIndexParams& params, const tessel::Raster& in,
              const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
