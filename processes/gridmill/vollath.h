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

/// The parameters of `VollathEvaluation`. Setters store the value, with no check.
class GRIDMILL_EXPORT VollathParams {
 public:
  double backgroundLow = -10000000.0;  ///< a sample counts if it is greater, in the unit of the samples
  double backgroundHigh = 10000000.0;  ///< a sample counts if it is less
  double failure = -32767.0;           ///< a sample within 1e-9 of it does not count

  void SetBackground(double low, double high) {
    backgroundLow = low;
    backgroundHigh = high;
  }
  void SetFailure(double value) { failure = value; }
};

/// The result of `VollathEvaluation`.
class GRIDMILL_EXPORT VollathStats {
 public:
  mutable std::vector<double> leftEq;   ///< sum of p1 p0 of each channel
  mutable std::vector<double> rightEq;  ///< sum of p2 p0 of each channel
  unsigned int numChannels = 0;         ///< of the last `InitEvaluation`

  std::vector<double> GetLeftEq() const { return leftEq; }
  std::vector<double> GetRightEq() const { return rightEq; }

  /// Starts with sums of 0 for `channels` channels. On the operator this clears a copy, which the next
  /// `Process` overwrites with the totals.
  void InitEvaluation(unsigned int channels) {
    numChannels = channels;
    leftEq.assign(channels, 0.0);
    rightEq.assign(channels, 0.0);
  }

 protected:
  void SetLeftEvaluation(std::vector<double> sums) const { leftEq = std::move(sums); }
  void SetRightEvaluation(std::vector<double> sums) const { rightEq = std::move(sums); }
};

}  // namespace details

/// The two sums of Vollath's autocorrelation focus measure, for each channel: of the products of each sample
/// with its right neighbour (left sum) and with the one two places on (right sum). The measure is left minus
/// right; the sharper of two images of one scene has the larger one.
///
/// In: any of the ten pixel types, real, at least one channel; each sample is converted to `double`.
/// Mask: null means that all pixels are valid; see below. Out: neither read nor written; may be null.
/// Result: `GetLeftEq` and `GetRightEq`, an entry for each channel of the input, in squared units of the
/// samples. They are the totals of all calls with one input type, so that an image can be fed in tiles.
///
/// A triple p0, p1, p2 of samples that follow each other in a row counts unless one of them is within 1e-9 of
/// `failure` or is not strictly between `backgroundLow` and `backgroundHigh`. For each counted triple p1 p0
/// and p2 p0 are added to sums that start at 0 with each call, in the order of the pixels, all in `double`.
/// Source: Vollath (1987), "Automatic focusing by correlative methods", Journal of Microscopy 147(3).
///
/// Parameters: see `details::VollathParams`. A setter called after `Process` takes effect when the input's
/// type changes, which starts totals of 0. Failures: `Exception` "poRasterIn is invalid pointer", "poRasterIn
/// must have minimum 1 channels.", "Invalid type requested." if the input's type is none of the ten, a
/// complex one included; std::bad_alloc. All calls with one type need one number of channels. Threads: the
/// scan holds one lock for the whole process, which `SqrGradientEvaluation` shares. One object is for one
/// thread at a time, two objects may run on two threads and scan one after the other.
///
/// Deliberate: the totals are not reset by a call with the same type.
/// Deliberate: the mask's bit of p2 is not tested.
/// Deliberate: in each row, as many triples from the left end on are read as positions pass the mask: the
/// position falls behind at each masked column.
///
/// Example: the row 1 2 3 4 gives left 1 x 2 + 2 x 3 = 8 and right 1 x 3 + 2 x 4 = 11.
class GRIDMILL_EXPORT VollathEvaluation : public details::VollathParams, public details::VollathStats {
 public:
  VollathEvaluation();
  VollathEvaluation(const VollathEvaluation&);
  VollathEvaluation& operator=(const VollathEvaluation&);
  ~VollathEvaluation();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
