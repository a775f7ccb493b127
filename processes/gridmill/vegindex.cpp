#include "processes/gridmill/vegindex.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <type_traits>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/clipto.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/pixelplanes.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/vegetation.h"

namespace orvik::filters {

namespace {

using kernels::kBandRoles;
using kernels::kBlock;
using kernels::kVegetationIndices;

constexpr double kNoData = -1e20;

/// Samples of larger images are asked for ahead.
constexpr std::uint64_t kCachedBytes = std::uint64_t{8} << 20;

// ---- row

/// What is requested, and where the bands are that it reads.
struct Plan {
  static constexpr std::size_t kAbsent = static_cast<std::size_t>(-1);

  std::vector<std::size_t> codes;  // of the requested indices, ascending
  std::array<std::size_t, kBandRoles> channels;

  /// Deliberate: only a request of exactly 1 counts, and of two channels with one role the later counts.
  Plan(const details::VegIndexParams& params, std::size_t inChannels) {
    for (std::size_t code = 0; code < kVegetationIndices; ++code)
      if (params.requestedIndex[code] == 1) codes.push_back(code);
    channels.fill(kAbsent);
    for (std::size_t c = 0; c < inChannels; ++c)
      if (params.bandIndex[c] < kBandRoles && IsRead(params.bandIndex[c])) channels[params.bandIndex[c]] = c;
  }

  bool IsRead(std::size_t role) const {
    return std::ranges::any_of(codes, [&](std::size_t code) { return kernels::IndexReads(code, role); });
  }

  bool LacksBand() const {
    for (std::size_t role = 0; role < kBandRoles; ++role)
      if (channels[role] == kAbsent && IsRead(role)) return true;
    return false;
  }
};

template <class In>
inline constexpr bool kNarrow = std::is_integral_v<In> && sizeof(In) <= 2;

/// Loads the bands of one block after the other.
template <class In>
class BandLoader {
 public:
  explicit BandLoader(const Plan& plan) : plan_(plan) {}

  /// Deliberate: samples pass through `float`, `double` ones too. A band without a channel stays 0.
  const kernels::BandPlanes& Load(const In* image, std::size_t stride, std::size_t count) {
    std::size_t split = Plan::kAbsent;  // the first channel of those in `group_`
    for (std::size_t role = 0; role < kBandRoles; ++role) {
      const std::size_t channel = plan_.channels[role];
      if (channel == Plan::kAbsent) continue;
      if (stride <= kDirectChannels || sizeof(In) > 4) {
        kernels::LoadRow(image + channel, stride, count, bands_[role]);
        continue;
      }
      const std::size_t first = channel - channel % kernels::kSplitChannels<In>;
      if (first != split)
        kernels::SplitPixels(image + first, stride, std::min(kernels::kSplitChannels<In>, stride - first),
                             count, group_);
      split = first;
      kernels::LoadRow(group_[channel - first], 1, count, bands_[role]);
    }
    return bands_;
  }

 private:
  static constexpr std::size_t kDirectChannels = 4;  // that are taken one by one

