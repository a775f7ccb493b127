#include "processes/gridmill/rasterstatistics.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <map>
#include <memory>
#include <sstream>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "tests/reference/conversions.h"
#include "tests/reference/rasterstatistics_reference.h"
#include "tests/support/images.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::gridmill {
namespace {

using tessel::DataType;
using tessel::Mask;
using tessel::Raster;
using tests::Image;
using tests::IsUntouched;
using tests::PixelType;

using Values = std::vector<float>;
using Counts = std::map<int, int>;  // of the bins that are not empty
using Listed = std::vector<unsigned int>;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr StatisticsMethod kPlain = eSTATISTICS_PLAIN;
constexpr StatisticsMethod kBlue = eSTATISTICS_SYNTHETIC_BLUE;

/// An operator for so many channels. The numbers in its list are of no account.
RasterStatistics StatisticsOf(std::uint32_t channels, int type = 16, StatisticsMethod method = kBlue) {
  Listed listed(channels, 9);
  RasterStatistics statistics;
  statistics.SetChans(listed);
  statistics.SetType(type);
  statistics.SetMethod(method);
  return statistics;
}

Values MinimaOf(RasterStatistics& statistics) {
  Values values;
  statistics.GetMinValue(values);
  return values;
}

Values MaximaOf(RasterStatistics& statistics) {
  Values values;
  statistics.GetMaxValue(values);
  return values;
}

Counts CountsOf(RasterStatistics& statistics, int channel) {
  const std::vector<int> histogram = statistics.GetPixelCounts(channel);
  Counts counts;
  for (std::size_t bin = 0; bin < histogram.size(); ++bin) {
    if (histogram[bin] != 0) counts[static_cast<int>(bin)] = histogram[bin];
  }
  return counts;
}

/// Counts the samples of one row, `channels` of them in a pixel.
template <class T>
void Count(const RasterStatistics& statistics, const std::vector<T>& samples, std::uint32_t channels = 1) {
  Image<T> in({static_cast<std::uint32_t>(samples.size()) / channels, 1, channels});
  std::copy(samples.begin(), samples.end(), in.Elements());
  statistics.Process(&in, nullptr, nullptr);
}

/// What samples of one channel give.
struct Summary {
  float min, max;
  Counts counts;

  bool operator==(const Summary&) const = default;
  friend std::ostream& operator<<(std::ostream& stream, const Summary& summary) {
    return stream << summary.min << " to " << summary.max << ", " << ::testing::PrintToString(summary.counts);
  }
};

Summary SummaryOf(RasterStatistics& statistics, int channel) {
  const auto position = static_cast<std::size_t>(channel);
  return {MinimaOf(statistics).at(position), MaximaOf(statistics).at(position),
          CountsOf(statistics, channel)};
}

template <class T>
Summary SummaryOf(const std::vector<T>& samples, int type = 16) {
  RasterStatistics statistics = StatisticsOf(1, type);
  Count(statistics, samples);
  return SummaryOf(statistics, 0);
}

/// What position 2 holds after one pixel.
template <class T>
Summary BlueOf(const std::vector<T>& pixel, int type = 16) {
  RasterStatistics statistics = StatisticsOf(3, type);
  Count(statistics, pixel, static_cast<std::uint32_t>(pixel.size()));
  return SummaryOf(statistics, 2);
}

/// A channel that nothing was counted in.
Summary Empty() { return {100000.0f, -100000.0f, {}}; }

/// A channel in which one value was counted.
Summary Single(int value, int count = 1) {
  return {static_cast<float>(value), static_cast<float>(value), {{value, count}}};
}

/// A decision by the first sample of a pixel that remembers all pixels.
template <class T>
struct Decision : tessel::IMaskDecision {
  std::vector<const void*> pixels;
  bool (*isValid)(T sample);

  explicit Decision(bool (*isValid)(T sample)) : isValid(isValid) {}
  bool IsPixelValid(const void* pixel) override {
    pixels.push_back(pixel);
    return isValid(*static_cast<const T*>(pixel));
  }
};

// ---- golden: the parameters

TEST(RasterStatistics, NothingIsListedAtFirst) {
  const details::StatisticsParams params;
  EXPECT_TRUE(params.minValues.empty());
  EXPECT_TRUE(params.maxValues.empty());
  EXPECT_TRUE(params.channels.empty());
  EXPECT_TRUE(params.histograms.empty());
  EXPECT_EQ(params.maskDecision, nullptr);
  EXPECT_EQ(params.channelCount, -1);
  EXPECT_EQ(params.histogramType, -1);
  EXPECT_EQ(params.method, 1);
  EXPECT_EQ(RasterStatistics().method, kBlue);
}

// Deliberate: the channels are appended to those that are listed already.
TEST(RasterStatistics, ChannelsAreAppendedToThoseThatAreListedAlready) {
  details::StatisticsParams params;
  Listed first = {4, 9}, second = {2};
  params.SetChans(first);
  EXPECT_EQ(params.channels, (Listed{4, 9}));
  EXPECT_EQ(params.channelCount, 2);
  EXPECT_EQ(params.minValues, (Values{100000, 100000}));
  EXPECT_EQ(params.maxValues, (Values{-100000, -100000}));
  EXPECT_EQ(params.histograms, (std::vector<std::vector<int>>{{}, {}}));
  params.minValues[1] = 5;
  params.SetChans(second);
  EXPECT_EQ(params.channels, (Listed{4, 9, 2}));
  EXPECT_EQ(params.channelCount, 1);
  EXPECT_EQ(params.minValues, (Values{100000, 5, 100000}));
  EXPECT_EQ(params.maxValues, (Values{-100000, -100000, -100000}));
  EXPECT_EQ(params.histograms.size(), 3u);
  EXPECT_EQ(first, (Listed{4, 9}));
}

TEST(RasterStatistics, SetChansWithAnEmptyVectorLeavesTheCountAt0AndSetTypeReturnsFalse) {
  details::StatisticsParams params;
  Listed none, two = {4, 9};
  params.SetChans(none);
  EXPECT_EQ(params.channelCount, 0);
  EXPECT_TRUE(params.channels.empty());
  EXPECT_FALSE(params.SetType(8));
  params.SetChans(two);
  params.SetChans(none);
  EXPECT_EQ(params.channelCount, 0);
  EXPECT_EQ(params.channels, (Listed{4, 9}));
  EXPECT_FALSE(params.SetType(16));
  EXPECT_EQ(params.histogramType, 16);
  EXPECT_EQ(params.histograms, (std::vector<std::vector<int>>{{}, {}}));
}

TEST(RasterStatistics, SetTypeAppends256ZerosFor8AndElse65536) {
  for (const int type : {16, 9, 7, 0, -1, -8, 256}) {
    details::StatisticsParams params;
    Listed two = {4, 9};
    params.SetChans(two);
    EXPECT_TRUE(params.SetType(8));
    EXPECT_EQ(params.histograms[0], std::vector<int>(256, 0));
    EXPECT_EQ(params.histograms[1], std::vector<int>(256, 0));
    params.histograms[1][3] = 5;
    EXPECT_TRUE(params.SetType(type));
    EXPECT_EQ(params.histogramType, type);
    EXPECT_EQ(params.histograms[0], std::vector<int>(256 + 65536, 0)) << type;
    EXPECT_EQ(params.histograms[1].size(), 256u + 65536u);
    EXPECT_EQ(params.histograms[1][3], 5);
  }
}

TEST(RasterStatistics, SetTypeBeforeSetChansStoresTheTypeAndReturnsFalse) {
  RasterStatistics statistics;
  EXPECT_FALSE(statistics.SetType(8));
  EXPECT_EQ(statistics.histogramType, 8);
  Listed one = {0};
  statistics.SetChans(one);
  EXPECT_TRUE(statistics.histograms[0].empty());
  Count<unsigned char>(statistics, {7, 7});
  EXPECT_EQ(statistics.GetPixelCounts(0).size(), 256u);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(7, 2));
}

