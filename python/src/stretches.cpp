#include <algorithm>
#include <string>
#include <vector>

#include "operator.h"
#include "processes/gridmill/intenpercent.h"
#include "processes/gridmill/normalize.h"
#include "processes/gridmill/percentile.h"

namespace gridmill::python {

std::vector<int> CountsOf(const py::object& counts) {
  using Exact = py::array_t<int, py::array::c_style>;
  if (!py::isinstance<Exact>(counts)) {
    try {
      return counts.cast<std::vector<int>>();
    } catch (const py::cast_error&) {
      RaiseType("counts", py::str(py::type::of(counts).attr("__name__")).cast<std::string>(),
                "a sequence of integers of 32 bits");
    }
  }
  const auto array = py::reinterpret_borrow<Exact>(counts);
  return std::vector<int>(array.data(), array.data() + array.size());
}

namespace {

using orvik::filters::IntenPercent;
using orvik::filters::Normalize;
using orvik::filters::Percentile;

/// A stretch of an image whose bands all need bounds.
template <class Holder>
void ProcessStretch(Holder& self, const py::object& given, const py::object& givenMask,
                    const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  RequireFit(image, mask, out);
  if (out.bands != image.bands)
    RaiseValue("out", std::to_string(out.bands) + " bands", std::to_string(image.bands) + ", as the image");
  const Turn turn = self.Enter();
  const auto limits = self.LimitsFor({image.type, out.type});
  if (limits.bands < image.bands)
    RaiseValue("MinData, MaxData", "bounds of " + std::to_string(limits.bands) + " bands",
               std::to_string(image.bands) + ", as many as the image has");
  RunOverBands(self, limits, image, mask, out);
}

// ---- normalize

struct Ranges {
  Ranges() = default;
  explicit Ranges(const Normalize& op) : bands(std::min(op.MinData.size(), op.MaxData.size())) {}

  std::size_t bands = 0;
};

using Normal = Operator<Normalize, Rebuilds::kOnAnyType, Ranges>;

void BindNormalize(py::module_& module) {
  py::class_<Normal> type(module, "Normalize", "Every sample as a percentage of the range of its band.");
  type.def(py::init<>());
  Parameter<Normal>(type, "SetMinData", &Normalize::SetMinData, "MinData", &Normalize::MinData);
  Parameter<Normal>(type, "SetMaxData", &Normalize::SetMaxData, "MaxData", &Normalize::MaxData);
  Parameter<Normal>(type, "SetNoData", &Normalize::SetNoData, "NoData", &Normalize::NoData);
  type.def("Process", &ProcessStretch<Normal>, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
           "The core ignores `mask`.");
}

// ---- percentile

std::size_t BinsOf(const Percentile& op) {
  if (op.BinNum < 1) RaiseValue("BinNum", std::to_string(op.BinNum), "at least 1");
  return static_cast<std::size_t>(op.BinNum);
}

/// What a build needs, since it computes the splines anew from the counts.
struct Splines {
  Splines() = default;
  explicit Splines(const Percentile& op) : bands(op.MaxData.size()) {
    const std::size_t bins = BinsOf(op);
    if (op.MinData.size() < bands)
      RaiseValue("MinData", std::to_string(op.MinData.size()) + " entries", std::to_string(bands));
    if (op.Coefficients.size() / bins < bands)
      RaiseValue("Coefficients", std::to_string(op.Coefficients.size()) + " counts",
                 std::to_string(bins) + " for each of " + std::to_string(bands) + " bands");
  }

