#include "tests/support/compare.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <sstream>
#include <type_traits>

#include "tests/support/pixeltypes.h"

namespace orvik::tests {
namespace {

template <class T>
bool IsSame(T expected, T actual) {
  if constexpr (std::is_floating_point_v<T>) {
    if (std::isnan(expected)) return std::isnan(actual);
  }
  return std::memcmp(&expected, &actual, sizeof(T)) == 0;
}

template <class T>
void Print(std::ostream& stream, T value) {
  std::uint64_t bits = 0;
  std::memcpy(&bits, &value, sizeof(T));
  stream.precision(17);
  stream << +value << " (0x" << std::hex << bits << std::dec << ')';
}

template <class T>
std::string Describe(const tessel::Raster& raster, std::uint64_t element, T expected, T actual) {
  const std::uint64_t elements = std::max(1u, raster.channels * (raster.dataType.isComplex ? 2u : 1u));
  const std::uint64_t width = std::max(1u, raster.bufferWidth);
  const std::uint64_t pixel = element / elements;
  const auto x = static_cast<std::int64_t>(pixel % width) - raster.marginX;
  const auto y = static_cast<std::int64_t>(pixel / width) - raster.marginY;
  std::ostringstream stream;
  stream << NameOf(raster.dataType) << " of " << raster.width << " x " << raster.height << " x "
         << raster.channels << ", margins " << raster.marginX << ", " << raster.marginY << ": pixel (" << x
         << ", " << y << "), element " << element % elements << ": expected ";
  Print(stream, expected);
  stream << ", got ";
  Print(stream, actual);
  return stream.str();
}

template <class T>
::testing::AssertionResult SameSamples(const tessel::Raster& expected, const tessel::Raster& actual) {
  for (std::uint64_t i = 0; (i + 1) * sizeof(T) <= expected.dataSize; ++i) {
    T a, b;
    std::memcpy(&a, expected.data + i * sizeof(T), sizeof(T));
    std::memcpy(&b, actual.data + i * sizeof(T), sizeof(T));
    if (!IsSame(a, b)) return ::testing::AssertionFailure() << Describe(expected, i, a, b);
  }
  return ::testing::AssertionSuccess();
}

}  // namespace

::testing::AssertionResult SameBits(const tessel::Raster& expected, const tessel::Raster& actual) {
  if (expected.dataSize != actual.dataSize || expected.dataType != actual.dataType) {
    return ::testing::AssertionFailure() << "the rasters differ in shape or type";
  }
  ::testing::AssertionResult result = ::testing::AssertionSuccess();
  WithPixelType(expected.dataType, [&]<class T>() { result = SameSamples<T>(expected, actual); });
  return result;
}

}  // namespace orvik::tests
