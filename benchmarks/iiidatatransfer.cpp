#include "processes/gridmill/iiidatatransfer.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

void Transfer(const Workload& work) {
  std::vector<unsigned int> from = {0, 0, work.in->width, work.in->height};
  std::vector<unsigned int> to = {0, 0, work.out->width, work.out->height};
  gridmill::IIIDataTransfer transfer;
  transfer.SetInRegion(from);
  transfer.SetOutRegion(to);
  transfer.Process(work.in.get(), work.mask.get(), work.out.get());
}

/// The input coordinate of an output coordinate, with both regions and both images at the origin.
std::size_t Nearest(std::size_t p, double scale, std::uint32_t extent) {
  const double u = static_cast<double>(p) / scale + 0.5;
  return static_cast<std::size_t>(std::clamp(static_cast<int>(u), 0, static_cast<int>(extent) - 1));
}

/// The columns are the same for all rows, and computed once.
template <class In, class Out>
void NaiveTransfer(const Workload& work) {
  const std::size_t channels = work.in->channels;
  const double scaleX = static_cast<double>(work.twin->width) / work.in->width;
  const double scaleY = static_cast<double>(work.twin->height) / work.in->height;
  std::vector<std::size_t> columns(work.twin->width);
  for (std::size_t x = 0; x < columns.size(); ++x) columns[x] = Nearest(x, scaleX, work.in->width);
  for (std::size_t y = 0; y < work.twin->height; ++y) {
    const In* const source = RowOf<In>(*work.in, Nearest(y, scaleY, work.in->height));
    Out* const target = RowOf<Out>(*work.twin, y);
    for (std::size_t x = 0; x < columns.size(); ++x)
      for (std::size_t c = 0; c < channels; ++c)
        target[x * channels + c] = static_cast<Out>(source[columns[x] * channels + c]);
  }
}

constexpr Row kRows[] = {
    {.job = "transfer, 2 x up",
     .types = "u8 x 3 -> u8 x 3",
     .workload = ScaledScene<unsigned char, unsigned char, 3, 1, 2>,
     .gridmill = Transfer,
     .naive = NaiveTransfer<unsigned char, unsigned char>,
     .opencv = OpenCvNearest},
    {.job = "transfer, 1.5 x down",
     .types = "u16 x 4 -> u16 x 4",
     .workload = ScaledScene<unsigned short, unsigned short, 4, 3, 2>,
     .gridmill = Transfer,
     .naive = NaiveTransfer<unsigned short, unsigned short>,
     .opencv = OpenCvNearest},
    {.job = "transfer, 1.5 x down",
     .types = "u16 x 4 -> f32 x 4",
     .workload = ScaledScene<unsigned short, float, 4, 3, 2>,
     .gridmill = Transfer,
     .naive = NaiveTransfer<unsigned short, float>,
     .opencv = OpenCvConvertedNearest},
    {.job = "transfer, same size",
     .types = "u16 -> f32",
     .workload = Scene<unsigned short, float, 1, 1>,
     .gridmill = Transfer,
     .naive = NaiveTransfer<unsigned short, float>,
     .opencv = OpenCvConverted,
     .peersWithin = 0.0},
};

}  // namespace

std::span<const Row> IIIDataTransferRows() { return kRows; }

}  // namespace orvik::bench
