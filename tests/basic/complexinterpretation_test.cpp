#include "basic/tessel/complexinterpretation.h"

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <memory>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::tessel {
namespace {

std::unique_ptr<Raster> Interpret(const Raster& raster) {
  return std::unique_ptr<Raster>(
      ComplexInterpretation().InterpretRaster(&raster, core::eINTERPRETATION_REAL));
}

/// Element i of the buffer has the value i.
template <class Pixel>
std::vector<Pixel> Count(std::size_t elements) {
  std::vector<Pixel> values(elements);
  for (std::size_t i = 0; i < elements; ++i) values[i] = static_cast<Pixel>(i);
  return values;
}

template <class Pixel>
class ComplexInterpretationOf : public ::testing::Test {};

using PixelTypes = ::testing::Types<char, unsigned char, short, unsigned short, int, unsigned int, float,
                                    double, std::int64_t, std::uint64_t>;
TYPED_TEST_SUITE(ComplexInterpretationOf, PixelTypes);

// ---- golden

TYPED_TEST(ComplexInterpretationOf, TakesTheRealPartOfEverySampleMarginsIncluded) {
  const RasterContext context(1, 2);
  std::vector<TypeParam> samples = Count<TypeParam>(5 * 6 * 2 * 2);
  const Raster raster({3, 2, 2, DataType::Of<TypeParam>(true)}, context,
                      reinterpret_cast<unsigned char*>(samples.data()));
  const std::unique_ptr<Raster> real = Interpret(raster);
  ASSERT_EQ(real->dataSize, 5 * 6 * 2 * sizeof(TypeParam));
  std::vector<TypeParam> result(5 * 6 * 2);
  std::memcpy(result.data(), real->data, real->dataSize);
  for (std::size_t i = 0; i < result.size(); ++i) EXPECT_EQ(result[i], samples[2 * i]) << i;
}

TYPED_TEST(ComplexInterpretationOf, KeepsShapeAndElementTypeAndIsReal) {
  const Raster raster({3, 2, 4, DataType::Of<TypeParam>(true)}, RasterContext(1, 2, 30, 40));
  std::memset(raster.data, 0, raster.dataSize);
  const std::unique_ptr<Raster> real = Interpret(raster);
  EXPECT_EQ(real->dataType, DataType::Of<TypeParam>());
  EXPECT_EQ(real->width, 3u);
  EXPECT_EQ(real->height, 2u);
  EXPECT_EQ(real->channels, 4u);
  EXPECT_EQ(real->marginX, 1u);
  EXPECT_EQ(real->marginY, 2u);
  EXPECT_EQ(real->originX, 30u);
  EXPECT_EQ(real->originY, 40u);
  EXPECT_EQ(real->bufferWidth, 5u);
  EXPECT_EQ(real->bufferHeight, 6u);
  EXPECT_TRUE(real->ownsData);
  EXPECT_NE(real->data, raster.data);
}

TYPED_TEST(ComplexInterpretationOf, CopiesARasterThatIsNotComplex) {
  std::vector<TypeParam> samples = Count<TypeParam>(5 * 3);
  const Raster raster({5, 3, 1, DataType::Of<TypeParam>()}, {},
                      reinterpret_cast<unsigned char*>(samples.data()));
  const std::unique_ptr<Raster> copy = Interpret(raster);
  EXPECT_EQ(copy->dataType, DataType::Of<TypeParam>());
  ASSERT_EQ(copy->dataSize, raster.dataSize);
  EXPECT_EQ(std::memcmp(copy->data, raster.data, raster.dataSize), 0);
}

TEST(ComplexInterpretation, KeepsTheBitsOfANaN) {
  std::vector<std::uint32_t> bits = {0x7FA00001u, 1, 0xFFC12345u, 2};
  const Raster raster({2, 1, 1, DataType(eDT_32F, true)}, {}, reinterpret_cast<unsigned char*>(bits.data()));
  const std::unique_ptr<Raster> real = Interpret(raster);
  std::uint32_t result[2];
  ASSERT_EQ(real->dataSize, sizeof(result));
  std::memcpy(result, real->data, sizeof(result));
  EXPECT_EQ(result[0], 0x7FA00001u);
  EXPECT_EQ(result[1], 0xFFC12345u);
}

TEST(ComplexInterpretation, LeavesTheCallersRasterAsItIs) {
  std::vector<short> samples = {1, 2, 3, 4};
  const Raster raster({2, 1, 1, DataType(eDT_16S, true)}, {},
                      reinterpret_cast<unsigned char*>(samples.data()));
  const std::unique_ptr<Raster> real = Interpret(raster);
  EXPECT_EQ(samples, (std::vector<short>{1, 2, 3, 4}));
  EXPECT_EQ(raster.dataType, DataType(eDT_16S, true));
}

TEST(ComplexInterpretation, AnEmptyRasterGivesAnEmptyOne) {
  const Raster raster({0, 0, 1, DataType(eDT_64F, true)}, {});
  EXPECT_EQ(Interpret(raster)->dataSize, 0u);
}

TEST(ComplexInterpretation, HasAVirtualDestructor) {
  static_assert(std::has_virtual_destructor_v<ComplexInterpretation>);
  static_assert(core::eINTERPRETATION_REAL == 0);
}

}  // namespace
}  // namespace orvik::tessel
