#include "processes/gridmill/frame/pixelwriter.h"

#include <algorithm>
#include <cstring>

#ifdef __SSE2__
#include <emmintrin.h>
#endif

#include "basic/tessel/samples.h"

namespace orvik::frame {

namespace {

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

}  // namespace

PixelWriter::PixelWriter(const tessel::Raster& raster, const tessel::DataType& element, std::size_t samples,
                         std::size_t pixels, Walk walk)
    : raster_(raster),
      walk_(walk),
      bytes_(samples * (element.sizeBits / 8)),
      dense_(walk == Walk::kElements || (Holds(raster, element) && ElementsOf(raster) == samples)),
      streams_(dense_ && raster.dataSize > kStreamedBytes) {
  if (!InPlace()) block_.resize(pixels * bytes_);
}

/// Other threads see streamed bytes only after the fence.
PixelWriter::~PixelWriter() {
#ifdef __SSE2__
  if (streams_) _mm_sfence();
#endif
}

unsigned char* PixelWriter::Place(std::uint32_t x, std::uint32_t y) const {
  if (walk_ == Walk::kElements) return raster_.data + tessel::PixelOffset(raster_, 0, y) + x * bytes_;
  return raster_.data + tessel::PixelOffset(raster_, x, y);
}

unsigned char* PixelWriter::At(std::uint32_t x, std::uint32_t y) {
  return InPlace() ? Place(x, y) : block_.data();
}

void PixelWriter::Write(std::uint32_t x, std::uint32_t y, std::size_t pixels) const {
  if (InPlace() || bytes_ == 0) return;
  if (streams_) return StreamBytes(block_.data(), pixels * bytes_, Place(x, y));
  for (std::size_t i = 0; i < pixels; ++i)
    std::memcpy(Place(x + static_cast<std::uint32_t>(i), y), block_.data() + i * bytes_, bytes_);
}

}  // namespace orvik::frame
