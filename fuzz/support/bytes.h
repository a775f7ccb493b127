#pragma once

#include <cstddef>
#include <cstdint>
#include <iterator>

namespace orvik::fuzz {

/// Choices out of the bytes of an input, one byte each as far as one is enough. Where the bytes are used up
/// every choice is 0, so that each input of any length is a valid one.
class Bytes {
 public:
  Bytes(const std::uint8_t* data, std::size_t size) : at_(data), end_(data + size) {}

  std::uint8_t Byte() { return at_ == end_ ? std::uint8_t{0} : *at_++; }
  bool IsAtEnd() const { return at_ == end_; }

  /// The next `count` bytes as a number, the most significant one first.
  std::uint64_t Bits(int count) {
    std::uint64_t bits = 0;
    for (int i = 0; i < count; ++i) bits = bits << 8 | Byte();
    return bits;
  }

  /// A number from 0 to `count` - 1; `count` is at most 256.
  std::uint32_t Below(std::uint32_t count) { return Byte() % count; }

  /// False for the byte 0, so that used up bytes leave the usual way.
  bool OneIn(std::uint32_t count) { return Byte() % count == count - 1; }

  template <class Container>
  auto Pick(const Container& container) {
    return container[Below(static_cast<std::uint32_t>(std::size(container)))];
  }

 private:
  const std::uint8_t* at_;
  const std::uint8_t* end_;
};

}  // namespace orvik::fuzz
