#pragma once

#include <cstddef>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters of `BitmapFiltering`. Setters store the value, with no check.
class GRIDMILL_EXPORT BitFParams {
 public:
  float thresholdMin;  ///< in the unit of the samples; above `thresholdMax` the range wraps
  float thresholdMax;
  std::byte reserved[4];  ///< copied with the object; nothing sets or reads it

  BitFParams(float min = 0.0f, float max = 0.0f) : thresholdMin(min), thresholdMax(max) {}

  void SetThresholdMin(float value) { thresholdMin = value; }
  void SetThresholdMax(float value) { thresholdMax = value; }
};

}  // namespace details

/// A bitmap of the samples within a range of thresholds: 1 inside, 0 outside.
///
/// In: any of the ten pixel types, one channel. Element x of a row is the sample of pixel x: of a raster with
/// more channels, or a complex one, the first `width` elements of each row are taken.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, of the input's size; sample 0 of a pixel is written, 0 or 1.
///
/// With the sample s and both thresholds in `float`: thresholdMin <= s <= thresholdMax, both ends included;
/// with equal thresholds s = thresholdMin. A minimum above the maximum wraps around, as for an angle: s >=
/// thresholdMin or s <= thresholdMax. A threshold of NaN makes the range a wrapped one too, of which the half
/// with the NaN holds nothing. A sample of NaN is outside every range.
///
/// Parameters: both thresholds 0 by default, which selects the samples equal to 0. A setter called after
/// `Process` takes effect when the input's type changes. Failures: `Exception` "Invalid type to dispatch." if
/// the type of the input or the output is none of the ten; std::bad_alloc. No pointer is tested but the
/// mask's, and no sizes are compared. Threads: runs on the caller's thread. One object is for one thread at a
/// time, two objects are independent.
///
/// Deliberate: only a change of the input's type rebuilds. A later output of another type is written as the
/// type of the first one.
/// Deliberate: an excluded pixel holds 0, which a sample outside the range gives too.
/// Deliberate: `double` and 64-bit samples are narrowed to `float` before they are compared.
///
/// Example: thresholds 10 and 20 give 1 for 10, 15 and 20 and 0 for 9.5; thresholds 20 and 10 give 1 for 5,
/// 10, 20 and 25 and 0 for 15.
class GRIDMILL_EXPORT BitmapFiltering : public details::BitFParams {
 public:
  BitmapFiltering(float thresholdMin = 0.0f, float thresholdMax = 0.0f);
  BitmapFiltering(const BitmapFiltering&);
  BitmapFiltering& operator=(const BitmapFiltering&);
  ~BitmapFiltering();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;
  struct BitCreationPolicy;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