TEST(RasterStatistics, SetTypeCalledTwiceDoublesTheOperatorsOwnHistogramsButNotTheResults) {
  RasterStatistics statistics = StatisticsOf(2, 8);
  EXPECT_TRUE(statistics.SetType(8));
  EXPECT_EQ(statistics.histograms[1].size(), 512u);
  Count<short>(statistics, {255, 1, 256, 1}, 2);
  EXPECT_EQ(statistics.GetPixelCounts(1).size(), 256u);
  EXPECT_EQ(CountsOf(statistics, 0), (Counts{{255, 1}}));
  EXPECT_EQ(statistics.histograms[0], std::vector<int>(512, 0));
}

TEST(RasterStatistics, WithoutSetTypeThereAre65536Bins) {
  RasterStatistics statistics;
  Listed one = {0};
  statistics.SetChans(one);
  Count<unsigned short>(statistics, {65535});
  EXPECT_EQ(statistics.GetPixelCounts(0).size(), 65536u);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(65535));
}

TEST(RasterStatistics, LastSetTypeBeforeTheFirstProcessCounts) {
  RasterStatistics statistics = StatisticsOf(1, 8);
  statistics.SetType(16);
  Count<short>(statistics, {300});
  EXPECT_EQ(statistics.GetPixelCounts(0).size(), 65536u);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(300));
}

// ---- golden: histograms, minimum and maximum

TEST(RasterStatistics, SampleCountsInTheBinOfItsValueInEveryType) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class T>() {
      const Summary expected = {3, 77, {{3, 1}, {5, 2}, {77, 1}}};
      EXPECT_EQ(SummaryOf<T>({5, 77, 3, 5}, 8), expected) << type;
      EXPECT_EQ(SummaryOf<T>({5, 77, 3, 5}, 16), expected) << type;
    });
  }
}

TEST(RasterStatistics, ChannelCAndNotTheListedNumberCountsAtPositionC) {
  RasterStatistics statistics;
  Listed listed = {1, 0};
  statistics.SetChans(listed);
  Count<short>(statistics, {10, 20, 11, 21}, 2);
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{10, 11, {{10, 1}, {11, 1}}}));
  EXPECT_EQ(SummaryOf(statistics, 1), (Summary{20, 21, {{20, 1}, {21, 1}}}));
}

TEST(RasterStatistics, FractionIsCutOffTowardsZero) {
  const Summary expected = {-0.75f, 255.9375f, {{0, 2}, {1, 1}, {255, 1}}};
  EXPECT_EQ(SummaryOf<float>({255.9375f, -0.75f, 0.99f, 1.99f}, 8), expected);
  EXPECT_EQ(SummaryOf<double>({255.9375, -0.75, 0.99, 1.99}, 8), expected);
  EXPECT_EQ(SummaryOf<double>({1.0 - 1e-16 / 2}).counts, (Counts{{1, 1}}));
  EXPECT_EQ(SummaryOf<double>({1.0 - 1e-12}).counts, (Counts{{0, 1}}));
}

TEST(RasterStatistics, ValueWithoutABinIsNotCounted) {
  EXPECT_EQ(SummaryOf<char>({-1, -128, 5}), (Summary{-128, 5, {{5, 1}}}));
  EXPECT_EQ(SummaryOf<short>({256, 255, -5, 32767}, 8), (Summary{-5, 32767, {{255, 1}}}));
  EXPECT_EQ(SummaryOf<unsigned short>({256, 300, 65535}, 8), (Summary{256, 65535, {}}));
  EXPECT_EQ(SummaryOf<int>({65536, 65535, -1, 65541, -2147483647 - 1}),
            (Summary{-2147483648.0f, 65541, {{65535, 1}}}));
  EXPECT_EQ(SummaryOf<unsigned int>({65536, 5, 4294967295u}).counts, (Counts{{5, 1}}));
}

TEST(RasterStatistics, WideValueWithoutABinIsNotCounted) {
  constexpr std::int64_t kWide = std::int64_t{1} << 32;
  EXPECT_EQ(SummaryOf<std::int64_t>({kWide + 5, kWide, -kWide + 7, -1, 6}).counts, (Counts{{6, 1}}));
  EXPECT_EQ(SummaryOf<std::uint64_t>({(1ull << 32) + 5, 1ull << 63, ~0ull, 6}).counts, (Counts{{6, 1}}));
  EXPECT_EQ(SummaryOf<float>({65535.5f, 65536.0f, -1.0f, 0x1p31f, -0x1p31f, 0x1p32f, 1e30f}).counts,
            (Counts{{65535, 1}}));
  EXPECT_EQ(SummaryOf<double>({65535.5, 65536.0, -1.0, 0x1p31, 0x1p32 + 5, 0x1p64, -1e300}).counts,
            (Counts{{65535, 1}}));
}

TEST(RasterStatistics, NaNCountsNowhereAndInfinityIsAnExtreme) {
  EXPECT_EQ(SummaryOf<double>({kNaN, -kNaN, kNaN}), Empty());
  EXPECT_EQ(SummaryOf<float>({5.0f, std::numeric_limits<float>::quiet_NaN(), 3.0f}),
            (Summary{3, 5, {{3, 1}, {5, 1}}}));
  const float infinity = std::numeric_limits<float>::infinity();
  EXPECT_EQ(SummaryOf<double>({kInfinity, -kInfinity, 1}), (Summary{-infinity, infinity, {{1, 1}}}));
}

TEST(RasterStatistics, MoreChannelsThanTheListedOnesAreNotCounted) {
  for (const StatisticsMethod method : {kPlain, kBlue}) {
    for (const std::uint32_t listed : {1u, 2u, 3u}) {
      RasterStatistics statistics = StatisticsOf(listed, 8, method);
      Count<unsigned char>(statistics, {100, 50, 20, 5, 6}, 5);
      const Summary expected[] = {Single(100), Single(50), Single(method == kBlue ? 92 : 20)};
      EXPECT_EQ(MinimaOf(statistics).size(), listed);
      for (int c = 0; c < static_cast<int>(listed); ++c) EXPECT_EQ(SummaryOf(statistics, c), expected[c]);
    }
  }
  RasterStatistics none;
  Count<unsigned char>(none, {100, 50, 20, 5}, 4);
  EXPECT_TRUE(MinimaOf(none).empty());
}

TEST(RasterStatistics, FewerChannelsThanTheListedOnesLeaveTheOthersAlone) {
  RasterStatistics statistics = StatisticsOf(3, 8, kPlain);
  Count<short>(statistics, {5});
  Count<short>(statistics, {6, 7}, 2);
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{5, 6, {{5, 1}, {6, 1}}}));
  EXPECT_EQ(SummaryOf(statistics, 1), Single(7));
  EXPECT_EQ(SummaryOf(statistics, 2), Empty());
}

