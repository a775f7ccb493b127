#include "processes/gridmill/vollath.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <utility>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/scanlock.h"
#include "processes/gridmill/kernels/countedsamples.h"
#include "processes/gridmill/kernels/focussums.h"

namespace orvik::filters {

namespace {

// ---- row

/// How many triples of row `y` are read.
std::size_t TriplesOfRow(std::size_t width, const tessel::Mask* mask, std::uint32_t y) {
  if (width <= 2) return 0;
  if (mask == nullptr) return width - 2;
  // Deliberate: as many as neighbours are both set, from the left end on; the pixel after them is not tested.
  const std::uint32_t first = tessel::PixelIndex(*mask, 0, y);
  return kernels::CountSetInBoth(mask->bits.data(), first, std::size_t{first} + 1, width - 2);
}

// ---- image

template <class In>
void AddImage(const tessel::Raster& in, const tessel::Mask* mask, const kernels::FocusSums<In>& row,
              double* left, double* right) {
  const frame::ScanLock lock;
  for (std::uint32_t y = 0; y < in.height; ++y)
    row.AddNeighbourProducts(tessel::PixelAt<In>(in, 0, y), TriplesOfRow(in.width, mask, y), left, right);
}

/// What the processors of all types have.
class VollathProcessor : public IProcessor, public details::VollathParams, public details::VollathStats {};

}  // namespace

template <class In, class Out>
class VollathEvaluation::InnerProcessor : public VollathProcessor {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster*) const override {
    std::vector<double> left(in->channels, 0.0), right(in->channels, 0.0);
    const kernels::CountedSamples<In> counted(backgroundLow, backgroundHigh, failure);
    AddImage(*in, mask, kernels::FocusSums<In>{in->channels, counted}, left.data(), right.data());
    const std::size_t held = std::min(left.size(), leftEq.size());
    for (std::size_t c = 0; c < held; ++c) {
      leftEq[c] += left[c];
      rightEq[c] += right[c];
    }
  }
};

// ---- frame policy

namespace {

struct VollathFrame : frame::Defaults<details::VollathParams> {
  static constexpr frame::Guards guards = frame::Guards::kInputChannels;
  static constexpr frame::Compares compares = frame::Compares::kInput;
  static constexpr frame::Selects selects = frame::Selects::kInputTwice;
  using Dispatcher =
      frame::Extended<typedispatch::Factory2Template<VollathEvaluation::InnerProcessor, IProcessor>,
                      typeconv::priv::FullTypeList>;

  static void HandOver(const Params& from, Params& to, const frame::Rasters<2>& rasters) {
    to = from;
    // NOLINTNEXTLINE(cppcoreguidelines-pro-type-static-cast-downcast): the dispatcher makes no other kind
    static_cast<VollathProcessor&>(to).InitEvaluation(rasters.front()->channels);
  }
};

}  // namespace

// ---- operator

VollathEvaluation::VollathEvaluation() = default;
VollathEvaluation::VollathEvaluation(const VollathEvaluation&) = default;
VollathEvaluation& VollathEvaluation::operator=(const VollathEvaluation&) = default;
VollathEvaluation::~VollathEvaluation() = default;

void VollathEvaluation::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<VollathFrame>(*this, cache_, frame::Rasters<2>{in, out},
                               [&](const auto& processor, const auto& r) {
                                 // Room before the call, since nothing may fail after the totals have grown:
                                 // a retry would add twice.
                                 const auto& totals = dynamic_cast<const details::VollathStats&>(processor);
                                 std::vector<double> left = totals.leftEq, right = totals.rightEq;
                                 processor.Process(r[0], mask, r[1]);
                                 left = totals.leftEq;
                                 right = totals.rightEq;
                                 SetLeftEvaluation(std::move(left));
                                 SetRightEvaluation(std::move(right));
                               });
}

}  // namespace orvik::filters
