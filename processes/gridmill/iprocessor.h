#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::filters {

/// An inner processor of one input and one mask.
class GRIDMILL_EXPORT IProcessor {
 public:
  virtual ~IProcessor() = default;
  virtual void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const = 0;
};

/// An inner processor of one input with a mask for the input and one for the output.
class GRIDMILL_EXPORT IClipperProcessor {
 public:
  virtual ~IClipperProcessor() = default;
  virtual void Process(tessel::Raster* in, tessel::Mask* inMask, tessel::Raster* out,
                       tessel::Mask* outMask) const = 0;
};

}  // namespace orvik::filters