// Deliberate: the initial values are final. A channel whose samples all lie above 100000 has that minimum,
// one whose samples all lie below -100000 that maximum, and one without any sample 100000 and -100000.
TEST(RasterStatistics, InitialValuesAreFinal) {
  EXPECT_EQ(SummaryOf<int>({200000, 150000}), (Summary{100000, 200000, {}}));
  EXPECT_EQ(SummaryOf<double>({-200000.5, -150000.25}), (Summary{-200000.5f, -100000, {}}));
  EXPECT_EQ(SummaryOf<std::uint64_t>({~0ull}), (Summary{100000, 0x1p64f, {}}));
  EXPECT_EQ(SummaryOf<float>({100000.0f, -100000.0f}), (Summary{-100000, 100000, {}}));
  EXPECT_EQ(SummaryOf<float>({99999.99f}).min, 99999.99f);
  EXPECT_EQ(SummaryOf<float>({-99999.99f}).max, -99999.99f);
  EXPECT_EQ(SummaryOf<short>({}), Empty());
}

// Deliberate: no value counts as no-data.
TEST(RasterStatistics, NoValueCountsAsNoData) {
  EXPECT_EQ(SummaryOf<short>({0, 0, -9999, -32768, 255, 1}),
            (Summary{-32768, 255, {{0, 2}, {1, 1}, {255, 1}}}));
  EXPECT_EQ(SummaryOf<unsigned short>({0, 65535}), (Summary{0, 65535, {{0, 1}, {65535, 1}}}));
}

TEST(RasterStatistics, MinimumAndMaximumAreOfTheSampleAsFloat) {
  EXPECT_EQ(SummaryOf<int>({16777217}).max, 16777216.0f);
  EXPECT_EQ(SummaryOf<std::int64_t>({-16777217}).min, -16777216.0f);
  EXPECT_EQ(SummaryOf<double>({0.1}), (Summary{0.1f, 0.1f, {{0, 1}}}));
  EXPECT_EQ(SummaryOf<double>({1e300, -1e300}),
            (Summary{-std::numeric_limits<float>::infinity(), std::numeric_limits<float>::infinity(), {}}));
  EXPECT_EQ(SummaryOf<double>({99999.9999999}).min, 100000.0f);
}

TEST(RasterStatistics, FirstZeroThatIsMetIsKeptWhateverItsSign) {
  for (const bool isNegative : {false, true}) {
    const float first = isNegative ? -0.0f : 0.0f;
    for (const std::size_t place : {0u, 3u, 16u, 63u, 70u}) {
      std::vector<float> above(71, 5.0f), below(71, -5.0f);
      above[place] = below[place] = first;
      for (std::size_t i = place + 1; i < above.size(); ++i) above[i] = below[i] = -first;
      EXPECT_EQ(std::signbit(SummaryOf(above).min), isNegative) << place;
      EXPECT_EQ(std::signbit(SummaryOf(below).max), isNegative) << place;
      std::vector<double> tiny(above.begin(), above.end());
      tiny[place] = isNegative ? -1e-60 : 1e-60;  // a zero as `float`
      EXPECT_EQ(std::signbit(SummaryOf(tiny).min), isNegative) << place;
    }
    RasterStatistics statistics = StatisticsOf(1);
    Count<float>(statistics, {first});
    Count<float>(statistics, {-first, first});
    EXPECT_EQ(std::signbit(MinimaOf(statistics)[0]), isNegative);
    EXPECT_EQ(std::signbit(MaximaOf(statistics)[0]), isNegative);
  }
}

TEST(RasterStatistics, ManyPixelsOfOneValueAreAllCounted) {
  Image<unsigned char> bytes({3000, 900}, {}, 200);
  Image<unsigned short> words({3000, 900}, {}, 200);
  Image<float> floats({3000, 90}, {}, 200);
  EXPECT_EQ(bytes.dataSize, 2700000u);
  for (int type : {8, 16}) {
    RasterStatistics ofBytes = StatisticsOf(1, type), ofWords = StatisticsOf(1, type),
                     ofFloats = StatisticsOf(1, type);
    for (int call = 1; call <= 2; ++call) {
      ofBytes.Process(&bytes, nullptr, nullptr);
      ofWords.Process(&words, nullptr, nullptr);
      ofFloats.Process(&floats, nullptr, nullptr);
      EXPECT_EQ(SummaryOf(ofBytes, 0), Single(200, call * 2700000));
      EXPECT_EQ(SummaryOf(ofWords, 0), Single(200, call * 2700000));
      EXPECT_EQ(SummaryOf(ofFloats, 0), Single(200, call * 270000));
    }
  }
}

TEST(RasterStatistics, ManyPixelsOfThreeChannelsAreAllCounted) {
  Image<unsigned char> in({1000, 300, 3}, {2, 1});
  in.Set([](int, int, std::uint32_t c) { return c == 0 ? 100 : c == 1 ? 50 : 20; });
  RasterStatistics statistics = StatisticsOf(3, 8);
  statistics.Process(&in, nullptr, nullptr);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(100, 300000));
  EXPECT_EQ(SummaryOf(statistics, 1), Single(50, 300000));
  EXPECT_EQ(SummaryOf(statistics, 2), Single(92, 300000));
}

// ---- golden: the synthesised band

TEST(RasterStatistics, PositionTwoTakesTheBlueOfTheFirstThreeSamples) {
  RasterStatistics statistics;
  Listed listed = {0, 1, 2};
  statistics.SetChans(listed);
  statistics.SetType(8);
  Count<unsigned char>(statistics, {100, 50, 20}, 3);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(100));
  EXPECT_EQ(SummaryOf(statistics, 1), Single(50));
  EXPECT_EQ(SummaryOf(statistics, 2), Single(92));
  Count<unsigned char>(statistics, {0, 0, 0}, 3);
  EXPECT_EQ(SummaryOf(statistics, 2), (Summary{13, 92, {{13, 1}, {92, 1}}}));
}

TEST(RasterStatistics, BlueIsTheSameInEveryType) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class T>() {
      EXPECT_EQ(BlueOf<T>({T{100}, T{50}, T{20}}), Single(92)) << type;
    });
  }
  EXPECT_EQ(BlueOf<double>({100.77, 50, 20}), Single(92));    // 92.992
  EXPECT_EQ(BlueOf<double>({100.7795, 50, 20}), Single(93));  // 93.0004
  EXPECT_EQ(BlueOf<char>({-10, -100, -100}), Single(29));     // 29.058
}

TEST(RasterStatistics, BlueIsLimitedTo0And255) {
  for (const int type : {8, 16}) {
    EXPECT_EQ(BlueOf<unsigned char>({0, 255, 255}, type), Single(0));
    EXPECT_EQ(BlueOf<short>({-32768, 0, 0}, type), Single(0));
    EXPECT_EQ(BlueOf<unsigned short>({65535, 0, 0}, type), Single(255));
    EXPECT_EQ(BlueOf<short>({277, 0, 0}, type), Single(255));  // 255.835
    EXPECT_EQ(BlueOf<short>({278, 0, 0}, type), Single(255));  // 256.709
    EXPECT_EQ(BlueOf<short>({0, 107, 0}, type), Single(0));    // -0.888
    EXPECT_EQ(BlueOf<short>({0, 93, 0}, type), Single(1));     // 1.048
  }
}

