#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/changecases.h"

namespace orvik::reference {

/// The difference of two dates of unlike types channel by channel, slowly: one sample after the other.
void ChanDiffChange2(const tests::ChangeParameters& parameters, const tessel::Raster& image,
                     const tessel::Raster& reference, const tessel::Mask* imageMask,
                     const tessel::Mask* referenceMask, tessel::Raster& out);

}  // namespace orvik::reference
