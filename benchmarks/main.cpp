#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <ios>
#include <regex>
#include <string>
#include <string_view>
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

/// Counts the benchmarks that it registers: those whose "job/types/size" the filter matches.
int RegisterRow(const Row& row, const Size& size, bool quick, const std::regex& filter) {
  using Measure = void (*)(benchmark::State&, const Row&, std::uint32_t);
  const int share = quick ? 3 : 1;
  int registered = 0;
  const auto add = [&](const std::string& job, Measure measure, int iterations) {
    const std::string edge = std::to_string(size.edge);
    const std::string name = job + "/" + row.types + "/" + edge + "x" + edge;
    if (!std::regex_search(name, filter)) return;
    ++registered;
    const auto run = [&row, edge = size.edge, measure](benchmark::State& state) {
      measure(state, row, edge);
    };
    benchmark::RegisterBenchmark(name.c_str(), run)->Iterations(iterations)->UseManualTime();
  };
  add(row.job, MeasureRow, size.rounds / share);
  if (row.twoThreads && omp_get_num_procs() > 1)
    add(row.job + std::string(", 2 threads"), MeasureTwoThreads, size.callsOfTwoThreads / share);
  return registered;
}

int RegisterRows(bool quick, const std::regex& filter) {
  int registered = 0;
  for (const auto rows :
       {FilterSlpRows(),        FilterAspRows(),        AverageChannelsRows(), SingleChangeRows(),
        ChanDiffChangeRows(),   ChanDiffChange2Rows(),  ChanRatioChangeRows(), ChanRatioChange2Rows(),
        CombChangeRows(),       IntenRatioChangeRows(), MagnitudeChangeRows(), TasseledCapChangeRows(),
        VegIndexRows(),         NormalizeRows(),        PercentileRows(),      IntenPercentRows(),
        BitmapFilteringRows(),  MirrorImgRows(),        SqrGradientRows(),     VollathRows(),
        RasterStatisticsRows(), RangeClassesRows(),     IIIDataTransferRows(), SPOTBlueRows()})
    for (const Row& row : rows)
      for (const Size& size : kSizes) registered += RegisterRow(row, size, quick, filter);
  return registered;
}

/// Names each row on the standard error when it is done; the results go to the file of --benchmark_out.
class Progress : public benchmark::BenchmarkReporter {
 public:
  bool ReportContext(const Context&) override { return true; }
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) std::fprintf(stderr, "%s\n", run.run_name.function_name.c_str());
  }
};

/// Takes the flag `--quick` out of the arguments, and `--samples=FOLDER`.
class Options {
 public:
  bool quick = false;
  std::string sampleFolder;

  Options(int& count, char** arguments) {
    const auto end = std::remove_if(arguments + 1, arguments + count,
                                    [this](std::string_view argument) { return Take(argument); });
    count = static_cast<int>(end - arguments);
  }

 private:
  bool Take(std::string_view argument) {
    constexpr std::string_view kSamples = "--samples=";
    if (argument.starts_with(kSamples)) {
      sampleFolder = argument.substr(kSamples.size());
      return true;
    }
    if (argument != "--quick") return false;
    quick = true;
    return true;
  }
};

/// Runs the rows that the filter names. The library would match its own names, which go on with
/// "/iterations:...": "ratio" and "time" occur in each of them.
int Run(bool quick, const std::string& filter) {
  if (RegisterRows(quick, std::regex(filter, std::regex::extended)) == 0) {
    std::fprintf(stderr, "no row matches '%s'\n", filter.c_str());
    return 2;
  }
  // An operator traces its calls to the standard output, which nothing here uses.
  if (std::freopen("/dev/null", "w", stdout) == nullptr) return 1;
  Progress progress;
  benchmark::RunSpecifiedBenchmarks(&progress, std::string("."));
  return 0;
}

}  // namespace

}  // namespace orvik::bench

int main(int argc, char** argv) {
  const orvik::bench::Options options(argc, argv);
  if (options.quick) orvik::bench::SetSlice(0.005);
  orvik::bench::SetSampleFolder(options.sampleFolder);
  benchmark::Initialize(&argc, argv);
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
  const std::string filter = benchmark::GetBenchmarkFilter();
  try {
    return orvik::bench::Run(options.quick, filter);
  } catch (const std::regex_error&) {
    std::fprintf(stderr, "'%s' is not a regular expression\n", filter.c_str());
    return 2;
  } catch (const std::ios_base::failure& failure) {
    std::fprintf(stderr, "cannot write a sample: %s\n", failure.what());
    return 1;
  }
}
