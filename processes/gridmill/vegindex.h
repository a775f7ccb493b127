#pragma once

#include <utility>
#include <vector>

#include "basic/core/export.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/processorcache.h"
#include "processes/gridmill/iprocessor.h"

namespace orvik::filters {

/// The spectral bands, as entries of `VegIndex::SetBandIndex`. Any other entry marks a channel that no index
/// uses.
enum BandRole : unsigned int {
  eBAND_BLUE = 0,
  eBAND_GREEN = 1,
  eBAND_RED = 2,
  eBAND_RED_EDGE = 3,  ///< about 700 nm
  eBAND_NIR = 4,
  eBAND_SWIR1 = 5,
  eBAND_SWIR2 = 6,
};

/// The indices, as positions of `VegIndex::SetRequestedIndex`.
enum VegetationIndex : unsigned int {
  eINDEX_NGRDI = 0,
  eINDEX_EXCESS_GREEN = 1,
  eINDEX_DVI = 2,
  eINDEX_RVI = 3,
  eINDEX_NDVI = 4,
  eINDEX_TVI = 5,
  eINDEX_SAVI = 6,
  eINDEX_MSAVI2 = 7,
  eINDEX_GEMI = 8,
  eINDEX_GREENNESS = 9,
  eINDEX_MCARI = 10,
  eINDEX_MTVI1 = 11,
};

namespace details {

/// The parameters of `VegIndex`. Setters store the vector, with no check.
class GRIDMILL_EXPORT VegIndexParams {
 public:
  std::vector<unsigned int> requestedIndex;  ///< twelve entries: 1 at k requests the index with code k
  std::vector<unsigned int> bandIndex;       ///< the role of each input channel

  void SetRequestedIndex(std::vector<unsigned int> requests) { requestedIndex = std::move(requests); }
  void SetBandIndex(std::vector<unsigned int> roles) { bandIndex = std::move(roles); }
};

}  // namespace details

/// Up to twelve vegetation indices in one pass, each an output channel, in the order of their codes.
///
/// In: any of the ten pixel types, real; reflectances or counts, one channel for each band. A sample is
/// converted to `float` and widened to `double`.
/// Mask: a clear bit excludes the pixel; null means that all are valid.
/// Out: any of the ten pixel types, at least the input's size and one channel for each requested index;
/// written through `ClipTo`; further channels keep what they held.
///
/// With B, G, R, E, N, S1, S2 for the bands in the order of `BandRole`, all in `double`, left to right:
///
/// - 0, NGRDI: (G - R) / (G + R), 0 for G + R = 0. Tucker (1979), Remote Sensing of Environment 8(2).
/// - 1, excess green, scaled: ((G + 255) - (R + B) 0.5) 0.5. Woebbecke et al. (1995), Transactions of the
///   ASAE 38(1).
/// - 2, DVI: N - R. Richardson and Wiegand (1977), Photogrammetric Engineering and Remote Sensing 43(12).
/// - 3, RVI: N / R, 0 for R = 0. Jordan (1969), Ecology 50(4).
/// - 4, NDVI: (N - R) / (N + R) within -1 to 1, 0 for N + R = 0. Rouse et al. (1974), NASA SP-351.
/// - 5, TVI: sqrt((N - R) / (N + R) + 0.5), the root as `float`, 0 for N + R = 0. Deering et al. (1975),
///   10th International Symposium on Remote Sensing of Environment.
/// - 6, SAVI: ((N - R) / (N + R + 0.5)) 1.5 within -1 to 1, 0 for N + R + 0.5 = 0. Huete (1988), Remote
///   Sensing of Environment 25(3).
/// - 7, MSAVI2: ((N + 1) 2 - sqrt((2 N + 1)^2 - 8 (N - R))) 0.5. Qi et al. (1994), Remote Sensing of
///   Environment 48(2).
/// - 8, GEMI: (1 - eta / 4) eta - (R - 0.125) / (1 - R), 0 for R = 1; eta = (2 (N^2 - R^2) + 1.5 N + 0.5 R)
///   / (N + R + 0.5), 0 for a divisor of 0. Pinty and Verstraete (1992), Vegetatio 101(1).
/// - 9, tasseled-cap greenness: -0.2848 B - 0.2435 G - 0.5436 R + 0.7243 N + 0.084 S1 - 1.18 S2. After Crist
///   and Cicone (1984), IEEE Transactions on Geoscience and Remote Sensing GE-22(3).
/// - 10, MCARI: ((E - R) - 0.2 (E - G)) (E / R), 0 for R = 0. Daughtry et al. (2000), Remote Sensing of
///   Environment 74(2).
/// - 11, MTVI1: 1.2 (1.2 (N - G) - 2.5 (R - G)). Haboudane et al. (2004), Remote Sensing of Environment
///   90(3).
///
/// MSAVI2 lies 0.5 above its form in the literature, which begins with 2 N + 1.
///
/// Parameters: both vectors empty by default; `Process` reads twelve entries of the requests and one role for
/// each input channel. A setter called after `Process` takes effect when a type changes. Failures:
/// `Exception` "Invalid type requested." if the type of the input or the output is none of the ten, a complex
/// one included; std::bad_alloc. No pointer is tested but the mask's, and no sizes are compared. Threads:
/// runs on the caller's thread. One object is for one thread at a time, two objects are independent.
///
/// Deliberate: samples pass through `float`, `double` ones too. An `int` of 16777217 counts as 16777216.
/// Deliberate: only a request of exactly 1 counts.
/// Deliberate: a band without a channel is 0 at every pixel; of two channels with one role the later counts.
/// Deliberate: an excluded pixel holds `ClipTo` of -1e20: the least value of `char`, `short` and `int`, 0 for
/// unsigned and 64-bit outputs.
/// Deliberate: the greenness weight of the second shortwave band is -1.18, not the -0.18 of the literature.
/// Deliberate: TVI and MSAVI2 do not test what is under the root; they are NaN where it is negative.
///
/// Example: red 0.25 and near infrared 0.75 give an NDVI of 0.5.
class GRIDMILL_EXPORT VegIndex : public details::VegIndexParams {
 public:
  VegIndex();
  VegIndex(const VegIndex&);
  VegIndex& operator=(const VegIndex&);
  ~VegIndex();

  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const;

  template <class In, class Out>
  class InnerProcessor;

 private:
  mutable frame::ProcessorCache<IProcessor, 2> cache_;
};

}  // namespace orvik::filters
