#pragma once

#include <optional>
#include <string>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::reference {

/// The squared gradient, slowly: one sample after the other, with all that an object keeps between its calls.
class SqrGradientEvaluation {
 public:
  void SetBackground(double low, double high);
  void SetFailure(double value);
  void InitEvaluation(unsigned int channels);
  const std::vector<double>& GetEvaluation() const { return evaluation_; }

  /// Returns what the call prints.
  std::string Process(const tessel::Raster& in, const tessel::Mask* mask);

  /// What a call that the dispatcher refuses leaves behind.
  void FailToDispatch() { inner_.reset(); }

 private:
  /// What a build fixes, and the running sums.
  struct Inner {
    tessel::DataType type;
    double low, high, failure;
    std::vector<double> evaluation;
  };

  std::vector<double> Scan(const tessel::Raster& in, const tessel::Mask* mask) const;

  double low_ = -10000000.0, high_ = 10000000.0, failure_ = -32767.0;
  std::vector<double> evaluation_;
  std::optional<Inner> inner_;
};

}  // namespace orvik::reference
