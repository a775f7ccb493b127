#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters of `FilterSlp`. Setters store the value, with no check: zero and negative spacings run
/// through the arithmetic as they are.
class GRIDMILL_EXPORT SlpParams {
 public:
  float XSIZE;              ///< pixel spacing along a row, in the unit of the scaled elevations
  float YSIZE;              ///< pixel spacing along a column, in the same unit
  float ELSZ;               ///< factor on every difference of two elevations
  float Background = 0.0f;  ///< written for a masked pixel

  SlpParams(float xSize = 1.0f, float ySize = 1.0f, float elevationScale = 1.0f)
      : XSIZE(xSize), YSIZE(ySize), ELSZ(elevationScale) {}

  void SetXSIZE(float value) { XSIZE = value; }
  void SetYSIZE(float value) { YSIZE = value; }
  void SetELSZ(float value) { ELSZ = value; }
  void SetBackground(float value) { Background = value; }
};

}  // namespace details

/// Terrain slope in degrees: the angle between the vertical and the normal of the surface through a cell of
/// 2 x 2 pixels, of which the pixel is the upper left.
///
/// In: elevations of any of the ten pixel types, any number of channels, each treated by itself, with a
/// margin of at least 1 in each direction that the caller has filled; a complex raster gives its real parts.
/// Mask: of the input's geometry; a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, of the input's size and channels; degrees from 0 to 90 for positive
/// spacings.
///
/// With the corners z00 (the pixel), z10 (to its right), z01 (below), z11, each converted to `float`, and all
/// in `float`: top = (z10 - z00) ELSZ, left = (z01 - z00) ELSZ, bottom = (z01 - z11) ELSZ, right = (z10 -
/// z11) ELSZ; the normal is nx = (bottom - top) YSIZE / 2, ny = (right - left) XSIZE / 2, nz = XSIZE YSIZE,
/// and the slope is acos(nz / |n|) 180 / pi. The normal is the cross product of the cell's averaged edge
/// vectors; on the averaged-edge gradient and its kin see Jones (1998), "A comparison of algorithms used to
/// compute hill slope as a property of the DEM", Computers & Geosciences 24(4).
///
/// Parameters: `XSIZE`, `YSIZE`, `ELSZ` 1 and `Background` 0 by default. A setter called after `Process`
/// takes effect when a type changes. Failures: `Exception` "poRasterIn is invalid pointer", "poRasterOut is
/// invalid pointer", "Output cannot be complex", "Invalid type to dispatch."; `ParameterException` "The
/// Margin of the input raster is too small"; std::bad_alloc. Nothing is written before a check fails. Sizes
/// are not compared. Threads: rows run in parallel. One object is for one thread at a time, two objects are
/// independent.
///
/// Deliberate: every output but 32-bit `float`, `double` included, holds whole degrees.
/// Deliberate: a masked neighbour counts as level with the pixel; it does not invalidate the result.
/// Deliberate: a cosine above 1 gives 0.
///
/// Example: with spacings of 1 and the cell 0 1 / 0 1, nx = -1, ny = 0, nz = 1: the slope is 45.
class GRIDMILL_EXPORT FilterSlp : public details::SlpParams {
 public:
  FilterSlp(float XSIZE = 1.0f, float YSIZE = 1.0f, float ELSZ = 1.0f);
  FilterSlp(const FilterSlp&);
  FilterSlp& operator=(const FilterSlp&);
  ~FilterSlp();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;
  struct SlpCreationPolicy;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
