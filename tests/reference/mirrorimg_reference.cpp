#include "tests/reference/mirrorimg_reference.h"

#include <cctype>
#include <cstdint>
#include <string>

#include "tests/reference/conversions.h"
#include "tests/reference/samples.h"
#include "tests/support/pixeltypes.h"

namespace orvik::reference {
namespace {

using filters::details::MirrorImgParams;
using tessel::Mask;
using tessel::Raster;

bool IsWord(const std::string& axis, const std::string& word) {
  std::string upper;
  for (const char letter : axis) {
    upper += static_cast<char>(std::toupper(static_cast<unsigned char>(letter)));
  }
  return upper == word;
}

/// A sample from the input by the address of its pixel, which may lie outside the image.
template <class In, class Out>
Out Transferred(const Raster& in, std::uint32_t x, std::uint32_t y, std::uint32_t c) {
  return ClipTo<Out>(static_cast<float>(Read<In>(in, x, y, c)));
}

template <class In, class Out>
void RowPass(const MirrorImgParams& p, std::uint32_t windowWidth, const Raster& in, const Mask* mask,
             Raster& out) {
  const auto transfer = [&](std::uint32_t from, std::uint32_t to, std::uint32_t y) {
    for (std::uint32_t c = 0; c < in.channels; ++c) {
      Write(out, 0, y, std::uint64_t{to} * in.channels + c, Transferred<In, Out>(in, from, y, c));
    }
  };
  for (std::uint32_t y = 0; y < in.height; ++y) {
    bool first = true;
    std::uint32_t source = 0, target = 0;
    for (std::uint32_t x = 0; x < in.width; ++x) {
      if (!IsValid(mask, x, y)) {
        if (!p.isNewFile) transfer(x, x, y);
        continue;
      }
      if (first) {
        source = x + windowWidth - 1;
        target = p.isNewFile ? 0 : x;
        first = false;
      } else {
        source = source - 1;
        target = target + 1;
      }
      transfer(source, target, y);
    }
  }
}

template <class In, class Out>
void ColumnPass(const MirrorImgParams& p, std::uint32_t windowHeight, const Raster& in, const Mask* mask,
                Raster& out) {
  const auto transfer = [&](std::uint32_t x, std::uint32_t from, std::uint32_t to) {
    for (std::uint32_t c = 0; c < in.channels; ++c) {
      Write(out, x, to, c, Transferred<In, Out>(in, x, from, c));
    }
  };
  for (std::uint32_t x = 0; x < in.width; ++x) {
    bool first = true;
    std::uint32_t source = 0, target = 0;
    for (std::uint32_t y = 0; y < in.height; ++y) {
      if (!IsValid(mask, x, y)) {
        if (!p.isNewFile) transfer(x, y, y);
        continue;
      }
      if (first) {
        source = y + windowHeight - 1;
        target = p.isNewFile ? 0 : y;
        first = false;
      } else {
        source = source - 1;
        target = target + 1;
      }
      transfer(x, source, target);
    }
  }
}

}  // namespace

void MirrorImg(const MirrorImgParams& params, const Raster& in, const Mask* mask, Raster& out) {
  const std::uint32_t windowWidth = params.Window.empty() ? in.width : params.Window[2];
  const std::uint32_t windowHeight = params.Window.empty() ? in.height : params.Window[3];
  tests::WithPixelTypes(in.dataType, out.dataType, [&]<class In, class Out>() {
    if (IsWord(params.Axis, "VERT")) {
      RowPass<In, Out>(params, windowWidth, in, mask, out);
    } else if (IsWord(params.Axis, "HORI")) {
      ColumnPass<In, Out>(params, windowHeight, in, mask, out);
    }
  });
}

}  // namespace orvik::reference
