#include <cstddef>
#include <cstdint>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "basic/tessel/mask/mask.h"
#include "processes/gridmill/averagechannels.h"
#include "processes/gridmill/sqrgradient.h"
#include "processes/gridmill/vollath.h"
#include "tests/support/capturedoutput.h"
#include "tests/support/images.h"

// Operators that run on several threads at once, each thread with an object of its own.
namespace orvik::filters {
namespace {

using tessel::Mask;
using tests::Image;

using Sums = std::vector<double>;

constexpr std::uint32_t kWidth = 300;
constexpr std::uint32_t kHeight = 40;
constexpr int kCalls = 20;
constexpr double kTriples = (kWidth - 2) * kHeight;
constexpr double kPairs = kWidth * (kHeight - 1);

/// Calls a Vollath measure on images of the constants `value` and `value` + 1.
void RunVollath(int value, bool* isRight) {
  Image<short> in({kWidth, kHeight, 2});
  in.Set([&](int, int, std::uint32_t c) { return value + static_cast<int>(c); });
  const VollathEvaluation measure;
  for (int call = 1; call <= kCalls; ++call) {
    measure.Process(&in, nullptr, nullptr);
    const double first = value * value, second = (value + 1) * (value + 1);
    const Sums expected = {call * kTriples * first, call * kTriples * second};
    *isRight = *isRight && measure.GetLeftEq() == expected && measure.GetRightEq() == expected;
  }
}

/// Calls a gradient measure on an image whose rows differ by `step`.
void RunSqrGradient(int step, bool* isRight) {
  Image<float> in({kWidth, kHeight});
  in.Set([&](int, int y, std::uint32_t) { return step * y; });
  SqrGradientEvaluation measure;
  measure.InitEvaluation(1);
  double expected = 0.0;
  for (int call = 1; call <= kCalls; ++call) {
    measure.Process(&in, nullptr, nullptr);
    expected += call * kPairs * step * step;
    *isRight = *isRight && measure.GetEvaluation() == Sums{expected};
  }
}

/// Averages images of two channels, 10 and `second`.
void RunAverage(short second, bool* isRight) {
  const AverageChannels average(-1.0f);
  Image<short> in({kWidth, 3 * kHeight, 2});
  in.Set([&](int, int, std::uint32_t c) { return c == 0 ? 10 : second; });
  Image<float> out({kWidth, 3 * kHeight});
  for (int call = 0; call < kCalls; ++call) {
    tests::FillBytes(out);
    average.Process(&in, nullptr, &out, nullptr);
    for (std::size_t i = 0; i < out.dataSize / sizeof(float); ++i)
      *isRight = *isRight && out.Elements()[i] == static_cast<float>(10 + second) / 2.0f;
  }
}

/// Runs both at once and returns what was printed.
template <class First, class Second>
std::string RunOnTwoThreads(First first, Second second) {
  tests::CapturedOutput output;
  std::thread firstThread(first), secondThread(second);
  firstThread.join();
  secondThread.join();
  return output.End();
}

/// `count` lines of a gradient measure's call in any order, as many characters as they are.
std::size_t LengthOfLines(int step, std::size_t count) {
  const auto sum = static_cast<long long>(kPairs * step * step);
  return count * ("\n BEFORE - 101 " + std::to_string(sum) + ".000000\n").size();
}

TEST(FocusThreads, OneMeasureOfEachKindRunsOnEachOfTwoThreads) {
  bool isVollathRight = true, isGradientRight = true;
  const std::string printed =
      RunOnTwoThreads([&] { RunVollath(7, &isVollathRight); }, [&] { RunSqrGradient(3, &isGradientRight); });
  EXPECT_TRUE(isVollathRight);
  EXPECT_TRUE(isGradientRight);
  EXPECT_EQ(printed.size(), LengthOfLines(3, kCalls));
}

TEST(FocusThreads, TwoVollathMeasuresRunOnTwoThreads) {
  bool isFirstRight = true, isSecondRight = true;
  const std::string printed =
      RunOnTwoThreads([&] { RunVollath(7, &isFirstRight); }, [&] { RunVollath(100, &isSecondRight); });
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
  EXPECT_EQ(printed, "");
}

TEST(FocusThreads, TwoGradientMeasuresRunOnTwoThreadsAndEachPrintsItsLines) {
  bool isFirstRight = true, isSecondRight = true;
  const std::string printed =
      RunOnTwoThreads([&] { RunSqrGradient(3, &isFirstRight); }, [&] { RunSqrGradient(5, &isSecondRight); });
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
  EXPECT_EQ(printed.size(), LengthOfLines(3, kCalls) + LengthOfLines(5, kCalls));
}

TEST(FocusThreads, MeasuresOfOneRasterAndOneMaskRunOnTwoThreads) {
  Image<unsigned char> in({kWidth, kHeight}, {1, 1}, 9);
  Mask mask(kWidth, kHeight, {1, 1});
  mask.SetValid(5, 0, false);
  Sums left, right;
  const auto run = [&](Sums* sums) {
    const VollathEvaluation measure;
    for (int call = 0; call < kCalls; ++call) measure.Process(&in, &mask, nullptr);
    *sums = measure.GetLeftEq();
  };
  RunOnTwoThreads([&] { run(&left); }, [&] { run(&right); });
  EXPECT_EQ(left, Sums{kCalls * (kTriples - 2) * 81});
  EXPECT_EQ(right, left);
}

TEST(FocusThreads, MeasureThatFailsDoesNotHoldUpAnother) {
  bool isRight = true;
  const auto fail = [] {
    tessel::Raster noChannels({3, 2, 0, tessel::eDT_8U}, {});
    tessel::Raster bits({3, 2, 1, tessel::eDT_BIT}, {});
    const VollathEvaluation measure;
    for (int call = 0; call < kCalls; ++call) {
      EXPECT_THROW(measure.Process(&noChannels, nullptr, nullptr), Exception);
      EXPECT_THROW(measure.Process(&bits, nullptr, nullptr), Exception);
    }
  };
  RunOnTwoThreads(fail, [&] { RunSqrGradient(3, &isRight); });
  EXPECT_TRUE(isRight);
}

TEST(FocusThreads, TwoAverageChannelsRunOnTwoThreads) {
  bool isFirstRight = true, isSecondRight = true;
  RunOnTwoThreads([&] { RunAverage(20, &isFirstRight); }, [&] { RunAverage(33, &isSecondRight); });
  EXPECT_TRUE(isFirstRight);
  EXPECT_TRUE(isSecondRight);
}

}  // namespace
}  // namespace orvik::filters
