#include "processes/gridmill/filterasp.h"

#include <algorithm>
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

namespace orvik::filters {

namespace {

using kernels::CellCorners;
using kernels::CellNormal;
using kernels::CellScale;
using kernels::CellScratch;
using kernels::kBlock;

// ---- pixel

/// The aspect in degrees, halved for an 8-bit output, from the normal of a cell and the arc tangent of |ny /
/// nx|. Deliberate: the `zeroSlope` of a flat cell is not halved.
template <bool halved>
GRIDMILL_INLINE float AspectOf(CellNormal normal, float arcTangent, float zeroSlope) {
  const auto [nx, ny] = normal;
  float aspect = (kernels::Atan2Quadrant(ny, nx, arcTangent) + 1.5707964f) * 57.29578f;
  aspect = aspect < 0.0f ? aspect + 360.0f : aspect;
  if constexpr (halved) aspect = aspect * 0.5f;
  const bool flat = (nx == 0.0f) & (ny == 0.0f);
  return flat ? zeroSlope : aspect;
}

// ---- row

/// What the three steps of a row hand on. A processor overlaps more of three short chains than of a long one.
struct AspectScratch {
  float nx[kBlock];
  float ny[kBlock];
  float angle[kBlock];  // the quotient |ny / nx|, then its arc tangent
};

GRIDMILL_MULTIVERSION void NormalRow(const CellCorners& z, CellScale scale, std::size_t count,
                                     float* __restrict nx, float* __restrict ny, float* __restrict quotient) {
  const auto [z00, z10, z01, z11] = z;
  for (std::size_t i = 0; i < count; ++i) {
    const CellNormal normal = kernels::NormalOf(z00[i], z10[i], z01[i], z11[i], scale);
    nx[i] = normal.nx;
    ny[i] = normal.ny;
    quotient[i] = kernels::Atan2Quotient(normal.ny, normal.nx);
  }
}

GRIDMILL_MULTIVERSION void ArcTangentRow(std::size_t count, float* __restrict angle) {
  for (std::size_t i = 0; i < count; ++i) angle[i] = kernels::AtanPositive(angle[i]);
}

template <bool halved>
GRIDMILL_MULTIVERSION void AspectRow(const AspectScratch& s, float zeroSlope, std::size_t count,
                                     float* __restrict aspect) {
  for (std::size_t i = 0; i < count; ++i)
    aspect[i] = AspectOf<halved>({s.nx[i], s.ny[i]}, s.angle[i], zeroSlope);
}

/// Deliberate: a masked neighbour leaves no direction.
GRIDMILL_MULTIVERSION void ZeroMaskedNeighbours(const unsigned char* mask, const unsigned char* maskBelow,
                                                float zeroSlope, std::size_t count,
                                                float* __restrict aspect) {
  for (std::size_t i = 0; i < count; ++i)
    aspect[i] = (mask[i + 1] & maskBelow[i] & maskBelow[i + 1]) != 0 ? aspect[i] : zeroSlope;
}

/// The rows of samples that meet in one row of cells, and what is made of them.
template <class In, class Out>
struct AspRow {
  static constexpr bool halved = sizeof(Out) == 1;

  const In* upper;
  const In* lower;
  std::size_t channels;
  CellScale scale;
  float zeroSlope;
  Out background;
  Out* target;

  /// The aspects of `count` pixels from the one with index `first` on, before they are written.
  void Compute(std::size_t first, std::size_t count, float* aspect) const {
    CellScratch scratch;
    const std::size_t sample = first * channels;
    kernels::PrefetchAhead(lower + sample, count * channels);
    const CellCorners z =
        kernels::LoadCorners(upper + sample, lower + sample, channels, channels, count, scratch);
    AspectScratch s;
    NormalRow(z, scale, count, s.nx, s.ny, s.angle);
    ArcTangentRow(count, s.angle);
    AspectRow<halved>(s, zeroSlope, count, aspect);
  }

  void Unmasked(std::size_t first, std::size_t count) const {
    if constexpr (std::is_same_v<Out, float>) {
      Compute(first, count, target + first);
    } else {
      float aspect[kBlock];
      Compute(first, count, aspect);
      kernels::StoreClipped(aspect, count, target + first);
    }
  }

