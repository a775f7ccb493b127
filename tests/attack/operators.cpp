#include "tests/attack/operators.h"

#include <algorithm>
#include <cstdio>
#include <cstring>

#include <fcntl.h>
#include <unistd.h>

#include "processes/gridmill/gridmill.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"

namespace orvik::attack {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;

namespace {

constexpr float kNoData = 7.0f;

// ---- objects

template <class Op>
class Held final : public Object {
 public:
  template <class... Arguments>
  explicit Held(Arguments... arguments) : op(arguments...) {}

  void Process(const Call& call) override {
    if constexpr (requires { op.Process(call.in, call.reference, call.mask, call.excluding, call.out); }) {
      op.Process(call.in, call.reference, call.mask, call.excluding, call.out);
    } else if constexpr (requires { op.Process(call.in, call.reference, call.mask, call.out); }) {
      op.Process(call.in, call.reference, call.mask, call.out);
    } else if constexpr (requires { op.Process(call.in, call.mask, call.out, call.mask); }) {
      op.Process(call.in, call.mask, call.out, nullptr);
    } else {
      op.Process(call.in, call.mask, call.out);
    }
  }

  std::vector<double> Collected() override {
    std::vector<double> all;
    const auto append = [&](const auto& values) { all.insert(all.end(), values.begin(), values.end()); };
    if constexpr (requires { op.GetEvaluation(); }) append(op.GetEvaluation());
    if constexpr (requires { op.GetLeftEq(); }) {
      append(op.GetLeftEq());
      append(op.GetRightEq());
    }
    if constexpr (requires { op.GetPixelCounts(0); }) {
      std::vector<float> ends;
      op.GetMinValue(ends);
      op.GetMaxValue(ends);
      append(ends);
      for (int c = 0; c < op.channelCount; ++c) append(op.GetPixelCounts(c));
    }
    if constexpr (requires { op.GetClassNumber(); }) {
      std::vector<float> bounds;
      op.GetMinRangeValue(bounds);
      op.GetMaxRangeValue(bounds);
      append(bounds);
      all.push_back(op.GetClassNumber());
    }
    return all;
  }

  Op op;
};

template <class Op, class... Arguments>
std::unique_ptr<Held<Op>> Make(Arguments... arguments) {
  return std::make_unique<Held<Op>>(arguments...);
}

using Made = std::unique_ptr<Object>;

Made Average(std::uint32_t) { return Make<filters::AverageChannels>(kNoData); }
Made Bitmap(std::uint32_t) { return Make<filters::BitmapFiltering>(20.0f, 90.0f); }

Made Slope(std::uint32_t) {
  auto made = Make<filters::FilterSlp>(1.0f, 2.0f, 0.25f);
  made->op.SetBackground(kNoData);
  return made;
}

Made Aspect(std::uint32_t) {
  auto made = Make<filters::FilterAsp>();
  made->op.SetXSIZE(1.0f);
  made->op.SetYSIZE(2.0f);
  made->op.SetBackground(kNoData);
  return made;
}

std::vector<int> Counts(std::size_t bins) {
  std::vector<int> counts(bins);
  for (std::size_t i = 0; i < bins; ++i) counts[i] = static_cast<int>(i % 7 + 1);
  return counts;
}

Made IntenPercent(std::uint32_t) {
  auto made = Make<filters::IntenPercent>();
  made->op.SetMin(0.0);
  made->op.SetMax(64.0);
  made->op.SetScale(1.0);
  made->op.SetNoData(kNoData);
  made->op.SetType(changedetection::eDIFF_BACKWARD);
  made->op.SetBins(Counts(64));
  return made;
}

template <char kDirection>
Made Mirror(std::uint32_t) {
  auto made = Make<filters::MirrorImg>();
  made->op.SetAxis(kDirection == 'V' ? "VERT" : "HORI");
  made->op.IsNewFile(false);
  return made;
}

Made Normalize(std::uint32_t channels) {
  auto made = Make<filters::Normalize>();
  made->op.SetMinData(std::vector<float>(channels, 5.0f));
  made->op.SetMaxData(std::vector<float>(channels, 100.0f));
  made->op.SetNoData(kNoData);
  return made;
}

Made Percentile(std::uint32_t channels) {
  auto made = Make<filters::Percentile>();
  made->op.SetBinNum(64);
  made->op.SetMinData(std::vector<float>(channels, 0.0f));
  made->op.SetMaxData(std::vector<float>(channels, 64.0f));
  made->op.SetNoData(kNoData);
  // The same histogram for each channel.
  std::vector<int> counts;
  for (std::uint32_t c = 0; c < channels; ++c)
    for (const int count : Counts(64)) counts.push_back(count);
  made->op.SetCoefficients(std::move(counts));
  return made;
}

Made Indices(std::uint32_t channels) {
  auto made = Make<filters::VegIndex>();
  made->op.SetRequestedIndex(std::vector<unsigned int>(12, 1u));
  std::vector<unsigned int> roles;
  for (std::uint32_t c = 0; c < channels; ++c) roles.push_back(c < 7 ? (c + 2) % 7 : 99);
  made->op.SetBandIndex(roles);
  return made;
}

Made Gradient(std::uint32_t channels) {
  auto made = Make<filters::SqrGradientEvaluation>();
  made->op.InitEvaluation(channels);
  return made;
}

Made Vollath(std::uint32_t) { return Make<filters::VollathEvaluation>(); }

template <class Op, int kForm>
Made Change(std::uint32_t channels) {
  auto made = Make<Op>(static_cast<decltype(Op::type)>(kForm));
  made->op.SetNoData(kNoData);
  made->op.SetImgNoData(std::vector<float>(channels, 9.0f));
  made->op.SetRefNoData(std::vector<float>(channels, 11.0f));
  return made;
}

template <class Op, bool kSixBands>
Made TasseledCap(std::uint32_t) {
  auto made = Make<Op>(kSixBands ? "Landsat-5 TM" : "QuickBird", kSixBands ? "Landsat-7 ETM+" : "Ikonos",
                       changedetection::eDIFF_BACKWARD);
  made->op.SetNoData(kNoData);
  return made;
}

Made Single(std::uint32_t) { return Make<changedetection::SingleChange>(changedetection::eDIFF_ABSOLUTE); }

template <gridmill::StatisticsMethod kMethod>
Made Statistics(std::uint32_t channels) {
  auto made = Make<gridmill::RasterStatistics>();
  std::vector<unsigned int> listed;
  for (std::uint32_t c = 0; c < channels; ++c) listed.push_back(c);
  made->op.SetChans(listed);
  made->op.SetType(8);
  made->op.SetMethod(kMethod);
  return made;
}

/// Statistics of the pixels that a decision keeps, which reads all bytes of each.
class DecidedStatistics final : public Object {
 public:
  explicit DecidedStatistics(std::uint32_t channels) : held_(Statistics<kPlain>(channels)) {
    static_cast<Held<gridmill::RasterStatistics>&>(*held_).op.SetMask(&decision_);
  }

