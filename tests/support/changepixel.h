#pragma once

#include <algorithm>
#include <cstddef>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/ichange.h"
#include "tests/support/images.h"

namespace orvik::tests {

/// Runs a change operator of either interface with one mask, the image's.
inline void Run(const changedetection::IChange& op, tessel::Raster* image, tessel::Raster* reference,
                tessel::Mask* mask, tessel::Raster* out) {
  op.Process(image, reference, mask, out);
}
inline void Run(const changedetection::IChangeProcessor& op, tessel::Raster* image, tessel::Raster* reference,
                tessel::Mask* mask, tessel::Raster* out) {
  op.Process(image, reference, mask, nullptr, out);
}

/// What the output's samples hold that an operator does not write.
inline constexpr int kUnwritten = 77;

/// The output pixel of `outChannels` samples for one pixel of either date. `Ref` is the reference's type.
template <class In, class Ref, class Out, class Operator>
std::vector<Out> ChangePixel(const Operator& op, const std::vector<In>& image,
                             const std::vector<Ref>& reference, std::size_t outChannels,
                             bool isValid = true) {
  Image<In> imageRaster({1, 1, static_cast<std::uint32_t>(image.size())});
  std::copy(image.begin(), image.end(), imageRaster.Elements());
  Image<Ref> referenceRaster({1, 1, static_cast<std::uint32_t>(reference.size())});
  std::copy(reference.begin(), reference.end(), referenceRaster.Elements());
  Image<Out> out({1, 1, static_cast<std::uint32_t>(outChannels)}, {}, static_cast<Out>(kUnwritten));
  tessel::Mask mask(1, 1, {}, isValid);
  Run(op, &imageRaster, &referenceRaster, &mask, &out);
  return {out.Elements(), out.Elements() + outChannels};
}

/// The same for dates of one type and one channel, and an output of one sample.
template <class In, class Out, class Operator>
Out ChangeSample(const Operator& op, In image, In reference, bool isValid = true) {
  return ChangePixel<In, In, Out>(op, std::vector<In>{image}, std::vector<In>{reference}, 1, isValid)[0];
}

}  // namespace orvik::tests
