#include <algorithm>
#include <bit>
#include <cinttypes>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <exception>
#include <iterator>
#include <map>
#include <memory>
#include <string>
#include <tuple>
#include <type_traits>
#include <vector>

#include "basic/tessel/datatype.h"
#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "processes/gridmill/gridmill.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

// All operators over a fixed set of inputs, with a hash of what they wrote for each: the same everywhere.
//
// The inputs are made of integers, and of quotients by powers of two, which are exact. Samples are hashed by
// their values, so that the order of bytes plays no part, and every NaN as one and the same: its sign and its
// payload are not promised. x86-64 makes negative ones, aarch64 positive ones.
namespace orvik {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::PixelType;
using tests::Random;

constexpr std::uint32_t kWidth = 67;
constexpr std::uint32_t kHeight = 23;
constexpr std::uint32_t kChannels[] = {1, 3, 4, 7};
constexpr float kNoData = 7.0f;

/// Of the inputs and the masks.
tessel::RasterContext Margins() { return {3, 2}; }

// ---- hashes

/// FNV-1a of 64 bits over words, folded, so that a difference in a top bit reaches the others.
class Hash {
 public:
  void Add(std::uint64_t word) {
    state_ = (state_ ^ word) * 0x100000001b3;
    state_ ^= state_ >> 29;
  }
  std::uint64_t Value() const { return state_; }

