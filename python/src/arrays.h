#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <initializer_list>
#include <optional>
#include <string>

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

/// numpy arrays as rasters and masks, without a copy of a sample.
namespace gridmill::python {

namespace py = pybind11;
using orvik::tessel::DataType;
using orvik::tessel::Mask;
using orvik::tessel::Raster;
using orvik::tessel::RasterContext;

/// Throws ValueError "argument: came; expected".
[[noreturn]] void RaiseValue(const std::string& argument, const std::string& came,
                             const std::string& expected);

/// Throws TypeError of the same form.
[[noreturn]] void RaiseType(const std::string& argument, const std::string& came,
                            const std::string& expected);

/// Which element types an argument may have.
enum class Types {
  kReal,          ///< the ten pixel types
  kComplex,       ///< the ten, and complex numbers of either floating type
  kShort,         ///< uint8, int16, uint16 and float32
  kShortComplex,  ///< these four and complex64
};

/// An array of an image, which stays the caller's: (height, width) or (height, width, bands), C-contiguous.
class Image {
 public:
  /// An array to read.
  /// @throws TypeError, ValueError  naming the argument
  static Image Read(const char* argument, const py::handle& given, Types types = Types::kReal);

  /// An array to write.
  static Image Written(const char* argument, const py::handle& given, Types types = Types::kReal);

  const char* argument;
  std::size_t height, width, bands;
  DataType type;
  unsigned char* data;

  std::size_t PixelBytes() const { return (type.isComplex ? 2 : 1) * type.sizeBits / 8 * bands; }
  std::size_t Bytes() const { return height * width * PixelBytes(); }

  /// Rows `first` to before `first + rows` of the array without its margin, as a raster with that margin.
  Raster Rows(std::size_t first, std::size_t rows, std::size_t margin = 0) const;

  std::string Size() const;

  void RequireSize(std::size_t neededHeight, std::size_t neededWidth) const;
  void RequireBands(std::size_t least, const char* reason) const;
  void RequireType(const Image& other) const;
  /// @throws ValueError  if it shares memory with `other`
  void RequireApart(const Image& other) const;

 private:
  Image() = default;
};

/// A bool array of an image's (height, width), or none.
class Validity {
 public:
  Validity(const char* argument, const py::handle& given);

  void RequireSizeOf(const Image& image) const;
  void RequireApart(const Image& out) const;
  bool Given() const { return bools_ != nullptr; }
  bool At(std::size_t x, std::size_t y) const { return bools_ == nullptr || bools_[y * width_ + x] != 0; }

  /// What a mask's bits mean to the operator that gets it.
  enum class Sense { kSetIsValid, kSetIsExcluded };

  /// The mask of some rows, as `Image::Rows`; none if none was given.
  std::optional<Mask> Rows(std::size_t first, std::size_t rows, std::size_t margin = 0,
                           Sense sense = Sense::kSetIsValid) const;

 private:
  const char* argument_;
  const unsigned char* bools_ = nullptr;
  std::size_t height_ = 0, width_ = 0;
};

inline Mask* Pointer(std::optional<Mask>& mask) { return mask ? &*mask : nullptr; }

/// `count` rows in bands of about `kBandBytes`, with a look at Python's signals between two bands. Called
/// with the GIL released; it is taken for the look alone.
///
/// @param rowBytes  bytes of one row of all images together
void InBands(std::size_t count, std::size_t rowBytes,
             const std::function<void(std::size_t first, std::size_t rows)>& run);

/// Rasters count pixels in 32 bits: an operator that takes an image in one call is limited by that.
void RequireOneRaster(std::initializer_list<Image> images);

std::string NameOf(const DataType& type);

}  // namespace gridmill::python
