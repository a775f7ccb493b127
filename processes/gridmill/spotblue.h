#pragma once

#include <cstddef>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::gridmill {

namespace details {

/// The parameters of `SPOTBlue`. Entries 0, 1 and 2 of `min`, `max` and `scale` are those of green, red and
/// the synthetic blue. Deliberate: the setters append. A second call adds behind what is there, and the first
/// entries go on being the ones used.
class GRIDMILL_EXPORT BlueParams {
 public:
  std::vector<float> min;    ///< least valid value of each band, and what the trim subtracts
  std::vector<float> max;    ///< greatest valid value of each band
  std::vector<float> scale;  ///< factor of the trim of each band
  std::vector<float>
      backGround;     ///< of each input channel, 3 at least; also what the background is written as
  bool trim = false;  ///< true: stretches the bands; to be set

  void SetMin(std::vector<float>& values) { Append(values, min); }
  void SetMax(std::vector<float>& values) { Append(values, max); }
  void SetScale(std::vector<float>& values) { Append(values, scale); }
  void SetBackGround(std::vector<float>& values) { Append(values, backGround); }
  void SetTrim(bool value) { trim = value; }

 private:
  static void Append(const std::vector<float>& values, std::vector<float>& field) {
    for (std::size_t i = 0, count = values.size(); i < count; ++i) field.push_back(values[i]);
  }
};

}  // namespace details

/// A blue band for a sensor of green, red and near infrared: alone, or as a natural-colour triple.
///
/// In: any of the ten pixel types; channels 0, 1 and 2 are green, red and near infrared. With one or two
/// channels the blue is 0. Mask: a clear bit makes the pixel background; null means that all are valid.
/// Out: any of the ten pixel types, of the input's size. With exactly 3 channels red, green and blue; with
/// any other number blue in channel 0 alone, further ones keep what they held.
/// Of a complex raster, element c of a pixel is its sample c.
///
/// With the samples s0, s1, s2 as `double`: blue = ((s0 0.873393 + 13.9054) - s1 0.138254) - s2 0.100616. A
/// pixel is background if the mask excludes it, if a sample, truncated to 32 bits, is the background of its
/// channel, truncated likewise, if s0 or s1, truncated, leaves its range from `min` to `max`, or if there are
/// three channels and blue leaves its own; the ends are valid. Without the trim, blue is limited to 0 to 255
/// and written through `ClipTo`, red and green are plain casts. With the trim each band is (value - `min`)
/// `scale`, red and green in `float` (in `double` for a `double` input), blue in `double`, all written
/// through `ClipTo`.
///
/// Parameters: `SetMin`, `SetMax` and `SetBackGround`, `SetScale` for the trim, `SetTrim`, before the first
/// `Process`. Failures: `Exception` "Invalid type to dispatch." if the type of the first input or output is
/// none of the ten; std::bad_alloc. No pointer is tested but the mask's, and no sizes are compared. Threads:
/// runs on the caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: built once and never again. Neither another type nor a setter after the first `Process` takes
/// effect: one object is for one pair of types and one set of parameters.
/// Deliberate: a valid pixel swaps the first two bands, a background pixel keeps the order of `backGround`,
/// which is therefore given as red, green, blue for the output and as green, red, near infrared for the test.
/// Deliberate: the background is a plain cast of the `float`, and is compared in whole numbers of 32 bits: a
/// sample of 7.9 is a background of 7.2, and 300 is none of an `unsigned char`.
///
/// Example: without the trim (0, 0, 0) has a blue of 13.9054, written to `unsigned char` as 14.
class GRIDMILL_EXPORT SPOTBlue : public details::BlueParams {
 public:
  SPOTBlue();
  SPOTBlue(const SPOTBlue&);
  SPOTBlue& operator=(const SPOTBlue&);
  ~SPOTBlue();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;
  struct BlueCreationPolicy;

 private:
  mutable frame::ProcessorCache<filters::IProcessor, 2> cache_;
};

}  // namespace orvik::gridmill
