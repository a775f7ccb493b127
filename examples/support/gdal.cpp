#include "gdal.h"

#include <algorithm>
#include <cstdio>

#include <ogr_spatialref.h>

#include "errors.h"

namespace examples {

using orvik::tessel::DataType;

namespace {

std::string firstFailure;

void CPL_STDCALL KeepError(CPLErr level, CPLErrorNum, const char* message) {
  if (level == CE_Warning) std::fprintf(stderr, "warning: %s\n", message);
  if (level >= CE_Failure && firstFailure.empty()) firstFailure = message;
}

std::string TakeFailure() {
  std::string message;
  message.swap(firstFailure);
  return message;
}

}  // namespace

void StartGdal() {
  GDALAllRegister();
  CPLSetErrorHandler(KeepError);
}

void ThrowOnGdalError(const std::string& doing, CPLErr result) {
  const std::string message = TakeFailure();
  if (result == CE_None && message.empty()) return;
  throw Failure(doing + ": " + (message.empty() ? "no reason given" : message));
}

DatasetPtr OpenRaster(const std::string& argument, const std::string& path) {
  DatasetPtr dataset(
      GDALDataset::Open(path.c_str(), GDAL_OF_RASTER | GDAL_OF_READONLY | GDAL_OF_VERBOSE_ERROR));
  const std::string message = TakeFailure();
  if (!dataset) throw Refusal(argument, message, "a raster that GDAL can read");
  if (dataset->GetRasterCount() == 0)
    throw Refusal(argument, "'" + path + "' has no bands of its own",
                  "a raster, or one of the file's subdatasets");
  return dataset;
}

DataType TypeOf(GDALDataType type, const std::string& argument) {
  switch (type) {
    case GDT_Byte:
      return DataType::Of<unsigned char>();
    case GDT_UInt16:
      return DataType::Of<unsigned short>();
    case GDT_Int16:
      return DataType::Of<short>();
    case GDT_UInt32:
      return DataType::Of<unsigned int>();
    case GDT_Int32:
      return DataType::Of<int>();
    case GDT_UInt64:
      return DataType::Of<std::uint64_t>();
    case GDT_Int64:
      return DataType::Of<std::int64_t>();
    case GDT_Float32:
      return DataType::Of<float>();
    case GDT_Float64:
      return DataType::Of<double>();
    case GDT_CInt16:
      return DataType::Of<short>(true);
    case GDT_CInt32:
      return DataType::Of<int>(true);
    case GDT_CFloat32:
      return DataType::Of<float>(true);
    case GDT_CFloat64:
      return DataType::Of<double>(true);
    default:
      break;
  }
  throw Refusal(argument, std::string("has samples of type ") + GDALGetDataTypeName(type),
                "integers or floating point numbers");
}

GDALDataType RealTypeOf(GDALDataset& dataset, const std::vector<int>& bands) {
  GDALDataType common = GDT_Unknown;
  for (const int band : bands) {
    const GDALDataType type = GDALGetNonComplexDataType(dataset.GetRasterBand(band)->GetRasterDataType());
    common = common == GDT_Unknown ? type : GDALDataTypeUnion(common, type);
  }
  return common;
}

const std::vector<std::string>& OutputTypeNames() {
  static const std::vector<std::string> names = {"Byte",   "UInt16", "Int16",   "UInt32", "Int32",
                                                 "UInt64", "Int64",  "Float32", "Float64"};
  return names;
}

GDALDataType OutputType(const std::string& name) { return GDALGetDataTypeByName(name.c_str()); }

bool IsFloating(GDALDataType type) { return type == GDT_Float32 || type == GDT_Float64; }

Cell CellOf(GDALDataset& dataset) {
  Cell cell{1.0, -1.0, false, false, true, "units"};
  if (const OGRSpatialReference* reference = dataset.GetSpatialRef()) {
    const char* unit = nullptr;
    reference->GetLinearUnits(&unit);
    cell.geographic = reference->IsGeographic();
    cell.unit = EQUAL(unit, "metre") || EQUAL(unit, "meter") ? "m" : unit;
  }
  double transform[6];
  if (dataset.GetGeoTransform(transform) != CE_None) return cell;
  cell.x = transform[1];
  cell.y = transform[5];
  cell.known = true;
  cell.straight = transform[2] == 0.0 && transform[4] == 0.0 && cell.x != 0.0 && cell.y != 0.0;
  return cell;
}

void SetNoData(GDALRasterBand& band, double value) {
  if (band.GetRasterDataType() == GDT_Int64) {
    band.SetNoDataValueAsInt64(static_cast<std::int64_t>(value));
  } else if (band.GetRasterDataType() == GDT_UInt64) {
    band.SetNoDataValueAsUInt64(static_cast<std::uint64_t>(value));
  } else {
    band.SetNoDataValue(value);
  }
}

}  // namespace examples
