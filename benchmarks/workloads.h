#pragma once

#include <any>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "basic/tessel/mask/mask.h"
#include "basic/tessel/raster.h"

namespace orvik::bench {

/// Counts of the samples other than 0 in bins of equal width, for each channel, from its least to its
/// greatest.
struct Histogram {
  int bins = 0;
  std::vector<float> minimum;
  std::vector<float> maximum;
  std::vector<int> counts;  ///< of bin i of channel c at `bins` c + i
};

/// What the contestants of a row work on. They read `in`, `reference` and `mask`; gridmill writes `out`, all
/// others `twin`.
struct Workload {
  std::unique_ptr<tessel::Raster> in;
  std::unique_ptr<tessel::Raster> reference;  ///< null: the job has one input
  std::unique_ptr<tessel::Mask> mask;         ///< null: every pixel is valid
  std::unique_ptr<tessel::Raster> out;
  std::unique_ptr<tessel::Raster> twin;
  Histogram histogram;        ///< of `in`; empty: the job needs none
  std::size_t untouched = 0;  ///< bytes of `in` and `out` that a pass has no need to move
  mutable std::any kept;      ///< what gridmill keeps from call to call; empty before the first
  mutable std::any keptTwin;  ///< the same of the naive twin

  /// Bytes that a pass has to move: the image areas of inputs and output, and the mask's bits.
  std::size_t BytesMoved() const;
};

using WorkloadMaker = Workload (*)(std::uint32_t size);

/// Half of the pixels valid, each by a toss, or in runs of 64 to 575 pixels.
enum class MaskPattern { kNone, kRandom, kRuns };

/// The distance of two neighbouring elevations, in the elevations' unit.
inline constexpr float kSpacing = 10.0f;

/// The range of a channel of `Scene` that is stretched from 0 to 100, a tenth of the samples beyond each end.
inline constexpr float kStretchFrom[] = {13000.0f, 12500.0f, 12000.0f};
inline constexpr float kStretchTo[] = {21000.0f, 21500.0f, 22000.0f};

/// Half of the samples of `Speckle`, from field to field and from pixel to pixel.
inline constexpr float kRangeFrom = 13500.0f;
inline constexpr float kRangeTo = 20500.0f;

/// Eight classes over the samples of `Scene`: three pairs overlap, the others share a bound. No-data is rare.
inline constexpr float kClassFrom[] = {5000, 9000, 12000, 14000, 16500, 18500, 21000, 24000};
inline constexpr float kClassTo[] = {9000, 12000, 14500, 17000, 18500, 21500, 24000, 32000};
inline constexpr float kClassNoData = 17000.0f;

/// The ranges of green, red and blue that all but a few pixels in a hundred of `Scene` in 8 bits keep within,
/// the factors that stretch them to 255, and the scene's own background, a tenth of the image.
inline constexpr float kBlueMin[] = {60.0f, 72.0f, 48.0f};
inline constexpr float kBlueMax[] = {204.0f, 193.0f, 148.0f};
inline constexpr float kBlueScale[] = {255.0f / 144.0f, 255.0f / 121.0f, 255.0f / 100.0f};
inline constexpr float kBlueBackground[] = {0.0f, 0.0f, 0.0f};

/// Hills of three wavelengths with a little noise, slopes from 0 to 60 degrees, and a margin of 1. The output
/// has as many channels.
template <class In, class Out, std::uint32_t channels, MaskPattern pattern = MaskPattern::kNone>
Workload Elevations(std::uint32_t size);

/// A textured scene with a slanting collar of no-data (0), a tenth of the image, and scattered samples of
/// no-data. The output has one channel.
template <class In, class Out, std::uint32_t channels, MaskPattern pattern = MaskPattern::kNone>
Workload Bands(std::uint32_t size);

/// Two dates of a textured scene: the same surfaces and texture, an eighth of the fields brighter in the
/// reference, sensor noise, and samples of no-data (0) as in `Bands`.
template <class In, class Ref, class Out, std::uint32_t channels, std::uint32_t outChannels,
          MaskPattern pattern = MaskPattern::kNone>
Workload Dates(std::uint32_t size);

/// A scene in correlated bands: waves that all bands share, weaker ones of each band's own and a little
/// noise, from about 5000 to 30000, of 8 bits the 128th part. No-data (0) as in `Bands`.
template <class In, class Out, std::uint32_t channels, std::uint32_t outChannels>
Workload Scene(std::uint32_t size);

/// The same with a histogram of 256 bins.
template <class In, class Out, std::uint32_t channels, std::uint32_t outChannels>
Workload RankedScene(std::uint32_t size);

/// The same scene for jobs that give sums: the output is one pixel of `sums` doubles.
template <class In, std::uint32_t channels, std::uint32_t sums>
Workload SummedScene(std::uint32_t size);

/// The same scene for jobs that count samples: the output is, for each channel, one `int` for each of `bins`
/// bins behind two for minimum and maximum. No call has to write it.
template <class In, std::uint32_t channels, std::uint32_t bins>
Workload CountedScene(std::uint32_t size);

/// The same scene for jobs that change the scale: `from` input pixels along each axis for `to` of the output,
/// whose edge is `size`.
template <class In, class Out, std::uint32_t channels, std::uint32_t from, std::uint32_t to>
Workload ScaledScene(std::uint32_t size);

/// Noise from 10000 to 24000 on waves of up to 5000, in one channel.
template <class In, class Out, MaskPattern pattern = MaskPattern::kNone>
Workload Speckle(std::uint32_t size);

/// The bit of pixel (x, y), tested as the text-book has it.
inline bool IsValid(const tessel::Mask& mask, std::size_t x, std::size_t y) {
  const std::size_t bit = (mask.marginY + y) * mask.bufferWidth + mask.marginX + x;
  return (mask.bits[bit >> 3] >> (7 - (bit & 7)) & 1) != 0;
}

/// A value as a byte: rounded and clamped.
template <class Value>
unsigned char ToByte(Value value) {
  const Value rounded = value + Value{0.5};
  if (rounded >= Value{255}) return 255;
  if (rounded <= Value{0}) return 0;
  return static_cast<unsigned char>(rounded);
}

/// Sample 0 of pixel (0, y) of a raster whose type is known.
template <class Pixel>
Pixel* RowOf(const tessel::Raster& raster, std::size_t y) {
  const std::size_t pixel = (raster.marginY + y) * raster.bufferWidth + raster.marginX;
  return reinterpret_cast<Pixel*>(raster.data) + pixel * raster.channels;
}

}  // namespace orvik::bench
