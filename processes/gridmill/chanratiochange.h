#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameters of `ChanRatioChange`.
class GRIDMILL_EXPORT ChanRatioParams : public ChangeParams<DiffType2> {};

}  // namespace details

/// The ratio of two dates channel by channel, for rasters of unlike types with a mask each.
///
/// Image: `unsigned char`, `short`, `unsigned short` or `float`, any number of channels; a complex raster
/// gives its real parts. Reference: a type of its own out of the same four, at least the image's channels;
/// complex likewise. Image mask: a clear bit excludes the pixel. Reference mask: deliberate, the reverse, a
/// set bit excludes the pixel. Null excludes none. Out: one of the four types, at least the image's channels;
/// a number without a unit.
///
/// With i of the image and r of the reference, both converted to `float`: q = i / r, in the absolute form
/// |q|. It is written through `ClipTo`. A no-data sample of either date makes this sample of the output
/// no-data, not the pixel. `eDIFF2_ABSOLUTE` is the absolute form, every other value the signed one.
///
/// Parameters: `type`, from the constructor; `noData`, default 3.4e38; `imgNoData` and `refNoData`, in the
/// unit of the samples, empty by default. A setter called after `Process` takes effect when a type changes.
/// Failures: `Exception` "poRasterIn is invalid pointer", "poRasterRef is invalid pointer", "poRasterOut is
/// invalid pointer", "Output cannot be complex", "Invalid type requested."; std::bad_alloc. Nothing is
/// written before a check fails. Sizes are not compared. Threads: runs on the caller's thread. One object is
/// for one thread at a time, two objects are independent.
///
/// Deliberate: a zero in the reference is not tested. It gives an infinity, or NaN for 0 / 0, which `ClipTo`
/// turns into the type's limits and 0 in an integer output.
///
/// Example: 10 against 4 is 2.5, and 3 in `unsigned char`.
/// Source: image ratioing, Singh (1989), "Digital change detection techniques using remotely-sensed data",
/// International Journal of Remote Sensing 10(6).
class GRIDMILL_EXPORT ChanRatioChange : public details::ChanRatioParams, public IChangeProcessor {
 public:
  ChanRatioChange(DiffType2 type);
  ChanRatioChange(const ChanRatioChange&);
  ChanRatioChange& operator=(const ChanRatioChange&);
  ~ChanRatioChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
               tessel::Mask* referenceMask, tessel::Raster* out) const override;

  template <class In, class Ref, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IChangeProcessor, 3> cache_;
};

}  // namespace orvik::changedetection
