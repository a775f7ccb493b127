#include "processes/gridmill/bitmapfiltering.h"

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

void Bitmap(const Workload& work) {
  filters::BitmapFiltering(kRangeFrom, kRangeTo).Process(work.in.get(), work.mask.get(), work.out.get());
}

bool IsInRange(float sample) { return sample >= kRangeFrom && kRangeTo >= sample; }

void NaiveBitmap(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const source = RowOf<unsigned short>(*work.in, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x) target[x] = IsInRange(source[x]) ? 1 : 0;
  }
}

void NaiveMaskedBitmap(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const unsigned short* const source = RowOf<unsigned short>(*work.in, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = IsValid(*work.mask, x, y) && IsInRange(source[x]) ? 1 : 0;
  }
}

constexpr Row kRows[] = {
    {.job = "bitmap",
     .types = "u16 -> u8",
     .workload = Speckle<unsigned short, unsigned char>,
     .gridmill = Bitmap,
     .naive = NaiveBitmap,
     .opencv = OpenCvBitmap,
     .peersWithin = 0.0,
     .python = "bitmap"},
    {.job = "bitmap, random mask",
     .types = "u16 -> u8",
     .workload = Speckle<unsigned short, unsigned char, MaskPattern::kRandom>,
     .gridmill = Bitmap,
     .naive = NaiveMaskedBitmap,
     .opencv = OpenCvMaskedBitmap,
     .peersWithin = 0.0,
     .python = "bitmap_random_mask"},
    {.job = "bitmap, mask in runs",
     .types = "u16 -> u8",
     .workload = Speckle<unsigned short, unsigned char, MaskPattern::kRuns>,
     .gridmill = Bitmap,
     .naive = NaiveMaskedBitmap,
     .opencv = OpenCvMaskedBitmap,
     .peersWithin = 0.0,
     .python = "bitmap_mask_in_runs"},
};

}  // namespace

std::span<const Row> BitmapFilteringRows() { return kRows; }

}  // namespace orvik::bench
