#include "processes/gridmill/frame/readback.h"

#include <cstddef>
#include <limits>
#include <vector>

#include <gtest/gtest.h>

#include "processes/gridmill/iprocessor.h"

namespace orvik::frame {
namespace {

struct Params {
  int value = 0;
};

struct OtherParams {
  int value = 0;
};

class Processor : public filters::IProcessor, public OtherParams, public Params {
 public:
  void Process(tessel::Raster*, tessel::Mask*, tessel::Raster*) const override {}
};

class PlainProcessor : public filters::IProcessor {
 public:
  void Process(tessel::Raster*, tessel::Mask*, tessel::Raster*) const override {}
};

using Cache = ProcessorCache<filters::IProcessor, 2>;

TEST(Built, IsNullBeforeAProcessorIsThere) {
  const Cache cache;
  EXPECT_EQ(Built<Params>(cache), nullptr);
}

TEST(Built, AreTheParametersOfTheProcessor) {
  Cache cache;
  auto* const processor = new Processor;
  processor->Params::value = 17;
  processor->OtherParams::value = 18;
  cache.processor = processor;
  ASSERT_EQ(Built<Params>(cache), static_cast<const Params*>(processor));
  EXPECT_EQ(Built<Params>(cache)->value, 17);
  EXPECT_EQ(Built<OtherParams>(cache)->value, 18);
  processor->Params::value = 19;
  EXPECT_EQ(Built<Params>(cache)->value, 19);
}

TEST(Built, IsNullIfTheProcessorHasNoSuchParameters) {
  Cache cache;
  cache.processor = new PlainProcessor;
  EXPECT_EQ(Built<Params>(cache), nullptr);
}

TEST(AppendFirst, AppendsAsManyAsThereAre) {
  const std::vector<float> values{1.0f, 2.0f, 3.0f};
  for (int count = -2; count <= 6; ++count) {
    std::vector<float> target{-1.0f, -2.0f}, expected = target;
    for (int i = 0; i < count && i < 3; ++i) expected.push_back(values[static_cast<std::size_t>(i)]);
    AppendFirst(values, count, target);
    EXPECT_EQ(target, expected) << count;
  }
}

TEST(AppendFirst, LimitsOfTheCount) {
  const std::vector<float> values{1.0f, 2.0f}, none;
  std::vector<float> target;
  AppendFirst(values, std::numeric_limits<int>::min(), target);
  EXPECT_TRUE(target.empty());
  AppendFirst(none, 5, target);
  EXPECT_TRUE(target.empty());
  AppendFirst(values, std::numeric_limits<int>::max(), target);
  EXPECT_EQ(target, values);
}

}  // namespace
}  // namespace orvik::frame
