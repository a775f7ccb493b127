#pragma once

#include <cstddef>

#include "basic/core/typedispatch/typelist.h"
#include "basic/exceptions/throw.h"
#include "basic/tessel/datatype.h"

namespace orvik::typedispatch {

/// True if `type` is the plain descriptor of `Pixel`, or its complex variant where that is accepted.
template <class Pixel>
inline bool Matches(const tessel::DataType& type, bool acceptComplex) {
  return type == tessel::DataType::Of<Pixel>() ||
         (acceptComplex && type == tessel::DataType::Of<Pixel>(true));
}

namespace details {

/// The second level of the two-level dispatcher: walks `OutputTypes` with the input type picked.
///
/// `Policy` has `template <class In, class Out> static Interface* Create(bool outputIsComplex)`.
template <class In, class OutputTypes, class Policy>
struct OutputDispatchType {
  using Interface = decltype(Policy::template Create<In, typename OutputTypes::Head>(false));

  static Interface Dispatch(const tessel::DataType& out) {
    if (Matches<typename OutputTypes::Head>(out, true))
      return Policy::template Create<In, typename OutputTypes::Head>(out.isComplex);
    return OutputDispatchType<In, typename OutputTypes::Tail, Policy>::Dispatch(out);
  }
};

template <class In, class Policy>
struct OutputDispatchType<In, typeconv::priv::NullDataType, Policy> {
  [[noreturn]] static std::nullptr_t Dispatch(const tessel::DataType&) {
    Throw<Exception>("Invalid type to dispatch.", ORVIK_HERE);
  }
};

/// The two-level dispatcher: walks `InputTypes`, then `OutputTypes`. A complex type selects the processor of
/// its element type.
///
/// @return a new inner processor, which the caller owns
/// @throws Exception "Invalid type to dispatch." if a list does not hold a type; the input is tested first
template <class InputTypes, class OutputTypes, class Policy>
struct InputDispatchType {
  using Head = typename InputTypes::Head;
  using Interface = typename OutputDispatchType<Head, OutputTypes, Policy>::Interface;

  static Interface Dispatch(const tessel::DataType& in, const tessel::DataType& out) {
    if (Matches<Head>(in, true)) return OutputDispatchType<Head, OutputTypes, Policy>::Dispatch(out);
    return InputDispatchType<typename InputTypes::Tail, OutputTypes, Policy>::Dispatch(in, out);
  }
};

template <class OutputTypes, class Policy>
struct InputDispatchType<typeconv::priv::NullDataType, OutputTypes, Policy> {
  [[noreturn]] static std::nullptr_t Dispatch(const tessel::DataType&, const tessel::DataType&) {
    Throw<Exception>("Invalid type to dispatch.", ORVIK_HERE);
  }
};

}  // namespace details

}  // namespace orvik::typedispatch
