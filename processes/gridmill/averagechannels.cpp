#include "processes/gridmill/averagechannels.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/clipto.h"
#include "basic/tessel/mask/maskrow.h"
#include "basic/tessel/plaincast.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/rows.h"
#include "processes/gridmill/kernels/integermean.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::filters {

namespace {

using kernels::IsNoData;
using kernels::kBlock;
using kernels::NoDataSample;

// ---- pixel

/// The mean of `Channels` samples, or `noData` if one of them counts as no-data.
template <std::size_t Channels, class In>
GRIDMILL_INLINE float MeanOf(const In* pixel, float noData) {
  float sum = 0.0f;
  bool hit = false;
  for (std::size_t c = 0; c < Channels; ++c) {
    const float s = tessel::PlainCast<float>(pixel[c]);
    sum = sum + s;
    hit |= IsNoData(s, noData);
  }
  return hit ? noData : sum / static_cast<float>(Channels);
}

// ---- row

template <std::size_t Channels, class In>
GRIDMILL_MULTIVERSION void MeanRowOf(const In* __restrict source, float noData, std::size_t count,
                                     float* __restrict mean) {
  for (std::size_t i = 0; i < count; ++i) mean[i] = MeanOf<Channels>(source + i * Channels, noData);
}

GRIDMILL_MULTIVERSION void AddChannel(const float* __restrict sample, float noData, std::size_t count,
                                      float* __restrict sum, int* __restrict hit) {
  for (std::size_t i = 0; i < count; ++i) {
    sum[i] = sum[i] + sample[i];
    hit[i] |= static_cast<int>(IsNoData(sample[i], noData));
  }
}

GRIDMILL_MULTIVERSION void DivideSums(const float* __restrict sum, const int* __restrict hit, float divisor,
                                      float noData, std::size_t count, float* __restrict mean) {
  for (std::size_t i = 0; i < count; ++i) {
    const float quotient = sum[i] / divisor;
    mean[i] = hit[i] != 0 ? noData : quotient;
  }
}

/// Any number of channels, one after the other.
template <class In>
void AnyMeanRow(const In* source, std::size_t channels, float noData, std::size_t count, float* mean) {
  float scratch[kBlock];
  float sum[kBlock] = {};
  int hit[kBlock] = {};
  for (std::size_t c = 0; c < channels; ++c)
    AddChannel(kernels::FloatRow(source + c, channels, count, scratch), noData, count, sum, hit);
  DivideSums(sum, hit, static_cast<float>(channels), noData, count, mean);
}

template <class In>
void MeanRow(const In* source, std::size_t channels, float noData, std::size_t count, float* mean) {
  if (channels == 4) {
    if constexpr (std::is_same_v<In, unsigned short>) {
      kernels::MeanRow4(source, NoDataSample<In>(noData), noData, count, mean);
    } else {
      MeanRowOf<4>(source, noData, count, mean);
    }
  } else if (channels == 3) {
    MeanRowOf<3>(source, noData, count, mean);
  } else {
    AnyMeanRow(source, channels, noData, count, mean);
  }
}

/// The means as they are written.
template <class In, class Out>
void WriteMeanRow(const In* source, std::size_t channels, float noData, std::size_t count, Out* target) {
  if constexpr (std::is_same_v<In, unsigned char> && std::is_same_v<Out, unsigned char>) {
    if (channels == 3)
      return kernels::RoundedMeanRow3(source, NoDataSample<In>(noData), tessel::ClipTo<Out>(noData), count,
                                      target);
  }
  if constexpr (std::is_same_v<Out, float>) {
    MeanRow(source, channels, noData, count, target);
  } else {
    float mean[kBlock];
    MeanRow(source, channels, noData, count, mean);
    kernels::StoreClipped(mean, count, target);
  }
}

// ---- image

}  // namespace

template <class In, class Out>
class AverageChannels::InnerProcessor : public IClipperProcessor, public details::AverageChannelsParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* inMask, tessel::Raster* out, tessel::Mask*) const override {
    const std::size_t channels = in->channels;
    const float value = noData;
    // Deliberate: a masked pixel holds the bare casts of `noData`, neither rounded nor clamped.
    // The first cast is volatile, as g++ takes the two for one that keeps the sign of a negative zero.
    const volatile In cast = tessel::PlainCast<In>(value);
    const Out masked = tessel::PlainCast<Out>(In{cast});

    frame::ParallelRows(in->height, std::uint64_t{in->width} * channels, [=](std::uint32_t y) {
      const In* const source = tessel::PixelAt<In>(*in, 0, y);
      Out* const target = tessel::PixelAt<Out>(*out, 0, y);
      for (std::size_t x = 0; x < in->width; x += kBlock) {
        const std::size_t count = std::min<std::size_t>(kBlock, in->width - x);
        kernels::PrefetchAhead(source + x * channels, count * channels);
        WriteMeanRow(source + x * channels, channels, value, count, target + x);
        if (inMask == nullptr) continue;
        unsigned char valid[kBlock];
        tessel::UnpackBits(*inMask, tessel::PixelIndex(*inMask, static_cast<std::uint32_t>(x), y), count,
                           valid);
        kernels::ReplaceMasked(valid, masked, count, target + x);
      }
    });
  }
};

// ---- frame policy

namespace {

struct AverageFrame : frame::Defaults<details::AverageChannelsParams> {
  static constexpr frame::Guards guards = frame::Guards::kRasters;
  static constexpr bool interprets = true;
  using Dispatcher =
      frame::Extended<typedispatch::Factory2Template<AverageChannels::InnerProcessor, IClipperProcessor>,
                      typeconv::priv::FullTypeList>;
};

}  // namespace

// ---- operator

details::AverageChannelsParams::~AverageChannelsParams() = default;

AverageChannels::AverageChannels() : AverageChannels(0.0f) {}
AverageChannels::AverageChannels(float noDataValue) { noData = noDataValue; }
AverageChannels::AverageChannels(const AverageChannels&) = default;
AverageChannels& AverageChannels::operator=(const AverageChannels&) = default;
AverageChannels::~AverageChannels() = default;

void AverageChannels::Process(tessel::Raster* in, tessel::Mask* inMask, tessel::Raster* out,
                              tessel::Mask* outMask) const {
  frame::Process<AverageFrame>(*this, cache_, frame::Rasters<2>{in, out},
                               [inMask, outMask](const auto& processor, const auto& r) {
                                 processor.Process(r[0], inMask, r[1], outMask);
                               });
}

}  // namespace orvik::filters
