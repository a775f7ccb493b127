#pragma once

#include <array>
#include <cstdint>
#include <ostream>
#include <stdexcept>

#include "basic/tessel/datatype.h"

namespace orvik::tests {

/// One of the ten pixel types at run time.
struct PixelType {
  const char* name;
  tessel::ElementType element;
};

inline std::ostream& operator<<(std::ostream& stream, const PixelType& type) { return stream << type.name; }

/// The ten pixel types in the order of the full list.
inline constexpr std::array<PixelType, 10> kPixelTypes = {{{"char", tessel::eDT_8S},
                                                           {"uchar", tessel::eDT_8U},
                                                           {"short", tessel::eDT_16S},
                                                           {"ushort", tessel::eDT_16U},
                                                           {"int", tessel::eDT_32S},
                                                           {"uint", tessel::eDT_32U},
                                                           {"float", tessel::eDT_32F},
                                                           {"double", tessel::eDT_64F},
                                                           {"int64", tessel::eDT_64S},
                                                           {"uint64", tessel::eDT_64U}}};

namespace details {

template <class T, class Function>
bool CallIf(bool matches, Function& function) {
  if (matches) function.template operator()<T>();
  return matches;
}

template <class... T>
struct PixelTypeList {
  template <class Function>
  static bool Call(const tessel::DataType& type, Function& function) {
    return (CallIf<T>(type == tessel::DataType::Of<T>(type.isComplex), function) || ...);
  }
};

using AllPixelTypes = PixelTypeList<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;

}  // namespace details

/// Calls `function.operator()<T>()` with the pixel type of `type`, for a complex type that of its parts.
template <class Function>
void WithPixelType(const tessel::DataType& type, Function function) {
  if (!details::AllPixelTypes::Call(type, function)) throw std::invalid_argument("no pixel type");
}

/// The same for a pair: `function.operator()<A, B>()`.
template <class Function>
void WithPixelTypes(const tessel::DataType& a, const tessel::DataType& b, Function function) {
  WithPixelType(
      a, [&]<class A>() { WithPixelType(b, [&]<class B>() { function.template operator()<A, B>(); }); });
}

/// The name of a type, for messages.
inline const char* NameOf(const tessel::DataType& type) {
  for (const PixelType& pixelType : kPixelTypes) {
    if (tessel::DataType(pixelType.element, type.isComplex) == type) return pixelType.name;
  }
  return "no pixel type";
}

}  // namespace orvik::tests
