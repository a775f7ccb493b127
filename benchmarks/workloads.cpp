#include "benchmarks/workloads.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <random>
#include <vector>

namespace orvik::bench {

namespace {

using Random = std::mt19937;

/// A number from -1 to 1.
float Noise(Random& random) { return static_cast<float>(random()) * 0x1p-31f - 1.0f; }

struct Wave {
  float pixels;  // the wavelength
  float height;
};

/// Waves along both axes, each the product of a sine of x and one of y.
class Surface {
 public:
  Surface(std::uint32_t size, float phase) : size_(size) {
    for (const Wave& wave : kWaves) {
      const float frequency = 6.2831853f / wave.pixels;
      for (std::uint32_t i = 0; i < size; ++i)
        alongX_.push_back(wave.height * std::sin(frequency * static_cast<float>(i) + phase));
      for (std::uint32_t i = 0; i < size; ++i)
        alongY_.push_back(std::sin(frequency * static_cast<float>(i) + 2.0f * phase));
    }
  }

  float At(std::size_t x, std::size_t y) const {
    float sum = 0.0f;
    for (std::size_t k = 0; k < kWaves.size(); ++k) sum += alongX_[k * size_ + x] * alongY_[k * size_ + y];
    return sum;
  }

 private:
  static constexpr std::array<Wave, 3> kWaves{{{401.0f, 300.0f}, {61.0f, 50.0f}, {17.0f, 8.0f}}};

