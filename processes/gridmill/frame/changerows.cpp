#include "processes/gridmill/frame/changerows.h"

#include <cstdint>
#include <cstring>
#include <vector>

#ifdef __SSE2__
#include <emmintrin.h>
#endif

#include "basic/tessel/mask/maskrow.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/rows.h"

namespace orvik::frame {

namespace {

using tessel::DataType;
using tessel::PixelOffset;
using tessel::Raster;

std::size_t BytesOf(const DataType& element) { return element.sizeBits / 8; }

/// Elements of a pixel: two for each channel of a complex raster.
std::size_t ElementsOf(const Raster& raster) {
  return std::size_t{raster.channels} * (raster.dataType.isComplex ? 2 : 1);
}

/// True if the raster holds elements of this type, real or complex.
bool Holds(const Raster& raster, DataType element) {
  element.isComplex = raster.dataType.isComplex;
  return raster.dataType == element;
}

/// Pixels read as elements of one type.
class PixelReader {
 public:
  PixelReader(const Raster& raster, const DataType& element, std::size_t samples, const BlockShape& shape)
      : raster_(raster), bytes_(samples * BytesOf(element)), stride_(ElementsOf(raster)) {
    inPlace_ = Holds(raster, element) && (!shape.dense || stride_ == samples);
    if (inPlace_) return;
    stride_ = samples;
    gathered_.resize(shape.pixels * bytes_);
  }

  std::size_t Stride() const { return stride_; }

  const unsigned char* Read(std::uint32_t x, std::uint32_t y, std::size_t pixels) {
    if (inPlace_) return raster_.data + PixelOffset(raster_, x, y);
    // A pixel's address follows from the raster's own type and need not be a multiple of the element's size.
    for (std::size_t i = 0; i < pixels && bytes_ > 0; ++i)
      std::memcpy(gathered_.data() + i * bytes_,
                  raster_.data + PixelOffset(raster_, x + static_cast<std::uint32_t>(i), y), bytes_);
    return gathered_.data();
  }

 private:
  const Raster& raster_;
  std::size_t bytes_;  // of a pixel that are read
  std::size_t stride_;
  bool inPlace_;
  std::vector<unsigned char> gathered_;
};

/// Outputs of more bytes than this are written past the caches, which they would not fit into: the lines need
/// not be read first.
constexpr std::uint64_t kStreamedBytes = std::uint64_t{32} << 20;

void StreamBytes(const unsigned char* source, std::size_t count, unsigned char* target) {
#ifdef __SSE2__
  const std::size_t head = std::min(count, -reinterpret_cast<std::uintptr_t>(target) % sizeof(__m128i));
  std::memcpy(target, source, head);
  std::size_t i = head;
  for (; i + sizeof(__m128i) <= count; i += sizeof(__m128i))
    _mm_stream_si128(reinterpret_cast<__m128i*>(target + i),
                     _mm_loadu_si128(reinterpret_cast<const __m128i*>(source + i)));
  std::memcpy(target + i, source + i, count - i);
#else
  std::memcpy(target, source, count);
#endif
}

/// Takes the samples of an output's pixels.
class PixelWriter {
 public:
  PixelWriter(const Raster& raster, const DataType& element, const BlockShape& shape)
      : raster_(raster),
        bytes_(shape.outSamples * BytesOf(element)),
        pixelBytes_(ElementsOf(raster) * BytesOf(element)),
        streams_(pixelBytes_ == bytes_ && raster.dataSize > kStreamedBytes) {
    if (!InPlace()) block_.resize(shape.pixels * bytes_);
  }
  PixelWriter(const PixelWriter&) = delete;
  PixelWriter& operator=(const PixelWriter&) = delete;

  /// Other threads see streamed bytes only after the fence.
  ~PixelWriter() {
#ifdef __SSE2__
    if (streams_) _mm_sfence();
#endif
  }

  /// Where the samples of the pixels from (x, y) on are to be put.
  unsigned char* At(std::uint32_t x, std::uint32_t y) {
    return InPlace() ? raster_.data + PixelOffset(raster_, x, y) : block_.data();
  }

  /// Called when they are there. Pixels are written in their order: where one has fewer samples than are
  /// written, the next one prevails.
  void Write(std::uint32_t x, std::uint32_t y, std::size_t pixels) const {
    if (InPlace() || bytes_ == 0) return;
    unsigned char* const row = raster_.data + PixelOffset(raster_, x, y);
    if (streams_) return StreamBytes(block_.data(), pixels * bytes_, row);
    for (std::size_t i = 0; i < pixels; ++i)
      std::memcpy(row + i * pixelBytes_, block_.data() + i * bytes_, bytes_);
  }

 private:
  bool InPlace() const { return pixelBytes_ == bytes_ && !streams_; }

  const Raster& raster_;
  std::size_t bytes_;  // of a pixel that are written
  std::size_t pixelBytes_;
  bool streams_;
  std::vector<unsigned char> block_;
};

/// Fills `valid` for the pixels from (x, y) on if there is a mask; returns whether one of them is excluded.
bool UnpackMasks(const TwoDates& dates, std::uint32_t x, std::uint32_t y, std::size_t pixels,
                 unsigned char* valid) {
  const auto unpack = [&](const tessel::Mask& mask, unsigned char* bits) {
    tessel::UnpackBits(mask, tessel::PixelIndex(mask, x, y), pixels, bits);
  };
  if (dates.mask == nullptr && dates.referenceMask == nullptr) return false;
  if (dates.mask != nullptr) {
    unpack(*dates.mask, valid);
  } else {
    std::fill_n(valid, pixels, static_cast<unsigned char>(1));
  }
  if (dates.referenceMask != nullptr) {
    unsigned char excluded[kMaxBlock];
    unpack(*dates.referenceMask, excluded);
    for (std::size_t i = 0; i < pixels; ++i) valid[i] &= static_cast<unsigned char>(excluded[i] ^ 1);
  }
  return std::memchr(valid, 0, pixels) != nullptr;
}

}  // namespace

void WalkBlocks(const TwoDates& dates, const BlockShape& shape, const ElementTypes& types,
                const std::function<void(const RawBlock&)>& row) {
  PixelReader image(dates.image, types.image, shape.imageSamples, shape);
  PixelReader reference(dates.reference, types.reference, shape.referenceSamples, shape);
  PixelWriter out(dates.out, types.out, shape);
  const std::size_t width = dates.image.width;
  SerialRows(dates.image.height, [&](std::uint32_t y) {
    for (std::size_t done = 0; done < width; done += shape.pixels) {
      const auto x = static_cast<std::uint32_t>(done);
      const std::size_t pixels = std::min(shape.pixels, width - done);
      unsigned char valid[kMaxBlock];
      const bool masked = UnpackMasks(dates, x, y, pixels, valid);
      row({image.Read(x, y, pixels), image.Stride(), reference.Read(x, y, pixels), reference.Stride(), pixels,
           valid, masked, out.At(x, y)});
      out.Write(x, y, pixels);
    }
  });
}

}  // namespace orvik::frame
