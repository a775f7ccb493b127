#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/tasseledcapchange.h"

namespace orvik::reference {

/// The greenness of two dates, slowly: one pixel after the other, step by step. Returns false where it stops
/// because a sensor is unknown.
bool TCGNChange(const changedetection::details::TCGNParams& params, const tessel::Raster& image,
                const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

/// The brightness of two dates, likewise.
bool TCSBChange(const changedetection::details::TCSBParams& params, const tessel::Raster& image,
                const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
