#include <chrono>
#include <cstdint>
#include <vector>

#include "processes/gridmill/filterslp.h"
#include "processes/gridmill/vegindex.h"

// The calls that the Python package is measured against: C++ over the same memory. Each runs a number of
// calls on the caller's thread as set by OpenMP, and returns the seconds that they took.
namespace {

using orvik::tessel::Mask;
using orvik::tessel::Raster;
using orvik::tessel::RasterContext;
using orvik::tessel::RasterInfo;

template <class Call>
double Seconds(int calls, Call call) {
  const auto start = std::chrono::steady_clock::now();
  for (int i = 0; i < calls; ++i) call();
  return std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count();
}

unsigned char* Bytes(void* data) { return static_cast<unsigned char*>(data); }

}  // namespace

/// Slope of a float raster of `edge` x `edge` pixels with a margin of 1. An operator for each call, as a
/// function call in Python makes one.
extern "C" __attribute__((visibility("default"))) double SlopeSeconds(void* in, void* out, std::uint32_t edge,
                                                                      int calls) {
  return Seconds(calls, [&] {
    Raster image(RasterInfo(edge, edge, 1, orvik::tessel::eDT_32F), RasterContext(1, 1), Bytes(in));
    Raster degrees(RasterInfo(edge, edge, 1, orvik::tessel::eDT_32F), RasterContext(), Bytes(out));
    orvik::filters::FilterSlp slope(30.0f, 30.0f);
    slope.Process(&image, nullptr, &degrees);
  });
}

/// NDVI of a raster of four `unsigned short` channels.
extern "C" __attribute__((visibility("default"))) double NdviSeconds(void* in, void* out, std::uint32_t edge,
                                                                     int calls) {
  return Seconds(calls, [&] {
    Raster image(RasterInfo(edge, edge, 4, orvik::tessel::eDT_16U), RasterContext(), Bytes(in));
    Raster index(RasterInfo(edge, edge, 1, orvik::tessel::eDT_32F), RasterContext(), Bytes(out));
    orvik::filters::VegIndex indices;
    std::vector<unsigned> requests(12, 0);
    requests[orvik::filters::eINDEX_NDVI] = 1;
    indices.SetRequestedIndex(requests);
    indices.SetBandIndex({orvik::filters::eBAND_BLUE, orvik::filters::eBAND_GREEN, orvik::filters::eBAND_RED,
                          orvik::filters::eBAND_NIR});
    indices.Process(&image, nullptr, &index);
  });
}
