#include "processes/gridmill/filterslp.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <type_traits>

#include "basic/exceptions/throw.h"
#include "basic/tessel/clipto.h"
#include "basic/tessel/mask/maskrow.h"
#include "basic/tessel/plaincast.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/rows.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/terraincell.h"
#include "processes/gridmill/kernels/trigonometry.h"
#include "processes/gridmill/kernels/wholedegrees.h"

namespace orvik::filters {

namespace {

using kernels::CellCorners;
using kernels::CellScale;
using kernels::CellScratch;
using kernels::kBlock;

// ---- pixel

/// The cosine of the slope of a cell; 1 where the slope is 0 whatever the cosine.
GRIDMILL_INLINE float CosineOf(float z00, float z10, float z01, float z11, const CellScale& scale) {
  const auto [nx, ny] = kernels::NormalOf(z00, z10, z01, z11, scale);
  const float nz = scale.XSIZE * scale.YSIZE;
  const float norm = std::sqrt((ny * ny + nx * nx) + nz * nz);
  const float cosine = nz / norm;
  // Deliberate: a cosine above 1 gives 0, as a flat cell does, and no rounding term lifts either.
  const bool level = ((nx == 0.0f) & (ny == 0.0f)) | (cosine > 1.0f);
  return level ? 1.0f : cosine;
}

/// The slope in degrees as it is written: as `float` all of it, as `int` whole degrees, rounded by a term of
/// 0.5. A cosine of 1 gives 0 in both.
template <class Slope>
GRIDMILL_INLINE Slope SlopeOf(float cosine) {
  if constexpr (std::is_same_v<Slope, float>) {
    return kernels::Acos(cosine) * 57.29578f;
  } else {
    return kernels::RoundedDegrees(cosine);
  }
}

// ---- row

/// Returns whether the arc cosine of every value is in its upper branch: slopes of at most 60 degrees.
/// Cosines and angles go through apart: a processor overlaps more of two short chains than of a long one.
GRIDMILL_MULTIVERSION bool CosineRow(const CellCorners& z, CellScale scale, std::size_t count,
                                     float* __restrict cosine) {
  const auto [z00, z10, z01, z11] = z;
  int steep = 0;
  for (std::size_t i = 0; i < count; ++i) {
    const float c = CosineOf(z00[i], z10[i], z01[i], z11[i], scale);
    cosine[i] = c;
    steep |= static_cast<int>(!(c >= 0.5f));
  }
  return steep == 0;
}

GRIDMILL_MULTIVERSION void SlopeRow(const float* __restrict cosine, bool gentle, std::size_t count,
                                    float* __restrict slope) {
  if (gentle) {
    for (std::size_t i = 0; i < count; ++i) slope[i] = kernels::AcosHigh(cosine[i]) * 57.29578f;
  } else {
    for (std::size_t i = 0; i < count; ++i) slope[i] = SlopeOf<float>(cosine[i]);
  }
}

void SlopeRow(const float* cosine, bool, std::size_t count, int* slope) {
  kernels::RoundedDegreesRow(cosine, count, slope);
}

/// Whole degrees on every output but 32-bit `float`.
template <class Out>
using SlopeFor = std::conditional_t<std::is_same_v<Out, float>, float, int>;

/// The rows of samples that meet in one row of cells, and what is made of them.
template <class In, class Out>
struct SlpRow {
  const In* upper;
  const In* lower;
  std::size_t channels;
  CellScale scale;
  Out background;
  Out* target;

  /// `count` samples from the one with index `first` on, none of their cells masked.
  void Samples(std::size_t first, std::size_t count) const {
    kernels::PrefetchAhead(lower + first, count);
    CellScratch scratch;
    float cosine[kBlock];
    const CellCorners z = kernels::LoadCorners(upper + first, lower + first, 1, channels, count, scratch);
    const bool gentle = CosineRow(z, scale, count, cosine);
    if constexpr (std::is_same_v<Out, float>) {
      SlopeRow(cosine, gentle, count, target + first);
    } else {
      int slope[kBlock];
      SlopeRow(cosine, gentle, count, slope);
      kernels::StoreClipped(slope, count, target + first);
    }
  }

  void Unmasked(std::size_t x, std::size_t pixels) const { Samples(x * channels, pixels * channels); }

  /// `pixels` pixels from `x` on, with one byte of validity for each pixel of their cells.
  void Masked(std::size_t x, std::size_t pixels, const unsigned char* mask,
              const unsigned char* maskBelow) const {
    const std::size_t first = x * channels;
    const std::size_t count = pixels * channels;
    CellScratch scratch;
    unsigned char valid[2 * kBlock], validBelow[2 * kBlock];
    float z10[kBlock], z01[kBlock], z11[kBlock], cosine[kBlock];
    SlopeFor<Out> slope[kBlock];
    kernels::ReplicateRow(mask, channels, pixels + 1, valid);
    kernels::ReplicateRow(maskBelow, channels, pixels + 1, validBelow);
    const CellCorners z = kernels::LoadCorners(upper + first, lower + first, 1, channels, count, scratch);
    // Deliberate: a masked neighbour counts as level with the pixel.
    kernels::LevelRow(z.z00, z.z10, valid + channels, count, z10);
    kernels::LevelRow(z.z00, z.z01, validBelow, count, z01);
    kernels::LevelRow(z.z00, z.z11, validBelow + channels, count, z11);
    const bool gentle = CosineRow({z.z00, z10, z01, z11}, scale, count, cosine);
    SlopeRow(cosine, gentle, count, slope);
    kernels::StoreClippedWhere(slope, valid, background, count, target + first);
  }

