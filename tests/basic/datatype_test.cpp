#include "basic/tessel/datatype.h"

#include <cstdint>
#include <vector>

#include <gtest/gtest.h>

namespace orvik::tessel {
namespace {

struct Row {
  ElementType element;
  std::uint32_t sizeBits;
  bool isSigned;
  bool isFloat;
  std::uint32_t mantissaBits;
  std::uint32_t exponentBits;
};

const std::vector<Row> kTable = {
    {eDT_BIT, 1, false, false, 1, 0},   {eDT_8S, 8, true, false, 8, 0},     {eDT_8U, 8, false, false, 8, 0},
    {eDT_16S, 16, true, false, 16, 0},  {eDT_16U, 16, false, false, 16, 0}, {eDT_32S, 32, true, false, 32, 0},
    {eDT_32U, 32, false, false, 32, 0}, {eDT_32F, 32, true, true, 23, 8},   {eDT_64F, 64, true, true, 52, 11},
    {eDT_64S, 64, true, false, 64, 0},  {eDT_64U, 64, false, false, 64, 0},
};

// ---- golden

TEST(DataType, EveryElementTypeHasTheFieldsOfItsRow) {
  for (const Row& row : kTable) {
    for (const bool complex : {false, true}) {
      const DataType type(row.element, complex);
      EXPECT_EQ(type.sizeBits, row.sizeBits) << row.element;
      EXPECT_EQ(type.isSigned, row.isSigned) << row.element;
      EXPECT_EQ(type.isFloat, row.isFloat) << row.element;
      EXPECT_EQ(type.mantissaBits, row.mantissaBits) << row.element;
      EXPECT_EQ(type.exponentBits, row.exponentBits) << row.element;
      EXPECT_EQ(type.isComplex, complex) << row.element;
    }
  }
}

template <class Pixel>
void ExpectPixelType(ElementType element) {
  EXPECT_EQ(DataType::Of<Pixel>(), DataType(element)) << element;
  EXPECT_EQ(DataType::Of<Pixel>(true), DataType(element, true)) << element;
}

TEST(DataType, EveryPixelTypeHasItsElementType) {
  ExpectPixelType<char>(eDT_8S);
  ExpectPixelType<unsigned char>(eDT_8U);
  ExpectPixelType<short>(eDT_16S);
  ExpectPixelType<unsigned short>(eDT_16U);
  ExpectPixelType<int>(eDT_32S);
  ExpectPixelType<unsigned int>(eDT_32U);
  ExpectPixelType<float>(eDT_32F);
  ExpectPixelType<double>(eDT_64F);
  ExpectPixelType<std::int64_t>(eDT_64S);
  ExpectPixelType<std::uint64_t>(eDT_64U);
}

TEST(DataType, ADefaultValueHasAllFieldsZero) {
  const DataType type;
  EXPECT_EQ(type.sizeBits, 0u);
  EXPECT_FALSE(type.isSigned);
  EXPECT_FALSE(type.isFloat);
  EXPECT_EQ(type.mantissaBits, 0u);
  EXPECT_EQ(type.exponentBits, 0u);
  EXPECT_FALSE(type.isComplex);
}

TEST(DataType, ADefaultValueEqualsNoElementType) {
  for (const Row& row : kTable) {
    EXPECT_NE(DataType(), DataType(row.element));
    EXPECT_NE(DataType(), DataType(row.element, true));
  }
}

TEST(DataType, TwoElementTypesAreNeverEqual) {
  for (const Row& a : kTable) {
    for (const Row& b : kTable) EXPECT_EQ(DataType(a.element) == DataType(b.element), a.element == b.element);
    EXPECT_NE(DataType(a.element), DataType(a.element, true));
  }
}

TEST(DataType, EachOfTheSixFieldsAloneMakesADifference) {
  const DataType type = eDT_32F;
  std::vector<DataType> others(6, type);
  others[0].sizeBits = 64;
  others[1].isSigned = false;
  others[2].isFloat = false;
  others[3].mantissaBits = 24;
  others[4].exponentBits = 9;
  others[5].isComplex = true;
  for (const DataType& other : others) {
    EXPECT_FALSE(type == other);
    EXPECT_TRUE(type != other);
  }
}

TEST(DataType, AValueOutsideTheElementTypesHasNoFieldSet) {
  EXPECT_EQ(DataType(static_cast<ElementType>(11)), DataType());
}

}  // namespace
}  // namespace orvik::tessel
