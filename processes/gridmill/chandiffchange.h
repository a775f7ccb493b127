#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameters of `ChanDiffChange`.
class GRIDMILL_EXPORT ChanDiffParams : public ChangeParams<DiffType> {};

}  // namespace details

/// The difference of two dates channel by channel, in the arithmetic of the output's type.
///
/// Image: any of the ten pixel types, any number of channels.
/// Reference: read as the image's type, at the same (x, y) by its own margins and channels, at least as many
/// as the image's.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, at least the image's channels; the unit is that of the samples.
///
/// Both samples are converted to the output's type by a plain cast, a of the image and b of the reference.
/// `eDIFF_ABSOLUTE` is a - b where a >= b, else b - a; `eDIFF_FORWARD` is a - b; every other value,
/// `eDIFF_BACKWARD` among them, is b - a, on a floating output 0 - (a - b). A no-data sample of either date
/// makes this sample of the output no-data, not the pixel.
///
/// Parameters: `type`, from the constructor; `noData`, default 0; `imgNoData` and `refNoData`, in the unit of
/// the samples, empty by default. A setter called after `Process` takes effect when a type changes.
/// Failures: `Exception` "Invalid type to dispatch." for an image or output of no pixel type; std::bad_alloc.
/// No pointer is tested but the mask's, and no sizes are compared. Threads: runs on the caller's thread. One
/// object is for one thread at a time, two objects are independent.
///
/// Deliberate: integer differences wrap and never saturate; an absolute difference in a signed output can be
/// negative.
/// Deliberate: floating samples are truncated one by one before an integer subtraction, wider integers lose
/// their high bits.
///
/// Example: `unsigned char` samples 10 and 250 give 16 forward, 240 backward and 240 as an absolute
/// difference. Source: image differencing, Singh (1989), "Digital change detection techniques using
/// remotely-sensed data", International Journal of Remote Sensing 10(6).
class GRIDMILL_EXPORT ChanDiffChange : public details::ChanDiffParams, public IChange {
 public:
  ChanDiffChange(DiffType type);
  ChanDiffChange(const ChanDiffChange&);
  ChanDiffChange& operator=(const ChanDiffChange&);
  ~ChanDiffChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct ChanDiffCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

}  // namespace orvik::changedetection
