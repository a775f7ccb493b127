#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "basic/tessel/clipto.h"
#include "basic/tessel/plaincast.h"

namespace orvik::tessel {
namespace {

using PixelTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;
using IntegerTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int,
                                      std::int64_t, std::uint64_t>;

/// Calls `test` with a value of each type of the list.
template <class... Types, class Test>
void ForEachType(::testing::Types<Types...>, const Test& test) {
  (test(Types{}), ...);
}

// ---- the definition, slow and spelled out

__extension__ using Wide = __int128;
using Real = long double;  // holds every integer of 64 bits and every double

constexpr Wide Power(int exponent) { return Wide{1} << exponent; }

constexpr Wide Lowest(bool isSigned, int bits) { return isSigned ? -Power(bits - 1) : 0; }
constexpr Wide Highest(bool isSigned, int bits) { return Power(isSigned ? bits - 1 : bits) - 1; }

template <class T>
constexpr int kBits = 8 * sizeof(T);
template <class T>
constexpr bool kIsSigned = std::is_signed_v<T>;

/// The low bits of a value, read as an `Out`.
template <class Out>
Out LowBits(Wide value) {
  Wide low = value % Power(kBits<Out>);
  if (low < 0) low += Power(kBits<Out>);
  if (low > Highest(kIsSigned<Out>, kBits<Out>)) low -= Power(kBits<Out>);
  return static_cast<Out>(low);
}

/// What the processor makes of a value in a conversion to a signed integer of `bits` bits.
Wide Truncated(Real value, int bits) {
  if (std::isnan(value)) return Lowest(true, bits);
  const Real whole = std::trunc(value);
  if (whole < static_cast<Real>(Lowest(true, bits)) || whole > static_cast<Real>(Highest(true, bits)))
    return Lowest(true, bits);
  return static_cast<Wide>(whole);
}

template <class Out>
Out SlowTruncate(Real value) {
  if (std::is_same_v<Out, std::uint64_t>) {
    const Real topBit = static_cast<Real>(Power(63));
    if (value >= topBit) return LowBits<Out>(Truncated(value - topBit, 64) + Power(63));
    return LowBits<Out>(Truncated(value, 64));
  }
  const bool by64 = std::is_same_v<Out, unsigned int> || std::is_same_v<Out, std::int64_t>;
  return LowBits<Out>(Truncated(value, by64 ? 64 : 32));
}

enum class Rounding { kNone, kUp, kAwayFromZero };

/// A row of the table for floating values.
template <class Value>
struct FloatingRow {
  Rounding rounding;
  Value upper;
  Value lower;
  bool lowerIsHit;  // at the lower bound already, which is tested first then
};

template <class Value>
FloatingRow<Value> RowOf(char) {
  return {Rounding::kAwayFromZero, 127, -128, false};
}
template <class Value>
FloatingRow<Value> RowOf(unsigned char) {
  return {Rounding::kUp, 255, 0, true};
}
template <class Value>
FloatingRow<Value> RowOf(short) {
  return {Rounding::kAwayFromZero, 32767, -32768, false};
}
template <class Value>
FloatingRow<Value> RowOf(unsigned short) {
  return {Rounding::kUp, 65535, 0, true};
}
template <class Value>
FloatingRow<Value> RowOf(int) {
  return {Rounding::kAwayFromZero, static_cast<Value>(2147483647), static_cast<Value>(-2147483648LL), false};
}
template <class Value>
FloatingRow<Value> RowOf(unsigned int) {
  return {Rounding::kUp, static_cast<Value>(4294967295U), 0, true};
}
template <class Value>
FloatingRow<Value> RowOf(std::int64_t) {
  return {Rounding::kNone, static_cast<Value>(0x1p63), 0, true};
}
template <class Value>
FloatingRow<Value> RowOf(std::uint64_t) {
  return {Rounding::kNone, static_cast<Value>(0x1p64), 0, true};
}

template <class Out, class Value>
Out SlowClipFloating(Value v) {
  const FloatingRow<Value> row = RowOf<Value>(Out{});
  const Value half = static_cast<Value>(0.5);
  if (row.rounding == Rounding::kUp) v = v + half;
  if (row.rounding == Rounding::kAwayFromZero) v = v >= 0 ? v + half : v - half;
  if (row.lowerIsHit && v <= row.lower) return 0;
  if (v >= row.upper) return std::numeric_limits<Out>::max();
  if (!row.lowerIsHit && v < row.lower) return std::numeric_limits<Out>::min();
  return SlowTruncate<Out>(static_cast<Real>(v));
}

/// The conversion of an integer of `fromBits` bits to one of `toBits` bits, before the low bits are taken.
Wide SlowClipWide(Wide v, bool fromSigned, int fromBits, bool toSigned, int toBits) {
  const Wide highest = Highest(toSigned, toBits);
  const bool narrower = toBits < fromBits;
  if (fromSigned == toSigned && fromBits == toBits) return v;
  if (!fromSigned) return v >= highest ? highest : v;
  if (fromBits == 64 && narrower) return v >= highest ? highest : v;
  if (!toSigned || toBits == 64) {
    if (v < 1) return 0;
    return narrower && v >= highest ? highest : v;
  }
  if (!narrower) return v;
  if (v >= highest) return highest;
  return v < Lowest(toSigned, toBits) ? Lowest(toSigned, toBits) : v;
}

template <class Out, class Value>
Out SlowClip(Value v) {
  if constexpr (std::is_floating_point_v<Out>) {
    return static_cast<Out>(v);
  } else if constexpr (std::is_floating_point_v<Value>) {
    return SlowClipFloating<Out>(v);
  } else {
    return LowBits<Out>(SlowClipWide(v, kIsSigned<Value>, kBits<Value>, kIsSigned<Out>, kBits<Out>));
  }
}

template <class Out, class Value>
Out SlowCast(Value v) {
  if constexpr (std::is_floating_point_v<Out>) {
    return static_cast<Out>(v);
  } else if constexpr (std::is_floating_point_v<Value>) {
    return SlowTruncate<Out>(static_cast<Real>(v));
  } else {
    return LowBits<Out>(v);
  }
}

// ---- the values of the sweeps

template <class Value>
void AddNeighbourhood(std::vector<Value>& values, Value centre) {
  constexpr Value infinity = std::numeric_limits<Value>::infinity();
  Value down = centre;
  Value up = centre;
  values.push_back(centre);
  for (int step = 0; step < 4; ++step) {
    values.push_back(down = std::nextafter(down, -infinity));
    values.push_back(up = std::nextafter(up, infinity));
  }
}

/// The bounds of all types and their halves, powers of two, ties, the special values, and random bits.
template <class Value>
std::vector<Value> FloatingValues() {
  using Bits = std::conditional_t<sizeof(Value) == 4, std::uint32_t, std::uint64_t>;
  using Limits = std::numeric_limits<Value>;
  std::vector<Value> values = {Limits::quiet_NaN(), -Limits::quiet_NaN(), Limits::infinity(),
                               -Limits::infinity(), Limits::denorm_min(), -Limits::denorm_min(),
                               Limits::min(),       -Limits::min(),       Limits::max(),
                               Limits::lowest()};
  for (const Value sign : {Value{1}, Value{-1}}) {
    for (const float offset : {-1.5f, -1.0f, -0.5f, 0.0f, 0.5f, 1.0f, 1.5f}) {
      for (const int exponent : {7, 8, 15, 16, 23, 24, 31, 32, 52, 53, 62, 63, 64})
        AddNeighbourhood<Value>(values, sign * (std::ldexp(Value{1}, exponent) + offset));
    }
    for (int exponent = -30; exponent <= 127; ++exponent)
      AddNeighbourhood<Value>(values, sign * std::ldexp(Value{1}, exponent));
    for (int half = 0; half <= 600; ++half)
      AddNeighbourhood<Value>(values, sign * static_cast<Value>(half) * static_cast<Value>(0.5));
    for (int half = 65000; half <= 66000; ++half)
      AddNeighbourhood<Value>(values, sign * static_cast<Value>(half) * static_cast<Value>(0.5));
  }
  std::mt19937_64 random(3);
  std::uniform_real_distribution<Value> exponents(0, 66);
  for (int i = 0; i < 50000; ++i) {
    const Bits bits = static_cast<Bits>(random());
    Value value;
    std::memcpy(&value, &bits, sizeof(value));
    values.push_back(value);
    values.push_back((bits & 1 ? 1 : -1) * std::exp2(exponents(random)));
  }
  return values;
}

/// All values of 8 and 16 bits; of wider types those around 0, around every power of two and at the limits.
template <class Value>
std::vector<Value> IntegerValues() {
  std::vector<Value> values;
  if constexpr (sizeof(Value) <= 2) {
    for (int v = std::numeric_limits<Value>::min(); v <= std::numeric_limits<Value>::max(); ++v)
      values.push_back(static_cast<Value>(v));
  } else {
    for (int exponent = 0; exponent <= 64; ++exponent)
      for (int offset = -300; offset <= 300; ++offset)
        for (const int sign : {1, -1}) values.push_back(LowBits<Value>(sign * (Power(exponent) + offset)));
    std::mt19937_64 random(4);
    for (int i = 0; i < 50000; ++i) values.push_back(static_cast<Value>(random() >> (random() % 64)));
  }
  return values;
}

template <class Value>
std::vector<Value> ValuesOf() {
  if constexpr (std::is_floating_point_v<Value>) {
    return FloatingValues<Value>();
  } else {
    return IntegerValues<Value>();
  }
}

/// Equal bits, any NaN for a NaN.
template <class T>
bool Same(T a, T b) {
  if constexpr (std::is_floating_point_v<T>) {
    if (std::isnan(a) || std::isnan(b)) return std::isnan(a) && std::isnan(b);
  }
  return std::memcmp(&a, &b, sizeof(T)) == 0;
}

template <class Value>
std::string Printed(Value v) {
  if constexpr (std::is_floating_point_v<Value>) {
    char text[64];
    std::snprintf(text, sizeof(text), "%a = %.17g", static_cast<double>(v), static_cast<double>(v));
    return text;
  } else {
    return std::to_string(v);
  }
}

/// Compares `fast` and `slow` over the values of the sweep.
template <class Value, class Fast, class Slow>
void Sweep(const Fast& fast, const Slow& slow) {
  for (const Value v : ValuesOf<Value>())
    ASSERT_TRUE(Same(fast(v), slow(v)))
        << Printed(v) << ": " << Printed(fast(v)) << ", expected " << Printed(slow(v));
}

// ---- golden: ClipTo of floating values, a test for each row of the table

constexpr float kNan = std::numeric_limits<float>::quiet_NaN();
constexpr double kNanDouble = std::numeric_limits<double>::quiet_NaN();
constexpr float kInfinity = std::numeric_limits<float>::infinity();

/// The last `float` or `double` below a value.
template <class Value>
Value Below(Value v) {
  return std::nextafter(v, -std::numeric_limits<Value>::infinity());
}

TEST(ClipTo, CharOfMinus128Point4IsMinus128BelowTheBound) { EXPECT_EQ(ClipTo<char>(-128.4f), -128); }

TEST(ClipTo, CharOfMinus128IsMinus128ThroughTheLowerBound) { EXPECT_EQ(ClipTo<char>(-128.0f), -128); }

TEST(ClipTo, CharOf126Point6Is127) { EXPECT_EQ(ClipTo<char>(126.6f), 127); }

TEST(ClipTo, CharRoundsHalvesAwayFromZeroAndIsClampedAtBothEnds) {
  EXPECT_EQ(ClipTo<char>(0.5f), 1);
  EXPECT_EQ(ClipTo<char>(-0.5f), -1);
  EXPECT_EQ(ClipTo<char>(0.49f), 0);
  EXPECT_EQ(ClipTo<char>(-0.49f), 0);
  EXPECT_EQ(ClipTo<char>(126.49f), 126);
  EXPECT_EQ(ClipTo<char>(-127.49f), -127);
  EXPECT_EQ(ClipTo<char>(-127.5f), -128);
  EXPECT_EQ(ClipTo<char>(1e30f), 127);
  EXPECT_EQ(ClipTo<char>(-1e30f), -128);
  EXPECT_EQ(ClipTo<char>(kInfinity), 127);
  EXPECT_EQ(ClipTo<char>(-kInfinity), -128);
}

TEST(ClipTo, UnsignedCharOfMinus0Point3Is0ByTruncationOf0Point2) {
  EXPECT_EQ(ClipTo<unsigned char>(-0.3f), 0);
}

TEST(ClipTo, UnsignedCharOf254Point5Is255) { EXPECT_EQ(ClipTo<unsigned char>(254.5f), 255); }

TEST(ClipTo, UnsignedCharRoundsUpAndIsClampedAtBothEnds) {
  EXPECT_EQ(ClipTo<unsigned char>(0.5f), 1);
  EXPECT_EQ(ClipTo<unsigned char>(-0.5f), 0);
  EXPECT_EQ(ClipTo<unsigned char>(254.49f), 254);
  EXPECT_EQ(ClipTo<unsigned char>(1e30), 255);
  EXPECT_EQ(ClipTo<unsigned char>(-1e30), 0);
}

TEST(ClipTo, ShortRoundsHalvesAwayFromZeroAndIsClampedAtBothEnds) {
  EXPECT_EQ(ClipTo<short>(2.5), 3);
  EXPECT_EQ(ClipTo<short>(-2.5), -3);
  EXPECT_EQ(ClipTo<short>(32766.5f), 32767);
  EXPECT_EQ(ClipTo<short>(40000.0f), 32767);
  EXPECT_EQ(ClipTo<short>(-32768.4f), -32768);
  EXPECT_EQ(ClipTo<short>(-40000.0f), -32768);
}

TEST(ClipTo, UnsignedShortRoundsUpAndIsClampedAtBothEnds) {
  EXPECT_EQ(ClipTo<unsigned short>(2.5), 3);
  EXPECT_EQ(ClipTo<unsigned short>(65534.5f), 65535);
  EXPECT_EQ(ClipTo<unsigned short>(70000.0f), 65535);
  EXPECT_EQ(ClipTo<unsigned short>(-0.5f), 0);
  EXPECT_EQ(ClipTo<unsigned short>(-70000.0f), 0);
}

TEST(ClipTo, IntRoundsHalvesAwayFromZeroAndIsClampedAtBothEnds) {
  EXPECT_EQ(ClipTo<int>(5.9), 6);
  EXPECT_EQ(ClipTo<int>(-5.5), -6);
  EXPECT_EQ(ClipTo<int>(2147483646.4), 2147483646);
  EXPECT_EQ(ClipTo<int>(2147483646.5), 2147483647);
  EXPECT_EQ(ClipTo<int>(3e9), 2147483647);
  EXPECT_EQ(ClipTo<int>(-2147483648.4), -2147483647 - 1);
  EXPECT_EQ(ClipTo<int>(-3e9), -2147483647 - 1);
}

TEST(ClipTo, TheUpperBoundOfIntIsTwoToThe31InFloat) {
  EXPECT_EQ(ClipTo<int>(2147483648.0f), 2147483647);
  EXPECT_EQ(ClipTo<int>(Below(2147483648.0f)), 2147483520);
  EXPECT_EQ(ClipTo<int>(-2147483648.0f), -2147483647 - 1);
}

TEST(ClipTo, TheHalfIsAddedInTheTypeOfTheValue) {
  EXPECT_EQ(ClipTo<int>(8388609.0f), 8388610);
  EXPECT_EQ(ClipTo<int>(8388609.0), 8388609);
  EXPECT_EQ(ClipTo<int>(-8388609.0f), -8388610);
  EXPECT_EQ(ClipTo<char>(std::nextafter(0.5f, 0.0f)), 1);
  EXPECT_EQ(ClipTo<char>(static_cast<double>(std::nextafter(0.5f, 0.0f))), 0);
}

TEST(ClipTo, UnsignedIntRoundsUpAndIsClampedAtBothEnds) {
  EXPECT_EQ(ClipTo<unsigned int>(5.5), 6u);
  EXPECT_EQ(ClipTo<unsigned int>(4294967294.4), 4294967294u);
  EXPECT_EQ(ClipTo<unsigned int>(3e9f), 3000000000u);
  EXPECT_EQ(ClipTo<unsigned int>(1e10), 4294967295u);
  EXPECT_EQ(ClipTo<unsigned int>(-0.5), 0u);
  EXPECT_EQ(ClipTo<unsigned int>(-1e10), 0u);
}

TEST(ClipTo, UnsignedIntOf4294967295InDoubleIs4294967295ThroughTheUpperBound) {
  EXPECT_EQ(ClipTo<unsigned int>(4294967295.0), 4294967295u);
}

TEST(ClipTo, TheUpperBoundOfUnsignedIntIsTwoToThe32InFloat) {
  EXPECT_EQ(ClipTo<unsigned int>(4294967296.0f), 4294967295u);
  EXPECT_EQ(ClipTo<unsigned int>(Below(4294967296.0f)), 4294967040u);
}

TEST(ClipTo, The64BitOutputsDoNotRoundAndANegativeValueGives0InA64BitSignedOutput) {
  // Deliberate: the 64-bit outputs do not round, and a negative value gives 0 in a 64-bit signed output.
  EXPECT_EQ(ClipTo<std::int64_t>(-5.0), 0);
  EXPECT_EQ(ClipTo<std::int64_t>(-5.0f), 0);
  EXPECT_EQ(ClipTo<std::int64_t>(5.9), 5);
  EXPECT_EQ(ClipTo<std::int64_t>(5.9f), 5);
  EXPECT_EQ(ClipTo<std::uint64_t>(5.9), 5u);
  EXPECT_EQ(ClipTo<std::uint64_t>(5.9f), 5u);
  EXPECT_EQ(ClipTo<std::uint64_t>(-5.0), 0u);
}

TEST(ClipTo, The64BitOutputsAreClampedAbove) {
  EXPECT_EQ(ClipTo<std::int64_t>(0x1p63), std::numeric_limits<std::int64_t>::max());
  EXPECT_EQ(ClipTo<std::int64_t>(0x1p63f), std::numeric_limits<std::int64_t>::max());
  EXPECT_EQ(ClipTo<std::int64_t>(Below(0x1p63)), 9223372036854774784);
  EXPECT_EQ(ClipTo<std::int64_t>(-kInfinity), 0);
  EXPECT_EQ(ClipTo<std::uint64_t>(0x1p64), std::numeric_limits<std::uint64_t>::max());
  EXPECT_EQ(ClipTo<std::uint64_t>(0x1p64f), std::numeric_limits<std::uint64_t>::max());
  EXPECT_EQ(ClipTo<std::uint64_t>(Below(0x1p64)), 18446744073709549568u);
}

TEST(ClipTo, A64BitUnsignedValueFromTwoToThe63OnKeepsItsTopBit) {
  EXPECT_EQ(ClipTo<std::uint64_t>(0x1p63), 0x8000000000000000u);
  EXPECT_EQ(ClipTo<std::uint64_t>(0x1.8p63), 0xC000000000000000u);
  EXPECT_EQ(ClipTo<std::uint64_t>(Below(0x1p63)), 0x7FFFFFFFFFFFFC00u);
}

TEST(ClipTo, FloatingOutputsAreAPlainConversion) {
  EXPECT_TRUE(Same(ClipTo<float>(-0.0f), -0.0f));
  EXPECT_EQ(ClipTo<float>(0.1), 0.1f);
  EXPECT_EQ(ClipTo<double>(0.1f), static_cast<double>(0.1f));
  EXPECT_EQ(ClipTo<float>(1e300), kInfinity);
  EXPECT_TRUE(std::isnan(ClipTo<float>(kNanDouble)));
  EXPECT_TRUE(std::isnan(ClipTo<double>(kNan)));
}

TEST(ClipTo, ANaNGivesTheIndefiniteIntegerCutToTheOutput) {
  EXPECT_EQ(ClipTo<char>(kNan), 0);
  EXPECT_EQ(ClipTo<unsigned char>(kNan), 0);
  EXPECT_EQ(ClipTo<short>(kNan), 0);
  EXPECT_EQ(ClipTo<unsigned short>(kNan), 0);
  EXPECT_EQ(ClipTo<int>(kNan), -2147483647 - 1);
  EXPECT_EQ(ClipTo<unsigned int>(kNan), 0u);
  EXPECT_EQ(ClipTo<std::int64_t>(kNan), std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ(ClipTo<std::uint64_t>(kNan), 0x8000000000000000u);
  EXPECT_EQ(ClipTo<int>(kNanDouble), -2147483647 - 1);
  EXPECT_EQ(ClipTo<std::uint64_t>(kNanDouble), 0x8000000000000000u);
}

// ---- golden: ClipTo of integer values, a test for each row of the table

TEST(ClipTo, AnIntegerOfTheSameTypeKeepsItsValue) {
  EXPECT_EQ(ClipTo<char>(char{-128}), -128);
  EXPECT_EQ(ClipTo<int>(-5), -5);
  EXPECT_EQ(ClipTo<std::int64_t>(std::int64_t{-5}), -5);
  EXPECT_EQ(ClipTo<std::uint64_t>(~std::uint64_t{0}), ~std::uint64_t{0});
}

TEST(ClipTo, AnIntegerGoesToFloatAndDoubleByThePlainConversion) {
  EXPECT_EQ(ClipTo<float>(-16777217), -16777216.0f);
  EXPECT_EQ(ClipTo<double>(std::int64_t{-5}), -5.0);
  EXPECT_EQ(ClipTo<float>(~std::uint64_t{0}), 0x1p64f);
}

TEST(ClipTo, ASignedIntegerIsClampedAtBothEndsOfANarrowerSignedType) {
  EXPECT_EQ(ClipTo<char>(short{126}), 126);
  EXPECT_EQ(ClipTo<char>(short{127}), 127);
  EXPECT_EQ(ClipTo<char>(short{300}), 127);
  EXPECT_EQ(ClipTo<char>(short{-128}), -128);
  EXPECT_EQ(ClipTo<char>(short{-129}), -128);
  EXPECT_EQ(ClipTo<short>(-70000), -32768);
}

TEST(ClipTo, ASignedIntegerBelow1Gives0InAnUnsignedType) {
  EXPECT_EQ(ClipTo<unsigned char>(short{0}), 0);
  EXPECT_EQ(ClipTo<unsigned char>(short{-1}), 0);
  EXPECT_EQ(ClipTo<unsigned char>(short{1}), 1);
  EXPECT_EQ(ClipTo<unsigned char>(short{255}), 255);
  EXPECT_EQ(ClipTo<unsigned char>(short{256}), 255);
  EXPECT_EQ(ClipTo<unsigned char>(char{-1}), 0);
  EXPECT_EQ(ClipTo<unsigned int>(char{-1}), 0u);
  EXPECT_EQ(ClipTo<std::uint64_t>(-1), 0u);
}

TEST(ClipTo, ANarrowerSignedIntegerBelow1Gives0In64BitSigned) {
  EXPECT_EQ(ClipTo<std::int64_t>(char{-1}), 0);
  EXPECT_EQ(ClipTo<std::int64_t>(char{0}), 0);
  EXPECT_EQ(ClipTo<std::int64_t>(char{1}), 1);
  EXPECT_EQ(ClipTo<std::int64_t>(-5), 0);
}

TEST(ClipTo, AnUnsignedIntegerIsClampedAtTheUpperEndOnly) {
  EXPECT_EQ(ClipTo<short>(static_cast<unsigned short>(32766)), 32766);
  EXPECT_EQ(ClipTo<short>(static_cast<unsigned short>(32767)), 32767);
  EXPECT_EQ(ClipTo<short>(static_cast<unsigned short>(40000)), 32767);
  EXPECT_EQ(ClipTo<char>(static_cast<unsigned char>(200)), 127);
  EXPECT_EQ(ClipTo<unsigned char>(70000u), 255);
  EXPECT_EQ(ClipTo<std::int64_t>(~std::uint64_t{0}), std::numeric_limits<std::int64_t>::max());
}

TEST(ClipTo, A64BitSignedIntegerIsClampedAboveAndANegativeValueKeepsItsLowBits) {
  // Deliberate: a negative value keeps its low bits.
  EXPECT_EQ(ClipTo<unsigned char>(std::int64_t{300}), 255);
  EXPECT_EQ(ClipTo<unsigned char>(std::int64_t{-1}), 255);
  EXPECT_EQ(ClipTo<unsigned char>(std::int64_t{-256}), 0);
  EXPECT_EQ(ClipTo<char>(std::int64_t{300}), 127);
  EXPECT_EQ(ClipTo<char>(std::int64_t{-129}), 127);
  EXPECT_EQ(ClipTo<short>(std::int64_t{-32769}), 32767);
  EXPECT_EQ(ClipTo<int>(std::numeric_limits<std::int64_t>::min()), 0);
  EXPECT_EQ(ClipTo<unsigned int>(std::int64_t{-1}), 4294967295u);
}

TEST(ClipTo, A64BitSignedIntegerBelow1Gives0In64BitUnsigned) {
  EXPECT_EQ(ClipTo<std::uint64_t>(std::int64_t{-1}), 0u);
  EXPECT_EQ(ClipTo<std::uint64_t>(std::int64_t{1}), 1u);
  EXPECT_EQ(ClipTo<std::uint64_t>(std::numeric_limits<std::int64_t>::max()), 0x7FFFFFFFFFFFFFFFu);
}

TEST(ClipTo, AnyOtherIntegerKeepsItsValue) {
  EXPECT_EQ(ClipTo<int>(char{-5}), -5);
  EXPECT_EQ(ClipTo<short>(static_cast<unsigned char>(200)), 200);
  EXPECT_EQ(ClipTo<std::int64_t>(4294967295u), 4294967295);
  EXPECT_EQ(ClipTo<unsigned short>(static_cast<unsigned char>(200)), 200);
}

// ---- golden: PlainCast

TEST(PlainCast, TruncatesTowardZero) {
  EXPECT_EQ(PlainCast<char>(-1.9f), -1);
  EXPECT_EQ(PlainCast<unsigned char>(254.9f), 254);
  EXPECT_EQ(PlainCast<int>(-5.9), -5);
  EXPECT_EQ(PlainCast<std::int64_t>(-5.9), -5);
}

TEST(PlainCast, KeepsTheLowBitsOfWhatFits32Bits) {
  EXPECT_EQ(PlainCast<unsigned char>(300.0f), 44);
  EXPECT_EQ(PlainCast<unsigned char>(-1.0f), 255);
  EXPECT_EQ(PlainCast<char>(200.0f), -56);
  EXPECT_EQ(PlainCast<unsigned short>(-1.0), 65535);
  EXPECT_EQ(PlainCast<short>(2147483647.0), -1);
}

TEST(PlainCast, AValueThat32BitsCannotHoldGivesTheLowestAndThenItsLowBits) {
  for (const double v : {2147483648.0, -2147483649.0, 1e300, -1e300, kNanDouble}) {
    EXPECT_EQ(PlainCast<char>(v), 0) << v;
    EXPECT_EQ(PlainCast<unsigned char>(v), 0) << v;
    EXPECT_EQ(PlainCast<short>(v), 0) << v;
    EXPECT_EQ(PlainCast<unsigned short>(v), 0) << v;
    EXPECT_EQ(PlainCast<int>(v), -2147483647 - 1) << v;
  }
  EXPECT_EQ(PlainCast<int>(-2147483648.9), -2147483647 - 1);
}

TEST(PlainCast, UnsignedIntGoesByWayOf64SignedBits) {
  EXPECT_EQ(PlainCast<unsigned int>(-1.0), 4294967295u);
  EXPECT_EQ(PlainCast<unsigned int>(4294967298.0), 2u);
  EXPECT_EQ(PlainCast<unsigned int>(kNan), 0u);
  EXPECT_EQ(PlainCast<unsigned int>(1e30), 0u);
  EXPECT_EQ(PlainCast<unsigned int>(-1e30), 0u);
}

TEST(PlainCast, SixtyFourBitSignedGivesTheLowestForWhatItCannotHold) {
  for (const double v : {0x1p63, -0x1.8p63, 1e300, kNanDouble})
    EXPECT_EQ(PlainCast<std::int64_t>(v), std::numeric_limits<std::int64_t>::min()) << v;
  EXPECT_EQ(PlainCast<std::int64_t>(Below(0x1p63)), 9223372036854774784);
}

TEST(PlainCast, SixtyFourBitUnsignedHoldsValuesFromTwoToThe63On) {
  EXPECT_EQ(PlainCast<std::uint64_t>(0x1.8p63), 0xC000000000000000u);
  EXPECT_EQ(PlainCast<std::uint64_t>(-1.0), ~std::uint64_t{0});
  EXPECT_EQ(PlainCast<std::uint64_t>(kNan), 0x8000000000000000u);
  EXPECT_EQ(PlainCast<std::uint64_t>(-1e30), 0x8000000000000000u);
  EXPECT_EQ(PlainCast<std::uint64_t>(0x1p64), 0u);
}

TEST(PlainCast, AnIntegerKeepsItsLowBitsOrIsExtendedByItsSign) {
  EXPECT_EQ(PlainCast<unsigned char>(-1), 255);
  EXPECT_EQ(PlainCast<char>(200), -56);
  EXPECT_EQ(PlainCast<std::uint64_t>(char{-1}), ~std::uint64_t{0});
  EXPECT_EQ(PlainCast<std::int64_t>(4294967295u), 4294967295);
}

TEST(PlainCast, GoesToTheNearestFloatAndDouble) {
  EXPECT_EQ(PlainCast<float>(16777217), 16777216.0f);
  EXPECT_EQ(PlainCast<float>(0.1), 0.1f);
  EXPECT_EQ(PlainCast<double>(~std::uint64_t{0}), 0x1p64);
  EXPECT_TRUE(std::isnan(PlainCast<float>(kNanDouble)));
}

// ---- differential

template <class Out>
class ClipToOf : public ::testing::Test {};
TYPED_TEST_SUITE(ClipToOf, PixelTypes);

TYPED_TEST(ClipToOf, AgreesWithTheTablesForEveryTypeOfValue) {
  using Out = TypeParam;
  ForEachType(PixelTypes(), [](auto type) {
    using Value = decltype(type);
    Sweep<Value>([](Value v) { return ClipTo<Out>(v); }, [](Value v) { return SlowClip<Out>(v); });
  });
}

template <class Out>
class PlainCastOf : public ::testing::Test {};
TYPED_TEST_SUITE(PlainCastOf, PixelTypes);

TYPED_TEST(PlainCastOf, AgreesWithTheDefinitionForEveryTypeOfValue) {
  using Out = TypeParam;
  ForEachType(PixelTypes(), [](auto type) {
    using Value = decltype(type);
    Sweep<Value>([](Value v) { return PlainCast<Out>(v); }, [](Value v) { return SlowCast<Out>(v); });
  });
}

}  // namespace
}  // namespace orvik::tessel
