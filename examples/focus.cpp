// How sharp a scene is, before and after a blur: focus scene.tif --blur 1,2 --png focus.png

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <limits>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

#include "processes/gridmill/sqrgradient.h"
#include "processes/gridmill/vollath.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/pendingfile.h"
#include "support/picture.h"
#include "support/tiles.h"

namespace {

using examples::Refusal;
using orvik::tessel::Raster;

struct FocusOptions {
  std::string input;
  std::vector<int> bands;
  std::vector<int> blur = {1, 2};
  std::string png;
  std::string title;
};

// Marks a pixel without data. The operators' own masks count the pixels of a row and not their places, so
// that a hole would shift the rest of its row.
constexpr double hole = std::numeric_limits<double>::lowest();

// One band of the whole image.
struct Image {
  std::size_t width;
  std::size_t height;
  std::vector<double> samples;
};

Image ReadImage(GDALDataset& input, int band) {
  const auto width = static_cast<std::uint32_t>(input.GetRasterXSize());
  const auto height = static_cast<std::uint32_t>(input.GetRasterYSize());
  const examples::TileReader reader({.dataset = input, .bands = {band}, .type = GDT_Float64}, 0,
                                    std::max(width, height));
  const examples::LoadedTile tile = reader.Read({0, 0, width, height});
  const auto* samples = reinterpret_cast<const double*>(tile.raster->data);
  Image image{width, height, {samples, samples + static_cast<std::size_t>(width) * height}};
  if (!tile.mask) return image;
  std::size_t i = 0;
  for (std::uint32_t y = 0; y < height; ++y)
    for (std::uint32_t x = 0; x < width; ++x, ++i)
      if (!tile.mask->IsValid(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y)))
        image.samples[i] = hole;
  return image;
}

// Adds up the window of 2 `radius` + 1 values around each of `count` values that lie `step` apart, as far as
// there are some.
void SumAlong(const double* from, double* to, std::size_t count, std::size_t step, std::size_t radius) {
  for (std::size_t i = 0; i < count; ++i) {
    const std::size_t first = i - std::min(i, radius), last = std::min(i + radius, count - 1);
    double sum = 0.0;
    for (std::size_t k = first; k <= last; ++k) sum += from[k * step];
    to[i * step] = sum;
  }
}

std::vector<double> BoxSums(const Image& image, std::vector<double> values, std::size_t radius) {
  std::vector<double> along(values.size());
  for (std::size_t y = 0; y < image.height; ++y)
    SumAlong(&values[y * image.width], &along[y * image.width], image.width, 1, radius);
  for (std::size_t x = 0; x < image.width; ++x)
    SumAlong(&along[x], &values[x], image.height, image.width, radius);
  return values;
}

// The mean of the valid samples in the window around each valid one: the same pixels stay valid.
Image Blurred(const Image& image, std::size_t radius) {
  std::vector<double> values = image.samples, valid(values.size(), 1.0);
  for (std::size_t i = 0; i < values.size(); ++i)
    if (image.samples[i] == hole) values[i] = valid[i] = 0.0;
  const std::vector<double> sums = BoxSums(image, values, radius), counts = BoxSums(image, valid, radius);
  Image blurred = image;
  for (std::size_t i = 0; i < values.size(); ++i)
    if (image.samples[i] != hole) blurred.samples[i] = sums[i] / counts[i];
  return blurred;
}

// Keeps what is printed on standard output meanwhile from it.
class SilentOutput {
 public:
  SilentOutput() {
    std::fflush(stdout);
    kept_ = dup(STDOUT_FILENO);
    const int nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC);
    if (kept_ < 0 || nowhere < 0) throw examples::Failure("cannot set standard output aside");
    dup2(nowhere, STDOUT_FILENO);
    close(nowhere);
  }
  SilentOutput(const SilentOutput&) = delete;
  SilentOutput& operator=(const SilentOutput&) = delete;
  ~SilentOutput() {
    std::fflush(stdout);
    dup2(kept_, STDOUT_FILENO);
    close(kept_);
  }

 private:
  int kept_;
};

