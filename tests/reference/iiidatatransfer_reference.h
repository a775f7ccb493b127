#pragma once

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/iiidatatransfer.h"

namespace orvik::reference {

/// The transfer, slowly: one sample after the other, step by step.
///
/// @param readAs     the type of the elements that are read, whatever the input's type says
/// @param writtenAs  the type of the elements that are written, whatever the output's type says
void IIIDataTransfer(const gridmill::details::IIIParams& params, const tessel::DataType& readAs,
                     const tessel::DataType& writtenAs, const tessel::Raster& in, tessel::Raster& out);

/// The same with the rasters' own types.
void IIIDataTransfer(const gridmill::details::IIIParams& params, const tessel::Raster& in,
                     tessel::Raster& out);

}  // namespace orvik::reference