 private:
  std::uint64_t state_ = 0xcbf29ce484222325;
};

/// The bits of an element, those of one NaN for each NaN.
template <class T>
std::uint64_t CanonicalBits(T element) {
  if constexpr (std::is_same_v<T, float>) {
    const auto bits = std::bit_cast<std::uint32_t>(element);
    return (bits & 0x7fffffff) > 0x7f800000 ? 0x7fc00000 : bits;
  } else if constexpr (std::is_same_v<T, double>) {
    const auto bits = std::bit_cast<std::uint64_t>(element);
    return (bits & 0x7fffffffffffffff) > 0x7ff0000000000000 ? 0x7ff8000000000000 : bits;
  } else {
    return static_cast<std::uint64_t>(static_cast<std::int64_t>(element));
  }
}

template <class T>
void AddAll(Hash& hash, const std::vector<T>& elements) {
  for (const T element : elements) hash.Add(CanonicalBits(element));
}

/// The whole buffer, margins included.
void AddAll(Hash& hash, const Raster& raster) {
  tests::WithPixelType(raster.dataType, [&]<class T>() {
    for (std::uint64_t i = 0; i < raster.dataSize; i += sizeof(T)) {
      // `char` has no sign on some platforms; elsewhere it is the signed pixel type.
      std::conditional_t<std::is_same_v<T, char>, signed char, T> element;
      std::memcpy(&element, raster.data + i, sizeof(T));
      hash.Add(CanonicalBits(element));
    }
  });
}

// ---- inputs

/// What the samples of a part of the rows are like.
enum class Kind : unsigned {
  kBytes,      ///< 0 to 255, with many 0 and 7
  kCounts,     ///< 0 to 65535
  kFractions,  ///< from -8192 to 8192, with all digits of the type
  kWild,       ///< any bits, the limits of the type, NaN, infinities, denormals
};

/// Zeros, NaNs, infinities, the extremes of the type, halves and the neighbourhood of powers of two.
constexpr std::uint32_t kSpecialFloats[] = {
    0x00000000, 0x80000000, 0x7fc00000, 0xffc00001, 0x7f800000, 0xff800000, 0x7f7fffff, 0xff7fffff,
    0x00000001, 0x80000001, 0x007fffff, 0x00800000, 0x33800000, 0x3effffff, 0x3f000000, 0xbf000000,
    0x3fc00000, 0xbfc00000, 0x437f8000, 0x477fff80, 0xc3008000, 0x4affffff, 0x4b000001, 0x4effffff,
    0x4f000000, 0xcf000000, 0xcf000001, 0x4f7fffff, 0x4f800000, 0x5effffff, 0x5f000000, 0xdf000000,
    0x5f7fffff, 0x5f800000, 0x501502f9, 0x60ad78ec};

constexpr std::uint64_t kSpecialDoubles[] = {
    0x0000000000000000, 0x8000000000000000, 0x7ff8000000000000, 0xfff8000000000001, 0x7ff0000000000000,
    0xfff0000000000000, 0x7fefffffffffffff, 0xffefffffffffffff, 0x0000000000000001, 0x8010000000000000,
    0x36a0000000000000, 0x47efffffe0000000, 0x47efffffefffffff, 0x47effffff0000000, 0x3fdfffffffffffff,
    0x3fe0000000000000, 0xbfe0000000000000, 0x406ff00000000000, 0x40efffe000000000, 0x41dfffffffc00000,
    0x41dfffffffe00000, 0x41e0000000000000, 0xc1e0000000000000, 0xc1e0000000100000, 0x41efffffffe00000,
    0x41f0000000000000, 0x43dfffffffffffff, 0x43e0000000000000, 0xc3e0000000000000, 0xc3e0000000000001,
    0x43efffffffffffff, 0x43f0000000000000, 0x4340000000000001, 0x3ff0000030000000, 0x3ff0000010000000};

/// The bits of number / 2^shift, rounded down in an integer.
std::uint64_t QuotientBits(const DataType& type, std::int64_t number, int shift) {
  const auto divisor = std::int64_t{1} << shift;
  if (!type.isFloat) return static_cast<std::uint64_t>(number >> shift);
  if (type.sizeBits == 64)
    return std::bit_cast<std::uint64_t>(static_cast<double>(number) / static_cast<double>(divisor));
  return std::bit_cast<std::uint32_t>(static_cast<float>(number) / static_cast<float>(divisor));
}

std::uint64_t SpecialBits(const DataType& type, Random& random) {
  if (type.isFloat) return type.sizeBits == 64 ? random.Pick(kSpecialDoubles) : random.Pick(kSpecialFloats);
  const std::uint64_t top = std::uint64_t{1} << (type.sizeBits - 1);
  const std::uint64_t specials[] = {0, 1, top - 1, top, top + 1, ~std::uint64_t{0}};
  return random.Pick(specials);
}

/// The bits of a sample; the type takes as many of the low ones as it has.
std::uint64_t SampleBits(const DataType& type, Kind kind, Random& random) {
  const bool isSpecial = random.OneIn(8);
  const std::uint64_t bits = random.Bits();
  const bool isDouble = type.isFloat && type.sizeBits == 64;
  switch (kind) {
    case Kind::kBytes:
      return QuotientBits(type, static_cast<std::int64_t>(isSpecial ? bits % 2 * 7 : bits % 256), 0);
    case Kind::kCounts:
      return QuotientBits(type, static_cast<std::int64_t>(bits % 65536), 0);
    case Kind::kFractions:
      if (isDouble)
        return QuotientBits(type, static_cast<std::int64_t>(bits >> 11) - (std::int64_t{1} << 52), 39);
      return QuotientBits(type, static_cast<std::int64_t>(bits >> 40) - (std::int64_t{1} << 23), 10);
    case Kind::kWild:
      return isSpecial || bits % 4 == 0 ? SpecialBits(type, random) : bits;
  }
  return 0;
}

template <class Word>
void FillWords(Raster& raster, std::uint32_t kinds, Random& random) {
  const std::size_t rowWords = std::size_t{raster.bufferWidth} * raster.channels;
  unsigned char* target = raster.data;
  for (std::uint32_t row = 0; row < raster.bufferHeight; ++row) {
    const auto kind = static_cast<Kind>(row * kinds / raster.bufferHeight);
    for (std::size_t i = 0; i < rowWords; ++i, target += sizeof(Word)) {
      const auto word = static_cast<Word>(SampleBits(raster.dataType, kind, random));
      std::memcpy(target, &word, sizeof word);
    }
  }
}

/// Inputs, made once for all operators.
class Inputs {
 public:
  /// @param wild    whether there are rows of wild samples
  /// @param second  whether the raster is the reference of another one
  Raster* Get(const DataType& type, std::uint32_t channels, bool wild, bool second) {
    const int element = type.isFloat ? 2 : type.isSigned ? 1 : 0;
    std::unique_ptr<Raster>& raster = rasters_[{type.sizeBits, element, channels, wild, second}];
    if (!raster) raster = Make(type, channels, wild, second);
    return raster.get();
  }

