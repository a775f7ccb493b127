#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <iterator>
#include <vector>

#include <opencv2/core.hpp>
#include <opencv2/imgproc.hpp>

#include "benchmarks/peers/peers.h"

namespace orvik::bench {

namespace {

/// Rows that go through a pipeline together, so that what lies between its steps stays in the cache: the
/// fastest of the powers of two for images of 512 and 4096 columns.
constexpr int kTerrainStrip = 16;
constexpr int kMeanStrip = 64;
constexpr int kUnlikeDifferenceStrip = 32;
/// The same as a number of pixels, where that is the better measure of a strip.
constexpr int kDecibelsPixels = 65536;
constexpr int kNdviPixels = 32768;
constexpr int kStretchPixels = 16384;
/// Bitmaps, classes and natural colours.
constexpr int kConstantPixels = 65536;
/// Rows of the output, for 1.5 rows of the input each.
constexpr int kNearestStrip = 64;
/// A single call does best with all rows at once.
constexpr int kAllRows = 1 << 30;

/// The library's type of a pixel, for the sample types that the rows have.
int PixelType(const tessel::Raster& raster) {
  const tessel::DataType& type = raster.dataType;
  const int depth = type.isFloat ? CV_32F : type.sizeBits == 8 ? CV_8U : type.isSigned ? CV_16S : CV_16U;
  return CV_MAKETYPE(depth, static_cast<int>(raster.channels));
}

/// `rows` rows of a raster from the pixel (x, y) on.
cv::Mat View(const tessel::Raster& raster, int x, int y, int rows) {
  const int type = PixelType(raster);
  const std::size_t pixel = CV_ELEM_SIZE(type);
  const std::size_t step = raster.bufferWidth * pixel;
  unsigned char* const first = raster.data + (raster.marginY + static_cast<std::size_t>(y)) * step +
                               (raster.marginX + static_cast<std::size_t>(x)) * pixel;
  return {rows, static_cast<int>(raster.width), type, first, step};
}

template <class Strip>
void ForEachStrip(const Workload& work, int stripRows, const Strip& strip) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  const auto height = static_cast<int>(work.in->height);
  for (int y = 0; y < height; y += stripRows) strip(y, std::min(stripRows, height - y));
}

/// Differences to the right and downward: cheaper than the mean of both sides of the cell.
void Gradient(const Workload& work, int y, int rows, cv::Mat& dx, cv::Mat& dy) {
  const cv::Mat z00 = View(*work.in, 0, y, rows);
  cv::subtract(View(*work.in, 1, y, rows), z00, dx);
  cv::subtract(View(*work.in, 0, y + 1, rows), z00, dy);
}

/// The rows of a strip of so many pixels.
int RowsOf(const Workload& work, int pixels) {
  return std::max(1, pixels / static_cast<int>(work.in->width));
}

/// Rows of samples that repeat a constant for each of three channels.
struct StretchConstants {
  cv::Mat from, range, gain;

  void Prepare(int width, int rows) {
    if (from.rows == rows && from.cols == 3 * width) return;
    cv::Mat firsts(1, 3, CV_16U), ranges(1, 3, CV_16U), gains(1, 3, CV_32F);
    for (int c = 0; c < 3; ++c) {
      const float span = kStretchTo[c] - kStretchFrom[c];
      firsts.at<unsigned short>(c) = static_cast<unsigned short>(kStretchFrom[c]);
      ranges.at<unsigned short>(c) = static_cast<unsigned short>(span);
      gains.at<float>(c) = 100.0f / span;
    }
    cv::repeat(firsts, rows, width, from);
    cv::repeat(ranges, rows, width, range);
    cv::repeat(gains, rows, width, gain);
  }
};

/// A strip of one pixel, for `inRange`, `compare` and `bitwise_and`, which are slower with scalars.
struct Constant {
  cv::Mat values;

  Constant(int type, const cv::Scalar& value) : values(1, kConstantPixels, type, value) {}
  cv::Mat As(const cv::Mat& strip) const {
    return values.colRange(0, strip.rows * strip.cols).reshape(values.channels(), strip.rows);
  }
};

struct RangeConstants {
  Constant from{CV_16U, kRangeFrom};
  Constant to{CV_16U, kRangeTo};
  Constant one{CV_8U, 1.0};
};

/// The mask's bits of some rows as bytes of 0 or 1, eight at a time; a row is whole bytes.
void UnpackBits(const tessel::Mask& mask, int y, int rows, cv::Mat& valid) {
  static const auto kBytes = [] {
    std::array<std::array<unsigned char, 8>, 256> bytes{};
    for (std::size_t v = 0; v < 256; ++v)
      for (std::size_t i = 0; i < 8; ++i) bytes[v][i] = v >> (7 - i) & 1;
    return bytes;
  }();
  valid.create(rows, static_cast<int>(mask.width), CV_8U);
  const unsigned char* const bits = mask.bits.data() + static_cast<std::size_t>(y) * mask.width / 8;
  unsigned char* const bytes = valid.data;
  const std::size_t count = valid.total() / 8;
  for (std::size_t i = 0; i < count; ++i) std::memcpy(bytes + 8 * i, kBytes[bits[i]].data(), 8);
}

void Flip(const Workload& work, int axis) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  cv::Mat target = View(*work.twin, 0, 0, static_cast<int>(work.in->height));
  cv::flip(View(*work.in, 0, 0, static_cast<int>(work.in->height)), target, axis);
}

