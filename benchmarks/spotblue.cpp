#include "processes/gridmill/spotblue.h"

#include <iterator>
#include <vector>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

std::vector<float> VectorOf(const float (&values)[3]) { return {std::begin(values), std::end(values)}; }

template <bool trim>
void NaturalColour(const Workload& work) {
  std::vector<float> min = VectorOf(kBlueMin);
  std::vector<float> max = VectorOf(kBlueMax);
  std::vector<float> scale = VectorOf(kBlueScale);
  std::vector<float> background = VectorOf(kBlueBackground);
  gridmill::SPOTBlue blue;
  blue.SetMin(min);
  blue.SetMax(max);
  blue.SetScale(scale);
  blue.SetBackGround(background);
  blue.SetTrim(trim);
  blue.Process(work.in.get(), work.mask.get(), work.out.get());
}

bool IsBackground(unsigned char sample, std::size_t c) {
  return static_cast<int>(sample) == static_cast<int>(kBlueBackground[c]);
}

bool IsOutside(unsigned char sample, std::size_t c) {
  const float value = sample;
  return kBlueMin[c] > value || value > kBlueMax[c];
}

unsigned char Stretched(unsigned char sample, std::size_t c) {
  return ToByte(static_cast<double>((sample - kBlueMin[c]) * kBlueScale[c]));
}

/// The pixel's natural colours; false for the background.
template <bool trim>
bool Colour(const unsigned char* source, unsigned char* target) {
  if (IsBackground(source[0], 0) || IsOutside(source[0], 0)) return false;
  if (IsBackground(source[1], 1) || IsOutside(source[1], 1)) return false;
  if (IsBackground(source[2], 2)) return false;
  double blue = source[0] * 0.873393 + 13.9054 - source[1] * 0.138254 - source[2] * 0.100616;
  if (kBlueMin[2] > blue || blue > kBlueMax[2]) return false;
  if (trim) {
    target[1] = Stretched(source[0], 0);
    target[0] = Stretched(source[1], 1);
    blue = (blue - kBlueMin[2]) * kBlueScale[2];
  } else {
    blue = blue < 0.0 ? 0.0 : blue > 255.0 ? 255.0 : blue;
    target[1] = source[0];
    target[0] = source[1];
  }
  target[2] = ToByte(blue);
  return true;
}

template <bool trim>
void NaiveNaturalColour(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* const source = RowOf<unsigned char>(*work.in, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      if (Colour<trim>(source + 3 * x, target + 3 * x)) continue;
      for (std::size_t c = 0; c < 3; ++c) target[3 * x + c] = static_cast<unsigned char>(kBlueBackground[c]);
    }
  }
}

constexpr Row kRows[] = {
    {.job = "natural colour",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Scene<unsigned char, unsigned char, 3, 3>,
     .gridmill = NaturalColour<false>,
     .naive = NaiveNaturalColour<false>,
     .opencv = OpenCvNaturalColour,
     .python = "natural_colour"},
    {.job = "natural colour, trim",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Scene<unsigned char, unsigned char, 3, 3>,
     .gridmill = NaturalColour<true>,
     .naive = NaiveNaturalColour<true>,
     .opencv = OpenCvTrimmedNaturalColour,
     .python = "natural_colour_trim"},
};

}  // namespace

std::span<const Row> SPOTBlueRows() { return kRows; }

}  // namespace orvik::bench
