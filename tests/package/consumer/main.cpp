#include <cstdio>

#include "basic/tessel/raster.h"
#include "processes/gridmill/gridmill.h"

// A program outside the project: averages two pixels of three channels.
int main() {
  using namespace orvik::tessel;
  unsigned char samples[] = {10, 20, 31, 0, 1, 2};
  unsigned char means[] = {0, 0};
  Raster in(RasterInfo(2, 1, 3, eDT_8U), RasterContext(), samples);
  Raster out(RasterInfo(2, 1, 1, eDT_8U), RasterContext(), means);

  const orvik::filters::AverageChannels average(255.0f);
  average.Process(&in, nullptr, &out, nullptr);
  std::printf("means %d %d\n", means[0], means[1]);
  return means[0] == 20 && means[1] == 1 ? 0 : 1;
}
