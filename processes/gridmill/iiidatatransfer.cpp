#include "processes/gridmill/iiidatatransfer.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "basic/tessel/plaincast.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/pixelreader.h"
#include "processes/gridmill/frame/pixelwriter.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/pixelgather.h"
#include "processes/gridmill/kernels/rowconversions.h"

namespace orvik::gridmill {

namespace {

// ---- pixel

/// One axis of the mapping from the output to the input.
struct Axis {
  unsigned int inStart;  ///< of the region, in the whole image
  unsigned int outStart;
  double scale;
  unsigned int inOrigin;  ///< of the raster
  unsigned int outOrigin;
  unsigned int extent;  ///< of the input

  /// The input coordinate of an output coordinate: the nearest one, ties upwards.
  GRIDMILL_INLINE unsigned int Nearest(unsigned int p) const {
    // Deliberate: a coordinate before the region wraps.
    const unsigned int t = p - outStart + outOrigin;
    const double u = t / scale + inStart - inOrigin + 0.5;
    const int nearest = tessel::TruncateSigned<int>(u);
    const unsigned int held = nearest < 0 ? 0 : static_cast<unsigned int>(nearest);
    return held < extent ? held : extent - 1;
  }
};

GRIDMILL_MULTIVERSION void MapRow(const Axis& axis, std::size_t count, std::uint32_t* __restrict nearest) {
  for (std::size_t p = 0; p < count; ++p) nearest[p] = axis.Nearest(static_cast<std::uint32_t>(p));
}

std::vector<std::uint32_t> Mapped(const Axis& axis, std::uint32_t count) {
  std::vector<std::uint32_t> nearest(count);
  MapRow(axis, count, nearest.data());
  return nearest;
}

// ---- row

/// Samples that go through the stages together.
constexpr std::size_t kSamples = 4096;

/// Chosen pixels of a row of the input, cast.
template <class In, class Out>
void TransferRow(const kernels::PixelGather& gather, const unsigned char* row, std::size_t first,
                 std::size_t pixels, std::size_t elements, In* scratch, unsigned char* target) {
  const bool consecutive = gather.IsConsecutive(first, pixels);
  if constexpr (std::is_same_v<In, Out>) {
    if (!consecutive) return gather.Take(row, first, pixels, target);
    std::memcpy(target, gather.At(row, first), pixels * elements * sizeof(In));
  } else {
    if (!consecutive) gather.Take(row, first, pixels, reinterpret_cast<unsigned char*>(scratch));
    const In* const source = consecutive ? reinterpret_cast<const In*>(gather.At(row, first)) : scratch;
    kernels::StoreCast(source, pixels * elements, reinterpret_cast<Out*>(target));
  }
}

// ---- image

bool IsEmpty(const tessel::Raster& raster) { return raster.width < 1 || raster.height < 1; }

/// The mapping of an image.
struct Mapping {
  std::size_t elements;  ///< of a pixel that are moved
  bool repeats;  ///< rows of one input row may be written together: no pixel reaches into the next one
  std::vector<std::uint32_t> columns;
  std::vector<std::uint32_t> rows;

  Mapping(const details::IIIParams& of, const tessel::Raster& in, const tessel::Raster& out,
          const tessel::DataType& outElement)
      : elements(frame::ElementsOf(in)),
        repeats(frame::Holds(out, outElement) && elements <= frame::ElementsOf(out)) {
    const auto& [inX, inY, inWidth, inHeight] = of.inRegion;
    const auto& [outX, outY, outWidth, outHeight] = of.outRegion;
    const double sx = static_cast<double>(outWidth) / inWidth;
    const double sy = static_cast<double>(outHeight) / inHeight;
    // cppcheck-suppress useInitializationList ; it needs the names above
    columns = Mapped({inX, outX, sx, in.originX, out.originX, in.width}, out.width);
    rows = Mapped({inY, outY, sy, in.originY, out.originY, in.height}, out.height);
  }
};

/// Calls `transfer(row, first, pixels, target)` for the blocks of the output's rows, once for rows that have
/// one row of the input in common.
template <class Transfer>
void TransferImage(const Mapping& mapping, frame::PixelReader& reader, std::size_t inWidth,
                   std::size_t pixels, std::size_t pixelBytes, frame::PixelWriter& writer,
                   Transfer transfer) {
  const auto& rows = mapping.rows;
  for (std::size_t y = 0, end; y < rows.size(); y = end) {
    end = y + 1;
    while (mapping.repeats && end < rows.size() && rows[end] == rows[y]) ++end;
    const unsigned char* const row = reader.At(0, rows[y], inWidth);
    for (std::size_t x = 0; x < mapping.columns.size(); x += pixels) {
      const std::size_t count = std::min(pixels, mapping.columns.size() - x);
      const auto column = static_cast<std::uint32_t>(x);
      const unsigned char* done = nullptr;
      for (std::size_t same = y; same < end; ++same) {
        unsigned char* const target = writer.At(column, static_cast<std::uint32_t>(same));
        if (done == nullptr) transfer(row, x, count, target);
        if (done != nullptr && done != target) std::memcpy(target, done, count * pixelBytes);
        writer.Write(column, static_cast<std::uint32_t>(same), count);
        done = target;
      }
    }
  }
}

}  // namespace

template <class In, class Out>
class IIIDataTransfer::InnerProcessor : public filters::IProcessor, public details::IIIParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask*, tessel::Raster* out) const override {
    if (resampleType != eRESAMPLE_NEAREST || IsEmpty(*in) || IsEmpty(*out) || in->channels < 1) return;
    const Mapping mapping(*this, *in, *out, tessel::DataType::Of<Out>());
    const std::size_t elements = mapping.elements;
    const kernels::PixelGather gather(mapping.columns, elements * sizeof(In), in->width);
    const std::size_t pixels = frame::DensePixels(elements, kSamples);
    frame::PixelReader reader(*in, tessel::DataType::Of<In>(), elements, in->width);
    frame::PixelWriter writer(*out, tessel::DataType::Of<Out>(), elements, pixels);
    std::vector<In> scratch(pixels * elements);
    TransferImage(mapping, reader, in->width, pixels, elements * sizeof(Out), writer,
                  [&](const unsigned char* row, std::size_t x, std::size_t count, unsigned char* target) {
                    TransferRow<In, Out>(gather, row, x, count, elements, scratch.data(), target);
                  });
  }
};

// ---- frame policy

namespace {

/// Deliberate: the first types and parameters stay, whatever comes later.
struct TransferFrame : frame::Defaults<details::IIIParams> {
  static constexpr frame::Compares compares = frame::Compares::kNone;
  using Dispatcher =
      frame::Extended<typedispatch::Factory2Template<IIIDataTransfer::InnerProcessor, filters::IProcessor>,
                      typeconv::priv::FullTypeList, true>;

  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    to.resampleType = from.resampleType;
    to.inRegion = from.inRegion;
    to.outRegion = from.outRegion;
  }
};

}  // namespace

// ---- operator

IIIDataTransfer::IIIDataTransfer() = default;
IIIDataTransfer::IIIDataTransfer(const IIIDataTransfer&) = default;
IIIDataTransfer& IIIDataTransfer::operator=(const IIIDataTransfer&) = default;
IIIDataTransfer::~IIIDataTransfer() = default;

void IIIDataTransfer::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<TransferFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

}  // namespace orvik::gridmill
