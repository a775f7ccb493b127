#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters of `FilterAsp`. Setters store the value, with no check.
class GRIDMILL_EXPORT AspParams {
 public:
  float ZeroSlope = 510.0f;  ///< written where no direction exists: a flat cell, a masked neighbour
  float XSIZE = 0.0f;        ///< pixel spacing along a row
  float YSIZE = 0.0f;        ///< pixel spacing along a column, in the same unit
  float ELSZ = 1.0f;         ///< factor on every difference of two elevations
  float Background = 0.0f;   ///< written for a masked pixel

  void SetZeroSlope(float value) { ZeroSlope = value; }
  void SetXSIZE(float value) { XSIZE = value; }
  void SetYSIZE(float value) { YSIZE = value; }
  void SetELSZ(float value) { ELSZ = value; }
  void SetBackground(float value) { Background = value; }
};

}  // namespace details

/// Terrain aspect in degrees: the compass direction in which the surface falls away, with 0 towards the top
/// of the raster, 90 towards increasing x, 180 towards increasing y and 270 towards decreasing x.
///
/// In: elevations of any of the ten pixel types, with a margin of at least 1 in each direction that the
/// caller has filled; channel 0 alone is read; a complex raster gives its real parts. Mask: of the input's
/// geometry; a clear bit excludes the pixel; null means that all are valid. Out: any of the ten pixel types,
/// one channel, from 0 to 360, halved on 8-bit outputs. Element x of an output row belongs to pixel x: a
/// raster of more channels gets its results packed at the start of each row.
///
/// With nx and ny of the cell as in `FilterSlp`, all in `float`: aspect = (atan2(ny, nx) + pi / 2) 180 / pi,
/// and 360 is added below 0. Written through `ClipTo` in single precision, which alone rounds.
///
/// Parameters: `ZeroSlope` 510, `XSIZE` and `YSIZE` 0, `ELSZ` 1, `Background` 0 by default: without spacings
/// every cell counts as flat. A setter called after `Process` takes effect when a type changes. Failures:
/// `Exception` "poRasterIn is invalid pointer", "poRasterOut is invalid pointer", "Output cannot be complex",
/// "Invalid type to dispatch."; `ParameterException` "The Margin of the input raster is too small";
/// std::bad_alloc. Nothing is written before a check fails. Sizes are not compared.
/// Threads: rows run in parallel. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: a masked neighbour gives `ZeroSlope`; a masked pixel gives `Background` whatever its
/// neighbours. Deliberate: `ZeroSlope` is not halved on 8-bit outputs. Deliberate: an aspect of 359.7 rounds
/// to 360 and does not wrap to 0.
///
/// Example: with spacings of 1 and the cell 1 0 / 1 0, nx = 1, ny = 0: the aspect is 90.
class GRIDMILL_EXPORT FilterAsp : public details::AspParams {
 public:
  FilterAsp();
  FilterAsp(const FilterAsp&);
  FilterAsp& operator=(const FilterAsp&);
  ~FilterAsp();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;
  struct AspCreationPolicy;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
