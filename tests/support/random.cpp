#include "tests/support/random.h"

#include <cstring>
#include <limits>
#include <vector>

#include "tests/reference/conversions.h"
#include "tests/support/pixeltypes.h"

namespace orvik::tests {
namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

constexpr double kExtremes[] = {0.0,           -0.0,
                                1.0,           -1.0,
                                0.5,           -0.5,
                                1.5,           -1.5,
                                2.5,           0.49999997,
                                126.5,         127.5,
                                -128.5,        -129.0,
                                254.5,         255.5,
                                256.0,         300.0,
                                32766.5,       32767.5,
                                -32768.5,      65534.5,
                                65535.5,       8388607.5,
                                16777217.0,    2147483583.0,
                                2147483647.0,  2147483648.0,
                                -2147483648.,  -2147483649.,
                                4294967040.0,  4294967295.0,
                                4294967296.0,  9007199254740993.0,
                                0x1p63,        -0x1p63,
                                0x1p64,        0x1.fffffep62,
                                0x1.fffffep63, 1e-9,
                                -1e-9,         1e-40,
                                -1e-40,        1e-320,
                                1e-30,         1e30,
                                3.4028235e38,  -3.4028235e38,
                                1e300,         -1e300,
                                kInfinity,     -kInfinity,
                                kNaN};

template <class T>
T Extreme(Random& random) {
  switch (random.Below(16)) {
    case 0:
      return std::numeric_limits<T>::max();
    case 1:
      return std::numeric_limits<T>::lowest();
    case 2:
      return std::numeric_limits<T>::denorm_min();
    default:
      return reference::PlainCast<T>(random.Pick(kExtremes));
  }
}

/// A plane of gentle tilt that stays within 8 bits unsigned, with noise of up to 4.
struct Plane {
  double tiltX, tiltY;

  explicit Plane(Random& random) : tiltX(random.Below(300) / 100.0), tiltY(random.Below(300) / 100.0) {}
  double At(std::size_t index, std::size_t rowElements, Random& random) const {
    const double x = static_cast<double>(index % rowElements % 16);
    const double y = static_cast<double>(index / rowElements % 16);
    return 10.0 + tiltX * x + tiltY * y + random.Below(400) / 100.0;
  }
};

template <class T>
void FillSamples(tessel::Raster& raster, Fill fill, Random& random, std::span<const double> extra) {
  std::vector<T> samples(raster.dataSize / sizeof(T));
  const std::size_t rowElements = raster.bufferHeight == 0 ? 1 : samples.size() / raster.bufferHeight + 1;
  const Plane plane(random);
  for (std::size_t i = 0; i < samples.size(); ++i) {
    const bool extreme = fill == Fill::eEXTREMES || (fill == Fill::eMIXED && random.OneIn(12));
    if (!extra.empty() && random.OneIn(fill == Fill::eFEW ? 40 : 10)) {
      samples[i] = reference::PlainCast<T>(random.Pick(extra));
    } else if (fill == Fill::eBITS) {
      const std::uint64_t bits = random.Bits();
      std::memcpy(&samples[i], &bits, sizeof(T));
    } else if (extreme) {
      samples[i] = Extreme<T>(random);
    } else if (fill == Fill::eFEW) {
      samples[i] = static_cast<T>(random.Below(4));
    } else {
      samples[i] = static_cast<T>(plane.At(i, rowElements, random));
    }
  }
  if (!samples.empty()) std::memcpy(raster.data, samples.data(), samples.size() * sizeof(T));
}

}  // namespace

const char* NameOf(Fill fill) {
  constexpr const char* kNames[] = {"any bits", "extremes", "few values", "smooth", "mixed"};
  return kNames[static_cast<int>(fill)];
}

void FillRandom(tessel::Raster& raster, Fill fill, Random& random, std::span<const double> extra) {
  WithPixelType(raster.dataType, [&]<class T>() { FillSamples<T>(raster, fill, random, extra); });
}

}  // namespace orvik::tests
