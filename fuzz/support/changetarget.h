#pragma once

#include <algorithm>
#include <cstdint>
#include <memory>
#include <optional>
#include <vector>

#include "fuzz/support/bytes.h"
#include "fuzz/support/digest.h"
#include "fuzz/support/scene.h"
#include "fuzz/support/values.h"
#include "tests/support/changecases.h"

namespace orvik::fuzz {

/// The rasters and masks of a call of a change operator.
struct Dates {
  tessel::Raster* image;
  tessel::Raster* reference;
  tessel::Mask* mask;
  tessel::Mask* referenceMask;
};

/// What the targets of the change operators deviate in. A target derives from this and adds
///
/// - `Operator`, and `static Operator Make(const tests::ChangeParameters&)`;
/// - `static void Twin(const tests::ChangeParameters&, const Dates&, Raster& out)`.
struct ChangeDefaults {
  using Parameters = tests::ChangeParameters;
  static constexpr bool isOfThreeTypes = false;  ///< those of the short list; complex inputs count as real
  static constexpr bool hasTwoMasks = false;
  static constexpr bool takesAnyReference = false;  ///< of another type than the image's
  static constexpr std::uint32_t leastChannels = 0;

  /// Draws what `Parameters` has beyond its base.
  static void DrawMore(Bytes&, tests::ChangeParameters&) {}

  /// Channels that are written.
  static std::uint32_t Written(std::uint32_t image, std::uint32_t) { return image; }

  /// Called before the comparison, with differences that are known taken back.
  static void Settle(const tests::ChangeParameters&, const Dates&, const tessel::Raster&, tessel::Raster&) {}

  template <class Operator>
  static void Process(const Operator& op, const Dates& dates, tessel::Raster* out) {
    op.Process(dates.image, dates.reference, dates.mask, out);
  }
  template <class Operator>
  static void Set(const tests::ChangeParameters& parameters, Operator& op) {
    op.SetType(static_cast<decltype(op.type)>(parameters.type));
    tests::SetNoDataOf(parameters, op);
  }
};

/// A change operator and what its processor was built with.
template <class Target>
class ChangeSequence {
 public:
  explicit ChangeSequence(Bytes& bytes)
      : bytes_(bytes),
        channels_(Target::leastChannels + bytes.Below(7 - Target::leastChannels)),
        referenceChannels_(channels_ + bytes.Below(3)) {
    Draw();
    op_ = std::make_unique<Operator>(Target::Make(drawn_));
    Target::Set(drawn_, *op_);
    if (bytes_.OneIn(4)) op_ = std::make_unique<Operator>(*op_);
  }

  /// One call of the operator and of its twin.
  void Call() {
    if (held_ && bytes_.OneIn(3)) {
      Draw();
      Target::Set(drawn_, *op_);
    }
    DrawTypes();
    Remember();
    const Shape image = DrawShape(bytes_, image_, channels_, 0);
    const Shape reference = Beside(image, reference_, referenceChannels_);
    const std::uint32_t written = Target::Written(channels_, referenceChannels_);
    const Shape out = Beside(image, out_, written + bytes_.Below(2));
    const Buffer in(image, false), ref(reference, Target::takesAnyReference);
    const Buffer expected(out, false), actual(out, false);
    const std::unique_ptr<tessel::Mask> mask = DrawMask(bytes_, *in);
    const std::unique_ptr<tessel::Mask> second = Target::hasTwoMasks ? DrawMask(bytes_, *in) : nullptr;
    Fill(bytes_, image_, *in);
    Fill(bytes_, reference_, *ref);
    Compare({in.Get(), ref.Get(), mask.get(), second.get()}, *expected, *actual);
    if (!in.IsIntact() || !ref.IsIntact() || !actual.IsIntact())
      Fail("a sentinel beside a buffer was overwritten");
  }

 private:
  using Operator = typename Target::Operator;
  using Parameters = typename Target::Parameters;

  /// Parameters with no-data vectors that switch the test on or off.
  void Draw() {
    drawn_.type = static_cast<int>(bytes_.Below(6)) - 1;
    drawn_.noData = FloatValue(bytes_);
    const bool isActive = !bytes_.OneIn(3);
    const std::size_t length = isActive ? channels_ : channels_ + 1;
    drawn_.imgNoData = FloatValues(bytes_, length);
    drawn_.refNoData = FloatValues(bytes_, isActive ? referenceChannels_ : bytes_.Below(3));
    Target::DrawMore(bytes_, drawn_);
  }

  tessel::DataType DrawType() { return Target::isOfThreeTypes ? ShortTypeOf(bytes_) : PixelTypeOf(bytes_); }

  void DrawTypes() {
    if (!held_ || bytes_.OneIn(2)) {
      image_ = DrawType();
      image_.isComplex = bytes_.OneIn(6);
    }
    if (!held_ || bytes_.OneIn(2)) {
      out_ = DrawType();
      out_.isComplex = !Target::isOfThreeTypes && bytes_.OneIn(6);
    }
    if (!Target::isOfThreeTypes) reference_ = image_;
    const bool isFree =
        Target::isOfThreeTypes ? !held_ || bytes_.OneIn(2) : Target::takesAnyReference && bytes_.OneIn(4);
    if (!isFree) return;
    reference_ = DrawType();
    reference_.isComplex = bytes_.OneIn(6);
  }

  /// Keeps the parameters of a call that builds a processor.
  void Remember() {
    tessel::DataType types[] = {image_, reference_, out_};
    if (Target::isOfThreeTypes) types[0].isComplex = types[1].isComplex = false;
    const tessel::DataType& comparedTo = Target::isOfThreeTypes ? builtFor_[1] : builtFor_[0];
    if (held_ && types[0] == builtFor_[0] && types[1] == comparedTo && types[2] == builtFor_[2]) return;
    held_ = drawn_;
    std::copy(std::begin(types), std::end(types), std::begin(builtFor_));
  }

  Shape Beside(const Shape& image, const tessel::DataType& type, std::uint32_t channels) {
    Shape shape = image;
    shape.width += bytes_.Below(3);
    shape.height += bytes_.Below(2);
    shape.channels = channels;
    shape.type = type;
    shape.margins = {bytes_.Below(3), bytes_.Below(3)};
    return shape;
  }

  void Compare(const Dates& dates, tessel::Raster& expected, tessel::Raster& actual) {
    const auto before = BytesOf(*dates.image), reference = BytesOf(*dates.reference);
    const auto bits = BytesOf(dates.mask), secondBits = BytesOf(dates.referenceMask);
    Target::Twin(*held_, dates, expected);
    Target::Process(*op_, dates, &actual);
    Observed().Add(actual, out_);
    Target::Settle(*held_, dates, expected, actual);
    RequireSame(expected, actual, out_);
    RequireUntouched(before, BytesOf(*dates.image));
    RequireUntouched(reference, BytesOf(*dates.reference));
    RequireUntouched(bits, BytesOf(dates.mask));
    RequireUntouched(secondBits, BytesOf(dates.referenceMask));
  }

  Bytes& bytes_;
  std::uint32_t channels_, referenceChannels_;
  Parameters drawn_;
  std::optional<Parameters> held_;
  std::unique_ptr<Operator> op_;
  tessel::DataType image_, reference_, out_;
  tessel::DataType builtFor_[3];
};

/// Runs one input of the fuzzer.
template <class Target>
void RunChange(Bytes& bytes) {
  const std::uint32_t calls = 1 + bytes.Below(4);
  ChangeSequence<Target> sequence(bytes);
  for (std::uint32_t i = 0; i < calls; ++i) sequence.Call();
}

}  // namespace orvik::fuzz
