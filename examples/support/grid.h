#pragma once

#include <string>

#include "gdal.h"

namespace examples {

/// A raster as messages name it.
struct NamedRaster {
  GDALDataset& dataset;
  std::string argument;  ///< "AFTER"
  std::string path;
};

/// Refuses a raster that does not lie pixel upon pixel on another one: one of other sizes, with a corner more
/// than a hundredth of a pixel away, with a georeference where the other has none, or, where both have one,
/// with another reference system. @throws Refusal naming the argument of `raster`
void CheckSameGrid(const NamedRaster& raster, const NamedRaster& other);

}  // namespace examples
