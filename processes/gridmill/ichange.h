#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::changedetection {

/// A comparison of two dates with one mask: an operator or its inner processor.
class GRIDMILL_EXPORT IChange {
 public:
  virtual ~IChange() = default;
  virtual void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                       tessel::Raster* out) const = 0;
};

/// A comparison of two dates with a mask for each. Deliberate: a set bit of `referenceMask` excludes the
/// pixel, the reverse of every other mask.
class GRIDMILL_EXPORT IChangeProcessor {
 public:
  virtual ~IChangeProcessor() = default;
  virtual void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
                       tessel::Mask* referenceMask, tessel::Raster* out) const = 0;
};

}  // namespace orvik::changedetection
