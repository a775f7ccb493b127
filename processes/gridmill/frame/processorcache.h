#pragma once

#include <array>
#include <cstddef>

#include "basic/tessel/datatype.h"

namespace orvik::frame {

/// The inner processor of an operator and the types that it was built for: all the state that `Process` keeps
/// from call to call.
///
/// Deliberate: a copy is shallow. It shares the processor, both destructors delete it, and an assignment does
/// not delete what it overwrites. Only an operator that has not run yet can be copied.
///
/// @tparam Interface  what the dispatcher returns
/// @tparam N          rasters of a call: input, (reference,) output
template <class Interface, std::size_t N>
struct ProcessorCache {
  Interface* processor = nullptr;           ///< owned; null until the first `Process`
  std::array<tessel::DataType, N> types{};  ///< of the last build

  ProcessorCache() = default;
  ProcessorCache(const ProcessorCache&) = default;
  ProcessorCache& operator=(const ProcessorCache&) = default;
  ~ProcessorCache() { delete processor; }
};

}  // namespace orvik::frame
