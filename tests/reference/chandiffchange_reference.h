#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/changecases.h"

namespace orvik::reference {

/// The difference of two dates channel by channel, slowly: one sample after the other, step by step.
void ChanDiffChange(const tests::ChangeParameters& parameters, const tessel::Raster& image,
                    const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
