#include "processes/gridmill/tasseledcapchange.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <utility>

#include "basic/exceptions/throw.h"
#include "basic/tessel/clipto.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/changenodata.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/pixelload.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

using kernels::kBlock;

constexpr std::size_t kMaxBands = 6;

/// The order of a weighted sum.
enum class Order {
  kRunning,       ///< c1 and c0, then the others in turn
  kVisibleFirst,  ///< c3 less the sum of c1, c0 and c2, then the others in turn
  kMss,           ///< c2 less the sum of c1 and c0, then c3
};

/// The weights of a sensor's bands on one axis. Bands without one have 0 and are not read.
struct Sensor {
  const char* name;
  Order order;
  std::size_t bands;
  double weights[kMaxBands];
};

/// Deliberate: the weights stand as they are; the Ikonos weight of band 3 is -0.324.
struct Greenness {
  static constexpr Sensor kSensors[] = {
      {"Landsat-4 MSS", Order::kMss, 4, {-0.29, -0.562, 0.6, 0.49}},
      {"Landsat-5 MSS", Order::kMss, 4, {-0.29, -0.562, 0.6, 0.49}},
      {"Landsat-4 TM", Order::kVisibleFirst, 6, {-0.2848, -0.2435, -0.5436, 0.7243, 0.084, -0.18}},
      {"Landsat-5 TM", Order::kVisibleFirst, 6, {-0.2848, -0.2435, -0.5436, 0.7243, 0.084, -0.18}},
      {"Landsat-7 ETM+", Order::kVisibleFirst, 6, {-0.3344, -0.3544, -0.4556, 0.6966, -0.0242, -0.263}},
      {"Ikonos", Order::kVisibleFirst, 4, {-0.311, -0.356, -0.324, 0.819}},
      {"QuickBird", Order::kVisibleFirst, 4, {-0.121, -0.331, -0.517, 0.78}},
  };
};

/// Deliberate: the weights stand as they are; the ETM+ weight of band 2 is 0.3872.
struct Brightness {
  static constexpr Sensor kSensors[] = {
      {"Landsat-4 MSS", Order::kRunning, 4, {0.433, 0.632, 0.586, 0.264}},
      {"Landsat-5 MSS", Order::kRunning, 4, {0.433, 0.632, 0.586, 0.264}},
      {"Landsat-4 TM", Order::kRunning, 6, {0.3037, 0.2793, 0.4343, 0.5585, 0.5082, 0.1863}},
      {"Landsat-5 TM", Order::kRunning, 6, {0.3037, 0.2793, 0.4343, 0.5585, 0.5082, 0.1863}},
      {"Landsat-7 ETM+", Order::kRunning, 6, {0.3561, 0.3872, 0.3904, 0.6966, 0.2286, 0.1596}},
      {"Ikonos", Order::kRunning, 4, {0.326, 0.509, 0.56, 0.567}},
      {"QuickBird", Order::kRunning, 4, {0.319, 0.542, 0.49, 0.604}},
  };
};

/// Null if the axis has no weights for a sensor of this name.
template <class Axis>
const Sensor* FindSensor(const std::string& name) {
  const Sensor* const found = std::ranges::find(Axis::kSensors, name, &Sensor::name);
  return found != std::end(Axis::kSensors) ? found : nullptr;
}

// ---- pixel

/// The projection of a pixel on the axis. The magnitudes of weights below 0 are summed and subtracted: the
/// sum of their negatives would differ in the sign of a zero.
template <Order order, std::size_t bands>
GRIDMILL_INLINE double ProjectionOf(const double (&c)[kMaxBands], const double (&w)[kMaxBands]) {
  double sum;
  if constexpr (order == Order::kRunning) {
    sum = ((w[1] * c[1] + w[0] * c[0]) + w[2] * c[2]) + w[3] * c[3];
  } else {
    const double visible = -w[1] * c[1] + -w[0] * c[0];
    sum =
        order == Order::kMss ? (w[2] * c[2] - visible) + w[3] * c[3] : w[3] * c[3] - (visible + -w[2] * c[2]);
  }
  if constexpr (bands == 6) sum = (sum + w[4] * c[4]) + w[5] * c[5];
  return sum;
}

// ---- row

template <Order order, std::size_t bands, class In>
GRIDMILL_MULTIVERSION void ProjectPixels(const In* __restrict pixels, const double (&weights)[kMaxBands],
                                         std::size_t count, double* __restrict projection) {
  for (std::size_t i = 0; i < count; ++i) {
    double c[kMaxBands];
    kernels::LoadPixel<bands>(pixels + i * bands, c);
    projection[i] = ProjectionOf<order, bands>(c, weights);
  }
}

