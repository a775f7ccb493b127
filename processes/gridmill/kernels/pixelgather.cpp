#include "processes/gridmill/kernels/pixelgather.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <utility>

#include "processes/gridmill/kernels/multiversion.h"

namespace orvik::kernels {

namespace {

/// Pixels of any size that is known to the compiler.
template <std::size_t bytes>
void TakeSized(const unsigned char* __restrict row, const std::uint32_t* columns, std::size_t count,
               unsigned char* __restrict target) {
  for (std::size_t i = 0; i < count; ++i) std::memcpy(target + i * bytes, row + columns[i] * bytes, bytes);
}

void TakePixels(const unsigned char* row, const std::uint32_t* columns, std::size_t pixelBytes,
                std::size_t count, unsigned char* target) {
  switch (pixelBytes) {
    case 1:
      return TakeSized<1>(row, columns, count, target);
    case 2:
      return TakeSized<2>(row, columns, count, target);
    case 3:
      return TakeSized<3>(row, columns, count, target);
    case 4:
      return TakeSized<4>(row, columns, count, target);
    case 6:
      return TakeSized<6>(row, columns, count, target);
    case 8:
      return TakeSized<8>(row, columns, count, target);
    case 12:
      return TakeSized<12>(row, columns, count, target);
    case 16:
      return TakeSized<16>(row, columns, count, target);
    default:
      for (std::size_t i = 0; i < count; ++i)
        std::memcpy(target + i * pixelBytes, row + columns[i] * pixelBytes, pixelBytes);
  }
}

// Chunks need a shuffle whose order is known at run time only.
#if defined(__GNUC__) && !defined(__clang__)

inline constexpr bool kShuffles = true;

template <class Chunk>
GRIDMILL_MULTIVERSION void TakeChunks(const unsigned char* __restrict row, const Chunk* chunks,
                                      std::size_t count, unsigned char* __restrict target) {
  using Bytes = unsigned char __attribute__((vector_size(16)));
  for (std::size_t i = 0; i < count; ++i) {
    Bytes bytes, order;
    std::memcpy(&bytes, row + chunks[i].first, sizeof(bytes));
    std::memcpy(&order, chunks[i].order.data(), sizeof(order));
    const Bytes taken = __builtin_shuffle(bytes, order);
    std::memcpy(target + 16 * i, &taken, sizeof(taken));
  }
}

#else

inline constexpr bool kShuffles = false;

template <class Chunk>
void TakeChunks(const unsigned char*, const Chunk*, std::size_t, unsigned char*) {}

#endif

}  // namespace

PixelGather::PixelGather(std::vector<std::uint32_t> columns, std::size_t pixelBytes, std::size_t rowPixels)
    : columns_(std::move(columns)), pixelBytes_(pixelBytes) {
  for (std::size_t i = 1; i < columns_.size(); ++i)
    if (columns_[i] != columns_[i - 1] + 1) jumps_.push_back(static_cast<std::uint32_t>(i));
  if (kShuffles && !jumps_.empty()) PrepareChunks(rowPixels);
}

void PixelGather::PrepareChunks(std::size_t rowPixels) {
  const std::size_t rowBytes = rowPixels * pixelBytes_;
  if (rowBytes < 16 || rowBytes > std::numeric_limits<std::uint32_t>::max() || pixelBytes_ >= 8) return;
  const std::size_t bytes = columns_.size() * pixelBytes_;
  chunks_.reserve(bytes / 16);
  for (std::size_t b = 0; b + 16 <= bytes; b += 16) {
    std::array<std::size_t, 16> source;
    for (std::size_t k = 0; k < 16; ++k)
      source[k] = columns_[(b + k) / pixelBytes_] * pixelBytes_ + (b + k) % pixelBytes_;
    const auto [least, most] = std::minmax_element(source.begin(), source.end());
    const std::size_t first = std::min(*least, rowBytes - 16);
    if (*most - first > 15) return chunks_.clear();
    Chunk chunk;
    chunk.first = static_cast<std::uint32_t>(first);
    for (std::size_t k = 0; k < 16; ++k) chunk.order[k] = static_cast<unsigned char>(source[k] - first);
    chunks_.push_back(chunk);
  }
}

bool PixelGather::IsConsecutive(std::size_t from, std::size_t count) const {
  const auto next = std::upper_bound(jumps_.begin(), jumps_.end(), from);
  return next == jumps_.end() || *next >= from + count;
}

void PixelGather::Take(const unsigned char* row, std::size_t from, std::size_t count,
                       unsigned char* target) const {
  std::size_t done = 0;
  if (!chunks_.empty()) {
    const std::size_t chunks = count * pixelBytes_ / 16;
    TakeChunks(row, chunks_.data() + from * pixelBytes_ / 16, chunks, target);
    done = chunks * 16 / pixelBytes_;
  }
  TakePixels(row, columns_.data() + from + done, pixelBytes_, count - done, target + done * pixelBytes_);
}

}  // namespace orvik::kernels
