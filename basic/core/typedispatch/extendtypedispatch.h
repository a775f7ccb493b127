#pragma once

#include <vector>

#include "basic/core/typedispatch/typedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/exceptions/throw.h"
#include "basic/tessel/datatype.h"

namespace orvik::typedispatch {

/// Makes `Processor<In, Out>` from the two picked types.
template <template <class, class> class Processor, class InterfaceType>
struct Factory2Template {
  using Interface = InterfaceType;
  template <class In, class Out>
  static Interface* Create() {
    return new Processor<In, Out>();
  }
};

/// Makes `Processor<In, Ref, Out>` from the three picked types.
template <template <class, class, class> class Processor, class InterfaceType>
struct Factory3Template {
  using Interface = InterfaceType;
  template <class In, class Ref, class Out>
  static Interface* Create() {
    return new Processor<In, Ref, Out>();
  }
};

namespace details {

/// `List` with `Type` appended at its end.
template <class List, class Type>
struct Append {
  using Result =
      typeconv::priv::TypeList<typename List::Head, typename Append<typename List::Tail, Type>::Result>;
};

template <class Type>
struct Append<typeconv::priv::NullDataType, Type> {
  using Result = typeconv::priv::TypeList<Type, typeconv::priv::NullDataType>;
};

/// Calls the factory with the types of `Chosen`, which holds them last first, in the order of the vector.
template <class Factory, class Chosen, class... InOrder>
struct CreateChosen {
  static typename Factory::Interface* Create() {
    return CreateChosen<Factory, typename Chosen::Tail, typename Chosen::Head, InOrder...>::Create();
  }
};

template <class Factory, class... InOrder>
struct CreateChosen<Factory, typeconv::priv::NullDataType, InOrder...> {
  static typename Factory::Interface* Create() { return Factory::template Create<InOrder...>(); }
};

}  // namespace details

/// The extended dispatcher: picks a type of `AllTypes` for each of the first `N` descriptors of a vector, the
/// last of them first, and creates the processor for these types.
///
/// @tparam Factory         `Factory2Template` or `Factory3Template`
/// @tparam N               types still to pick
/// @tparam RemainingTypes  those not yet compared at this level; `AllTypes` at the start
/// @tparam ChosenTypes     those picked so far; `NullDataType` at the start
template <class Factory, unsigned int N, class AllTypes, class RemainingTypes, class ChosenTypes>
struct ExtendDispatchTypes {
  using Interface = typename Factory::Interface;
  using Head = typename RemainingTypes::Head;

  /// @param types          at least `N` descriptors: input, (reference,) output; further ones are not looked
  /// at
  /// @param acceptComplex  whether a complex type selects the processor of its element type
  /// @return a new inner processor, which the caller owns
  /// @throws Exception "Not enough type in the vector for the dispatcher you are using." or "Invalid type
  ///         requested."
  static Interface* Dispatch(const std::vector<tessel::DataType>& types, bool acceptComplex) {
    if (types.size() < N)
      Throw<Exception>("Not enough type in the vector for the dispatcher you are using.", ORVIK_HERE);
    if (!Matches<Head>(types[N - 1], acceptComplex))
      return ExtendDispatchTypes<Factory, N, AllTypes, typename RemainingTypes::Tail, ChosenTypes>::Dispatch(
          types, acceptComplex);
    using Chosen = typename details::Append<ChosenTypes, Head>::Result;
    if constexpr (N > 1) {
      return ExtendDispatchTypes<Factory, N - 1, AllTypes, AllTypes, Chosen>::Dispatch(types, acceptComplex);
    } else {
      return details::CreateChosen<Factory, Chosen>::Create();
    }
  }
};

template <class Factory, unsigned int N, class AllTypes, class ChosenTypes>
struct ExtendDispatchTypes<Factory, N, AllTypes, typeconv::priv::NullDataType, ChosenTypes> {
  [[noreturn]] static typename Factory::Interface* Dispatch(const std::vector<tessel::DataType>& types,
                                                            bool) {
    if (types.size() < N)
      Throw<Exception>("Not enough type in the vector for the dispatcher you are using.", ORVIK_HERE);
    Throw<Exception>("Invalid type requested.", ORVIK_HERE);
  }
};

}  // namespace orvik::typedispatch
