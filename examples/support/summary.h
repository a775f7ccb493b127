#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "gdal.h"
#include "quantity.h"

namespace examples {

/// The figures of a band, in the unit of its quantity.
struct Summary {
  std::uint64_t pixels = 0;
  std::uint64_t valid = 0;
  std::uint64_t flat = 0;  ///< valid pixels that have no direction; not in the figures below
  double min = 0.0;
  double mean = 0.0;  ///< of directions: the direction of their sum, from 0 to 360
  double max = 0.0;
  std::vector<std::uint64_t> classes = {};  ///< pixels of each class
};

Summary Summarise(GDALRasterBand& band, const Quantity& quantity);

/// "min 0.0, mean 2.1, max 11.3 degrees, 12321 of 12321 pixels valid"
std::string Describe(const Summary& summary, const Quantity& quantity);

/// A line for each class of the quantity, with its pixels and its share of those that are in a class.
std::string DescribeClasses(const Summary& summary, const Quantity& quantity);

}  // namespace examples
