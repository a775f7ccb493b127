#include <cstdio>

#include "processes/gridmill/gridmill.h"

// The slope of a small surface, one value a line. slope.py prints the same lines.
int main() {
  using namespace orvik;
  constexpr int size = 5;
  float elevation[size + 2][size + 2];  // with a margin of 1 on each side
  for (int y = 0; y < size + 2; ++y)
    for (int x = 0; x < size + 2; ++x) elevation[y][x] = static_cast<float>(x * x + 3 * y - x * y);
  float degrees[size][size] = {};

  tessel::Raster in({size, size, 1, tessel::eDT_32F}, {1, 1}, reinterpret_cast<unsigned char*>(elevation));
  tessel::Raster out({size, size, 1, tessel::eDT_32F}, {}, reinterpret_cast<unsigned char*>(degrees));
  const filters::FilterSlp slope(30.0f, 25.0f);
  slope.Process(&in, nullptr, &out);
  for (const auto& row : degrees)
    for (float value : row) std::printf("%.9g\n", static_cast<double>(value));
}