/// The counts of one channel go to a place in `twin`.
void CountSamples(const Workload& work, int channel, int bins) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  const cv::Mat image = View(*work.in, 0, 0, static_cast<int>(work.in->height));
  const float range[] = {0.0f, static_cast<float>(bins)};
  const float* ranges[] = {range};
  cv::Mat counts(bins, 1, CV_32F, RowOf<float>(*work.twin, 0) + channel * bins);
  cv::calcHist(&image, 1, &channel, cv::Mat(), counts, 1, &bins, ranges);
}

/// The bounds, the numbers and the no-data value of the classes, for one type of samples.
struct ClassConstants {
  struct Class {
    Constant from, to, number;
  };
  std::vector<Class> classes;
  Constant noData;

  explicit ClassConstants(int type) : noData(type, kClassNoData) {
    for (std::size_t k = 0; k < std::size(kClassFrom); ++k)
      classes.push_back({{type, kClassFrom[k]}, {type, kClassTo[k]}, {CV_8U, static_cast<double>(k + 1)}});
  }
};

/// The ranges of the bands' samples; background is below them.
struct ColourConstants {
  Constant from{CV_8UC3, {kBlueMin[0], kBlueMin[1], 1.0}};
  Constant to{CV_8UC3, {kBlueMax[0], kBlueMax[1], 255.0}};
};

/// The colours of a strip by one product of matrices, then the pixels whose samples leave their ranges. The
/// strips of bounds are prepared once and not counted.
void MixColours(const Workload& work, const cv::Matx34f& mix) {
  static const ColourConstants constants;
  cv::Mat colours, valid, validSamples;
  ForEachStrip(work, RowsOf(work, kConstantPixels), [&](int y, int rows) {
    const cv::Mat source = View(*work.in, 0, y, rows);
    cv::transform(source, colours, mix);
    cv::inRange(source, constants.from.As(source), constants.to.As(source), valid);
    cv::cvtColor(valid, validSamples, cv::COLOR_GRAY2BGR);
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::bitwise_and(colours, validSamples, target);
  });
}

}  // namespace

void OpenCvSlope(const Workload& work) {
  cv::Mat dx, dy, rise;
  const cv::Mat run(kTerrainStrip, static_cast<int>(work.in->width), CV_32F, cv::Scalar(kSpacing));
  ForEachStrip(work, kTerrainStrip, [&](int y, int rows) {
    Gradient(work, y, rows, dx, dy);
    cv::magnitude(dx, dy, rise);
    cv::Mat slope = View(*work.twin, 0, y, rows);
    cv::phase(run.rowRange(0, rows), rise, slope, true);
  });
}

void OpenCvAspect(const Workload& work) {
  cv::Mat dx, dy;
  ForEachStrip(work, kTerrainStrip, [&](int y, int rows) {
    Gradient(work, y, rows, dx, dy);
    cv::Mat aspect = View(*work.twin, 0, y, rows);
    cv::phase(dx, dy, aspect, true);
  });
}

void OpenCvMean(const Workload& work) {
  cv::Mat mean, valid;
  const cv::Mat third(1, 3, CV_32F, cv::Scalar(1.0f / 3.0f));
  ForEachStrip(work, kMeanStrip, [&](int y, int rows) {
    const cv::Mat source = View(*work.in, 0, y, rows);
    cv::transform(source, mean, third);
    cv::inRange(source, cv::Scalar::all(1), cv::Scalar::all(255), valid);
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::bitwise_and(mean, valid, target);
  });
}

void OpenCvDifference(const Workload& work) {
  ForEachStrip(work, kAllRows, [&](int y, int rows) {
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::absdiff(View(*work.in, 0, y, rows), View(*work.reference, 0, y, rows), target);
  });
}

/// Converted first: faster than a subtraction of unlike types with the absolute value after it.
void OpenCvUnlikeDifference(const Workload& work) {
  cv::Mat image, reference;
  ForEachStrip(work, kUnlikeDifferenceStrip, [&](int y, int rows) {
    View(*work.in, 0, y, rows).convertTo(image, CV_32F);
    View(*work.reference, 0, y, rows).convertTo(reference, CV_32F);
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::absdiff(image, reference, target);
  });
}

