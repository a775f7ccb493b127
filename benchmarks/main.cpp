#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <benchmark/benchmark.h>
#include <omp.h>

#include "benchmarks/measure.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

struct Size {
  std::uint32_t edge;
  int rounds;
  int callsOfTwoThreads;
};

/// A tile that stays in the second-level cache, and an image in DRAM.
constexpr Size kSizes[] = {{512, 25, 2000}, {4096, 9, 100}};

void RegisterRow(const Row& row, const Size& size, bool quick) {
  using Measure = void (*)(benchmark::State&, const Row&, std::uint32_t);
  const int share = quick ? 3 : 1;
  const auto add = [&](const std::string& job, Measure measure, int iterations) {
    const std::string edge = std::to_string(size.edge);
    const std::string name = job + "/" + row.types + "/" + edge + "x" + edge;
    const auto run = [&row, edge = size.edge, measure](benchmark::State& state) {
      measure(state, row, edge);
    };
    benchmark::RegisterBenchmark(name.c_str(), run)->Iterations(iterations)->UseManualTime();
  };
  add(row.job, MeasureRow, size.rounds / share);
  if (row.twoThreads && omp_get_num_procs() > 1)
    add(row.job + std::string(", 2 threads"), MeasureTwoThreads, size.callsOfTwoThreads / share);
}

void RegisterRows(bool quick) {
  for (const auto rows : {FilterSlpRows(), FilterAspRows(), AverageChannelsRows()})
    for (const Row& row : rows)
      for (const Size& size : kSizes) RegisterRow(row, size, quick);
}

/// Names each row on the standard error when it is done; the results go to the file of --benchmark_out.
class Progress : public benchmark::BenchmarkReporter {
 public:
  bool ReportContext(const Context&) override { return true; }
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) std::fprintf(stderr, "%s\n", run.run_name.function_name.c_str());
  }
};

/// Takes the flag `--quick` out of the arguments.
bool TakeQuick(int& count, char** arguments) {
  for (int i = 1; i < count; ++i) {
    if (std::strcmp(arguments[i], "--quick") != 0) continue;
    std::copy(arguments + i + 1, arguments + count, arguments + i);
    --count;
    return true;
  }
  return false;
}

}  // namespace

}  // namespace orvik::bench

int main(int argc, char** argv) {
  const bool quick = orvik::bench::TakeQuick(argc, argv);
  if (quick) orvik::bench::SetSlice(0.005);
  orvik::bench::RegisterRows(quick);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
  orvik::bench::Progress progress;
  return benchmark::RunSpecifiedBenchmarks(&progress) > 0 ? 0 : 2;
}
