#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"

namespace orvik::tests {

/// Width, height and channels of an image.
struct Size {
  std::uint32_t width;
  std::uint32_t height;
  std::uint32_t channels = 1;
};

/// The bytes that outputs are filled with before a call. As a `float` or `double` they are numbers, not NaNs.
inline constexpr unsigned char kSentinel = 0xA5;
inline constexpr unsigned char kOtherSentinel = 0x5A;

/// A raster of one pixel type whose samples can be read and set. A complex one has `2 * channels` elements in
/// a pixel: real and imaginary part in turn.
template <class T>
class Image : public tessel::Raster {
 public:
  Image(Size size, const tessel::RasterContext& context = {}, T fill = T(), bool complex = false)
      : Raster({size.width, size.height, size.channels, tessel::DataType::Of<T>(complex)}, context) {
    std::fill_n(Elements(), dataSize / sizeof(T), fill);
  }

  /// Element c of pixel (x, y), which may lie in the margin.
  T& At(int x, int y, std::uint32_t c = 0) {
    const std::uint32_t pixel =
        (marginY + static_cast<std::uint32_t>(y)) * bufferWidth + marginX + static_cast<std::uint32_t>(x);
    return Elements()[std::size_t{pixel} * channels * (dataType.isComplex ? 2 : 1) + c];
  }

  /// Sets every element, margins included, to `value(x, y, c)`.
  template <class Value>
  void Set(Value value) {
    const int left = static_cast<int>(marginX), top = static_cast<int>(marginY);
    const std::uint32_t elements = channels * (dataType.isComplex ? 2 : 1);
    for (int y = -top; y < static_cast<int>(height) + top; ++y) {
      for (int x = -left; x < static_cast<int>(width) + left; ++x) {
        for (std::uint32_t c = 0; c < elements; ++c) At(x, y, c) = static_cast<T>(value(x, y, c));
      }
    }
  }

  /// Sets the first elements of pixel (x, y).
  void SetPixel(int x, int y, std::initializer_list<T> samples) {
    std::copy(samples.begin(), samples.end(), &At(x, y));
  }

  T* Elements() { return reinterpret_cast<T*>(data); }
};

/// Fills the whole buffer with `kSentinel`, or with another byte.
inline void FillBytes(tessel::Raster& raster, unsigned char byte = kSentinel) {
  std::fill_n(raster.data, raster.dataSize, byte);
}

/// The bytes of the whole buffer.
inline std::vector<unsigned char> Bytes(const tessel::Raster& raster) {
  return {raster.data, raster.data + raster.dataSize};
}

/// True if every byte of the buffer still is `byte`.
inline bool IsUntouched(const tessel::Raster& raster, unsigned char byte = kSentinel) {
  return std::all_of(raster.data, raster.data + raster.dataSize,
                     [byte](unsigned char b) { return b == byte; });
}

}  // namespace orvik::tests