void OpenCvRatio(const Workload& work) {
  ForEachStrip(work, kAllRows, [&](int y, int rows) {
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::divide(View(*work.in, 0, y, rows), View(*work.reference, 0, y, rows), target, 1.0, CV_32F);
  });
}

void OpenCvCombination(const Workload& work) {
  ForEachStrip(work, kAllRows, [&](int y, int rows) {
    const cv::Mat dates[] = {View(*work.in, 0, y, rows), View(*work.reference, 0, y, rows)};
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::merge(dates, 2, target);
  });
}

/// The decibels alone, packed into the first quarter of `twin`: the ratio of the sums is that of the means,
/// which are not written, and nothing is merged to four channels. Sums of planes are faster than `transform`.
void OpenCvDecibels(const Workload& work) {
  cv::Mat image, reference;
  cv::Mat planes[3];
  const auto sum = [&planes](const cv::Mat& date, cv::Mat& total) {
    cv::split(date, planes);
    planes[0].convertTo(total, CV_32F);
    cv::accumulate(planes[1], total);
    cv::accumulate(planes[2], total);
  };
  const auto width = static_cast<int>(work.in->width);
  cv::Mat decibels(static_cast<int>(work.in->height), width, CV_32F, work.twin->data);
  ForEachStrip(work, RowsOf(work, kDecibelsPixels), [&](int y, int rows) {
    sum(View(*work.in, 0, y, rows), image);
    sum(View(*work.reference, 0, y, rows), reference);
    cv::divide(image, reference, image);
    cv::log(image, image);
    cv::Mat target = decibels.rowRange(y, y + rows);
    image.convertTo(target, CV_32F, 4.3429448190325183);
  });
}

/// Two channels taken out are faster than all four split; 0 / 0 is patched afterwards.
void OpenCvNdvi(const Workload& work) {
  cv::Mat band, red, nir, difference;
  const auto extract = [&](const cv::Mat& bands, int channel, cv::Mat& target) {
    cv::extractChannel(bands, band, channel);
    band.convertTo(target, CV_32F);
  };
  ForEachStrip(work, RowsOf(work, kNdviPixels), [&](int y, int rows) {
    extract(View(*work.in, 0, y, rows), 2, red);
    extract(View(*work.in, 0, y, rows), 3, nir);
    cv::subtract(nir, red, difference);
    cv::add(nir, red, nir);
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::divide(difference, nir, target);
    cv::patchNaNs(target);
  });
}

/// Clamped as integers, then scaled, on rows of samples beside rows of the channels' constants: faster than
/// planes, scalars or `transform`. The constants are prepared once and not counted.
void OpenCvStretch(const Workload& work) {
  static StretchConstants constants;
  const int stripRows = RowsOf(work, kStretchPixels);
  constants.Prepare(static_cast<int>(work.in->width), stripRows);
  cv::Mat above;
  ForEachStrip(work, stripRows, [&](int y, int rows) {
    cv::subtract(View(*work.in, 0, y, rows).reshape(1), constants.from.rowRange(0, rows), above);
    cv::min(above, constants.range.rowRange(0, rows), above);
    cv::Mat target = View(*work.twin, 0, y, rows).reshape(1);
    above.convertTo(target, CV_32F);
    cv::multiply(target, constants.gain.rowRange(0, rows), target);
  });
}

void OpenCvBitmap(const Workload& work) {
  static const RangeConstants constants;
  cv::Mat inside;
  ForEachStrip(work, RowsOf(work, kConstantPixels), [&](int y, int rows) {
    const cv::Mat source = View(*work.in, 0, y, rows);
    cv::inRange(source, constants.from.As(source), constants.to.As(source), inside);
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::bitwise_and(inside, constants.one.As(source), target);
  });
}

/// The mask's bits are unpacked to bytes of 0 or 1 in each call, and counted.
void OpenCvMaskedBitmap(const Workload& work) {
  static const RangeConstants constants;
  cv::Mat inside, valid;
  ForEachStrip(work, RowsOf(work, kConstantPixels), [&](int y, int rows) {
    const cv::Mat source = View(*work.in, 0, y, rows);
    cv::inRange(source, constants.from.As(source), constants.to.As(source), inside);
    UnpackBits(*work.mask, y, rows, valid);
    cv::Mat target = View(*work.twin, 0, y, rows);
    cv::bitwise_and(inside, valid, target);
  });
}

void OpenCvMirrorColumns(const Workload& work) { Flip(work, 1); }

void OpenCvMirrorRows(const Workload& work) { Flip(work, 0); }

