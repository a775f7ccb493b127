#pragma once

#include "basic/exceptions/exceptions.h"

/// The file, full function signature and line of the place where it stands: the last three arguments of
/// every failure type.
#define ORVIK_HERE __FILE__, __PRETTY_FUNCTION__, static_cast<unsigned int>(__LINE__)

namespace orvik {

/// Throws `Failure` with the given message; the rest is `ORVIK_HERE`.
template <class Failure>
[[noreturn]] inline void Throw(const char* message, const char* file, const char* function,
                               unsigned int line) {
  throw Failure(message, file, function, line);
}

/// Throws the failure of an invalid input raster.
[[noreturn]] inline void ThrowInvalidInput(const char* message, const char* file, const char* function,
                                           unsigned int line) {
  throw ParameterException("poRasterIn", ParameterException::eINVALID, "", "", message, file, function, line);
}

}  // namespace orvik
