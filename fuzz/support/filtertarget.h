#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

#include <omp.h>

#include "fuzz/support/bytes.h"
#include "fuzz/support/digest.h"
#include "fuzz/support/scene.h"
#include "fuzz/support/values.h"

namespace orvik::fuzz {

/// Which change of types builds a new processor, to which alone the parameters go.
enum class Rebuilds { kInputOrOutput, kInput, kNever };

/// A number of threads, another one in each copy of a target in a program.
inline int DrawThreads(Bytes& bytes) {
  constexpr int kThreads[] = {1, 2, 5};
  return kThreads[(bytes.Below(3) + GRIDMILL_FUZZ_COPY) % 3];
}

/// What the targets of one input and one output deviate in. A target derives from this and adds
///
/// - `Operator` and `Params`, the parameters that a twin takes;
/// - `static Operator Make(Bytes&)`, where there is no default constructor to use;
/// - `static void Set(Bytes&, Operator&, std::uint32_t channels)`, setters with valid values;
/// - `static void Twin(const Params&, const DataType& readAs, const DataType& writtenAs, const Raster& in,
///   const Mask*, Raster& out)`.
struct FilterDefaults {
  static constexpr Rebuilds rebuilds = Rebuilds::kInputOrOutput;
  static constexpr std::uint32_t leastChannels = 0;
  static constexpr std::uint32_t leastMargin = 0;
  static constexpr bool isParallel = false;
  static constexpr bool takesComplex = false;    ///< as an input
  static constexpr bool interprets = false;      ///< complex inputs count as real ones
  static constexpr bool writesComplex = false;   ///< takes a complex output
  static constexpr bool hasSettersLater = true;  ///< setters between calls keep within what is valid

  /// What an input needs beyond what is drawn.
  static void Widen(Shape&) {}

  /// The size and the origins of an output, where they are not those of the input.
  static void Reshape(Bytes&, Shape&) {}

  /// Channels of an output.
  static std::uint32_t OutChannels(Bytes& bytes, const Shape& in) { return in.channels + bytes.Below(2); }
  template <class Operator>
  static Operator Make(Bytes&) {
    return Operator();
  }
  template <class Operator>
  static void Process(const Operator& op, tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) {
    op.Process(in, mask, out);
  }
};

/// An operator and what its processor was built with.
template <class Target>
class FilterSequence {
 public:
  explicit FilterSequence(Bytes& bytes)
      : bytes_(bytes),
        channels_(Target::leastChannels + bytes.Below(7 - Target::leastChannels)),
        op_(std::make_unique<Operator>(Target::template Make<Operator>(bytes))) {
    Target::Set(bytes_, *op_, channels_);
    if (bytes_.OneIn(4)) op_ = std::make_unique<Operator>(*op_);
  }

  /// One call of the operator and of its twin.
  void Call() {
    if (held_ && Target::hasSettersLater && bytes_.OneIn(3)) Target::Set(bytes_, *op_, channels_);
    DrawTypes();
    Shape shape = DrawShape(bytes_, in_, channels_, Target::leastMargin, Target::isParallel);
    Target::Widen(shape);
    Remember();
    const bool isRoomy = Target::rebuilds != Rebuilds::kInputOrOutput;
    const Buffer in(shape, isRoomy);
    const std::unique_ptr<tessel::Mask> mask = DrawMask(bytes_, *in);
    Shape outShape = shape;
    outShape.channels = Target::OutChannels(bytes_, shape);
    outShape.width += bytes_.Below(2);
    outShape.type = out_;
    outShape.margins = {bytes_.Below(3), bytes_.Below(3)};
    Target::Reshape(bytes_, outShape);
    const Buffer expected(outShape, isRoomy), actual(outShape, isRoomy);
    Fill(bytes_, readAs_, *in);
    Run(in, mask.get(), expected, actual);
    if (!ShowsPayloads(outShape, *in, mask.get())) RequireSame(*expected, *actual, writtenAs_);
  }

 private:
  using Operator = typename Target::Operator;
  using Params = typename Target::Params;

  void DrawTypes() {
    if (!held_ || bytes_.OneIn(2)) {
      in_ = PixelTypeOf(bytes_);
      in_.isComplex = Target::takesComplex && bytes_.OneIn(5);
    }
    if (!held_ || bytes_.OneIn(2)) {
      out_ = PixelTypeOf(bytes_);
      out_.isComplex = Target::writesComplex && bytes_.OneIn(5);
    }
  }

  /// Keeps the parameters and types of a call that builds a processor.
  void Remember() {
    tessel::DataType in = in_;
    if (Target::interprets) in.isComplex = false;
    bool isKept = held_.has_value();
    if (Target::rebuilds != Rebuilds::kNever && in != builtFor_) isKept = false;
    if (Target::rebuilds == Rebuilds::kInputOrOutput && out_ != writtenAs_) isKept = false;
    readAs_ = in_;
    if (isKept && Target::rebuilds == Rebuilds::kNever) readAs_ = builtFor_;
    if (isKept) return;
    held_.emplace(*op_);
    builtFor_ = in;
    writtenAs_ = out_;
  }

  /// Runs operator and twin, and looks at all but their results.
  void Run(const Buffer& in, tessel::Mask* mask, const Buffer& expected, const Buffer& actual) {
    const std::vector<unsigned char> before = BytesOf(*in), bits = BytesOf(mask);
    Target::Twin(*held_, readAs_, writtenAs_, *in, mask, *expected);
    if (Target::isParallel) omp_set_num_threads(DrawThreads(bytes_));
    Target::Process(*op_, in.Get(), mask, actual.Get());
    Observed().Add(*actual, writtenAs_);
    RequireUntouched(before, BytesOf(*in));
    RequireUntouched(bits, BytesOf(mask));
    if (!in.IsIntact() || !actual.IsIntact()) Fail("a sentinel beside a buffer was overwritten");
  }

  /// True if elements overlap and one of them is NaN. What is left to see of it is a part of its payload, and
  /// which one a sum of two NaNs takes over is the compiler's choice.
  bool ShowsPayloads(Shape out, const tessel::Raster& in, const tessel::Mask* mask) const {
    if (!writtenAs_.isFloat || writtenAs_.sizeBits <= out.type.sizeBits) return false;
    out.type = writtenAs_;
    const Buffer apart(out, true);
    Target::Twin(*held_, readAs_, writtenAs_, in, mask, *apart);
    return HasNaN(*apart);
  }

  Bytes& bytes_;
  std::uint32_t channels_;
  std::unique_ptr<Operator> op_;
  std::optional<Params> held_;
  tessel::DataType in_, out_;
  tessel::DataType builtFor_, readAs_, writtenAs_;
};

/// Runs one input of the fuzzer.
template <class Target>
void RunFilter(Bytes& bytes) {
  const std::uint32_t calls = 1 + bytes.Below(4);
  FilterSequence<Target> sequence(bytes);
  for (std::uint32_t i = 0; i < calls; ++i) sequence.Call();
}

}  // namespace orvik::fuzz
