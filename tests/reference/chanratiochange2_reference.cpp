#include "tests/reference/chanratiochange2_reference.h"

#include <cmath>
#include <cstdint>

#include "tests/reference/changesamples.h"
#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using tests::ChangeParameters;

float Ratio(int type, float i, float r) {
  const float q = i / r;
  return type == 0 ? std::fabs(q) : q;
}

template <class In, class Ref, class Out>
Out Sample(const ChangeParameters& parameters, const NoDataTest& test, In i, Ref r, bool isValid,
           std::uint32_t c) {
  if (!isValid) return ClipTo<Out>(parameters.noData);
  if (test.HitsImage(i, c)) return ClipTo<Out>(parameters.noData);
  if (test.HitsReference(r, c)) return ClipTo<Out>(parameters.noData);
  return ClipTo<Out>(Ratio(parameters.type, static_cast<float>(i), static_cast<float>(r)));
}

template <class In, class Ref, class Out>
void Image(const ChangeParameters& parameters, const tessel::Raster& image, const tessel::Raster& reference,
           const tessel::Mask* mask, tessel::Raster& out) {
  const NoDataTest test(parameters, image);
  ForEachPixel(image, [&](std::uint32_t x, std::uint32_t y) {
    const bool isValid = IsValid(mask, x, y);
    for (std::uint32_t c = 0; c < image.channels; ++c) {
      const In i = Read<In>(image, x, y, c);
      const Ref r = Read<Ref>(reference, x, y, c);
      Write(out, x, y, c, Sample<In, Ref, Out>(parameters, test, i, r, isValid, c));
    }
  });
}

}  // namespace

void ChanRatioChange2(const ChangeParameters& parameters, const tessel::Raster& image,
                      const tessel::Raster& reference, const tessel::Mask* mask, tessel::Raster& out) {
  if (image.dataType.isComplex) return ChanRatioChange2(parameters, *RealParts(image), reference, mask, out);
  if (reference.dataType.isComplex)
    return ChanRatioChange2(parameters, image, *RealParts(reference), mask, out);
  tests::WithShortPixelTypes(image.dataType, reference.dataType, out.dataType,
                             [&]<class In, class Ref, class Out>() {
                               Image<In, Ref, Out>(parameters, image, reference, mask, out);
                             });
}

}  // namespace orvik::reference
