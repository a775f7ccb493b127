#pragma once

#include <vector>

#include "basic/tessel/raster.h"
#include "processes/gridmill/percentile.h"
#include "tests/reference/cumulativespline_reference.h"

namespace orvik::reference {

/// Bins per unit of one channel.
double BinScale(const filters::details::PercentileParams& params, std::size_t channel);

/// The splines of the channels, as many as `MaxData` has entries.
std::vector<CumulativeSpline> PercentileSplines(const filters::details::PercentileParams& params);

/// The percentiles, slowly: one sample after the other, step by step. The parameters' own tables are not
/// looked at.
void Percentile(const filters::details::PercentileParams& params, const tessel::Raster& in,
                tessel::Raster& out);

}  // namespace orvik::reference
