#include "tests/reference/filterslp_reference.h"

#include <cmath>
#include <type_traits>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/reference/terraincell_reference.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::SlpParams;

float Slope(const SlpParams& p, float z00, float z10, float z01, float z11, float rounding) {
  const auto [nx, ny] = CellNormal(z00, z10, z01, z11, p.XSIZE, p.YSIZE, p.ELSZ);
  const float nz = p.XSIZE * p.YSIZE;
  if (nx == 0.0f && ny == 0.0f) return 0.0f;
  const float norm = std::sqrt((ny * ny + nx * nx) + nz * nz);
  const float cosine = nz / norm;
  float slope = 0.0f;
  if (!(cosine > 1.0f)) slope = std::acos(cosine) * 57.29578f + rounding;
  if (rounding != 0.0f) slope = static_cast<float>(TruncateToInt32(slope));
  return slope;
}

template <class In, class Out>
void Image(const SlpParams& p, const tessel::Raster& in, const tessel::Mask* mask, tessel::Raster& out) {
  const float rounding = std::is_same_v<Out, float> ? 0.0f : 0.5f;
  const std::uint32_t row = in.width + 2 * in.marginX;
  for (std::uint32_t y = 0; y < in.height; ++y) {
    In remembered = 0;
    for (std::uint32_t x = 0; x < in.width; ++x) {
      const std::uint32_t index = (in.marginY + y) * row + in.marginX + x;
      const auto isByteSet = [&](std::uint32_t offset) {
        return mask == nullptr || Bit(*mask, index + offset);
      };
      const bool isValid = IsValid(mask, x, y);
      for (std::uint32_t c = 0; c < in.channels; ++c) {
        const std::uint64_t element = std::uint64_t{x} * in.channels + c;
        if (isByteSet(0)) remembered = Read<In>(in, x, y, c);
        if (!isValid) {
          Write(out, 0, y, element, ClipTo<Out>(p.Background));
          continue;
        }
        const In z00 = isByteSet(0) ? Read<In>(in, x, y, c) : remembered;
        const In z10 = isByteSet(1) ? Read<In>(in, x + 1, y, c) : remembered;
        const In z01 = isByteSet(row) ? Read<In>(in, x, y + 1, c) : remembered;
        const In z11 = isByteSet(row + 1) ? Read<In>(in, x + 1, y + 1, c) : remembered;
        const float slope = Slope(p, static_cast<float>(z00), static_cast<float>(z10),
                                  static_cast<float>(z01), static_cast<float>(z11), rounding);
        Write(out, 0, y, element, ClipTo<Out>(static_cast<double>(slope)));
      }
    }
  }
}

}  // namespace

void FilterSlp(const SlpParams& params, const tessel::Raster& in, const tessel::Mask* mask,
               tessel::Raster& out) {
  if (in.dataType.isComplex) return FilterSlp(params, *RealParts(in), mask, out);
  tests::WithPixelTypes(in.dataType, out.dataType,
                        [&]<class In, class Out>() { Image<In, Out>(params, in, mask, out); });
}

}  // namespace orvik::reference
