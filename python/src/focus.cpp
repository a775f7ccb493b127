#include <cstdio>
#include <string>

#include "operator.h"
#include "processes/gridmill/sqrgradient.h"
#include "processes/gridmill/vollath.h"

namespace gridmill::python {

namespace {

using orvik::filters::SqrGradientEvaluation;
using orvik::filters::VollathEvaluation;

constexpr unsigned kMostBands = 1u << 20;

/// All calls with one type need one number of bands.
struct Bands {
  Bands() = default;
  template <class Op>
  explicit Bands(const Op&) {}

  std::size_t count = 0;  ///< 0 before a build
};

template <class Holder>
void ProcessFocus(Holder& self, const py::object& given, const py::object& givenMask) {
  const Image image = Image::Read("image", given);
  const Validity mask("mask", givenMask);
  mask.RequireSizeOf(image);
  RequireOneRaster({image});
  const Turn turn = self.Enter();
  const CallTypes types{image.type};
  Bands bands = self.LimitsFor(types);
  if (bands.count != 0 && bands.count != image.bands)
    RaiseValue("image", std::to_string(image.bands) + " bands",
               std::to_string(bands.count) + ", as in the first image of this object");
  bands.count = image.bands;
  self.Run(types, bands, [&] {
    Raster in = image.Rows(0, image.height);
    std::optional<Mask> valid = mask.Rows(0, image.height);
    self.op.Process(&in, Pointer(valid), nullptr);
    // Otherwise the lines leave at the end of the process, wherever its standard output then goes.
    std::fflush(stdout);
  });
}

template <class Holder>
void InitEvaluation(Holder& self, unsigned channels) {
  if (channels > kMostBands) RaiseValue("channels", std::to_string(channels), "at most 1048576");
  const Turn turn = self.Enter();
  self.op.InitEvaluation(channels);
}

template <class Holder, class Class, class Op>
void DefineFocus(Class& type, const Op*) {
  type.def(py::init<>());
  type.def("SetBackground", Setter<Holder>(&Op::SetBackground), py::arg("low"), py::arg("high"));
  type.def_property_readonly("backgroundLow", Field<Holder>(&Op::backgroundLow));
  type.def_property_readonly("backgroundHigh", Field<Holder>(&Op::backgroundHigh));
  Parameter<Holder>(type, "SetFailure", &Op::SetFailure, "failure", &Op::failure);
  type.def("InitEvaluation", &InitEvaluation<Holder>, py::arg("channels"));
  type.def_property_readonly("numChannels", Field<Holder>(&Op::numChannels));
  type.def("Process", &ProcessFocus<Holder>, py::arg("image"), py::arg("mask") = py::none());
}

}  // namespace

void BindFocus(py::module_& module) {
  using Gradient = Operator<SqrGradientEvaluation, Rebuilds::kOnInputType, Bands>;
  py::class_<Gradient> gradient(
      module, "SqrGradientEvaluation",
      "The sum of the squared differences of vertical neighbours. Each call prints a "
      "line for each band on the process's standard output.");
  DefineFocus<Gradient>(gradient, static_cast<const SqrGradientEvaluation*>(nullptr));
  gradient.def("GetEvaluation", Field<Gradient>(&SqrGradientEvaluation::evaluation));

  using Vollath = Operator<VollathEvaluation, Rebuilds::kOnInputType, Bands>;
  py::class_<Vollath> vollath(module, "VollathEvaluation", "The two sums of Vollath's focus measure.");
  DefineFocus<Vollath>(vollath, static_cast<const VollathEvaluation*>(nullptr));
  vollath.def("GetLeftEq", Field<Vollath>(&VollathEvaluation::leftEq));
  vollath.def("GetRightEq", Field<Vollath>(&VollathEvaluation::rightEq));
}

}  // namespace gridmill::python