struct Sharpness {
  double vollath;
  double gradient;
};

// A new object for every image: the totals of one object go on over its calls.
Sharpness Measure(Image& image) {
  constexpr double infinity = std::numeric_limits<double>::infinity();
  Raster raster({static_cast<std::uint32_t>(image.width), static_cast<std::uint32_t>(image.height), 1,
                 orvik::tessel::DataType::Of<double>()},
                {}, reinterpret_cast<unsigned char*>(image.samples.data()));
  orvik::filters::VollathEvaluation vollath;
  vollath.SetBackground(-infinity, infinity);
  vollath.SetFailure(hole);
  vollath.Process(&raster, nullptr, nullptr);

  orvik::filters::SqrGradientEvaluation gradient;
  gradient.SetBackground(-infinity, infinity);
  gradient.SetFailure(hole);
  gradient.InitEvaluation(1);
  {
    const SilentOutput silent;  // the operator prints a line of its own in every call
    gradient.Process(&raster, nullptr, nullptr);
  }
  return {vollath.GetLeftEq().front() - vollath.GetRightEq().front(), gradient.GetEvaluation().front()};
}

// What part of the figure of the sharp image a figure is.
std::string Part(double value, double sharp) {
  return sharp == 0.0 ? "-" : CPLSPrintf("%.1f %%", 100.0 * value / sharp);
}

std::string Figure(double value, double sharp) {
  return CPLSPrintf("%14.5e %8s", value, Part(value, sharp).c_str());
}

void PrintHead(const FocusOptions& options, GDALDataset& input) {
  const std::filesystem::path path(options.input);
  std::printf("%s\n", examples::DescribeGrid(path.filename().string(), input).c_str());
  std::printf("%-6s %-16s %14s", "band", "measure", "as it is");
  for (const int radius : options.blur) std::printf(" %23s", CPLSPrintf("blurred, radius %d", radius));
  std::printf("\n");
}

void PrintBand(int band, const std::vector<Sharpness>& images) {
  const auto line = [&](const std::string& head, const char* measure, double Sharpness::*part) {
    std::printf("%-6s %-16s %14.5e", head.c_str(), measure, images.front().*part);
    for (std::size_t i = 1; i < images.size(); ++i)
      std::printf(" %s", Figure(images[i].*part, images.front().*part).c_str());
    std::printf("\n");
  };
  line(std::to_string(band), "Vollath", &Sharpness::vollath);
  line("", "squared gradient", &Sharpness::gradient);
}

// The images as bands of a raster, for the picture.
examples::DatasetPtr RasterOf(GDALDataset& input, std::vector<Image>& images) {
  GDALDriver* driver = GetGDALDriverManager()->GetDriverByName("MEM");
  const int width = input.GetRasterXSize(), height = input.GetRasterYSize();
  examples::DatasetPtr raster(
      driver->Create("", width, height, static_cast<int>(images.size()), GDT_Float64, nullptr));
  examples::ThrowOnGdalError("laying the picture", raster ? CE_None : CE_Failure);
  double transform[6];
  if (input.GetGeoTransform(transform) == CE_None) raster->SetGeoTransform(transform);
  if (const OGRSpatialReference* reference = input.GetSpatialRef()) raster->SetSpatialRef(reference);
  for (std::size_t i = 0; i < images.size(); ++i)
    examples::ThrowOnGdalError("laying the picture",
                               raster->GetRasterBand(static_cast<int>(i) + 1)
                                   ->RasterIO(GF_Write, 0, 0, width, height, images[i].samples.data(), width,
                                              height, GDT_Float64, 0, 0, nullptr));
  return raster;
}

