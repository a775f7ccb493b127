#include "processes/gridmill/intenratiochange.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>

#include "basic/tessel/clipto.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/channelsums.h"
#include "processes/gridmill/kernels/logarithm.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

using kernels::kBlock;

// ---- pixel

struct Sample {
  /// True if `int` holds the sum of four samples.
  template <class In>
  static constexpr bool kFitsInt = sizeof(In) <= 2;

  template <class In>
  GRIDMILL_INLINE static In Of(In sample) {
    return sample;
  }
};

/// A sum over the number of channels.
class Mean {
 public:
  explicit Mean(std::size_t channels)
      : channels_(static_cast<double>(channels)), reciprocal_(1.0 / channels_) {}

  GRIDMILL_INLINE double Of(double sum) const { return sum / channels_; }

  /// The same quotient, rounded alike, from multiplications: a processor has one divider, and all three
  /// divisions of a pixel would wait for it. The estimate is off by less than two units of its last place.
  /// The head of 26 bits times the channels is exact, and so is each step to the remainder. No quotient of
  /// such a sum lies near enough to the middle of two `double` values for the last rounding to go astray.
  GRIDMILL_INLINE double Of(int sum) const {
    const double dividend = static_cast<double>(sum);
    const double estimate = dividend * reciprocal_;
    const double head =
        std::bit_cast<double>(std::bit_cast<std::uint64_t>(estimate) & ~std::uint64_t{0x7FFFFFF});
    const double tail = estimate - head;
    const double remainder = (dividend - head * channels_) - tail * channels_;
    return estimate + remainder * reciprocal_;
  }

 private:
  double channels_;
  double reciprocal_;
};

// ---- row

GRIDMILL_MULTIVERSION void IntensityRatioRow(const double* __restrict S, const double* __restrict T,
                                             std::size_t count, double* __restrict ratio) {
  for (std::size_t i = 0; i < count; ++i) ratio[i] = std::fabs(S[i] / T[i]);
}

/// Deliberate: only T is tested, so that an S of 0 gives minus infinity.
GRIDMILL_MULTIVERSION void DecibelRow(const double* __restrict T, std::size_t count, double* __restrict D) {
  for (std::size_t i = 0; i < count; ++i) D[i] = T[i] == 0.0 ? 0.0 : 10.0 * D[i];
}

}  // namespace

// ---- image

template <class In, class Out>
class IntenRatioChange::InnerProcessor : public IChange, public details::IntenRatioParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    const std::size_t m = image->channels;
    const std::size_t n = reference->channels;
    const Out excluded = tessel::ClipTo<Out>(noData);
    const kernels::PixelChoice choice(*this, m, n);

    double planes[4][kBlock];
    double* const S = planes[0];
    double* const T = planes[1];
    double* const D = planes[2];
    std::fill_n(planes[3], kBlock, 0.0);

    const frame::BlockShape shape = frame::PixelBlocks(m, n, 4);
    frame::ChangeRows<In, In, Out>({*image, *reference, *out, mask}, shape, [&](const auto& block) {
      const unsigned char* const keep = choice.Of(block);
      kernels::SumRow<Sample>(block.image, block.imageStride, m, Mean(m), block.pixels, S);
      kernels::SumRow<Sample>(block.reference, block.referenceStride, n, Mean(n), block.pixels, T);
      IntensityRatioRow(S, T, block.pixels, D);
      kernels::Log10Row(D, block.pixels, D);
      DecibelRow(T, block.pixels, D);
      kernels::StorePixelsWhere(planes, keep, excluded, block.pixels, block.target);
    });
  }
};

struct IntenRatioChange::SingleCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct IntenRatioFrame : frame::Defaults<details::IntenRatioParams> {
  static constexpr frame::Compares compares = frame::Compares::kReferenceAgainstInput;
  using Dispatcher = frame::TwoLevel<IntenRatioChange::SingleCreationPolicy>;
};

}  // namespace

// ---- operator

IntenRatioChange::IntenRatioChange(DiffType form) {
  type = form;
  noData = 0.0f;
}
IntenRatioChange::IntenRatioChange(const IntenRatioChange&) = default;
IntenRatioChange& IntenRatioChange::operator=(const IntenRatioChange&) = default;
IntenRatioChange::~IntenRatioChange() = default;

void IntenRatioChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                               tessel::Raster* out) const {
  frame::Process<IntenRatioFrame>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
