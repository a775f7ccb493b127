#pragma once

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

namespace details {

/// The parameter of `AverageChannels`.
class GRIDMILL_EXPORT AverageChannelsParams {
 public:
  float
      noData;  ///< in the unit of the samples; unset until a constructor of the operator or a setter sets it

  AverageChannelsParams() = default;
  AverageChannelsParams(const AverageChannelsParams&) = default;
  AverageChannelsParams& operator=(const AverageChannelsParams&) = default;
  virtual ~AverageChannelsParams();

  /// Stores the value, with no check.
  void SetNodata(float value) { noData = value; }
};

}  // namespace details

/// The arithmetic mean of a pixel's channels, as one band.
///
/// In: any of the ten pixel types, any number of channels; a complex raster is averaged over its real parts.
/// Input mask: a clear bit excludes the pixel; null means that all are valid. Output mask: ignored.
/// Out: any of the ten pixel types, one channel, the unit of the samples. Element x of an output row is the
/// mean of pixel x: a raster of more channels gets its results packed at the start of each row.
///
/// All arithmetic is in `float`: the samples are added in the order of the channels, the sum is divided by
/// their number, and the mean is written through `ClipTo`. A pixel is no-data if one of its samples differs
/// from `noData` by less than 1e-9; it holds `ClipTo` of `noData`. A `noData` of NaN matches nothing.
///
/// Parameters: `noData`, default 0. A setter called after `Process` takes effect when a type changes.
/// Failures: `Exception` "poRasterIn is invalid pointer", "poRasterOut is invalid pointer", "Output cannot be
/// complex", "Invalid type requested."; std::bad_alloc. Nothing is written before a check fails. Sizes are
/// not compared.
/// Threads: rows run in parallel. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: a masked pixel holds `noData` cast to the input's type and then to the output's, neither
/// rounded nor clamped. With -1, `short` in and `unsigned char` out it holds 255, where a no-data pixel holds
/// 0.
///
/// Example: the `unsigned char` pixel (10, 20, 31) has the mean 20.33 and gives 20.
class GRIDMILL_EXPORT AverageChannels : public details::AverageChannelsParams {
 public:
  AverageChannels();
  AverageChannels(float noData);
  AverageChannels(const AverageChannels&);
  AverageChannels& operator=(const AverageChannels&);
  ~AverageChannels() override;

  void Process(tessel::Raster* in, tessel::Mask* inMask, tessel::Raster* out, tessel::Mask* outMask) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IClipperProcessor, 2> cache_;
};

}  // namespace orvik::filters
