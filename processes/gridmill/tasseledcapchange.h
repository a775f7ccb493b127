#pragma once

#include <string>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/changeparams.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/ichange.h"

namespace orvik::changedetection {

namespace details {

/// The sensors of two dates. Names are not checked here.
class GRIDMILL_EXPORT SensorParams {
 public:
  std::string sensorType;     ///< of the image
  std::string refSensorType;  ///< of the reference

  void SetSensorType(const std::string& name) { sensorType = name; }
  void SetRefSensorType(const std::string& name) { refSensorType = name; }
};

/// The parameters of `TCGNChange`.
class GRIDMILL_EXPORT TCGNParams : public SensorParams, public ChangeParams<DiffType> {};

/// The parameters of `TCSBChange`.
class GRIDMILL_EXPORT TCSBParams : public SensorParams, public ChangeParams<DiffType> {};

}  // namespace details

/// The tasseled-cap greenness of two dates, and their difference.
///
/// Image: any of the ten pixel types, the bands of its sensor as they are stored: four for
/// "Landsat-4 MSS" and "Landsat-5 MSS" (the MSS bands in their order), "Ikonos" and "QuickBird" (blue, green,
/// red, near infrared), six for "Landsat-4 TM", "Landsat-5 TM" and "Landsat-7 ETM+" (1, 2, 3, 4, 5 and 7).
/// Reference: read as the image's type, at the same (x, y) by its own margins and channels; the bands of its
/// own sensor.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, at least three channels: a of the image, b of the reference and their
/// difference d, in the unit of the samples.
///
/// a and b are weighted sums of the bands in `double`, without an offset, with the weights of each raster's
/// sensor. With d = a - b: |d| for `eDIFF_ABSOLUTE`, -d for `eDIFF_BACKWARD`, d for every other value,
/// `eDIFF_FORWARD` among them. They are written through `ClipTo`. The no-data test covers as many channels as
/// the image has, in both rasters; one no-data sample makes the whole pixel no-data.
///
/// Parameters: `sensorType`, `refSensorType` and `type`, from the constructor; `noData`, default 0;
/// `imgNoData` and `refNoData`, in the unit of the samples, empty by default. A setter called after `Process`
/// takes effect when a type changes.
/// Failures: `Exception` "Image type not supported", with no place, at the first valid pixel if a sensor is
/// unknown: what was written before stays, and a raster without a valid pixel does not fail. `Exception`
/// "Invalid type to dispatch." for an image or output of no pixel type; std::bad_alloc. No pointer is tested
/// but the mask's, and no sizes are compared.
/// Threads: runs on the caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: a `type` of 3 means image minus reference, where `ChanDiffChange` and `MagnitudeChange` take
/// every value but 0 and 1 as the reverse.
/// Deliberate: the weights stand as they are; the Ikonos weight of band 3 is -0.324.
///
/// Example: the "QuickBird" pixel (0, 0, 0, 100) has the greenness 78.
/// Source: Kauth and Thomas (1976), "The tasselled cap", for MSS; Crist and Cicone (1984), "A
/// physically-based transformation of Thematic Mapper data", IEEE TGRS 22(3), for TM; Huang et al. (2002),
/// "Derivation of a tasselled cap transformation based on Landsat 7 at-satellite reflectance", IJRS 23(8),
/// for ETM+; Horne (2003), "A tasseled cap transformation for IKONOS images", Proc. ASPRS, for Ikonos;
/// Yarbrough et al. (2005), "QuickBird 2 tasseled cap transform coefficients", Proc. Pecora 16, for
/// QuickBird.
class GRIDMILL_EXPORT TCGNChange : public details::TCGNParams, public IChange {
 public:
  TCGNChange(std::string sensorType, std::string refSensorType, DiffType type);
  TCGNChange(const TCGNChange&);
  TCGNChange& operator=(const TCGNChange&);
  ~TCGNChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct TCGNCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

/// The tasseled-cap brightness of two dates, and their difference: `TCGNChange` with other weights, in
/// everything else the same.
///
/// Deliberate: the weights stand as they are; the ETM+ weight of band 2 is 0.3872.
///
/// Example: the "QuickBird" pixel (0, 0, 0, 100) has the brightness 60.4.
class GRIDMILL_EXPORT TCSBChange : public details::TCSBParams, public IChange {
 public:
  TCSBChange(std::string sensorType, std::string refSensorType, DiffType type);
  TCSBChange(const TCSBChange&);
  TCSBChange& operator=(const TCSBChange&);
  ~TCSBChange() override;

  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override;

  template <class In, class Out>
  class InnerProcessor;
  struct TCSBCreationPolicy;

 private:
  mutable frame::ProcessorCache<IChange, 3> cache_;
};

}  // namespace orvik::changedetection
