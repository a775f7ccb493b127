#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/difftype.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameter of `SingleChange`.
class GRIDMILL_EXPORT SingleParams {
 public:
  DiffType type;  ///< form of the difference; unset until the operator's constructor or a setter sets it

  /// Stores the value, with no check.
  void SetType(DiffType value) { type = value; }
};

}  // namespace details

/// The difference of the first channels of two dates, in single precision.
///
/// Image: any of the ten pixel types; only sample 0 of a pixel is read.
/// Reference: read as the image's type, at the same (x, y) by its own margins and channels.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types; sample 0 of a pixel is written, the unit is that of the samples.
///
/// With i of the image and r of the reference, both converted to `float`: `eDIFF_FORWARD` is r - i,
/// `eDIFF_ABSOLUTE` is |r - i|, every other value, `eDIFF_BACKWARD` among them, is i - r. The difference is
/// written through `ClipTo`. A complex raster is read and written element by element, its real part first.
///
/// Parameters: `type`, from the constructor. A setter called after `Process` takes effect when a type
/// changes. Failures: `Exception` "Invalid type to dispatch." for an image or output of no pixel type;
/// std::bad_alloc. No pointer is tested but the mask's, and no sizes are compared. Threads: runs on the
/// caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: `eDIFF_FORWARD` is reference minus image, the reverse of `ChanDiffChange`.
/// Deliberate: an excluded pixel holds 0, which is a valid difference too.
/// Deliberate: `double` and 64-bit samples are narrowed to `float` before the subtraction.
///
/// Example: `unsigned char` samples 10 and 250 give 240 forward, 0 backward and 240 as an absolute
/// difference. Source: image differencing, Singh (1989), "Digital change detection techniques using
/// remotely-sensed data", International Journal of Remote Sensing 10(6).
class GRIDMILL_EXPORT SingleChange : public details::SingleParams, public IChange {
 public:
  SingleChange(DiffType type);
  SingleChange(const SingleChange&);
  SingleChange& operator=(const SingleChange&);
  ~SingleChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct SingleCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

}  // namespace orvik::changedetection
