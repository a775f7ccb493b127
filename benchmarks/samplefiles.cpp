#include "benchmarks/samplefiles.h"

#include <fstream>
#include <vector>

namespace orvik::bench {

namespace {

class SampleFile {
 public:
  explicit SampleFile(const std::string& path) {
    file_.exceptions(std::ios::failbit | std::ios::badbit);
    file_.open(path, std::ios::binary);
  }

  void Write(const void* data, std::size_t bytes) {
    file_.write(static_cast<const char*>(data), static_cast<std::streamsize>(bytes));
  }

  template <class Value>
  void Write(const std::vector<Value>& values) {
    Write(values.data(), values.size() * sizeof(Value));
  }

 private:
  std::ofstream file_;
};

}  // namespace

void WriteSample(const Row& row, const std::string& folder) {
  const Workload work = row.workload(kSampleEdge);
  row.gridmill(work);
  if (row.results != nullptr) row.results(work);
  const std::string path = folder + "/" + row.python;
  SampleFile(path + ".in").Write(work.in->data, work.in->dataSize);
  SampleFile(path + ".out").Write(work.out->data, work.out->dataSize);
  if (work.mask != nullptr) SampleFile(path + ".mask").Write(work.mask->bits);
  if (work.histogram.bins == 0) return;
  SampleFile histogram(path + ".histogram");
  histogram.Write(work.histogram.minimum);
  histogram.Write(work.histogram.maximum);
  histogram.Write(work.histogram.counts);
}

}  // namespace orvik::bench
