#include "processes/gridmill/kernels/bytecolours.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <limits>
#include <span>
#include <vector>

#include <gtest/gtest.h>

#include "processes/gridmill/kernels/syntheticblue.h"
#include "processes/gridmill/kernels/validrange.h"
#include "tests/support/random.h"

// What is made of bytes against the arithmetic in `double`, one pixel after the other: either the same bytes,
// or none.
namespace orvik::kernels {
namespace {

using Pixel = std::array<unsigned char, 3>;

const float kNaN = std::numeric_limits<float>::quiet_NaN();
const float kInfinity = std::numeric_limits<float>::infinity();
constexpr unsigned char kSentinel = 0xA5;

/// The parameters as a caller has them.
struct Rule {
  bool trims = false;
  int background[3] = {-1, -1, -1};
  float least[3] = {-kInfinity, -kInfinity, -kInfinity};  ///< of green, red and blue
  float greatest[3] = {kInfinity, kInfinity, kInfinity};
  Trim trim[3] = {{0.0f, 1.0f}, {0.0f, 1.0f}, {0.0f, 1.0f}};
  unsigned char written[3] = {11, 22, 33};

  ByteColours Colours() const {
    ByteColours colours{};
    for (std::size_t c = 0; c < 3; ++c) {
      colours.background[c] = background[c];
      colours.trim[c] = trim[c];
      colours.written[c] = written[c];
      if (c < 2) colours.range[c] = ValidRange(least[c], greatest[c]).Of<unsigned char>();
    }
    colours.least = least[2];
    colours.greatest = greatest[2];
    colours.trims = trims;
    return colours;
  }
};

// ---- one pixel

double SlowBlue(const Pixel& pixel) {
  const double s0 = pixel[0], s1 = pixel[1], s2 = pixel[2];
  return ((s0 * 0.873393) + 13.9054) - (s1 * 0.138254) - (s2 * 0.100616);
}

unsigned char SlowClip(double value) {
  const double rounded = value + 0.5;
  if (std::isnan(rounded) || rounded <= 0.0) return 0;
  if (rounded >= 255.0) return 255;
  return static_cast<unsigned char>(rounded);
}

bool IsBackground(const Rule& rule, const Pixel& pixel) {
  for (std::size_t c = 0; c < 3; ++c) {
    if (pixel[c] == rule.background[c]) return true;
    if (c < 2 && (rule.least[c] > pixel[c] || pixel[c] > rule.greatest[c])) return true;
  }
  const double blue = SlowBlue(pixel);
  return double{rule.least[2]} > blue || blue > double{rule.greatest[2]};
}

/// Red, green and blue.
Pixel SlowColours(const Rule& rule, const Pixel& pixel) {
  if (IsBackground(rule, pixel)) return {rule.written[0], rule.written[1], rule.written[2]};
  const double blue = SlowBlue(pixel);
  if (!rule.trims) return {pixel[1], pixel[0], SlowClip(std::clamp(blue, 0.0, 255.0))};
  unsigned char trimmed[2];
  for (std::size_t c = 0; c < 2; ++c) {
    const float value = (static_cast<float>(pixel[c]) - rule.trim[c].offset) * rule.trim[c].factor;
    trimmed[c] = SlowClip(value);
  }
  const double value = (blue - double{rule.trim[2].offset}) * double{rule.trim[2].factor};
  return {trimmed[1], trimmed[0], SlowClip(value)};
}

// ---- blocks

/// Makes pixels, of which some are background from the start. Returns what `Make` does.
bool ExpectColours(const Rule& rule, const std::vector<Pixel>& pixels, tests::Random& random) {
  const std::size_t count = pixels.size(), shift = random.Bits() % 4;
  unsigned char planes[3][kBlock];
  std::vector<unsigned char> valid(shift + count + 8, kSentinel), memory(shift + 3 * kBlock + 8, kSentinel);
  const auto bands = reinterpret_cast<unsigned char(*)[kBlock]>(memory.data() + shift);
  std::vector<unsigned char> expected = memory;
  const bool masks = random.Bits() % 2 == 0;
  for (std::size_t i = 0; i < count; ++i) {
    for (std::size_t c = 0; c < 3; ++c) planes[c][i] = pixels[i][c];
    valid[shift + i] = !masks || random.Bits() % 4 != 0;
    const Pixel excluded{rule.written[0], rule.written[1], rule.written[2]};
    const Pixel colours = valid[shift + i] != 0 ? SlowColours(rule, pixels[i]) : excluded;
    for (std::size_t c = 0; c < 3; ++c) expected[shift + c * kBlock + i] = colours[c];
  }
  const bool made = rule.Colours().Make(planes, valid.data() + shift, count, bands);
  for (std::size_t c = 0; c < 3 && made; ++c) {
    for (std::size_t i = 0; i < count; ++i) {
      const std::size_t at = shift + c * kBlock + i;
      EXPECT_EQ(int{memory[at]}, int{expected[at]})
          << "band " << c << " of (" << int{pixels[i][0]} << ", " << int{pixels[i][1]} << ", "
          << int{pixels[i][2]} << "), blue " << SlowBlue(pixels[i]) << ", from " << rule.least[2] << " to "
          << rule.greatest[2] << (rule.trims ? ", trim " : ", no trim ") << rule.trim[c].offset << ", "
          << rule.trim[c].factor;
      if (memory[at] != expected[at]) return made;
    }
    for (std::size_t i = count; i < kBlock; ++i) EXPECT_EQ(memory[shift + c * kBlock + i], kSentinel);
  }
  for (std::size_t i = 0; i < 8; ++i) EXPECT_EQ(valid[shift + count + i], kSentinel);
  return made;
}

Pixel AnyPixel(tests::Random& random) {
  Pixel pixel;
  for (auto& sample : pixel) sample = static_cast<unsigned char>(random.Bits());
  return pixel;
}

std::vector<Pixel> AnyPixels(std::size_t count, tests::Random& random) {
  std::vector<Pixel> pixels(count);
  for (Pixel& pixel : pixels) pixel = AnyPixel(random);
  return pixels;
}

float Uniform(float from, float to, tests::Random& random) {
  return from + (to - from) * static_cast<float>(random.Bits() % 65536) / 65536.0f;
}

// ---- ordinary rules

/// Ranges that hold most pixels, and factors that stretch.
Rule OrdinaryRule(bool trims, tests::Random& random) {
  Rule rule;
  rule.trims = trims;
  for (std::size_t c = 0; c < 3; ++c) {
    rule.background[c] = random.Bits() % 2 == 0 ? static_cast<int>(random.Bits() % 256) : -1;
    rule.least[c] = Uniform(0.0f, 60.0f, random);
    rule.greatest[c] = Uniform(120.0f, 255.0f, random);
    rule.trim[c] = {rule.least[c], Uniform(0.5f, 2.5f, random)};
    rule.written[c] = static_cast<unsigned char>(random.Bits());
  }
  return rule;
}

TEST(ByteColours, OrdinaryBlocksAreMadeNearlyAlways) {
  for (const bool trims : {false, true}) {
    tests::Random random(81);
    int made = 0;
    for (int block = 0; block < 300; ++block)
      made += ExpectColours(OrdinaryRule(trims, random), AnyPixels(kBlock, random), random);
    EXPECT_GT(made, trims ? 255 : 285) << "of 300" << (trims ? ", trimmed" : "");
  }
}

TEST(ByteColours, EveryCountOfPixels) {
  tests::Random random(82);
  int made = 0;
  for (std::size_t count = 0; count <= kBlock; ++count)
    made += ExpectColours(OrdinaryRule(count % 2 == 0, random), AnyPixels(count, random), random);
  EXPECT_GT(made, 230);
}

// ---- any rules

constexpr float kFactors[] = {0.0f, -0.0f, 1.0f, 0.5f,  2.55f, 10.0f, 100.0f, 1e3f,
                              1e4f, 1e6f,  -1.f, -0.3f, 1e-3f, 1e-6f, 1e-30f, 1e30f};
constexpr float kLimits[] = {0.0f,   -0.0f,    255.0f, 13.9054f, -1024.0f, 1024.0f, 5000.0f,
                             236.6f, -46.995f, 128.0f, 0.5f,     1e10f,    -1e10f,  3.4e38f};

float AnyFloat(std::span<const float> often, tests::Random& random) {
  const float special[] = {kNaN, kInfinity, -kInfinity};
  const auto draw = random.Bits() % 12;
  if (draw == 0) return special[random.Bits() % 3];
  if (draw < 5) return often[random.Bits() % often.size()];
  return Uniform(-30.0f, 270.0f, random);
}

Rule AnyRule(tests::Random& random) {
  const int backgrounds[] = {-1, 256, 300, 0, 7, 255, -249, std::numeric_limits<int>::min()};
  Rule rule;
  rule.trims = random.Bits() % 2 == 0;
  for (std::size_t c = 0; c < 3; ++c) {
    rule.background[c] = backgrounds[random.Bits() % std::size(backgrounds)];
    if (random.Bits() % 3 != 0) rule.least[c] = AnyFloat(kLimits, random);
    if (random.Bits() % 3 != 0) rule.greatest[c] = AnyFloat(kLimits, random);
    rule.trim[c].offset = AnyFloat(kLimits, random);
    const bool stretches = random.Bits() % 2 == 0;
    rule.trim[c].factor = stretches ? Uniform(-3.0f, 3.0f, random) : AnyFloat(kFactors, random);
    rule.written[c] = static_cast<unsigned char>(random.Bits());
  }
  return rule;
}

TEST(ByteColours, AnyRuleIsExactOrNotMade) {
  tests::Random random(83);
  int made = 0;
  for (int i = 0; i < 20000; ++i)
    made += ExpectColours(AnyRule(random), AnyPixels(random.Bits() % 24, random), random);
  EXPECT_GT(made, 4000);
}

TEST(ByteColours, EveryByteIsJudgedAndTrimmed) {
  tests::Random random(84);
  int made = 0;
  for (int i = 0; i < 2000; ++i) {
    Rule rule = AnyRule(random);
    // Blue is certain.
    rule.least[2] = rule.greatest[2] = kNaN;
    rule.trim[2] = {0.0f, 0.0f};
    std::vector<Pixel> pixels(kBlock);
    for (std::size_t s = 0; s < kBlock; ++s) {
      const auto sample = static_cast<unsigned char>(s);
      const auto other = static_cast<unsigned char>(255 - s);
      pixels[s] = {sample, other, sample};
    }
    rule.trims = true;
    made += ExpectColours(rule, pixels, random);
  }
  EXPECT_GT(made, 800);
}

TEST(ByteColours, TrimmedBytesRoundAtHalves) {
  tests::Random random(85);
  for (const float factor : {0.5f, 0.25f, -0.5f, 0.1f, 1.5f, std::nextafter(0.5f, 0.0f), 1.0f}) {
    for (const float offset : {0.0f, 0.5f, 1.0f, 200.5f, std::nextafter(0.5f, 0.0f), 254.49998f}) {
      Rule rule;
      rule.trims = true;
      rule.trim[0] = rule.trim[1] = {offset, factor};
      rule.trim[2] = {0.0f, 0.0f};
      std::vector<Pixel> pixels(kBlock);
      for (std::size_t s = 0; s < kBlock; ++s)
        pixels[s] = {static_cast<unsigned char>(s), static_cast<unsigned char>(s * 7), 0};
      EXPECT_TRUE(ExpectColours(rule, pixels, random)) << offset << ", " << factor;
    }
  }
}

// ---- close to a limit

/// Millionths of blue, exact: the factors have six decimals.
int Millionths(int s0, int s1, int s2) { return 873393 * s0 + 13905400 - 138254 * s1 - 100616 * s2; }

/// The pixels whose blue lies within so many millionths of a half, where rounding changes.
std::vector<Pixel> PixelsAtHalves(int distance) {
  std::vector<Pixel> pixels;
  for (int s0 = 0; s0 < 256; ++s0) {
    for (int s1 = 0; s1 < 256; ++s1) {
      for (int s2 = 0; s2 < 256; ++s2) {
        const int above = (Millionths(s0, s1, s2) + 100500000 + distance) % 1000000;
        if (above > 2 * distance) continue;
        pixels.push_back(
            {static_cast<unsigned char>(s0), static_cast<unsigned char>(s1), static_cast<unsigned char>(s2)});
      }
    }
  }
  return pixels;
}

TEST(ByteColours, BlueAtAHalfIsRoundedAsItIsInDouble) {
  tests::Random random(86);
  const std::vector<Pixel> pixels = PixelsAtHalves(100);
  ASSERT_GT(pixels.size(), 1000u);
  std::size_t exact = 0, refused = 0, made = 0;
  for (const Pixel& pixel : pixels) {
    exact += (Millionths(pixel[0], pixel[1], pixel[2]) + 100500000) % 1000000 == 0;
    for (const bool trims : {false, true}) {
      Rule rule;
      rule.trims = trims;
      (ExpectColours(rule, {pixel}, random) ? made : refused) += 1;
    }
  }
  EXPECT_GT(exact, 5u);
  EXPECT_GT(refused, 100u);
  EXPECT_GT(made, 100u);
}

/// A small distance of either sign, or none.
double SmallDistance(tests::Random& random) {
  constexpr double distances[] = {0.0, 1e-7, 1e-6, 1e-5, 2e-5, 3e-5, 5e-5, 1e-4, 2e-4, 4e-4, 1e-3};
  const double distance = distances[random.Bits() % std::size(distances)];
  return random.Bits() % 2 == 0 ? distance : -distance;
}

TEST(ByteColours, BlueAtAnEndOfItsRange) {
  tests::Random random(87);
  int made = 0;
  for (int i = 0; i < 20000; ++i) {
    std::vector<Pixel> pixels = AnyPixels(1 + random.Bits() % 3, random);
    Rule rule;
    const double blue = SlowBlue(pixels[0]);
    const auto end = static_cast<float>(blue + SmallDistance(random));
    const auto which = random.Bits() % 4;
    if (which != 0) rule.least[2] = end;
    if (which != 1) rule.greatest[2] = which == 2 ? std::nextafter(end, 1e3f) : end;
    if (which == 3) rule.greatest[2] = end + 40.0f;
    made += ExpectColours(rule, pixels, random);
  }
  EXPECT_GT(made, 1000);
}

TEST(ByteColours, TrimmedBlueAtAHalf) {
  tests::Random random(88);
  int made = 0;
  for (int i = 0; i < 20000; ++i) {
    const std::vector<Pixel> pixels = AnyPixels(1 + random.Bits() % 2, random);
    Rule rule;
    rule.trims = true;
    const float offsets[] = {0.0f, 13.9f, 100.0f, -50.0f, -1e3f, 1e4f, -1e5f, 1e6f};
    rule.trim[2].offset = offsets[random.Bits() % std::size(offsets)] + Uniform(0.0f, 1.0f, random);
    const double half = static_cast<double>(random.Bits() % 256) + 0.5 * (random.Bits() % 8 == 0 ? 0.0 : 1.0);
    const double value = half + SmallDistance(random);
    rule.trim[2].factor = static_cast<float>(value / (SlowBlue(pixels[0]) - rule.trim[2].offset));
    made += ExpectColours(rule, pixels, random);
  }
  EXPECT_GT(made, 1000);
}

TEST(ByteColours, EstimateOfTrimmedBlueOnTheOtherSideOfAHalf) {
  tests::Random random(89);
  int tried = 0;
  for (int i = 0; i < 60000; ++i) {
    const Pixel pixel = AnyPixel(random);
    const double blue = SlowBlue(pixel);
    const double off = EstimatedBlue(pixel[0], pixel[1], pixel[2]) - blue;
    if (std::fabs(off) < 2e-5) continue;
    ++tried;
    // The half lies between the two, close to the blue.
    const double limit = blue + 0.1 * off, half = random.Below(255) + 0.5;
    Rule rule;
    rule.trims = true;
    rule.trim[2].offset = static_cast<float>(limit - half / Uniform(2.0f, 500.0f, random));
    rule.trim[2].factor = static_cast<float>(half / (limit - rule.trim[2].offset));
    ExpectColours(rule, {pixel}, random);
  }
  EXPECT_GT(tried, 300);
}

TEST(ByteColours, BackgroundKeepsItsOrderAndOthersChangePlaces) {
  Rule rule;
  rule.background[2] = 9;
  unsigned char planes[3][kBlock] = {{10, 10, 10}, {20, 20, 20}, {30, 9, 30}}, bands[3][kBlock];
  unsigned char valid[] = {1, 1, 0};
  ASSERT_TRUE(rule.Colours().Make(planes, valid, 3, bands));
  const int blue = 17;  // 16.85591
  EXPECT_EQ((Pixel{bands[0][0], bands[1][0], bands[2][0]}), (Pixel{20, 10, blue}));
  EXPECT_EQ((Pixel{bands[0][1], bands[1][1], bands[2][1]}), (Pixel{11, 22, 33}));
  EXPECT_EQ((Pixel{bands[0][2], bands[1][2], bands[2][2]}), (Pixel{11, 22, 33}));
}

}  // namespace
}  // namespace orvik::kernels
