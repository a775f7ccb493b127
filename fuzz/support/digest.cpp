#include "fuzz/support/digest.h"

#include <cstring>

#include "tests/support/pixeltypes.h"

namespace orvik::fuzz {

void Digest::Add(const tessel::Raster& raster, const tessel::DataType& writtenAs) {
  if (writtenAs.isFloat && writtenAs.sizeBits != raster.dataType.sizeBits) return;
  tests::WithPixelType(writtenAs, [&]<class T>() {
    for (std::uint64_t at = 0; at + sizeof(T) <= raster.dataSize; at += sizeof(T)) {
      T value;
      std::memcpy(&value, raster.data + at, sizeof(T));
      Add(value);
    }
  });
}

Digest& Observed() {
  static Digest digest;
  return digest;
}

}  // namespace orvik::fuzz
