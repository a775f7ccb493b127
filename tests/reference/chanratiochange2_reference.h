#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/changecases.h"

namespace orvik::reference {

/// The ratio of two dates channel by channel with one mask, slowly: one sample after the other.
void ChanRatioChange2(const tests::ChangeParameters& parameters, const tessel::Raster& image,
                      const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
