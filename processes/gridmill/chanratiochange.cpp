#include "processes/gridmill/chanratiochange.h"

#include <cstddef>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/channelratio.h"

namespace orvik::changedetection {

// ---- image

template <class In, class Ref, class Out>
class ChanRatioChange::InnerProcessor : public IChangeProcessor, public details::ChanRatioParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
               tessel::Mask* referenceMask, tessel::Raster* out) const override {
    const std::size_t channels = image->channels;
    const frame::BlockShape shape = frame::SampleBlocks(channels);
    frame::ChangeRows<In, Ref, Out>(
        {*image, *reference, *out, imageMask, referenceMask}, shape,
        kernels::ChannelRatios<In, Ref, Out>(*this, type == eDIFF2_ABSOLUTE, channels, shape.pixels));
  }
};

// ---- frame policy

namespace {

struct ChanRatioFrame : frame::Defaults<details::ChanRatioParams> {
  static constexpr frame::Guards guards = frame::Guards::kRasters;
  static constexpr bool interprets = true;
  using Dispatcher =
      frame::Extended<typedispatch::Factory3Template<ChanRatioChange::InnerProcessor, IChangeProcessor>,
                      typeconv::priv::ShortTypeList>;
};

}  // namespace

// ---- operator

ChanRatioChange::ChanRatioChange(DiffType2 form) {
  type = form;
  noData = 3.4e38f;
}
ChanRatioChange::ChanRatioChange(const ChanRatioChange&) = default;
ChanRatioChange& ChanRatioChange::operator=(const ChanRatioChange&) = default;
ChanRatioChange::~ChanRatioChange() = default;

void ChanRatioChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* imageMask,
                              tessel::Mask* referenceMask, tessel::Raster* out) const {
  frame::Process<ChanRatioFrame>(*this, cache_, frame::Rasters<3>{image, reference, out},
                                 [imageMask, referenceMask](const auto& processor, const auto& r) {
                                   processor.Process(r[0], r[1], imageMask, referenceMask, r[2]);
                                 });
}

}  // namespace orvik::changedetection
