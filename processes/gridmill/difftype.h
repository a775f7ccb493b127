#pragma once

namespace orvik::changedetection {

/// The form of a comparison of two dates. Every value is stored as it is; an operator says what it makes of
/// others than these.
enum DiffType : int {
  eDIFF_ABSOLUTE = 0,
  eDIFF_FORWARD = 1,   ///< image minus reference; deliberate: the reverse in `SingleChange`
  eDIFF_BACKWARD = 2,  ///< reference minus image; deliberate: the reverse in `SingleChange`
};

/// The form of a comparison that knows one direction. Every value but 0 counts as signed.
enum DiffType2 : int {
  eDIFF2_ABSOLUTE = 0,
  eDIFF2_SIGNED = 1,  ///< image against reference
};

}  // namespace orvik::changedetection
