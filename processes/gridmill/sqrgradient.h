#pragma once

#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameters and the result of `SqrGradientEvaluation`. Setters store the value, with no check.
class GRIDMILL_EXPORT SqrGradientParams {
 public:
  double backgroundLow = -10000000.0;      ///< a sample counts if it is greater, in the unit of the samples
  double backgroundHigh = 10000000.0;      ///< a sample counts if it is less
  double failure = -32767.0;               ///< a sample within 1e-9 of it does not count
  unsigned int numChannels = 0;            ///< of the last `InitEvaluation`
  mutable std::vector<double> evaluation;  ///< the sum of each channel

  void SetBackground(double low, double high) {
    backgroundLow = low;
    backgroundHigh = high;
  }
  void SetFailure(double value) { failure = value; }

  /// Starts with sums of 0 for `channels` channels. The caller does so before the first `Process`.
  void InitEvaluation(unsigned int channels) {
    numChannels = channels;
    evaluation.assign(channels, 0.0);
  }

  std::vector<double> GetEvaluation() const { return evaluation; }
};

}  // namespace details

/// A focus measure: for each channel the sum of the squared differences between each sample and the one a row
/// below. The sharper of two images of one scene has the larger sum.
///
/// In: any of the ten pixel types, real, at least one channel; each sample is converted to `double`.
/// Mask: null means that all pixels are valid; see below. Out: neither read nor written; may be null.
/// Result: `GetEvaluation`, an entry for each channel that `InitEvaluation` was called with, in squared units
/// of the samples.
///
/// A pair counts unless one of its samples is within 1e-9 of `failure` or is not strictly between
/// `backgroundLow` and `backgroundHigh`. For each counted pair (p1 - p0)^2 is added to a sum that starts at 0
/// with each call, in the order of the pixels, all in `double`. This is the squared vertical gradient; see
/// Santos et al. (1997), "Evaluation of autofocus functions in molecular cytogenetic analysis", Journal of
/// Microscopy 188(3).
///
/// Parameters: see `details::SqrGradientParams`. A setter called after `Process` takes effect when the
/// input's type changes. Failures: `Exception` "poRasterIn is invalid pointer", "poRasterIn must have minimum
/// 1 channels.", "Invalid type requested." if the input's type is none of the ten, a complex one included;
/// std::bad_alloc. All calls with one type need one number of channels. Threads: the scan holds one lock for
/// the whole process, which `VollathEvaluation` shares. One object is for one thread at a time, two objects
/// may run on two threads and scan one after the other.
///
/// Deliberate: without a call of `InitEvaluation` on this object the result stays empty.
/// Deliberate: after a call the running total of all calls with this type is added to the result, which
/// therefore grows quadratically: sums s1 and s2 give s1 + (s1 + s2). For one call's sum use a new object.
/// Deliberate: in each row, as many pairs from the left end on are read as pixels are set in the mask in both
/// rows: the position falls behind at each masked column.
/// Deliberate: every call prints a line for each channel to the standard output: "\n BEFORE - 101 %f\n" with
/// the sum of the call.
///
/// Example: the rows 1 2 and 4 6 give (4 - 1)^2 + (6 - 2)^2 = 25.
class GRIDMILL_EXPORT SqrGradientEvaluation : public details::SqrGradientParams {
 public:
  SqrGradientEvaluation();
  SqrGradientEvaluation(const SqrGradientEvaluation&);
  SqrGradientEvaluation& operator=(const SqrGradientEvaluation&);
  ~SqrGradientEvaluation();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