TEST(RasterStatistics, BlueThatIsNaNOrLeaves32BitsCountsAs0) {
  EXPECT_EQ(BlueOf<double>({kNaN, 1, 1}), Single(0));
  EXPECT_EQ(BlueOf<double>({1, 1, kNaN}), Single(0));
  EXPECT_EQ(BlueOf<double>({kInfinity, 1, 1}), Single(0));
  EXPECT_EQ(BlueOf<double>({-kInfinity, 1, 1}), Single(0));
  EXPECT_EQ(BlueOf<double>({1e300, 1, 1}), Single(0));
  EXPECT_EQ(BlueOf<double>({-1e300, 1, 1}), Single(0));
  EXPECT_EQ(BlueOf<float>({2.458e9f, 0, 0}), Single(255));  // just below 2^31
  EXPECT_EQ(BlueOf<float>({2.459e9f, 0, 0}), Single(0));    // just above
  EXPECT_EQ(BlueOf<unsigned int>({2458000000u, 0, 0}), Single(255));
  EXPECT_EQ(BlueOf<unsigned int>({2459000000u, 0, 0}), Single(0));
  EXPECT_EQ(BlueOf<std::uint64_t>({~0ull, 0, 0}), Single(0));
}

TEST(RasterStatistics, SamplesOfThePlainBandsOfAPixelWithoutBlueStillCount) {
  RasterStatistics statistics = StatisticsOf(3);
  Count<double>(statistics, {5, kNaN, 7}, 3);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(5));
  EXPECT_EQ(SummaryOf(statistics, 1), Empty());
  EXPECT_EQ(SummaryOf(statistics, 2), Single(0));
}

TEST(RasterStatistics, EveryOtherMethodIsPlain) {
  for (const int method : {0, 2, -1, 77, 257}) {
    RasterStatistics statistics = StatisticsOf(3, 8, static_cast<StatisticsMethod>(method));
    EXPECT_EQ(statistics.method, method);
    Count<unsigned char>(statistics, {100, 50, 20}, 3);
    EXPECT_EQ(SummaryOf(statistics, 2), Single(20)) << method;
  }
}

TEST(RasterStatistics, FewerThanThreeChannelsHaveNoBlue) {
  RasterStatistics two = StatisticsOf(2), three = StatisticsOf(3);
  for (RasterStatistics* const statistics : {&two, &three}) {
    Count<short>(*statistics, {100, 50}, 2);
    EXPECT_EQ(SummaryOf(*statistics, 0), Single(100));
    EXPECT_EQ(SummaryOf(*statistics, 1), Single(50));
  }
  EXPECT_EQ(SummaryOf(three, 2), Empty());
}

TEST(RasterStatistics, OfFourChannelsOnlyPositionTwoIsSynthesised) {
  RasterStatistics statistics = StatisticsOf(4);
  Count<short>(statistics, {100, 50, 20, 30, 100, 50, 20, 31}, 4);
  EXPECT_EQ(SummaryOf(statistics, 2), Single(92, 2));
  EXPECT_EQ(SummaryOf(statistics, 3), (Summary{30, 31, {{30, 1}, {31, 1}}}));
}

// ---- golden: masks and decisions

TEST(RasterStatistics, MaskIsIgnored) {
  Image<short> in({300, 2}, {1, 1}, 5);
  Mask mask(300, 2, {1, 1}, false), nothing(0, 0);
  RasterStatistics statistics = StatisticsOf(1);
  statistics.Process(&in, &mask, nullptr);
  statistics.Process(&in, &nothing, nullptr);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(5, 1200));
}

TEST(RasterStatistics, PixelsThatTheDecisionRefusesAreLeftOut) {
  Decision<short> decision([](short sample) { return sample % 2 == 0; });
  RasterStatistics statistics = StatisticsOf(3);
  statistics.SetMask(&decision);
  EXPECT_EQ(statistics.maskDecision, &decision);
  Count<short>(statistics, {100, 50, 20, 101, 5, 6, 8, 0, 0, 255, 7, 8}, 3);
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{8, 100, {{8, 1}, {100, 1}}}));
  EXPECT_EQ(SummaryOf(statistics, 1), (Summary{0, 50, {{0, 1}, {50, 1}}}));
  EXPECT_EQ(SummaryOf(statistics, 2), (Summary{20, 92, {{20, 1}, {92, 1}}}));
}

TEST(RasterStatistics, DecisionThatRefusesEveryPixelLeavesTheInitialValues) {
  Decision<float> decision([](float) { return false; });
  RasterStatistics statistics = StatisticsOf(3);
  statistics.SetMask(&decision);
  Count<float>(statistics, std::vector<float>(3 * 257, 40.0f), 3);
  for (int c = 0; c < 3; ++c) EXPECT_EQ(SummaryOf(statistics, c), Empty());
  EXPECT_EQ(decision.pixels.size(), 257u);
}

/// The addresses of all pixels of the image area, row by row.
template <class T>
std::vector<const void*> AddressesOf(Image<T>& image) {
  std::vector<const void*> addresses;
  for (int y = 0; y < static_cast<int>(image.height); ++y) {
    for (int x = 0; x < static_cast<int>(image.width); ++x) addresses.push_back(&image.At(x, y));
  }
  return addresses;
}

// A pixel is left out if the `IMaskDecision` says so, which is called for each pixel in their order.
TEST(RasterStatistics, DecisionIsCalledForEachPixelInTheirOrderWithItsFirstSample) {
  for (const PixelType& type : tests::kPixelTypes) {
    tests::WithPixelType(type.element, [&]<class T>() {
      Decision<T> decision([](T sample) { return sample != 0; });
      for (const bool isComplex : {false, true}) {
        for (const std::uint32_t channels : {1u, 2u, 3u, 4u}) {
          Image<T> in({67, 3, channels}, {2, 1}, T{}, isComplex);
          in.Set([](int x, int y, std::uint32_t) { return (x + y) % 3; });
          decision.pixels.clear();
          RasterStatistics statistics = StatisticsOf(channels);
          statistics.SetMask(&decision);
          statistics.Process(&in, nullptr, nullptr);
          EXPECT_EQ(decision.pixels, AddressesOf(in)) << type << ", " << channels;
          statistics.Process(&in, nullptr, nullptr);
          EXPECT_EQ(decision.pixels.size(), 2u * 67 * 3);
        }
      }
    });
  }
}

TEST(RasterStatistics, DecisionIsNotCalledWithoutPixels) {
  Decision<short> decision([](short) { return true; });
  RasterStatistics statistics = StatisticsOf(1);
  statistics.SetMask(&decision);
  for (const tests::Size size : {tests::Size{4, 0}, tests::Size{0, 4}}) {
    Image<short> in(size, {1, 1}, 5);
    statistics.Process(&in, nullptr, nullptr);
  }
  EXPECT_TRUE(decision.pixels.empty());
  EXPECT_EQ(SummaryOf(statistics, 0), Empty());
}

// ---- golden: the rasters

TEST(RasterStatistics, OutputMayBeNullAndIsNotTouched) {
  RasterStatistics statistics = StatisticsOf(1);
  Image<short> in({3, 2}, {}, 5);
  statistics.Process(&in, nullptr, nullptr);
  for (const DataType type :
       {DataType(tessel::eDT_16S), DataType(tessel::eDT_32F, true), DataType(tessel::eDT_BIT), DataType()}) {
    unsigned char bytes[64] = {};
    Raster out({3, 2, 1, type}, {}, bytes);
    statistics.Process(&in, nullptr, &out);
    EXPECT_TRUE(std::all_of(std::begin(bytes), std::end(bytes), [](unsigned char b) { return b == 0; }));
  }
  EXPECT_EQ(SummaryOf(statistics, 0), Single(5, 30));
}