  void Process(const Call& call) override {
    const tessel::DataType& type = call.in->dataType;
    decision_.pixelBytes = std::size_t{call.in->channels} * (type.isComplex ? 2 : 1) * (type.sizeBits / 8);
    held_->Process(call);
  }

  std::vector<double> Collected() override {
    std::vector<double> all = held_->Collected();
    all.push_back(decision_.sum);
    return all;
  }

 private:
  static constexpr auto kPlain = gridmill::eSTATISTICS_PLAIN;

  struct Decision final : tessel::IMaskDecision {
    std::size_t pixelBytes = 0;
    std::uint32_t sum = 0;

    bool IsPixelValid(const void* pixel) override {
      const auto* const bytes = static_cast<const unsigned char*>(pixel);
      for (std::size_t i = 0; i < pixelBytes; ++i) sum += bytes[i];
      return bytes[0] % 3 != 0;
    }
  };

  Decision decision_;
  Made held_;
};

Made Decided(std::uint32_t channels) { return std::make_unique<DecidedStatistics>(channels); }

template <int kCount>
Made Classes(std::uint32_t) {
  auto made = Make<gridmill::RangeClasses>();
  std::vector<float> least, greatest;
  for (int k = 0; k < kCount; ++k) {
    least.push_back(8.0f + static_cast<float>(k * 29 % 90));
    greatest.push_back(least.back() + 3.0f + static_cast<float>(k % 20));
  }
  made->op.SetNumClasses(kCount);
  made->op.SetMinRange(least);
  made->op.SetMaxRange(greatest);
  made->op.SetNoData(kNoData);
  return made;
}

Made Transfer(std::uint32_t) {
  auto made = Make<gridmill::IIIDataTransfer>();
  std::vector<unsigned int> from = {0, 0, 8, 8}, to = {0, 0, 11, 13};
  made->op.SetInRegion(from);
  made->op.SetOutRegion(to);
  made->op.SetResampleType(eRESAMPLE_NEAREST);
  return made;
}

template <bool kTrim>
Made Blue(std::uint32_t channels) {
  auto made = Make<gridmill::SPOTBlue>();
  std::vector<float> least(3, 2.0f), greatest(3, 115.0f), scale(3, 2.0f);
  std::vector<float> background(std::max(channels, 3u), kNoData);
  made->op.SetMin(least);
  made->op.SetMax(greatest);
  made->op.SetScale(scale);
  made->op.SetBackGround(background);
  made->op.SetTrim(kTrim);
  return made;
}

// ---- the table

std::vector<Operator> Filters() {
  using enum Complex;
  using enum Channels;
  constexpr Takes kPair = Takes::kPair;
  const Operator average{.name = "AverageChannels",
                         .make = Average,
                         .complex = kRealParts,
                         .channels = kTogether,
                         .outFixed = 1,
                         .takesMoreOut = true,
                         .isParallel = true};
  const Operator aspect{.name = "FilterAsp",
                        .make = Aspect,
                        .complex = kRealParts,
                        .channels = kFirst,
                        .outFixed = 1,
                        .takesMoreOut = true,
                        .isParallel = true};
  const Operator slope{
      .name = "FilterSlp", .make = Slope, .complex = kRealParts, .outEach = 1, .isParallel = true};
  const Operator gradient{.name = "SqrGradientEvaluation", .make = Gradient, .outFixed = 1, .collects = true};
  const Operator vollath{.name = "VollathEvaluation", .make = Vollath, .outFixed = 1, .collects = true};
  return {
      average,
      {"BitmapFiltering", Bitmap, kPair, kElements, kPacked, 1, 1, 1, 0, true},
      slope,
      aspect,
      {"IntenPercent", IntenPercent, kPair, kRefused, kFirst, 3, 3, 4, 0, true},
      {"MirrorImg", Mirror<'V'>, kPair, kRefused, kEach, 1, 1, 0, 1},
      {"MirrorImg, HORI", Mirror<'H'>, kPair, kRefused, kEach, 1, 1, 0, 1},
      {"Normalize", Normalize, kPair, kRefused, kEach, 1, 1, 0, 1},
      {"Percentile", Percentile, kPair, kRefused, kEach, 1, 1, 0, 1},
      {"VegIndex", Indices, kPair, kRefused, kFirst, 1, 7, 12, 0, true},
      gradient,
      vollath,
  };
}

std::vector<Operator> Changes() {
  using namespace changedetection;
  using enum Takes;
  using enum Complex;
  using enum Channels;
  return {
      {"SingleChange", Single, kDates, kElements, kFirst, 1, 1, 1, 0, true},
      {"ChanDiffChange", Change<ChanDiffChange, 1>, kDates, kElements, kEach, 1, 1, 0, 1, true},
      {"ChanDiffChange2", Change<ChanDiffChange2, 0>, kTriple, kRealParts, kEach, 1, 1, 0, 1, true},
      {"ChanDiffChange2, signed", Change<ChanDiffChange2, 1>, kTriple, kRealParts, kEach, 1, 1, 0, 1, true},
      {"ChanRatioChange", Change<ChanRatioChange, 0>, kTriple, kRealParts, kEach, 1, 1, 0, 1, true},
      {"ChanRatioChange2", Change<ChanRatioChange2, 1>, kTriple, kRealParts, kEach, 1, 1, 0, 1, true},
      {"CombChange", Change<CombChange, 1>, kDates, kElements, kBeside, 1, 1, 0, 2, true},
      {"IntenRatioChange", Change<IntenRatioChange, 1>, kDates, kElements, kTogether, 1, 1, 4, 0, true},
      {.name = "MagnitudeChange",
       .make = Change<MagnitudeChange, 2>,
       .takes = kDates,
       .complex = kElements,
       .channels = kTogether,
       .outFixed = 3,
       .takesMoreOut = true,
       .isLength = true},
      {"TCGNChange", TasseledCap<TCGNChange, false>, kDates, kElements, kFirst, 4, 4, 3, 0, true},
      {"TCGNChange, six bands", TasseledCap<TCGNChange, true>, kDates, kElements, kFirst, 6, 6, 3, 0, true},
      {"TCSBChange", TasseledCap<TCSBChange, false>, kDates, kElements, kFirst, 4, 4, 3, 0, true},
  };
}

std::vector<Operator> Services() {
  using namespace gridmill;
  using enum Complex;
  using enum Channels;
  const auto statistics = [](const char* name, std::unique_ptr<Object> (*make)(std::uint32_t)) {
    return Operator{
        .name = name, .make = make, .complex = kElements, .outFixed = 1, .isKept = true, .collects = true};
  };
  const auto blue = [](const char* name, std::unique_ptr<Object> (*make)(std::uint32_t)) {
    return Operator{.name = name,
                    .make = make,
                    .complex = kElements,
                    .channels = kTogether,
                    .read = 3,
                    .outFixed = 3,
                    .takesMoreOut = true,
                    .isKept = true};
  };
  Operator blueStatistics = statistics("RasterStatistics, blue", Statistics<eSTATISTICS_SYNTHETIC_BLUE>);
  blueStatistics.channels = kFirst;
  blueStatistics.read = 3;
  Operator decided = statistics("RasterStatistics, decided", Decided);
  decided.channels = kFirst;
  return {
      statistics("RasterStatistics", Statistics<eSTATISTICS_PLAIN>),
      blueStatistics,
      decided,
      {"RangeClasses", Classes<3>, Takes::kPair, kRefused, kFirst, 1, 1, 1, 0, true},
      {"RangeClasses, many", Classes<300>, Takes::kPair, kRefused, kFirst, 1, 1, 1, 0, true},
      {.name = "IIIDataTransfer",
       .make = Transfer,
       .complex = kElements,
       .outEach = 1,
       .takesMoreOut = true,
       .isKept = true},
      blue("SPOTBlue", Blue<false>),
      blue("SPOTBlue, trimmed", Blue<true>),
  };
}

std::vector<Operator> All() {
  std::vector<Operator> all;
  for (const std::vector<Operator>& some : {Filters(), Changes(), Services()})
    all.insert(all.end(), some.begin(), some.end());
  return all;
}

bool IsNamed(const Operator& op, const char* start) {
  return std::strncmp(op.name, start, std::strlen(start)) == 0;
}

// ---- samples

/// A number from 0 to 119.
std::uint32_t Scattered(std::size_t raster, std::size_t pixel, std::size_t sample) {
  std::uint64_t bits =
      (raster + 1) * 0x9E3779B97F4A7C15u + pixel * 0xD1B54A32D192ED03u + sample * 0x8CB92BA7u;
  bits ^= bits >> 29;
  bits *= 0xBF58476D1CE4E5B9u;
  return static_cast<std::uint32_t>((bits >> 32) % 120);
}

std::uint32_t ElementsOf(const Raster& raster) {
  return raster.channels * (raster.dataType.isComplex ? 2 : 1);
}

void Fill(Raster& raster, std::size_t index, const Shape& shape) {
  const std::uint32_t elements = ElementsOf(raster);
  tests::WithPixelType(raster.dataType, [&]<class T>() {
    T* const samples = reinterpret_cast<T*>(raster.data);
    for (std::size_t i = 0, count = raster.dataSize / sizeof(T); i < count; ++i) {
      const std::size_t sample = shape.isEven ? 0 : i % elements + shape.firstSample;
      const std::uint32_t number = Scattered(index, i / elements, sample);
      samples[i] = static_cast<T>(number);
      if constexpr (std::is_floating_point_v<T>) samples[i] += static_cast<T>(number % 4) / 4;
    }
  });
}

Raster* Null(std::optional<Raster>& raster) { return raster ? &*raster : nullptr; }

}  // namespace

std::ostream& operator<<(std::ostream& stream, const Operator& op) { return stream << op.name; }

const std::vector<Operator>& Operators() {
  static const std::vector<Operator> all = All();
  return all;
}

std::vector<Types> TypesOf(const Operator& op) {
  using enum tessel::ElementType;
  const DataType complexFloat(eDT_32F, true), complexShort(eDT_16S, true);
  std::vector<Types> types = {{eDT_8U, eDT_8U, eDT_8U},    {eDT_8U, eDT_8U, eDT_32F},
                              {eDT_16S, eDT_16S, eDT_16U}, {eDT_16U, eDT_16U, eDT_8U},
                              {eDT_32F, eDT_32F, eDT_32F}, {eDT_32F, eDT_32F, eDT_8U}};
  if (op.takes == Takes::kTriple) {
    types.push_back({eDT_8U, eDT_16S, eDT_32F});
    types.push_back({eDT_32F, eDT_8U, eDT_16U});
  } else {
    types.push_back({eDT_64F, eDT_64F, eDT_64F});
    types.push_back({eDT_64S, eDT_64S, eDT_8S});
    types.push_back({eDT_16U, eDT_16U, eDT_64U});
    types.push_back({eDT_32S, eDT_64F, eDT_32U});
  }
  // Gathered, and as wide as it is read: a sample more lies behind the buffer.
  if (op.takes == Takes::kDates) types.push_back({eDT_32F, eDT_32S, eDT_32F});
  if (op.complex != Complex::kRefused) {
    types.push_back({complexFloat, complexFloat, eDT_32F});
    types.push_back({complexShort, complexShort, eDT_8U});
  }
  return types;
}

// ---- scenes

Scene::Scene(const Operator& op, const Shape& shape, const Types& types, const Memory& memory)
    : isMasked_(shape.isMasked) {
  const auto make = [&](std::size_t index, std::optional<Raster>& raster, std::uint32_t channels,
                        const DataType& type, std::uint32_t marginX, std::uint32_t marginY) {
    const std::size_t bytes = std::size_t{shape.width + 2 * marginX} * (shape.height + 2 * marginY) *
                              channels * (type.isComplex ? 2 : 1) * (type.sizeBits / 8);
    if (!memory) own_[index].resize(bytes / 8 + 1);
    unsigned char* const data =
        memory ? memory(index, bytes) : reinterpret_cast<unsigned char*>(own_[index].data());
    raster.emplace(tessel::RasterInfo(shape.width, shape.height, channels, type),
                   tessel::RasterContext(marginX, marginY), data);
    if (index < 2) Fill(*raster, index, shape);
  };
  const std::uint32_t least = IsNamed(op, "Filter") ? 1 : 0, margin = std::max(shape.margin, least);
  const std::uint32_t more = op.takesMoreOut ? shape.moreOut : 0;
  const std::uint32_t elements = types.in.isComplex && IsNamed(op, "IIIDataTransfer") ? 2 : 1;
  make(0, in_, shape.channels, types.in, margin, margin);
  if (op.takes != Takes::kPair) make(1, reference_, shape.channels, types.reference, margin / 2, margin + 1);
  make(2, out_, op.outFixed + op.outEach * shape.channels * elements + more, types.out, margin / 2, margin);
  Clear();
  if (!isMasked_) return;
  mask_.emplace(shape.width, shape.height, tessel::RasterContext(margin, margin), true);
  excluding_.emplace(shape.width, shape.height, tessel::RasterContext(margin, margin), false);
  // A window of `MirrorImg` that does not start at the edge takes its pixels from beyond it.
  const bool keepsEdges = IsNamed(op, "MirrorImg");
  for (std::uint32_t i = 0; i < shape.width * shape.height; ++i) {
    const auto x = static_cast<int>(i % shape.width), y = static_cast<int>(i / shape.width);
    if ((keepsEdges && (x == 0 || y == 0)) || Scattered(3, i, 0) % 5 != 0) continue;
    mask_->SetValid(x, y, false);
    excluding_->SetValid(x, y, true);
  }
}

Call Scene::Get() {
  return {&*in_, Null(reference_), isMasked_ ? &*mask_ : nullptr, isMasked_ ? &*excluding_ : nullptr, &*out_};
}

void Scene::Clear() { tests::FillBytes(*out_); }

std::vector<unsigned char> Scene::Bytes(std::size_t raster) const {
  const std::optional<Raster>* const rasters[] = {&in_, &reference_, &out_};
  return *rasters[raster] ? tests::Bytes(**rasters[raster]) : std::vector<unsigned char>();
}

double Scene::Result(std::size_t pixel, std::uint32_t c) const {
  double result = 0.0;
  tests::WithPixelType(out_->dataType, [&]<class T>() {
    result = static_cast<double>(reinterpret_cast<const T*>(out_->data)[pixel * ElementsOf(*out_) + c]);
  });
  return result;
}

bool Scene::IsUntouched() const { return tests::IsUntouched(*out_); }

bool Scene::IsMarginUntouched() const {
  const std::size_t pixelBytes = std::size_t{ElementsOf(*out_)} * (out_->dataType.sizeBits / 8);
  const auto isSentinel = [](unsigned char byte) { return byte == tests::kSentinel; };
  for (std::uint32_t y = 0; y < out_->bufferHeight; ++y) {
    const unsigned char* const row = out_->data + y * out_->bufferWidth * pixelBytes;
    const unsigned char* const left = row + out_->marginX * pixelBytes;
    const unsigned char* const end = row + out_->bufferWidth * pixelBytes;
    const unsigned char* const right = left + out_->width * pixelBytes;
    const bool isInside = y >= out_->marginY && y < out_->marginY + out_->height;
    if (!std::all_of(row, isInside ? left : end, isSentinel)) return false;
    if (isInside && !std::all_of(right, end, isSentinel)) return false;
  }
  return true;
}

// ---- output

Silence::Silence() {
  std::fflush(stdout);
  kept_ = dup(1);
  const int nowhere = open("/dev/null", O_WRONLY);
  dup2(nowhere, 1);
  close(nowhere);
}

Silence::~Silence() {
  std::fflush(stdout);
  dup2(kept_, 1);
  close(kept_);
}

}  // namespace orvik::attack
