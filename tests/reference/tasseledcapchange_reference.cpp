#include "tests/reference/tasseledcapchange_reference.h"

#include <cmath>
#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using changedetection::details::TCGNParams;
using changedetection::details::TCSBParams;
using tessel::Mask;
using tessel::Raster;

/// A sample of a pixel as a `double`, by its channel.
template <class In>
struct Samples {
  const Raster& raster;
  std::uint32_t x, y;
  double operator[](std::uint32_t c) const { return static_cast<double>(Read<In>(raster, x, y, c)); }
};

struct Greenness {
  template <class Pixel>
  static std::optional<double> Of(const std::string& sensor, const Pixel& c) {
    if (sensor == "Landsat-4 MSS" || sensor == "Landsat-5 MSS")
      return (0.6 * c[2] - (0.562 * c[1] + 0.29 * c[0])) + 0.49 * c[3];
    if (sensor == "Landsat-4 TM" || sensor == "Landsat-5 TM")
      return ((0.7243 * c[3] - ((0.2435 * c[1] + 0.2848 * c[0]) + 0.5436 * c[2])) + 0.084 * c[4]) -
             0.18 * c[5];
    if (sensor == "Landsat-7 ETM+")
      return ((0.6966 * c[3] - ((0.3544 * c[1] + 0.3344 * c[0]) + 0.4556 * c[2])) - 0.0242 * c[4]) -
             0.263 * c[5];
    if (sensor == "Ikonos") return 0.819 * c[3] - ((0.356 * c[1] + 0.311 * c[0]) + 0.324 * c[2]);
    if (sensor == "QuickBird") return 0.78 * c[3] - ((0.331 * c[1] + 0.121 * c[0]) + 0.517 * c[2]);
    return std::nullopt;
  }
};

struct Brightness {
  template <class Pixel>
  static std::optional<double> Of(const std::string& sensor, const Pixel& c) {
    if (sensor == "Landsat-4 MSS" || sensor == "Landsat-5 MSS")
      return ((0.632 * c[1] + 0.433 * c[0]) + 0.586 * c[2]) + 0.264 * c[3];
    if (sensor == "Landsat-4 TM" || sensor == "Landsat-5 TM")
      return ((((0.2793 * c[1] + 0.3037 * c[0]) + 0.4343 * c[2]) + 0.5585 * c[3]) + 0.5082 * c[4]) +
             0.1863 * c[5];
    if (sensor == "Landsat-7 ETM+")
      return ((((0.3872 * c[1] + 0.3561 * c[0]) + 0.3904 * c[2]) + 0.6966 * c[3]) + 0.2286 * c[4]) +
             0.1596 * c[5];
    if (sensor == "Ikonos") return ((0.509 * c[1] + 0.326 * c[0]) + 0.56 * c[2]) + 0.567 * c[3];
    if (sensor == "QuickBird") return ((0.542 * c[1] + 0.319 * c[0]) + 0.49 * c[2]) + 0.604 * c[3];
    return std::nullopt;
  }
};

/// True if one of the first `channels` samples of a pixel is no-data.
template <class In>
bool HasNoData(const Raster& raster, std::uint32_t channels, const std::vector<float>& noData,
               std::uint32_t x, std::uint32_t y) {
  for (std::uint32_t c = 0; c < channels; ++c) {
    if (static_cast<float>(Read<In>(raster, x, y, c)) == noData[c]) return true;
  }
  return false;
}

template <class Out>
void Exclude(float noData, std::uint32_t x, std::uint32_t y, Raster& out) {
  for (std::uint32_t c = 0; c < 3; ++c) Write(out, x, y, c, ClipTo<Out>(noData));
}

double Compare(int type, double a, double b) {
  const double d = a - b;
  if (type == 0) return std::fabs(d);
  if (type == 2) return -d;
  return d;
}

/// False if a sensor is unknown.
template <class Axis, class In, class Out, class Params>
bool Pixel(const Params& params, const Raster& image, const Raster& reference, bool noDataActive,
           std::uint32_t x, std::uint32_t y, Raster& out) {
  const std::uint32_t channels = image.channels;
  const bool imageInvalid = noDataActive && HasNoData<In>(image, channels, params.imgNoData, x, y);
  const bool referenceInvalid = noDataActive && HasNoData<In>(reference, channels, params.refNoData, x, y);
  if (imageInvalid || referenceInvalid) {
    Exclude<Out>(params.noData, x, y, out);
    return true;
  }
  const std::optional<double> a = Axis::Of(params.sensorType, Samples<In>{image, x, y});
  if (!a) return false;
  const std::optional<double> b = Axis::Of(params.refSensorType, Samples<In>{reference, x, y});
  if (!b) return false;
  Write(out, x, y, 0, ClipTo<Out>(*a));
  Write(out, x, y, 1, ClipTo<Out>(*b));
  Write(out, x, y, 2, ClipTo<Out>(Compare(params.type, *a, *b)));
  return true;
}

template <class Axis, class In, class Out, class Params>
bool Image(const Params& params, const Raster& image, const Raster& reference, const Mask* mask,
           Raster& out) {
  const bool noDataActive = image.channels == params.imgNoData.size();
  for (std::uint32_t y = 0; y < image.height; ++y) {
    for (std::uint32_t x = 0; x < image.width; ++x) {
      if (!IsValid(mask, x, y)) {
        Exclude<Out>(params.noData, x, y, out);
      } else if (!Pixel<Axis, In, Out>(params, image, reference, noDataActive, x, y, out)) {
        return false;
      }
    }
  }
  return true;
}

template <class Axis, class Params>
bool Run(const Params& params, const Raster& image, const Raster& reference, const Mask* mask, Raster& out) {
  bool isDone = false;
  tests::WithPixelTypes(image.dataType, out.dataType, [&]<class In, class Out>() {
    isDone = Image<Axis, In, Out>(params, image, reference, mask, out);
  });
  return isDone;
}

}  // namespace

bool TCGNChange(const TCGNParams& params, const Raster& image, const Raster& reference, const Mask* mask,
                Raster& out) {
  return Run<Greenness>(params, image, reference, mask, out);
}

bool TCSBChange(const TCSBParams& params, const Raster& image, const Raster& reference, const Mask* mask,
                Raster& out) {
  return Run<Brightness>(params, image, reference, mask, out);
}

}  // namespace orvik::reference
