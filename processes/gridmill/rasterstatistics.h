#pragma once

#include <cstddef>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/mask/maskdecision.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::gridmill {

/// What the third channel's statistics are of. Every value but 1 counts as plain.
enum StatisticsMethod : int {
  eSTATISTICS_PLAIN = 0,           ///< of each channel's own samples
  eSTATISTICS_SYNTHETIC_BLUE = 1,  ///< the third channel: of a blue band made of the first three samples
};

namespace details {

/// The parameters of `RasterStatistics` and its results, an entry for each listed channel. Deliberate: the
/// channels are appended to those that are listed already.
class GRIDMILL_EXPORT StatisticsParams {
 public:
  mutable std::vector<float> minValues;              ///< in the unit of the samples; at first 100000
  mutable std::vector<float> maxValues;              ///< at first -100000
  std::vector<unsigned int> channels;                ///< the channel list
  mutable std::vector<std::vector<int>> histograms;  ///< samples of each value from 0 on
  tessel::IMaskDecision* maskDecision = nullptr;     ///< not owned; null: every pixel counts
  int channelCount = -1;                             ///< of the last `SetChans`
  int histogramType = -1;                            ///< 8: 256 bins, any other value: 65536 bins
  StatisticsMethod method = eSTATISTICS_SYNTHETIC_BLUE;

  /// Appends the channels, with the initial minimum and maximum and an empty histogram for each.
  void SetChans(std::vector<unsigned int>& listed) {
    channelCount = static_cast<int>(listed.size());
    for (std::size_t i = 0, count = listed.size(); i < count; ++i) {
      channels.push_back(listed[i]);
      maxValues.push_back(-100000.0f);
      minValues.push_back(100000.0f);
      histograms.emplace_back();
    }
  }

  /// Appends the bins of `type` to each histogram. Returns false, with the type stored, if there is no
  /// channel.
  bool SetType(int type) {
    histogramType = type;
    if (channelCount < 1) return false;
    for (std::vector<int>& histogram : histograms)
      histogram.resize(histogram.size() + (type == 8 ? 256 : 65536));
    return true;
  }

  void SetMask(tessel::IMaskDecision* decision) { maskDecision = decision; }
  void SetMethod(StatisticsMethod value) { method = value; }
};

}  // namespace details

/// The histogram, the minimum and the maximum of each channel, over all calls of `Process` on one object: the
/// tiles of an image, in any order and of any size, give what the whole image gives.
///
/// In: any of the ten pixel types, real or complex; of a complex raster the first `channels` elements of each
/// pixel are read. Channel c counts at position c of the results, whatever numbers the channel list holds.
/// Mask: ignored. A pixel is left out if the `IMaskDecision` says so, which is called for each pixel in their
/// order. Out: neither read nor written; may be null.
/// Results: `GetMinValue`, `GetMaxValue`, `GetPixelCounts`.
///
/// A sample counts in the bin of its value, truncated to an integer. As `float` it becomes the minimum if it
/// is less, the maximum if it is greater. With `eSTATISTICS_SYNTHETIC_BLUE`, the default, position 2 takes
/// instead of the sample b = s0 0.873393 + 13.9054 - s1 0.138254 - s2 0.100616, in `double`, truncated and
/// limited to 0 to 255: the blue band of `SPOTBlue`.
///
/// Parameters: `SetChans`, then `SetType`, before the first `Process`; later setters have no effect on the
/// results. Failures: `Exception` "Invalid type to dispatch." if the type of the first input is none of the
/// ten; std::bad_alloc. No pointer is tested. Threads: runs on the caller's thread. One object is for one
/// thread at a time, two objects are independent.
///
/// A value without a bin is not counted: a negative one, or one beyond the last bin; the same holds for
/// channels beyond the listed ones. `SetType(8)` fits 8-bit data, any other type 16-bit data.
///
/// Deliberate: built once and never again. A later raster of another type is read as the first one's type,
/// and the results are never reset: to start over, use a new object.
/// Deliberate: the initial values are final. A channel whose samples all lie above 100000 has that minimum,
/// one whose samples all lie below -100000 that maximum, and one without any sample 100000 and -100000.
/// Deliberate: no value counts as no-data.
///
/// Example: with three channels and the default method the pixel (100, 50, 20) counts in bins 100 and 50 of
/// the first two channels and in bin 92 of the third, whose minimum and maximum are 92.
class GRIDMILL_EXPORT RasterStatistics : public details::StatisticsParams {
 public:
  RasterStatistics();
  RasterStatistics(const RasterStatistics&);
  RasterStatistics& operator=(const RasterStatistics&);
  ~RasterStatistics();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  /// Appends the minimum of each listed channel; nothing before the first `Process`.
  void GetMinValue(std::vector<float>& values);

  /// Appends the maximum of each listed channel; nothing before the first `Process`.
  void GetMaxValue(std::vector<float>& values);

  /// The histogram at a position of the channel list, which is not checked; empty before the first `Process`.
  std::vector<int> GetPixelCounts(int channel);

  template <class In, class Out>
  class InnerProcessor;
  struct RasterStatsCreationPolicy;

 private:
  mutable frame::ProcessorCache<filters::IProcessor, 2> cache_;
};

}  // namespace orvik::gridmill
