#pragma once

#include <utility>
#include <vector>

#include "processes/gridmill/difftype.h"

namespace orvik::changedetection::details {

/// The parameters of a change operator. Setters store the value, with no check.
///
/// The no-data test runs if `imgNoData` has as many entries as the image has channels, and then on both
/// rasters; else on neither, whatever `refNoData` holds. A sample is no-data if it is, as a `float`, equal to
/// the entry of its channel. NaN never is.
///
/// @tparam FormType  `DiffType` or `DiffType2`
template <class FormType>
class ChangeParams {
 public:
  FormType type;  ///< form of the comparison; unset until an operator's constructor or a setter sets it
  float noData;   ///< written for what is excluded, through `ClipTo`; unset like `type`
  std::vector<float> imgNoData;  ///< no-data value of each image channel
  std::vector<float> refNoData;  ///< no-data value of each reference channel, at least as many as are tested

  void SetType(FormType value) { type = value; }
  void SetNoData(float value) { noData = value; }
  void SetImgNoData(std::vector<float> values) { imgNoData = std::move(values); }
  void SetRefNoData(std::vector<float> values) { refNoData = std::move(values); }
};

}  // namespace orvik::changedetection::details
