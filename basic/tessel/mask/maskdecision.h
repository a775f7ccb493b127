#pragma once

#include "basic/core/export.h"

namespace orvik::tessel {

/// A caller's test of a pixel by its value. The caller owns it; operators hold it by pointer.
class GRIDMILL_EXPORT IMaskDecision {
 public:
  virtual ~IMaskDecision() = default;

  /// @param pixel  the first sample of the pixel; element type and channels are the implementation's to know
  /// @return true to keep the pixel
  virtual bool IsPixelValid(const void* pixel) = 0;
};

}  // namespace orvik::tessel
