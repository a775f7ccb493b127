#pragma once

#include <utility>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters of `Percentile` and the splines that are built from them, one for each channel. Setters
/// store the value, with no check. A row of a table has `BinNum` + 2 entries.
class GRIDMILL_EXPORT PercentileParams {
 public:
  using Table = std::vector<std::vector<double>>;

  std::vector<int> Coefficients;  ///< samples of bin i of channel c at `BinNum` c + i
  std::vector<float> MinData;     ///< lower edge of the histogram of each channel, in the unit of its samples
  std::vector<float> MaxData;     ///< upper edge; its size is the number of splines
  std::vector<double> binScale;   ///< bins per unit, for each channel
  float NoData = 0.0f;            ///< marks an invalid sample, of the input and of the output
  int BinNum = 0;                 ///< bins of each channel, to be set
  Table cumulative;               ///< percentage of the samples below the lower edge of each bin
  Table alpha;                    ///< right-hand side of the spline system
  Table linear;                   ///< first-order coefficient of each bin
  Table quadratic;                ///< second-order coefficient of each bin
  Table cubic;                    ///< third-order coefficient of each bin
  Table diagonal;                 ///< of the elimination
  Table mu;                       ///< of the elimination
  Table z;                        ///< of the elimination
  std::vector<int> totals;        ///< samples of each channel

  void SetMinData(std::vector<float> values) { MinData = std::move(values); }
  void SetMaxData(std::vector<float> values) { MaxData = std::move(values); }
  void SetNoData(float value) { NoData = value; }
  void SetBinNum(int value) { BinNum = value; }

  /// Stores the counts and builds the splines from `BinNum`, `MinData` and `MaxData`, which are set before.
  /// Rows that stand already keep their length: a later call with more bins is not supported.
  void SetCoefficients(std::vector<int> counts);
};

}  // namespace details

/// Every sample as its percentile: the percentage of its channel's samples that lie below it.
///
/// In: any of the ten pixel types, real, any number of channels. Mask: ignored.
/// Out: any of the ten pixel types, of the input's size and channels; percent from 0 to 100 but for an
/// overshoot of the spline, written through `ClipTo`.
///
/// The percentile is read off a cubic spline through the cumulative percentages at the edges of the bins.
/// With the sample v, `MinData` and `MaxData` of its channel in `float`: 0 for v <= MinData or an empty
/// range, 100 for v >= MaxData; else bin = floor((v - MinData) binScale) in `float`, 0 for a negative bin and
/// 100 beyond the last, and in `double`, with dx = v - (bin / binScale + MinData), the value ((dx linear +
/// cumulative) + (dx quadratic) dx) + ((dx cubic) dx) dx, cast to the input's type and then to `float`. A
/// sample that differs from `NoData` by less than 1e-9, both in `float`, is written as `NoData`. This is
/// histogram equalisation; see Richards and Jia (2006), "Remote Sensing Digital Image Analysis", section 4.4;
/// on cubic splines through knots at equal steps Press et al. (2007), "Numerical Recipes", section 3.3.
///
/// Parameters: all vectors empty and `NoData` 0 by default, `BinNum` is the caller's to set. `MinData` and
/// `MaxData` need an entry for each channel, the counts `BinNum` entries for each. A setter called after
/// `Process` takes effect when a type changes. Failures: `Exception` "Invalid type requested." if the type of
/// the input or the output is none of the ten, a complex one included; std::bad_alloc. No pointer is tested,
/// and no sizes are compared. Threads: runs on the caller's thread. One object is for one thread at a time,
/// two objects are independent.
///
/// Deliberate: the spline's system is its own, with 2 (2 - mu) where a natural spline has 4 - mu.
/// Deliberate: the spline's value is cast to the input's type. Integers lose the fraction and wrap: an
/// overshoot of -1.2 is 255 for an `unsigned char` input.
/// Deliberate: counts are multiplied by 100 in 32 bits and wrap above 21474836.
///
/// Example: with the range 0 to 4 and the counts 1, 1, 1, 1 a sample of 2 gives 50.
class GRIDMILL_EXPORT Percentile : public details::PercentileParams {
 public:
  Percentile();
  Percentile(const Percentile&);
  Percentile& operator=(const Percentile&);
  ~Percentile();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
