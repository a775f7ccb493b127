#include "processes/gridmill/rangeclasses.h"

#include <algorithm>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <type_traits>
#include <utility>
#include <vector>

#include "basic/core/typedispatch/extendtypedispatch.h"
#include "basic/core/typedispatch/typelist.h"
#include "processes/gridmill/frame/filterrows.h"
#include "processes/gridmill/frame/frame.h"
#include "processes/gridmill/frame/readback.h"
#include "processes/gridmill/kernels/countedsamples.h"
#include "processes/gridmill/kernels/multiversion.h"
#include "processes/gridmill/kernels/rowconversions.h"
#include "processes/gridmill/kernels/tablelookup.h"

namespace orvik::gridmill {

namespace {

using kernels::kBlock;

// ---- pixel

template <class In>
inline constexpr bool kNarrow = std::is_integral_v<In> && sizeof(In) <= 2;

/// What is compared: narrow integers, which are exact in `float`, as they are, all others as `float`.
template <class In>
using ValueOf = std::conditional_t<kNarrow<In>, In, float>;

/// An integer in the order of the values, so that one comparison finds a range.
template <class Value>
GRIDMILL_INLINE auto KeyOf(Value value) {
  if constexpr (std::is_same_v<Value, float>) {
    const auto bits = std::bit_cast<std::int32_t>(value + 0.0f);  // both zeros alike
    return static_cast<std::uint32_t>(bits ^ (bits >> 31 & 0x7fffffff));
  } else {
    return static_cast<std::make_unsigned_t<Value>>(value);
  }
}

/// The keys from `first` on, `span` + 1 of them.
template <class Value>
struct KeyRange {
  using Key = decltype(KeyOf(Value{}));

  Key first;
  Key span;
  int number;  ///< of the class; 0: no-data
};

// ---- row

/// Replaces the numbers of the values within `group` ranges, of which the last one prevails.
template <std::size_t group, class Value, class Number>
GRIDMILL_MULTIVERSION void NumberGroup(const Value* __restrict values, const KeyRange<Value>* ranges,
                                       std::size_t count, Number* __restrict numbers) {
  using Key = typename KeyRange<Value>::Key;
  Key first[group], span[group], number[group];
  for (std::size_t k = 0; k < group; ++k) {
    first[k] = ranges[k].first;
    span[k] = ranges[k].span;
    number[k] = static_cast<Key>(ranges[k].number);
  }
  for (std::size_t i = 0; i < count; ++i) {
    const Key key = KeyOf(values[i]);
    Key found = static_cast<Key>(numbers[i]);
    // Unrolled here: compilers do not vectorise around a loop over many ranges.
    [&]<std::size_t... k>(std::index_sequence<k...>) {
      ((found = static_cast<Key>(key - first[k]) <= span[k] ? number[k] : found), ...);
    }
    (std::make_index_sequence<group>());
    numbers[i] = static_cast<Number>(found);
  }
}

template <class Value, class Number>
void NumberRow(const Value* values, const std::vector<KeyRange<Value>>& ranges, std::size_t count,
               Number* numbers) {
  std::fill_n(numbers, count, Number{0});
  const KeyRange<Value>* range = ranges.data();
  const KeyRange<Value>* const end = range + ranges.size();
  for (; end - range >= 9; range += 9) NumberGroup<9>(values, range, count, numbers);  // eight and no-data
  for (; end - range >= 8; range += 8) NumberGroup<8>(values, range, count, numbers);
  for (; end - range >= 3; range += 3) NumberGroup<3>(values, range, count, numbers);
  for (; range < end; ++range) NumberGroup<1>(values, range, count, numbers);
}

/// The classes as values of a type are compared with them.
template <class Value>
class Classes {
 public:
  explicit Classes(const details::RangeClassesParams& of) {
    for (std::size_t k = 0; k < of.classValues.size(); ++k) {
      // Deliberate: both bounds are exclusive.
      const double lower = of.minRange[k], upper = of.maxRange[k];
      Add({[lower](double v) { return v > lower; }, [upper](double v) { return v < upper; }},
          of.classValues[k]);
    }
    const float noData = of.noData;
    const auto difference = [noData](double v) -> double { return static_cast<float>(v) - noData; };
    Add({[&](double v) { return difference(v) > -1e-9; }, [&](double v) { return difference(v) < 1e-9; }}, 0);
    if constexpr (kNarrow<Value>) {
      if (ranges_.size() > kCompared || highest_ > 255) FillTable();
    }
  }