template <class In>
void ProjectRow(const In* first, std::size_t stride, const Sensor& sensor, std::size_t count,
                double* projection) {
  using Project = void (*)(const In*, const double(&)[kMaxBands], std::size_t, double*);
  constexpr Project kFour[] = {ProjectPixels<Order::kRunning, 4, In>,
                               ProjectPixels<Order::kVisibleFirst, 4, In>, ProjectPixels<Order::kMss, 4, In>};
  constexpr Project kSix[] = {ProjectPixels<Order::kRunning, 6, In>,
                              ProjectPixels<Order::kVisibleFirst, 6, In>};
  In dense[kMaxBands * kBlock];
  for (std::size_t i = 0; i < count && stride != sensor.bands; ++i)
    std::copy_n(first + i * stride, sensor.bands, dense + i * sensor.bands);
  const In* const pixels = stride != sensor.bands ? dense : first;
  const auto order = static_cast<std::size_t>(sensor.order);
  (sensor.bands == 4 ? kFour[order] : kSix[order])(pixels, sensor.weights, count, projection);
}

/// Deliberate: every type but absolute and backward is image minus reference.
GRIDMILL_MULTIVERSION void AxisDifferenceRow(const double* __restrict a, const double* __restrict b,
                                             DiffType type, std::size_t count, double* __restrict d) {
  if (type == eDIFF_ABSOLUTE) {
    for (std::size_t i = 0; i < count; ++i) d[i] = std::fabs(a[i] - b[i]);
  } else if (type == eDIFF_BACKWARD) {
    for (std::size_t i = 0; i < count; ++i) d[i] = -(a[i] - b[i]);
  } else {
    for (std::size_t i = 0; i < count; ++i) d[i] = a[i] - b[i];
  }
}

/// One pixel, of which a sensor is unknown: fails unless it is excluded.
template <class Out>
void RefuseValid(const unsigned char* keep, Out excluded, Out* target) {
  if (keep == nullptr || *keep != 0) Throw<Exception>("Image type not supported", "", "", 0);
  std::fill_n(target, 3, excluded);
}

// ---- image

/// One comparison for both axes.
template <class Axis, class In, class Out, class Params>
void CompareOnAxis(const Params& params, const frame::TwoDates& dates) {
  const std::size_t channels = dates.image.channels;
  const Sensor* const sensor = FindSensor<Axis>(params.sensorType);
  const Sensor* const refSensor = FindSensor<Axis>(params.refSensorType);
  const Out excluded = tessel::ClipTo<Out>(params.noData);
  const kernels::PixelChoice choice(params, channels, channels);
  frame::BlockShape shape = frame::PixelBlocks(channels, channels, 3);
  const bool known = sensor != nullptr && refSensor != nullptr;
  if (known) {
    shape.imageSamples = std::max(channels, sensor->bands);
    shape.referenceSamples = std::max(channels, refSensor->bands);
  } else {
    shape.pixels = 1;  // fails at the first valid pixel, and what was written before stays
  }
  frame::ChangeRows<In, In, Out>(dates, shape, [&](const auto& block) {
    const unsigned char* const keep = choice.Of(block);
    if (!known) return RefuseValid<Out>(keep, excluded, block.target);
    double planes[3][kBlock];
    auto& [a, b, d] = planes;
    ProjectRow(block.image, block.imageStride, *sensor, block.pixels, a);
    ProjectRow(block.reference, block.referenceStride, *refSensor, block.pixels, b);
    AxisDifferenceRow(a, b, params.type, block.pixels, d);
    kernels::StorePixelsWhere(planes, keep, excluded, block.pixels, block.target);
  });
}

}  // namespace

template <class In, class Out>
class TCGNChange::InnerProcessor : public IChange, public details::TCGNParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    CompareOnAxis<Greenness, In, Out>(*this, {*image, *reference, *out, mask});
  }
};

struct TCGNChange::TCGNCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

template <class In, class Out>
class TCSBChange::InnerProcessor : public IChange, public details::TCSBParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    CompareOnAxis<Brightness, In, Out>(*this, {*image, *reference, *out, mask});
  }
};

struct TCSBChange::TCSBCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

template <class Params, class CreationPolicy>
struct TasseledCapFrame : frame::Defaults<Params> {
  static constexpr frame::Compares compares = frame::Compares::kReferenceAgainstInput;
  using Dispatcher = frame::TwoLevel<CreationPolicy>;
};

}  // namespace

// ---- operator

TCGNChange::TCGNChange(std::string sensor, std::string refSensor, DiffType form) {
  sensorType = std::move(sensor);
  refSensorType = std::move(refSensor);
  type = form;
  noData = 0.0f;
}
TCGNChange::TCGNChange(const TCGNChange&) = default;
TCGNChange& TCGNChange::operator=(const TCGNChange&) = default;
TCGNChange::~TCGNChange() = default;

void TCGNChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                         tessel::Raster* out) const {
  frame::Process<TasseledCapFrame<details::TCGNParams, TCGNCreationPolicy>>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

TCSBChange::TCSBChange(std::string sensor, std::string refSensor, DiffType form) {
  sensorType = std::move(sensor);
  refSensorType = std::move(refSensor);
  type = form;
  noData = 0.0f;
}
TCSBChange::TCSBChange(const TCSBChange&) = default;
TCSBChange& TCSBChange::operator=(const TCSBChange&) = default;
TCSBChange::~TCSBChange() = default;

void TCSBChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                         tessel::Raster* out) const {
  frame::Process<TasseledCapFrame<details::TCSBParams, TCSBCreationPolicy>>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
