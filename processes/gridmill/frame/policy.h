#pragma once

namespace orvik::frame {

/// What `Process` tests before it does anything else.
enum class Guards {
  kNone,           ///< a bad argument is an access fault
  kRasters,        ///< every raster present, in their order, then a real output
  kInputChannels,  ///< the input present, then at least one channel
};

/// Which types have to agree with the remembered ones for the cached processor to be kept.
enum class Compares {
  kAll,                    ///< input, (reference,) output, each with its own
  kInput,                  ///< the input alone: the first output type stays
  kNone,                   ///< none: built once and never again
  kReferenceAgainstInput,  ///< input and output with their own, the reference with the remembered input
};

/// Which types select the processor of a build.
enum class Selects {
  kAll,         ///< input, (reference,) output
  kInputTwice,  ///< the input's, for the output as well: the output is never looked at and may be null
};

/// What becomes of the processor that a rebuild replaces.
enum class Replaced {
  kDeleted,
  kLeftAllocated,
};

/// A policy derives from this and states deviations only. It adds
///
/// - `Dispatcher`, one of `frame/dispatchers.h`;
/// - where the parameters are not simply assigned, its own `HandOver`.
///
/// @tparam ParamsType  the parameter class, a base of the operator and of its inner processors
template <class ParamsType>
struct Defaults {
  using Params = ParamsType;
  static constexpr Guards guards = Guards::kNone;
  static constexpr bool interprets = false;  ///< complex inputs and references are replaced by real ones
  static constexpr Compares compares = Compares::kAll;
  static constexpr Selects selects = Selects::kAll;
  static constexpr Replaced replaced = Replaced::kDeleted;

  /// Hands the operator's parameters over to a new processor.
  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    to = from;
  }
};

}  // namespace orvik::frame
