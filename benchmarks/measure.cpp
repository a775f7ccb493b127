#include "benchmarks/measure.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include <omp.h>
#include <time.h>

#include "benchmarks/samplefiles.h"

namespace orvik::bench {

namespace {

double slice = 0.02;
std::string sampleFolder;

double Seconds(clockid_t clock) {
  timespec now{};
  clock_gettime(clock, &now);
  return static_cast<double>(now.tv_sec) + 1e-9 * static_cast<double>(now.tv_nsec);
}

double Median(std::vector<double> values) {
  const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

/// One that takes its turn in each round: what it does, and the seconds of a call in each round.
class Turn {
 public:
  /// @param seconds  how long a turn takes at least; one call takes what it takes
  Turn(std::string name, clockid_t clock, double seconds, std::function<void()> run)
      : name_(std::move(name)), clock_(clock), run_(std::move(run)) {
    run_();
    const double once = Time(1);
    calls_ = static_cast<std::size_t>(std::max(1.0, std::ceil(seconds / once)));
  }

  void Take() { seconds_.push_back(Time(calls_)); }

  const std::string& Name() const { return name_; }
  const std::vector<double>& Rounds() const { return seconds_; }
  double Best() const { return *std::min_element(seconds_.begin(), seconds_.end()); }

 private:
  double Time(std::size_t calls) const {
    const double start = Seconds(clock_);
    for (std::size_t i = 0; i < calls; ++i) run_();
    return (Seconds(clock_) - start) / static_cast<double>(calls);
  }

  std::string name_;
  clockid_t clock_;
  std::function<void()> run_;
  std::size_t calls_ = 1;
  std::vector<double> seconds_;
};

void TakeTurns(benchmark::State& state, std::vector<Turn>& turns) {
  for ([[maybe_unused]] auto round : state) {
    for (Turn& turn : turns) turn.Take();
    state.SetIterationTime(turns.front().Rounds().back());
  }
}

double MedianRatio(const Turn& first, const Turn& other) {
  std::vector<double> ratios;
  for (std::size_t i = 0; i < first.Rounds().size(); ++i)
    ratios.push_back(other.Rounds()[i] / first.Rounds()[i]);
  return Median(ratios);
}

/// Of an image of the row's size, whatever the sizes of the workload's rasters.
double MegapixelsOf(std::uint32_t size) { return 1e-6 * size * size; }

/// The difference of two samples, relative to the first if that is above 1.
template <class Sample>
double Difference(Sample first, Sample second) {
  const double value = static_cast<double>(first);
  return std::fabs(value - static_cast<double>(second)) / std::max(1.0, std::fabs(value));
}

/// Whether all samples of two images without margins are within a difference of each other.
template <class Sample>
bool SamplesAgree(const tessel::Raster& image, const tessel::Raster& other, double within) {
  const Sample* const samples = RowOf<Sample>(image, 0);
  return std::equal(samples, samples + image.dataSize / sizeof(Sample), RowOf<Sample>(other, 0),
                    [within](Sample a, Sample b) { return Difference(a, b) <= within; });
}

/// The same for the types of the rows. Within 0 means the same bits.
bool Agrees(const tessel::Raster& image, const tessel::Raster& other, double within) {
  if (within > 0.0 && image.dataType == tessel::DataType::Of<float>())
    return SamplesAgree<float>(image, other, within);
  if (within > 0.0 && image.dataType == tessel::DataType::Of<double>())
    return SamplesAgree<double>(image, other, within);
  return std::memcmp(image.data, other.data, image.dataSize) == 0;
}

/// Who computes something else than gridmill; "" if nobody does.
std::string Stranger(const Row& row, const Workload& work) {
  std::memset(work.out->data, 0xaa, work.out->dataSize);
  row.gridmill(work);
  const auto isStranger = [&row, &work](Contestant other, double within) {
    std::memset(work.twin->data, 0x55, work.twin->dataSize);
    other(work);
    if (row.results != nullptr) row.results(work);
    return !Agrees(*work.out, *work.twin, within);
  };
  if (isStranger(row.naive, 0.0)) return "its naive twin";
  if (row.peersWithin < 0.0) return {};
  const std::pair<const char*, Contestant> peers[] = {
      {"vectorised", row.vectorised}, {"opencv", row.opencv}, {"gdal", row.gdal}};
  for (const auto& [name, peer] : peers)
    if (peer != nullptr && isStranger(peer, row.peersWithin)) return name;
  return {};
}

/// A plain copy that reads and writes as many bytes as a pass over the workload does.
class Copy {
 public:
  explicit Copy(std::size_t bytesMoved) : source_(bytesMoved / 2, 1), target_(bytesMoved / 2) {}

  void operator()() {
    std::memcpy(target_.data(), source_.data(), source_.size());
    benchmark::DoNotOptimize(target_.data());
    benchmark::ClobberMemory();
  }

 private:
  std::vector<unsigned char> source_;
  std::vector<unsigned char> target_;
};

}  // namespace

void SetSlice(double seconds) { slice = seconds; }

void SetSampleFolder(const std::string& folder) { sampleFolder = folder; }

void MeasureRow(benchmark::State& state, const Row& row, std::uint32_t size) {
  omp_set_num_threads(1);
  const Workload work = row.workload(size);
  if (const std::string stranger = Stranger(row, work); !stranger.empty()) {
    state.SkipWithError(("gridmill and " + stranger + " differ").c_str());
    return;
  }
  if (row.python != nullptr) {
    state.SetLabel(row.python);
    if (!sampleFolder.empty()) WriteSample(row, sampleFolder);
  }

  std::vector<Turn> turns;
  const auto enter = [&](const char* name, Contestant run) {
    if (run != nullptr) turns.emplace_back(name, CLOCK_THREAD_CPUTIME_ID, slice, [&work, run] { run(work); });
  };
  enter("gridmill", row.gridmill);
  enter("naive", row.naive);
  enter("vectorised", row.vectorised);
  enter("opencv", row.opencv);
  enter("gdal", row.gdal);
  turns.emplace_back("roof", CLOCK_THREAD_CPUTIME_ID, slice, Copy(work.BytesMoved()));

  TakeTurns(state, turns);
  const double megapixels = MegapixelsOf(size);
  for (const Turn& turn : turns) {
    state.counters[turn.Name()] = megapixels / Median(turn.Rounds());
    state.counters["vs " + turn.Name()] = MedianRatio(turns.front(), turn);
  }
}

void MeasureTwoThreads(benchmark::State& state, const Row& row, std::uint32_t size) {
  const Workload work = row.workload(size);
  std::vector<Turn> turns;
  const auto enter = [&](const char* name, int threads) {
    turns.emplace_back(name, CLOCK_MONOTONIC, 0.0, [&work, &row, threads] {
      omp_set_num_threads(threads);
      row.gridmill(work);
    });
  };
  enter("gridmill", 2);
  enter("one_core", 1);

  TakeTurns(state, turns);
  const double megapixels = MegapixelsOf(size);
  for (const Turn& turn : turns) {
    state.counters[turn.Name()] = megapixels / turn.Best();
    state.counters["vs " + turn.Name()] = turn.Best() / turns.front().Best();
  }
}

}  // namespace orvik::bench
