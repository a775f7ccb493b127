#pragma once

#include <cstdint>
#include <string>

#include <benchmark/benchmark.h>

#include "benchmarks/row.h"

namespace orvik::bench {

/// Measures a row on one core: gridmill, its naive twin, the peers and a plain copy of as many bytes take
/// turns, one round for each iteration of `state`. Reports as counters the speed of each in Mpixel/s, the
/// median of the rounds, and as "vs <name>" the median of the rounds' ratios to it.
///
/// The clock is the processor time of the thread, so that other programs on the machine count for little.
/// The row fails before it is timed if gridmill and its naive twin differ in a bit, or gridmill and a peer in
/// the same quantity by more than the row's `peersWithin`. The label is the row's `python`.
void MeasureRow(benchmark::State& state, const Row& row, std::uint32_t size);

/// Measures gridmill with two threads against one, by the wall clock: the best of many single calls, those in
/// which no other program held a core.
void MeasureTwoThreads(benchmark::State& state, const Row& row, std::uint32_t size);

/// Where `MeasureRow` writes the samples of rows with a name for Python (see `WriteSample`); "": nowhere.
void SetSampleFolder(const std::string& folder);

/// How long each contestant of `MeasureRow` runs within a round, at least; one call takes what it takes.
void SetSlice(double seconds);

}  // namespace orvik::bench
