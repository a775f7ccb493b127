#include <string>

#include "operator.h"
#include "processes/gridmill/chandiffchange.h"
#include "processes/gridmill/chandiffchange2.h"
#include "processes/gridmill/chanratiochange.h"
#include "processes/gridmill/chanratiochange2.h"
#include "processes/gridmill/combchange.h"
#include "processes/gridmill/intenratiochange.h"
#include "processes/gridmill/magnitudechange.h"
#include "processes/gridmill/singlechange.h"
#include "processes/gridmill/tasseledcapchange.h"

namespace gridmill::python {

namespace {

using namespace orvik::changedetection;

/// What the bands of a call have to be, by the parameters of the last build.
struct Needs {
  Needs() = default;
  explicit Needs(const SingleChange&) {}
  explicit Needs(const TCGNChange& op) { OfSensors(op); }
  explicit Needs(const TCSBChange& op) { OfSensors(op); }
  template <class Op>
  explicit Needs(const Op& op) : imgNoData(op.imgNoData.size()), refNoData(op.refNoData.size()) {}

  /// The no-data test of both dates runs if the image has as many bands as there are values for it.
  void RequireNoData(const Image& image, const Image& reference) const {
    if (imgNoData != image.bands) return;
    if (refNoData < image.bands)
      RaiseValue("refNoData", std::to_string(refNoData) + " entries",
                 std::to_string(image.bands) + ", as many as imgNoData");
    reference.RequireBands(image.bands, "at least those of the image, which are tested for no-data");
  }

  std::size_t imgNoData = 0, refNoData = 0;
  std::size_t imageBands = 1, referenceBands = 1;

 private:
  template <class Op>
  void OfSensors(const Op& op) {
    imgNoData = op.imgNoData.size();
    refNoData = op.refNoData.size();
    imageBands = BandsOf(op.sensorType);
    referenceBands = BandsOf(op.refSensorType);
  }

