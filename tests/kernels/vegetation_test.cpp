#include "processes/gridmill/kernels/vegetation.h"

#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <random>
#include <sstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

// Each kernel against the formulas, one pixel after the other. What narrow integers may take as a short way
// is tried with every pair of bytes, with pairs that are close to each other, to zero and to the limits, and
// with random ones; with every pair of 16 bits where GRIDMILL_EXHAUSTIVE is set in the environment, which
// takes minutes.
namespace orvik::kernels {
namespace {

constexpr std::size_t kGroup = 16;
constexpr float kSentinel = -12345.0f;

enum Role { kBlue, kGreen, kRed, kEdge, kNir, kSwir1, kSwir2 };

double Limited(double v) {
  if (v > 1.0) return 1.0;
  if (v < -1.0) return -1.0;
  return v;
}

double SlowGemi(double R, double N) {
  const double D = (N + R) + 0.5;
  const double eta = D == 0.0 ? 0.0 : ((((N * N) - (R * R)) * 2.0) + (N * 1.5) + (R * 0.5)) / D;
  const double Q = 1.0 - R;
  return Q == 0.0 ? 0.0 : ((1.0 - (eta * 0.25)) * eta) - ((R - 0.125) / Q);
}

using Pixel = std::array<float, kBandRoles>;

double SlowIndex(std::size_t code, const Pixel& pixel) {
  const double B = pixel[kBlue], G = pixel[kGreen], R = pixel[kRed], E = pixel[kEdge], N = pixel[kNir];
  const double S1 = pixel[kSwir1], S2 = pixel[kSwir2];
  const double D = (N + R) + 0.5;
  const double twiceNPlus1 = N * 2.0 + 1.0;
  switch (code) {
    case 0:
      return G + R == 0.0 ? 0.0 : (G - R) / (G + R);
    case 1:
      return ((G + 255.0) - ((R + B) * 0.5)) * 0.5;
    case 2:
      return N - R;
    case 3:
      return R == 0.0 ? 0.0 : N / R;
    case 4:
      return N + R == 0.0 ? 0.0 : Limited((N - R) / (N + R));
    case 5:
      return N + R == 0.0 ? 0.0 : static_cast<float>(std::sqrt(((N - R) / (N + R)) + 0.5));
    case 6:
      return D == 0.0 ? 0.0 : Limited(((N - R) / D) * 1.5);
    case 7:
      return (((N + 1.0) * 2.0) - std::sqrt(twiceNPlus1 * twiceNPlus1 - ((N - R) * 8.0))) * 0.5;
    case 8:
      return SlowGemi(R, N);
    case 9:
      return B * -0.2848 + G * -0.2435 + R * -0.5436 + N * 0.7243 + S1 * 0.084 + S2 * -1.18;
    case 10:
      return R == 0.0 ? 0.0 : ((E - R) - ((E - G) * 0.2)) * (E / R);
    default:
      return (((N - G) * 1.2) - ((R - G) * 2.5)) * 1.2;
  }
}

/// The same bits, or both NaN.
template <class Value>
bool Same(Value a, Value b) {
  return std::memcmp(&a, &b, sizeof(Value)) == 0 || (std::isnan(a) && std::isnan(b));
}

/// A block of pixels as planes.
struct Block {
  BandPlanes bands = {};
  std::size_t count = 0;