  std::size_t size_;
  std::vector<float> alongX_;
  std::vector<float> alongY_;
};

std::vector<Surface> SurfacesFor(const tessel::Raster& raster) {
  std::vector<Surface> surfaces;
  for (std::uint32_t c = 0; c < raster.channels; ++c)
    surfaces.emplace_back(raster.bufferWidth, 0.7f + static_cast<float>(c));
  return surfaces;
}

/// `sample(x, y, c)` of the whole buffer, margins included.
template <class Pixel, class Sample>
void Fill(tessel::Raster& raster, const Sample& sample) {
  Pixel* element = reinterpret_cast<Pixel*>(raster.data);
  for (std::size_t y = 0; y < raster.bufferHeight; ++y)
    for (std::size_t x = 0; x < raster.bufferWidth; ++x)
      for (std::size_t c = 0; c < raster.channels; ++c) *element++ = static_cast<Pixel>(sample(x, y, c));
}

std::unique_ptr<tessel::Mask> MakeMask(const tessel::Raster& raster, MaskPattern pattern) {
  if (pattern == MaskPattern::kNone) return nullptr;
  auto mask = std::make_unique<tessel::Mask>(raster.width, raster.height, raster, false);
  const std::size_t pixels = std::size_t{mask->bufferWidth} * mask->bufferHeight;
  Random random(2);
  bool valid = false;
  std::size_t runEnd = 0;
  for (std::size_t bit = 0; bit < pixels; ++bit) {
    if (pattern == MaskPattern::kRandom) {
      valid = (random() >> 31) != 0;
    } else if (bit == runEnd) {
      valid = !valid;
      runEnd += 64 + random() % 512;
    }
    if (valid) mask->bits[bit >> 3] |= static_cast<unsigned char>(0x80 >> (bit & 7));
  }
  return mask;
}

std::size_t ImageBytes(const tessel::Raster& raster) {
  return std::size_t{raster.width} * raster.height * raster.channels * (raster.dataType.sizeBits / 8);
}

bool IsInCollar(std::size_t x, std::size_t y, std::size_t size) { return 20 * x + 2 * y < 3 * size; }

/// How much brighter a field of 64 x 64 pixels is at the second date.
float Change(std::size_t x, std::size_t y) { return (5 * (x / 64) + 3 * (y / 64)) % 8 == 0 ? 30.0f : 0.0f; }

template <class Pixel>
void FillDate(tessel::Raster& raster, bool second) {
  const std::vector<Surface> surfaces = SurfacesFor(raster);
  const float gain = sizeof(Pixel) == 1 ? 1.0f : 40.0f;
  Random texture(1);
  Random sensor(second ? 4 : 3);
  Fill<Pixel>(raster, [&](std::size_t x, std::size_t y, std::size_t c) {
    const float scene = 100.0f + 0.25f * surfaces[c].At(x, y) + 20.0f * Noise(texture);
    const float sample = gain * (scene + (second ? Change(x, y) : 0.0f) + 5.0f * Noise(sensor));
    const bool dead = IsInCollar(x, y, raster.width) || sensor() % 4096 == 0;
    return dead ? 0.0f : std::fmax(sample, 1.0f);
  });
}

template <class Pixel>
void FillScene(tessel::Raster& raster) {
  const Surface shared(raster.bufferWidth, 0.3f);
  const std::vector<Surface> own = SurfacesFor(raster);
  const float gain = sizeof(Pixel) == 1 ? 0x1p-7f : 1.0f;
  Random random(1);
  bool dead = false;
  Fill<Pixel>(raster, [&](std::size_t x, std::size_t y, std::size_t c) {
    if (c == 0) dead = IsInCollar(x, y, raster.width) || random() % 4096 == 0;
    const float sample =
        17000.0f + 23.0f * shared.At(x, y) + 6.0f * own[c].At(x, y) + 1500.0f * Noise(random);
    return dead ? 0.0f : gain * sample;
  });
}

/// `use(sample, c)` for each sample other than 0.
template <class Pixel, class Use>
void ForEachSample(const tessel::Raster& raster, const Use& use) {
  const Pixel* element = reinterpret_cast<const Pixel*>(raster.data);
  for (std::size_t pixel = 0; pixel < std::size_t{raster.bufferWidth} * raster.bufferHeight; ++pixel)
    for (std::size_t c = 0; c < raster.channels; ++c, ++element)
      if (*element != Pixel{0}) use(static_cast<float>(*element), c);
}

template <class Pixel>
Histogram HistogramOf(const tessel::Raster& raster, int bins) {
  Histogram histogram;
  histogram.bins = bins;
  histogram.minimum.assign(raster.channels, 1e9f);
  histogram.maximum.assign(raster.channels, 0.0f);
  ForEachSample<Pixel>(raster, [&](float sample, std::size_t c) {
    histogram.minimum[c] = std::fmin(histogram.minimum[c], sample);
    histogram.maximum[c] = std::fmax(histogram.maximum[c], sample);
  });
  histogram.counts.assign(raster.channels * static_cast<std::size_t>(bins), 0);
  ForEachSample<Pixel>(raster, [&](float sample, std::size_t c) {
    const float scale = static_cast<float>(bins) / (histogram.maximum[c] - histogram.minimum[c]);
    const int bin = std::min(static_cast<int>((sample - histogram.minimum[c]) * scale), bins - 1);
    ++histogram.counts[c * static_cast<std::size_t>(bins) + static_cast<std::size_t>(bin)];
  });
  return histogram;
}

template <class In, class Out>
Workload MakeWorkload(std::uint32_t size, std::uint32_t inChannels, std::uint32_t outChannels,
                      std::uint32_t margin, MaskPattern pattern) {
  const tessel::RasterInfo inInfo(size, size, inChannels, tessel::DataType::Of<In>());
  const tessel::RasterInfo outInfo(size, size, outChannels, tessel::DataType::Of<Out>());
  Workload workload;
  workload.in = std::make_unique<tessel::Raster>(inInfo, tessel::RasterContext(margin, margin));
  workload.mask = MakeMask(*workload.in, pattern);
  workload.out = std::make_unique<tessel::Raster>(outInfo, tessel::RasterContext());
  workload.twin = std::make_unique<tessel::Raster>(outInfo, tessel::RasterContext());
  return workload;
}

template <class In>
Workload MakeScene(const tessel::RasterInfo& inInfo, const tessel::RasterInfo& outInfo) {
  Workload workload;
  workload.in = std::make_unique<tessel::Raster>(inInfo, tessel::RasterContext());
  workload.out = std::make_unique<tessel::Raster>(outInfo, tessel::RasterContext());
  workload.twin = std::make_unique<tessel::Raster>(outInfo, tessel::RasterContext());
  FillScene<In>(*workload.in);
  return workload;
}

}  // namespace

std::size_t Workload::BytesMoved() const {
  return ImageBytes(*in) + (reference != nullptr ? ImageBytes(*reference) : 0) + ImageBytes(*out) +
         (mask != nullptr ? mask->bits.size() : 0) - untouched;
}

template <class In, class Out, std::uint32_t channels, MaskPattern pattern>
Workload Elevations(std::uint32_t size) {
  Workload workload = MakeWorkload<In, Out>(size, channels, channels, 1, pattern);
  const std::vector<Surface> surfaces = SurfacesFor(*workload.in);
  Random random(1);
  Fill<In>(*workload.in, [&](std::size_t x, std::size_t y, std::size_t c) {
    return 1000.0f + surfaces[c].At(x, y) + Noise(random);
  });
  return workload;
}

template <class In, class Out, std::uint32_t channels, MaskPattern pattern>
Workload Bands(std::uint32_t size) {
  Workload workload = MakeWorkload<In, Out>(size, channels, 1, 0, pattern);
  const std::vector<Surface> surfaces = SurfacesFor(*workload.in);
  const float gain = sizeof(In) == 1 ? 1.0f : 40.0f;
  Random random(1);
  Fill<In>(*workload.in, [&](std::size_t x, std::size_t y, std::size_t c) {
    const float sample = gain * (128.0f + 0.25f * surfaces[c].At(x, y) + 30.0f * Noise(random));
    return IsInCollar(x, y, size) || random() % 4096 == 0 ? 0.0f : std::fmax(sample, 1.0f);
  });
  return workload;
}

template <class In, class Ref, class Out, std::uint32_t channels, std::uint32_t outChannels,
          MaskPattern pattern>
Workload Dates(std::uint32_t size) {
  Workload workload = MakeWorkload<In, Out>(size, channels, outChannels, 0, pattern);
  const tessel::RasterInfo info(size, size, channels, tessel::DataType::Of<Ref>());
  workload.reference = std::make_unique<tessel::Raster>(info, tessel::RasterContext());
  FillDate<In>(*workload.in, false);
  FillDate<Ref>(*workload.reference, true);
  return workload;
}

template <class In, class Out, std::uint32_t channels, std::uint32_t outChannels>
Workload Scene(std::uint32_t size) {
  Workload workload = MakeWorkload<In, Out>(size, channels, outChannels, 0, MaskPattern::kNone);
  FillScene<In>(*workload.in);
  return workload;
}

template <class In, class Out, std::uint32_t channels, std::uint32_t outChannels>
Workload RankedScene(std::uint32_t size) {
  Workload workload = Scene<In, Out, channels, outChannels>(size);
  workload.histogram = HistogramOf<In>(*workload.in, 256);
  return workload;
}

template <class In, std::uint32_t channels, std::uint32_t sums>
Workload SummedScene(std::uint32_t size) {
  return MakeScene<In>({size, size, channels, tessel::DataType::Of<In>()},
                       {1, 1, sums, tessel::DataType::Of<double>()});
}

template <class In, std::uint32_t channels, std::uint32_t bins>
Workload CountedScene(std::uint32_t size) {
  Workload workload = MakeScene<In>({size, size, channels, tessel::DataType::Of<In>()},
                                    {1, 1, channels * (2 + bins), tessel::DataType::Of<int>()});
  workload.untouched = ImageBytes(*workload.out);
  return workload;
}

template <class In, class Out, std::uint32_t channels, std::uint32_t from, std::uint32_t to>
Workload ScaledScene(std::uint32_t size) {
  const std::uint32_t inSize = size * from / to;
  Workload workload = MakeScene<In>({inSize, inSize, channels, tessel::DataType::Of<In>()},
                                    {size, size, channels, tessel::DataType::Of<Out>()});
  const std::uint32_t skippedRows = inSize > size ? inSize - size : 0;
  workload.untouched = ImageBytes(*workload.in) / inSize * skippedRows;
  return workload;
}

template <class In, class Out, MaskPattern pattern>
Workload Speckle(std::uint32_t size) {
  Workload workload = MakeWorkload<In, Out>(size, 1, 1, 0, pattern);
  const Surface surface(size, 0.3f);
  Random random(1);
  Fill<In>(*workload.in, [&](std::size_t x, std::size_t y, std::size_t) {
    return 17000.0f + 14.0f * surface.At(x, y) + 7000.0f * Noise(random);
  });
  return workload;
}

template Workload Elevations<float, float, 1, MaskPattern::kNone>(std::uint32_t);
template Workload Elevations<float, float, 3, MaskPattern::kRandom>(std::uint32_t);
template Workload Elevations<float, float, 3, MaskPattern::kRuns>(std::uint32_t);
template Workload Elevations<short, unsigned char, 1, MaskPattern::kNone>(std::uint32_t);
template Workload Bands<unsigned char, unsigned char, 3, MaskPattern::kNone>(std::uint32_t);
template Workload Bands<unsigned char, unsigned char, 3, MaskPattern::kRandom>(std::uint32_t);
template Workload Bands<unsigned char, unsigned char, 3, MaskPattern::kRuns>(std::uint32_t);
template Workload Bands<unsigned short, float, 4, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned char, unsigned char, unsigned char, 3, 3, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned char, unsigned char, unsigned char, 3, 3, MaskPattern::kRandom>(
    std::uint32_t);
template Workload Dates<unsigned char, unsigned char, unsigned char, 3, 3, MaskPattern::kRuns>(std::uint32_t);
template Workload Dates<unsigned char, unsigned char, unsigned char, 3, 6, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned char, unsigned char, float, 3, 3, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned char, unsigned char, float, 3, 4, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned short, unsigned short, unsigned short, 4, 4, MaskPattern::kNone>(
    std::uint32_t);
template Workload Dates<unsigned short, unsigned short, float, 4, 3, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned short, unsigned short, float, 4, 4, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<unsigned short, unsigned short, float, 6, 3, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<short, unsigned short, float, 1, 1, MaskPattern::kNone>(std::uint32_t);
template Workload Dates<float, float, float, 1, 1, MaskPattern::kNone>(std::uint32_t);
template Workload Scene<unsigned char, unsigned char, 3, 3>(std::uint32_t);
template Workload Scene<unsigned short, unsigned char, 1, 1>(std::uint32_t);
template Workload Scene<unsigned short, float, 1, 1>(std::uint32_t);
template Workload Scene<unsigned short, float, 3, 3>(std::uint32_t);
template Workload Scene<unsigned short, float, 4, 1>(std::uint32_t);
template Workload Scene<unsigned short, float, 7, 12>(std::uint32_t);
template Workload Scene<float, unsigned char, 1, 1>(std::uint32_t);
template Workload Scene<float, float, 1, 1>(std::uint32_t);
template Workload RankedScene<unsigned short, unsigned char, 3, 3>(std::uint32_t);
template Workload RankedScene<float, float, 1, 1>(std::uint32_t);
template Workload RankedScene<float, float, 3, 4>(std::uint32_t);
template Workload SummedScene<unsigned char, 1, 1>(std::uint32_t);
template Workload SummedScene<unsigned char, 1, 2>(std::uint32_t);
template Workload SummedScene<unsigned short, 1, 2>(std::uint32_t);
template Workload SummedScene<float, 1, 1>(std::uint32_t);
template Workload SummedScene<float, 1, 2>(std::uint32_t);
template Workload SummedScene<float, 4, 4>(std::uint32_t);
template Workload SummedScene<float, 4, 8>(std::uint32_t);
template Workload CountedScene<unsigned char, 3, 256>(std::uint32_t);
template Workload CountedScene<unsigned short, 1, 65536>(std::uint32_t);
template Workload ScaledScene<unsigned char, unsigned char, 3, 1, 2>(std::uint32_t);
template Workload ScaledScene<unsigned short, unsigned short, 4, 3, 2>(std::uint32_t);
template Workload ScaledScene<unsigned short, float, 4, 3, 2>(std::uint32_t);
template Workload Speckle<unsigned short, unsigned char, MaskPattern::kNone>(std::uint32_t);
template Workload Speckle<unsigned short, unsigned char, MaskPattern::kRandom>(std::uint32_t);
template Workload Speckle<unsigned short, unsigned char, MaskPattern::kRuns>(std::uint32_t);

}  // namespace orvik::bench
