#include "processes/gridmill/chandiffchange.h"

#include <cmath>
#include <cstdlib>
#include <iterator>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

using changedetection::ChanDiffChange;
using changedetection::eDIFF_ABSOLUTE;

constexpr unsigned char kNoData = 255;
constexpr float kImageNoData[] = {0.0f, 0.0f, 0.0f};
constexpr float kReferenceNoData[] = {0.0f, 0.0f, 0.0f};

void Difference(const Workload& work) {
  ChanDiffChange(eDIFF_ABSOLUTE)
      .Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

void ValidDifference(const Workload& work) {
  ChanDiffChange difference(eDIFF_ABSOLUTE);
  difference.SetNoData(kNoData);
  difference.SetImgNoData({std::begin(kImageNoData), std::end(kImageNoData)});
  difference.SetRefNoData({std::begin(kReferenceNoData), std::end(kReferenceNoData)});
  difference.Process(work.in.get(), work.reference.get(), work.mask.get(), work.out.get());
}

template <class Pixel>
Pixel SampleDifference(Pixel a, Pixel b) {
  return static_cast<Pixel>(std::abs(a - b));
}

template <class Pixel>
void NaiveDifference(const Workload& work) {
  const std::size_t samples = std::size_t{work.in->width} * work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const Pixel* const image = RowOf<Pixel>(*work.in, y);
    const Pixel* const reference = RowOf<Pixel>(*work.reference, y);
    Pixel* const target = RowOf<Pixel>(*work.twin, y);
    for (std::size_t i = 0; i < samples; ++i) target[i] = SampleDifference(image[i], reference[i]);
  }
}

void NaiveValidDifference(const Workload& work) {
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned char* const image = RowOf<unsigned char>(*work.in, y);
    const unsigned char* const reference = RowOf<unsigned char>(*work.reference, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) {
      const bool valid = IsValid(*work.mask, x, y);
      for (std::size_t c = 0; c < channels; ++c) {
        const std::size_t i = x * channels + c;
        if (!valid || image[i] == kImageNoData[c] || reference[i] == kReferenceNoData[c])
          target[i] = kNoData;
        else
          target[i] = SampleDifference(image[i], reference[i]);
      }
    }
  }
}

constexpr Row kRows[] = {
    {.job = "difference",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Dates<unsigned char, unsigned char, unsigned char, 3, 3>,
     .gridmill = Difference,
     .naive = NaiveDifference<unsigned char>,
     .opencv = OpenCvDifference},
    // With no-data as well; the peer runs without either.
    {.job = "difference, random mask",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Dates<unsigned char, unsigned char, unsigned char, 3, 3, MaskPattern::kRandom>,
     .gridmill = ValidDifference,
     .naive = NaiveValidDifference,
     .opencv = OpenCvDifference},
    {.job = "difference, mask in runs",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Dates<unsigned char, unsigned char, unsigned char, 3, 3, MaskPattern::kRuns>,
     .gridmill = ValidDifference,
     .naive = NaiveValidDifference,
     .opencv = OpenCvDifference},
    {.job = "difference",
     .types = "u16 x 4 -> u16 x 4",
     .workload = Dates<unsigned short, unsigned short, unsigned short, 4, 4>,
     .gridmill = Difference,
     .naive = NaiveDifference<unsigned short>,
     .opencv = OpenCvDifference},
    {.job = "difference",
     .types = "f32 -> f32",
     .workload = Dates<float, float, float, 1, 1>,
     .gridmill = Difference,
     .naive = NaiveDifference<float>,
     .opencv = OpenCvDifference},
};

}  // namespace

std::span<const Row> ChanDiffChangeRows() { return kRows; }

}  // namespace orvik::bench