  bool IsFull() const { return count == kBlock; }
  void Add(const Pixel& pixel) {
    for (std::size_t role = 0; role < kBandRoles; ++role) bands[role][count] = pixel[role];
    ++count;
  }
  Pixel At(std::size_t i) const {
    Pixel pixel;
    for (std::size_t role = 0; role < kBandRoles; ++role) pixel[role] = bands[role][i];
    return pixel;
  }
};

std::string Text(std::size_t code, const Pixel& pixel) {
  std::ostringstream text;
  text << "index " << code << " of";
  for (const float band : pixel) text << ' ' << band;
  return text.str();
}

template <class Value, class Row>
void ExpectRow(const Block& block, std::size_t code, Row row) {
  std::vector<Value> index(block.count + 2 * kGroup, Value{kSentinel});
  row(code, block.bands, block.count, index.data() + kGroup);
  for (std::size_t i = 0; i < block.count; ++i)
    ASSERT_TRUE(Same(index[kGroup + i], static_cast<Value>(SlowIndex(code, block.At(i)))))
        << Text(code, block.At(i)) << " is " << index[kGroup + i];
  for (std::size_t i = 0; i < kGroup; ++i) {
    ASSERT_EQ(index[i], kSentinel);
    ASSERT_EQ(index[kGroup + block.count + i], kSentinel);
  }
}

template <class Pixels>
void ExpectPixels(const Block& block, Pixels pixels) {
  std::vector<float> target(block.count * kVegetationIndices + 2 * kGroup, kSentinel);
  pixels(block.bands, block.count, target.data() + kGroup);
  for (std::size_t i = 0; i < block.count; ++i)
    for (std::size_t code = 0; code < kVegetationIndices; ++code) {
      const float index = target[kGroup + i * kVegetationIndices + code];
      ASSERT_TRUE(Same(index, static_cast<float>(SlowIndex(code, block.At(i)))))
          << Text(code, block.At(i)) << " is " << index;
    }
  for (std::size_t i = 0; i < kGroup; ++i) {
    ASSERT_EQ(target[i], kSentinel);
    ASSERT_EQ(target[target.size() - 1 - i], kSentinel);
  }
}

void ExpectGeneralKernels(const Block& block) {
  for (std::size_t code = 0; code < kVegetationIndices; ++code) {
    ExpectRow<double>(block, code, VegetationRow<double>);
    ExpectRow<float>(block, code, VegetationRow<float>);
  }
  ExpectPixels(block, VegetationPixels);
}

void ExpectNarrowKernels(const Block& block) {
  for (std::size_t code = 0; code < kVegetationIndices; ++code)
    ExpectRow<float>(block, code, NarrowVegetationRow);
  ExpectPixels(block, NarrowVegetationPixels);
}

std::vector<std::size_t> Counts() {
  std::vector<std::size_t> counts;
  for (std::size_t count = 0; count <= 70; ++count) counts.push_back(count);
  counts.insert(counts.end(), {127, 128, 129, 255, 256});
  return counts;
}

// ---- bands of any value

float AnyBand(std::mt19937& random) {
  using Limits = std::numeric_limits<float>;
  constexpr float special[] = {0.0f,
                               -0.0f,
                               1.0f,
                               -1.0f,
                               0.5f,
                               -0.5f,
                               -0.25f,
                               0.125f,
                               Limits::max(),
                               Limits::lowest(),
                               Limits::min(),
                               Limits::denorm_min(),
                               Limits::infinity(),
                               -Limits::infinity(),
                               Limits::quiet_NaN()};
  const auto bits = random();
  if (bits % 4 == 0) return special[bits / 4 % std::size(special)];
  if (bits % 4 == 1) return static_cast<float>(bits >> 8) * 0x1p-24f;  // a reflectance
  const float magnitude = std::exp2(static_cast<float>(bits % 4000) / 100.0f - 20.0f);
  return bits % 8 < 6 ? magnitude : -magnitude;
}

TEST(VegetationRow, IsTheFormulaInDoubleForEveryCount) {
  std::mt19937 random(21);
  for (const std::size_t count : Counts()) {
    Block block;
    while (block.count < count) {
      Pixel pixel;
      for (float& band : pixel) band = AnyBand(random);
      block.Add(pixel);
    }
    ASSERT_NO_FATAL_FAILURE(ExpectGeneralKernels(block));
  }
}

TEST(VegetationRow, IsTheFormulaInDoubleForManyPixels) {
  std::mt19937 random(22);
  for (int i = 0; i < 200; ++i) {
    Block block;
    while (!block.IsFull()) {
      Pixel pixel;
      for (float& band : pixel) band = AnyBand(random);
      if (random() % 8 == 0) pixel[kNir] = -pixel[kRed];
      if (random() % 8 == 0) pixel[kNir] = -pixel[kRed] - 0.5f;
      block.Add(pixel);
    }
    ASSERT_NO_FATAL_FAILURE(ExpectGeneralKernels(block));
  }
}

TEST(IndexReads, NamesTheBandsThatChangeAnIndex) {
  for (std::size_t code = 0; code < kVegetationIndices; ++code) {
    for (std::size_t role = 0; role < kBandRoles; ++role) {
      Pixel pixel = {0.11f, 0.23f, 0.31f, 0.43f, 0.53f, 0.61f, 0.71f};
      const double before = SlowIndex(code, pixel);
      pixel[role] += 0.07f;
      EXPECT_EQ(IndexReads(code, role), SlowIndex(code, pixel) != before) << Text(code, pixel);
    }
  }
}

// ---- narrow bands

/// Red and near infrared as given; the others depend on them.
Pixel NarrowPixel(int red, int nir, int lowest, int highest) {
  const auto within = [=](std::uint32_t mixed) {
    const auto range = static_cast<std::uint32_t>(highest - lowest + 1);
    return static_cast<float>(lowest + static_cast<int>((mixed >> 7) % range));
  };
  const std::uint32_t mixed = static_cast<std::uint32_t>(red) * 2654435761u ^ static_cast<std::uint32_t>(nir);
  return {within(mixed * 40503u),      within(mixed * 2246822519u), static_cast<float>(red),
          within(mixed * 3266489917u), static_cast<float>(nir),     within(mixed * 668265263u),
          within(mixed * 374761393u)};
}

/// Collects pixels and compares full blocks.
class NarrowChecker {
 public:
  NarrowChecker(int lowest, int highest) : lowest_(lowest), highest_(highest) {}

