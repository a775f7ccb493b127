#pragma once

#include <array>
#include <cstddef>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/exceptions/throw.h"
#include "basic/tessel/datatype.h"

namespace orvik::frame {

/// The types of a call in the order of its rasters: input, (reference,) output.
template <std::size_t N>
using Types = std::array<tessel::DataType, N>;

/// The extended dispatcher over one list for all rasters.
template <class Factory, class List, bool acceptComplex = false>
struct Extended {
  using Interface = typename Factory::Interface;

  template <std::size_t N>
  static Interface* Dispatch(const Types<N>& types) {
    const std::vector<tessel::DataType> wanted(types.begin(), types.end());
    return typedispatch::ExtendDispatchTypes<Factory, N, List, List, typeconv::priv::NullDataType>::Dispatch(
        wanted, acceptComplex);
  }
};

/// The two-level dispatcher over the full list, from the first and the last raster's type.
template <class CreationPolicy>
struct TwoLevel {
  using List = typeconv::priv::FullTypeList;
  using Level = typedispatch::details::InputDispatchType<List, List, CreationPolicy>;

  template <std::size_t N>
  static typename Level::Interface Dispatch(const Types<N>& types) {
    return Level::Dispatch(types.front(), types.back());
  }
};

/// The same for an operator that has no complex form of its pixels.
template <class CreationPolicy>
struct RealTwoLevel : TwoLevel<CreationPolicy> {
  template <std::size_t N>
  static auto Dispatch(const Types<N>& types) {
    if (types.front().isComplex || types.back().isComplex)
      Throw<Exception>("Invalid type to dispatch.", ORVIK_HERE);
    return TwoLevel<CreationPolicy>::Dispatch(types);
  }
};

}  // namespace orvik::frame