TEST(RasterStatistics, MarginIsNotCounted) {
  Image<short> in({5, 3, 3}, {3, 2}, 999);
  for (int y = 0; y < 3; ++y) {
    for (int x = 0; x < 5; ++x) in.SetPixel(x, y, {100, 50, 20});
  }
  RasterStatistics statistics = StatisticsOf(3);
  statistics.Process(&in, nullptr, nullptr);
  EXPECT_EQ(SummaryOf(statistics, 0), Single(100, 15));
  EXPECT_EQ(SummaryOf(statistics, 1), Single(50, 15));
  EXPECT_EQ(SummaryOf(statistics, 2), Single(92, 15));
}

TEST(RasterStatistics, SizeOf0CountsNothing) {
  for (const tests::Size size : {tests::Size{4, 0}, tests::Size{0, 4}, tests::Size{4, 4, 0}}) {
    Image<short> in(size, {1, 1}, 5);
    RasterStatistics statistics = StatisticsOf(1);
    statistics.Process(&in, nullptr, nullptr);
    EXPECT_EQ(SummaryOf(statistics, 0), Empty());
  }
}

TEST(RasterStatistics, FirstElementsOfEachPixelOfAComplexRasterAreRead) {
  Image<float> in({2, 2, 2}, {1, 1}, 999, true);
  for (int y = 0; y < 2; ++y) {
    for (int x = 0; x < 2; ++x) {
      const float first = static_cast<float>(10 * y + x);
      in.SetPixel(x, y, {first, first + 100, 200, 201});
    }
  }
  RasterStatistics statistics = StatisticsOf(2, 8);
  statistics.Process(&in, nullptr, nullptr);
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{0, 11, {{0, 1}, {1, 1}, {10, 1}, {11, 1}}}));
  EXPECT_EQ(SummaryOf(statistics, 1), (Summary{100, 111, {{100, 1}, {101, 1}, {110, 1}, {111, 1}}}));
  Image<float> three({1, 1, 3}, {}, 999, true);
  three.SetPixel(0, 0, {100, 50, 20});
  RasterStatistics blue = StatisticsOf(3);
  blue.Process(&three, nullptr, nullptr);
  EXPECT_EQ(SummaryOf(blue, 2), Single(92));
}

// ---- golden: the object

TEST(RasterStatistics, TwoTilesGiveWhatTheJoinedImageGives) {
  RasterStatistics tiles = StatisticsOf(3), joined = StatisticsOf(3);
  Count<short>(tiles, {100, 50, 20, 7, 8, 9}, 3);
  Count<short>(tiles, {1, 2, 3, 200, 0, 0, 100, 50, 20}, 3);
  Count<short>(joined, {100, 50, 20, 7, 8, 9, 1, 2, 3, 200, 0, 0, 100, 50, 20}, 3);
  for (int c = 0; c < 3; ++c) EXPECT_EQ(SummaryOf(tiles, c), SummaryOf(joined, c));
  EXPECT_EQ(CountsOf(joined, 2).at(92), 2);
}

// Deliberate: built once and never again. A later raster of another type is read as the first one's type,
// and the results are never reset: to start over, use a new object.
TEST(RasterStatistics, LaterRasterOfAnotherTypeIsReadAsTheFirstOnesType) {
  RasterStatistics statistics = StatisticsOf(2, 16, kPlain);
  Count<unsigned char>(statistics, {5, 6}, 2);
  Image<unsigned short> wide({2, 1, 2}, {1, 1}, 0xEEEE);
  wide.SetPixel(0, 0, {0x1211, 0x1413, 0x2221, 0x2423});
  statistics.Process(&wide, nullptr, nullptr);  // the first two bytes of each pixel
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{5, 0x21, {{5, 1}, {0x11, 1}, {0x21, 1}}}));
  EXPECT_EQ(SummaryOf(statistics, 1), (Summary{6, 0x22, {{6, 1}, {0x12, 1}, {0x22, 1}}}));
  Count<unsigned char>(statistics, {7, 8}, 2);
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{5, 0x21, {{5, 1}, {7, 1}, {0x11, 1}, {0x21, 1}}}));
}

TEST(RasterStatistics, ElementsWiderThanThoseOfALaterRasterOverlap) {
  RasterStatistics statistics = StatisticsOf(1);
  Count<unsigned short>(statistics, {5});
  Image<unsigned char> narrow({3, 1}, {1, 0});
  narrow.SetPixel(-1, 0, {9, 1, 2, 3, 4});
  statistics.Process(&narrow, nullptr, nullptr);
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{5, 0x403, {{5, 1}, {0x201, 1}, {0x302, 1}, {0x403, 1}}}));
}

TEST(RasterStatistics, LaterRasterIsAddressedByItsOwnFields) {
  RasterStatistics statistics = StatisticsOf(1);
  Count<unsigned char>(statistics, {5});
  Image<unsigned char> complex({2, 1}, {}, 0, true);
  complex.SetPixel(0, 0, {10, 11, 12, 13});
  statistics.Process(&complex, nullptr, nullptr);
  EXPECT_EQ(CountsOf(statistics, 0), (Counts{{5, 1}, {10, 1}, {12, 1}}));
  unsigned char bytes[] = {20, 21, 22, 23};
  Raster bits({20, 1, 1, tessel::eDT_BIT}, {6, 0}, bytes);  // the pixels 6 to 25, eight in a byte
  statistics.Process(&bits, nullptr, nullptr);
  EXPECT_EQ(CountsOf(statistics, 0), (Counts{{5, 1}, {10, 1}, {12, 1}, {20, 2}, {21, 8}, {22, 8}, {23, 2}}));
}

TEST(RasterStatistics, DecisionGetsThePixelsOfALaterRasterByItsOwnAddressing) {
  Decision<unsigned char> decision([](unsigned char) { return true; });
  RasterStatistics statistics = StatisticsOf(1);
  statistics.SetMask(&decision);
  Count<unsigned char>(statistics, {5});
  Image<double> wide({9, 2, 2}, {1, 1});
  decision.pixels.clear();
  statistics.Process(&wide, nullptr, nullptr);
  EXPECT_EQ(decision.pixels, AddressesOf(wide));
}

TEST(RasterStatistics, ResultsAreNeverResetAndLaterSettersChangeNothingInThem) {
  RasterStatistics statistics = StatisticsOf(3, 8);
  Count<short>(statistics, {100, 50, 20}, 3);
  Decision<short> decision([](short) { return false; });
  Listed listed = {0, 1};
  statistics.SetMask(&decision);
  statistics.SetMethod(kPlain);
  statistics.SetChans(listed);
  statistics.SetType(16);
  statistics.minValues.assign(5, 1.0f);
  Count<short>(statistics, {100, 50, 20}, 3);
  Count<short>(statistics, {300, 50, 20}, 3);
  statistics.channelCount = 3;
  EXPECT_EQ(SummaryOf(statistics, 0), (Summary{100, 300, {{100, 2}}}));
  EXPECT_EQ(SummaryOf(statistics, 1), Single(50, 3));
  EXPECT_EQ(SummaryOf(statistics, 2), (Summary{92, 255, {{92, 2}, {255, 1}}}));
  EXPECT_EQ(statistics.GetPixelCounts(0).size(), 256u);
  EXPECT_TRUE(decision.pixels.empty());
}

