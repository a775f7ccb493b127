#include "processes/gridmill/chandiffchange.h"

#include <cstddef>
#include <type_traits>
#include <vector>

#include "basic/tessel/clipto.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/difference.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

using kernels::Difference;

// ---- pixel

Difference FormOf(DiffType type) {
  if (type == eDIFF_ABSOLUTE) return Difference::kAbsolute;
  return type == eDIFF_FORWARD ? Difference::kForward : Difference::kBackward;
}

// ---- row

/// Deliberate: the samples become `Out` by plain casts, one by one, before anything is computed.
template <class In, class Out>
void DifferenceOfCasts(const In* image, const In* reference, Difference form, std::size_t count, Out* scratch,
                       Out* target) {
  const Out* const a = kernels::CastedRow(image, count, scratch);
  const Out* const b = kernels::CastedRow(reference, count, scratch + count);
  kernels::DifferenceRow(a, b, form, count, target);
}

}  // namespace

// ---- image

template <class In, class Out>
class ChanDiffChange::InnerProcessor : public IChange, public details::ChanDiffParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    const std::size_t channels = image->channels;
    const frame::BlockShape shape = frame::SampleBlocks(channels);
    const Difference form = FormOf(type);
    const Out excluded = tessel::ClipTo<Out>(noData);
    kernels::SampleChoice<In, In> choice(*this, channels, shape.pixels);
    std::vector<Out> scratch(2 * shape.pixels * channels);

    frame::ChangeRows<In, In, Out>({*image, *reference, *out, mask}, shape, [&](const auto& block) {
      const std::size_t count = block.pixels * channels;
      if constexpr (std::is_same_v<kernels::NoDataKey<In>, Out> && std::is_same_v<In, Out>) {
        if (choice.ImageKeys() != nullptr)
          return kernels::TestedDifferenceRow(block.image, choice.ImageKeys(), block.reference,
                                              choice.ReferenceKeys(), choice.MaskOf(block), form, excluded,
                                              count, block.target);
      }
      const unsigned char* const keep = choice.Of(block);
      DifferenceOfCasts(block.image, block.reference, form, count, scratch.data(), block.target);
      if (keep != nullptr) kernels::ReplaceMasked(keep, excluded, count, block.target);
    });
  }
};

struct ChanDiffChange::ChanDiffCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct ChanDiffFrame : frame::Defaults<details::ChanDiffParams> {
  static constexpr frame::Compares compares = frame::Compares::kReferenceAgainstInput;
  using Dispatcher = frame::TwoLevel<ChanDiffChange::ChanDiffCreationPolicy>;
};

}  // namespace

// ---- operator

ChanDiffChange::ChanDiffChange(DiffType form) {
  type = form;
  noData = 0.0f;
}
ChanDiffChange::ChanDiffChange(const ChanDiffChange&) = default;
ChanDiffChange& ChanDiffChange::operator=(const ChanDiffChange&) = default;
ChanDiffChange::~ChanDiffChange() = default;

void ChanDiffChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                             tessel::Raster* out) const {
  frame::Process<ChanDiffFrame>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
