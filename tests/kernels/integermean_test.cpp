#include "processes/gridmill/kernels/integermean.h"

#include <cmath>
#include <cstddef>
#include <limits>
#include <random>
#include <vector>

#include <gtest/gtest.h>

#include "basic/tessel/clipto.h"

namespace orvik::kernels {
namespace {

/// The definition of no-data: the distance in `float`, compared as a `double` with 1e-9.
bool SlowIsNoData(float sample, float noData) {
  return std::fabs(static_cast<double>(sample - noData)) < 1e-9;
}

/// The mean in `float`, in the order of the channels, or `noData` where one of them counts as such.
template <class In>
float SlowMean(const In* pixel, std::size_t channels, float noData) {
  float sum = 0.0f;
  for (std::size_t c = 0; c < channels; ++c) {
    const float sample = static_cast<float>(pixel[c]);
    if (SlowIsNoData(sample, noData)) return noData;
    sum = sum + sample;
  }
  return sum / static_cast<float>(channels);
}

const float kNoData[] = {0.0f,
                         -0.0f,
                         7.0f,
                         255.0f,
                         65535.0f,
                         -1.0f,
                         256.0f,
                         65536.0f,
                         7.5f,
                         std::nextafter(7.0f, 8.0f),
                         std::nextafter(0.0f, 1.0f),
                         0x1p-30f,
                         1e-9f,
                         -1e-9f,
                         1e30f,
                         -1e30f,
                         std::numeric_limits<float>::infinity(),
                         std::numeric_limits<float>::quiet_NaN()};

TEST(IsNoData, IsADistanceBelow1e9) {
  for (const float noData : kNoData) {
    std::vector<float> samples = {0.0f, 7.0f, 255.0f, std::numeric_limits<float>::quiet_NaN(),
                                  std::numeric_limits<float>::infinity()};
    for (const float offset : {1e-9f, 2e-9f, 5e-10f}) {
      samples.push_back(noData + offset);
      samples.push_back(noData - offset);
      samples.push_back(offset);
      samples.push_back(std::nextafter(offset, 0.0f));
      samples.push_back(std::nextafter(offset, 1.0f));
    }
    for (const float sample : samples)
      EXPECT_EQ(IsNoData(sample, noData), SlowIsNoData(sample, noData)) << sample << ", no-data " << noData;
  }
}

template <class In>
void ExpectTheOneSample() {
  for (const float noData : kNoData) {
    const NoDataSample<In> found(noData);
    for (int v = std::numeric_limits<In>::min(); v <= std::numeric_limits<In>::max(); ++v) {
      const bool hit = found.exists && found.sample == static_cast<In>(v);
      ASSERT_EQ(hit, SlowIsNoData(static_cast<float>(v), noData)) << v << ", no-data " << noData;
    }
  }
}

TEST(NoDataSample, IsTheOneSampleThatCountsAsNoData) {
  ExpectTheOneSample<unsigned char>();
  ExpectTheOneSample<unsigned short>();
}

/// Random samples, many of them 7, 0 or the largest.
template <class In>
std::vector<In> Samples(std::size_t count, std::mt19937& random) {
  const In often[] = {7, 0, std::numeric_limits<In>::max()};
  std::vector<In> samples(count);
  for (In& sample : samples) sample = random() % 8 == 0 ? often[random() % 3] : static_cast<In>(random());
  return samples;
}

TEST(RoundedMeanRow3, IsTheMeanOfThreeBytesRoundedToAByte) {
  std::mt19937 random(13);
  for (const float noData : kNoData) {
    const auto substitute = tessel::ClipTo<unsigned char>(noData);
    for (std::size_t count = 0; count <= 70; ++count) {
      const std::vector<unsigned char> source = Samples<unsigned char>(3 * count, random);
      std::vector<unsigned char> expected(count + 16, 0xA5);
      std::vector<unsigned char> target = expected;
      for (std::size_t i = 0; i < count; ++i)
        expected[8 + i] = tessel::ClipTo<unsigned char>(SlowMean(&source[3 * i], 3, noData));
      RoundedMeanRow3(source.data(), NoDataSample<unsigned char>(noData), substitute, count,
                      target.data() + 8);
      ASSERT_EQ(target, expected) << count << " pixels, no-data " << noData;
    }
  }
}

TEST(RoundedMeanRow3, RoundsEverySum) {
  std::vector<unsigned char> source;
  std::vector<unsigned char> expected;
  for (int sum = 0; sum <= 765; ++sum) {
    const int first = sum / 3, second = (sum - first) / 2;
    for (const int sample : {first, second, sum - first - second})
      source.push_back(static_cast<unsigned char>(sample));
    expected.push_back(tessel::ClipTo<unsigned char>(SlowMean(&source[source.size() - 3], 3, -1.0f)));
  }
  std::vector<unsigned char> target(expected.size());
  RoundedMeanRow3(source.data(), NoDataSample<unsigned char>(-1.0f), 0, expected.size(), target.data());
  EXPECT_EQ(target, expected);
}

TEST(MeanRow4, IsTheMeanOfFourShorts) {
  std::mt19937 random(14);
  for (const float noData : kNoData) {
    if (std::isnan(noData)) continue;  // compared below
    for (std::size_t count = 0; count <= 70; ++count) {
      const std::vector<unsigned short> source = Samples<unsigned short>(4 * count, random);
      std::vector<float> expected(count + 16, -2.0f);
      std::vector<float> target = expected;
      for (std::size_t i = 0; i < count; ++i) expected[8 + i] = SlowMean(&source[4 * i], 4, noData);
      MeanRow4(source.data(), NoDataSample<unsigned short>(noData), noData, count, target.data() + 8);
      ASSERT_EQ(target, expected) << count << " pixels, no-data " << noData;
    }
  }
}

TEST(MeanRow4, ANoDataOfNaNMatchesNothing) {
  const std::vector<unsigned short> source = {0, 0, 0, 0, 65535, 65535, 65535, 65535};
  float target[2];
  MeanRow4(source.data(), NoDataSample<unsigned short>(kNoData[17]), kNoData[17], 2, target);
  EXPECT_EQ(target[0], 0.0f);
  EXPECT_EQ(target[1], 65535.0f);
}

TEST(MeanRow4, NoDataIsFoundInEveryChannelAndNextToItsNeighbours) {
  for (const auto hit : std::vector<unsigned short>{0, 1, 7, 0x7FFF, 0x8000, 0xFFFF}) {
    for (std::size_t channel = 0; channel < 4; ++channel) {
      for (const int step : {-1, 1, 0x100, 0x8000}) {
        std::vector<unsigned short> source(4, static_cast<unsigned short>(hit + step));
        const float noData = static_cast<float>(hit);
        float mean = -1.0f;
        MeanRow4(source.data(), NoDataSample<unsigned short>(noData), -5.0f, 1, &mean);
        EXPECT_EQ(mean, static_cast<float>(source[0])) << hit << " is not " << source[0];
        source[channel] = hit;
        MeanRow4(source.data(), NoDataSample<unsigned short>(noData), -5.0f, 1, &mean);
        EXPECT_EQ(mean, -5.0f) << hit << " in channel " << channel;
      }
    }
  }
}

}  // namespace
}  // namespace orvik::kernels
