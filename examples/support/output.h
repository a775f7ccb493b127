#pragma once

#include <optional>
#include <string>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "gdal.h"
#include "pendingfile.h"
#include "quantity.h"
#include "tiles.h"

namespace examples {

/// The no-data value that an output of this type gets unless another one is stated: NaN for floating types,
/// else a value that no slope, no aspect and no halved aspect takes.
double DefaultNoData(GDALDataType type);

/// Tells whether a raster of this type can hold the value and a `float` parameter carries it there unchanged.
bool IsStorable(double value, GDALDataType type);

/// Refuses a value that is not storable.
void CheckStorable(const std::string& argument, double value, GDALDataType type);

/// Writes the no-data value of an output of this type into all channels of the pixels whose bit in the mask
/// is clear.
void FillMasked(const orvik::tessel::Mask& mask, double noData, GDALDataType type,
                orvik::tessel::Raster& out);

/// A GeoTIFF with the georeference of its source, written tile by tile.
class OutputRaster {
 public:
  OutputRaster(const PendingFile& file, GDALDataset& source, GDALDataType type,
               const std::vector<Quantity>& bands);

  orvik::tessel::DataType Type() const { return TypeOf(type_); }

  /// `raster` has no margins, and a channel for each band.
  void Write(const Tile& tile, const orvik::tessel::Raster& raster);

  /// Writes what is still in memory. @throws Failure if the disk is full
  void Close();

 private:
  std::string name_;
  GDALDataType type_;
  DatasetPtr dataset_;
};

}  // namespace examples
