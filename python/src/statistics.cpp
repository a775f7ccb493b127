#include <memory>
#include <string>
#include <vector>

#include "operator.h"
#include "processes/gridmill/rangeclasses.h"
#include "processes/gridmill/rasterstatistics.h"

// The operators that take a decision on each pixel.
namespace gridmill::python {

namespace {

using orvik::gridmill::RangeClasses;
using orvik::gridmill::RasterStatistics;

// ---- mask decisions

/// A Python function that decides on each pixel: it gets an array of the pixel's samples.
class Decision : public orvik::tessel::IMaskDecision {
 public:
  explicit Decision(py::function function) : function_(std::move(function)) {}
  ~Decision() override {
    const py::gil_scoped_acquire gil;
    function_ = py::function();
    dtype_ = py::dtype();
  }

  /// Says what the bare pointers are that the operator is about to hand in.
  void Read(const py::object& array, const Image& image) {
    dtype_ = py::reinterpret_borrow<py::array>(array).dtype();
    bands_ = image.bands;
  }

  bool IsPixelValid(const void* pixel) override {
    const py::gil_scoped_acquire gil;
    const py::array samples(dtype_, {bands_}, {}, pixel);
    return static_cast<bool>(py::bool_(function_(samples)));
  }

 private:
  py::function function_;
  py::dtype dtype_;
  std::size_t bands_ = 0;
};

/// A holder that keeps every decision that it was given: the core goes on with the one of its last build.
template <class Op, Rebuilds kRebuilds, class Limits>
class DecidingOperator : public Operator<Op, kRebuilds, Limits> {
 public:
  std::vector<std::unique_ptr<Decision>> decisions;
};

template <class Holder>
void SetDecision(Holder& self, const py::object& given) {
  if (!given.is_none() && !py::isinstance<py::function>(given) && PyCallable_Check(given.ptr()) == 0)
    RaiseType("decision", py::repr(given).template cast<std::string>(), "a function of a pixel, or None");
  std::unique_ptr<Decision> decision;
  if (!given.is_none()) decision = std::make_unique<Decision>(py::reinterpret_borrow<py::function>(given));
  const Turn turn = self.Enter();
  self.op.SetMask(decision.get());
  if (decision != nullptr) self.decisions.push_back(std::move(decision));
}

// ---- statistics

constexpr std::size_t kMostListed = 4096;

/// What the results hold.
struct Listed {
  Listed() = default;
  explicit Listed(const RasterStatistics& op)
      : bands(op.channels.size()),
        synthetic(op.method == orvik::gridmill::eSTATISTICS_SYNTHETIC_BLUE && bands > 2) {}

