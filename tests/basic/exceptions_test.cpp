#include "basic/exceptions/exceptions.h"

#include <exception>
#include <string>
#include <type_traits>
#include <typeinfo>

#include <gtest/gtest.h>

#include "basic/exceptions/throw.h"

namespace orvik {
namespace {

// ---- golden

TEST(Exceptions, WhatIsTheMessageAndTheRestHasAccessors) {
  const Exception failure("message", "file.cpp", "void Function()", 17);
  EXPECT_STREQ(failure.what(), "message");
  EXPECT_EQ(failure.File(), "file.cpp");
  EXPECT_EQ(failure.Function(), "void Function()");
  EXPECT_EQ(failure.Line(), 17u);
}

TEST(Exceptions, ADataFailureIsAnException) {
  static_assert(std::is_base_of_v<Exception, DataException>);
  const DataException failure("message", "file.cpp", "void Function()", 17);
  EXPECT_STREQ(failure.what(), "message");
  EXPECT_EQ(failure.File(), "file.cpp");
  EXPECT_EQ(failure.Function(), "void Function()");
  EXPECT_EQ(failure.Line(), 17u);
}

TEST(Exceptions, AParameterFailureIsADataFailureWithAParameter) {
  static_assert(std::is_base_of_v<DataException, ParameterException>);
  const ParameterException failure("poRasterIn", ParameterException::eMISSING, "given", "expected", "message",
                                   "file.cpp", "void Function()", 17);
  EXPECT_EQ(failure.Parameter(), "poRasterIn");
  EXPECT_EQ(failure.Kind(), ParameterException::eMISSING);
  EXPECT_EQ(failure.Given(), "given");
  EXPECT_EQ(failure.Expected(), "expected");
  EXPECT_STREQ(failure.what(), "message");
  EXPECT_EQ(failure.File(), "file.cpp");
  EXPECT_EQ(failure.Function(), "void Function()");
  EXPECT_EQ(failure.Line(), 17u);
}

TEST(Exceptions, EveryFailureIsAStandardException) {
  static_assert(std::is_base_of_v<std::exception, Exception>);
  static_assert(std::has_virtual_destructor_v<Exception>);
  try {
    throw ParameterException("p", ParameterException::eINVALID, "", "", "message", "f", "g", 1);
  } catch (const std::exception& failure) {
    EXPECT_STREQ(failure.what(), "message");
  }
}

TEST(Exceptions, AFailureCaughtByReferenceKeepsItsType) {
  try {
    throw ParameterException("p", ParameterException::eINVALID, "", "", "message", "f", "g", 1);
  } catch (const Exception& failure) {
    EXPECT_NE(dynamic_cast<const ParameterException*>(&failure), nullptr);
  }
}

TEST(Exceptions, ACopyHoldsTheSame) {
  Exception copy("other", "f", "g", 1);
  copy = Exception("message", "file.cpp", "void Function()", 17);
  const Exception again(copy);
  EXPECT_STREQ(again.what(), "message");
  EXPECT_EQ(again.File(), "file.cpp");
  EXPECT_EQ(again.Function(), "void Function()");
  EXPECT_EQ(again.Line(), 17u);
}

template <class Failure>
[[noreturn]] void FunctionThatFails() {
  Throw<Failure>("message", ORVIK_HERE);
}

TEST(Exceptions, ThrowThrowsExactlyTheNamedType) {
  EXPECT_THROW(FunctionThatFails<DataException>(), DataException);
  try {
    FunctionThatFails<Exception>();
  } catch (const Exception& failure) {
    EXPECT_EQ(typeid(failure), typeid(Exception));
  }
}

TEST(Exceptions, HereNamesTheThrowingFunctionItsFileAndItsLine) {
  try {
    FunctionThatFails<DataException>();
  } catch (const Exception& failure) {
    EXPECT_NE(failure.Function().find("FunctionThatFails"), std::string::npos);
    EXPECT_NE(failure.Function().find("DataException"), std::string::npos);
    EXPECT_NE(failure.File().find("exceptions_test.cpp"), std::string::npos);
    EXPECT_GT(failure.Line(), 0u);
  }
}

TEST(Exceptions, AnInvalidInputNamesTheInputAndTwoEmptyStrings) {
  try {
    ThrowInvalidInput("message", "file.cpp", "void Function()", 17);
  } catch (const ParameterException& failure) {
    EXPECT_EQ(failure.Parameter(), "poRasterIn");
    EXPECT_EQ(static_cast<int>(failure.Kind()), 1);
    EXPECT_EQ(failure.Given(), "");
    EXPECT_EQ(failure.Expected(), "");
    EXPECT_STREQ(failure.what(), "message");
    EXPECT_EQ(failure.Line(), 17u);
  }
}

}  // namespace
}  // namespace orvik
