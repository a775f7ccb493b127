#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameters of `MagnitudeChange`.
class GRIDMILL_EXPORT MagnitudeParams : public ChangeParams<DiffType> {};

}  // namespace details

/// The lengths of the pixel vectors of two dates, and their difference.
///
/// Image: any of the ten pixel types, any number of channels.
/// Reference: read as the image's type, at the same (x, y) by its own margins and channels.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, at least three channels: the image's magnitude A, the reference's
/// magnitude B and their difference C, in the unit of the samples.
///
/// A and B are the square roots of the sums of the channels' squares, in the order of the channels and in
/// `double`. C is |A - B| for `eDIFF_ABSOLUTE`, A - B for `eDIFF_FORWARD`, B - A for every other value,
/// `eDIFF_BACKWARD` among them. They are written through `ClipTo`. A no-data sample in any channel of either
/// date makes the whole pixel no-data.
///
/// Parameters: `type`, from the constructor; `noData`, default 0; `imgNoData` and `refNoData`, in the unit of
/// the samples, empty by default. A setter called after `Process` takes effect when a type changes.
/// Failures: `Exception` "Invalid type to dispatch." for an image or output of no pixel type; std::bad_alloc.
/// No pointer is tested but the mask's, and no sizes are compared. Threads: runs on the caller's thread. One
/// object is for one thread at a time, two objects are independent.
///
/// Deliberate: a square is formed in the sample's own arithmetic, that of `int` for 8 and 16 bits, and wraps
/// there: an `unsigned short` above 46340 has a negative square, and the magnitude may be NaN.
///
/// Example: (3, 4) against (6, 8) gives 5, 10 and -5 forward.
/// Source: the difference of vector lengths, after the change vector of Malila (1980), "Change vector
/// analysis: an approach for detecting forest changes with Landsat", Proc. Machine Processing of Remotely
/// Sensed Data.
class GRIDMILL_EXPORT MagnitudeChange : public details::MagnitudeParams, public IChange {
 public:
  MagnitudeChange(DiffType type);
  MagnitudeChange(const MagnitudeChange&);
  MagnitudeChange& operator=(const MagnitudeChange&);
  ~MagnitudeChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct MagnitudeCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

}  // namespace orvik::changedetection
