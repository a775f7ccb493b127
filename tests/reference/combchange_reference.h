#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/combchange.h"

namespace orvik::reference {

/// Two dates side by side, slowly: one pixel after the other, step by step.
void CombChange(const changedetection::details::CombParams& params, const tessel::Raster& image,
                const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
