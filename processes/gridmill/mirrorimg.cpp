#include "processes/gridmill/mirrorimg.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string_view>
#include <type_traits>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/mask/maskrow.h"
#include "basic/tessel/samples.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/pixelwriter.h"
#include "processes/gridmill/frame/rows.h"
#include "processes/gridmill/kernels/reverse.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::filters {

namespace {

using kernels::kBlock;

/// True if the text is `word`, which is in upper case, in any mix of cases.
bool IsWord(const std::string& text, std::string_view word) {
  return std::equal(text.begin(), text.end(), word.begin(), word.end(),
                    [](char a, char b) { return (a >= 'a' && a <= 'z' ? a - 'a' + 'A' : a) == b; });
}

// ---- row

/// True if the way through `float` and `ClipTo` gives back every sample.
template <class In, class Out>
inline constexpr bool kKeeps = std::is_same_v<In, Out> &&
                               (std::is_same_v<In, float> || (std::is_integral_v<In> && sizeof(In) <= 2));

/// Deliberate: every sample goes through `float` and `ClipTo`, between equal types too.
template <class In, class Out>
void TransferSamples(const In* source, std::size_t count, Out* target) {
  if constexpr (kKeeps<In, Out>) {
    if (count > 0) std::memcpy(target, source, count * sizeof(In));
  } else {
    float scratch[kBlock];
    for (std::size_t i = 0; i < count; i += kBlock) {
      const std::size_t part = std::min(kBlock, count - i);
      kernels::StoreClipped(kernels::FloatRow(source + i, 1, part, scratch), part, target + i);
    }
  }
}

/// Transfers `pixels` pixels, the first from `source` and each next one from before the one before.
template <class In, class Out>
void TransferReversed(const In* source, std::size_t channels, std::size_t pixels, Out* target) {
  if constexpr (kKeeps<In, Out>) {
    kernels::ReversePixels(reinterpret_cast<const unsigned char*>(source), channels * sizeof(In), pixels,
                           reinterpret_cast<unsigned char*>(target));
  } else if (channels > kBlock) {
    for (std::size_t i = 0; i < pixels; ++i)
      TransferSamples(source - static_cast<std::ptrdiff_t>(i * channels), channels, target + i * channels);
  } else {
    Out scratch[kBlock];
    const std::size_t block = kBlock / std::max<std::size_t>(channels, 1);
    for (std::size_t i = 0; i < pixels; i += block) {
      const std::size_t part = std::min(block, pixels - i);
      const std::size_t first = (i + part - 1) * channels;
      TransferSamples(source - static_cast<std::ptrdiff_t>(first), part * channels, scratch);
      kernels::ReversePixels(reinterpret_cast<const unsigned char*>(scratch + (part - 1) * channels),
                             channels * sizeof(Out), part,
                             reinterpret_cast<unsigned char*>(target + i * channels));
    }
  }
}

/// How the samples of two types are moved, for a walk that knows bytes only.
struct Moves {
  std::size_t inBytes, outBytes;  ///< of a sample
  tessel::DataType outElement;
  void (*samples)(const unsigned char* source, std::size_t count, unsigned char* target);
  void (*reversed)(const unsigned char* source, std::size_t channels, std::size_t pixels,
                   unsigned char* target);
};

template <class In, class Out>
Moves MovesOf() {
  using Byte = unsigned char;
  const auto samples = [](const Byte* source, std::size_t count, Byte* target) {
    TransferSamples(reinterpret_cast<const In*>(source), count, reinterpret_cast<Out*>(target));
  };
  const auto reversed = [](const Byte* source, std::size_t channels, std::size_t pixels, Byte* target) {
    TransferReversed(reinterpret_cast<const In*>(source), channels, pixels, reinterpret_cast<Out*>(target));
  };
  return {sizeof(In), sizeof(Out), tessel::DataType::Of<Out>(), samples, reversed};
}

// ---- image

/// A pixel of the window on its way: where it comes from and where it goes along the flip.
struct Step {
  std::uint32_t source;
  std::uint32_t target;
  bool started = false;

  /// The step of the next marked pixel of a row or column, which lies at `position`.
  void Advance(std::uint32_t position, std::uint32_t windowSize, bool packed) {
    // Deliberate: marked pixels with a gap between them are counted as if they had none.
    source = started ? source - 1 : position + windowSize - 1;
    target = started ? target + 1 : (packed ? 0 : position);
    started = true;
  }
};

/// The rasters of a flip, with the pixels of the input as the unit of length in both.
struct Flip {
  Moves moves;
  const tessel::Raster& in;
  const tessel::Raster& out;
  const tessel::Mask* mask;
  std::uint32_t windowSize;  ///< along the flip
  bool packed;               ///< the mirrored pixels alone, from coordinate 0 along the flip

  std::size_t Channels() const { return in.channels; }

