#pragma once

#include "benchmarks/workloads.h"

/// In front of a peer's function: its address is null where the peer's library is not installed.
#define GRIDMILL_PEER __attribute__((weak))

namespace orvik::bench {

// Each computes its library's own comparable quantity into `twin`, on the caller's thread alone.

GRIDMILL_PEER void OpenCvSlope(const Workload& work);
GRIDMILL_PEER void OpenCvAspect(const Workload& work);
GRIDMILL_PEER void OpenCvMean(const Workload& work);
GRIDMILL_PEER void OpenCvDifference(const Workload& work);
GRIDMILL_PEER void OpenCvUnlikeDifference(const Workload& work);
GRIDMILL_PEER void OpenCvRatio(const Workload& work);
GRIDMILL_PEER void OpenCvCombination(const Workload& work);
GRIDMILL_PEER void OpenCvDecibels(const Workload& work);

GRIDMILL_PEER void OpenCvNdvi(const Workload& work);
GRIDMILL_PEER void OpenCvStretch(const Workload& work);
GRIDMILL_PEER void OpenCvBitmap(const Workload& work);
GRIDMILL_PEER void OpenCvMaskedBitmap(const Workload& work);
GRIDMILL_PEER void OpenCvMirrorColumns(const Workload& work);
GRIDMILL_PEER void OpenCvMirrorRows(const Workload& work);
GRIDMILL_PEER void OpenCvSquaredGradient(const Workload& work);

GRIDMILL_PEER void OpenCvHistograms(const Workload& work);
GRIDMILL_PEER void OpenCvWideHistogram(const Workload& work);
GRIDMILL_PEER void OpenCvClasses(const Workload& work);
GRIDMILL_PEER void OpenCvClassesInRange(const Workload& work);
GRIDMILL_PEER void OpenCvConverted(const Workload& work);
GRIDMILL_PEER void OpenCvNearest(const Workload& work);
GRIDMILL_PEER void OpenCvConvertedNearest(const Workload& work);
GRIDMILL_PEER void OpenCvNaturalColour(const Workload& work);
GRIDMILL_PEER void OpenCvTrimmedNaturalColour(const Workload& work);

GRIDMILL_PEER void GdalSlope(const Workload& work);
GRIDMILL_PEER void GdalAspect(const Workload& work);

/// A plain loop in `float`, left to the compiler's vectoriser.
void VectorisedNdvi(const Workload& work);

}  // namespace orvik::bench