 private:
  static std::unique_ptr<Raster> Make(const DataType& type, std::uint32_t channels, bool wild, bool second) {
    auto raster = std::make_unique<Raster>(tessel::RasterInfo(kWidth, kHeight, channels, type), Margins());
    Random random(channels * 4u + (wild ? 2u : 0u) + (second ? 1u : 0u));
    const std::uint32_t kinds = wild ? 4 : 3;
    if (type.sizeBits == 8) FillWords<std::uint8_t>(*raster, kinds, random);
    if (type.sizeBits == 16) FillWords<std::uint16_t>(*raster, kinds, random);
    if (type.sizeBits == 32) FillWords<std::uint32_t>(*raster, kinds, random);
    if (type.sizeBits == 64) FillWords<std::uint64_t>(*raster, kinds, random);
    return raster;
  }

  std::map<std::tuple<std::uint32_t, int, std::uint32_t, bool, bool>, std::unique_ptr<Raster>> rasters_;
};

/// A mask in which one pixel of `count` is excluded.
Mask RandomMask(std::uint32_t count) {
  Mask mask(kWidth, kHeight, Margins());
  Random random(count);
  for (unsigned char& byte : mask.bits) {
    for (unsigned bit = 1; bit < 256; bit *= 2)
      byte = static_cast<unsigned char>(random.OneIn(count) ? byte & ~bit : byte);
  }
  return mask;
}

// ---- operators

/// The rasters and the masks of a call. Without masks those are null.
struct Call {
  Raster* in;
  Raster* reference;
  Mask* mask;
  Mask* referenceMask;
  Raster* out;
  bool second;  ///< the second set of parameters

