#include <algorithm>
#include <cctype>
#include <string>

#include "operator.h"
#include "processes/gridmill/bitmapfiltering.h"
#include "processes/gridmill/mirrorimg.h"
#include "processes/gridmill/vegindex.h"

namespace gridmill::python {

namespace {

using orvik::filters::BitmapFiltering;
using orvik::filters::MirrorImg;
using orvik::filters::VegIndex;

// ---- thresholds

using Bitmap = Operator<BitmapFiltering, Rebuilds::kOnInputType>;

void ProcessBitmap(Bitmap& self, const py::object& given, const py::object& givenMask,
                   const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  RequireFit(image, mask, out);
  const Turn turn = self.Enter();
  RunOverBands(self, self.LimitsFor({image.type, out.type}), image, mask, out);
}

void BindBitmap(py::module_& module) {
  py::class_<Bitmap> type(module, "BitmapFiltering", "A bitmap of the samples within a range of thresholds.");
  type.def(py::init<float, float>(), py::arg("thresholdMin") = 0.0f, py::arg("thresholdMax") = 0.0f);
  Parameter<Bitmap>(type, "SetThresholdMin", &BitmapFiltering::SetThresholdMin, "thresholdMin",
                    &BitmapFiltering::thresholdMin);
  Parameter<Bitmap>(type, "SetThresholdMax", &BitmapFiltering::SetThresholdMax, "thresholdMax",
                    &BitmapFiltering::thresholdMax);
  type.def("Process", &ProcessBitmap, py::arg("image"), py::arg("mask").none(true), py::arg("out"));
}

// ---- mirror

/// How the last build mirrors.
struct Flip {
  Flip() = default;
  explicit Flip(const MirrorImg& op) : packed(op.isNewFile), windowed(!op.Window.empty()) {
    std::string axis = op.Axis;
    std::transform(axis.begin(), axis.end(), axis.begin(),
                   [](unsigned char letter) { return static_cast<char>(std::toupper(letter)); });
    if (axis != "VERT" && axis != "HORI") RaiseValue("Axis", "\"" + op.Axis + "\"", "\"VERT\" or \"HORI\"");
    inRows = axis == "VERT";
    if (!windowed) return;
    if (op.Window.size() < 4)
      RaiseValue("Window", std::to_string(op.Window.size()) + " entries", "none or four");
    window = op.Window[inRows ? 2 : 3];
  }

