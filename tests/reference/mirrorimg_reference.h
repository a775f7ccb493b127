#pragma once

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/mirrorimg.h"

namespace orvik::reference {

/// The mirrored raster, slowly: one pixel after the other, step by step.
void MirrorImg(const filters::details::MirrorImgParams& params, const tessel::Raster& in,
               const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