TEST(RasterStatistics, LaterTypeChangesDoNotTakeTheSettersEither) {
  RasterStatistics statistics = StatisticsOf(3, 8);
  Count<float>(statistics, {100, 50, 20}, 3);
  statistics.SetMethod(kPlain);
  Image<float> complex({1, 1, 3}, {}, 999, true);
  complex.SetPixel(0, 0, {100, 50, 20});
  statistics.Process(&complex, nullptr, nullptr);
  EXPECT_EQ(SummaryOf(statistics, 2), Single(92, 2));
}

TEST(RasterStatistics, GettersHaveNothingBeforeTheFirstProcess) {
  RasterStatistics statistics = StatisticsOf(3);
  EXPECT_TRUE(MinimaOf(statistics).empty());
  EXPECT_TRUE(MaximaOf(statistics).empty());
  EXPECT_TRUE(statistics.GetPixelCounts(0).empty());
}

TEST(RasterStatistics, GettersAppend) {
  RasterStatistics statistics = StatisticsOf(2);
  Count<short>(statistics, {5, 6, 7, 8}, 2);
  Values values = {77};
  statistics.GetMinValue(values);
  EXPECT_EQ(values, (Values{77, 5, 6}));
  statistics.GetMaxValue(values);
  EXPECT_EQ(values, (Values{77, 5, 6, 7, 8}));
}

TEST(RasterStatistics, GettersGiveAsManyAsTheLastSetChansListed) {
  Listed three = {0, 1, 2}, two = {3, 4}, none;
  RasterStatistics statistics;
  statistics.SetChans(three);
  statistics.SetChans(two);
  statistics.SetMethod(kPlain);
  Count<short>(statistics, {5, 6, 7, 8, 9}, 5);
  EXPECT_EQ(MinimaOf(statistics), (Values{5, 6}));
  EXPECT_EQ(MaximaOf(statistics), (Values{5, 6}));
  EXPECT_EQ(CountsOf(statistics, 4), (Counts{{9, 1}}));
  statistics.SetChans(none);
  EXPECT_TRUE(MinimaOf(statistics).empty());
  EXPECT_TRUE(MaximaOf(statistics).empty());
  Listed seven(7, 0);
  statistics.SetChans(seven);  // more than the results have
  EXPECT_EQ(MinimaOf(statistics), (Values{5, 6, 7, 8, 9}));
  EXPECT_EQ(MaximaOf(statistics), (Values{5, 6, 7, 8, 9}));
}

TEST(RasterStatistics, ListThatAnEmptyOneFollowedStillCounts) {
  Listed three = {0, 1, 2}, none;
  RasterStatistics statistics;
  statistics.SetChans(three);
  statistics.SetChans(none);
  EXPECT_FALSE(statistics.SetType(8));
  Count<short>(statistics, {100, 50, 20}, 3);
  EXPECT_TRUE(MinimaOf(statistics).empty());
  EXPECT_EQ(statistics.GetPixelCounts(2).size(), 256u);
  EXPECT_EQ(CountsOf(statistics, 2), (Counts{{92, 1}}));
}

TEST(RasterStatistics, HistogramIsACopy) {
  RasterStatistics statistics = StatisticsOf(1);
  Count<short>(statistics, {5});
  statistics.GetPixelCounts(0)[5] = 99;
  EXPECT_EQ(CountsOf(statistics, 0), (Counts{{5, 1}}));
}

// ---- differential

/// Decisions by the number of the call, so that an operator and its twin agree only in one order.
struct DrawnDecision : tessel::IMaskDecision {
  std::uint64_t seed, run;  ///< so many pixels in a row are decided alike
  std::uint64_t keepsOf8;   ///< 0: none, 8: all
  std::vector<const void*> pixels;

  explicit DrawnDecision(std::uint64_t seed) : seed(seed) {
    tests::Random random(seed);
    constexpr std::uint64_t kRuns[] = {1, 1, 3, 40, 700};
    constexpr std::uint64_t kKept[] = {0, 1, 4, 4, 7, 8};
    run = random.Pick(kRuns);
    keepsOf8 = random.Pick(kKept);
  }
  bool IsPixelValid(const void* pixel) override {
    const std::uint64_t key = pixels.size() / run + seed;
    pixels.push_back(pixel);
    return (key * 0x9E3779B97F4A7C15u) >> 61 < keepsOf8;
  }
};

/// A raster whose buffer has room behind the last pixel for elements wider than its own.
struct RoomyRaster {
  std::vector<unsigned char> bytes;
  std::unique_ptr<Raster> raster;

  RoomyRaster(const tessel::RasterInfo& info, const tessel::RasterContext& context, tests::Random& random) {
    raster = std::make_unique<Raster>(info, context, nullptr);
    bytes.resize((raster->dataSize / 8 + 1 + info.channels) * 8);
    for (std::size_t i = 0; i < bytes.size(); i += 8) {
      const std::uint64_t bits = random.Bits();
      std::memcpy(&bytes[i], &bits, sizeof bits);
    }
    raster->data = bytes.data();
    raster->dataSize = bytes.size();
  }
};

/// Samples of a range, some of which are repeated.
struct SampleRange {
  double low, high;
};

constexpr SampleRange kRanges[] = {{0, 256},  {0, 256},          {0, 65536},      {0, 70000},
                                   {-300, 3}, {-200000, -99000}, {99000, 200000}, {-1, 1}};

template <class T>
void FillRange(Raster& raster, const SampleRange& range, tests::Random& random) {
  constexpr double kExtra[] = {
      0.0,    -0.0,     255.0,     255.5,     256.0,      65535.0, 65535.9,    65536.0,  -0.5,
      -1.0,   100000.0, 1e5 + 1,   -100000.0, -1e5 - 1,   0x1p31,  0x1p32 + 5, 0x1p63,   -0x1p63,
      0x1p64, kNaN,     kInfinity, 1e300,     -kInfinity, 1e-60,   -1e-60,     16777217, 9007199254740993.0};
  const std::uint32_t rare = random.OneIn(2) ? 1u << 30 : 10 + random.Below(200);
  const bool isWhole = random.OneIn(2), repeats = random.OneIn(2);
  double value = 0.0;
  for (std::uint64_t i = 0; i < raster.dataSize / sizeof(T); ++i) {
    if (!repeats || random.OneIn(5))
      value = range.low + (range.high - range.low) * random.Below(1u << 20) * 0x1p-20;
    if (isWhole) value = std::floor(value);
    const T sample = reference::PlainCast<T>(random.OneIn(rare) ? random.Pick(kExtra) : value);
    std::memcpy(raster.data + i * sizeof(T), &sample, sizeof(T));
  }
}

/// Zeros of both signs that are the least or the greatest samples.
template <class T>
void FillZeros(Raster& raster, tests::Random& random) {
  const int sign = random.OneIn(2) ? 1 : -1;
  const std::uint32_t rare = 1 + random.Below(300);
  for (std::uint64_t i = 0; i < raster.dataSize / sizeof(T); ++i) {
    const double zero = random.OneIn(2) ? 0.0 : -0.0;
    const double value = random.OneIn(rare) ? zero : sign * static_cast<int>(1 + random.Below(9));
    const T sample = reference::PlainCast<T>(value);
    std::memcpy(raster.data + i * sizeof(T), &sample, sizeof(T));
  }
}

