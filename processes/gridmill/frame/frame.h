#pragma once

#include <cstddef>
#include <memory>
#include <utility>

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/dispatchers.h"
#include "processes/gridmill/frame/guards.h"
#include "processes/gridmill/frame/interpreted.h"
#include "processes/gridmill/frame/policy.h"
#include "processes/gridmill/frame/processorcache.h"

namespace orvik::frame {

/// The types that select a processor, and that are remembered with it.
template <Selects selects, std::size_t N>
Types<N> TypesOf(const Rasters<N>& rasters) {
  Types<N> types;
  types.fill(rasters.front()->dataType);
  if constexpr (selects == Selects::kAll)
    for (std::size_t i = 1; i < N; ++i) types[i] = rasters[i]->dataType;
  return types;
}

/// True if a processor is cached and serves these types.
template <Compares compares, class Interface, std::size_t N>
bool Holds(const ProcessorCache<Interface, N>& cache, const Rasters<N>& rasters) {
  if (cache.processor == nullptr) return false;
  if constexpr (compares == Compares::kNone) return true;
  if constexpr (compares == Compares::kInput) return rasters.front()->dataType == cache.types.front();
  if constexpr (compares == Compares::kReferenceAgainstInput)
    return rasters[0]->dataType == cache.types[0] && rasters[1]->dataType == cache.types[0] &&
           rasters[2]->dataType == cache.types[2];
  return TypesOf<Selects::kAll>(rasters) == cache.types;
}

/// Empties the cache, so that an operator whose rebuild fails can be destroyed and used again.
template <Replaced replaced, class Interface, std::size_t N>
void Drop(ProcessorCache<Interface, N>& cache) {
  Interface* const old = std::exchange(cache.processor, nullptr);
  cache.types = {};
  if constexpr (replaced == Replaced::kDeleted) delete old;
}

/// `Process` of every operator: guards, interpretation, rebuild, hand-over, run. What an operator reads back
/// from its processor it reads after this has returned.
///
/// Deliberate: the parameters travel only when a processor is built, and only types decide on that. A
/// parameter changed after the first call takes effect with the next change of types.
///
/// @param op     the operator's parameters
/// @param cache  the operator's cache
/// @param given  the caller's rasters: input, (reference,) output
/// @param run    called with the processor and the rasters, complex ones replaced; passes the masks on
template <class Policy, class Interface, std::size_t N, class Run>
void Process(const typename Policy::Params& op, ProcessorCache<Interface, N>& cache, const Rasters<N>& given,
             Run run) {
  Guard<Policy::guards>(given);
  const Interpreted<Policy::interprets, N> interpreted(given);
  const Rasters<N>& rasters = interpreted.Get();
  if (!Holds<Policy::compares>(cache, rasters)) {
    Drop<Policy::replaced>(cache);
    const Types<N> types = TypesOf<Policy::selects>(rasters);
    std::unique_ptr<Interface> processor(Policy::Dispatcher::Dispatch(types));
    Policy::HandOver(op, dynamic_cast<typename Policy::Params&>(*processor), rasters);
    cache.types = types;
    cache.processor = processor.release();
  }
  run(*cache.processor, rasters);
}

}  // namespace orvik::frame
