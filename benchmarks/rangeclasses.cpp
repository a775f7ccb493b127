#include "processes/gridmill/rangeclasses.h"

#include <iterator>

#include "benchmarks/peers/peers.h"
#include "benchmarks/row.h"

namespace orvik::bench {

namespace {

constexpr int kClasses = static_cast<int>(std::size(kClassFrom));

void Classes(const Workload& work) {
  gridmill::RangeClasses classes;
  classes.SetNumClasses(kClasses);
  classes.SetMinRange({std::begin(kClassFrom), std::end(kClassFrom)});
  classes.SetMaxRange({std::begin(kClassTo), std::end(kClassTo)});
  classes.SetNoData(kClassNoData);
  classes.Process(work.in.get(), work.mask.get(), work.out.get());
}

int ClassOf(float sample) {
  const double delta = sample - kClassNoData;
  if (delta > -1e-9 && delta < 1e-9) return 0;
  int number = 0;
  for (int k = 0; k < kClasses; ++k)
    if (sample > kClassFrom[k] && kClassTo[k] > sample) number = k + 1;
  return number;
}

template <class Pixel>
void NaiveClasses(const Workload& work) {
  for (std::size_t y = 0; y < work.in->height; ++y) {
    const Pixel* const source = RowOf<Pixel>(*work.in, y);
    unsigned char* const target = RowOf<unsigned char>(*work.twin, y);
    for (std::size_t x = 0; x < work.in->width; ++x)
      target[x] = static_cast<unsigned char>(ClassOf(source[x]));
  }
}

constexpr Row kRows[] = {
    {.job = "range classes",
     .types = "f32 -> u8",
     .workload = Scene<float, unsigned char, 1, 1>,
     .gridmill = Classes,
     .naive = NaiveClasses<float>,
     .opencv = OpenCvClasses,
     .peersWithin = 0.0,
     .python = "classes_of_floats"},
    {.job = "range classes",
     .types = "u16 -> u8",
     .workload = Scene<unsigned short, unsigned char, 1, 1>,
     .gridmill = Classes,
     .naive = NaiveClasses<unsigned short>,
     .opencv = OpenCvClasses,
     .peersWithin = 0.0,
     .python = "classes_of_shorts"},
    {.job = "range classes, inRange",
     .types = "f32 -> u8",
     .workload = Scene<float, unsigned char, 1, 1>,
     .gridmill = Classes,
     .naive = NaiveClasses<float>,
     .opencv = OpenCvClassesInRange,
     .peersWithin = 0.0},
    {.job = "range classes, inRange",
     .types = "u16 -> u8",
     .workload = Scene<unsigned short, unsigned char, 1, 1>,
     .gridmill = Classes,
     .naive = NaiveClasses<unsigned short>,
     .opencv = OpenCvClassesInRange,
     .peersWithin = 0.0},
};

}  // namespace

std::span<const Row> RangeClassesRows() { return kRows; }

}  // namespace orvik::bench
