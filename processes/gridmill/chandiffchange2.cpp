#include "processes/gridmill/chandiffchange2.h"

#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/clipto.h"
#include "basic/tessel/plaincast.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/difference.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

using kernels::Difference;

// ---- row

/// With the plain casts a and b and the clipped reference k, of integers: a - k, and so i - k in the low
/// bits, where a >= b, else k - a.
template <class Out>
GRIDMILL_MULTIVERSION void ClippedDifferenceRow(const Out* a, const Out* b, const Out* k, std::size_t count,
                                                Out* target) {
  GRIDMILL_INDEPENDENT
  for (std::size_t x = 0; x < count; ++x) {
    const int difference = a[x] >= b[x] ? a[x] - k[x] : k[x] - a[x];
    target[x] = tessel::PlainCast<Out>(difference);
  }
}

/// The same of a floating image, whose fraction stays until the difference is cast.
template <class Out>
GRIDMILL_MULTIVERSION void ClippedDifferenceRow(const float* i, const Out* a, const Out* b, const Out* k,
                                                std::size_t count, Out* target) {
  GRIDMILL_INDEPENDENT
  for (std::size_t x = 0; x < count; ++x) {
    const float clipped = tessel::PlainCast<float>(k[x]);
    const float difference = a[x] >= b[x] ? i[x] - clipped : clipped - i[x];
    target[x] = tessel::PlainCast<Out>(difference);
  }
}

/// Deliberate: the absolute form is not symmetric. Plain casts decide on the direction, the subtraction takes
/// the image as it stands and the reference clipped.
template <class In, class Ref, class Out>
void DifferenceOfTypes(const In* image, const Ref* reference, bool absolute, std::size_t count, Out* scratch,
                       Out* target) {
  const Out* const a = kernels::CastedRow(image, count, scratch);
  const Out* const b = kernels::CastedRow(reference, count, scratch + count);
  if (!absolute) return kernels::DifferenceRow(a, b, Difference::kForward, count, target);
  if constexpr (std::is_same_v<Out, float>) {
    kernels::DifferenceRow(a, b, Difference::kAbsolute, count, target);
  } else {
    const Out* const k = kernels::ClippedRow(reference, count, scratch + 2 * count);
    if constexpr (std::is_same_v<In, float>) {
      ClippedDifferenceRow(image, a, b, k, count, target);
    } else {
      ClippedDifferenceRow(a, b, k, count, target);
    }
  }
}

}  // namespace

// ---- image

template <class In, class Ref, class Out>
class ChanDiffChange2::InnerProcessor : public IChangeProcessor, public details::ChanDiffParams2 {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
               tessel::Mask* referenceMask, tessel::Raster* out) const override {
    const std::size_t channels = image->channels;
    const frame::BlockShape shape = frame::SampleBlocks(channels);
    const bool absolute = type == eDIFF2_ABSOLUTE;
    const Out excluded = tessel::ClipTo<Out>(noData);
    kernels::SampleChoice<In, Ref> choice(*this, channels, shape.pixels);
    std::vector<Out> scratch(3 * shape.pixels * channels);

    const frame::TwoDates dates{*image, *reference, *out, imageMask, referenceMask};
    frame::ChangeRows<In, Ref, Out>(dates, shape, [&](const auto& block) {
      const std::size_t count = block.pixels * channels;
      const unsigned char* const keep = choice.Of(block);
      DifferenceOfTypes(block.image, block.reference, absolute, count, scratch.data(), block.target);
      if (keep != nullptr) kernels::ReplaceMasked(keep, excluded, count, block.target);
    });
  }
};

// ---- frame policy

namespace {

struct ChanDiff2Frame : frame::Defaults<details::ChanDiffParams2> {
  static constexpr frame::Guards guards = frame::Guards::kRasters;
  static constexpr bool interprets = true;
  using Dispatcher =
      frame::Extended<typedispatch::Factory3Template<ChanDiffChange2::InnerProcessor, IChangeProcessor>,
                      typeconv::priv::ShortTypeList>;
};

}  // namespace

// ---- operator

ChanDiffChange2::ChanDiffChange2(DiffType2 form) {
  type = form;
  noData = 0.0f;
}
ChanDiffChange2::ChanDiffChange2(const ChanDiffChange2&) = default;
ChanDiffChange2& ChanDiffChange2::operator=(const ChanDiffChange2&) = default;
ChanDiffChange2::~ChanDiffChange2() = default;

void ChanDiffChange2::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
                              tessel::Mask* referenceMask, tessel::Raster* out) const {
  frame::Process<ChanDiff2Frame>(*this, cache_, frame::Rasters<3>{image, reference, out},
                                 [imageMask, referenceMask](const auto& processor, const auto& r) {
                                   processor.Process(r[0], r[1], imageMask, referenceMask, r[2]);
                                 });
}

}  // namespace orvik::changedetection
