#pragma once

#include <span>

#include "benchmarks/workloads.h"

namespace orvik::bench {

using Contestant = void (*)(const Workload&);

/// One job on one pair of types. It is measured at every size of `main.cpp`; bytes moved follow from the
/// workload.
struct Row {
  const char* job;
  const char* types;
  WorkloadMaker workload;
  Contestant gridmill;              ///< fills `out`
  Contestant naive;                 ///< fills `twin` with the same bits
  Contestant vectorised = nullptr;  ///< fills `twin` with the peer's comparable quantity
  Contestant opencv = nullptr;      ///< likewise
  Contestant gdal = nullptr;        ///< likewise
  double peersWithin = -1.0;        ///< how far the peers may be off; below 0: they have their own quantity
  const char* python = nullptr;     ///< the row's name in `peers/python_rows.py`
  bool twoThreads = false;          ///< also measured with two threads against one
  /// Null: each call fills `out` or `twin`. Else gridmill and its twin add up over their calls, and this
  /// writes what they have; such a row's peers have their own quantity.
  Contestant results = nullptr;
};

std::span<const Row> AverageChannelsRows();
std::span<const Row> BitmapFilteringRows();
std::span<const Row> ChanDiffChangeRows();
std::span<const Row> ChanDiffChange2Rows();
std::span<const Row> ChanRatioChangeRows();
std::span<const Row> ChanRatioChange2Rows();
std::span<const Row> CombChangeRows();
std::span<const Row> FilterAspRows();
std::span<const Row> FilterSlpRows();
std::span<const Row> IIIDataTransferRows();
std::span<const Row> IntenPercentRows();
std::span<const Row> IntenRatioChangeRows();
std::span<const Row> MagnitudeChangeRows();
std::span<const Row> MirrorImgRows();
std::span<const Row> NormalizeRows();
std::span<const Row> PercentileRows();
std::span<const Row> RangeClassesRows();
std::span<const Row> RasterStatisticsRows();
std::span<const Row> SingleChangeRows();
std::span<const Row> SPOTBlueRows();
std::span<const Row> SqrGradientRows();
std::span<const Row> TasseledCapChangeRows();
std::span<const Row> VegIndexRows();
std::span<const Row> VollathRows();

}  // namespace orvik::bench
