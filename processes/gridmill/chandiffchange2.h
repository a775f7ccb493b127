#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameters of `ChanDiffChange2`.
class GRIDMILL_EXPORT ChanDiffParams2 : public ChangeParams<DiffType2> {};

}  // namespace details

/// The difference of two dates channel by channel, for rasters of unlike types with a mask each.
///
/// Image: `unsigned char`, `short`, `unsigned short` or `float`, any number of channels; a complex raster
/// gives its real parts. Reference: a type of its own out of the same four, at least the image's channels;
/// complex likewise. Image mask: a clear bit excludes the pixel. Reference mask: deliberate, the reverse, a
/// set bit excludes the pixel. Null excludes none. Out: one of the four types, at least the image's channels;
/// the unit is that of the samples.
///
/// With i of the image and r of the reference, a and b their plain casts to the output's type, and k the
/// `ClipTo` of r: `eDIFF2_ABSOLUTE` is i - k where a >= b, else k - i, formed as an integer or, if the image
/// or the output is `float`, as `float`, and cast plainly; every other value, `eDIFF2_SIGNED` among them, is
/// a - b, which wraps in an integer output. A no-data sample of either date makes this sample of the output
/// no-data, not the pixel.
///
/// Parameters: `type`, from the constructor; `noData`, default 0; `imgNoData` and `refNoData`, in the unit of
/// the samples, empty by default. A setter called after `Process` takes effect when a type changes.
/// Failures: `Exception` "poRasterIn is invalid pointer", "poRasterRef is invalid pointer", "poRasterOut is
/// invalid pointer", "Output cannot be complex", "Invalid type requested."; std::bad_alloc. Nothing is
/// written before a check fails. Sizes are not compared. Threads: runs on the caller's thread. One object is
/// for one thread at a time, two objects are independent.
///
/// Deliberate: the absolute form is not symmetric. Plain casts of both decide on the direction, the
/// subtraction takes the image as it stands and the reference clipped.
///
/// Example: the `unsigned char` 5 against the `short` -3 in `unsigned short`: b is 65533, k is 0, and the
/// absolute form gives 0 - 5, that is, 65531.
/// Source: image differencing, Singh (1989), "Digital change detection techniques using remotely-sensed
/// data", International Journal of Remote Sensing 10(6).
class GRIDMILL_EXPORT ChanDiffChange2 : public details::ChanDiffParams2, public IChangeProcessor {
 public:
  ChanDiffChange2(DiffType2 type);
  ChanDiffChange2(const ChanDiffChange2&);
  ChanDiffChange2& operator=(const ChanDiffChange2&);
  ~ChanDiffChange2() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
               tessel::Mask* referenceMask, tessel::Raster* out) const override;

  template <class In, class Ref, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IChangeProcessor, 3> cache_;
};

}  // namespace orvik::changedetection
