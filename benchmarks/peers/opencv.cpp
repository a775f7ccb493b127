#include <algorithm>

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
  ForEachStrip(work, std::max(1, kDecibelsPixels / width), [&](int y, int rows) {
    sum(View(*work.in, 0, y, rows), image);
    sum(View(*work.reference, 0, y, rows), reference);
    cv::divide(image, reference, image);
    cv::log(image, image);
    cv::Mat target = decibels.rowRange(y, y + rows);
    image.convertTo(target, CV_32F, 4.3429448190325183);
  });
}

}  // namespace orvik::bench
