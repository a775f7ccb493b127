#include <gtest/gtest.h>

#include "basic/exceptions/exceptions.h"
#include "processes/gridmill/gridmill.h"
#include "tests/support/failures.h"
#include "tests/support/images.h"

namespace orvik::filters {
namespace {

using tests::Image;
using tests::Throws;

/// An image that falls by 1 from pixel to pixel towards increasing x, with a margin of 1.
struct Shared : ::testing::Test {
  Image<float> in{{40, 3}, {1, 1}};
  Image<float> barren{{40, 3}};
  Image<short> out{{40, 3}};
  tessel::Mask mask{40, 3, {1, 1}};

  Shared() {
    in.Set([](int x, int, std::uint32_t) { return 100 - x; });
    mask.SetValid(20, 1, false);
  }
};

TEST_F(Shared, AverageChannelsRuns) {
  const AverageChannels average(-1.0f);
  average.Process(&in, &mask, &out, nullptr);
  EXPECT_EQ(out.At(7, 2), 93);
  EXPECT_EQ(out.At(20, 1), -1);
}

TEST_F(Shared, FilterSlpRuns) {
  FilterSlp slope;
  slope.SetBackground(-1.0f);
  slope.Process(&in, &mask, &out);
  EXPECT_EQ(out.At(7, 2), 45);
  EXPECT_EQ(out.At(20, 1), -1);
}

TEST_F(Shared, FilterAspRuns) {
  FilterAsp aspect;
  aspect.SetXSIZE(1.0f);
  aspect.SetYSIZE(1.0f);
  aspect.SetBackground(-1.0f);
  aspect.Process(&in, &mask, &out);
  EXPECT_EQ(out.At(7, 2), 90);
  EXPECT_EQ(out.At(19, 1), 510);
  EXPECT_EQ(out.At(20, 1), -1);
}

TEST_F(Shared, ExceptionsAreCaughtByTheirType) {
  const char* const margin = "The Margin of the input raster is too small";
  EXPECT_TRUE(Throws<Exception>("poRasterIn is invalid pointer",
                                [&] { AverageChannels().Process(nullptr, nullptr, &out, nullptr); }));
  EXPECT_TRUE(Throws<ParameterException>(margin, [&] { FilterSlp().Process(&barren, nullptr, &out); }));
  EXPECT_TRUE(Throws<ParameterException>(margin, [&] { FilterAsp().Process(&barren, nullptr, &out); }));
  EXPECT_TRUE(Throws<DataException>("We can only rasterize into a eDT_BIT or eDT_8U Raster",
                                    [&] { mask.RetrieveRaster(&out); }));
}

}  // namespace
}  // namespace orvik::filters
