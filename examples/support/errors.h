#pragma once

#include <stdexcept>
#include <string>

namespace examples {

/// An argument that cannot be used. Thrown before anything is written.
struct Refusal : std::runtime_error {
  Refusal(const std::string& argument, const std::string& wrong, const std::string& expected)
      : std::runtime_error(argument + ": " + wrong + "; expected " + expected) {}
};

/// Work that could not be finished. Pending files are removed on the way out.
struct Failure : std::runtime_error {
  using std::runtime_error::runtime_error;
};

}  // namespace examples
