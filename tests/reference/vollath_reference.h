#pragma once

#include <optional>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::reference {

/// Vollath's sums, slowly: one sample after the other, with all that an object keeps between its calls.
class VollathEvaluation {
 public:
  void SetBackground(double low, double high);
  void SetFailure(double value);
  void InitEvaluation(unsigned int channels);
  const std::vector<double>& GetLeftEq() const { return sums_.left; }
  const std::vector<double>& GetRightEq() const { return sums_.right; }

  void Process(const tessel::Raster& in, const tessel::Mask* mask);

  /// What a call that the dispatcher refuses leaves behind.
  void FailToDispatch() { inner_.reset(); }

 private:
  struct Sums {
    std::vector<double> left, right;
  };
  /// What a build fixes, and the totals.
  struct Inner {
    tessel::DataType type;
    double low, high, failure;
    Sums sums;
  };

  static Sums Zeros(unsigned int channels);
  Sums Scan(const tessel::Raster& in, const tessel::Mask* mask) const;

  double low_ = -10000000.0, high_ = 10000000.0, failure_ = -32767.0;
  Sums sums_;
  std::optional<Inner> inner_;
};

}  // namespace orvik::reference
