#include <omp.h>

#include "operator.h"
#include "processes/gridmill/averagechannels.h"
#include "processes/gridmill/filterasp.h"
#include "processes/gridmill/filterslp.h"

// The operators whose rows run in parallel.
namespace gridmill::python {

namespace {

using orvik::filters::AverageChannels;
using orvik::filters::FilterAsp;
using orvik::filters::FilterSlp;

constexpr int kMostThreads = 256;

/// The number of threads of the parallel regions that this thread opens, for the lifetime of the object.
class Threads {
 public:
  explicit Threads(const std::optional<int>& count) : before_(omp_get_max_threads()) {
    if (count) omp_set_num_threads(*count);
  }
  ~Threads() { omp_set_num_threads(before_); }
  Threads(const Threads&) = delete;
  Threads& operator=(const Threads&) = delete;

 private:
  int before_;
};

void RequireThreads(const std::optional<int>& count) {
  if (count && (*count < 1 || *count > kMostThreads))
    RaiseValue("num_threads", std::to_string(*count), "1 to " + std::to_string(kMostThreads));
}

/// The types that the operator remembers: those of a complex image's real parts.
CallTypes RealTypes(const Image& image, const Image& out) {
  DataType real = image.type;
  real.isComplex = false;
  return {real, out.type};
}

void RequireMargins(const Image& image, std::size_t margin, const Image& out, std::size_t outMargin) {
  if (margin < 1 || margin > 0xFFFF) RaiseValue("margin", std::to_string(margin), "1 to 65535");
  if (outMargin > 0xFFFF) RaiseValue("out_margin", std::to_string(outMargin), "0 to 65535");
  if (image.height < 2 * margin || image.width < 2 * margin)
    RaiseValue("image", std::to_string(image.height) + " x " + std::to_string(image.width) + " pixels",
               "more than its margin of " + std::to_string(margin) + " on each side");
  out.RequireSize(image.height - 2 * margin + 2 * outMargin, image.width - 2 * margin + 2 * outMargin);
}

template <class Holder>
void ProcessTerrain(Holder& self, const py::object& given, const py::object& givenMask,
                    const py::object& givenOut, std::size_t margin, std::size_t outMargin,
                    const std::optional<int>& threads) {
  const Image image = Image::Read("image", given, Types::kComplex);
  const Validity mask("mask", givenMask);
  const Image out = Image::Written("out", givenOut);
  RequireThreads(threads);
  RequireMargins(image, margin, out, outMargin);
  out.RequireBands(std::is_same_v<Holder, Operator<FilterSlp, Rebuilds::kOnAnyType>> ? image.bands : 1,
                   "those of the image");
  mask.RequireSizeOf(image);
  out.RequireApart(image);
  mask.RequireApart(out);
  const Turn turn = self.Enter();
  const CallTypes types = RealTypes(image, out);
  self.Run(types, self.LimitsFor(types), [&] {
    const Threads region(threads);
    const std::size_t rowBytes = image.width * image.PixelBytes() + out.width * out.PixelBytes();
    InBands(image.height - 2 * margin, rowBytes, [&](std::size_t first, std::size_t rows) {
      Raster in = image.Rows(first, rows, margin), target = out.Rows(first, rows, outMargin);
      std::optional<Mask> valid = mask.Rows(first, rows, margin);
      self.op.Process(&in, Pointer(valid), &target);
    });
  });
}

template <class Holder, class Class>
void DefineTerrainProcess(Class& type) {
  type.def(
      "Process", &ProcessTerrain<Holder>, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
      py::arg("margin") = 0, py::arg("out_margin") = 0, py::arg("num_threads") = py::none(),
      "Writes to `out`, which has the size of `image` without `margin` on each side and with `out_margin`.");
}

void BindSlope(py::module_& module) {
  using Holder = Operator<FilterSlp, Rebuilds::kOnAnyType>;
  py::class_<Holder> type(module, "FilterSlp", "Terrain slope in degrees.");
  type.def(py::init<float, float, float>(), py::arg("XSIZE") = 1.0f, py::arg("YSIZE") = 1.0f,
           py::arg("ELSZ") = 1.0f);
  Parameter<Holder>(type, "SetXSIZE", &FilterSlp::SetXSIZE, "XSIZE", &FilterSlp::XSIZE);
  Parameter<Holder>(type, "SetYSIZE", &FilterSlp::SetYSIZE, "YSIZE", &FilterSlp::YSIZE);
  Parameter<Holder>(type, "SetELSZ", &FilterSlp::SetELSZ, "ELSZ", &FilterSlp::ELSZ);
  Parameter<Holder>(type, "SetBackground", &FilterSlp::SetBackground, "Background", &FilterSlp::Background);
  DefineTerrainProcess<Holder>(type);
}

void BindAspect(py::module_& module) {
  using Holder = Operator<FilterAsp, Rebuilds::kOnAnyType>;
  py::class_<Holder> type(module, "FilterAsp", "Terrain aspect in degrees.");
  type.def(py::init<>());
  Parameter<Holder>(type, "SetZeroSlope", &FilterAsp::SetZeroSlope, "ZeroSlope", &FilterAsp::ZeroSlope);
  Parameter<Holder>(type, "SetXSIZE", &FilterAsp::SetXSIZE, "XSIZE", &FilterAsp::XSIZE);
  Parameter<Holder>(type, "SetYSIZE", &FilterAsp::SetYSIZE, "YSIZE", &FilterAsp::YSIZE);
  Parameter<Holder>(type, "SetELSZ", &FilterAsp::SetELSZ, "ELSZ", &FilterAsp::ELSZ);
  Parameter<Holder>(type, "SetBackground", &FilterAsp::SetBackground, "Background", &FilterAsp::Background);
  DefineTerrainProcess<Holder>(type);
}

using Average = Operator<AverageChannels, Rebuilds::kOnAnyType>;

void ProcessAverage(Average& self, const py::object& given, const py::object& givenMask,
                    const py::object& givenOut, const std::optional<int>& threads) {
  const Image image = Image::Read("image", given, Types::kComplex);
  const Validity mask("mask", givenMask);
  const Image out = Image::Written("out", givenOut);
  RequireThreads(threads);
  RequireFit(image, mask, out);
  const Turn turn = self.Enter();
  const CallTypes types = RealTypes(image, out);
  self.Run(types, self.LimitsFor(types), [&] {
    const Threads region(threads);
    const std::size_t rowBytes = image.width * (image.PixelBytes() + out.PixelBytes());
    InBands(image.height, rowBytes, [&](std::size_t first, std::size_t rows) {
      Raster in = image.Rows(first, rows), target = out.Rows(first, rows);
      std::optional<Mask> valid = mask.Rows(first, rows);
      self.op.Process(&in, Pointer(valid), &target, nullptr);
    });
  });
}

void BindAverage(py::module_& module) {
  py::class_<Average> type(module, "AverageChannels", "The mean of a pixel's bands.");
  type.def(py::init<>()).def(py::init<float>(), py::arg("noData"));
  Parameter<Average>(type, "SetNodata", &AverageChannels::SetNodata, "noData", &AverageChannels::noData);
  type.def("Process", &ProcessAverage, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
           py::arg("num_threads") = py::none());
}

}  // namespace

void BindTerrain(py::module_& module) {
  BindSlope(module);
  BindAspect(module);
  BindAverage(module);
}

}  // namespace gridmill::python
