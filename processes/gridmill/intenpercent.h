#pragma once

#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/difftype.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters of `IntenPercent` and the spline that is built from them. Setters store the value, with no
/// check. A block of doubles has `binCount` + 2 entries.
class GRIDMILL_EXPORT IntenPercentParams {
 public:
  double Min = 0.0;       ///< lower edge of the histogram, to be set; in the unit of the intensity
  double Max = 0.0;       ///< upper edge of the histogram, to be set
  double NoData = 0.0;    ///< intensity that marks an invalid pixel
  double Scale = 0.0;     ///< bins per unit of intensity, to be set
  std::vector<int> Bins;  ///< pixels of each bin
  changedetection::DiffType Type = changedetection::eDIFF_ABSOLUTE;  ///< decides the sign, to be set
  int binCount = 0;              ///< entries of `Bins` when the spline was built
  int* spareBlock = nullptr;     ///< `binCount` + 2 zeros that nothing reads
  double* cumulative = nullptr;  ///< percentage of the pixels below the lower edge of each bin
  double* alpha = nullptr;       ///< right-hand side of the spline system
  double* linear = nullptr;      ///< first-order coefficient of each bin
  double* quadratic = nullptr;   ///< second-order coefficient of each bin
  double* cubic = nullptr;       ///< third-order coefficient of each bin
  double* diagonal = nullptr;    ///< of the elimination
  double* mu = nullptr;          ///< of the elimination
  double* z = nullptr;           ///< of the elimination
  int total = 0;                 ///< pixels of all bins

  void SetMin(double value) { Min = value; }
  void SetMax(double value) { Max = value; }
  void SetNoData(double value) { NoData = value; }
  void SetScale(double value) { Scale = value; }
  void SetType(changedetection::DiffType value) { Type = value; }

  /// Deliberate: appends. A second call lengthens the histogram.
  void SetBins(const std::vector<int>& bins) { Bins.insert(Bins.end(), bins.begin(), bins.end()); }

  /// Builds the spline from `Bins` and `Scale`. `Process` calls it on its processor.
  ///
  /// Deliberate: nothing frees the blocks. A copy reads the same ones, and a second call leaves the first
  /// ones behind.
  /// Deliberate: there is no test for a histogram of zeros, whose knots are NaN.
  void SetCoefficients();
};

}  // namespace details

/// The percentile of an intensity within a histogram, with a sign from the comparison of two values.
///
/// In: any of the ten pixel types, real; channels 0 and 1 hold two values, channel 2 an intensity.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, of the input's size, at least four channels: samples 0 to 2 hold those of
/// the input by way of `ClipTo`, sample 3 the percentile from 0 to 100, negative by the sign rule; further
/// samples keep what they held.
///
/// The percentile is read off a cubic spline through the cumulative percentages at the edges of the bins.
/// With the intensity v in `float`, widened to `double`: 0 for v <= `Min`, 100 for v >= `Max`; else bin =
/// floor((v - Min) Scale), 0 for a negative bin and 100 beyond the last, and with dx = v - (bin / Scale +
/// Min) the value ((dx linear + cumulative) + (dx quadratic) dx) + ((dx cubic) dx) dx, cast to the input's
/// type and then to `float`. An intensity equal to `NoData`, both in `float`, is written to sample 3 as it
/// is. The sign is reversed if `Type` is `eDIFF_BACKWARD` and sample 0 is above sample 1, or `eDIFF_FORWARD`
/// and sample 1 is above sample 0. On cubic splines through knots at equal steps see Press et al. (2007),
/// "Numerical Recipes", section 3.3.
///
/// Parameters: `NoData` 0 by default, all others are the caller's to set: `Bins` as long as (Max - Min)
/// Scale. A setter called after `Process` takes effect when the input's type changes. Failures: `Exception`
/// "Invalid type to dispatch." if the type of the input or the output is none of the ten, a complex one
/// included; std::bad_alloc. No pointer is tested but the mask's, and no sizes are compared. Threads: runs on
/// the caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: only a change of the input's type rebuilds. A later output of another type is written as the
/// type of the first one.
/// Deliberate: the spline's system is its own, with 2 (2 - mu) where a natural spline has 4 - mu.
/// Deliberate: the spline's value is cast to the input's type. Integers lose the fraction and wrap.
/// Deliberate: an excluded pixel holds `NoData` cast to the input's type in all four samples.
/// Deliberate: counts are multiplied by 100 in 32 bits and wrap above 21474836.
///
/// Example: with `Min` 0, `Max` 4, `Scale` 1 and the bins 1, 1, 1, 1 an intensity of 2 gives 50.
class GRIDMILL_EXPORT IntenPercent : public details::IntenPercentParams {
 public:
  IntenPercent();
  IntenPercent(const IntenPercent&);
  IntenPercent& operator=(const IntenPercent&);
  ~IntenPercent();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;
  struct IntenPercentCreationPolicy;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
