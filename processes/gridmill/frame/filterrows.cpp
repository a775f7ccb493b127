#include "processes/gridmill/frame/filterrows.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "basic/tessel/mask/maskrow.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/pixelreader.h"
#include "processes/gridmill/frame/rows.h"

namespace orvik::frame {

void WalkFilter(const tessel::Raster& in, const tessel::Mask* mask, const tessel::Raster& out,
                const FilterShape& shape, const tessel::DataType& inElement,
                const tessel::DataType& outElement, const std::function<void(const RawFilterBlock&)>& row) {
  PixelReader reader(in, inElement, shape.inSamples, shape.pixels, shape.in);
  PixelWriter writer(out, outElement, shape.outSamples, shape.pixels, shape.out);
  const std::size_t width = in.width;
  SerialRows(in.height, [&](std::uint32_t y) {
    for (std::size_t done = 0; done < width; done += shape.pixels) {
      const auto x = static_cast<std::uint32_t>(done);
      const std::size_t pixels = std::min(shape.pixels, width - done);
      unsigned char valid[kMaxBlock];
      bool masked = false;
      if (mask != nullptr) {
        tessel::UnpackBits(*mask, tessel::PixelIndex(*mask, x, y), pixels, valid);
        masked = std::memchr(valid, 0, pixels) != nullptr;
      }
      row({reader.At(x, y, pixels), reader.Stride(), pixels, valid, masked, writer.At(x, y)});
      writer.Write(x, y, pixels);
    }
  });
}

}  // namespace orvik::frame
