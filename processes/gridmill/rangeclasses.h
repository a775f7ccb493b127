#pragma once

#include <limits>
#include <utility>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/mask/maskdecision.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::gridmill {

namespace details {

/// The parameters of `RangeClasses`. Setters store the value, with no check.
class GRIDMILL_EXPORT RangeClassesParams {
 public:
  std::vector<float> minRange;   ///< lower bound of each class, in the unit of the samples
  std::vector<float> maxRange;   ///< upper bound of each class
  std::vector<int> classValues;  ///< 1, 2, ... `classCount`
  int classCount = -1;
  float noData = std::numeric_limits<float>::quiet_NaN();  ///< to be set; NaN is equal to no sample
  tessel::IMaskDecision* maskDecision = nullptr;           ///< not owned; never called

  /// Always returns true.
  bool SetNumClasses(int count) {
    classCount = count;
    classValues.clear();
    for (int number = 1; number <= count; ++number) classValues.push_back(number);
    return true;
  }

  void SetMinRange(std::vector<float> bounds) { minRange = std::move(bounds); }
  void SetMaxRange(std::vector<float> bounds) { maxRange = std::move(bounds); }
  void SetNoData(float value) { noData = value; }
  void SetMask(tessel::IMaskDecision* decision) { maskDecision = decision; }
};

}  // namespace details

/// A density slice: each pixel gets the number of the class whose range its first sample lies in, or 0.
///
/// In: any of the ten pixel types, real; sample 0 of a pixel is read, as `float`. Mask: ignored.
/// Out: any of the ten pixel types, of the input's size and one channel. Element x of a row is written for
/// pixel x: of a raster with more channels, the first `width` elements of each row.
///
/// With the sample s in `float`, class k, from 1 to the number of classes, holds minRange[k - 1] < s <
/// maxRange[k - 1]. Where ranges overlap, the highest class wins. A sample that differs from `noData` by less
/// than 1e-9, both in `float`, gets 0, and so does NaN. The number is stored as a plain cast: in an `unsigned
/// char` class 300 is 44.
///
/// Parameters: `SetNumClasses`, `SetMinRange` and `SetMaxRange` with a bound for each class, `SetNoData`. A
/// setter called after `Process` takes effect when a type changes. Without a class, all pixels get 0.
/// Failures: `Exception` "Invalid type requested." if the type of the input or the output is none of the ten,
/// a complex one included; std::bad_alloc. No pointer is tested, and no sizes are compared. Threads: runs on
/// the caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: both bounds are exclusive. A sample equal to a bound that two ranges share is in neither.
/// Deliberate: the mask decision is handed over and never called.
/// Deliberate: `double` and 64-bit samples are narrowed to `float` before they are compared.
///
/// Example: with the ranges (0, 10) and (5, 20), 3 gives 1, 7 gives 2, 10 gives 2, 20 gives 0.
class GRIDMILL_EXPORT RangeClasses : public details::RangeClassesParams {
 public:
  RangeClasses();
  RangeClasses(const RangeClasses&);
  RangeClasses& operator=(const RangeClasses&);
  ~RangeClasses();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  /// The number of classes of the last build; -1 before the first `Process`.
  int GetClassNumber();

  /// Appends the lower bounds of the last build, as many as this object has classes; nothing before the first
  /// `Process`.
  void GetMinRangeValue(std::vector<float>& values);

  /// The same for the upper bounds.
  void GetMaxRangeValue(std::vector<float>& values);

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<filters::IProcessor, 2> cache_;
};

}  // namespace orvik::gridmill