  std::size_t Channels() const { return in->channels; }
};

template <class Op>
void RunDates(Op op, const Call& call) {
  op.SetNoData(call.second ? -1.5f : kNoData);
  if (call.second) {
    op.SetImgNoData(std::vector<float>(call.in->channels, kNoData));
    op.SetRefNoData(std::vector<float>(call.reference->channels, 0.0f));
  }
  if constexpr (requires { op.Process(call.in, call.reference, call.mask, call.referenceMask, call.out); }) {
    op.Process(call.in, call.reference, call.mask, call.referenceMask, call.out);
  } else {
    op.Process(call.in, call.reference, call.mask, call.out);
  }
}

// -- filters

void RunAverage(const Call& call, Hash&) {
  filters::AverageChannels(call.second ? -1.0f : kNoData).Process(call.in, call.mask, call.out, nullptr);
}

void RunBitmap(const Call& call, Hash&) {
  const float least = call.second ? 100.25f : 20.0f, greatest = call.second ? -50.5f : 2000.5f;
  filters::BitmapFiltering(least, greatest).Process(call.in, call.mask, call.out);
}

void RunSlope(const Call& call, Hash&) {
  filters::FilterSlp slope(call.second ? 30.0f : 100.0f, call.second ? 29.7f : 100.0f,
                           call.second ? 0.3048f : 1.0f);
  slope.SetBackground(-1.0f);
  slope.Process(call.in, call.mask, call.out);
}

void RunAspect(const Call& call, Hash&) {
  filters::FilterAsp aspect;
  aspect.SetXSIZE(call.second ? 30.0f : 1.0f);
  aspect.SetYSIZE(call.second ? 29.7f : 1.0f);
  if (call.second) aspect.SetELSZ(0.3048f);
  aspect.SetBackground(-1.0f);
  aspect.Process(call.in, call.mask, call.out);
}

/// Counts of bins, some of them empty.
std::vector<int> Counts(std::size_t bins) {
  Random random(bins);
  std::vector<int> counts(bins);
  for (int& count : counts) count = random.OneIn(4) ? 0 : static_cast<int>(random.Below(1000));
  return counts;
}

void RunIntenPercent(const Call& call, Hash&) {
  filters::IntenPercent percent;
  percent.SetMin(call.second ? -100.5 : 0.0);
  percent.SetMax(call.second ? 5019.5 : 256.0);
  percent.SetScale(call.second ? 0.0125 : 0.25);
  percent.SetNoData(kNoData);
  percent.SetType(call.second ? changedetection::eDIFF_BACKWARD : changedetection::eDIFF_FORWARD);
  percent.SetBins(Counts(64));
  percent.Process(call.in, call.mask, call.out);
}

/// The mask is a rectangle here: with any other one pixels are taken from outside the raster.
void RunMirror(const Call& call, Hash&) {
  filters::MirrorImg mirror;
  mirror.SetAxis(call.Channels() < 4 ? "VERT" : "HORI");
  mirror.IsNewFile(call.second);
  Mask window(kWidth, kHeight, Margins(), false);
  for (std::int32_t y = 4; y < 16; ++y)
    for (std::int32_t x = 5; x < 41; ++x) window.SetValid(x, y, true);
  if (call.mask != nullptr) mirror.SetWindow({5, 4, 36, 12});
  mirror.Process(call.in, call.mask != nullptr ? &window : nullptr, call.out);
}

/// Ends of a range for each channel, no two alike.
std::vector<float> Ends(std::size_t channels, float first, float step) {
  std::vector<float> ends;
  for (std::size_t c = 0; c < channels; ++c) ends.push_back(first + step * static_cast<float>(c));
  return ends;
}

void RunNormalize(const Call& call, Hash&) {
  filters::Normalize normalize;
  normalize.SetMinData(Ends(call.Channels(), call.second ? -500.125f : 3.0f, 0.5f));
  normalize.SetMaxData(Ends(call.Channels(), call.second ? 8191.7f : 251.0f, -7.0f));
  normalize.SetNoData(call.second ? kNoData : -1.0f);
  normalize.Process(call.in, call.mask, call.out);
}

void RunPercentile(const Call& call, Hash&) {
  filters::Percentile percentile;
  percentile.SetBinNum(call.second ? 50 : 64);
  percentile.SetMinData(Ends(call.Channels(), call.second ? -500.125f : 3.0f, 0.5f));
  percentile.SetMaxData(Ends(call.Channels(), call.second ? 8191.7f : 251.0f, -7.0f));
  percentile.SetNoData(call.second ? kNoData : -1.0f);
  percentile.SetCoefficients(Counts(call.Channels() * (call.second ? 50 : 64)));
  percentile.Process(call.in, call.mask, call.out);
}

void RunVegIndex(const Call& call, Hash&) {
  using namespace filters;
  static constexpr unsigned int kRoles[] = {eBAND_RED,      eBAND_NIR,   eBAND_GREEN, eBAND_BLUE,
                                            eBAND_RED_EDGE, eBAND_SWIR1, eBAND_SWIR2};
  VegIndex index;
  std::vector<unsigned int> requests(12, 1u);
  if (call.second) requests = {1, 0, 1, 0, 1, 1, 0, 0, 0, 0, 0, 1};
  index.SetRequestedIndex(requests);
  index.SetBandIndex(std::vector<unsigned int>(kRoles, kRoles + call.Channels()));
  index.Process(call.in, call.mask, call.out);
}

void RunSqrGradient(const Call& call, Hash& hash) {
  filters::SqrGradientEvaluation gradient;
  if (call.second) gradient.SetBackground(-50.5, 3000.0);
  if (call.second) gradient.SetFailure(kNoData);
  gradient.InitEvaluation(call.in->channels);
  gradient.Process(call.in, call.mask, call.out);
  AddAll(hash, gradient.GetEvaluation());
}

void RunVollath(const Call& call, Hash& hash) {
  filters::VollathEvaluation vollath;
  if (call.second) vollath.SetBackground(-50.5, 3000.0);
  if (call.second) vollath.SetFailure(kNoData);
  vollath.Process(call.in, call.mask, call.out);
  AddAll(hash, vollath.GetLeftEq());
  AddAll(hash, vollath.GetRightEq());
}

// -- two dates

using namespace changedetection;

DiffType Form(const Call& call) {
  return call.second ? eDIFF_ABSOLUTE : call.mask != nullptr ? eDIFF_FORWARD : eDIFF_BACKWARD;
}
DiffType2 Form2(const Call& call) { return call.second ? eDIFF2_ABSOLUTE : eDIFF2_SIGNED; }

void RunSingle(const Call& call, Hash&) {
  SingleChange(Form(call)).Process(call.in, call.reference, call.mask, call.out);
}
void RunChanDiff(const Call& call, Hash&) { RunDates(ChanDiffChange(Form(call)), call); }
void RunChanDiff2(const Call& call, Hash&) { RunDates(ChanDiffChange2(Form2(call)), call); }
void RunChanRatio(const Call& call, Hash&) { RunDates(ChanRatioChange(Form2(call)), call); }
void RunChanRatio2(const Call& call, Hash&) { RunDates(ChanRatioChange2(Form(call)), call); }
void RunComb(const Call& call, Hash&) { RunDates(CombChange(Form(call)), call); }
void RunIntenRatio(const Call& call, Hash&) { RunDates(IntenRatioChange(Form(call)), call); }
void RunMagnitude(const Call& call, Hash&) { RunDates(MagnitudeChange(Form(call)), call); }

template <class Op>
void RunTasseledCap(const Call& call, Hash&) {
  const bool hasSix = call.Channels() >= 6;
  const char* const image = hasSix ? "Landsat-5 TM" : call.second ? "Landsat-5 MSS" : "Ikonos";
  RunDates(Op(image, hasSix ? "Landsat-7 ETM+" : "QuickBird", Form(call)), call);
}

// -- raster services

void RunStatistics(const Call& call, Hash& hash) {
  gridmill::RasterStatistics statistics;
  std::vector<unsigned int> channels(call.Channels());
  statistics.SetChans(channels);
  statistics.SetType(call.second && call.mask == nullptr ? 16 : 8);
  const bool isPlain = call.second || call.Channels() < 3;
  statistics.SetMethod(isPlain ? gridmill::eSTATISTICS_PLAIN : gridmill::eSTATISTICS_SYNTHETIC_BLUE);
  statistics.Process(call.in, call.mask, call.out);
  std::vector<float> extremes;
  statistics.GetMinValue(extremes);
  statistics.GetMaxValue(extremes);
  AddAll(hash, extremes);
  for (std::size_t c = 0; c < channels.size(); ++c)
    AddAll(hash, statistics.GetPixelCounts(static_cast<int>(c)));
}

void RunClasses(const Call& call, Hash&) {
  gridmill::RangeClasses classes;
  const int count = call.second ? 40 : 3;
  classes.SetNumClasses(count);
  classes.SetMinRange(Ends(static_cast<std::size_t>(count), -3.5f, call.second ? 100.25f : 10.0f));
  classes.SetMaxRange(Ends(static_cast<std::size_t>(count), 60.0f, call.second ? 90.75f : 5.5f));
  classes.SetNoData(kNoData);
  classes.Process(call.in, call.mask, call.out);
}

void RunTransfer(const Call& call, Hash&) {
  gridmill::IIIDataTransfer transfer;
  std::vector<unsigned int> from = {0, 0, kWidth, kHeight}, to = from;
  if (call.second) from = {5, 3, 40, 17}, to = {0, 1, 67, 20};
  if (call.mask != nullptr) to = {2, 0, 29, 61};
  transfer.SetInRegion(from);
  transfer.SetOutRegion(to);
  transfer.Process(call.in, call.mask, call.out);
}

void RunBlue(const Call& call, Hash&) {
  gridmill::SPOTBlue blue;
  std::vector<float> least = {1.0f, 2.0f, -20.5f}, scale = {1.25f, 0.7f, 1.1f};
  std::vector<float> greatest(3, call.second ? 3000.0f : 250.0f), background(call.Channels() + 3, kNoData);
  blue.SetMin(least);
  blue.SetMax(greatest);
  blue.SetScale(scale);
  blue.SetBackGround(background);
  blue.SetTrim(call.second);
  blue.Process(call.in, call.mask, call.out);
}

// -- the table

/// Which types of rasters vary: of one input, of two dates of one type, of three rasters of the short list.
enum class Takes { kPair, kDates, kTriple };

struct Operator {
  const char* name;
  Takes takes;
  std::uint32_t leastIn;                 ///< channels of the input, at least
  std::uint32_t outFactor, outConstant;  ///< channels of the output: factor x those of the input + constant
  void (*run)(const Call&, Hash&);
};

constexpr Operator kOperators[] = {
    {"AverageChannels", Takes::kPair, 1, 0, 1, RunAverage},
    {"BitmapFiltering", Takes::kPair, 1, 0, 1, RunBitmap},
    {"ChanDiffChange", Takes::kDates, 1, 1, 0, RunChanDiff},
    {"ChanDiffChange2", Takes::kTriple, 1, 1, 0, RunChanDiff2},
    {"ChanRatioChange", Takes::kTriple, 1, 1, 0, RunChanRatio},
    {"ChanRatioChange2", Takes::kTriple, 1, 1, 0, RunChanRatio2},
    {"CombChange", Takes::kDates, 1, 2, 1, RunComb},
    {"FilterAsp", Takes::kPair, 1, 0, 1, RunAspect},
    {"FilterSlp", Takes::kPair, 1, 1, 0, RunSlope},
    {"IIIDataTransfer", Takes::kPair, 1, 1, 0, RunTransfer},
    {"IntenPercent", Takes::kPair, 3, 0, 5, RunIntenPercent},
    {"IntenRatioChange", Takes::kDates, 1, 0, 4, RunIntenRatio},
    {"MagnitudeChange", Takes::kDates, 1, 0, 3, RunMagnitude},
    {"MirrorImg", Takes::kPair, 1, 1, 0, RunMirror},
    {"Normalize", Takes::kPair, 1, 1, 0, RunNormalize},
    {"Percentile", Takes::kPair, 1, 1, 0, RunPercentile},
    {"RangeClasses", Takes::kPair, 1, 0, 1, RunClasses},
    {"RasterStatistics", Takes::kPair, 1, 0, 1, RunStatistics},
    {"SPOTBlue", Takes::kPair, 3, 0, 3, RunBlue},
    {"SingleChange", Takes::kDates, 1, 0, 2, RunSingle},
    {"SqrGradientEvaluation", Takes::kPair, 1, 0, 1, RunSqrGradient},
    {"TCGNChange", Takes::kDates, 4, 0, 3, RunTasseledCap<TCGNChange>},
    {"TCSBChange", Takes::kDates, 4, 0, 3, RunTasseledCap<TCSBChange>},
    {"VegIndex", Takes::kPair, 1, 0, 12, RunVegIndex},
    {"VollathEvaluation", Takes::kPair, 1, 0, 1, RunVollath},
};
static_assert(std::size(kOperators) == 25);

/// The types of the rasters of a call.
struct Types {
  PixelType in, reference, out;
};

std::vector<Types> Combinations(Takes takes) {
  std::vector<Types> all;
  for (const PixelType& in : tests::kPixelTypes) {
    for (const PixelType& out : tests::kPixelTypes) {
      if (takes != Takes::kTriple) all.push_back({in, in, out});
    }
  }
  const PixelType four[] = {tests::kPixelTypes[1], tests::kPixelTypes[2], tests::kPixelTypes[3],
                            tests::kPixelTypes[6]};
  for (const PixelType& in : four) {
    for (const PixelType& reference : four) {
      for (const PixelType& out : four) {
        if (takes == Takes::kTriple) all.push_back({in, reference, out});
      }
    }
  }
  return all;
}

// ---- the runs

/// Runs operators and writes a line for each one, or for each call.
class Runs {
 public:
  Runs(std::FILE* file, bool each) : file_(file), each_(each) {}

