#include "processes/gridmill/intenpercent.h"

#include <cmath>

#include "benchmarks/naivespline.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

constexpr int kIntensity = 2;

/// The histogram of the intensity.
struct Bins {
  double minimum;
  double maximum;
  double scale;
  std::vector<int> counts;

  explicit Bins(const Histogram& histogram)
      : minimum(histogram.minimum[kIntensity]),
        maximum(histogram.maximum[kIntensity]),
        scale(histogram.bins / (maximum - minimum)),
        counts(histogram.counts.begin() + kIntensity * histogram.bins,
               histogram.counts.begin() + (kIntensity + 1) * histogram.bins) {}
};

void SignedPercentile(const Workload& work) {
  const Bins bins(work.histogram);
  filters::IntenPercent percent;
  percent.SetMin(bins.minimum);
  percent.SetMax(bins.maximum);
  percent.SetScale(bins.scale);
  percent.SetBins(bins.counts);
  percent.SetType(changedetection::eDIFF_FORWARD);
  percent.Process(work.in.get(), work.mask.get(), work.out.get());
}

float Rank(double value, const Bins& bins, const NaiveSpline& spline) {
  if (bins.minimum >= value) return 0.0f;
  if (value >= bins.maximum) return 100.0f;
  const int bin = static_cast<int>(std::floor((value - bins.minimum) * bins.scale));
  if (bin < 0) return 0.0f;
  if (bin >= static_cast<int>(bins.counts.size())) return 100.0f;
  const double dx = value - (bin / bins.scale + bins.minimum);
  return static_cast<float>(spline.At(static_cast<std::size_t>(bin), dx));
}

void NaiveSignedPercentile(const Workload& work) {
  const Bins bins(work.histogram);
  const NaiveSpline spline(bins.counts.data(), static_cast<int>(bins.counts.size()), bins.scale);
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const float* source = RowOf<float>(*work.in, y);
    float* target = RowOf<float>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x, source += 3, target += 4) {
      for (std::size_t c = 0; c < 3; ++c) target[c] = source[c];
      const float value = source[kIntensity];
      if (value == 0.0f) {
        target[3] = value;
        continue;
      }
      const float rank = Rank(value, bins, spline);
      target[3] = source[1] > source[0] ? rank * -1.0f : rank;
    }
  }
}

constexpr Row kRows[] = {
    {.job = "intensity percentile",
     .types = "f32 x 3 -> f32 x 4",
     .workload = RankedScene<float, float, 3, 4>,
     .gridmill = SignedPercentile,
     .naive = NaiveSignedPercentile},
};

}  // namespace

std::span<const Row> IntenPercentRows() { return kRows; }

}  // namespace orvik::bench
