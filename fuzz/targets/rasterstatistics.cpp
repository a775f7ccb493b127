#include "processes/gridmill/rasterstatistics.h"

#include <cstring>
#include <memory>
#include <vector>

#include "fuzz/support/bytes.h"
#include "fuzz/support/digest.h"
#include "fuzz/support/scene.h"
#include "fuzz/support/values.h"
#include "tests/reference/rasterstatistics_reference.h"

namespace orvik::fuzz {
namespace {

/// Decides by the number of the call.
struct Decision : tessel::IMaskDecision {
  std::uint8_t pattern = 0;
  unsigned int calls = 0;

  bool IsPixelValid(const void*) override { return (pattern >> (calls++ / 3 % 8) & 1) != 0; }
};

void RequireSameValues(const std::vector<float>& expected, const std::vector<float>& actual) {
  if (expected.size() != actual.size()) Fail("the results differ in number");
  if (!expected.empty() && std::memcmp(expected.data(), actual.data(), expected.size() * sizeof(float)) != 0)
    Fail("a minimum or a maximum differs");
}

void RequireSameResults(const reference::RasterStatistics& twin, gridmill::RasterStatistics& statistics) {
  std::vector<float> minima, maxima;
  statistics.GetMinValue(minima);
  statistics.GetMaxValue(maxima);
  RequireSameValues(twin.Minima(), minima);
  RequireSameValues(twin.Maxima(), maxima);
  Observed().Add(minima);
  Observed().Add(maxima);
  for (std::size_t i = 0; i < twin.Histograms().size(); ++i) {
    const std::vector<int> counts = statistics.GetPixelCounts(static_cast<int>(i));
    if (counts != twin.Histograms()[i]) Fail("a histogram differs");
    Observed().Add(counts);
  }
}

tessel::DataType DrawType(Bytes& bytes) {
  tessel::DataType type = PixelTypeOf(bytes);
  type.isComplex = bytes.OneIn(5);
  return type;
}

/// Calls on one object. The type of the first raster is that of the elements of all.
void Run(Bytes& bytes) {
  const std::uint32_t listed = 1 + bytes.Below(6);
  Decision decision, twinsDecision;
  decision.pattern = twinsDecision.pattern = bytes.Byte();
  const bool decides = bytes.OneIn(3);
  auto statistics = std::make_unique<gridmill::RasterStatistics>();
  std::vector<unsigned int> channels(listed);
  for (unsigned int& channel : channels) channel = bytes.Byte();
  statistics->SetChans(channels);
  statistics->SetType(bytes.OneIn(16) ? 16 : 8);
  statistics->SetMethod(static_cast<gridmill::StatisticsMethod>(static_cast<int>(bytes.Below(4)) - 1));
  statistics->SetMask(decides ? &decision : nullptr);
  if (bytes.OneIn(4)) statistics = std::make_unique<gridmill::RasterStatistics>(*statistics);
  reference::RasterStatistics twin(*statistics, decides ? &twinsDecision : nullptr);
  const tessel::DataType first = DrawType(bytes);
  for (std::uint32_t i = 0, calls = 1 + bytes.Below(4); i < calls; ++i) {
    if (i > 0 && bytes.OneIn(4)) statistics->SetMask(nullptr);
    const tessel::DataType type = i > 0 && bytes.OneIn(4) ? DrawType(bytes) : first;
    const Buffer in(DrawShape(bytes, type, bytes.OneIn(4) ? bytes.Below(8) : listed, 0), true);
    Fill(bytes, first, *in);
    const std::vector<unsigned char> before = BytesOf(*in);
    statistics->Process(in.Get(), nullptr, nullptr);
    twin.Process(*in);
    RequireUntouched(before, BytesOf(*in));
    RequireSameResults(twin, *statistics);
  }
}

}  // namespace
}  // namespace orvik::fuzz

GRIDMILL_FUZZ_TARGET(orvik::fuzz::Run)
