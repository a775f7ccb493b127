#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/intenratiochange.h"

namespace orvik::reference {

/// The means of two dates and their ratio in decibels, slowly: one pixel after the other, step by step.
void IntenRatioChange(const changedetection::details::IntenRatioParams& params, const tessel::Raster& image,
                      const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