  /// `count` pixels from `x` on, with one byte of validity for each pixel of their cells.
  void Masked(std::size_t x, std::size_t count, const unsigned char* mask,
              const unsigned char* maskBelow) const {
    float aspect[kBlock];
    Compute(x, count, aspect);
    ZeroMaskedNeighbours(mask, maskBelow, zeroSlope, count, aspect);
    kernels::StoreClippedWhere(aspect, mask, background, count, target + x);
  }

  void Background(std::size_t x, std::size_t count) const { std::fill_n(target + x, count, background); }

  /// A whole row without a mask.
  void Run(std::size_t width) const {
    for (std::size_t x = 0; x < width; x += kBlock) Unmasked(x, std::min(kBlock, width - x));
  }

  /// A whole row with one byte of validity for each pixel.
  void Run(std::size_t width, const unsigned char* mask, const unsigned char* maskBelow) const {
    kernels::RunMaskedCells(*this, width, kBlock, mask, maskBelow);
  }
};

// ---- image

/// A row pixel by pixel: for masks of another geometry than the input's, where the bit of a pixel and its
/// byte differ. A corner whose byte is clear then reads as 0.
template <class In, class Out>
void SlowRow(const tessel::Raster& in, const tessel::Mask& mask, const tessel::MaskBytes& bytes,
             std::uint32_t y, const AspRow<In, Out>& row) {
  const std::uint32_t pitch = tessel::MaskBytes::Pitch(in);
  const auto valid = [&](std::uint32_t px, std::uint32_t py) { return tessel::MaskBitAt(mask, px, py) != 0; };
  for (std::uint32_t x = 0; x < in.width; ++x) {
    Out& target = row.target[x];
    if (!valid(x, y)) {
      target = row.background;
    } else if (!valid(x + 1, y) || !valid(x + 1, y + 1) || !valid(x, y + 1)) {
      target = tessel::ClipTo<Out>(row.zeroSlope);
    } else {
      const unsigned char* const byte = bytes.At(in, x, y);
      const std::size_t i = x * row.channels;
      const std::size_t right = i + row.channels;
      const auto corner = [&](const In& sample, std::uint32_t index) {
        return byte[index] != 0 ? tessel::PlainCast<float>(sample) : 0.0f;
      };
      const CellNormal normal =
          kernels::NormalOf(corner(row.upper[i], 0), corner(row.upper[right], 1), corner(row.lower[i], pitch),
                            corner(row.lower[right], pitch + 1), row.scale);
      const float arcTangent = kernels::AtanPositive(kernels::Atan2Quotient(normal.ny, normal.nx));
      target = tessel::ClipTo<Out>(AspectOf<AspRow<In, Out>::halved>(normal, arcTangent, row.zeroSlope));
    }
  }
}

}  // namespace

template <class In, class Out>
class FilterAsp::InnerProcessor : public IProcessor, public details::AspParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    if (in->marginX < 1 || in->marginY < 1)
      ThrowInvalidInput("The Margin of the input raster is too small", ORVIK_HERE);

    const tessel::MaskBytes bytes(mask);
    const bool wholeRows = mask == nullptr || tessel::HasGeometryOf(*mask, *in);
    const CellScale scale{XSIZE, YSIZE, ELSZ};
    const Out background = tessel::ClipTo<Out>(Background);

    frame::ParallelRows(in->height, in->width, [&, zeroSlope = ZeroSlope](std::uint32_t y) {
      const AspRow<In, Out> row{tessel::PixelAt<In>(*in, 0, y),
                                tessel::PixelAt<In>(*in, 0, y + 1),
                                in->channels,
                                scale,
                                zeroSlope,
                                background,
                                tessel::PixelAt<Out>(*out, 0, y)};
      if (!wholeRows) return SlowRow(*in, *mask, bytes, y, row);
      if (mask == nullptr) return row.Run(in->width);
      row.Run(in->width, bytes.At(*in, 0, y), bytes.At(*in, 0, y + 1));
    });
  }
};

struct FilterAsp::AspCreationPolicy {
  template <class In, class Out>
  static IProcessor* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct AspFrame : frame::Defaults<details::AspParams> {
  static constexpr frame::Guards guards = frame::Guards::kRasters;
  static constexpr bool interprets = true;
  using Dispatcher = frame::TwoLevel<FilterAsp::AspCreationPolicy>;
};

}  // namespace

// ---- operator

FilterAsp::FilterAsp() = default;
FilterAsp::FilterAsp(const FilterAsp&) = default;
FilterAsp& FilterAsp::operator=(const FilterAsp&) = default;
FilterAsp::~FilterAsp() = default;

void FilterAsp::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<AspFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
