#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::reference {

/// The difference of the first channels of two dates, slowly: one pixel after the other, step by step.
///
/// @param type  any value of a `DiffType`
void SingleChange(int type, const tessel::Raster& image, const tessel::Raster& reference,
                  const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
