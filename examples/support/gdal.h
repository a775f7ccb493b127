#pragma once

#include <memory>
#include <string>
#include <vector>

#include <gdal_priv.h>

#include "basic/tessel/datatype.h"

namespace examples {

struct DatasetCloser {
  void operator()(GDALDataset* dataset) const { GDALClose(dataset); }
};
using DatasetPtr = std::unique_ptr<GDALDataset, DatasetCloser>;

/// Registers the drivers and keeps GDAL's failures for `ThrowOnGdalError`; warnings go to standard error.
void StartGdal();

/// Throws a `Failure` that begins with `doing` if `result` is an error or GDAL has reported one since the
/// last call.
void ThrowOnGdalError(const std::string& doing, CPLErr result = CE_None);

/// Opens a raster for reading. @throws Refusal naming `argument`
DatasetPtr OpenRaster(const std::string& argument, const std::string& path);

/// The library's type for a band's samples. @throws Refusal naming `argument`
orvik::tessel::DataType TypeOf(GDALDataType type, const std::string& argument = "INPUT");

/// The type that holds the real parts of all samples of some bands, which count from 1.
GDALDataType RealTypeOf(GDALDataset& dataset, const std::vector<int>& bands);

/// The GDAL type for `--type`: one of the library's pixel types that GDAL has, none of them complex.
GDALDataType OutputType(const std::string& name);
/// True for `Float32` and `Float64`.
bool IsFloating(GDALDataType type);
/// The names that `OutputType` knows.
const std::vector<std::string>& OutputTypeNames();

/// What one pixel measures on the ground, in the units of the coordinates, as stored: `y` is negative where
/// rows run southwards.
struct Cell {
  double x;
  double y;
  bool known;        ///< false: the raster carries no georeference, and x and y are 1 and -1
  bool geographic;   ///< the units are degrees
  bool straight;     ///< rows run along one axis of the coordinates and columns along the other
  std::string unit;  ///< of the coordinates: "m", or the name that the reference system gives it
};

Cell CellOf(GDALDataset& dataset);

/// Sets a band's no-data value in the form that its type asks for.
void SetNoData(GDALRasterBand& band, double value);

}  // namespace examples
