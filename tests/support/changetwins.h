#pragma once

#include <cstdint>

#include "basic/tessel/raster.h"
#include "processes/gridmill/difftype.h"
#include "tests/reference/samples.h"
#include "tests/support/changecases.h"

namespace orvik::tests {

/// The parameters of a case as a twin takes them.
template <class Params>
Params ParamsOf(const ChangeParameters& parameters) {
  Params params;
  params.type = static_cast<changedetection::DiffType>(parameters.type);
  params.noData = parameters.noData;
  params.imgNoData = parameters.imgNoData;
  params.refNoData = parameters.refNoData;
  return params;
}

/// Puts the sample `channel` of the twin's in place of the operator's where `isAsGood(twin's, operator's)`,
/// in the pixels of an area: for a channel that may differ in a way that is known.
template <class T, class IsAsGood>
void Settle(const tessel::Raster& expected, tessel::Raster& actual, const Size& area, std::uint32_t channel,
            IsAsGood isAsGood) {
  for (std::uint32_t y = 0; y < area.height; ++y) {
    for (std::uint32_t x = 0; x < area.width; ++x) {
      const T wanted = reference::Read<T>(expected, x, y, channel);
      if (isAsGood(wanted, reference::Read<T>(actual, x, y, channel)))
        reference::Write(actual, x, y, channel, wanted);
    }
  }
}

}  // namespace orvik::tests
