#include "processes/gridmill/combchange.h"

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "basic/tessel/clipto.h"
#include "basic/tessel/datatype.h"
#include "processes/gridmill/frame/changerows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/kernels/maskedcells.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::changedetection {

namespace {

using tessel::DataType;

/// The order of the types on which the path depends.
bool OrdersBefore(const DataType& a, const DataType& b) {
  if (a.sizeBits != b.sizeBits) return a.sizeBits < b.sizeBits;
  if (a.isSigned != b.isSigned) return b.isSigned;
  if (a.isFloat != b.isFloat) return b.isFloat;
  if (a.mantissaBits != b.mantissaBits) return a.mantissaBits < b.mantissaBits;
  return !a.isComplex && b.isComplex;
}

// ---- pixel

/// Deliberate: a 16-bit sample counts as the decimal number that its two bytes spell out, any other as 0.
template <class In>
float NumberSpelt(const In& sample) {
  if constexpr (sizeof(In) != 2) return 0.0f;
  char scratch[3] = {};
  std::memcpy(scratch, &sample, 2);
  return static_cast<float>(std::atoi(scratch));
}

// ---- row

template <class In, class Out>
const Out* SpellRow(const In* source, std::size_t count, Out* target) {
  for (std::size_t i = 0; i < count; ++i) target[i] = tessel::ClipTo<Out>(NumberSpelt(source[i]));
  return target;
}

/// Copies pixels in chunks of a fixed size, which is faster than one of their own: what a chunk writes beyond
/// a pixel, the next one replaces. Returns how many pixels it copied; those at the end have no room for that.
template <std::size_t chunk>
std::size_t JoinChunks(const unsigned char* a, std::size_t aBytes, const unsigned char* b, std::size_t bBytes,
                       std::size_t pixels, unsigned char* target) {
  const std::size_t shorter = std::min(aBytes, bBytes);
  const std::size_t kept = shorter == 0 ? pixels : std::min(pixels, chunk / shorter + 1);
  for (std::size_t i = 0; i + kept < pixels; ++i) {
    std::memcpy(target, a + i * aBytes, chunk);
    std::memcpy(target + aBytes, b + i * bBytes, chunk);
    target += aBytes + bBytes;
  }
  return pixels - kept;
}

/// Copies `pixels` pixels of `aBytes` and `bBytes` bytes into one row, each pixel of `a` before that of `b`.
void JoinPixels(const unsigned char* a, std::size_t aBytes, const unsigned char* b, std::size_t bBytes,
                std::size_t pixels, unsigned char* target) {
  const std::size_t longer = std::max(aBytes, bBytes);
  std::size_t done = 0;
  if (longer <= 4) {
    done = JoinChunks<4>(a, aBytes, b, bBytes, pixels, target);
  } else if (longer <= 8) {
    done = JoinChunks<8>(a, aBytes, b, bBytes, pixels, target);
  } else if (longer <= 16) {
    done = JoinChunks<16>(a, aBytes, b, bBytes, pixels, target);
  } else if (longer <= 32) {
    done = JoinChunks<32>(a, aBytes, b, bBytes, pixels, target);
  }
  for (std::size_t i = done; i < pixels; ++i) {
    std::copy_n(a + i * aBytes, aBytes, target + i * (aBytes + bBytes));
    std::copy_n(b + i * bBytes, bBytes, target + i * (aBytes + bBytes) + aBytes);
  }
}

/// The channels of both dates on their way into one pixel.
template <class Out>
class Combination {
 public:
  Combination(std::size_t m, std::size_t n, std::size_t pixels, Out excluded)
      : m_(m),
        n_(n),
        excluded_(excluded),
        image_(m * pixels),
        reference_(n * pixels),
        keep_((m + n) * pixels) {}

  /// Room for the image's channels of a block, and for the reference's.
  Out* Image() { return image_.data(); }
  Out* Reference() { return reference_.data(); }

