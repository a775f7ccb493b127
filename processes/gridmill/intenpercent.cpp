#include "processes/gridmill/intenpercent.h"

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <new>
#include <type_traits>
#include <utility>
#include <vector>

#include "basic/tessel/clipto.h"
#include "basic/tessel/plaincast.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/percentilespline.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::filters {

namespace {

using changedetection::DiffType;
using kernels::kBlock;

// ---- row

/// The histogram as the pixels are compared with it.
struct Histogram {
  double low;
  double high;
  double scale;
  int bins;
  float noData;
};

/// What an intensity is before the spline is evaluated.
struct Binned {
  int bin[kBlock];         ///< 0 for intensities outside
  int inside[kBlock];      ///< 0: the percentile is a constant
  float constant[kBlock];  ///< 0, 100 or the intensity itself
};

GRIDMILL_MULTIVERSION void BinRow(const float* __restrict value, const Histogram& histogram,
                                  std::size_t count, Binned& __restrict binned) {
  const auto [low, high, scale, bins, noData] = histogram;
  for (std::size_t i = 0; i < count; ++i) {
    const double v = value[i];
    const double position = (v - low) * scale;
    // A position that is no 32-bit integer counts as a negative bin.
    const bool held = (position >= 0.0) & (position < 2147483648.0);
    const int bin = static_cast<int>(held ? position : 0.0);
    const bool invalid = value[i] == noData;
    const bool zero = low >= v;
    const bool hundred = (v >= high) | (held & (bin >= bins));
    const bool inside = !(invalid | zero | hundred) & held;
    const float limit = (!zero & hundred) ? 100.0f : 0.0f;
    binned.constant[i] = invalid ? value[i] : limit;
    binned.inside[i] = inside;
    binned.bin[i] = inside ? bin : 0;
  }
}

/// Reverses the sign where `greater` is above `less`, but not of no-data.
template <class In>
GRIDMILL_MULTIVERSION void SignRow(const In* __restrict greater, const In* __restrict less,
                                   const float* __restrict value, float noData, std::size_t count,
                                   float* __restrict percentile) {
  for (std::size_t i = 0; i < count; ++i) {
    const bool negative = (greater[i] > less[i]) & !(value[i] == noData);
    percentile[i] = negative ? -percentile[i] : percentile[i];
  }
}

/// Sample 3 of at most `kBlock` pixels, from planes of their samples 0 to 2.
template <class In>
void PercentileRow(const In (&planes)[4][kBlock], const Histogram& histogram, const kernels::Knot* knots,
                   DiffType type, std::size_t count, float* percentile) {
  float scratch[kBlock];
  Binned binned;
  double spline[kBlock];
  const float* const value = kernels::FloatRow(planes[2], 1, count, scratch);
  BinRow(value, histogram, count, binned);
  kernels::SplineRow(value, binned.bin, knots, count, spline);
  kernels::CastThrough<In>(spline, count, percentile);
  kernels::ReplaceOutside(binned.inside, binned.constant, count, percentile);
  if (type == changedetection::eDIFF_BACKWARD)
    SignRow(planes[0], planes[1], value, histogram.noData, count, percentile);
  if (type == changedetection::eDIFF_FORWARD)
    SignRow(planes[1], planes[0], value, histogram.noData, count, percentile);
}

/// Stores planes of samples as pixels, `excluded` in all samples of the masked ones.
template <class In, class Out>
void StoreBlock(Out (&planes)[4][kBlock], Out excluded, const frame::FilterBlock<In, Out>& block) {
  if (block.masked)
    for (Out* const plane : planes) kernels::ReplaceMasked(block.valid, excluded, block.pixels, plane);
  kernels::StorePixels(planes, block.pixels, block.target);
}

template <class In, class Out>
void WritePixels(const frame::FilterBlock<In, Out>& block, const Histogram& histogram,
                 const kernels::Knot* knots, DiffType type, Out excluded) {
  In planes[4][kBlock];
  float percentile[kBlock];
  for (std::size_t c = 0; c < 3; ++c)
    kernels::CopyRow(block.image + c, block.stride, block.pixels, planes[c]);
  PercentileRow(planes, histogram, knots, type, block.pixels, percentile);
  if constexpr (std::is_same_v<In, Out>) {
    kernels::StoreClipped(percentile, block.pixels, planes[3]);
    StoreBlock(planes, excluded, block);
  } else {
    Out target[4][kBlock];
    for (std::size_t c = 0; c < 3; ++c) kernels::StoreClipped(planes[c], block.pixels, target[c]);
    kernels::StoreClipped(percentile, block.pixels, target[3]);
    StoreBlock(target, excluded, block);
  }
}

// ---- image

}  // namespace

