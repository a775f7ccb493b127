#pragma once

#include <exception>
#include <string>

#include "basic/core/export.h"

namespace orvik {

/// The base of every failure of the library. Thrown by value, meant to be caught by reference.
///
/// `what()` is the message alone; the place of the throw has accessors of its own.
struct GRIDMILL_EXPORT Exception : public std::exception {
  Exception(const std::string& message, const std::string& file, const std::string& function,
            unsigned int line);
  Exception(const Exception&);
  Exception& operator=(const Exception&);
  ~Exception() override;

  const char* what() const noexcept override { return message_.c_str(); }

  /// The source file of the throw, as built.
  const std::string& File() const noexcept { return file_; }
  /// The compiler's full signature of the throwing function.
  const std::string& Function() const noexcept { return function_; }
  unsigned int Line() const noexcept { return line_; }

 private:
  std::string message_;
  std::string file_;
  std::string function_;
  unsigned int line_;
};

/// A failure of the data handed in: a mask unpacked into a raster of an unsuitable type.
class GRIDMILL_EXPORT DataException : public Exception {
 public:
  DataException(const std::string& message, const std::string& file, const std::string& function,
                unsigned int line);
  ~DataException() override;
};

/// A failure of one named parameter: an input raster whose margin is too small.
struct GRIDMILL_EXPORT ParameterException : public DataException {
  enum Type : int { eMISSING = 0, eINVALID = 1 };

  /// @param parameter  the parameter's name
  /// @param kind       what is wrong with it
  /// @param given      the value that came, may be empty
  /// @param expected   the value that was expected, may be empty
  /// @param message    what `what()` gives
  /// @param file       the source file of the throw
  /// @param function   the signature of the throwing function
  /// @param line       the line of the throw
  ParameterException(const std::string& parameter, Type kind, const std::string& given,
                     const std::string& expected, const std::string& message, const std::string& file,
                     const std::string& function, unsigned int line);
  ~ParameterException() override;

  const std::string& Parameter() const noexcept { return parameter_; }
  Type Kind() const noexcept { return kind_; }
  const std::string& Given() const noexcept { return given_; }
  const std::string& Expected() const noexcept { return expected_; }

 private:
  std::string parameter_;
  Type kind_;
  std::string given_;
  std::string expected_;
};

}  // namespace orvik
