#include "basic/exceptions/exceptions.h"
#include "operator.h"
#include "processes/gridmill/difftype.h"
#include "processes/gridmill/iiidatatransfer.h"
#include "processes/gridmill/rasterstatistics.h"
#include "processes/gridmill/vegindex.h"

namespace gridmill::python {

namespace {

void BindEnums(py::module_& module) {
  using namespace orvik::changedetection;
  using namespace orvik::filters;
  using namespace orvik::gridmill;
  py::enum_<DiffType>(module, "DiffType", py::arithmetic())
      .value("eDIFF_ABSOLUTE", eDIFF_ABSOLUTE)
      .value("eDIFF_FORWARD", eDIFF_FORWARD)
      .value("eDIFF_BACKWARD", eDIFF_BACKWARD);
  py::enum_<DiffType2>(module, "DiffType2", py::arithmetic())
      .value("eDIFF2_ABSOLUTE", eDIFF2_ABSOLUTE)
      .value("eDIFF2_SIGNED", eDIFF2_SIGNED);
  py::enum_<ResampleType>(module, "ResampleType", py::arithmetic())
      .value("eRESAMPLE_NEAREST", eRESAMPLE_NEAREST);
  py::enum_<StatisticsMethod>(module, "StatisticsMethod", py::arithmetic())
      .value("eSTATISTICS_PLAIN", eSTATISTICS_PLAIN)
      .value("eSTATISTICS_SYNTHETIC_BLUE", eSTATISTICS_SYNTHETIC_BLUE);
  py::enum_<BandRole>(module, "BandRole", py::arithmetic())
      .value("eBAND_BLUE", eBAND_BLUE)
      .value("eBAND_GREEN", eBAND_GREEN)
      .value("eBAND_RED", eBAND_RED)
      .value("eBAND_RED_EDGE", eBAND_RED_EDGE)
      .value("eBAND_NIR", eBAND_NIR)
      .value("eBAND_SWIR1", eBAND_SWIR1)
      .value("eBAND_SWIR2", eBAND_SWIR2);
  py::enum_<VegetationIndex>(module, "VegetationIndex", py::arithmetic())
      .value("eINDEX_NGRDI", eINDEX_NGRDI)
      .value("eINDEX_EXCESS_GREEN", eINDEX_EXCESS_GREEN)
      .value("eINDEX_DVI", eINDEX_DVI)
      .value("eINDEX_RVI", eINDEX_RVI)
      .value("eINDEX_NDVI", eINDEX_NDVI)
      .value("eINDEX_TVI", eINDEX_TVI)
      .value("eINDEX_SAVI", eINDEX_SAVI)
      .value("eINDEX_MSAVI2", eINDEX_MSAVI2)
      .value("eINDEX_GEMI", eINDEX_GEMI)
      .value("eINDEX_GREENNESS", eINDEX_GREENNESS)
      .value("eINDEX_MCARI", eINDEX_MCARI)
      .value("eINDEX_MTVI1", eINDEX_MTVI1);
}

}  // namespace

}  // namespace gridmill::python

PYBIND11_MODULE(_core, module) {
  namespace py = pybind11;
  module.doc() = "The operators under their names in the core library.";
  module.attr("__version__") = GRIDMILL_VERSION;
  py::register_exception<orvik::Exception>(module, "GridmillError", PyExc_RuntimeError).doc() =
      "A failure of the core itself; its message is the core's own.";
  gridmill::python::BindEnums(module);
  gridmill::python::BindTerrain(module);
  gridmill::python::BindFilters(module);
  gridmill::python::BindStretches(module);
  gridmill::python::BindFocus(module);
  gridmill::python::BindChange(module);
  gridmill::python::BindStatistics(module);
  gridmill::python::BindServices(module);
}