  /// Every row reversed, or the order of the rows.
  void Whole(bool rows) const {
    const frame::Walk walk = rows ? frame::Walk::kElements : frame::Walk::kPixels;
    frame::PixelWriter writer(out, moves.outElement, Channels(), frame::kMaxBlock, walk);
    frame::SerialRows(in.height, [&](std::uint32_t y) {
      const unsigned char* const source = rows ? Source(windowSize - 1, y) : Source(0, windowSize - 1 - y);
      for (std::uint32_t x = 0; x < in.width; x += frame::kMaxBlock) {
        const std::size_t pixels = std::min<std::size_t>(frame::kMaxBlock, in.width - x);
        const auto bytes = static_cast<std::ptrdiff_t>(x * InBytes());
        if (rows) moves.reversed(source - bytes, Channels(), pixels, writer.At(x, y));
        if (!rows) moves.samples(source + bytes, pixels * Channels(), writer.At(x, y));
        writer.Write(x, y, pixels);
      }
    });
  }

  /// The marked pixels of every row in reversed order.
  void MarkedRows() const {
    std::vector<unsigned char> marked(in.width);
    frame::SerialRows(in.height, [&](std::uint32_t y) {
      tessel::UnpackBits(*mask, tessel::PixelIndex(*mask, 0, y), in.width, marked.data());
      unsigned char* const row = tessel::PixelAt<unsigned char>(out, 0, y);
      Step step{};
      for (std::uint32_t x = 0, end = 0; x < in.width; x = end) {
        end = RunEnd(marked, x);
        if (marked[x] == 0) {
          if (!packed) moves.samples(Source(x, y), (end - x) * Channels(), row + x * OutBytes());
          continue;
        }
        step.Advance(x, windowSize, packed);
        moves.reversed(Source(step.source, y), Channels(), end - x, row + step.target * OutBytes());
        step.source -= end - x - 1;
        step.target += end - x - 1;
      }
    });
  }

  /// The marked pixels of every column in reversed order. Row by row: the order counts within a column only.
  void MarkedColumns() const {
    std::vector<unsigned char> marked(in.width);
    std::vector<Step> steps(in.width);
    frame::SerialRows(in.height, [&](std::uint32_t y) {
      tessel::UnpackBits(*mask, tessel::PixelIndex(*mask, 0, y), in.width, marked.data());
      for (std::uint32_t x = 0, end = 0; x < in.width; x = end) {
        if (marked[x] == 0) {
          end = RunEnd(marked, x);
          if (!packed) TransferRun(x, end, y, y);
          continue;
        }
        steps[x].Advance(y, windowSize, packed);
        for (end = x + 1; end < in.width && marked[end] != 0; ++end) {
          Step step = steps[end];
          step.Advance(y, windowSize, packed);
          if (step.source != steps[x].source || step.target != steps[x].target) break;
          steps[end] = step;
        }
        TransferRun(x, end, steps[x].source, steps[x].target);
      }
    });
  }

 private:
  std::size_t InBytes() const { return Channels() * moves.inBytes; }
  std::size_t OutBytes() const { return Channels() * moves.outBytes; }

  /// The first sample of a pixel of the input, which may lie outside the image.
  const unsigned char* Source(std::uint32_t x, std::uint32_t y) const {
    return tessel::PixelAt<unsigned char>(in, x, y);
  }

  /// The pixels from column `x` to before `end` of one row to another.
  void TransferRun(std::uint32_t x, std::uint32_t end, std::uint32_t source, std::uint32_t target) const {
    const std::uint32_t step = out.channels == in.channels ? end - x : 1;
    for (; x < end; x += step)
      moves.samples(Source(x, source), step * Channels(), tessel::PixelAt<unsigned char>(out, x, target));
  }

  /// The end of the pixels from `x` on that are marked, or not marked, as it is.
  static std::uint32_t RunEnd(const std::vector<unsigned char>& marked, std::uint32_t x) {
    const auto from = marked.begin() + x;
    return x + static_cast<std::uint32_t>(std::find(from, marked.end(), *from ^ 1) - from);
  }
};

}  // namespace

template <class In, class Out>
class MirrorImg::InnerProcessor : public IProcessor, public details::MirrorImgParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const override {
    const bool rows = IsWord(Axis, "VERT");
    if (!rows && !IsWord(Axis, "HORI")) return;
    const std::uint32_t windowSize = Window.empty() ? (rows ? in->width : in->height) : Window[rows ? 2 : 3];
    const Flip flip{MovesOf<In, Out>(), *in, *out, mask, windowSize, isNewFile};
    if (mask == nullptr) return flip.Whole(rows);
    rows ? flip.MarkedRows() : flip.MarkedColumns();
  }
};

// ---- frame policy

namespace {

struct MirrorFrame : frame::Defaults<details::MirrorImgParams> {
  /// Deliberate: a rebuild leaves the old processor allocated.
  static constexpr frame::Replaced replaced = frame::Replaced::kLeftAllocated;
  using Dispatcher = frame::Extended<typedispatch::Factory2Template<MirrorImg::InnerProcessor, IProcessor>,
                                     typeconv::priv::FullTypeList>;
};

}  // namespace

// ---- operator

MirrorImg::MirrorImg() = default;
MirrorImg::MirrorImg(const MirrorImg&) = default;
MirrorImg& MirrorImg::operator=(const MirrorImg&) = default;
MirrorImg::~MirrorImg() = default;

void MirrorImg::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<MirrorFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::filters
