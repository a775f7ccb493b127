#include <cstdlib>
#include <memory>
#include <string>

#include <gdal.h>
#include <gdal_utils.h>

#include "benchmarks/peers/peers.h"

namespace orvik::bench {

namespace {

using Dataset = std::unique_ptr<void, decltype(&GDALClose)>;

/// The elevations where they lie, as a dataset of one band.
Dataset Wrap(const Workload& work) {
  const auto width = static_cast<int>(work.in->width);
  const auto height = static_cast<int>(work.in->height);
  Dataset dataset(GDALCreate(GDALGetDriverByName("MEM"), "", width, height, 0, GDT_Float32, nullptr),
                  &GDALClose);
  const std::string pointer =
      "DATAPOINTER=" + std::to_string(reinterpret_cast<std::uintptr_t>(RowOf<float>(*work.in, 0)));
  const std::string line = "LINEOFFSET=" + std::to_string(work.in->bufferWidth * sizeof(float));
  const char* const band[] = {pointer.c_str(), line.c_str(), nullptr};
  GDALAddBand(dataset.get(), GDT_Float32, const_cast<char**>(band));
  double transform[] = {0.0, kSpacing, 0.0, 0.0, 0.0, -kSpacing};
  GDALSetGeoTransform(dataset.get(), transform);
  return dataset;
}

/// The result is a dataset that the library makes itself: its allocation is part of the call.
void Terrain(const Workload& work, const char* quantity) {
  [[maybe_unused]] static const bool registered = (GDALAllRegister(), true);
  const Dataset source = Wrap(work);
  const char* const arguments[] = {"-of", "MEM", "-alg", "ZevenbergenThorne", "-q", nullptr};
  GDALDEMProcessingOptions* const options =
      GDALDEMProcessingOptionsNew(const_cast<char**>(arguments), nullptr);
  const Dataset result(GDALDEMProcessing("", source.get(), quantity, nullptr, options, nullptr), &GDALClose);
  GDALDEMProcessingOptionsFree(options);
  if (result == nullptr) std::abort();
}

}  // namespace

void GdalSlope(const Workload& work) { Terrain(work, "slope"); }

void GdalAspect(const Workload& work) { Terrain(work, "aspect"); }

}  // namespace orvik::bench
