#pragma once

#include <memory>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/random.h"

namespace orvik::tests {

/// Which bits of a random mask are set.
enum class MaskKind : int { eNULL, eFULL, eEMPTY, eRANDOM, eLONG_RUNS, eFEW_CLEAR };
inline constexpr MaskKind kMaskKinds[] = {MaskKind::eNULL,   MaskKind::eFULL,      MaskKind::eEMPTY,
                                          MaskKind::eRANDOM, MaskKind::eLONG_RUNS, MaskKind::eFEW_CLEAR};

/// How a mask lies to its raster. With another margin or another width a pixel has one index in the mask and
/// another in the raster; such masks have enough bits for both, for the pixels (0, 0) to (width, height).
enum class MaskGeometry : int { eSAME, eOTHER_MARGIN, eOTHER_WIDTH };
inline constexpr MaskGeometry kMaskGeometries[] = {MaskGeometry::eSAME, MaskGeometry::eOTHER_MARGIN,
                                                   MaskGeometry::eOTHER_WIDTH};

const char* NameOf(MaskKind kind);
const char* NameOf(MaskGeometry geometry);

/// A mask for `raster`; null for `eNULL`. The bits behind the last pixel are random.
std::unique_ptr<tessel::Mask> RandomMask(const tessel::Raster& raster, MaskKind kind, MaskGeometry geometry,
                                         Random& random);

}  // namespace orvik::tests
