#include "processes/gridmill/magnitudechange.h"

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <type_traits>

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

/// The square of a sample in its own arithmetic, that of `int` for 8 and 16 bits.
/// Deliberate: it wraps there, so that it can be negative.
struct Square {
  /// True if `int` holds the sum of four squares.
  template <class In>
  static constexpr bool kFitsInt = sizeof(In) == 1;

  template <class In>
  GRIDMILL_INLINE static auto Of(In sample) {
    if constexpr (std::is_floating_point_v<In>) {
      return sample * sample;
    } else {
      using Promoted = decltype(sample * sample);
      using Unsigned = std::make_unsigned_t<Promoted>;
      const auto wrapping = static_cast<Unsigned>(sample);
      return static_cast<Promoted>(wrapping * wrapping);
    }
  }
};

struct Root {
  GRIDMILL_INLINE static double Of(double sum) { return std::sqrt(sum); }
};

// ---- row

GRIDMILL_MULTIVERSION void MagnitudeDifferenceRow(const double* __restrict A, const double* __restrict B,
                                                  DiffType type, std::size_t count, double* __restrict C) {
  if (type == eDIFF_ABSOLUTE) {
    for (std::size_t i = 0; i < count; ++i) C[i] = std::fabs(A[i] - B[i]);
  } else if (type == eDIFF_FORWARD) {
    for (std::size_t i = 0; i < count; ++i) C[i] = A[i] - B[i];
  } else {
    for (std::size_t i = 0; i < count; ++i) C[i] = B[i] - A[i];
  }
}

}  // namespace

// ---- image

template <class In, class Out>
class MagnitudeChange::InnerProcessor : public IChange, public details::MagnitudeParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    const std::size_t m = image->channels;
    const std::size_t n = reference->channels;
    const Out excluded = tessel::ClipTo<Out>(noData);
    const kernels::PixelChoice choice(*this, m, n);

    const frame::BlockShape shape = frame::PixelBlocks(m, n, 3);
    frame::ChangeRows<In, In, Out>({*image, *reference, *out, mask}, shape, [&](const auto& block) {
      double planes[3][kBlock];
      auto& [A, B, C] = planes;
      const unsigned char* const keep = choice.Of(block);
      kernels::SumRow<Square>(block.image, block.imageStride, m, Root{}, block.pixels, A);
      kernels::SumRow<Square>(block.reference, block.referenceStride, n, Root{}, block.pixels, B);
      MagnitudeDifferenceRow(A, B, type, block.pixels, C);
      kernels::StorePixelsWhere(planes, keep, excluded, block.pixels, block.target);
    });
  }
};

struct MagnitudeChange::MagnitudeCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct MagnitudeFrame : frame::Defaults<details::MagnitudeParams> {
  static constexpr frame::Compares compares = frame::Compares::kReferenceAgainstInput;
  using Dispatcher = frame::TwoLevel<MagnitudeChange::MagnitudeCreationPolicy>;
};

}  // namespace

// ---- operator

MagnitudeChange::MagnitudeChange(DiffType form) {
  type = form;
  noData = 0.0f;
}
MagnitudeChange::MagnitudeChange(const MagnitudeChange&) = default;
MagnitudeChange& MagnitudeChange::operator=(const MagnitudeChange&) = default;
MagnitudeChange::~MagnitudeChange() = default;

void MagnitudeChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                              tessel::Raster* out) const {
  frame::Process<MagnitudeFrame>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
