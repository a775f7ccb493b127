#pragma once

#include <optional>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/rasterstatistics.h"

namespace orvik::reference {

/// The statistics, slowly: one pixel after the other, with all that an object keeps between its calls.
class RasterStatistics {
 public:
  /// @param params    what the operator holds at its first call; the channel list, the type and the method
  /// count
  /// @param decision  in place of that of `params`; null: every pixel counts
  RasterStatistics(const gridmill::details::StatisticsParams& params, tessel::IMaskDecision* decision);

  /// The type of the first raster is that of the elements of all rasters.
  void Process(const tessel::Raster& in);

  const std::vector<float>& Minima() const { return minima_; }
  const std::vector<float>& Maxima() const { return maxima_; }
  const std::vector<std::vector<int>>& Histograms() const { return histograms_; }

 private:
  template <class T>
  void CountPixel(const tessel::Raster& in, unsigned x, unsigned y);
  template <class T>
  void CountSample(unsigned channel, T sample);
  void CountBlue(double s0, double s1, double s2);

  gridmill::StatisticsMethod method_;
  tessel::IMaskDecision* decision_;
  std::optional<tessel::DataType> type_;
  std::vector<float> minima_, maxima_;
  std::vector<std::vector<int>> histograms_;
};

}  // namespace orvik::reference