  std::size_t bands = 0;
  bool synthetic = false;
};

using Statistics = DecidingOperator<RasterStatistics, Rebuilds::kNever, Listed>;

void ProcessStatistics(Statistics& self, const py::object& given, const py::object& givenMask) {
  const Image image = Image::Read("image", given, Types::kComplex);
  const Validity mask("mask", givenMask);
  mask.RequireSizeOf(image);
  const Turn turn = self.Enter();
  const CallTypes types{image.type, image.type};
  const Listed listed = self.LimitsFor(types);
  if (listed.synthetic) image.RequireBands(3, "at least 3 for a synthetic blue");
  for (const auto& decision : self.decisions) decision->Read(given, image);
  self.Run(types, listed, [&] {
    InBands(image.height, image.width * image.PixelBytes(), [&](std::size_t first, std::size_t rows) {
      Raster in = image.Rows(first, rows);
      self.op.Process(&in, nullptr, nullptr);
    });
  });
}

void SetChannels(Statistics& self, std::vector<unsigned> channels) {
  const Turn turn = self.Enter();
  if (self.op.channels.size() + channels.size() > kMostListed)
    RaiseValue("channels", std::to_string(self.op.channels.size() + channels.size()) + " channels",
               "at most " + std::to_string(kMostListed));
  self.op.SetChans(channels);
}

/// A second call lengthens the histograms, of which no bin beyond the first 65536 is ever counted.
bool SetHistogramType(Statistics& self, int type) {
  const Turn turn = self.Enter();
  if (!self.op.histograms.empty() && self.op.histograms.front().size() >= (1u << 20))
    RaiseValue("type", "a histogram of " + std::to_string(self.op.histograms.front().size()) + " bins",
               "a new object");
  return self.op.SetType(type);
}

py::array_t<int> PixelCounts(Statistics& self, int channel) {
  const Turn turn = self.Enter();
  if (self.Built() && (channel < 0 || static_cast<std::size_t>(channel) >= self.Last().bands))
    RaiseValue("channel", std::to_string(channel), "0 to " + std::to_string(self.Last().bands) + " - 1");
  const std::vector<int> counts = self.op.GetPixelCounts(channel);
  return py::array_t<int>(static_cast<py::ssize_t>(counts.size()), counts.data());
}

template <class Holder, class Base>
auto Getter(void (Base::*get)(std::vector<float>&)) {
  return [get](Holder& self) {
    const Turn turn = self.Enter();
    std::vector<float> values;
    (self.op.*get)(values);
    return values;
  };
}

void BindRasterStatistics(py::module_& module) {
  using orvik::gridmill::StatisticsMethod;
  py::class_<Statistics> type(module, "RasterStatistics",
                              "Histogram, minimum and maximum of each channel over all calls.");
  type.def(py::init<>());
  type.def("SetChans", &SetChannels, py::arg("channels"), "Appends the channels.");
  type.def("SetType", &SetHistogramType, py::arg("type"), "8: 256 bins, any other value: 65536.");
  type.def("SetMask", &SetDecision<Statistics>, py::arg("decision").none(true),
           "A function that gets the array of a pixel's samples and says whether the pixel counts.");
  Parameter<Statistics>(type, "SetMethod", &RasterStatistics::SetMethod, "method", &RasterStatistics::method);
  type.def_property_readonly("channels", Field<Statistics>(&RasterStatistics::channels));
  type.def_property_readonly("histogramType", Field<Statistics>(&RasterStatistics::histogramType));
  type.def("GetMinValue", Getter<Statistics>(&RasterStatistics::GetMinValue));
  type.def("GetMaxValue", Getter<Statistics>(&RasterStatistics::GetMaxValue));
  type.def("GetPixelCounts", &PixelCounts, py::arg("channel"));
  type.def("Process", &ProcessStatistics, py::arg("image"), py::arg("mask") = py::none(),
           "The core ignores `mask`.");
}

// ---- classes

constexpr int kMostClasses = 1 << 20;

struct ClassRanges {
  ClassRanges() = default;
  explicit ClassRanges(const RangeClasses& op) {
    const std::size_t classes = op.classValues.size();
    if (op.minRange.size() < classes || op.maxRange.size() < classes)
      RaiseValue(
          "minRange, maxRange",
          std::to_string(op.minRange.size()) + " and " + std::to_string(op.maxRange.size()) + " bounds",
          std::to_string(classes) + ", one for each class");
  }
};

using Classes = DecidingOperator<RangeClasses, Rebuilds::kOnAnyType, ClassRanges>;

bool SetNumClasses(Classes& self, int count) {
  if (count > kMostClasses) RaiseValue("count", std::to_string(count), "at most 1048576");
  const Turn turn = self.Enter();
  return self.op.SetNumClasses(count);
}

void ProcessClasses(Classes& self, const py::object& given, const py::object& givenMask,
                    const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  RequireFit(image, mask, out);
  const Turn turn = self.Enter();
  RunOverBands(self, self.LimitsFor({image.type, out.type}), image, mask, out);
}

void BindClasses(py::module_& module) {
  py::class_<Classes> type(module, "RangeClasses", "The number of the class whose range a sample lies in.");
  type.def(py::init<>());
  type.def("SetNumClasses", &SetNumClasses, py::arg("count"));
  Parameter<Classes>(type, "SetMinRange", &RangeClasses::SetMinRange, "minRange", &RangeClasses::minRange);
  Parameter<Classes>(type, "SetMaxRange", &RangeClasses::SetMaxRange, "maxRange", &RangeClasses::maxRange);
  Parameter<Classes>(type, "SetNoData", &RangeClasses::SetNoData, "noData", &RangeClasses::noData);
  type.def("SetMask", &SetDecision<Classes>, py::arg("decision").none(true), "The core never calls it.");
  type.def_property_readonly("classCount", Field<Classes>(&RangeClasses::classCount));
  type.def_property_readonly("classValues", Field<Classes>(&RangeClasses::classValues));
  type.def("GetClassNumber", Setter<Classes>(&RangeClasses::GetClassNumber));
  type.def("GetMinRangeValue", Getter<Classes>(&RangeClasses::GetMinRangeValue));
  type.def("GetMaxRangeValue", Getter<Classes>(&RangeClasses::GetMaxRangeValue));
  type.def("Process", &ProcessClasses, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
           "The core ignores `mask`.");
}

}  // namespace

void BindStatistics(py::module_& module) {
  BindRasterStatistics(module);
  BindClasses(module);
}

}  // namespace gridmill::python
