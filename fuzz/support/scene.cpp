#include "fuzz/support/scene.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <type_traits>

#include "fuzz/support/values.h"
#include "tests/reference/conversions.h"
#include "tests/support/pixeltypes.h"

#if defined(__SANITIZE_ADDRESS__)
#define GRIDMILL_FUZZ_REDZONES 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define GRIDMILL_FUZZ_REDZONES 1
#endif
#endif

namespace orvik::fuzz {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tessel::RasterContext;
using tessel::RasterInfo;

#ifdef GRIDMILL_FUZZ_REDZONES
constexpr std::size_t kGuard = 0;
#else
constexpr std::size_t kGuard = 64;
#endif
constexpr unsigned char kGuardByte = 0xC3;
constexpr std::size_t kDrawnSamples = 96;  // the rest of a buffer repeats them

template <class T>
void FillAs(Bytes& bytes, Raster& raster) {
  const std::size_t count = raster.dataSize / sizeof(T);
  const bool isAnyBits = bytes.OneIn(4);
  std::vector<T> drawn(std::min(count, kDrawnSamples));
  for (T& sample : drawn) {
    if (isAnyBits) {
      const std::uint64_t bits = bytes.Bits(static_cast<int>(sizeof(T)));
      std::memcpy(&sample, &bits, sizeof(T));
    } else {
      sample = reference::PlainCast<T>(Value(bytes));
    }
  }
  for (std::size_t i = 0; i < count; ++i)
    std::memcpy(raster.data + i * sizeof(T), &drawn[(i + i / kDrawnSamples) % drawn.size()], sizeof(T));
}

template <class T>
bool IsNaNAt(const Raster& raster, std::uint64_t offset) {
  T value;
  std::memcpy(&value, raster.data + offset, sizeof(T));
  return std::isnan(value);
}

/// True if byte `i` belongs to an element that is NaN in both. Elements of a type other than the raster's may
/// start at any byte.
template <class T>
bool AreNaNs(const Raster& expected, const Raster& actual, std::uint64_t i) {
  if constexpr (std::is_floating_point_v<T>) {
    const std::uint64_t step = expected.dataType.sizeBits == 8 * sizeof(T) ? sizeof(T) : 1;
    const std::uint64_t least = i < sizeof(T) - 1 ? 0 : i - (sizeof(T) - 1);
    for (std::uint64_t at = (least + step - 1) / step * step; at <= i; at += step) {
      const bool isWithin = at + sizeof(T) <= expected.dataSize;
      if (isWithin && IsNaNAt<T>(expected, at) && IsNaNAt<T>(actual, at)) return true;
    }
  }
  return false;
}

}  // namespace

Buffer::Buffer(const Shape& shape, bool isRoomy) {
  const RasterInfo info(shape.width, shape.height, shape.channels, shape.type);
  raster_ = std::make_unique<Raster>(info, shape.margins, nullptr);
  size_ = raster_->dataSize;
  if (isRoomy) size_ += std::size_t{16} * (raster_->bufferWidth + 1) * (shape.channels + 8);
  bytes_ = std::make_unique<unsigned char[]>(size_ + 2 * kGuard);
  std::fill_n(bytes_.get(), size_ + 2 * kGuard, kGuardByte);
  raster_->data = bytes_.get() + kGuard;
  raster_->dataSize = size_;
  std::fill_n(raster_->data, size_, static_cast<unsigned char>(0x5A));
}

bool Buffer::IsIntact() const {
  const auto isGuard = [](unsigned char byte) { return byte == kGuardByte; };
  const unsigned char* const end = bytes_.get() + kGuard + size_;
  return std::all_of(bytes_.get(), bytes_.get() + kGuard, isGuard) && std::all_of(end, end + kGuard, isGuard);
}

Shape DrawShape(Bytes& bytes, const DataType& type, std::uint32_t channels, std::uint32_t leastMargin,
                bool canBeLarge) {
  Shape shape;
  shape.width = bytes.Below(41);
  shape.height = bytes.Below(13);
  shape.channels = channels;
  shape.type = type;
  shape.margins = {leastMargin + bytes.Below(3), leastMargin + bytes.Below(3)};
  if (canBeLarge && bytes.OneIn(128)) {
    shape.width += 300;
    shape.height += 110;
  }
  return shape;
}

void Fill(Bytes& bytes, const DataType& type, Raster& raster) {
  tests::WithPixelType(type, [&]<class T>() { FillAs<T>(bytes, raster); });
}

std::unique_ptr<Mask> DrawMask(Bytes& bytes, const Raster& raster) {
  const std::uint32_t kind = bytes.Below(6);
  if (kind == 0) return nullptr;
  RasterContext margins(raster.marginX, raster.marginY);
  std::uint32_t width = raster.width;
  if (kind == 4) {
    margins.marginX += bytes.Below(4);
    margins.marginY += bytes.Below(3);
  }
  if (kind == 5) width += bytes.Below(9);
  auto mask = std::make_unique<Mask>(width, raster.height + (kind >= 4 ? 1 : 0), margins, true);
  if (kind == 1) return mask;
  const bool isSparse = bytes.OneIn(2);
  for (std::size_t i = 0; i < mask->bits.size() && !bytes.IsAtEnd(); ++i) {
    if (!isSparse || bytes.OneIn(2)) mask->bits[i] = bytes.Byte();
  }
  return mask;
}

std::vector<unsigned char> BytesOf(const Raster& raster) {
  return {raster.data, raster.data + raster.dataSize};
}

std::vector<unsigned char> BytesOf(const Mask* mask) {
  return mask == nullptr ? std::vector<unsigned char>() : mask->bits;
}

void Fail(const char* what) {
  std::fprintf(stderr, "gridmill: %s\n", what);
  std::abort();
}

void RequireSame(const Raster& expected, const Raster& actual, const DataType& writtenAs) {
  if (std::memcmp(expected.data, actual.data, expected.dataSize) == 0) return;
  for (std::uint64_t i = 0; i < expected.dataSize; ++i) {
    if (expected.data[i] == actual.data[i]) continue;
    bool isSame = false;
    tests::WithPixelType(writtenAs, [&]<class T>() { isSame = AreNaNs<T>(expected, actual, i); });
    if (isSame) continue;
    const std::string what = std::string("the output of ") + tests::NameOf(expected.dataType) +
                             " written as " + tests::NameOf(writtenAs) + " differs at byte " +
                             std::to_string(i) + ": expected " + std::to_string(expected.data[i]) + ", got " +
                             std::to_string(actual.data[i]);
    Fail(what.c_str());
  }
}

bool HasNaN(const Raster& raster) {
  const std::uint64_t size = raster.dataType.sizeBits / 8;
  for (std::uint64_t at = 0; at + size <= raster.dataSize; at += size) {
    if (size == sizeof(float) ? IsNaNAt<float>(raster, at) : IsNaNAt<double>(raster, at)) return true;
  }
  return false;
}

void RequireUntouched(const std::vector<unsigned char>& before, const std::vector<unsigned char>& after) {
  if (before != after) Fail("an input was modified");
}

}  // namespace orvik::fuzz
