#include "processes/gridmill/spotblue.h"

#include "fuzz/support/filtertarget.h"
#include "tests/reference/spotblue_reference.h"

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

struct Target : FilterDefaults {
  using Operator = gridmill::SPOTBlue;
  using Params = gridmill::details::BlueParams;
  static constexpr Rebuilds rebuilds = Rebuilds::kNever;
  static constexpr bool takesComplex = true;
  static constexpr bool writesComplex = true;

  /// Appends, and has an effect before the first call alone.
  static void Set(Bytes& bytes, Operator& op, std::uint32_t channels) {
    std::vector<float> min = FloatValues(bytes, 3), max = FloatValues(bytes, 3);
    for (std::size_t band = 0; band < 3; ++band) {
      if (bytes.OneIn(2)) min[band] = -3e38f;
      if (bytes.OneIn(2)) max[band] = 3e38f;
    }
    std::vector<float> scale = FloatValues(bytes, 3), background = FloatValues(bytes, channels + 3);
    op.SetMin(min);
    op.SetMax(max);
    op.SetScale(scale);
    op.SetBackGround(background);
    op.SetTrim(bytes.OneIn(2));
  }

  /// A triple needs a second sample.
  static std::uint32_t OutChannels(Bytes& bytes, const Shape& in) {
    constexpr std::uint32_t kChannels[] = {3, 1, 3, 2, 4, 5};
    const std::uint32_t channels = bytes.Pick(kChannels);
    return in.channels < 2 && channels == 3 ? 1 : channels;
  }
  static void Twin(const Params& params, const DataType& readAs, const DataType& writtenAs, const Raster& in,
                   const Mask* mask, Raster& out) {
    reference::SPOTBlue(params, readAs, writtenAs, in, mask, out);
  }
};

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::RunFilter<orvik::fuzz::Target>)
