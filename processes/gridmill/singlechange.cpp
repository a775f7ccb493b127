#include "processes/gridmill/singlechange.h"

#include <cmath>
#include <cstddef>
#include <type_traits>

#include "basic/tessel/clipto.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

/// Samples whose `float` forms stay in the first-level cache together.
constexpr std::size_t kPixels = 1024;

// ---- row

/// Deliberate: forward is reference minus image, the reverse of the other difference operators.
GRIDMILL_MULTIVERSION void SingleRow(const float* i, const float* r, DiffType type, std::size_t count,
                                     float* d) {
  if (type == eDIFF_FORWARD) {
    GRIDMILL_INDEPENDENT
    for (std::size_t x = 0; x < count; ++x) d[x] = r[x] - i[x];
  } else if (type == eDIFF_ABSOLUTE) {
    GRIDMILL_INDEPENDENT
    for (std::size_t x = 0; x < count; ++x) d[x] = std::fabs(r[x] - i[x]);
  } else {
    GRIDMILL_INDEPENDENT
    for (std::size_t x = 0; x < count; ++x) d[x] = i[x] - r[x];
  }
}

/// The differences as they are written.
template <class In, class Out>
void WriteSingleRow(const In* image, std::size_t imageStride, const In* reference,
                    std::size_t referenceStride, DiffType type, std::size_t count, Out* target) {
  float imageScratch[kPixels], referenceScratch[kPixels], d[kPixels];
  const float* const i = kernels::FloatRow(image, imageStride, count, imageScratch);
  const float* const r = kernels::FloatRow(reference, referenceStride, count, referenceScratch);
  if constexpr (std::is_same_v<Out, float>) {
    SingleRow(i, r, type, count, target);
  } else {
    SingleRow(i, r, type, count, d);
    kernels::StoreClipped(d, count, target);
  }
}

}  // namespace

// ---- image

template <class In, class Out>
class SingleChange::InnerProcessor : public IChange, public details::SingleParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    frame::BlockShape shape = frame::PixelBlocks(1, 1, 1);
    shape.pixels = kPixels;
    frame::ChangeRows<In, In, Out>({*image, *reference, *out, mask}, shape, [&](const auto& block) {
      WriteSingleRow(block.image, block.imageStride, block.reference, block.referenceStride, type,
                     block.pixels, block.target);
      // Deliberate: an excluded pixel holds 0.
      if (block.masked) kernels::ReplaceMasked(block.valid, Out{0}, block.pixels, block.target);
    });
  }
};

struct SingleChange::SingleCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct SingleFrame : frame::Defaults<details::SingleParams> {
  static constexpr frame::Compares compares = frame::Compares::kReferenceAgainstInput;
  using Dispatcher = frame::TwoLevel<SingleChange::SingleCreationPolicy>;
};

}  // namespace

// ---- operator

SingleChange::SingleChange(DiffType form) { type = form; }
SingleChange::SingleChange(const SingleChange&) = default;
SingleChange& SingleChange::operator=(const SingleChange&) = default;
SingleChange::~SingleChange() = default;

void SingleChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                           tessel::Raster* out) const {
  frame::Process<SingleFrame>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
