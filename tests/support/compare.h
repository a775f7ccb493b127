#pragma once

#include <gtest/gtest.h>

#include "basic/tessel/raster.h"

namespace orvik::tests {

/// Passes if the buffers of two rasters of one shape hold the same bits, margins included. Where `expected`
/// holds a NaN, any NaN will do. The message names the first element that differs.
::testing::AssertionResult SameBits(const tessel::Raster& expected, const tessel::Raster& actual);

}  // namespace orvik::tests