  std::size_t bands = 0;
};

using Percent = Operator<Percentile, Rebuilds::kOnAnyType, Splines>;

void SetPercentileCounts(Percent& self, const py::object& given) {
  std::vector<int> counts = CountsOf(given);
  const Turn turn = self.Enter();
  const std::size_t bins = BinsOf(self.op), bands = self.op.MaxData.size();
  if (self.op.MinData.size() < bands)
    RaiseValue("MinData", std::to_string(self.op.MinData.size()) + " entries", std::to_string(bands));
  if (counts.size() / bins < bands)
    RaiseValue("counts", std::to_string(counts.size()) + " counts",
               std::to_string(bins) + " for each of " + std::to_string(bands) + " bands");
  for (const std::vector<double>& row : self.op.cumulative)
    if (row.size() < bins + 2)
      RaiseValue("BinNum", std::to_string(bins) + " after a histogram of fewer bins", "a new object");
  self.op.SetCoefficients(std::move(counts));
}

void BindPercentile(py::module_& module) {
  py::class_<Percent> type(module, "Percentile",
                           "Every sample as its percentile in the histogram of its band.");
  type.def(py::init<>());
  Parameter<Percent>(type, "SetMinData", &Percentile::SetMinData, "MinData", &Percentile::MinData);
  Parameter<Percent>(type, "SetMaxData", &Percentile::SetMaxData, "MaxData", &Percentile::MaxData);
  Parameter<Percent>(type, "SetNoData", &Percentile::SetNoData, "NoData", &Percentile::NoData);
  Parameter<Percent>(type, "SetBinNum", &Percentile::SetBinNum, "BinNum", &Percentile::BinNum);
  type.def("SetCoefficients", &SetPercentileCounts, py::arg("counts"),
           "Counts of bin i of band c at BinNum c + i. SetMinData, SetMaxData and SetBinNum come before.");
  type.def_property_readonly("Coefficients", Field<Percent>(&Percentile::Coefficients));
  type.def_property_readonly("totals", Field<Percent>(&Percentile::totals));
  type.def_property_readonly("binScale", Field<Percent>(&Percentile::binScale));
  type.def_property_readonly("cumulative", Field<Percent>(&Percentile::cumulative));
  type.def("Process", &ProcessStretch<Percent>, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
           "The core ignores `mask`.");
}

// ---- intensity

struct Intensity {
  Intensity() = default;
  explicit Intensity(const IntenPercent& op) {
    if (op.Bins.empty()) RaiseValue("Bins", "an empty histogram", "at least one bin");
  }
};

using Inten = Operator<IntenPercent, Rebuilds::kOnInputType, Intensity>;

void ProcessIntensity(Inten& self, const py::object& given, const py::object& givenMask,
                      const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  RequireFit(image, mask, out);
  image.RequireBands(3, "at least 3");
  out.RequireBands(4, "at least 4");
  const Turn turn = self.Enter();
  RunOverBands(self, self.LimitsFor({image.type, out.type}), image, mask, out);
}

void SetIntensityBins(Inten& self, const py::object& counts) {
  const std::vector<int> bins = CountsOf(counts);
  const Turn turn = self.Enter();
  self.op.SetBins(bins);
}

void BindIntensity(py::module_& module) {
  py::class_<Inten> type(module, "IntenPercent",
                         "The percentile of an intensity, signed by two other bands.");
  type.def(py::init<>());
  Parameter<Inten>(type, "SetMin", &IntenPercent::SetMin, "Min", &IntenPercent::Min);
  Parameter<Inten>(type, "SetMax", &IntenPercent::SetMax, "Max", &IntenPercent::Max);
  Parameter<Inten>(type, "SetNoData", &IntenPercent::SetNoData, "NoData", &IntenPercent::NoData);
  Parameter<Inten>(type, "SetScale", &IntenPercent::SetScale, "Scale", &IntenPercent::Scale);
  Parameter<Inten>(type, "SetType", &IntenPercent::SetType, "Type", &IntenPercent::Type);
  type.def("SetBins", &SetIntensityBins, py::arg("counts"), "Appends the counts.");
  type.def_property_readonly("Bins", Field<Inten>(&IntenPercent::Bins));
  type.def("Process", &ProcessIntensity, py::arg("image"), py::arg("mask").none(true), py::arg("out"));
}

}  // namespace

void BindStretches(py::module_& module) {
  BindNormalize(module);
  BindPercentile(module);
  BindIntensity(module);
}

}  // namespace gridmill::python