  void Run(const Operator& op) {
    Hash hash;
    for (const Types& types : Combinations(op.takes)) {
      for (const std::uint32_t channels : kChannels) {
        if (channels < op.leastIn) continue;
        for (const unsigned way : {0u, 1u, 2u, 3u}) hash.Add(RunOne(op, types, channels, way));
      }
    }
    if (!each_) std::fprintf(file_, "%s %016" PRIx64 "\n", op.name, hash.Value());
  }

 private:
  /// @param way  bit 0: with masks, bit 1: the second set of parameters, on samples of all kinds
  std::uint64_t RunOne(const Operator& op, const Types& types, std::uint32_t channels, unsigned way) {
    const bool second = way >= 2, isMasked = way % 2 == 1;
    Raster out({kWidth, kHeight, op.outFactor * channels + op.outConstant, types.out.element}, {2, 1});
    std::fill_n(out.data, out.dataSize, static_cast<unsigned char>(0xa5));
    Raster* const in = inputs_.Get(types.in.element, channels, second, false);
    Raster* const reference = inputs_.Get(types.reference.element, channels + 1, second, true);
    Hash hash;
    op.run({in, reference, isMasked ? &mask_ : nullptr, isMasked ? &excluding_ : nullptr, &out, second},
           hash);
    AddAll(hash, out);
    if (each_) {
      std::fprintf(file_, "%s %s %s %s channels %u way %u %016" PRIx64 "\n", op.name, types.in.name,
                   types.reference.name, types.out.name, channels, way, hash.Value());
    }
    return hash.Value();
  }

  std::FILE* file_;
  bool each_;
  Inputs inputs_;
  Mask mask_ = RandomMask(5);
  Mask excluding_ = RandomMask(2);
};

int Main(const std::vector<std::string>& arguments) {
  if (arguments.size() < 2) {
    std::fputs("Usage: bits FILE [OPERATOR]\nOf one operator the hashes of its calls.\n", stderr);
    return 2;
  }
  std::FILE* const file = std::fopen(arguments[1].c_str(), "w");
  if (file == nullptr) {
    std::perror(arguments[1].c_str());
    return 1;
  }
  const bool each = arguments.size() > 2;
  Runs runs(file, each);
  for (const Operator& op : kOperators) {
    if (!each || arguments[2] == op.name) runs.Run(op);
  }
  return std::fclose(file) == 0 ? 0 : 1;
}

}  // namespace
}  // namespace orvik

int main(int count, char** arguments) {
  try {
    return orvik::Main(std::vector<std::string>(arguments, arguments + count));
  } catch (const std::exception& error) {
    std::fprintf(stderr, "bits: %s\n", error.what());
    return 1;
  }
}
