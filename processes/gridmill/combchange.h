#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The parameters of `CombChange`. Deliberate: only `noData` has an effect.
class GRIDMILL_EXPORT CombParams : public ChangeParams<DiffType> {};

}  // namespace details

/// Two dates side by side: each pixel holds the channels of the image, then those of the reference.
///
/// Image: any of the ten pixel types, any number of channels.
/// Reference: any number of channels, of the image's type for a plain combination.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, at least as many channels as both together; the unit is that of the
/// samples.
///
/// Each sample is written through `ClipTo`; equal types are copied. An excluded pixel holds `noData` in all
/// of these channels. Types are ordered by width, signedness, floating, significand and complexity, so that
/// `unsigned char` < `char` < `unsigned short` < `short`.
///
/// Parameters: `noData`, default 0; `type`, `imgNoData` and `refNoData` are stored and have no effect. A
/// setter called after `Process` takes effect when a type changes. Failures: `Exception` "Invalid type to
/// dispatch." for an image or output of no pixel type; std::bad_alloc. No pointer is tested but the mask's,
/// and no sizes are compared. Threads: runs on the caller's thread. One object is for one thread at a time,
/// two objects are independent.
///
/// Deliberate: beside an image that does not order below it, a reference of another type is read byte by byte
/// as `unsigned char` if it has 8 bits, and comes out as 0 if it has another width. Deliberate: an image that
/// orders below its reference is read as decimal text: the two bytes of a 16-bit sample through `atoi`, so
/// that 0x3231 gives 12 and most samples give 0; other widths give 0. The reference is then read in elements
/// of the image's type.
///
/// Example: image pixel (1, 2, 3), reference pixel (4, 5): (1, 2, 3, 4, 5).
/// Source: the composite of dates on which multidate classification works, Singh (1989), "Digital change
/// detection techniques using remotely-sensed data", International Journal of Remote Sensing 10(6).
class GRIDMILL_EXPORT CombChange : public details::CombParams, public IChange {
 public:
  CombChange(DiffType type);
  CombChange(const CombChange&);
  CombChange& operator=(const CombChange&);
  ~CombChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct CombCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

}  // namespace orvik::changedetection
