#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include <gtest/gtest.h>

#include "tests/attack/allocations.h"
#include "tests/attack/operators.h"

// Many calls, and many channels.
namespace orvik::attack {
namespace {

const Types kBytes = {tessel::eDT_8U, tessel::eDT_8U, tessel::eDT_8U};
const Types kFloats = {tessel::eDT_32F, tessel::eDT_32F, tessel::eDT_32F};

#ifdef GRIDMILL_ATTACK_ALLOCATIONS
constexpr int kCalls = 100000;
#else
constexpr int kCalls = 2000;  // of a library that is watched and not optimised
#endif

class Load : public testing::TestWithParam<Operator> {};
INSTANTIATE_TEST_SUITE_P(Attack, Load, testing::ValuesIn(Operators()));

struct Requests {
  std::size_t live;
  std::size_t made;
  std::size_t cleared;

  friend bool operator==(const Requests&, const Requests&) = default;
};

/// What `calls` calls leave in use, and what they ask for.
Requests Process(Object& object, const Call& call, int calls) {
  const Silence silence;
  const std::size_t live = allocations::Live(), made = allocations::Made(), cleared = allocations::Cleared();
  for (int i = 0; i < calls; ++i) object.Process(call);
  return {allocations::Live() - live, allocations::Made() - made, allocations::Cleared() - cleared};
}

TEST_P(Load, MemoryIsFlatOverManyCalls) {
  const Operator& op = GetParam();
  const Shape shape{.channels = op.least, .isMasked = true};
  Scene scene(op, shape, kBytes);
  const std::unique_ptr<Object> object = op.make(shape.channels);
  Process(*object, scene.Get(), 10);
  const Requests one = Process(*object, scene.Get(), 1);
  EXPECT_EQ(one.live, 0u);
  EXPECT_EQ(one.cleared, 0u);
  const Requests all = Process(*object, scene.Get(), kCalls);
  EXPECT_TRUE((all == Requests{0u, kCalls * one.made, 0u}))
      << all.live << " left, " << all.made << " and " << all.cleared << " requests";
}

/// Results as numbers: samples of each pixel, then what is collected.
struct Result {
  std::unique_ptr<Scene> scene;
  std::vector<double> collected;

  Result(const Operator& op, const Shape& shape) : scene(std::make_unique<Scene>(op, shape, kFloats)) {
    const Silence silence;
    const std::unique_ptr<Object> object = op.make(shape.channels);
    object->Process(scene->Get());
    collected = object->Collected();
  }
};

constexpr double kExcluded = 7.0;  // what the operators write there

/// Passes if channel `c` of `many` is channel `single` of `one`, but for a factor on what is neither excluded
/// nor, like the first pixel of the buffer, in the margin.
testing::AssertionResult IsChannel(const Result& many, std::uint32_t c, const Result& one,
                                   std::uint32_t single, double gain = 1.0) {
  for (std::size_t i = 0; i < one.scene->OutPixels(); ++i) {
    const double wanted = one.scene->Result(i, single), result = many.scene->Result(i, c);
    const bool isLeft = wanted == kExcluded || wanted == one.scene->Result(0, single);
    if (result == wanted * gain || (isLeft && result == wanted) || (result != result && wanted != wanted))
      continue;
    return testing::AssertionFailure()
           << "channel " << c << " of pixel " << i << " is " << result << ", not " << wanted * gain;
  }
  return testing::AssertionSuccess();
}

constexpr std::uint32_t kMany = 64;
constexpr Shape kSmall = {.width = 19, .height = 7, .isMasked = true};

Shape WithChannels(Shape shape, std::uint32_t channels) {
  shape.channels = channels;
  return shape;
}

/// The entries of one channel within what is collected of `channels` channels.
std::vector<double> Collected(const std::vector<double>& all, std::uint32_t channels, std::uint32_t c) {
  std::vector<double> some;
  const std::size_t bins = 256, ends = 2 * std::size_t{channels};
  for (std::size_t i = c; i < std::min(ends, all.size()); i += channels) some.push_back(all[i]);
  for (std::size_t i = ends + c * bins; i < std::min(all.size(), ends + (c + 1) * bins); ++i)
    some.push_back(all[i]);
  return some;
}

void CompareEach(const Operator& op) {
  std::vector<Result> each;
  for (std::uint32_t c = 0; c < kMany; ++c) {
    Shape shape = WithChannels(kSmall, 1);
    shape.firstSample = c;
    each.emplace_back(op, shape);
  }
  for (std::uint32_t channels = 1; channels <= kMany; ++channels) {
    const Result many(op, WithChannels(kSmall, channels));
    for (std::uint32_t c = 0; c < channels; ++c) {
      if (op.collects) {
        EXPECT_EQ(Collected(many.collected, channels, c), Collected(each[c].collected, 1, 0)) << channels;
        continue;
      }
      EXPECT_TRUE(IsChannel(many, c, each[c], 0)) << channels;
      if (op.channels == Channels::kBeside) {
        EXPECT_TRUE(IsChannel(many, channels + c, each[c], 1)) << channels;
      }
    }
  }
}

void CompareFirst(const Operator& op) {
  const Result few(op, WithChannels(kSmall, op.read));
  for (std::uint32_t channels = op.read; channels <= kMany; ++channels) {
    const Result many(op, WithChannels(kSmall, channels));
    EXPECT_TRUE(many.scene->Bytes(2) == few.scene->Bytes(2)) << channels;
    for (std::uint32_t c = 0; c < op.read && op.collects; ++c)
      EXPECT_EQ(Collected(many.collected, channels, c), Collected(few.collected, op.read, c)) << channels;
  }
}

void CompareTogether(const Operator& op) {
  Shape shape = kSmall;
  shape.isEven = true;
  const Result few(op, WithChannels(shape, op.read));
  for (std::uint32_t channels = op.read; channels <= kMany; ++channels) {
    const double length = std::sqrt(channels);
    if (op.isLength && length != std::floor(length)) continue;  // rounded
    const Result many(op, WithChannels(shape, channels));
    for (std::uint32_t c = 0; c < op.outFixed; ++c)
      EXPECT_TRUE(IsChannel(many, c, few, c, op.isLength ? length : 1.0)) << channels;
  }
}

/// All elements of a row that are read belong to its first pixels, of which the channels are equal.
void ComparePacked(const Operator& op) {
  Shape shape = kSmall;
  shape.isEven = true;
  shape.isMasked = false;
  const Result one(op, WithChannels(shape, 1));
  for (std::uint32_t channels = 1; channels <= kMany; ++channels) {
    const Result many(op, WithChannels(shape, channels));
    bool isSomeSet = false;
    for (std::size_t i = 0; i < one.scene->OutPixels(); ++i) {
      const std::size_t x = i % shape.width;
      EXPECT_EQ(many.scene->Result(i, 0), one.scene->Result(i - x + x / channels, 0))
          << channels << ", " << i;
      isSomeSet = isSomeSet || many.scene->Result(i, 0) == 1.0;
    }
    EXPECT_TRUE(isSomeSet);
  }
}

TEST_P(Load, ChannelsUpToManyAreSomeMore) {
  const Operator& op = GetParam();
  switch (op.channels) {
    case Channels::kEach:
    case Channels::kBeside:
      return CompareEach(op);
    case Channels::kFirst:
      return CompareFirst(op);
    case Channels::kTogether:
      return CompareTogether(op);
    case Channels::kPacked:
      return ComparePacked(op);
  }
}

}  // namespace
}  // namespace orvik::attack
