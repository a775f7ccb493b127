#include "tests/support/cases.h"

#include <algorithm>

#include <omp.h>

#include "tests/support/compare.h"

namespace orvik::tests {
namespace {

constexpr std::uint32_t kWidths[] = {0,  1,  2,  7,  8,   9,   15,  16,  17,  31,  32,
                                     33, 63, 64, 65, 127, 128, 129, 255, 256, 257, 601};
constexpr std::uint32_t kHeights[] = {1, 1, 1, 2, 3, 3, 3, 0};
constexpr std::uint32_t kChannels[] = {1, 1, 1, 2, 2, 3, 3, 3, 4, 4, 5, 7, 8, 0};
constexpr int kThreads[] = {1, 2, 7};
constexpr int kCasesOfAWidth = 5;
constexpr std::uint32_t kManyChannels[] = {127, 128, 129, 255, 256, 257, 300};
constexpr std::uint32_t kLargePixels = 33000;  // more than a parallel region is worth

Case Draw(Random& random, const Case& types, Size size, const CaseLimits& limits) {
  Case c = types;
  c.size = size;
  c.outChannels = limits.outputHasInputChannels ? size.channels + (random.OneIn(4) ? 1 : 0)
                                                : 1 + (random.OneIn(4) ? random.Below(3) : 0);
  c.in.isComplex = random.OneIn(6);
  c.inMargins = {limits.leastMargin + random.Below(4), limits.leastMargin + random.Below(3)};
  c.outMargins = {random.Below(4), random.Below(3)};
  c.maskKind = random.Pick(kMaskKinds);
  c.maskGeometry = random.OneIn(3) ? random.Pick(kMaskGeometries) : MaskGeometry::eSAME;
  c.fill = random.Pick(kFills);
  c.threads = {random.Pick(kThreads)};
  c.seed = random.Bits();
  return c;
}

/// An image that is worth a parallel region, on one thread; on each of `kThreads` if `isParallel`.
Case DrawLarge(Random& random, const Case& types, const CaseLimits& limits, bool isParallel) {
  const std::uint32_t width = 300 + random.Below(400);
  Case c = Draw(random, types, {width, kLargePixels / width + 1, 1 + random.Below(4)}, limits);
  c.threads = {1};
  if (isParallel) c.threads.assign(std::begin(kThreads), std::end(kThreads));
  return c;
}

std::vector<unsigned char> BitsOf(const Scene& scene) {
  return scene.mask ? scene.mask->bits : std::vector<unsigned char>();
}

}  // namespace

std::ostream& operator<<(std::ostream& stream, const Case& c) {
  stream << (c.in.isComplex ? "complex " : "") << NameOf(c.in) << " -> " << NameOf(c.out) << ", "
         << c.size.width << " x " << c.size.height << " x " << c.size.channels << " to " << c.outChannels
         << " channels, margins " << c.inMargins.marginX << ", " << c.inMargins.marginY << " and "
         << c.outMargins.marginX << ", " << c.outMargins.marginY << ", samples: " << NameOf(c.fill)
         << ", mask: " << NameOf(c.maskKind);
  if (c.maskKind != MaskKind::eNULL) stream << ' ' << NameOf(c.maskGeometry);
  return stream << ", seed " << c.seed;
}

std::vector<Case> CasesFrom(const PixelType& in, const CaseLimits& limits) {
  Random random(20240229 + static_cast<std::uint64_t>(in.element));
  std::vector<Case> cases;
  for (const PixelType& out : kPixelTypes) {
    Case types;
    types.in = in.element;
    types.out = out.element;
    for (const std::uint32_t width : kWidths) {
      for (int i = 0; i < kCasesOfAWidth; ++i) {
        const Size size = {width, random.Pick(kHeights),
                           std::max(limits.leastChannels, random.Pick(kChannels))};
        cases.push_back(Draw(random, types, size, limits));
      }
    }
    cases.push_back(Draw(random, types, {1 + random.Below(5), 2, random.Pick(kManyChannels)}, limits));
    cases.push_back(DrawLarge(random, types, limits, (in.element + out.element) % 3 == 0));
  }
  return cases;
}

Scene::Scene(const Case& c, std::span<const double> extra) {
  Random random(c.seed);
  in = std::make_unique<tessel::Raster>(
      tessel::RasterInfo(c.size.width, c.size.height, c.size.channels, c.in), c.inMargins);
  FillRandom(*in, c.fill, random, extra);
  mask = RandomMask(*in, c.maskKind, c.maskGeometry, random);
  out = std::make_unique<tessel::Raster>(
      tessel::RasterInfo(c.size.width, c.size.height, c.outChannels, c.out), c.outMargins);
  FillBytes(*out, (c.seed & 1) != 0 ? kSentinel : kOtherSentinel);
}

namespace details {

void SetThreads(int count) { omp_set_num_threads(count); }

::testing::AssertionResult Judge(const Case& c, int threads, const Scene& expected, const Scene& actual) {
  const ::testing::AssertionResult sameOutput = SameBits(*expected.out, *actual.out);
  if (!sameOutput) {
    return ::testing::AssertionFailure()
           << c << ", " << threads << " threads: output " << sameOutput.message();
  }
  if (Bytes(*expected.in) != Bytes(*actual.in))
    return ::testing::AssertionFailure() << c << ": the input was modified";
  if (BitsOf(expected) != BitsOf(actual))
    return ::testing::AssertionFailure() << c << ": the mask was modified";
  return ::testing::AssertionSuccess();
}

}  // namespace details
}  // namespace orvik::tests
