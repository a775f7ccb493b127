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

/// The parameters of `Normalize`. Setters store the value, with no check.
class GRIDMILL_EXPORT NormalizeParams {
 public:
  std::vector<float> MinData;  ///< lower bound of each channel, in the unit of its samples
  std::vector<float> MaxData;  ///< upper bound of each channel
  float NoData = 0.0f;         ///< marks an invalid sample, of the input and of the output

  void SetMinData(std::vector<float> values) { MinData = std::move(values); }
  void SetMaxData(std::vector<float> values) { MaxData = std::move(values); }
  void SetNoData(float value) { NoData = value; }
};

}  // namespace details

/// Every sample as a percentage of the range of its channel.
///
/// In: any of the ten pixel types, real, any number of channels. Mask: ignored.
/// Out: any of the ten pixel types, of the input's size and channels; percent from 0 to 100, written through
/// `ClipTo`.
///
/// With the sample v, `MinData` and `MaxData` of its channel in `float`: 0 for v <= MinData, 100 for v >=
/// MaxData, else (v - MinData) 100 / (MaxData - MinData), the differences in `float`, product and quotient in
/// `double`, narrowed to `float` and limited to 0 and 100. A sample that differs from `NoData` by less than
/// 1e-9, both in `float`, is written as `NoData`. This is the linear contrast stretch; see Richards and Jia
/// (2006), "Remote Sensing Digital Image Analysis", section 4.3.
///
/// Parameters: both vectors empty and `NoData` 0 by default; the vectors need an entry for each channel. A
/// setter called after `Process` takes effect when a type changes. Failures: `Exception` "Invalid type
/// requested." if the type of the input or the output is none of the ten, a complex one included;
/// std::bad_alloc. No pointer is tested, and no sizes are compared. Threads: runs on the caller's thread. One
/// object is for one thread at a time, two objects are independent.
///
/// Deliberate: with the default `NoData` samples of exactly 0 stay 0, whatever the range.
/// Deliberate: a lower bound at or above the upper one divides by nothing: 0 up to it, 100 beyond.
///
/// Example: with the range 10 to 30 the samples 5, 10, 15, 30 and 40 give 0, 0, 25, 100 and 100.
class GRIDMILL_EXPORT Normalize : public details::NormalizeParams {
 public:
  Normalize();
  Normalize(const Normalize&);
  Normalize& operator=(const Normalize&);
  ~Normalize();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