// A map for each image, with what is left of both measures.
void Draw(const FocusOptions& options, GDALDataset& input, std::vector<Image>& images,
          const std::vector<Sharpness>& measures, const std::string& png) {
  const std::filesystem::path path(options.input);
  const examples::DatasetPtr raster = RasterOf(input, images);
  std::vector<examples::Panel> panels;
  for (std::size_t i = 0; i < images.size(); ++i) {
    examples::Panel panel{.band = static_cast<int>(i) + 1, .quantity = {.name = "samples", .noData = hole}};
    panel.style.title = options.title.empty() ? "Sharpness, " + path.stem().string() : options.title;
    panel.style.caption = examples::DescribeGrid(path.filename().string(), input);
    panel.style.legend = i == 0 ? "as it is" : CPLSPrintf("blurred, radius %d", options.blur[i - 1]);
    panel.style.note = "Vollath " + Part(measures[i].vollath, measures[0].vollath);
    panel.style.unit = "gradient " + Part(measures[i].gradient, measures[0].gradient);
    panels.push_back(std::move(panel));
  }
  DrawPicture(*raster, panels, png);
}

void CheckPicture(const FocusOptions& options, GDALDataset& input, const std::vector<int>& bands) {
  if (options.png.empty()) return;
  examples::CheckTarget("--png", options.png, examples::FilesOf(input), {".png"});
  if (bands.size() != 1)
    throw Refusal("--png", std::to_string(bands.size()) + " bands are measured", "one, as with --bands 4");
}

void CheckSize(GDALDataset& input) {
  const auto pixels =
      static_cast<std::uint64_t>(input.GetRasterXSize()) * static_cast<std::uint64_t>(input.GetRasterYSize());
  if (pixels * sizeof(double) > INT32_MAX)
    throw Refusal("INPUT", "a band of it takes more than 2 GiB in double precision", "a smaller raster");
}

void Run(const FocusOptions& options) {
  const examples::DatasetPtr input = examples::OpenRaster("INPUT", options.input);
  const std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  CheckPicture(options, *input, bands);
  CheckSize(*input);
  std::optional<examples::PendingFile> picture;
  if (!options.png.empty()) picture.emplace("--png", options.png);
  PrintHead(options, *input);
  for (const int band : bands) {
    Image image = ReadImage(*input, band);
    std::vector<Sharpness> measures = {Measure(image)};
    std::vector<Image> shown;
    for (const int radius : options.blur) {
      Image blurred = Blurred(image, static_cast<std::size_t>(radius));
      measures.push_back(Measure(blurred));
      if (picture) shown.push_back(std::move(blurred));
    }
    PrintBand(band, measures);
    if (!picture) continue;
    shown.insert(shown.begin(), std::move(image));
    Draw(options, *input, shown, measures, picture->TemporaryPath());
    picture->Commit();
  }
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("Two measures of how sharp each band of a raster is, before and after a blur.\n", "focus");
  FocusOptions options;
  app.footer(
      "Vollath: the sum of the products of neighbours in a row minus that of next but one neighbours.\n"
      "Squared gradient: the sum of the squared differences between a pixel and the one below. Both are\n"
      "in squared units of the samples, grow with the number of pixels and the contrast, and say by\n"
      "themselves nothing: compare images of one scene over the same pixels. Both fall with a blur,\n"
      "Vollath's below 0 where a smooth image grows brighter along its rows.\n"
      "\n"
      "The blur is the mean over a square of 2 R + 1 pixels, of those in it that have data; it is done\n"
      "in memory, and its result is not rounded.\n"
      "\n"
      "No-data: a pixel of a band is left out where a no-data value, a mask band or an alpha band says\n"
      "so, and where it is NaN. Nothing is written to files but the picture.\n"
      "\n"
      "Exit status: 0 done; 2 an argument was refused; 1 the work failed.");
  app.add_option("INPUT", options.input, "a raster that GDAL reads, of any pixel type")
      ->type_name("FILE")
      ->required();
  examples::AddBandList(app, "--bands", options.bands,
                        "bands to measure, as in 1,2,3; default: all but alpha bands");
  app.add_option("--blur", options.blur, "radii of the blurs in pixels, as in 1,2, the default")
      ->type_name("R,...")
      ->delimiter(',')
      ->expected(1, 8)
      ->check(examples::Count(1000));
  app.add_option("--png", options.png, "also draw the band and its blurs into this file (.png); one band")
      ->type_name("FILE");
  app.add_option("--title", options.title, "title of the picture")->type_name("TEXT");
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
