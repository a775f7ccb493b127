#pragma once

namespace orvik::reference {

/// The normal of a cell of 2 x 2 pixels, in the stated order of steps.
struct Normal {
  float nx;
  float ny;
};

inline Normal CellNormal(float z00, float z10, float z01, float z11, float XSIZE, float YSIZE, float ELSZ) {
  const float top = (z10 - z00) * ELSZ;
  const float left = (z01 - z00) * ELSZ;
  const float bottom = (z01 - z11) * ELSZ;
  const float right = (z10 - z11) * ELSZ;
  const float nx = ((bottom - top) * YSIZE) * 0.5f;
  const float ny = ((right - left) * XSIZE) * 0.5f;
  return {nx, ny};
}

}  // namespace orvik::reference
