#include "processes/gridmill/intenratiochange.h"

#include <cmath>
#include <cstddef>

#include "basic/tessel/clipto.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/channelsums.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

using kernels::kBlock;

// ---- pixel

struct Sample {
  template <class In>
  GRIDMILL_INLINE static In Of(In sample) {
    return sample;
  }
};

// ---- row

/// Turns the sums of the channels into means, and fills in their ratios in decibels.
GRIDMILL_MULTIVERSION void IntensityRow(double m, double n, std::size_t count, double* __restrict S,
                                        double* __restrict T, double* __restrict ratio) {
  for (std::size_t i = 0; i < count; ++i) {
    S[i] = S[i] / m;
    T[i] = T[i] / n;
    ratio[i] = std::fabs(S[i] / T[i]);
  }
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

    const frame::BlockShape shape = frame::PixelBlocks(m, n, 4);
    frame::ChangeRows<In, In, Out>({*image, *reference, *out, mask}, shape, [&](const auto& block) {
      double planes[4][kBlock] = {};
      auto& [S, T, D, zero] = planes;
      const unsigned char* const keep = choice.Of(block);
      kernels::SumRow<Sample>(block.image, block.imageStride, m, block.pixels, S);
      kernels::SumRow<Sample>(block.reference, block.referenceStride, n, block.pixels, T);
      IntensityRow(static_cast<double>(m), static_cast<double>(n), block.pixels, S, T, D);
      for (std::size_t i = 0; i < block.pixels; ++i) D[i] = std::log10(D[i]);
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
