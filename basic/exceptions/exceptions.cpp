#include "basic/exceptions/exceptions.h"

namespace orvik {

Exception::Exception(const std::string& message, const std::string& file, const std::string& function,
                     unsigned int line)
    : message_(message), file_(file), function_(function), line_(line) {}

Exception::Exception(const Exception&) = default;
Exception& Exception::operator=(const Exception&) = default;
Exception::~Exception() = default;

DataException::DataException(const std::string& message, const std::string& file, const std::string& function,
                             unsigned int line)
    : Exception(message, file, function, line) {}

DataException::~DataException() = default;

ParameterException::ParameterException(const std::string& parameter, Type kind, const std::string& given,
                                       const std::string& expected, const std::string& message,
                                       const std::string& file, const std::string& function,
                                       unsigned int line)
    : DataException(message, file, function, line),
      parameter_(parameter),
      kind_(kind),
      given_(given),
      expected_(expected) {}

ParameterException::~ParameterException() = default;

}  // namespace orvik
