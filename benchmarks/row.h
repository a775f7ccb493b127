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
  Contestant gridmill;          ///< fills `out`
  Contestant naive;             ///< fills `twin` with the same bits
  Contestant opencv = nullptr;  ///< fills `twin` with the peer's comparable quantity
  Contestant gdal = nullptr;    ///< likewise
  bool twoThreads = false;      ///< also measured with two threads against one
};

std::span<const Row> AverageChannelsRows();
std::span<const Row> ChanDiffChangeRows();
std::span<const Row> ChanDiffChange2Rows();
std::span<const Row> ChanRatioChangeRows();
std::span<const Row> ChanRatioChange2Rows();
std::span<const Row> CombChangeRows();
std::span<const Row> FilterAspRows();
std::span<const Row> FilterSlpRows();
std::span<const Row> IntenRatioChangeRows();
std::span<const Row> MagnitudeChangeRows();
std::span<const Row> SingleChangeRows();
std::span<const Row> TasseledCapChangeRows();

}  // namespace orvik::bench
