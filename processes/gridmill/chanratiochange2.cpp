#include "processes/gridmill/chanratiochange2.h"

#include <cstddef>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/channelratio.h"

namespace orvik::changedetection {

// ---- image

template <class In, class Ref, class Out>
class ChanRatioChange2::InnerProcessor : public IChange, public details::ChanRatioParams2 {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    const std::size_t channels = image->channels;
    const frame::BlockShape shape = frame::SampleBlocks(channels);
    // Deliberate: forward and backward are the same signed form, and neither swaps the dates.
    frame::ChangeRows<In, Ref, Out>(
        {*image, *reference, *out, mask}, shape,
        kernels::ChannelRatios<In, Ref, Out>(*this, type == eDIFF_ABSOLUTE, channels, shape.pixels));
  }
};

// ---- frame policy

namespace {

struct ChanRatio2Frame : frame::Defaults<details::ChanRatioParams2> {
  static constexpr frame::Guards guards = frame::Guards::kRasters;
  static constexpr bool interprets = true;
  using Dispatcher =
      frame::Extended<typedispatch::Factory3Template<ChanRatioChange2::InnerProcessor, IChange>,
                      typeconv::priv::ShortTypeList>;
};

}  // namespace

// ---- operator

ChanRatioChange2::ChanRatioChange2(DiffType form) {
  type = form;
  noData = 3.4e38f;
}
ChanRatioChange2::ChanRatioChange2(const ChanRatioChange2&) = default;
ChanRatioChange2& ChanRatioChange2::operator=(const ChanRatioChange2&) = default;
ChanRatioChange2::~ChanRatioChange2() = default;

void ChanRatioChange2::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                               tessel::Raster* out) const {
  frame::Process<ChanRatio2Frame>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
