#include "arrays.h"

#include <algorithm>
#include <cstring>
#include <limits>

namespace gridmill::python {

namespace {

using orvik::tessel::ElementType;
using orvik::tessel::RasterInfo;

constexpr std::size_t kBandBytes = std::size_t{16} << 20;
constexpr std::size_t kMostPixels = std::numeric_limits<std::uint32_t>::max();

const char* Expected(Types types) {
  switch (types) {
    case Types::kReal:
      return "int8 to int64, uint8 to uint64, float32 or float64";
    case Types::kComplex:
      return "int8 to int64, uint8 to uint64, float32, float64, complex64 or complex128";
    case Types::kShort:
      return "uint8, int16, uint16 or float32";
    case Types::kShortComplex:
      return "uint8, int16, uint16, float32 or complex64";
  }
  return "";
}

std::string TypeName(const py::handle& object) {
  return py::str(py::type::of(object).attr("__name__")).cast<std::string>();
}

/// The element type of a dtype; none if it is no pixel type.
std::optional<DataType> DataTypeOf(const py::dtype& dtype) {
  using orvik::tessel::eDT_16S, orvik::tessel::eDT_16U, orvik::tessel::eDT_32F, orvik::tessel::eDT_32S,
      orvik::tessel::eDT_32U, orvik::tessel::eDT_64F, orvik::tessel::eDT_64S, orvik::tessel::eDT_64U,
      orvik::tessel::eDT_8S, orvik::tessel::eDT_8U;
  const auto bytes = dtype.itemsize();
  switch (dtype.kind()) {
    case 'i':
      return DataType(bytes == 1 ? eDT_8S : bytes == 2 ? eDT_16S : bytes == 4 ? eDT_32S : eDT_64S);
    case 'u':
      return DataType(bytes == 1 ? eDT_8U : bytes == 2 ? eDT_16U : bytes == 4 ? eDT_32U : eDT_64U);
    case 'f':
      if (bytes == 4 || bytes == 8) return DataType(bytes == 4 ? eDT_32F : eDT_64F);
      return std::nullopt;
    case 'c':
      if (bytes == 8 || bytes == 16) return DataType(bytes == 8 ? eDT_32F : eDT_64F, true);
      return std::nullopt;
    default:
      return std::nullopt;
  }
}

bool Allowed(const DataType& type, Types types) {
  const bool complex = types == Types::kComplex || types == Types::kShortComplex;
  if (type.isComplex && !complex) return false;
  if (types == Types::kReal || types == Types::kComplex) return true;
  if (type.isFloat) return type.sizeBits == 32;
  return type.sizeBits == 16 || (type.sizeBits == 8 && !type.isSigned);
}

py::array ArrayOf(const char* argument, const py::handle& given) {
  if (!py::isinstance<py::array>(given)) RaiseType(argument, TypeName(given), "a numpy array");
  return py::reinterpret_borrow<py::array>(given);
}

bool IsInPlace(const py::array& array) {
  constexpr int kNeeded = py::array::c_style | py::detail::npy_api::NPY_ARRAY_ALIGNED_;
  const char order = array.dtype().byteorder();
  return (array.flags() & kNeeded) == kNeeded && (order == '=' || order == '|');
}

void RequireInPlace(const char* argument, const py::array& array) {
  if (!IsInPlace(array))
    RaiseValue(argument, "strided, misaligned or of foreign byte order",
               "a C-contiguous array of the machine's byte order");
}

/// The bits of `count` bools, the first in the most significant bit of a byte.
void PackBools(const unsigned char* bools, std::size_t count, unsigned char flip, unsigned char* bytes) {
  // Moves the lowest bit of byte i of a little-endian word to bit 7 - i of its highest byte.
  constexpr std::uint64_t kLowest = 0x0101010101010101u, kGather = 0x8040201008040201u;
  std::size_t i = 0;
  for (; i + 8 <= count; i += 8) {
    std::uint64_t word;
    std::memcpy(&word, bools + i, 8);
    *bytes++ = static_cast<unsigned char>(((word & kLowest) * kGather >> 56) ^ flip);
  }
  if (i == count) return;
  unsigned last = 0;
  for (unsigned bit = 128; i < count; ++i, bit >>= 1) last |= (bools[i] & 1u) * bit;
  *bytes = static_cast<unsigned char>(last ^ flip);
}

bool Overlap(const unsigned char* a, std::size_t aBytes, const unsigned char* b, std::size_t bBytes) {
  return aBytes > 0 && bBytes > 0 && std::less<>()(a, b + bBytes) && std::less<>()(b, a + aBytes);
}

}  // namespace

void RaiseValue(const std::string& argument, const std::string& came, const std::string& expected) {
  throw py::value_error(argument + ": " + came + "; expected " + expected);
}

void RaiseType(const std::string& argument, const std::string& came, const std::string& expected) {
  throw py::type_error(argument + ": " + came + "; expected " + expected);
}

std::string NameOf(const DataType& type) {
  if (type.isComplex) return "complex" + std::to_string(2 * type.sizeBits);
  return (type.isFloat ? "float" : type.isSigned ? "int" : "uint") + std::to_string(type.sizeBits);
}

Image Image::Read(const char* argument, const py::handle& given, Types types) {
  const py::array array = ArrayOf(argument, given);
  const std::optional<DataType> type = DataTypeOf(array.dtype());
  if (!type || !Allowed(*type, types))
    RaiseType(argument, "an array of " + py::str(array.dtype()).cast<std::string>(), Expected(types));
  if (array.ndim() != 2 && array.ndim() != 3)
    RaiseValue(argument, "an array of " + std::to_string(array.ndim()) + " dimensions",
               "(height, width) or (height, width, bands)");
  RequireInPlace(argument, array);
  Image image;
  image.argument = argument;
  image.height = static_cast<std::size_t>(array.shape(0));
  image.width = static_cast<std::size_t>(array.shape(1));
  image.bands = array.ndim() == 3 ? static_cast<std::size_t>(array.shape(2)) : 1;
  image.type = *type;
  image.data = static_cast<unsigned char*>(const_cast<void*>(array.data()));
  image.RequireBands(1, "at least one band");
  if (image.width > kMostPixels || image.height > kMostPixels || image.bands > kMostPixels ||
      image.width * 3 * image.PixelBytes() > kMostPixels)
    RaiseValue(argument, "an array of " + image.Size(), "rows of less than 1.4 GB");
  return image;
}

Image Image::Written(const char* argument, const py::handle& given, Types types) {
  const Image image = Read(argument, given, types);
  if (!py::reinterpret_borrow<py::array>(given).writeable())
    RaiseValue(argument, "a read-only array", "one to write to");
  return image;
}

Raster Image::Rows(std::size_t first, std::size_t rows, std::size_t margin) const {
  const auto m = static_cast<std::uint32_t>(margin);
  const RasterInfo info(static_cast<std::uint32_t>(width) - 2 * m, static_cast<std::uint32_t>(rows),
                        static_cast<std::uint32_t>(bands), type);
  return Raster(info, RasterContext(m, m), data + first * width * PixelBytes());
}

std::string Image::Size() const {
  return std::to_string(height) + " x " + std::to_string(width) + " x " + std::to_string(bands);
}

void Image::RequireSize(std::size_t neededHeight, std::size_t neededWidth) const {
  if (height == neededHeight && width == neededWidth) return;
  RaiseValue(argument, std::to_string(height) + " x " + std::to_string(width) + " pixels",
             std::to_string(neededHeight) + " x " + std::to_string(neededWidth));
}

void Image::RequireBands(std::size_t least, const char* reason) const {
  if (bands >= least) return;
  RaiseValue(argument, std::to_string(bands) + (bands == 1 ? " band" : " bands"), reason);
}

void Image::RequireType(const Image& other) const {
  if (type == other.type) return;
  RaiseType(argument, "an array of " + NameOf(type),
            NameOf(other.type) + ", the type of " + std::string(other.argument));
}

void Image::RequireApart(const Image& other) const {
  if (Overlap(data, Bytes(), other.data, other.Bytes()))
    RaiseValue(argument, "shares memory with " + std::string(other.argument), "an array of its own");
}

Validity::Validity(const char* argument, const py::handle& given) : argument_(argument) {
  if (given.is_none()) return;
  const py::array array = ArrayOf(argument, given);
  if (array.dtype().kind() != 'b')
    RaiseType(argument, "an array of " + py::str(array.dtype()).cast<std::string>(),
              "bool, True for a valid pixel");
  if (array.ndim() != 2)
    RaiseValue(argument, "an array of " + std::to_string(array.ndim()) + " dimensions", "(height, width)");
  RequireInPlace(argument, array);
  bools_ = static_cast<const unsigned char*>(array.data());
  height_ = static_cast<std::size_t>(array.shape(0));
  width_ = static_cast<std::size_t>(array.shape(1));
}

void Validity::RequireSizeOf(const Image& image) const {
  if (bools_ == nullptr || (height_ == image.height && width_ == image.width)) return;
  RaiseValue(
      argument_, std::to_string(height_) + " x " + std::to_string(width_) + " pixels",
      std::to_string(image.height) + " x " + std::to_string(image.width) + ", the size of " + image.argument);
}

void Validity::RequireApart(const Image& out) const {
  if (Overlap(out.data, out.Bytes(), bools_, height_ * width_))
    RaiseValue(out.argument, "shares memory with " + std::string(argument_), "an array of its own");
}

std::optional<Mask> Validity::Rows(std::size_t first, std::size_t rows, std::size_t margin,
                                   Sense sense) const {
  if (bools_ == nullptr) return std::nullopt;
  const auto m = static_cast<std::uint32_t>(margin);
  std::optional<Mask> mask(std::in_place, static_cast<std::uint32_t>(width_) - 2 * m,
                           static_cast<std::uint32_t>(rows), RasterContext(m, m), false);
  const unsigned char flip = sense == Sense::kSetIsExcluded ? 0xFF : 0;
  PackBools(bools_ + first * width_, (rows + 2 * margin) * width_, flip, mask->bits.data());
  return mask;
}

void InBands(std::size_t count, std::size_t rowBytes,
             const std::function<void(std::size_t first, std::size_t rows)>& run) {
  const std::size_t band = std::max<std::size_t>(kBandBytes / std::max<std::size_t>(rowBytes, 1), 1);
  std::size_t first = 0;
  while (true) {
    const std::size_t rows = std::min({band, count - first, kMostPixels});
    run(first, rows);
    first += rows;
    if (first >= count) return;
    const py::gil_scoped_acquire gil;
    if (PyErr_CheckSignals() != 0) throw py::error_already_set();
  }
}

void RequireOneRaster(std::initializer_list<Image> images) {
  for (const Image& image : images)
    if (image.height * image.width > kMostPixels)
      RaiseValue(image.argument,
                 std::to_string(image.height) + " x " + std::to_string(image.width) + " pixels",
                 "at most 4294967295, since this operator takes an image as a whole");
}

}  // namespace gridmill::python
