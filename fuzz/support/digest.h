#pragma once

#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/raster.h"

namespace orvik::fuzz {

/// One number for all that the operator of an input gave, the same at every instruction set and with every
/// number of threads. Any NaN counts as one and the same.
class Digest {
 public:
  template <class T>
  void Add(T value) {
    if constexpr (std::is_floating_point_v<T>) {
      if (std::isnan(value)) value = std::numeric_limits<T>::quiet_NaN();
    }
    const auto* bytes = reinterpret_cast<const unsigned char*>(&value);
    for (std::size_t i = 0; i < sizeof(T); ++i) value_ = (value_ ^ bytes[i]) * 0x100000001B3u;
  }
  template <class T>
  void Add(const std::vector<T>& values) {
    for (const T value : values) Add(value);
  }

  /// Adds the whole buffer. One of floating-point numbers in a raster of elements of another size is left
  /// out: any byte could be the first of a NaN.
  ///
  /// @param writtenAs  the type of the elements, whatever the raster's own is
  void Add(const tessel::Raster& raster, const tessel::DataType& writtenAs);

  std::uint64_t Value() const { return value_; }
  void Restart() { value_ = kStart; }

 private:
  static constexpr std::uint64_t kStart = 0xCBF29CE484222325u;
  std::uint64_t value_ = kStart;
};

/// The digest of the input that runs.
Digest& Observed();

}  // namespace orvik::fuzz

/// The entry point of a target, under the name that the build gives it: one for each instruction set.
///
/// @param run  void(Bytes&)
#define GRIDMILL_FUZZ_TARGET(run)                                                            \
  extern "C" std::uint64_t GRIDMILL_FUZZ_ENTRY(const std::uint8_t* data, std::size_t size);  \
  extern "C" std::uint64_t GRIDMILL_FUZZ_ENTRY(const std::uint8_t* data, std::size_t size) { \
    orvik::fuzz::Bytes bytes(data, size);                                                    \
    orvik::fuzz::Observed().Restart();                                                       \
    run(bytes);                                                                              \
    return orvik::fuzz::Observed().Value();                                                  \
  }