  void Add(int red, int nir) {
    if (red < lowest_ || red > highest_ || nir < lowest_ || nir > highest_) return;
    block_.Add(NarrowPixel(red, nir, lowest_, highest_));
    if (block_.IsFull()) Finish();
  }
  void Finish() {
    ASSERT_NO_FATAL_FAILURE(ExpectNarrowKernels(block_));
    block_.count = 0;
  }

 private:
  int lowest_;
  int highest_;
  Block block_;
};

struct Range {
  int lowest;
  int highest;
};
constexpr Range kRanges[] = {{-128, 127}, {0, 255}, {-32768, 32767}, {0, 65535}};

TEST(NarrowVegetationRow, IsTheFormulaForEveryPairOfBytes) {
  for (const Range& range : {kRanges[0], kRanges[1]}) {
    NarrowChecker checker(range.lowest, range.highest);
    for (int red = range.lowest; red <= range.highest; ++red)
      for (int nir = range.lowest; nir <= range.highest; ++nir)
        ASSERT_NO_FATAL_FAILURE(checker.Add(red, nir));
  }
}

TEST(NarrowVegetationRow, IsTheFormulaNearZeroAndLimitsAndForOppositeBands) {
  for (const Range& range : kRanges) {
    NarrowChecker checker(range.lowest, range.highest);
    std::vector<int> places = {0, 1, range.lowest, range.highest, range.lowest / 2, range.highest / 2};
    for (int power = 2; power <= range.highest; power *= 2) places.insert(places.end(), {power, -power});
    for (const int a : places)
      for (const int b : places)
        for (int i = -3; i <= 3; ++i)
          for (int k = -3; k <= 3; ++k) {
            ASSERT_NO_FATAL_FAILURE(checker.Add(a + i, b + k));
            ASSERT_NO_FATAL_FAILURE(checker.Add(a + i, -a + k));
            ASSERT_NO_FATAL_FAILURE(checker.Add(a + i, 3 * a + k));
          }
    ASSERT_NO_FATAL_FAILURE(checker.Finish());
  }
}

TEST(NarrowVegetationRow, IsTheFormulaForRandomBandsAndEveryCount) {
  std::mt19937 random(23);
  for (const Range& range : kRanges) {
    std::uniform_int_distribution<int> band(range.lowest, range.highest);
    for (const std::size_t count : Counts()) {
      Block block;
      while (block.count < count)
        block.Add(NarrowPixel(band(random), band(random), range.lowest, range.highest));
      ASSERT_NO_FATAL_FAILURE(ExpectNarrowKernels(block));
    }
    NarrowChecker checker(range.lowest, range.highest);
    for (int i = 0; i < 200000; ++i) ASSERT_NO_FATAL_FAILURE(checker.Add(band(random), band(random)));
  }
}

void ExpectEveryPair(const Range& range) {
  std::vector<float> target(kBlock * kVegetationIndices);
  for (int red = range.lowest; red <= range.highest; ++red) {
    for (int start = range.lowest; start <= range.highest; start += static_cast<int>(kBlock)) {
      Block block;
      for (int nir = start; !block.IsFull(); ++nir)
        block.Add(NarrowPixel(red, nir, range.lowest, range.highest));
      NarrowVegetationPixels(block.bands, kBlock, target.data());
      for (std::size_t i = 0; i < kBlock; ++i)
        for (std::size_t code = 0; code < kVegetationIndices; ++code) {
          const float index = target[i * kVegetationIndices + code];
          if (!Same(index, static_cast<float>(SlowIndex(code, block.At(i)))))
            FAIL() << Text(code, block.At(i)) << " is " << index;
        }
    }
  }
}

class EveryPair : public ::testing::TestWithParam<Range> {};

TEST_P(EveryPair, IsTheFormula) {
  if (std::getenv("GRIDMILL_EXHAUSTIVE") == nullptr) GTEST_SKIP() << "GRIDMILL_EXHAUSTIVE is not set";
  ExpectEveryPair(GetParam());
}

INSTANTIATE_TEST_SUITE_P(NarrowVegetationPixels, EveryPair, ::testing::Values(kRanges[2], kRanges[3]),
                         [](const auto& info) { return info.param.lowest < 0 ? "short" : "ushort"; });

// ---- pixels of four

template <class In>
class NarrowPixelRowOf : public ::testing::Test {};
using Shorts = ::testing::Types<short, unsigned short>;
TYPED_TEST_SUITE(NarrowPixelRowOf, Shorts);

TYPED_TEST(NarrowPixelRowOf, IsTheFormulaWhereverTheBandsAre) {
  using In = TypeParam;
  std::mt19937 random(24);
  std::size_t kernels = 0;
  for (std::size_t code = 0; code < kVegetationIndices; ++code) {
    if (!HasPixelRow(code)) continue;
    ++kernels;
    for (std::size_t places = 0; places < 64; ++places) {
      const NarrowPixelBands bands = {places % 4, places / 4 % 4, places / 16};
      const std::size_t count = places == 0 ? 5000 : random() % 150;
      std::vector<In> pixels(4 * count);
      for (In& sample : pixels) sample = static_cast<In>(random() >> (random() % 4 == 0 ? 29 : 8));
      std::vector<float> index(count + 2 * kGroup, kSentinel);
      NarrowPixelRow(code, pixels.data(), bands, count, index.data() + kGroup);
      for (std::size_t i = 0; i < count; ++i) {
        Pixel pixel = {};
        pixel[kGreen] = pixels[4 * i + bands.green];
        pixel[kRed] = pixels[4 * i + bands.red];
        pixel[kNir] = pixels[4 * i + bands.nir];
        ASSERT_TRUE(Same(index[kGroup + i], static_cast<float>(SlowIndex(code, pixel))))
            << Text(code, pixel) << " is " << index[kGroup + i];
      }
      for (std::size_t i = 0; i < kGroup; ++i) {
        ASSERT_EQ(index[i], kSentinel);
        ASSERT_EQ(index[kGroup + count + i], kSentinel);
      }
    }
  }
  EXPECT_EQ(kernels, 4u);
}

}  // namespace
}  // namespace orvik::kernels
