#pragma once

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/bitmapfiltering.h"

namespace orvik::reference {

/// The bitmap, slowly: one pixel after the other, step by step.
///
/// @param writtenAs  the type of the elements that are written, whatever the output's type says
void BitmapFiltering(const filters::details::BitFParams& params, const tessel::DataType& writtenAs,
                     const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
