#include <string>
#include <utility>
#include <vector>

#include "operator.h"
#include "processes/gridmill/iiidatatransfer.h"
#include "processes/gridmill/spotblue.h"

namespace gridmill::python {

namespace {

using orvik::gridmill::IIIDataTransfer;
using orvik::gridmill::SPOTBlue;

// ---- transfer

struct Regions {
  Regions() = default;
  explicit Regions(const IIIDataTransfer& op) {
    if (op.inRegion[2] < 1 || op.inRegion[3] < 1) RaiseValue("inRegion", "an empty region", "pixels");
    if (op.outRegion[2] < 1 || op.outRegion[3] < 1) RaiseValue("outRegion", "an empty region", "pixels");
  }
};

using Transfer = Operator<IIIDataTransfer, Rebuilds::kNever, Regions>;
using Origin = std::pair<unsigned, unsigned>;

template <class Base>
auto RegionSetter(void (Base::*set)(std::vector<unsigned>&)) {
  return [set](Transfer& self, std::vector<unsigned> region) {
    if (region.size() < 4) RaiseValue("region", std::to_string(region.size()) + " entries", "four");
    const Turn turn = self.Enter();
    (self.op.*set)(region);
  };
}

void ProcessTransfer(Transfer& self, const py::object& given, const py::object& givenMask,
                     const py::object& givenOut, const Origin& inOrigin, const Origin& outOrigin) {
  const Image image = Image::Read("image", given, Types::kComplex);
  const Image out = Image::Written("out", givenOut, Types::kComplex);
  const Validity mask("mask", givenMask);
  mask.RequireSizeOf(image);
  out.RequireApart(image);
  out.RequireBands(image.type.isComplex && !out.type.isComplex ? 2 * image.bands : image.bands,
                   "at least the samples of the image");
  RequireOneRaster({image});
  const Turn turn = self.Enter();
  const CallTypes types{image.type, out.type};
  self.Run(types, self.LimitsFor(types), [&] {
    Raster in = image.Rows(0, image.height);
    in.originX = inOrigin.first;
    in.originY = inOrigin.second;
    InBands(out.height, out.width * out.PixelBytes(), [&](std::size_t first, std::size_t rows) {
      Raster target = out.Rows(first, rows);
      target.originX = outOrigin.first;
      target.originY = outOrigin.second + static_cast<unsigned>(first);
      self.op.Process(&in, nullptr, &target);
    });
  });
}

void BindTransfer(py::module_& module) {
  py::class_<Transfer> type(module, "IIIDataTransfer", "Nearest pixels from one region to another.");
  type.def(py::init<>());
  type.def("SetInRegion", RegionSetter(&IIIDataTransfer::SetInRegion), py::arg("region"));
  type.def("SetOutRegion", RegionSetter(&IIIDataTransfer::SetOutRegion), py::arg("region"));
  Parameter<Transfer>(type, "SetResampleType", &IIIDataTransfer::SetResampleType, "resampleType",
                      &IIIDataTransfer::resampleType);
  type.def_property_readonly("inRegion", Field<Transfer>(&IIIDataTransfer::inRegion));
  type.def_property_readonly("outRegion", Field<Transfer>(&IIIDataTransfer::outRegion));
  type.def("Process", &ProcessTransfer, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
           py::arg("in_origin") = Origin{0, 0}, py::arg("out_origin") = Origin{0, 0},
           "The core ignores `mask`.");
}

// ---- synthetic blue

struct BlueRanges {
  BlueRanges() = default;
  explicit BlueRanges(const SPOTBlue& op) : backgrounds(op.backGround.size()) {
    Require("min", op.min);
    Require("max", op.max);
    Require("backGround", op.backGround);
    if (op.trim) Require("scale", op.scale);
  }

  std::size_t backgrounds = 0;

 private:
  static void Require(const char* name, const std::vector<float>& values) {
    if (values.size() < 3) RaiseValue(name, std::to_string(values.size()) + " entries", "at least 3");
  }
};

using Blue = Operator<SPOTBlue, Rebuilds::kNever, BlueRanges>;

void ProcessBlue(Blue& self, const py::object& given, const py::object& givenMask,
                 const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  RequireFit(image, mask, out);
  if (out.bands == 3) image.RequireBands(2, "at least 2 for red and green");
  const Turn turn = self.Enter();
  const BlueRanges ranges = self.LimitsFor({image.type, out.type});
  if (ranges.backgrounds < image.bands)
    RaiseValue("backGround", std::to_string(ranges.backgrounds) + " entries",
               std::to_string(image.bands) + ", one for each band of the image");
  RunOverBands(self, ranges, image, mask, out);
}

void BindBlue(py::module_& module) {
  py::class_<Blue> type(module, "SPOTBlue", "A blue band from green, red and near infrared.");
  type.def(py::init<>());
  Parameter<Blue>(type, "SetMin", &SPOTBlue::SetMin, "min", &SPOTBlue::min);
  Parameter<Blue>(type, "SetMax", &SPOTBlue::SetMax, "max", &SPOTBlue::max);
  Parameter<Blue>(type, "SetScale", &SPOTBlue::SetScale, "scale", &SPOTBlue::scale);
  Parameter<Blue>(type, "SetBackGround", &SPOTBlue::SetBackGround, "backGround", &SPOTBlue::backGround);
  Parameter<Blue>(type, "SetTrim", &SPOTBlue::SetTrim, "trim", &SPOTBlue::trim);
  type.def("Process", &ProcessBlue, py::arg("image"), py::arg("mask").none(true), py::arg("out"));
}

}  // namespace

void BindServices(py::module_& module) {
  BindTransfer(module);
  BindBlue(module);
}

}  // namespace gridmill::python
