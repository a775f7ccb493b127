#pragma once

#include <cstddef>
#include <functional>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/pixelwriter.h"

/// The walk of the filters over the pixels of an image.
namespace orvik::frame {

/// How a filter takes its pixels.
struct FilterShape {
  std::size_t pixels;  ///< of a block, at most `kMaxBlock`
  Walk in = Walk::kPixels;
  std::size_t outSamples = 1;  ///< written to each pixel
  Walk out = Walk::kPixels;
  std::size_t inSamples = 0;  ///< read from each pixel, where the input may be of another type than is read
};

/// Pixels of one row, as a row function gets them.
template <class In, class Out>
struct FilterBlock {
  const In* image;
  std::size_t stride;  ///< samples from pixel to pixel; 1 where elements are walked
  std::size_t pixels;
  const unsigned char* valid;  ///< one byte of 0 or 1 for each pixel
  bool masked;                 ///< true: a byte is 0; false: all pixels are valid and the bytes are not set
  Out* target;                 ///< `outSamples` for each pixel, one after the other
};

/// A block before its samples have types.
using RawFilterBlock = FilterBlock<unsigned char, unsigned char>;

/// Calls `row(block)` for all pixels of `in` in their order, on the caller's thread. The size of `in`
/// governs; the mask, which may be null, and `out` are addressed by their own fields at the same (x, y).
///
/// @param inElement  the element type of `in`
void WalkFilter(const tessel::Raster& in, const tessel::Mask* mask, const tessel::Raster& out,
                const FilterShape& shape, const tessel::DataType& inElement,
                const tessel::DataType& outElement, const std::function<void(const RawFilterBlock&)>& row);

/// The same with samples that have types.
template <class In, class Out, class Row>
void FilterRows(const tessel::Raster& in, const tessel::Mask* mask, const tessel::Raster& out,
                const FilterShape& shape, Row row) {
  using tessel::DataType;
  WalkFilter(in, mask, out, shape, DataType::Of<In>(), DataType::Of<Out>(),
             [&row](const RawFilterBlock& raw) {
               row(FilterBlock<In, Out>{reinterpret_cast<const In*>(raw.image), raw.stride, raw.pixels,
                                        raw.valid, raw.masked, reinterpret_cast<Out*>(raw.target)});
             });
}

}  // namespace orvik::frame
