#pragma once

#include <algorithm>
#include <array>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

/// How samples are taken where the scale changes. With any value but 0 nothing is written.
enum ResampleType : int {
  eRESAMPLE_NEAREST = 0,  ///< the nearest pixel
};

namespace orvik::gridmill {

namespace details {

/// A region of a whole image, in pixels: x, y, width, height.
using Region = std::array<unsigned int, 4>;

/// The parameters of `IIIDataTransfer`. Setters store the value, with no check.
class GRIDMILL_EXPORT IIIParams {
 public:
  ResampleType resampleType = eRESAMPLE_NEAREST;
  Region inRegion{};   ///< source, in the whole image that the input is a piece of; to be set
  Region outRegion{};  ///< target, in the whole image that the output is a piece of; to be set
  std::vector<unsigned int> inReserved;   ///< copied with the object; nothing sets or reads it
  std::vector<unsigned int> outReserved;  ///< the same

  /// The first four entries are taken.
  void SetInRegion(std::vector<unsigned int>& region) { std::copy_n(region.begin(), 4, inRegion.begin()); }
  void SetOutRegion(std::vector<unsigned int>& region) { std::copy_n(region.begin(), 4, outRegion.begin()); }
  void SetResampleType(ResampleType type) { resampleType = type; }
};

}  // namespace details

/// Fills a raster with the nearest pixels of another one, from a region of a whole image to a region of
/// another scale. Both rasters may be pieces of larger images: their origins count.
///
/// In: any of the ten pixel types, real or complex, any number of channels. Mask: ignored.
/// Out: any of the ten pixel types, with at least the input's channels, and complex or with twice as many if
/// the input is complex; not the input itself. All its pixels are written, those outside the region too; each
/// gets all samples of its input pixel, and further ones keep what they held.
///
/// On each axis, with the output coordinate p, the scale S = `outRegion` extent / `inRegion` extent in
/// `double`, and the input's extent n: t = p - `outRegion` start + the output's origin, in unsigned 32 bits;
/// u = t / S + `inRegion` start - the input's origin + 0.5 in `double`; the input coordinate is u truncated,
/// limited to 0 to n - 1. Samples are plain casts, without `ClipTo`: 300.7 to `unsigned char` is 44.
///
/// Parameters: both regions, to be set before the first `Process`. Failures: `Exception` "Invalid type
/// requested." if the type of the first input or output is none of the ten; std::bad_alloc. No pointer is
/// tested, and no sizes are compared. Threads: runs on the caller's thread. One object is for one thread at a
/// time, two objects are independent.
///
/// Deliberate: built once and never again. Neither another type nor a setter after the first `Process` takes
/// effect: for other regions or types, use a new object.
/// Deliberate: input pixels past the edges of `inRegion` are taken too; only the input's own extent is a
/// limit. Deliberate: a pixel left of the target region wraps. With a scale up to about 2 it gets the first
/// column, with a larger one the last; above the region it is the same with rows.
///
/// Example: with a scale of 2 the output columns 0, 1, 2, 3 get the input columns 0, 1, 1, 2.
class GRIDMILL_EXPORT IIIDataTransfer : public details::IIIParams {
 public:
  IIIDataTransfer();
  IIIDataTransfer(const IIIDataTransfer&);
  IIIDataTransfer& operator=(const IIIDataTransfer&);
  ~IIIDataTransfer();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<filters::IProcessor, 2> cache_;
};

}  // namespace orvik::gridmill
