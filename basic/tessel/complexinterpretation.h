#pragma once

#include "basic/core/export.h"
#include "basic/core/interpretationtypes.h"
#include "basic/tessel/raster.h"

namespace orvik::tessel {

/// Turns a complex raster into a real one.
class GRIDMILL_EXPORT ComplexInterpretation {
 public:
  ComplexInterpretation() = default;
  virtual ~ComplexInterpretation();

  /// Returns a new raster with the real quantity `type` of each sample of `raster`, margins included, in the
  /// element type of the input. The caller deletes it.
  ///
  /// Width, height, channels, margins and origin are those of `raster`. A raster that is not complex is
  /// copied. Elements that are no pixel type are left uninitialised.
  /// @throws std::bad_alloc
  virtual Raster* InterpretRaster(const Raster* raster, core::OrvikInterpretationTypes type) const;
};

}  // namespace orvik::tessel
