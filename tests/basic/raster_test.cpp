#include "basic/tessel/raster.h"

#include <cstdint>
#include <memory>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include "basic/tessel/samples.h"

namespace orvik::tessel {
namespace {

// ---- golden

TEST(Raster, ADoubleRasterOfWidth10HasARowEvery80Bytes) {
  const Raster raster({10, 3, 1, eDT_64F}, {});
  EXPECT_EQ(PixelOffset(raster, 0, 1) - PixelOffset(raster, 0, 0), 80u);
  EXPECT_EQ(raster.dataSize, 240u);
}

TEST(Raster, AComplexDoubleRasterOfWidth10HasARowEvery160Bytes) {
  const Raster raster({10, 3, 1, DataType(eDT_64F, true)}, {});
  EXPECT_EQ(PixelOffset(raster, 0, 1) - PixelOffset(raster, 0, 0), 160u);
  EXPECT_EQ(raster.dataSize, 480u);
}

TEST(Raster, PixelZeroWithMargins2And1AndABufferOf14ColumnsHasTheIndex16) {
  const Raster raster({10, 3, 1, eDT_8U}, RasterContext(2, 1));
  ASSERT_EQ(raster.bufferWidth, 14u);
  EXPECT_EQ(PixelIndex(raster, 0, 0), 16u);
}

TEST(Raster, ABufferOverFourGigabytesGetsTheWrappedSize) {
  // Deliberate: `dataSize` is formed in 32-bit unsigned arithmetic and wraps; the wrapped size is allocated.
  const Raster raster({65536, 65537, 1, eDT_8U}, {});
  EXPECT_EQ(raster.dataSize, 65536u);
  EXPECT_TRUE(raster.ownsData);
  raster.data[0] = 1;
  raster.data[65535] = 2;
  EXPECT_EQ(Raster({65536, 65536, 1, eDT_8U}, {}).dataSize, 0u);
}

TEST(Raster, EveryFactorOfTheBufferSizeTakesPartInTheWrap) {
  unsigned char byte = 0;
  EXPECT_EQ(Raster({65536, 32769, 1, eDT_16S}, {}, &byte).dataSize, 131072u);
  EXPECT_EQ(Raster({65536, 32769, 1, DataType(eDT_8U, true)}, {}, &byte).dataSize, 131072u);
  EXPECT_EQ(Raster({65536, 257, 256, eDT_8U}, {}, &byte).dataSize, 16777216u);
  EXPECT_EQ(Raster({65534, 65535, 1, eDT_8U}, RasterContext(1, 1), &byte).dataSize, 65536u);
}

TEST(Raster, TheBufferSizeIsElementBytesTimesPartsTimesPixelsTimesChannels) {
  const RasterContext context(2, 1);
  EXPECT_EQ(Raster({3, 4, 5, eDT_8S}, context).dataSize, 7u * 6 * 5);
  EXPECT_EQ(Raster({3, 4, 5, eDT_16U}, context).dataSize, 7u * 6 * 5 * 2);
  EXPECT_EQ(Raster({3, 4, 5, eDT_32F}, context).dataSize, 7u * 6 * 5 * 4);
  EXPECT_EQ(Raster({3, 4, 5, eDT_64S}, context).dataSize, 7u * 6 * 5 * 8);
  EXPECT_EQ(Raster({3, 4, 5, DataType(eDT_64S, true)}, context).dataSize, 7u * 6 * 5 * 16);
  EXPECT_EQ(Raster({3, 4, 0, eDT_64S}, context).dataSize, 0u);
}

TEST(Raster, AnElementOfOneBitTakesAWholeByteOfTheBufferButOneBitOfTheAddress) {
  const Raster raster({16, 2, 1, eDT_BIT}, {});
  EXPECT_EQ(raster.dataSize, 32u);
  EXPECT_EQ(PixelOffset(raster, 7, 0), 0u);
  EXPECT_EQ(PixelOffset(raster, 8, 0), 1u);
  EXPECT_EQ(PixelOffset(raster, 0, 1), 2u);
}

TEST(Raster, TheConstructorCopiesTheShapeAndOwnsItsBuffer) {
  const Raster raster({3, 4, 5, eDT_16S}, RasterContext(2, 1, 70, 80));
  EXPECT_EQ(raster.width, 3u);
  EXPECT_EQ(raster.height, 4u);
  EXPECT_EQ(raster.channels, 5u);
  EXPECT_EQ(raster.dataType, DataType(eDT_16S));
  EXPECT_EQ(raster.marginX, 2u);
  EXPECT_EQ(raster.marginY, 1u);
  EXPECT_EQ(raster.originX, 70u);
  EXPECT_EQ(raster.originY, 80u);
  EXPECT_EQ(raster.bufferWidth, 7u);
  EXPECT_EQ(raster.bufferHeight, 6u);
  EXPECT_NE(raster.data, nullptr);
  EXPECT_TRUE(raster.ownsData);
}

TEST(Raster, WrappedMemoryStaysTheCallers) {
  std::vector<unsigned char> memory(6, 7);
  {
    const Raster raster({3, 2, 1, eDT_8U}, {}, memory.data());
    EXPECT_FALSE(raster.ownsData);
    EXPECT_EQ(raster.data, memory.data());
    EXPECT_EQ(raster.dataSize, 6u);
  }
  EXPECT_EQ(memory, std::vector<unsigned char>(6, 7));
}

TEST(Raster, AnOwnedBufferIsFreedWithArrayDelete) {
  Raster raster({3, 2, 1, eDT_8U}, {});
  delete[] raster.data;
  raster.data = new unsigned char[100];  // what the destructor finds is what it frees
}

TEST(Raster, ANullBufferIsNotFreed) {
  Raster raster({3, 2, 1, eDT_8U}, {});
  delete[] raster.data;
  raster.data = nullptr;
  EXPECT_TRUE(raster.ownsData);
}

TEST(Raster, IsDeletedThroughItsBase) {
  static_assert(std::has_virtual_destructor_v<RasterInfo>);
  static_assert(!std::is_polymorphic_v<RasterContext>);
  const std::unique_ptr<RasterInfo> base =
      std::make_unique<Raster>(RasterInfo(3, 2, 1, eDT_8U), RasterContext());
  EXPECT_EQ(base->width, 3u);
}

TEST(Raster, CannotBeCopied) {
  static_assert(!std::is_copy_constructible_v<Raster>);
  static_assert(!std::is_copy_assignable_v<Raster>);
}

TEST(Raster, ADefaultShapeIsEmpty) {
  const RasterInfo info;
  EXPECT_EQ(info.width, 0u);
  EXPECT_EQ(info.height, 0u);
  EXPECT_EQ(info.channels, 0u);
  EXPECT_EQ(info.dataType, DataType());
  const RasterContext context;
  EXPECT_EQ(context.marginX, 0u);
  EXPECT_EQ(context.marginY, 0u);
  EXPECT_EQ(context.originX, 0u);
  EXPECT_EQ(context.originY, 0u);
}

TEST(Raster, AnAssignedShapeHoldsTheSame) {
  RasterInfo info;
  info = RasterInfo(3, 4, 5, DataType(eDT_16S, true));
  EXPECT_EQ(info.width, 3u);
  EXPECT_EQ(info.height, 4u);
  EXPECT_EQ(info.channels, 5u);
  EXPECT_EQ(info.dataType, DataType(eDT_16S, true));
}

// ---- addressing

TEST(Raster, SamplesOfAPixelLieNextToEachOther) {
  const Raster raster({4, 4, 3, eDT_16U}, RasterContext(1, 2));
  EXPECT_EQ(PixelOffset(raster, 0, 0), (2u * 6 + 1) * 3 * 2);
  EXPECT_EQ(PixelOffset(raster, 1, 0) - PixelOffset(raster, 0, 0), 6u);
  EXPECT_EQ(PixelOffset(raster, 0, 1) - PixelOffset(raster, 0, 0), 36u);
}

TEST(Raster, TheMarginIsReachedWithNegativePositions) {
  const Raster raster({4, 4, 1, eDT_8U}, RasterContext(1, 2));
  const auto minus = [](std::uint32_t distance) { return 0u - distance; };
  EXPECT_EQ(PixelOffset(raster, minus(1), minus(2)), 0u);
  EXPECT_EQ(PixelOffset(raster, 4, 5), raster.dataSize - 1);
}

TEST(Raster, ThePixelIndexIsWidenedBeforeItIsMultiplied) {
  unsigned char byte = 0;
  const Raster raster({65536, 65535, 3, DataType(eDT_64F, true)}, {}, &byte);
  EXPECT_EQ(PixelOffset(raster, 65535, 65534), (std::uint64_t{65534} * 65536 + 65535) * 48);
}

TEST(Raster, ThePixelIndexItselfWrapsAt32Bits) {
  unsigned char byte = 0;
  const Raster raster({65536, 65538, 1, eDT_8U}, {}, &byte);
  EXPECT_EQ(PixelOffset(raster, 5, 65537), 65536u + 5);
}

TEST(Raster, AnElementOfAPixelIsTakenFromItsAddress) {
  Raster raster({3, 2, 2, eDT_32F}, RasterContext(1, 1));
  float* const samples = reinterpret_cast<float*>(raster.data);
  for (int i = 0; i < 40; ++i) samples[i] = static_cast<float>(i);
  EXPECT_EQ(PixelAt<float>(raster, 0, 0)[0], 12.0f);
  EXPECT_EQ(PixelAt<float>(raster, 2, 1)[1], 27.0f);
}

}  // namespace
}  // namespace orvik::tessel
