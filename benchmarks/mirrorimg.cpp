#include "processes/gridmill/mirrorimg.h"

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

void Mirror(const Workload& work, const char* axis) {
  filters::MirrorImg mirror;
  mirror.SetAxis(axis);
  mirror.IsNewFile(false);
  mirror.Process(work.in.get(), work.mask.get(), work.out.get());
}

void MirrorColumns(const Workload& work) { Mirror(work, "VERT"); }

void MirrorRows(const Workload& work) { Mirror(work, "HORI"); }

template <class Pixel>
void NaiveMirrorColumns(const Workload& work) {
  const std::size_t width = work.in->width;
  const std::size_t channels = work.in->channels;
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const Pixel* const source = RowOf<Pixel>(*work.in, y);
    Pixel* const target = RowOf<Pixel>(*work.twin, y);
    for (std::size_t x = 0; x < width; ++x)
      for (std::size_t c = 0; c < channels; ++c)
        target[x * channels + c] = source[(width - 1 - x) * channels + c];
  }
}

template <class Pixel>
void NaiveMirrorRows(const Workload& work) {
  const std::size_t height = work.in->height;
  const std::size_t samples = std::size_t{work.in->width} * work.in->channels;
  for (std::size_t y = 0; y < height; ++y) {
    const Pixel* const source = RowOf<Pixel>(*work.in, height - 1 - y);
    Pixel* const target = RowOf<Pixel>(*work.twin, y);
    for (std::size_t i = 0; i < samples; ++i) target[i] = source[i];
  }
}

constexpr Row kRows[] = {
    {.job = "mirror VERT",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Scene<unsigned char, unsigned char, 3, 3>,
     .gridmill = MirrorColumns,
     .naive = NaiveMirrorColumns<unsigned char>,
     .opencv = OpenCvMirrorColumns,
     .peersWithin = 0.0},
    {.job = "mirror VERT",
     .types = "f32 -> f32",
     .workload = Scene<float, float, 1, 1>,
     .gridmill = MirrorColumns,
     .naive = NaiveMirrorColumns<float>,
     .opencv = OpenCvMirrorColumns,
     .peersWithin = 0.0},
    {.job = "mirror HORI",
     .types = "u8 x 3 -> u8 x 3",
     .workload = Scene<unsigned char, unsigned char, 3, 3>,
     .gridmill = MirrorRows,
     .naive = NaiveMirrorRows<unsigned char>,
     .opencv = OpenCvMirrorRows,
     .peersWithin = 0.0},
};

}  // namespace

std::span<const Row> MirrorImgRows() { return kRows; }

}  // namespace orvik::bench
