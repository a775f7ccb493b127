#pragma once

#include <cstdint>
#include <limits>
#include <type_traits>

#include "basic/core/export.h"

namespace orvik::tessel {

/// The element types of a raster. All but `eDT_BIT` are pixel types; `eDT_BIT` serves only as a target of
/// `Mask::RetrieveRaster`.
enum ElementType : int {
  eDT_BIT,
  eDT_8S,
  eDT_8U,
  eDT_16S,
  eDT_16U,
  eDT_32S,
  eDT_32U,
  eDT_32F,
  eDT_64F,
  eDT_64S,
  eDT_64U
};

/// Describes one element of a raster. A default-constructed value equals no element type.
struct GRIDMILL_EXPORT DataType {
  std::uint32_t sizeBits = 0;  ///< width of one element in bits: 1, 8, 16, 32 or 64; of one part if complex
  bool isSigned = false;       ///< set for signed integers and for both floating types
  bool isFloat = false;        ///< set for the floating types
  std::uint32_t mantissaBits = 0;  ///< stored significand bits of a floating type, else `sizeBits`
  std::uint32_t exponentBits = 0;  ///< exponent bits of a floating type, else 0
  bool isComplex = false;          ///< a sample is a pair of elements: the real and the imaginary part

  DataType() = default;
  /// The descriptor of an element type, or of its complex variant.
  DataType(ElementType element, bool complex = false);

  /// The descriptor of one of the ten pixel types, or of its complex variant.
  template <class Pixel>
  static DataType Of(bool complex = false) {
    static_assert(std::is_arithmetic_v<Pixel>, "a pixel type is an integer or a floating type");
    DataType type;
    type.sizeBits = 8 * sizeof(Pixel);
    type.isSigned = std::is_signed_v<Pixel> || std::is_same_v<Pixel, char>;
    type.isFloat = std::is_floating_point_v<Pixel>;
    type.mantissaBits =
        type.isFloat ? static_cast<std::uint32_t>(std::numeric_limits<Pixel>::digits - 1) : type.sizeBits;
    type.exponentBits = type.isFloat ? type.sizeBits - 1 - type.mantissaBits : 0;
    type.isComplex = complex;
    return type;
  }
};

/// True if all six fields are equal, compared in their order.
inline bool operator==(const DataType& a, const DataType& b) {
  return a.sizeBits == b.sizeBits && a.isSigned == b.isSigned && a.isFloat == b.isFloat &&
         a.mantissaBits == b.mantissaBits && a.exponentBits == b.exponentBits && a.isComplex == b.isComplex;
}

inline bool operator!=(const DataType& a, const DataType& b) { return !(a == b); }

}  // namespace orvik::tessel
