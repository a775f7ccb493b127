#include "tests/reference/rangeclasses_reference.h"

#include <cstddef>
#include <cstdint>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using gridmill::details::RangeClassesParams;

int ClassOf(const RangeClassesParams& p, float s) {
  const float fromNoData = s - p.noData;
  const double d = static_cast<double>(fromNoData);
  if (d > -1e-9 && d < 1e-9) return 0;
  int result = 0;
  for (int i = 0; i < p.classCount; ++i) {
    const std::size_t k = static_cast<std::size_t>(i);
    if (s > p.minRange[k] && p.maxRange[k] > s) result = i + 1;
  }
  return result;
}

}  // namespace

void RangeClasses(const RangeClassesParams& params, const tessel::Raster& in, tessel::Raster& out) {
  tests::WithPixelTypes(in.dataType, out.dataType, [&]<class In, class Out>() {
    for (std::uint32_t y = 0; y < in.height; ++y) {
      for (std::uint32_t x = 0; x < in.width; ++x) {
        const float s = static_cast<float>(Read<In>(in, x, y, 0));
        Write(out, 0, y, x, PlainCast<Out>(ClassOf(params, s)));
      }
    }
  });
}

}  // namespace orvik::reference
