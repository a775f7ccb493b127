#include "output.h"

#include <cmath>
#include <cstring>
#include <limits>

#include "errors.h"

namespace examples {

namespace {

// The values that an integer type holds and that a `float` parameter carries to it.
bool Holds(GDALDataType type, double value) {
  if (value != std::floor(value)) return false;
  const auto within = [&](double low, double high) { return value >= low && value <= high; };
  switch (type) {
    case GDT_Byte:
      return within(0.0, 255.0);
    case GDT_UInt16:
      return within(0.0, 65535.0);
    case GDT_Int16:
      return within(-32768.0, 32767.0);
    case GDT_UInt32:
      return within(0.0, 4294967295.0);
    case GDT_Int32:
      return within(-2147483648.0, 2147483647.0);
    default:
      return within(0.0, 0x1p62);  // conversions to 64 bits turn negative values into 0
  }
}

void CopyGeoreference(GDALDataset& from, GDALDataset& to) {
  double transform[6];
  if (from.GetGeoTransform(transform) == CE_None) {
    to.SetGeoTransform(transform);
  } else if (from.GetGCPCount() > 0) {
    to.SetGCPs(from.GetGCPCount(), from.GetGCPs(), from.GetGCPSpatialRef());
  }
  if (const OGRSpatialReference* reference = from.GetSpatialRef()) to.SetSpatialRef(reference);
  if (const char* kind = from.GetMetadataItem(GDALMD_AREA_OR_POINT))
    to.SetMetadataItem(GDALMD_AREA_OR_POINT, kind);
}

void DescribeBand(GDALRasterBand& band, const Quantity& quantity) {
  if (quantity.noData) SetNoData(band, *quantity.noData);
  band.SetDescription(quantity.name.c_str());
  band.SetUnitType(quantity.unit.c_str());
  if (quantity.scale != 1.0) band.SetScale(quantity.scale);
  if (quantity.flat) band.SetMetadataItem("FLAT_VALUE", CPLSPrintf("%.9g", *quantity.flat));
}

}  // namespace

double DefaultNoData(GDALDataType type) {
  switch (type) {
    case GDT_Float32:
    case GDT_Float64:
      return std::numeric_limits<double>::quiet_NaN();
    case GDT_Byte:
      return 255.0;
    case GDT_Int16:
    case GDT_Int32:
      return -32768.0;
    default:
      return 65535.0;
  }
}

bool IsStorable(double value, GDALDataType type) {
  const bool exact = std::isnan(value) || static_cast<double>(static_cast<float>(value)) == value;
  return exact && (IsFloating(type) || Holds(type, value));
}

void CheckStorable(const std::string& argument, double value, GDALDataType type) {
  if (IsStorable(value, type)) return;
  throw Refusal(argument,
                CPLSPrintf("%.17g does not fit into outputs of type %s", value, GDALGetDataTypeName(type)),
                IsFloating(type) ? "a value in single precision"
                                 : "a whole number of the type, not negative for 64 bits");
}

void FillMasked(const orvik::tessel::Mask& mask, double noData, GDALDataType type,
                orvik::tessel::Raster& out) {
  const int size = GDALGetDataTypeSizeBytes(type), pixelBytes = size * static_cast<int>(out.channels);
  std::vector<unsigned char> pixel(static_cast<std::size_t>(pixelBytes));
  GDALCopyWords(&noData, GDT_Float64, 0, pixel.data(), type, size, static_cast<int>(out.channels));
  unsigned char* to = out.data;
  for (std::uint32_t y = 0; y < out.height; ++y)
    for (std::uint32_t x = 0; x < out.width; ++x, to += pixelBytes)
      if (!mask.IsValid(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y)))
        std::memcpy(to, pixel.data(), pixel.size());
}

OutputRaster::OutputRaster(const PendingFile& file, GDALDataset& source, GDALDataType type,
                           const std::vector<Quantity>& bands)
    : name_(file.Target()), type_(type) {
  GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("GTiff");
  const char* const options[] = {"BIGTIFF=IF_SAFER", nullptr};
  dataset_.reset(driver->Create(file.TemporaryPath().c_str(), source.GetRasterXSize(),
                                source.GetRasterYSize(), static_cast<int>(bands.size()), type,
                                const_cast<char**>(options)));
  ThrowOnGdalError("creating '" + name_ + "'", dataset_ ? CE_None : CE_Failure);
  CopyGeoreference(source, *dataset_);
  for (std::size_t i = 0; i < bands.size(); ++i)
    DescribeBand(*dataset_->GetRasterBand(static_cast<int>(i) + 1), bands[i]);
  ThrowOnGdalError("writing '" + name_ + "'");
}

void OutputRaster::Write(const Tile& tile, const orvik::tessel::Raster& raster) {
  const auto width = static_cast<int>(tile.width), height = static_cast<int>(tile.height);
  const GSpacing sample = GDALGetDataTypeSizeBytes(type_), pixel = sample * raster.channels;
  const CPLErr result = dataset_->RasterIO(
      GF_Write, static_cast<int>(tile.x), static_cast<int>(tile.y), width, height, raster.data, width, height,
      type_, static_cast<int>(raster.channels), nullptr, pixel, pixel * width, sample, nullptr);
  ThrowOnGdalError("writing '" + name_ + "'", result);
}

void OutputRaster::Close() {
  dataset_->FlushCache(true);
  dataset_.reset();
  ThrowOnGdalError("writing '" + name_ + "'");
}

}  // namespace examples
