#include "processes/gridmill/bitmapfiltering.h"

#include <cstddef>
#include <type_traits>

#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/thresholds.h"

namespace orvik::filters {

namespace {

constexpr std::size_t kPixels = frame::kMaxBlock;

// ---- row

/// The range of the thresholds, as the samples of a type are compared with it.
template <class In>
class Range {
 public:
  /// Deliberate: a minimum above the maximum wraps around, and so does a threshold of NaN.
  Range(float lower, float upper) : lower_(lower), upper_(upper), wraps_(!(lower <= upper)) {}

  /// 1 for the samples within, 0 for the others.
  void Select(const In* samples, std::size_t count, unsigned char* selected) const {
    if constexpr (std::is_integral_v<In> && sizeof(In) <= 2) {
      kernels::SelectRow(samples, kernels::IntegerRange<In>(lower_, upper_, wraps_), count, selected);
    } else {
      float scratch[kPixels];
      const float* const values = kernels::FloatRow(samples, 1, count, scratch);
      kernels::SelectRow(values, lower_, upper_, wraps_, count, selected);
    }
  }

 private:
  float lower_;
  float upper_;
  bool wraps_;
};

/// The selection as it is written.
template <class In, class Out>
void WriteSelection(const Range<In>& range, const frame::FilterBlock<In, Out>& block) {
  constexpr bool bytes = sizeof(Out) == 1;
  unsigned char scratch[kPixels];
  unsigned char* const selected = bytes ? reinterpret_cast<unsigned char*>(block.target) : scratch;
  range.Select(block.image, block.pixels, selected);
  // Deliberate: an excluded pixel holds 0.
  if (block.masked) kernels::KeepValid(block.valid, block.pixels, selected);
  if constexpr (!bytes) kernels::StoreCast(selected, block.pixels, block.target);
}

// ---- image

}  // namespace

template <class In, class Out>
class BitmapFiltering::InnerProcessor : public IProcessor, public details::BitFParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    const Range<In> range(thresholdMin, thresholdMax);
    const frame::FilterShape shape{kPixels, frame::Walk::kElements};
    frame::FilterRows<In, Out>(*in, mask, *out, shape,
                               [&range](const auto& block) { WriteSelection(range, block); });
  }
};

struct BitmapFiltering::BitCreationPolicy {
  template <class In, class Out>
  static IProcessor* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

/// Deliberate: only a change of the input's type rebuilds; the first output type stays.
struct BitmapFrame : frame::Defaults<details::BitFParams> {
  static constexpr frame::Compares compares = frame::Compares::kInput;
  using Dispatcher = frame::TwoLevel<BitmapFiltering::BitCreationPolicy>;

  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    to.thresholdMin = from.thresholdMin;
    to.thresholdMax = from.thresholdMax;
  }
};

}  // namespace

// ---- operator

BitmapFiltering::BitmapFiltering(float min, float max) : BitFParams(min, max) {}
BitmapFiltering::BitmapFiltering(const BitmapFiltering&) = default;
BitmapFiltering& BitmapFiltering::operator=(const BitmapFiltering&) = default;
BitmapFiltering::~BitmapFiltering() = default;

void BitmapFiltering::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<BitmapFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
