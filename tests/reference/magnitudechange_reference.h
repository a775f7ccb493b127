#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/magnitudechange.h"

namespace orvik::reference {

/// The lengths of the pixel vectors of two dates, slowly: one pixel after the other, step by step.
void MagnitudeChange(const changedetection::details::MagnitudeParams& params, const tessel::Raster& image,
                     const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