template <class In, class Out>
class IntenPercent::InnerProcessor : public IProcessor, public details::IntenPercentParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (knots_.empty()) {
      // Apart, since a table of which a part is missing must not stay.
      std::vector<kernels::Knot> knots;
      kernels::AppendKnots({cumulative, linear, quadratic, cubic}, binCount, Scale, Min, knots);
      knots_ = std::move(knots);
    }
    // Deliberate: an excluded pixel holds `NoData` cast to the input's type.
    // The cast is volatile, as g++ takes it and the one that follows for one that keeps the sign of a zero.
    const volatile In cast = tessel::PlainCast<In>(NoData);
    const Out excluded = tessel::ClipTo<Out>(In{cast});
    const Histogram histogram{Min, Max, Scale, binCount, static_cast<float>(NoData)};

    const frame::FilterShape shape{kBlock, frame::Walk::kPixels, 4};
    frame::FilterRows<In, Out>(*in, mask, *out, shape, [&](const auto& block) {
      WritePixels(block, histogram, knots_.data(), Type, excluded);
    });
  }

 private:
  mutable std::vector<kernels::Knot> knots_;
};

struct IntenPercent::IntenPercentCreationPolicy {
  template <class In, class Out>
  static IProcessor* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

/// Deliberate: only a change of the input's type rebuilds; the first output type stays.
struct IntenPercentFrame : frame::Defaults<details::IntenPercentParams> {
  static constexpr frame::Compares compares = frame::Compares::kInput;
  using Dispatcher = frame::RealTwoLevel<IntenPercent::IntenPercentCreationPolicy>;

  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    to.Min = from.Min;
    to.Max = from.Max;
    to.Scale = from.Scale;
    to.NoData = from.NoData;
    to.SetBins(from.Bins);
    to.Type = from.Type;
    to.SetCoefficients();
  }
};

/// Zeros that nobody frees.
template <class Value>
Value* Zeros(int count) {
  // NOLINTNEXTLINE(cppcoreguidelines-no-malloc): no container owns what nobody frees
  void* const block = std::calloc(static_cast<std::size_t>(count), sizeof(Value));
  if (block == nullptr) throw std::bad_alloc();
  return static_cast<Value*>(block);
}

}  // namespace

// ---- operator

void details::IntenPercentParams::SetCoefficients() {
  binCount = static_cast<int>(Bins.size());
  // Deliberate: nothing frees these blocks.
  spareBlock = Zeros<int>(binCount + 2);
  for (double** const block : {&cumulative, &alpha, &linear, &quadratic, &cubic, &diagonal, &mu, &z})
    *block = Zeros<double>(binCount + 2);
  total = kernels::SumOfCounts(Bins.data(), Bins.size());
  cumulative[binCount + 1] = 100.0;
  for (int i = 1; i <= binCount; ++i) {
    const double percent = kernels::Hundredfold(Bins[static_cast<std::size_t>(i - 1)]);
    cumulative[i] = percent / total + cumulative[i - 1];
  }
  kernels::SolveSpline({cumulative, alpha, linear, quadratic, cubic, diagonal, mu, z}, binCount, Scale);
}

IntenPercent::IntenPercent() = default;
IntenPercent::IntenPercent(const IntenPercent&) = default;
IntenPercent& IntenPercent::operator=(const IntenPercent&) = default;
IntenPercent::~IntenPercent() = default;

void IntenPercent::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<IntenPercentFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