RoomyRaster DrawRaster(tests::Random& random, const DataType& type, std::uint32_t channels) {
  constexpr std::uint32_t kWidths[] = {0,   1,   2,   3,   7,    8,    9,    15,   16,  17,  31,
                                       32,  33,  48,  63,  64,   65,   127,  128,  129, 255, 256,
                                       257, 511, 512, 513, 601,  1024, 70,   90,   40,  20,  10,
                                       200, 300, 350, 400, 2047, 2048, 2049, 2050, 4100};
  constexpr std::uint32_t kHeights[] = {0, 1, 1, 1, 2, 2, 3, 3, 5};
  const std::uint32_t width = random.Pick(kWidths);
  const std::uint32_t height = width > 1000 ? 1 + random.Below(2) : random.Pick(kHeights);
  RoomyRaster drawn({width, height, channels, type}, {random.Below(4), random.Below(3)}, random);
  if (type.sizeBits == 1 || random.OneIn(6)) return drawn;
  if (random.OneIn(6)) {
    FillRandom(*drawn.raster, random.Pick(tests::kFills), random);
    return drawn;
  }
  const bool hasZeros = random.OneIn(5);
  const SampleRange range = random.Pick(kRanges);
  tests::WithPixelType(type, [&]<class T>() {
    if (hasZeros) {
      FillZeros<T>(*drawn.raster, random);
    } else {
      FillRange<T>(*drawn.raster, range, random);
    }
  });
  return drawn;
}

/// Passes if two vectors hold the same bits.
::testing::AssertionResult SameValues(const char* what, const Values& expected, const Values& actual) {
  if (expected.size() != actual.size()) {
    return ::testing::AssertionFailure() << actual.size() << ' ' << what << ", expected " << expected.size();
  }
  for (std::size_t i = 0; i < expected.size(); ++i) {
    if (std::memcmp(&expected[i], &actual[i], sizeof(float)) == 0) continue;
    std::ostringstream message;
    message.precision(9);
    message << what << " at " << i << ": expected " << expected[i] << ", got " << actual[i];
    return ::testing::AssertionFailure() << message.str();
  }
  return ::testing::AssertionSuccess();
}

/// Passes if the minima and the maxima have the same bits and all histograms are equal.
::testing::AssertionResult SameResults(const reference::RasterStatistics& expected,
                                       RasterStatistics& actual) {
  const auto sameMinima = SameValues("minima", expected.Minima(), MinimaOf(actual));
  if (!sameMinima) return sameMinima;
  const auto sameMaxima = SameValues("maxima", expected.Maxima(), MaximaOf(actual));
  if (!sameMaxima) return sameMaxima;
  for (std::size_t i = 0; i < expected.Histograms().size(); ++i) {
    const std::vector<int>& bins = expected.Histograms()[i];
    const std::vector<int> counted = actual.GetPixelCounts(static_cast<int>(i));
    if (counted == bins) continue;
    if (counted.size() != bins.size()) {
      return ::testing::AssertionFailure() << counted.size() << " bins, expected " << bins.size();
    }
    const auto at = std::mismatch(bins.begin(), bins.end(), counted.begin());
    return ::testing::AssertionFailure() << "histogram " << i << ", bin " << at.first - bins.begin()
                                         << ": expected " << *at.first << ", got " << *at.second;
  }
  return ::testing::AssertionSuccess();
}

/// Calls that follow each other on one object and on its twin.
class Sequence {
 public:
  Sequence(const PixelType& first, std::uint64_t seed)
      : random_(seed),
        type_(first.element, random_.OneIn(5)),
        listed_(1 + random_.Below(7)),
        decides_(random_.OneIn(3)),
        decision_(seed),
        twinsDecision_(seed),
        statistics_(DrawStatistics()),
        twin_(statistics_, decides_ ? &twinsDecision_ : nullptr) {
    statistics_.SetMask(decides_ ? &decision_ : nullptr);
  }

  /// One call of each. Most rasters have the first one's type.
  ::testing::AssertionResult Call() {
    if (!isFirst_ && random_.OneIn(4)) SetLater();
    const DataType type = isFirst_ || !random_.OneIn(4) ? type_ : DrawLaterType();
    const std::uint32_t channels = random_.OneIn(4) ? random_.Below(8) : listed_;
    const RoomyRaster in = DrawRaster(random_, type, channels);
    const std::vector<unsigned char> before = in.bytes;
    Raster out({1, 1, 1, random_.Pick(tests::kPixelTypes).element}, {});
    statistics_.Process(in.raster.get(), nullptr, random_.OneIn(2) ? nullptr : &out);
    twin_.Process(*in.raster);
    isFirst_ = false;
    if (in.bytes != before) return ::testing::AssertionFailure() << "the input was modified";
    if (decision_.pixels != twinsDecision_.pixels)
      return ::testing::AssertionFailure() << "the decision met other pixels";
    return SameResults(twin_, statistics_)
           << ", " << tests::NameOf(type) << (type.isComplex ? " complex, " : ", ") << in.raster->width
           << " x " << in.raster->height << " x " << channels << (decides_ ? ", with a decision" : "");
  }

 private:
  RasterStatistics DrawStatistics() {
    constexpr int kMethods[] = {1, 1, 1, 0, 2, -1};
    constexpr int kTypes[] = {8, 8, 16, -1};
    return StatisticsOf(listed_, random_.Pick(kTypes), static_cast<StatisticsMethod>(random_.Pick(kMethods)));
  }

  /// Setters that have no effect any more.
  void SetLater() {
    statistics_.SetMask(random_.OneIn(2) ? &other_ : nullptr);
    statistics_.SetMethod(random_.OneIn(2) ? kPlain : kBlue);
    statistics_.histogramType = random_.OneIn(2) ? 8 : 16;
  }

  DataType DrawLaterType() {
    if (random_.OneIn(10)) return tessel::eDT_BIT;
    return DataType(random_.Pick(tests::kPixelTypes).element, random_.OneIn(4));
  }

  tests::Random random_;
  DataType type_;
  std::uint32_t listed_;
  bool decides_;
  DrawnDecision decision_, twinsDecision_, other_{0};
  RasterStatistics statistics_;
  reference::RasterStatistics twin_;
  bool isFirst_ = true;
};

struct RasterStatisticsDifferential : ::testing::TestWithParam<PixelType> {};

TEST_P(RasterStatisticsDifferential, AgreesWithTheTwinAfterEachCall) {
  for (std::uint64_t seed = 0; seed < 120; ++seed) {
    const std::uint64_t own = 1000 * static_cast<std::uint64_t>(GetParam().element) + seed;
    Sequence sequence(GetParam(), own);
    for (std::uint64_t call = 0; call <= seed % 4; ++call)
      ASSERT_TRUE(sequence.Call()) << "seed " << own << ", call " << call;
  }
}

INSTANTIATE_TEST_SUITE_P(From, RasterStatisticsDifferential, ::testing::ValuesIn(tests::kPixelTypes),
                         ::testing::PrintToStringParamName());

/// Between the values of blue in the test below.
constexpr int kStep = 7;

/// Pixels whose blue is 1 or a multiple of `kStep` more, as decimals: the last bit decides between two bins.
std::vector<int> PixelsOfWholeBlue() {
  std::vector<int> samples;
  for (int s1 = 0; s1 < 1000; ++s1) {
    for (int s2 = 0; s2 < 1000; ++s2) {
      const long rest = 138254L * s1 + 100616L * s2 - 13905400L;  // in millionths
      for (long blue = 1; blue < 250; blue += kStep) {
        const long millionths = rest + blue * 1000000L;
        if (millionths > 0 && millionths % 873393L == 0)
          samples.insert(samples.end(), {static_cast<int>(millionths / 873393L), s1, s2});
      }
    }
  }
  return samples;
}

