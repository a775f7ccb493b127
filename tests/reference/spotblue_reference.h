#pragma once

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/spotblue.h"

namespace orvik::reference {

/// The blue band or the triple, slowly: one pixel after the other, step by step.
///
/// @param readAs     the type of the elements that are read, whatever the input's type says
/// @param writtenAs  the type of the elements that are written, whatever the output's type says
void SPOTBlue(const gridmill::details::BlueParams& params, const tessel::DataType& readAs,
              const tessel::DataType& writtenAs, const tessel::Raster& in, const tessel::Mask* mask,
              tessel::Raster& out);

/// The same with the rasters' own types.
void SPOTBlue(const gridmill::details::BlueParams& params, const tessel::Raster& in, const tessel::Mask* mask,
              tessel::Raster& out);

}  // namespace orvik::reference