  void Background(std::size_t x, std::size_t pixels) const {
    std::fill_n(target + x * channels, pixels * channels, background);
  }

  /// A whole row without a mask.
  void Run(std::size_t width) const {
    const std::size_t samples = width * channels;
    for (std::size_t first = 0; first < samples; first += kBlock)
      Samples(first, std::min(kBlock, samples - first));
  }

  /// A whole row with one byte of validity for each pixel. `channels` is at most `kBlock`: a block holds
  /// pixels whose samples fit it, in whole vectors of bytes where there are many.
  void Run(std::size_t width, const unsigned char* mask, const unsigned char* maskBelow) const {
    const std::size_t pixels = kBlock / channels;
    kernels::RunMaskedCells(*this, width, pixels < 64 ? pixels : pixels & ~std::size_t{63}, mask, maskBelow);
  }
};

// ---- image

/// A row sample by sample: for masks of another geometry than the input's, where the bit of a pixel and its
/// byte differ, and for pixels of many channels.
template <class In, class Out>
void SlowRow(const tessel::Raster& in, const tessel::Mask& mask, const tessel::MaskBytes& bytes,
             std::uint32_t y, const SlpRow<In, Out>& row) {
  const std::uint32_t pitch = tessel::MaskBytes::Pitch(in);
  In elevation = 0;  // the last sample of a pixel whose byte is set
  for (std::uint32_t x = 0; x < in.width; ++x) {
    const bool valid = tessel::MaskBitAt(mask, x, y) != 0;
    const unsigned char* const byte = bytes.At(in, x, y);
    for (std::size_t c = 0; c < row.channels; ++c) {
      const std::size_t i = x * row.channels + c;
      const std::size_t right = i + row.channels;
      if (byte[0] != 0) elevation = row.upper[i];
      if (!valid) {
        row.target[i] = row.background;
        continue;
      }
      const auto corner = [&](const In& sample, std::uint32_t index) {
        return tessel::PlainCast<float>(byte[index] != 0 ? sample : elevation);
      };
      const float cosine =
          CosineOf(corner(row.upper[i], 0), corner(row.upper[right], 1), corner(row.lower[i], pitch),
                   corner(row.lower[right], pitch + 1), row.scale);
      row.target[i] = tessel::ClipTo<Out>(SlopeOf<SlopeFor<Out>>(cosine));
    }
  }
}

}  // namespace

template <class In, class Out>
class FilterSlp::InnerProcessor : public IProcessor, public details::SlpParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (in->marginX == 0 || in->marginY == 0)
      ThrowInvalidInput("The Margin of the input raster is too small", ORVIK_HERE);

    const tessel::MaskBytes bytes(mask);
    const bool wholeRows =
        mask == nullptr || (tessel::HasGeometryOf(*mask, *in) && in->channels >= 1 && in->channels <= kBlock);
    const CellScale scale{XSIZE, YSIZE, ELSZ};
    const Out background = tessel::ClipTo<Out>(Background);

    frame::ParallelRows(in->height, std::uint64_t{in->width} * in->channels, [&](std::uint32_t y) {
      const SlpRow<In, Out> row{tessel::PixelAt<In>(*in, 0, y),
                                tessel::PixelAt<In>(*in, 0, y + 1),
                                in->channels,
                                scale,
                                background,
                                tessel::PixelAt<Out>(*out, 0, y)};
      if (!wholeRows) return SlowRow(*in, *mask, bytes, y, row);
      if (mask == nullptr) return row.Run(in->width);
      row.Run(in->width, bytes.At(*in, 0, y), bytes.At(*in, 0, y + 1));
    });
  }
};

struct FilterSlp::SlpCreationPolicy {
  template <class In, class Out>
  static IProcessor* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct SlpFrame : frame::Defaults<details::SlpParams> {
  static constexpr frame::Guards guards = frame::Guards::kRasters;
  static constexpr bool interprets = true;
  using Dispatcher = frame::TwoLevel<FilterSlp::SlpCreationPolicy>;
};

}  // namespace

// ---- operator

FilterSlp::FilterSlp(float xSize, float ySize, float elevationScale)
    : SlpParams(xSize, ySize, elevationScale) {}
FilterSlp::FilterSlp(const FilterSlp&) = default;
FilterSlp& FilterSlp::operator=(const FilterSlp&) = default;
FilterSlp::~FilterSlp() = default;

void FilterSlp::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<SlpFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
