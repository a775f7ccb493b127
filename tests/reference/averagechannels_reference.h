#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::reference {

/// The mean of the channels, slowly: one pixel after the other, step by step.
void AverageChannels(float noData, const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
