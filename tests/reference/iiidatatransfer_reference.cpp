#include "tests/reference/iiidatatransfer_reference.h"

#include <cstdint>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using gridmill::details::IIIParams;

/// One axis of both rasters and both regions.
struct Axis {
  std::uint32_t inStart, inExtent;    ///< of the source region
  std::uint32_t outStart, outExtent;  ///< of the target region
  std::uint32_t inOrigin, outOrigin;  ///< of the rasters
  std::uint32_t inLength;             ///< of the input
};

/// The input coordinate of an output coordinate.
std::uint32_t Source(const Axis& axis, std::uint32_t p) {
  const double S = static_cast<double>(axis.outExtent) / static_cast<double>(axis.inExtent);
  const std::uint32_t t = p - axis.outStart + axis.outOrigin;
  double u = static_cast<double>(t) / S;
  u = u + static_cast<double>(axis.inStart);
  u = u - static_cast<double>(axis.inOrigin);
  u = u + 0.5;
  const std::int64_t last = std::int64_t{axis.inLength} - 1;
  std::int64_t source = TruncateToInt32(u);
  if (source < 0) source = 0;
  if (source > last) source = last;
  return static_cast<std::uint32_t>(source);
}

template <class In, class Out>
void Image(const IIIParams& p, const tessel::Raster& in, tessel::Raster& out) {
  const Axis horizontal = {p.inRegion[0], p.inRegion[2], p.outRegion[0], p.outRegion[2],
                           in.originX,    out.originX,   in.width};
  const Axis vertical = {p.inRegion[1], p.inRegion[3], p.outRegion[1], p.outRegion[3],
                         in.originY,    out.originY,   in.height};
  const std::uint32_t elements = in.dataType.isComplex ? 2 * in.channels : in.channels;
  for (std::uint32_t y = 0; y < out.height; ++y) {
    const std::uint32_t row = Source(vertical, y);
    for (std::uint32_t x = 0; x < out.width; ++x) {
      const std::uint32_t column = Source(horizontal, x);
      if (p.resampleType != 0) continue;
      for (std::uint32_t c = 0; c < elements; ++c) {
        Write(out, x, y, c, PlainCast<Out>(Read<In>(in, column, row, c)));
      }
    }
  }
}

}  // namespace

void IIIDataTransfer(const IIIParams& params, const tessel::DataType& readAs,
                     const tessel::DataType& writtenAs, const tessel::Raster& in, tessel::Raster& out) {
  tests::WithPixelTypes(readAs, writtenAs, [&]<class In, class Out>() { Image<In, Out>(params, in, out); });
}

void IIIDataTransfer(const IIIParams& params, const tessel::Raster& in, tessel::Raster& out) {
  IIIDataTransfer(params, in.dataType, out.dataType, in, out);
}

}  // namespace orvik::reference
