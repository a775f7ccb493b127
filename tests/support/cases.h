#pragma once

#include <cstdint>
#include <memory>
#include <ostream>
#include <span>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"
#include "tests/support/images.h"
#include "tests/support/masks.h"
#include "tests/support/pixeltypes.h"
#include "tests/support/random.h"

namespace orvik::tests {

/// What the cases of one operator have in common.
struct CaseLimits {
  std::uint32_t leastMargin = 0;        ///< of the input
  std::uint32_t leastChannels = 0;      ///< of the input
  bool outputHasInputChannels = false;  ///< else the output has one channel or a few
};

/// One run of an operator from one raster to another. All that is random in it follows from the fields.
struct Case {
  tessel::DataType in;
  tessel::DataType out;
  Size size;  ///< of the input
  std::uint32_t outChannels = 1;
  tessel::RasterContext inMargins;
  tessel::RasterContext outMargins;
  MaskKind maskKind = MaskKind::eNULL;
  MaskGeometry maskGeometry = MaskGeometry::eSAME;
  Fill fill = Fill::eBITS;
  std::vector<int> threads = {1};
  std::uint64_t seed = 0;  ///< of the samples, the mask bits and the parameters
};

std::ostream& operator<<(std::ostream& stream, const Case& c);

/// The cases of one input type: all output types, widths around the lane counts, a pixel of many channels and
/// images that are worth a parallel region; the rest is drawn.
std::vector<Case> CasesFrom(const PixelType& in, const CaseLimits& limits);

/// The rasters and the mask of a case, the output full of sentinels.
struct Scene {
  std::unique_ptr<tessel::Raster> in;
  std::unique_ptr<tessel::Mask> mask;
  std::unique_ptr<tessel::Raster> out;

  /// @param extra  values that some samples take
  Scene(const Case& c, std::span<const double> extra);
};

/// Compares an operator with its twin on one case, for each number of threads: the same bits in the whole
/// output buffer, the input, its margins and the mask as they were.
///
/// @param process  void(Raster* in, Mask* mask, Raster* out)
/// @param twin     void(const Raster& in, const Mask* mask, Raster& out)
template <class Process, class Twin>
::testing::AssertionResult Agree(const Case& c, std::span<const double> extra, Process process, Twin twin);

namespace details {

void SetThreads(int count);
::testing::AssertionResult Judge(const Case& c, int threads, const Scene& expected, const Scene& actual);

}  // namespace details

template <class Process, class Twin>
::testing::AssertionResult Agree(const Case& c, std::span<const double> extra, Process process, Twin twin) {
  const Scene expected(c, extra);
  twin(*expected.in, expected.mask.get(), *expected.out);
  for (const int threads : c.threads) {
    const Scene actual(c, extra);
    details::SetThreads(threads);
    process(actual.in.get(), actual.mask.get(), actual.out.get());
    ::testing::AssertionResult result = details::Judge(c, threads, expected, actual);
    if (!result) return result;
  }
  return ::testing::AssertionSuccess();
}

}  // namespace orvik::tests