TEST(RasterStatisticsOfWholeBlue, AgreesWithTheTwinInOrderAndPrecision) {
  const std::vector<int> samples = PixelsOfWholeBlue();
  ASSERT_GT(samples.size(), 3u * 20);
  int belowByALastBit = 0;
  for (std::size_t i = 0; i < samples.size(); i += 3) {
    const std::vector<int> pixel(samples.begin() + static_cast<long>(i),
                                 samples.begin() + static_cast<long>(i) + 3);
    RasterStatistics statistics = StatisticsOf(3, 8);
    reference::RasterStatistics twin(statistics, nullptr);
    Image<int> in({1, 1, 3});
    std::copy(pixel.begin(), pixel.end(), in.Elements());
    statistics.Process(&in, nullptr, nullptr);
    twin.Process(in);
    ASSERT_TRUE(SameResults(twin, statistics)) << ::testing::PrintToString(pixel);
    if (static_cast<int>(MinimaOf(statistics)[2]) % kStep == 0) ++belowByALastBit;
  }
  EXPECT_GT(belowByALastBit, 0);  // else the pixels prove nothing
}

/// All pixels of bytes whose blue lies within 0.0002 of a whole number.
std::vector<unsigned char> BytesOfNearlyWholeBlue() {
  std::vector<unsigned char> samples;
  for (int s0 = 0; s0 < 256; ++s0) {
    for (int s1 = 0; s1 < 256; ++s1) {
      for (int s2 = 0; s2 < 256; ++s2) {
        const int millionths = 873393 * s0 + 13905400 - 138254 * s1 - 100616 * s2;
        if ((millionths + 100000200) % 1000000 > 400) continue;
        for (const int sample : {s0, s1, s2}) samples.push_back(static_cast<unsigned char>(sample));
      }
    }
  }
  return samples;
}

TEST(RasterStatisticsOfWholeBlue, AgreesWithTheTwinForAllBytesThatComeNearIt) {
  const std::vector<unsigned char> samples = BytesOfNearlyWholeBlue();
  ASSERT_GT(samples.size(), 3u * 1000);
  Image<unsigned char> in({37, 1, 3});  // one pixel again and again
  for (std::size_t i = 0; i < samples.size(); i += 3) {
    in.Set([&](int, int, std::uint32_t c) { return samples[i + c]; });
    RasterStatistics statistics = StatisticsOf(3, 8);
    reference::RasterStatistics twin(statistics, nullptr);
    statistics.Process(&in, nullptr, nullptr);
    twin.Process(in);
    ASSERT_TRUE(SameResults(twin, statistics)) << ::testing::PrintToString(
        std::vector<int>(samples.begin() + static_cast<long>(i), samples.begin() + static_cast<long>(i) + 3));
  }
}

// ---- statistics over tiles

struct Tile {
  int x, y, width, height;
};

/// Cuts an area into tiles of random sizes.
void Cut(tests::Random& random, const Tile& area, std::vector<Tile>& tiles) {
  const bool isWide = area.width > area.height;
  const int length = isWide ? area.width : area.height;
  if (length < 2 || (area.width * area.height < 900 && random.OneIn(3))) {
    tiles.push_back(area);
    return;
  }
  const int part = 1 + static_cast<int>(random.Below(static_cast<std::uint32_t>(length - 1)));
  Tile first = area, second = area;
  (isWide ? first.width : first.height) = part;
  (isWide ? second.x : second.y) += part;
  (isWide ? second.width : second.height) -= part;
  Cut(random, first, tiles);
  Cut(random, second, tiles);
}

/// A tile of an image, with margins that hold what would show if it were counted.
template <class T>
std::unique_ptr<Image<T>> TileOf(Image<T>& image, const Tile& tile, const tessel::RasterContext& margins) {
  const tests::Size size = {static_cast<std::uint32_t>(tile.width), static_cast<std::uint32_t>(tile.height),
                            image.channels};
  auto cut = std::make_unique<Image<T>>(size, margins, T{255});
  for (int y = 0; y < tile.height; ++y) {
    for (int x = 0; x < tile.width; ++x)
      std::copy_n(&image.At(tile.x + x, tile.y + y), image.channels, &cut->At(x, y));
  }
  return cut;
}

/// @param decides  a decision leaves out the pixels whose first sample is not above 60
template <class T>
void CompareTiles(std::uint32_t channels, bool decides, tests::Random& random) {
  Image<T> image({97, 83, channels}, {2, 1});
  const double quarter = std::is_floating_point_v<T> ? 0.25 : 0.0;
  image.Set([&](int, int, std::uint32_t) { return 3 + random.Below(200) + quarter * random.Below(4); });
  Decision<T> decision([](T sample) { return sample > T{60}; });
  RasterStatistics whole = StatisticsOf(channels, 8), tiled = StatisticsOf(channels, 8);
  for (RasterStatistics* const statistics : {&whole, &tiled})
    statistics->SetMask(decides ? &decision : nullptr);
  whole.Process(&image, nullptr, nullptr);
  std::vector<Tile> tiles;
  Cut(random, {0, 0, 97, 83}, tiles);
  ASSERT_GT(tiles.size(), 3u);
  for (std::size_t left = tiles.size(); left > 0; --left) {
    std::swap(tiles[left - 1], tiles[random.Below(static_cast<std::uint32_t>(left))]);
    const auto in = TileOf(image, tiles[left - 1], {random.Below(4), random.Below(4)});
    tiled.Process(in.get(), nullptr, nullptr);
  }
  int kept = 0;
  for (int y = 0; y < 83; ++y) {
    for (int x = 0; x < 97; ++x) kept += !decides || image.At(x, y) > T{60} ? 1 : 0;
  }
  for (int c = 0; c < static_cast<int>(channels); ++c) {
    const Summary summary = SummaryOf(whole, c);
    int counted = 0;
    for (const auto& [bin, count] : summary.counts) counted += count;
    EXPECT_EQ(counted, kept) << c;
    EXPECT_EQ(SummaryOf(tiled, c), summary) << c;
  }
}

template <class T>
void CompareTilesOfOneType() {
  tests::Random random(20241105);
  for (const std::uint32_t channels : {1u, 2u, 3u, 4u}) {
    for (const bool decides : {false, true}) {
      SCOPED_TRACE(::testing::Message() << channels << " channels" << (decides ? ", with a decision" : ""));
      for (int i = 0; i < 3; ++i) CompareTiles<T>(channels, decides, random);
    }
  }
}

// The tiles of an image, in any order and of any size, give what the whole image gives.
TEST(RasterStatisticsOverTiles, ByteTilesInAnyOrderAndOfAnySizeGiveWhatTheWholeImageGives) {
  CompareTilesOfOneType<unsigned char>();
}

TEST(RasterStatisticsOverTiles, WordTilesInAnyOrderAndOfAnySizeGiveWhatTheWholeImageGives) {
  CompareTilesOfOneType<unsigned short>();
}

TEST(RasterStatisticsOverTiles, FloatTilesInAnyOrderAndOfAnySizeGiveWhatTheWholeImageGives) {
  CompareTilesOfOneType<float>();
}

static_assert(std::is_base_of_v<details::StatisticsParams, RasterStatistics>);
static_assert(!std::is_polymorphic_v<RasterStatistics>);
static_assert(!std::is_polymorphic_v<details::StatisticsParams>);

}  // namespace
}  // namespace orvik::gridmill
