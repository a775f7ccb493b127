#pragma once

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/intenpercent.h"

namespace orvik::reference {

/// The percentile of an intensity, slowly: one pixel after the other, step by step. The parameters' own
/// tables are not looked at.
///
/// @param writtenAs  the type of the elements that are written, whatever the output's type says
void IntenPercent(const filters::details::IntenPercentParams& params, const tessel::DataType& writtenAs,
                  const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out);

}  // namespace orvik::reference
