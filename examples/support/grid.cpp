#include "grid.h"

#include <algorithm>
#include <cmath>

#include <ogr_spatialref.h>

#include "errors.h"

namespace examples {

namespace {

constexpr double tolerance = 0.01;  // in pixels

struct GeoTransform {
  double part[6];
  bool known;

  explicit GeoTransform(GDALDataset& dataset) : known(dataset.GetGeoTransform(part) == CE_None) {}
  double X(double column, double row) const { return part[0] + column * part[1] + row * part[2]; }
  double Y(double column, double row) const { return part[3] + column * part[4] + row * part[5]; }
  double Pixel() const { return std::min(std::hypot(part[1], part[4]), std::hypot(part[2], part[5])); }
};

// How far the corners lie apart at most, in pixels of `b`.
double Offset(const GeoTransform& a, const GeoTransform& b, double width, double height) {
  double offset = 0.0;
  for (const double column : {0.0, width})
    for (const double row : {0.0, height})
      offset = std::max(offset,
                        std::hypot(a.X(column, row) - b.X(column, row), a.Y(column, row) - b.Y(column, row)));
  return offset / b.Pixel();
}

bool SameReference(const OGRSpatialReference& a, const OGRSpatialReference& b) {
  const char* const options[] = {"IGNORE_DATA_AXIS_TO_SRS_AXIS_MAPPING=YES", "CRITERION=EQUIVALENT", nullptr};
  return a.IsSame(&b, options);
}

std::string NameOf(const OGRSpatialReference& reference) {
  const char* name = reference.GetName();
  return name == nullptr ? "a reference system without a name" : name;
}

}  // namespace

void CheckSameGrid(const NamedRaster& raster, const NamedRaster& other) {
  const std::string name = "'" + raster.path + "'", otherName = other.argument + " '" + other.path + "'";
  const int width = raster.dataset.GetRasterXSize(), height = raster.dataset.GetRasterYSize();
  const int otherWidth = other.dataset.GetRasterXSize(), otherHeight = other.dataset.GetRasterYSize();
  if (width != otherWidth || height != otherHeight)
    throw Refusal(raster.argument, name + CPLSPrintf(" has %d x %d pixels", width, height),
                  std::string(CPLSPrintf("%d x %d", otherWidth, otherHeight)) + " as in " + otherName +
                      ", on one grid, as gdalwarp makes it");

  const GeoTransform transform(raster.dataset), otherTransform(other.dataset);
  if (transform.known != otherTransform.known)
    throw Refusal(raster.argument, name + (transform.known ? " has a georeference" : " has no georeference"),
                  (transform.known ? "none as in " : "one as in ") + otherName);
  if (transform.known) {
    const double offset = Offset(transform, otherTransform, width, height);
    if (!(offset <= tolerance))
      throw Refusal(raster.argument, name + CPLSPrintf(" lies up to %.3g pixels beside ", offset) + otherName,
                    CPLSPrintf("one grid, within %g pixels, as gdalwarp makes it", tolerance));
  }

  const OGRSpatialReference* reference = raster.dataset.GetSpatialRef();
  const OGRSpatialReference* otherReference = other.dataset.GetSpatialRef();
  if (reference != nullptr && otherReference != nullptr && !SameReference(*reference, *otherReference))
    throw Refusal(raster.argument, name + " is in " + NameOf(*reference),
                  NameOf(*otherReference) + " as " + otherName + ", as gdalwarp makes it");
}

}  // namespace examples
