#pragma once

#include <cstddef>
#include <functional>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/frame/pixelwriter.h"

/// The walk of the change operators over the pixels of two dates.
namespace orvik::frame {

/// The rasters and masks of a comparison. The image's size governs; the others are addressed by their own
/// fields at the same (x, y).
struct TwoDates {
  const tessel::Raster& image;
  const tessel::Raster& reference;
  const tessel::Raster& out;
  const tessel::Mask* mask;                     ///< a clear bit excludes the pixel; null excludes none
  const tessel::Mask* referenceMask = nullptr;  ///< deliberate: a set bit excludes the pixel
};

/// Pixels of a block whose pixels are single results.
inline constexpr std::size_t kPixelBlock = 256;

/// How an operator takes its pixels.
struct BlockShape {
  std::size_t pixels;        ///< of a block, at most `kMaxBlock`
  std::size_t imageSamples;  ///< read from each pixel
  std::size_t referenceSamples;
  std::size_t outSamples;  ///< written to each pixel
  bool dense;              ///< the samples of a block follow each other without others between
};

/// For operators that treat each sample by itself: the same number of samples in all three rasters.
///
/// @param samples  of a block at most, in whole vectors where pixels are not large
inline BlockShape SampleBlocks(std::size_t channels, std::size_t samples = 2048) {
  return {DensePixels(channels, samples), channels, channels, channels, true};
}

/// For operators that make one result of all samples of a pixel.
inline BlockShape PixelBlocks(std::size_t imageSamples, std::size_t referenceSamples,
                              std::size_t outSamples) {
  return {kPixelBlock, imageSamples, referenceSamples, outSamples, false};
}

/// Pixels of one row, as a row function gets them.
template <class In, class Ref, class Out>
struct Block {
  const In* image;
  std::size_t imageStride;  ///< samples from pixel to pixel
  const Ref* reference;
  std::size_t referenceStride;
  std::size_t pixels;
  unsigned char* valid;  ///< room for one byte of 0 or 1 for each pixel, the row function's to write
  bool masked;           ///< true: a byte is 0; false: all pixels are valid and the bytes are not set
  Out* target;           ///< `outSamples` for each pixel, one after the other
};

/// A block before its samples have types.
using RawBlock = Block<unsigned char, unsigned char, unsigned char>;

/// The element types that an operator was built for: image, reference, output.
struct ElementTypes {
  tessel::DataType image;
  tessel::DataType reference;
  tessel::DataType out;
};

/// Calls `row(block)` for all pixels of the image in their order, on the caller's thread. Samples are used
/// where they stand, or gathered where a raster holds another type than it is to be read as or, for a dense
/// block, more or fewer samples; likewise for the output. A large output goes past the caches, by way of a
/// scratch block.
void WalkBlocks(const TwoDates& dates, const BlockShape& shape, const ElementTypes& types,
                const std::function<void(const RawBlock&)>& row);

/// The same with samples that have types.
template <class In, class Ref, class Out, class Row>
void ChangeRows(const TwoDates& dates, const BlockShape& shape, Row row) {
  using tessel::DataType;
  const ElementTypes types{DataType::Of<In>(), DataType::Of<Ref>(), DataType::Of<Out>()};
  WalkBlocks(dates, shape, types, [&row](const RawBlock& raw) {
    row(Block<In, Ref, Out>{reinterpret_cast<const In*>(raw.image), raw.imageStride,
                            reinterpret_cast<const Ref*>(raw.reference), raw.referenceStride, raw.pixels,
                            raw.valid, raw.masked, reinterpret_cast<Out*>(raw.target)});
  });
}

}  // namespace orvik::frame
