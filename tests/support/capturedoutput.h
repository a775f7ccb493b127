#pragma once

#include <string>

#include <gtest/gtest.h>

namespace orvik::tests {

/// Keeps what is printed to the standard output from being shown.
class CapturedOutput {
 public:
  CapturedOutput() { ::testing::internal::CaptureStdout(); }
  CapturedOutput(const CapturedOutput&) = delete;
  CapturedOutput& operator=(const CapturedOutput&) = delete;
  ~CapturedOutput() {
    if (isOpen_) End();
  }

  /// Returns what was printed and ends the capture.
  std::string End() {
    isOpen_ = false;
    return ::testing::internal::GetCapturedStdout();
  }

 private:
  bool isOpen_ = true;
};

}  // namespace orvik::tests
