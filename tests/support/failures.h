#pragma once

#include <string>
#include <typeinfo>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"

namespace orvik::tests {

/// Passes if `call()` throws exactly a `Failure` with the message `message` that says where it was thrown.
template <class Failure, class Call>
::testing::AssertionResult Throws(const std::string& message, Call call) {
  try {
    call();
  } catch (const Exception& failure) {
    if (typeid(failure) != typeid(Failure)) {
      return ::testing::AssertionFailure()
             << "thrown as " << typeid(failure).name() << ", \"" << failure.what() << '"';
    }
    if (failure.what() != message)
      return ::testing::AssertionFailure() << "the message is \"" << failure.what() << '"';
    if (failure.File().empty() || failure.Function().empty() || failure.Line() == 0) {
      return ::testing::AssertionFailure() << "the place is " << failure.File() << ':' << failure.Line()
                                           << " in \"" << failure.Function() << '"';
    }
    return ::testing::AssertionSuccess();
  }
  return ::testing::AssertionFailure() << "nothing was thrown";
}

}  // namespace orvik::tests
