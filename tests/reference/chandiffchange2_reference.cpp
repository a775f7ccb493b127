#include "tests/reference/chandiffchange2_reference.h"

#include <cstdint>
#include <type_traits>

#include "tests/reference/changesamples.h"
#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using tests::ChangeParameters;

/// The smaller from the larger by their casts to `Out`, the reference clipped.
template <class Out, class In, class Ref>
Out AbsoluteDifference(In i, Ref r) {
  const Out a = PlainCast<Out>(i);
  const Out b = PlainCast<Out>(r);
  const Out k = ClipTo<Out>(r);
  if constexpr (std::is_same_v<In, float> || std::is_same_v<Out, float>) {
    const float fi = static_cast<float>(i);
    const float fk = static_cast<float>(k);
    return PlainCast<Out>(a >= b ? fi - fk : fk - fi);
  } else {
    const int ii = i;
    const int ik = k;
    return PlainCast<Out>(a >= b ? ii - ik : ik - ii);
  }
}

template <class In, class Ref, class Out>
Out Sample(const ChangeParameters& parameters, const NoDataTest& test, In i, Ref r, bool isValid,
           std::uint32_t c) {
  if (!isValid) return ClipTo<Out>(parameters.noData);
  if (test.HitsImage(i, c)) return ClipTo<Out>(parameters.noData);
  if (test.HitsReference(r, c)) return ClipTo<Out>(parameters.noData);
  if (parameters.type == 0) return AbsoluteDifference<Out>(i, r);
  return Difference(PlainCast<Out>(i), PlainCast<Out>(r));
}

template <class In, class Ref, class Out>
void Image(const ChangeParameters& parameters, const tessel::Raster& image, const tessel::Raster& reference,
           const tessel::Mask* imageMask, const tessel::Mask* referenceMask, tessel::Raster& out) {
  const NoDataTest test(parameters, image);
  ForEachPixel(image, [&](std::uint32_t x, std::uint32_t y) {
    const bool isValid =
        IsValid(imageMask, x, y) && (referenceMask == nullptr || !IsValid(referenceMask, x, y));
    for (std::uint32_t c = 0; c < image.channels; ++c) {
      const In i = Read<In>(image, x, y, c);
      const Ref r = Read<Ref>(reference, x, y, c);
      Write(out, x, y, c, Sample<In, Ref, Out>(parameters, test, i, r, isValid, c));
    }
  });
}

}  // namespace

void ChanDiffChange2(const ChangeParameters& parameters, const tessel::Raster& image,
                     const tessel::Raster& reference, const tessel::Mask* imageMask,
                     const tessel::Mask* referenceMask, tessel::Raster& out) {
  if (image.dataType.isComplex)
    return ChanDiffChange2(parameters, *RealParts(image), reference, imageMask, referenceMask, out);
  if (reference.dataType.isComplex)
    return ChanDiffChange2(parameters, image, *RealParts(reference), imageMask, referenceMask, out);
  tests::WithShortPixelTypes(
      image.dataType, reference.dataType, out.dataType, [&]<class In, class Ref, class Out>() {
        Image<In, Ref, Out>(parameters, image, reference, imageMask, referenceMask, out);
      });
}

}  // namespace orvik::reference
