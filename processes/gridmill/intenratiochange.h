#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameters of `IntenRatioChange`. Deliberate: `type` has no effect.
class GRIDMILL_EXPORT IntenRatioParams : public ChangeParams<DiffType> {};

}  // namespace details

/// The mean intensities of two dates and their ratio in decibels.
///
/// Image: any of the ten pixel types, any number of channels.
/// Reference: read as the image's type, at the same (x, y) by its own margins and channels.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, at least four channels: the image's mean S and the reference's mean T in
/// the unit of the samples, the ratio D in decibels, and 0.
///
/// All in `double`: S and T are the sums of all channels in their order, divided by their number;
/// D = 10 log10(|S / T|), and 0 where T is 0. They are written through `ClipTo`. A no-data sample in any
/// channel of either date makes the whole pixel no-data.
///
/// Parameters: `noData`, default 0; `imgNoData` and `refNoData`, in the unit of the samples, empty by
/// default. A setter called after `Process` takes effect when a type changes. Failures: `Exception` "Invalid
/// type to dispatch." for an image or output of no pixel type; std::bad_alloc. No pointer is tested but the
/// mask's, and no sizes are compared. Threads: runs on the caller's thread. One object is for one thread at a
/// time, two objects are independent.
///
/// Deliberate: `type` is stored and has no effect.
/// Deliberate: only T is tested: an S of 0 gives minus infinity.
///
/// Example: image samples 100 and 200, reference samples 50 and 100 give 150, 75, 3.0103 and 0.
/// Source: the log-ratio, Dekker (1998), "Speckle filtering in satellite SAR change detection imagery",
/// International Journal of Remote Sensing 19(6).
class GRIDMILL_EXPORT IntenRatioChange : public details::IntenRatioParams, public IChange {
 public:
  IntenRatioChange(DiffType type);
  IntenRatioChange(const IntenRatioChange&);
  IntenRatioChange& operator=(const IntenRatioChange&);
  ~IntenRatioChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct SingleCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

}  // namespace orvik::changedetection