  /// Calls `write` with the numbers of at most `kBlock` values.
  template <class Write>
  void Number(const Value* values, std::size_t count, Write write) const {
    unsigned char bytes[kBlock];
    int numbers[kBlock];
    if constexpr (kNarrow<Value>) {
      if (!table_.empty()) {
        kernels::LookUpRow(values, table_.data(), 1, count, numbers);
        return write(numbers);
      }
    } else if (highest_ > 255) {
      NumberRow(values, ranges_, count, numbers);
      return write(numbers);
    }
    NumberRow(values, ranges_, count, bytes);
    write(bytes);
  }

 private:
  /// With more ranges a table is faster, where one is possible.
  static constexpr std::size_t kCompared = 16;

  void Add(const kernels::SampleSpan<Value>& span, int number) {
    if (span.IsEmpty()) return;
    const auto first = KeyOf(span.first);
    ranges_.push_back({first, static_cast<decltype(first)>(KeyOf(span.last) - first), number});
    highest_ = std::max(highest_, number);
  }

  void FillTable() {
    using Key = typename KeyRange<Value>::Key;
    table_.resize(kernels::kTableEntries<Value>);
    for (const KeyRange<Value>& range : ranges_)
      for (std::size_t i = 0; i <= range.span; ++i) table_[static_cast<Key>(range.first + i)] = range.number;
  }

  std::vector<KeyRange<Value>> ranges_;
  int highest_ = 0;
  std::vector<int> table_;  ///< the number of every value, by its bits
};

/// The class numbers of at most `kBlock` samples as they are written.
template <class In, class Out>
void WriteClassRow(const In* samples, std::size_t stride, std::size_t count,
                   const Classes<ValueOf<In>>& classes, Out* target) {
  const auto write = [&](const auto* numbers) { kernels::StoreCast(numbers, count, target); };
  if constexpr (!kNarrow<In>) {
    float scratch[kBlock];
    classes.Number(kernels::FloatRow(samples, stride, count, scratch), count, write);
  } else if (stride == 1) {
    classes.Number(samples, count, write);
  } else {
    In scratch[kBlock];
    kernels::CopyRow(samples, stride, count, scratch);
    classes.Number(scratch, count, write);
  }
}

// ---- image

}  // namespace

template <class In, class Out>
class RangeClasses::InnerProcessor : public filters::IProcessor, public details::RangeClassesParams {
 public:
  void Process(tessel::Raster* in, tessel::Mask*, tessel::Raster* out) const override {
    if (in->height < 1) return;
    if (classes_ == nullptr) classes_ = std::make_unique<Classes<ValueOf<In>>>(*this);
    const frame::FilterShape shape{kBlock, frame::Walk::kPixels, 1, frame::Walk::kElements};
    frame::FilterRows<In, Out>(*in, nullptr, *out, shape, [this](const auto& block) {
      WriteClassRow(block.image, block.stride, block.pixels, *classes_, block.target);
    });
  }

 private:
  mutable std::unique_ptr<Classes<ValueOf<In>>> classes_;  ///< made by the first call
};

// ---- frame policy

namespace {

struct RangeClassesFrame : frame::Defaults<details::RangeClassesParams> {
  using Dispatcher =
      frame::Extended<typedispatch::Factory2Template<RangeClasses::InnerProcessor, filters::IProcessor>,
                      typeconv::priv::FullTypeList>;

  template <class Rasters>
  static void HandOver(const Params& from, Params& to, const Rasters&) {
    to.SetNumClasses(from.classCount);
    to.SetMask(from.maskDecision);
    to.SetMinRange(from.minRange);
    to.SetMaxRange(from.maxRange);
    to.SetNoData(from.noData);
  }
};

}  // namespace

// ---- operator

RangeClasses::RangeClasses() = default;
RangeClasses::RangeClasses(const RangeClasses&) = default;
RangeClasses& RangeClasses::operator=(const RangeClasses&) = default;
RangeClasses::~RangeClasses() = default;

void RangeClasses::Process(tessel::Raster* in, tessel::Mask* mask, tessel::Raster* out) const {
  frame::Process<RangeClassesFrame>(
      *this, cache_, frame::Rasters<2>{in, out},
      [mask](const auto& processor, const auto& r) { processor.Process(r[0], mask, r[1]); });
}

int RangeClasses::GetClassNumber() {
  const auto* const built = frame::Built<details::RangeClassesParams>(cache_);
  return built == nullptr ? -1 : built->classCount;
}

void RangeClasses::GetMinRangeValue(std::vector<float>& values) {
  if (const auto* const built = frame::Built<details::RangeClassesParams>(cache_))
    frame::AppendFirst(built->minRange, classCount, values);
}

void RangeClasses::GetMaxRangeValue(std::vector<float>& values) {
  if (const auto* const built = frame::Built<details::RangeClassesParams>(cache_))
    frame::AppendFirst(built->maxRange, classCount, values);
}

}  // namespace orvik::gridmill