  const Plan& plan_;
  kernels::BandPlanes bands_ = {};
  In group_[kernels::kSplitChannels<In>][kBlock];
};

/// Deliberate: an excluded pixel holds `ClipTo` of -1e20.
template <class Out>
constexpr Out kExcluded = tessel::ClipTo<Out>(kNoData);

/// A block of excluded pixels alone, whose samples are not read. Returns whether it is one.
template <class In, class Out>
bool WriteExcluded(const frame::FilterBlock<In, Out>& block, std::size_t samples) {
  if (!block.masked || !kernels::AllMasked(block.valid, block.pixels)) return false;
  std::fill_n(block.target, block.pixels * samples, kExcluded<Out>);
  return true;
}

/// One index of a block, as it is written.
template <class In, class Out>
void WriteIndex(std::size_t code, const kernels::BandPlanes& bands, std::size_t count, Out* target) {
  if constexpr (kNarrow<In> && std::is_same_v<Out, float>) {
    kernels::NarrowVegetationRow(code, bands, count, target);
  } else if constexpr (std::is_floating_point_v<Out>) {
    kernels::VegetationRow(code, bands, count, target);
  } else {
    double index[kBlock];
    kernels::VegetationRow(code, bands, count, index);
    kernels::StoreClipped(index, count, target);
  }
}

/// The requested indices of a block, as pixels.
template <class In, class Out>
void WritePixels(const std::vector<std::size_t>& codes, const kernels::BandPlanes& bands, std::size_t count,
                 Out* target) {
  if (codes.size() == 1) return WriteIndex<In>(codes.front(), bands, count, target);
  if constexpr (std::is_same_v<Out, float>) {
    if (codes.size() == kVegetationIndices)
      return (kNarrow<In>) ? kernels::NarrowVegetationPixels(bands, count, target)
                           : kernels::VegetationPixels(bands, count, target);
  }
  Out planes[kVegetationIndices][kBlock];
  const Out* written[kVegetationIndices];
  for (std::size_t c = 0; c < codes.size(); ++c) {
    WriteIndex<In>(codes[c], bands, count, planes[c]);
    written[c] = planes[c];
  }
  kernels::JoinPixels(written, codes.size(), count, target);
}

template <class Out>
void ExcludePixels(const unsigned char* valid, std::size_t samples, std::size_t count, Out* target) {
  if (samples == 1) return kernels::ReplaceMasked(valid, kExcluded<Out>, count, target);
  unsigned char validSamples[kVegetationIndices * kBlock];
  kernels::ReplicateRow(valid, samples, count, validSamples);
  kernels::ReplaceMasked(validSamples, kExcluded<Out>, samples * count, target);
}

// ---- image

/// The one index of pixels of four channels where there is a short way to it. Returns whether there is.
template <class In, class Out>
bool WriteFromPixels(const Plan& plan, const tessel::Raster& in, const tessel::Mask* mask,
                     const tessel::Raster& out) {
  if constexpr (kNarrow<In> && sizeof(In) == 2 && std::is_same_v<Out, float>) {
    const std::size_t code = plan.codes.front();
    if (in.channels != 4 || plan.codes.size() != 1 || !kernels::HasPixelRow(code) || plan.LacksBand())
      return false;
    const auto at = [&plan](std::size_t role) { return plan.IsRead(role) ? plan.channels[role] : 0; };
    const kernels::NarrowPixelBands bands{at(eBAND_GREEN), at(eBAND_RED), at(eBAND_NIR)};
    const bool far = in.dataSize > kCachedBytes;
    const frame::FilterShape shape{.pixels = 2 * kBlock};
    frame::FilterRows<In, Out>(in, mask, out, shape, [&](const auto& block) {
      if (WriteExcluded(block, 1)) return;
      if (far) kernels::PrefetchAhead(block.image, block.pixels * block.stride);
      kernels::NarrowPixelRow(code, block.image, bands, block.pixels, block.target);
      if (block.masked) ExcludePixels(block.valid, 1, block.pixels, block.target);
    });
    return true;
  }
  return false;
}

}  // namespace

template <class In, class Out>
class VegIndex::InnerProcessor : public IProcessor, public details::VegIndexParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (in->width == 0 || in->height == 0) return;
    const Plan plan(*this, in->channels);
    if (plan.codes.empty() || WriteFromPixels<In, Out>(plan, *in, mask, *out)) return;

    BandLoader<In> loader(plan);
    const bool far = in->dataSize > kCachedBytes;
    const frame::FilterShape shape{.pixels = kBlock, .outSamples = plan.codes.size()};
    frame::FilterRows<In, Out>(*in, mask, *out, shape, [&](const auto& block) {
      if (WriteExcluded(block, plan.codes.size())) return;
      if (far) kernels::PrefetchAhead(block.image, block.pixels * block.stride);
      const kernels::BandPlanes& bands = loader.Load(block.image, block.stride, block.pixels);
      WritePixels<In>(plan.codes, bands, block.pixels, block.target);
      if (block.masked) ExcludePixels(block.valid, plan.codes.size(), block.pixels, block.target);
    });
  }
};

// ---- frame policy

namespace {

struct VegIndexFrame : frame::Defaults<details::VegIndexParams> {
  using Dispatcher = frame::Extended<typedispatch::Factory2Template<VegIndex::InnerProcessor, IProcessor>,
                                     typeconv::priv::FullTypeList>;
};

}  // namespace

// ---- operator

VegIndex::VegIndex() = default;
VegIndex::VegIndex(const VegIndex&) = default;
VegIndex& VegIndex::operator=(const VegIndex&) = default;
VegIndex::~VegIndex() = default;

void VegIndex::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<VegIndexFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
