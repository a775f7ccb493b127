#include <algorithm>

#include <opencv2/core.hpp>

#include "benchmarks/peers/peers.h"

namespace orvik::bench {

namespace {

/// Rows that go through a pipeline together, so that what lies between its steps stays in the cache: the
/// fastest of the powers of two for images of 512 and 4096 columns.
constexpr int kTerrainStrip = 16;
constexpr int kMeanStrip = 64;

/// `rows` rows of a raster from the pixel (x, y) on.
template <class Pixel>
cv::Mat View(const tessel::Raster& raster, int x, int y, int rows) {
  const auto channels = static_cast<int>(raster.channels);
  const std::size_t step = std::size_t{raster.bufferWidth} * raster.channels * sizeof(Pixel);
  Pixel* const first = RowOf<Pixel>(raster, static_cast<std::size_t>(y)) + x * channels;
  return {rows, static_cast<int>(raster.width), CV_MAKETYPE(cv::DataType<Pixel>::depth, channels), first,
          step};
}

template <class Strip>
void ForEachStrip(const Workload& work, int stripRows, const Strip& strip) {
  [[maybe_unused]] static const bool serial = (cv::setNumThreads(1), true);
  const auto height = static_cast<int>(work.in->height);
  for (int y = 0; y < height; y += stripRows) strip(y, std::min(stripRows, height - y));
}

/// Differences to the right and downward: cheaper than the mean of both sides of the cell.
void Gradient(const Workload& work, int y, int rows, cv::Mat& dx, cv::Mat& dy) {
  const cv::Mat z00 = View<float>(*work.in, 0, y, rows);
  cv::subtract(View<float>(*work.in, 1, y, rows), z00, dx);
  cv::subtract(View<float>(*work.in, 0, y + 1, rows), z00, dy);
}

}  // namespace

void OpenCvSlope(const Workload& work) {
  cv::Mat dx, dy, rise;
  const cv::Mat run(kTerrainStrip, static_cast<int>(work.in->width), CV_32F, cv::Scalar(kSpacing));
  ForEachStrip(work, kTerrainStrip, [&](int y, int rows) {
    Gradient(work, y, rows, dx, dy);
    cv::magnitude(dx, dy, rise);
    cv::Mat slope = View<float>(*work.twin, 0, y, rows);
    cv::phase(run.rowRange(0, rows), rise, slope, true);
  });
}

void OpenCvAspect(const Workload& work) {
  cv::Mat dx, dy;
  ForEachStrip(work, kTerrainStrip, [&](int y, int rows) {
    Gradient(work, y, rows, dx, dy);
    cv::Mat aspect = View<float>(*work.twin, 0, y, rows);
    cv::phase(dx, dy, aspect, true);
  });
}

void OpenCvMean(const Workload& work) {
  cv::Mat mean, valid;
  const cv::Mat third(1, 3, CV_32F, cv::Scalar(1.0f / 3.0f));
  ForEachStrip(work, kMeanStrip, [&](int y, int rows) {
    const cv::Mat source = View<unsigned char>(*work.in, 0, y, rows);
    cv::transform(source, mean, third);
    cv::inRange(source, cv::Scalar::all(1), cv::Scalar::all(255), valid);
    cv::Mat target = View<unsigned char>(*work.twin, 0, y, rows);
    cv::bitwise_and(mean, valid, target);
  });
}

}  // namespace orvik::bench
