#pragma once

#include "basic/tessel/raster.h"
#include "processes/gridmill/rangeclasses.h"

namespace orvik::reference {

/// The classes, slowly: one pixel and one range after the other.
void RangeClasses(const gridmill::details::RangeClassesParams& params, const tessel::Raster& in,
                  tessel::Raster& out);

}  // namespace orvik::reference
