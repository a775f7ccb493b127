// Untested: a draft.
#include <cstdio>

#include "processes/gridmill/filterslp.h"

// The slope of a surface that rises by 1 from column to column: 45 degrees.
int main() {
  using namespace orvik;
  float elevation[3][3] = {{0, 1, 2}, {0, 1, 2}, {0, 1, 2}};  // 1 x 1 and a margin of 1
  float degrees = 0.0f;
  tessel::Raster in({1, 1, 1, tessel::eDT_32F}, {1, 1}, reinterpret_cast<unsigned char*>(elevation));
  tessel::Raster out({1, 1, 1, tessel::eDT_32F}, {}, reinterpret_cast<unsigned char*>(&degrees));
  const filters::FilterSlp slope(1.0f, 1.0f);
  slope.Process(&in, nullptr, &out);
  std::printf("%g\n", static_cast<double>(degrees));
  return degrees == 45.0f ? 0 : 1;
}
