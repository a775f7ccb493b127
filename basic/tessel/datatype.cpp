#include "basic/tessel/datatype.h"

namespace orvik::tessel {

namespace {

DataType BitType() {
  DataType type;
  type.sizeBits = 1;
  type.mantissaBits = 1;
  return type;
}

DataType PlainType(ElementType element) {
  switch (element) {
    case eDT_BIT:
      return BitType();
    case eDT_8S:
      return DataType::Of<char>();
    case eDT_8U:
      return DataType::Of<unsigned char>();
    case eDT_16S:
      return DataType::Of<short>();
    case eDT_16U:
      return DataType::Of<unsigned short>();
    case eDT_32S:
      return DataType::Of<int>();
    case eDT_32U:
      return DataType::Of<unsigned int>();
    case eDT_32F:
      return DataType::Of<float>();
    case eDT_64F:
      return DataType::Of<double>();
    case eDT_64S:
      return DataType::Of<std::int64_t>();
    case eDT_64U:
      return DataType::Of<std::uint64_t>();
  }
  return DataType();
}

}  // namespace

DataType::DataType(ElementType element, bool complex) : DataType(PlainType(element)) { isComplex = complex; }

}  // namespace orvik::tessel