  /// Writes a block.
  template <class Block>
  void Write(const Block& block, const Out* image, const Out* reference) {
    JoinPixels(reinterpret_cast<const unsigned char*>(image), m_ * sizeof(Out),
               reinterpret_cast<const unsigned char*>(reference), n_ * sizeof(Out), block.pixels,
               reinterpret_cast<unsigned char*>(block.target));
    if (!block.masked) return;
    kernels::ReplicateRow(block.valid, m_ + n_, block.pixels, keep_.data());
    kernels::ReplaceMasked(keep_.data(), excluded_, block.pixels * (m_ + n_), block.target);
  }

 private:
  std::size_t m_;
  std::size_t n_;
  Out excluded_;
  std::vector<Out> image_;
  std::vector<Out> reference_;
  std::vector<unsigned char> keep_;
};

}  // namespace

// ---- image

template <class In, class Out>
class CombChange::InnerProcessor : public IChange, public details::CombParams {
 public:
  void Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
               tessel::Raster* out) const override {
    const frame::TwoDates dates{*image, *reference, *out, mask};
    const bool like = image->dataType == reference->dataType;
    const bool below = OrdersBefore(image->dataType, reference->dataType);
    if (like || below) return CombineElements(dates, below);
    CombineBytes(dates);
  }

 private:
  static frame::BlockShape ShapeOf(std::size_t m, std::size_t n) {
    frame::BlockShape shape = frame::SampleBlocks(m + n, 8192);
    shape.imageSamples = m;
    shape.referenceSamples = n;
    return shape;
  }

  /// Both dates as elements of the image's type.
  /// Deliberate: an image that orders below its reference is read as decimal text.
  void CombineElements(const frame::TwoDates& dates, bool spelt) const {
    const std::size_t m = dates.image.channels, n = dates.reference.channels;
    const frame::BlockShape shape = ShapeOf(m, n);
    Combination<Out> both(m, n, shape.pixels, tessel::ClipTo<Out>(noData));
    frame::ChangeRows<In, In, Out>(dates, shape, [&](const auto& block) {
      const Out* const i = spelt ? SpellRow(block.image, block.pixels * m, both.Image())
                                 : kernels::ClippedRow(block.image, block.pixels * m, both.Image());
      both.Write(block, i, kernels::ClippedRow(block.reference, block.pixels * n, both.Reference()));
    });
  }

  /// Deliberate: beside an image that does not order below it, a reference of another type is read byte by
  /// byte if it has 8 bits, and counts as 0 if it has another width.
  void CombineBytes(const frame::TwoDates& dates) const {
    const std::size_t m = dates.image.channels, n = dates.reference.channels;
    const bool read = dates.reference.dataType.sizeBits == 8;
    frame::BlockShape shape = ShapeOf(m, n);
    if (!read) shape.referenceSamples = 0;
    Combination<Out> both(m, n, shape.pixels, tessel::ClipTo<Out>(noData));
    std::vector<float> value(n * shape.pixels);
    frame::ChangeRows<In, unsigned char, Out>(dates, shape, [&](const auto& block) {
      const std::size_t count = block.pixels * n;
      if (read) kernels::LoadRow(block.reference, 1, count, value.data());
      kernels::StoreClipped(value.data(), count, both.Reference());
      both.Write(block, kernels::ClippedRow(block.image, block.pixels * m, both.Image()), both.Reference());
    });
  }
};

struct CombChange::CombCreationPolicy {
  template <class In, class Out>
  static IChange* Create(bool) {
    return new InnerProcessor<In, Out>();
  }
};

// ---- frame policy

namespace {

struct CombFrame : frame::Defaults<details::CombParams> {
  static constexpr frame::Compares compares = frame::Compares::kReferenceAgainstInput;
  using Dispatcher = frame::TwoLevel<CombChange::CombCreationPolicy>;
};

}  // namespace

// ---- operator

CombChange::CombChange(DiffType form) {
  type = form;
  noData = 0.0f;
}
CombChange::CombChange(const CombChange&) = default;
CombChange& CombChange::operator=(const CombChange&) = default;
CombChange::~CombChange() = default;

void CombChange::Process(tessel::Raster* image, tessel::Raster* reference, tessel::Mask* mask,
                         tessel::Raster* out) const {
  frame::Process<CombFrame>(
      *this, cache_, frame::Rasters<3>{image, reference, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], r[1], mask, r[2]); });
}

}  // namespace orvik::changedetection
