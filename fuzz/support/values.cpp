#include "fuzz/support/values.h"

#include <cstring>
#include <limits>

#include "tests/support/changecases.h"
#include "tests/support/pixeltypes.h"

namespace orvik::fuzz {
namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kSpecial[] = {
    0.0,          -0.0,          0.5,          -0.5,         1.5,          2.5,          -2.5,
    0.1,          127.5,         254.5,        255.0,        255.5,        256.0,        300.0,
    -128.0,       -128.5,        -129.0,       32767.0,      32767.5,      -32768.5,     -32767.0,
    46341.0,      65535.0,       65535.5,      8388607.5,    8388609.0,    16777217.0,   100000.0,
    -100000.0,    2147483583.0,  2147483647.0, 2147483648.0, -2147483648., -2147483649., 4294967040.0,
    4294967295.0, 4294967296.0,  0x1p53 + 1.0, 0x1p63,       -0x1p63,      0x1p64,       1e-9,
    6e-10,        -1e-9,         1e-30,        1e-40,        1e-320,       1e20,         -1e20,
    3.4028235e38, -3.4028235e38, 1e300,        -1e300,       kInfinity,    -kInfinity,   kNaN};

double AnyBits(Bytes& bytes) {
  const std::uint64_t bits = bytes.Bits(8);
  double value;
  std::memcpy(&value, &bits, sizeof value);
  return value;
}

}  // namespace

double Value(Bytes& bytes) {
  const std::uint32_t kind = bytes.Below(8);
  if (kind < 4) return static_cast<double>(bytes.Below(256)) - (kind == 3 ? 128.0 : 0.0);
  if (kind < 6) return bytes.Pick(kSpecial);
  if (kind == 6) return static_cast<double>(bytes.Bits(3)) / 256.0 - 32768.0;
  return AnyBits(bytes);
}

std::vector<float> FloatValues(Bytes& bytes, std::size_t count) {
  std::vector<float> values(count);
  for (float& value : values) value = FloatValue(bytes);
  return values;
}

tessel::DataType PixelTypeOf(Bytes& bytes) { return bytes.Pick(tests::kPixelTypes).element; }

tessel::DataType ShortTypeOf(Bytes& bytes) { return bytes.Pick(tests::kShortPixelTypes).element; }

std::vector<int> Counts(Bytes& bytes, std::size_t bins) {
  constexpr int kLarge[] = {2147483647, 21474836, 21474837, 42949673, 1 << 30, -1, -1000};
  std::vector<int> counts(bins);
  for (int& count : counts) {
    const std::uint8_t byte = bytes.Byte();
    count = byte < 248 ? byte : kLarge[(byte - 248) % std::size(kLarge)];
  }
  return counts;
}

}  // namespace orvik::fuzz
