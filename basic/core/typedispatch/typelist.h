#pragma once

#include <cstdint>

namespace typeconv::priv {

/// The end of every type list, and the empty list.
struct NullDataType {};

/// A compile-time list of types; `Tail` is a `TypeList` or `NullDataType`.
template <class HeadType, class TailType>
struct TypeList {
  using Head = HeadType;
  using Tail = TailType;
};

namespace details {

template <class... Types>
struct MakeTypeList {
  using Result = NullDataType;
};

template <class First, class... Rest>
struct MakeTypeList<First, Rest...> {
  using Result = TypeList<First, typename MakeTypeList<Rest...>::Result>;
};

}  // namespace details

/// The full list: the ten pixel types, in the order in which they are tested.
using FullTypeList = details::MakeTypeList<char, unsigned char, short, unsigned short, int, unsigned int,
                                           float, double, std::int64_t, std::uint64_t>::Result;

/// The short list: the four pixel types of the operators on three rasters.
using ShortTypeList = details::MakeTypeList<unsigned char, short, unsigned short, float>::Result;

}  // namespace typeconv::priv
