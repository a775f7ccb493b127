#include "tests/reference/chandiffchange_reference.h"

#include <cstdint>
#include <type_traits>

#include "tests/reference/changesamples.h"
#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using tests::ChangeParameters;

template <class Out>
Out Form(int type, Out a, Out b) {
  if (type == 0) return a >= b ? Difference(a, b) : Difference(b, a);
  if (type == 1) return Difference(a, b);
  if constexpr (std::is_floating_point_v<Out>) return Out{0} - (a - b);
  return Difference(b, a);
}

template <class In, class Out>
Out Sample(const ChangeParameters& parameters, const NoDataTest& test, In i, In r, bool isValid,
           std::uint32_t c) {
  if (!isValid) return ClipTo<Out>(parameters.noData);
  if (test.HitsImage(i, c)) return ClipTo<Out>(parameters.noData);
  if (test.HitsReference(r, c)) return ClipTo<Out>(parameters.noData);
  return Form(parameters.type, PlainCast<Out>(i), PlainCast<Out>(r));
}

template <class In, class Out>
void Image(const ChangeParameters& parameters, const tessel::Raster& image, const tessel::Raster& reference,
           const tessel::Mask* mask, tessel::Raster& out) {
  const NoDataTest test(parameters, image);
  ForEachPixel(image, [&](std::uint32_t x, std::uint32_t y) {
    const bool isValid = IsValid(mask, x, y);
    for (std::uint32_t c = 0; c < image.channels; ++c) {
      const In i = Read<In>(image, x, y, c);
      const In r = Read<In>(reference, x, y, c);
      Write(out, x, y, c, Sample<In, Out>(parameters, test, i, r, isValid, c));
    }
  });
}

}  // namespace

void ChanDiffChange(const ChangeParameters& parameters, const tessel::Raster& image,
                    const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out) {
  tests::WithPixelTypes(image.dataType, out.dataType, [&]<class In, class Out>() {
    Image<In, Out>(parameters, image, reference, mask, out);
  });
}

}  // namespace orvik::reference
