#pragma once

#include <cstddef>

#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::kernels {

/// The corners of the cells of a run of pixels: the pixels themselves, and those to the right, below, and
/// below to the right of them.
struct CellCorners {
  const float* z00;
  const float* z10;
  const float* z01;
  const float* z11;
};

/// Room for the corners of a block of cells: of each row one sample more than cells, or both corners apart.
struct CellScratch {
  float z00[kBlock + 1];
  float z10[kBlock];
  float z01[kBlock + 1];
  float z11[kBlock];
};

/// The corners of `count` cells as `float`.
///
/// @param upper   the sample of the first cell
/// @param lower   the sample below it
/// @param stride  samples from one cell to the next
/// @param right   samples from a corner to the one on its right
template <class In>
CellCorners LoadCorners(const In* upper, const In* lower, std::size_t stride, std::size_t right,
                        std::size_t count, CellScratch& scratch) {
  if (right == stride) {
    const float* const z00 = FloatRow(upper, stride, count + 1, scratch.z00);
    const float* const z01 = FloatRow(lower, stride, count + 1, scratch.z01);
    return {z00, z00 + 1, z01, z01 + 1};
  }
  return {FloatRow(upper, stride, count, scratch.z00), FloatRow(upper + right, stride, count, scratch.z10),
          FloatRow(lower, stride, count, scratch.z01), FloatRow(lower + right, stride, count, scratch.z11)};
}

/// The spacings of a cell and the factor on its differences of elevation.
struct CellScale {
  float XSIZE;
  float YSIZE;
  float ELSZ;
};

/// The horizontal part of a normal of a cell, which points down the slope.
struct CellNormal {
  float nx;
  float ny;
};

GRIDMILL_INLINE CellNormal NormalOf(float z00, float z10, float z01, float z11, const CellScale& scale) {
  const float top = (z10 - z00) * scale.ELSZ;
  const float left = (z01 - z00) * scale.ELSZ;
  const float bottom = (z01 - z11) * scale.ELSZ;
  const float right = (z10 - z11) * scale.ELSZ;
  const float nx = ((bottom - top) * scale.YSIZE) * 0.5f;
  const float ny = ((right - left) * scale.XSIZE) * 0.5f;
  return {nx, ny};
}

}  // namespace orvik::kernels