  /// An unknown sensor is the core's to refuse, which it does before it reads a band.
  static std::size_t BandsOf(const std::string& sensor) {
    if (sensor == "Landsat-4 TM" || sensor == "Landsat-5 TM" || sensor == "Landsat-7 ETM+") return 6;
    return 4;
  }
};

/// How many bands an operator reads of the reference and writes, for an image of `bands`.
enum class Shape {
  kFirst,     ///< one of each
  kSamples,   ///< as many as the image has
  kCombined,  ///< writes those of both dates
  kThree,     ///< writes three
  kAxes,      ///< reads of either date the bands of its sensor, writes three
  kFour,      ///< writes four
};

void RequireBands(Shape shape, const Image& image, const Image& reference, const Image& out) {
  if (shape == Shape::kSamples || shape == Shape::kThree || shape == Shape::kFour)
    reference.RequireBands(image.bands, "at least those of the image");
  switch (shape) {
    case Shape::kFirst:
      return;
    case Shape::kSamples:
      return out.RequireBands(image.bands, "at least those of the image");
    case Shape::kCombined:
      return out.RequireBands(image.bands + reference.bands, "those of both dates");
    case Shape::kThree:
    case Shape::kAxes:
      return out.RequireBands(3, "at least 3");
    case Shape::kFour:
      return out.RequireBands(4, "at least 4");
  }
}

void RequirePlace(const Image& image, const Image& reference, const Image& out) {
  reference.RequireSize(image.height, image.width);
  out.RequireSize(image.height, image.width);
  out.RequireApart(image);
  out.RequireApart(reference);
}

template <class Work>
void OverBands(const Image& image, const Image& reference, const Image& out, Work work) {
  const std::size_t rowBytes = image.width * (image.PixelBytes() + reference.PixelBytes() + out.PixelBytes());
  InBands(image.height, rowBytes, [&](std::size_t first, std::size_t rows) {
    Raster in = image.Rows(first, rows), ref = reference.Rows(first, rows), target = out.Rows(first, rows);
    work(first, rows, in, ref, target);
  });
}

// ---- one mask, image and reference of one type

template <class Holder, Shape kShape>
void ProcessOneMask(Holder& self, const py::object& given, const py::object& givenReference,
                    const py::object& givenMask, const py::object& givenOut) {
  const Image image = Image::Read("image", given), reference = Image::Read("reference", givenReference);
  const Image out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  reference.RequireType(image);
  RequirePlace(image, reference, out);
  RequireBands(kShape, image, reference, out);
  mask.RequireSizeOf(image);
  mask.RequireApart(out);
  const Turn turn = self.Enter();
  const CallTypes types{image.type, out.type};
  const Needs needs = self.LimitsFor(types);
  image.RequireBands(needs.imageBands, "those of its sensor");
  reference.RequireBands(needs.referenceBands, "those of its sensor");
  if (kShape != Shape::kFirst && kShape != Shape::kCombined) needs.RequireNoData(image, reference);
  self.Run(types, needs, [&] {
    OverBands(image, reference, out,
              [&](std::size_t first, std::size_t rows, Raster& in, Raster& ref, Raster& target) {
                std::optional<Mask> valid = mask.Rows(first, rows);
                self.op.Process(&in, &ref, Pointer(valid), &target);
              });
  });
}

// ---- types of the short list, one of their own for each raster

/// The types that the operator remembers: those of the real parts.
CallTypes RealTypes(const Image& image, const Image& reference, const Image& out) {
  CallTypes types{image.type, reference.type, out.type};
  types[0].isComplex = types[1].isComplex = false;
  return types;
}

template <class Holder, class Work>
void RunMixed(Holder& self, const Image& image, const Image& reference, const Image& out, Work work) {
  RequirePlace(image, reference, out);
  RequireBands(Shape::kSamples, image, reference, out);
  const Turn turn = self.Enter();
  const CallTypes types = RealTypes(image, reference, out);
  const Needs needs = self.LimitsFor(types);
  needs.RequireNoData(image, reference);
  self.Run(types, needs, [&] { OverBands(image, reference, out, work); });
}

template <class Holder>
void ProcessMixed(Holder& self, const py::object& given, const py::object& givenReference,
                  const py::object& givenMask, const py::object& givenOut) {
  const Image image = Image::Read("image", given, Types::kShortComplex);
  const Image reference = Image::Read("reference", givenReference, Types::kShortComplex);
  const Image out = Image::Written("out", givenOut, Types::kShort);
  const Validity mask("mask", givenMask);
  mask.RequireSizeOf(image);
  mask.RequireApart(out);
  RunMixed(self, image, reference, out,
           [&](std::size_t first, std::size_t rows, Raster& in, Raster& ref, Raster& target) {
             std::optional<Mask> valid = mask.Rows(first, rows);
             self.op.Process(&in, &ref, Pointer(valid), &target);
           });
}

template <class Holder>
void ProcessTwoMasks(Holder& self, const py::object& given, const py::object& givenReference,
                     const py::object& givenMask, const py::object& givenReferenceMask,
                     const py::object& givenOut) {
  const Image image = Image::Read("image", given, Types::kShortComplex);
  const Image reference = Image::Read("reference", givenReference, Types::kShortComplex);
  const Image out = Image::Written("out", givenOut, Types::kShort);
  const Validity mask("mask", givenMask), referenceMask("reference_mask", givenReferenceMask);
  mask.RequireSizeOf(image);
  mask.RequireApart(out);
  referenceMask.RequireSizeOf(image);
  referenceMask.RequireApart(out);
  RunMixed(self, image, reference, out,
           [&](std::size_t first, std::size_t rows, Raster& in, Raster& ref, Raster& target) {
             std::optional<Mask> valid = mask.Rows(first, rows);
             // A set bit of the core's reference mask excludes; here True is valid everywhere.
             std::optional<Mask> excluded =
                 referenceMask.Rows(first, rows, 0, Validity::Sense::kSetIsExcluded);
             self.op.Process(&in, &ref, Pointer(valid), Pointer(excluded), &target);
           });
}

// ---- classes

template <class Holder, class Class, class Op>
void DefineChangeParameters(Class& type, const Op*) {
  Parameter<Holder>(type, "SetType", &Op::SetType, "type", &Op::type);
  Parameter<Holder>(type, "SetNoData", &Op::SetNoData, "noData", &Op::noData);
  Parameter<Holder>(type, "SetImgNoData", &Op::SetImgNoData, "imgNoData", &Op::imgNoData);
  Parameter<Holder>(type, "SetRefNoData", &Op::SetRefNoData, "refNoData", &Op::refNoData);
}

template <class Holder, class Class>
void DefineOneMaskProcess(Class& type, void (*process)(Holder&, const py::object&, const py::object&,
                                                       const py::object&, const py::object&)) {
  type.def("Process", process, py::arg("image"), py::arg("reference"), py::arg("mask").none(true),
           py::arg("out"));
}

template <class Op, Shape kShape>
void BindOneMask(py::module_& module, const char* name, const char* doc) {
  using Holder = Operator<Op, Rebuilds::kOnAnyType, Needs>;
  py::class_<Holder> type(module, name, doc);
  type.def(py::init<DiffType>(), py::arg("type"));
  DefineChangeParameters<Holder>(type, static_cast<const Op*>(nullptr));
  DefineOneMaskProcess<Holder>(type, &ProcessOneMask<Holder, kShape>);
}

template <class Op>
void BindTwoMasks(py::module_& module, const char* name, const char* doc) {
  using Holder = Operator<Op, Rebuilds::kOnAnyType, Needs>;
  py::class_<Holder> type(module, name, doc);
  type.def(py::init<DiffType2>(), py::arg("type"));
  DefineChangeParameters<Holder>(type, static_cast<const Op*>(nullptr));
  type.def("Process", &ProcessTwoMasks<Holder>, py::arg("image"), py::arg("reference"),
           py::arg("mask").none(true), py::arg("reference_mask").none(true), py::arg("out"),
           "True is a valid pixel in both masks: the reference mask is turned for the core.");
}

template <class Op>
void BindTasseledCap(py::module_& module, const char* name, const char* doc) {
  using Holder = Operator<Op, Rebuilds::kOnAnyType, Needs>;
  py::class_<Holder> type(module, name, doc);
  type.def(py::init<std::string, std::string, DiffType>(), py::arg("sensorType"), py::arg("refSensorType"),
           py::arg("type"));
  DefineChangeParameters<Holder>(type, static_cast<const Op*>(nullptr));
  Parameter<Holder>(type, "SetSensorType", &Op::SetSensorType, "sensorType", &Op::sensorType);
  Parameter<Holder>(type, "SetRefSensorType", &Op::SetRefSensorType, "refSensorType", &Op::refSensorType);
  DefineOneMaskProcess<Holder>(type, &ProcessOneMask<Holder, Shape::kAxes>);
}

void BindSingle(py::module_& module) {
  using Holder = Operator<SingleChange, Rebuilds::kOnAnyType, Needs>;
  py::class_<Holder> type(module, "SingleChange", "The difference of the first bands of two dates.");
  type.def(py::init<DiffType>(), py::arg("type"));
  Parameter<Holder>(type, "SetType", &SingleChange::SetType, "type", &SingleChange::type);
  DefineOneMaskProcess<Holder>(type, &ProcessOneMask<Holder, Shape::kFirst>);
}

void BindRatioOneMask(py::module_& module) {
  using Holder = Operator<ChanRatioChange2, Rebuilds::kOnAnyType, Needs>;
  py::class_<Holder> type(module, "ChanRatioChange2", "The ratio of two dates band by band, with one mask.");
  type.def(py::init<DiffType>(), py::arg("type"));
  DefineChangeParameters<Holder>(type, static_cast<const ChanRatioChange2*>(nullptr));
  DefineOneMaskProcess<Holder>(type, &ProcessMixed<Holder>);
}

}  // namespace

void BindChange(py::module_& module) {
  BindSingle(module);
  BindOneMask<ChanDiffChange, Shape::kSamples>(module, "ChanDiffChange",
                                               "The difference of two dates band by band.");
  BindOneMask<CombChange, Shape::kCombined>(module, "CombChange", "The bands of two dates side by side.");
  BindOneMask<IntenRatioChange, Shape::kFour>(
      module, "IntenRatioChange", "The mean intensities of two dates and their ratio in decibels.");
  BindOneMask<MagnitudeChange, Shape::kThree>(
      module, "MagnitudeChange", "The lengths of the pixel vectors of two dates, and their difference.");
  BindTasseledCap<TCGNChange>(module, "TCGNChange",
                              "The tasseled-cap greenness of two dates, and their difference.");
  BindTasseledCap<TCSBChange>(module, "TCSBChange",
                              "The tasseled-cap brightness of two dates, and their difference.");
  BindRatioOneMask(module);
  BindTwoMasks<ChanDiffChange2>(module, "ChanDiffChange2",
                                "The difference of two dates band by band, with a mask for each.");
  BindTwoMasks<ChanRatioChange>(module, "ChanRatioChange",
                                "The ratio of two dates band by band, with a mask for each.");
}

}  // namespace gridmill::python