  bool inRows = true;
  bool packed = false;
  bool windowed = false;
  std::size_t window = 0;  ///< along the flip
};

/// The marked pixels of one row or column: `count` of them, the first at `first`.
struct Marked {
  std::size_t first = 0, count = 0;
};

template <class IsMarked>
Marked MarkedOf(std::size_t length, IsMarked isMarked) {
  Marked marked;
  for (std::size_t i = 0; i < length; ++i) {
    if (!isMarked(i)) continue;
    if (marked.count++ == 0) marked.first = i;
  }
  return marked;
}

/// Requires the pixels that `marked` ones are taken from to lie in a line of `length` pixels, and those that
/// they are written to in one of `outLength`.
void RequireInside(const Flip& flip, const Marked& marked, std::size_t length, std::size_t outLength) {
  if (marked.count == 0) return;
  const std::size_t window = flip.windowed ? flip.window : length;
  if (window < 1 || marked.first + window > length || marked.first + window < marked.count)
    RaiseValue("mask",
               "pixels from " + std::to_string(marked.first) + " on, " + std::to_string(marked.count) +
                   " in a line, in a window of " + std::to_string(window),
               "a window that lies in the image, at its marked pixels");
  if (flip.packed && marked.count > outLength)
    RaiseValue("out", std::to_string(outLength) + " pixels along the flip",
               "at least the " + std::to_string(marked.count) + " marked ones");
}

void RequireFlip(const Flip& flip, const Image& image, const Validity& mask, const Image& out) {
  const std::size_t length = flip.inRows ? image.width : image.height;
  const std::size_t lines = flip.inRows ? image.height : image.width;
  const std::size_t outLength = flip.inRows ? out.width : out.height;
  if (!flip.packed || !mask.Given()) {
    out.RequireSize(image.height, image.width);
  } else if ((flip.inRows ? out.height : out.width) < lines) {
    RaiseValue("out", std::to_string(out.height) + " x " + std::to_string(out.width) + " pixels",
               std::to_string(lines) + " across the flip");
  }
  if (!mask.Given()) {
    if (lines > 0) RequireInside(flip, {0, length}, length, outLength);
    return;
  }
  for (std::size_t line = 0; line < lines; ++line) {
    const auto isMarked = [&](std::size_t i) { return flip.inRows ? mask.At(i, line) : mask.At(line, i); };
    RequireInside(flip, MarkedOf(length, isMarked), length, outLength);
  }
}

using Mirror = Operator<MirrorImg, Rebuilds::kOnAnyType, Flip>;

void ProcessMirror(Mirror& self, const py::object& given, const py::object& givenMask,
                   const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  mask.RequireSizeOf(image);
  out.RequireApart(image);
  mask.RequireApart(out);
  if (out.bands != image.bands)
    RaiseValue("out", std::to_string(out.bands) + " bands", std::to_string(image.bands) + ", as the image");
  RequireOneRaster({image, out});
  const Turn turn = self.Enter();
  const Flip flip = self.LimitsFor({image.type, out.type});
  RequireFlip(flip, image, mask, out);
  self.Run({image.type, out.type}, flip, [&] {
    Raster in = image.Rows(0, image.height), target = out.Rows(0, out.height);
    std::optional<Mask> marked = mask.Rows(0, image.height);
    self.op.Process(&in, Pointer(marked), &target);
  });
}

void BindMirror(py::module_& module) {
  py::class_<Mirror> type(module, "MirrorImg", "A mirrored raster, or one in which a window is mirrored.");
  type.def(py::init<>());
  Parameter<Mirror>(type, "SetAxis", &MirrorImg::SetAxis, "Axis", &MirrorImg::Axis);
  Parameter<Mirror>(type, "SetWindow", &MirrorImg::SetWindow, "Window", &MirrorImg::Window);
  Parameter<Mirror>(type, "IsNewFile", &MirrorImg::IsNewFile, "isNewFile", &MirrorImg::isNewFile);
  type.def("Process", &ProcessMirror, py::arg("image"), py::arg("mask").none(true), py::arg("out"),
           "A True pixel of `mask` belongs to the window that is mirrored.");
}

// ---- vegetation indices

constexpr std::size_t kIndices = 12;

/// What the last build asks for.
struct Plan {
  Plan() = default;
  explicit Plan(const VegIndex& op) : roles(op.bandIndex.size()) {
    if (op.requestedIndex.size() < kIndices)
      RaiseValue("requestedIndex", std::to_string(op.requestedIndex.size()) + " entries", "twelve");
    outputs = static_cast<std::size_t>(
        std::count(op.requestedIndex.begin(), op.requestedIndex.begin() + kIndices, 1u));
  }

  std::size_t roles = 0;
  std::size_t outputs = 0;
};

using Indices = Operator<VegIndex, Rebuilds::kOnAnyType, Plan>;

void ProcessIndices(Indices& self, const py::object& given, const py::object& givenMask,
                    const py::object& givenOut) {
  const Image image = Image::Read("image", given), out = Image::Written("out", givenOut);
  const Validity mask("mask", givenMask);
  RequireFit(image, mask, out);
  const Turn turn = self.Enter();
  const Plan plan = self.LimitsFor({image.type, out.type});
  if (plan.roles < image.bands)
    RaiseValue("bandIndex", std::to_string(plan.roles) + " entries",
               std::to_string(image.bands) + ", one for each band of the image");
  out.RequireBands(plan.outputs, "one for each requested index");
  RunOverBands(self, plan, image, mask, out);
}

void BindIndices(py::module_& module) {
  py::class_<Indices> type(module, "VegIndex", "Up to twelve vegetation indices in one pass.");
  type.def(py::init<>());
  Parameter<Indices>(type, "SetRequestedIndex", &VegIndex::SetRequestedIndex, "requestedIndex",
                     &VegIndex::requestedIndex);
  Parameter<Indices>(type, "SetBandIndex", &VegIndex::SetBandIndex, "bandIndex", &VegIndex::bandIndex);
  type.def("Process", &ProcessIndices, py::arg("image"), py::arg("mask").none(true), py::arg("out"));
}

}  // namespace

void BindFilters(py::module_& module) {
  BindBitmap(module);
  BindMirror(module);
  BindIndices(module);
}

}  // namespace gridmill::python