void OpenCvSquaredGradient(const Workload& work) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  const int pairs = static_cast<int>(work.in->height) - 1;
  const cv::Mat upper = View(*work.in, 0, 0, pairs);
  const cv::Mat lower = View(*work.in, 0, 1, pairs);
  *RowOf<double>(*work.twin, 0) = cv::norm(upper, lower, cv::NORM_L2SQR);
}

/// The channels as they lie in the pixels: splitting costs more than it saves.
void OpenCvHistograms(const Workload& work) {
  for (int c = 0; c < 3; ++c) CountSamples(work, c, 256);
}

void OpenCvWideHistogram(const Workload& work) { CountSamples(work, 0, 65536); }

/// The greatest of the classes' numbers, each 0 outside its class: faster than `setTo` with a mask. Samples
/// of both types are compared faster than `inRange` takes those of 32 bits. The strips of bounds are prepared
/// once and not counted.
void OpenCvClasses(const Workload& work) {
  static const ClassConstants ofShorts(CV_16U), ofFloats(CV_32F);
  const ClassConstants& constants = work.in->dataType.isFloat ? ofFloats : ofShorts;
  cv::Mat above, inside;
  ForEachStrip(work, RowsOf(work, kConstantPixels), [&](int y, int rows) {
    const cv::Mat source = View(*work.in, 0, y, rows);
    cv::Mat target = View(*work.twin, 0, y, rows);
    target.setTo(0);
    for (const ClassConstants::Class& one : constants.classes) {
      cv::compare(source, one.from.As(source), above, cv::CMP_GT);
      cv::compare(source, one.to.As(source), inside, cv::CMP_LT);
      cv::bitwise_and(above, inside, inside);
      cv::bitwise_and(inside, one.number.As(source), inside);
      cv::max(target, inside, target);
    }
    cv::compare(source, constants.noData.As(source), inside, cv::CMP_NE);
    cv::bitwise_and(target, inside, target);
  });
}

/// Class by class, in strips that stay in the cache. `inRange` includes its bounds.
void OpenCvClassesInRange(const Workload& work) {
  const auto next = [&work](float from, float to) -> double {
    return work.in->dataType.isFloat ? std::nextafter(from, to) : from + (to > from ? 1.0f : -1.0f);
  };
  cv::Mat inside;
  ForEachStrip(work, RowsOf(work, kConstantPixels), [&](int y, int rows) {
    const cv::Mat source = View(*work.in, 0, y, rows);
    cv::Mat target = View(*work.twin, 0, y, rows);
    target.setTo(0);
    for (std::size_t k = 0; k < std::size(kClassFrom); ++k) {
      const float from = kClassFrom[k], to = kClassTo[k];
      cv::inRange(source, cv::Scalar(next(from, to)), cv::Scalar(next(to, from)), inside);
      target.setTo(static_cast<double>(k + 1), inside);
    }
    cv::inRange(source, cv::Scalar(kClassNoData), cv::Scalar(kClassNoData), inside);
    target.setTo(0, inside);
  });
}

void OpenCvConverted(const Workload& work) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  const int rows = static_cast<int>(work.twin->height);
  cv::Mat target = View(*work.twin, 0, 0, rows);
  View(*work.in, 0, 0, rows).convertTo(target, CV_32F);
}

void OpenCvNearest(const Workload& work) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  cv::Mat target = View(*work.twin, 0, 0, static_cast<int>(work.twin->height));
  cv::resize(View(*work.in, 0, 0, static_cast<int>(work.in->height)), target, target.size(), 0.0, 0.0,
             cv::INTER_NEAREST);
}

/// From 1.5 rows to one, then to the output's type.
void OpenCvConvertedNearest(const Workload& work) {
  cv::Mat nearest;
  ForEachStrip(work, kNearestStrip * 3 / 2, [&](int y, int rows) {
    cv::Mat target = View(*work.twin, 0, y * 2 / 3, rows * 2 / 3);
    cv::resize(View(*work.in, 0, y, rows), nearest, target.size(), 0.0, 0.0, cv::INTER_NEAREST);
    nearest.convertTo(target, CV_32F);
  });
}

void OpenCvNaturalColour(const Workload& work) {
  MixColours(work, {0.0f, 1.0f, 0.0f, 0.0f,  //
                    1.0f, 0.0f, 0.0f, 0.0f,  //
                    0.873393f, -0.138254f, -0.100616f, 13.9054f});
}

void OpenCvTrimmedNaturalColour(const Workload& work) {
  const auto [green, red, blue] = kBlueScale;
  MixColours(work, {0.0f, red, 0.0f, -kBlueMin[1] * red,      //
                    green, 0.0f, 0.0f, -kBlueMin[0] * green,  //
                    0.873393f * blue, -0.138254f * blue, -0.100616f * blue, (13.9054f - kBlueMin[2]) * blue});
}

}  // namespace orvik::bench
