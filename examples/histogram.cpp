// The histograms of a raster's bands, as a plot and as numbers: histogram scene.tif --png histogram.png

#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <optional>
#include <string>
#include <vector>

#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/pendingfile.h"
#include "support/plot.h"
#include "support/statistics.h"

namespace {

using examples::Histogram;
using examples::PendingFile;
using examples::Refusal;

struct HistogramOptions {
  std::string input;
  std::vector<int> bands;
  std::uint32_t tile = 512;
  std::string png;
  std::string csv;
  std::string title;
  bool syntheticBlue = false;
};

// Distinct also without the difference of red and green.
constexpr examples::Colour colours[] = {{0.12, 0.35, 0.75}, {0.85, 0.45, 0.05}, {0.10, 0.58, 0.45},
                                        {0.75, 0.15, 0.35}, {0.50, 0.35, 0.70}, {0.35, 0.35, 0.35},
                                        {0.35, 0.65, 0.90}, {0.60, 0.55, 0.10}};
constexpr std::size_t mostInPlot = std::size(colours);
constexpr examples::Colour ofGreen = colours[2], ofRed = colours[3], ofBlue = colours[0];

void CheckBands(const HistogramOptions& options, GDALDataset& input, const std::vector<int>& bands) {
  if (options.syntheticBlue && bands.size() != 3)
    throw Refusal("--synthetic-blue", std::to_string(bands.size()) + " bands",
                  "three --bands, for green, red and near infrared");
  if (bands.size() > mostInPlot)
    throw Refusal("--bands", std::to_string(bands.size()) + " bands are too many for a plot",
                  "at most " + std::to_string(mostInPlot));
  for (const int band : bands) {
    const GDALDataType type = input.GetRasterBand(band)->GetRasterDataType();
    if (type == GDT_Byte || type == GDT_UInt16) continue;
    const std::string name = GDALGetDataTypeName(type);
    throw Refusal("INPUT",
                  "band " + std::to_string(band) + " has samples of type " + name +
                      ", and only whole numbers from 0 to 65535 have a bin",
                  "Byte or UInt16, as gdal_translate -ot UInt16 makes them where no sample is negative");
  }
}

examples::TileReader ReaderFor(const HistogramOptions& options, GDALDataset& input,
                               const std::vector<int>& bands) {
  examples::TileReader reader({.dataset = input, .bands = bands}, 0, options.tile);
  if (!examples::HasBins(reader.Type()))
    throw Refusal("INPUT", "has signed bytes, and negative samples have no bin", "Byte or UInt16");
  return reader;
}

std::vector<std::string> NamesOf(const HistogramOptions& options, const std::vector<int>& bands) {
  std::vector<std::string> names;
  for (const int band : bands) names.push_back("band " + std::to_string(band));
  if (options.syntheticBlue) names = {"green (" + names[0] + ")", "red (" + names[1] + ")", "synthetic blue"};
  return names;
}

void WriteTable(const std::vector<Histogram>& histograms, const std::vector<std::string>& names,
                const PendingFile& file) {
  std::ofstream table(file.TemporaryPath());
  table << "value";
  for (const std::string& name : names) table << "," << name;
  table << "\n";
  float least = histograms[0].min, greatest = histograms[0].max;
  for (const Histogram& histogram : histograms) {
    least = std::min(least, histogram.min);
    greatest = std::max(greatest, histogram.max);
  }
  for (auto value = static_cast<std::size_t>(least); value <= static_cast<std::size_t>(greatest); ++value) {
    table << value;
    for (const Histogram& histogram : histograms) table << "," << histogram.counts[value];
    table << "\n";
  }
  table.close();
  if (!table) throw examples::Failure("writing '" + file.Target() + "': the disk may be full");
}

examples::Plot PlotOf(const HistogramOptions& options, const std::vector<Histogram>& histograms,
                      const std::vector<std::string>& names, GDALDataset& input) {
  const std::filesystem::path path(options.input);
  examples::Plot plot{.title = !options.title.empty() ? options.title : "Histogram, " + path.stem().string(),
                      .caption = examples::DescribeGrid(path.filename().string(), input),
                      .valueAxis = "value of the sample",
                      .countAxis = "pixels",
                      .curves = {}};
  for (std::size_t i = 0; i < histograms.size(); ++i)
    plot.curves.push_back({names[i], colours[i], histograms[i].counts});
  if (options.syntheticBlue) {
    plot.curves[0].colour = ofGreen;
    plot.curves[1].colour = ofRed;
    plot.curves[2].colour = ofBlue;
  }
  return plot;
}

void Print(const HistogramOptions& options, const std::vector<Histogram>& histograms,
           const std::vector<std::string>& names) {
  const std::string table = options.csv.empty() ? "" : ", " + options.csv;
  std::printf("%s%s:\n", options.png.c_str(), table.c_str());
  for (std::size_t i = 0; i < histograms.size(); ++i)
    std::printf("  %s: min %.0f, mean %.2f, max %.0f, %llu pixels\n", names[i].c_str(), histograms[i].min,
                histograms[i].Mean(), histograms[i].max,
                static_cast<unsigned long long>(histograms[i].Total()));
}

void CheckTargets(const HistogramOptions& options, GDALDataset& input) {
  std::vector<std::string> taken = examples::FilesOf(input);
  examples::CheckTarget("--png", options.png, taken, {".png"});
  taken.push_back(options.png);
  if (!options.csv.empty()) examples::CheckTarget("--csv", options.csv, taken, {".csv"});
}

void Run(const HistogramOptions& options) {
  const examples::DatasetPtr input = examples::OpenRaster("INPUT", options.input);
  const std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  CheckTargets(options, *input);
  CheckBands(options, *input, bands);
  const examples::TileReader reader = ReaderFor(options, *input, bands);
  PendingFile picture("--png", options.png);
  std::optional<PendingFile> table;
  if (!options.csv.empty()) table.emplace("--csv", options.csv);

  const auto width = static_cast<std::uint32_t>(input->GetRasterXSize());
  const auto height = static_cast<std::uint32_t>(input->GetRasterYSize());
  using namespace orvik::gridmill;
  const std::vector<Histogram> histograms =
      HistogramsOf(reader, examples::CutTiles(width, height, options.tile),
                   options.syntheticBlue ? eSTATISTICS_SYNTHETIC_BLUE : eSTATISTICS_PLAIN);
  if (histograms[0].min > histograms[0].max)
    throw Refusal("INPUT", "has no valid pixel", "a raster with data in all bands that are read");
  const std::vector<std::string> names = NamesOf(options, bands);
  DrawPlot(PlotOf(options, histograms, names, *input), picture.TemporaryPath());
  if (table) WriteTable(histograms, names, *table);
  picture.Commit();
  if (table) table->Commit();
  Print(options, histograms, names);
}

void AddHistogramOptions(CLI::App& app, HistogramOptions& options) {
  app.add_option("INPUT", options.input, "a raster that GDAL reads, of Byte or UInt16 samples")
      ->type_name("FILE")
      ->required();
  app.add_option("--png", options.png, "the plot to write (.png); an old one is replaced")
      ->type_name("FILE")
      ->required();
  app.add_option("--csv", options.csv,
                 "also write a table into this file (.csv): a line for each value\n"
                 "from the least to the greatest, with its count in each band")
      ->type_name("FILE");
  examples::AddBandList(app, "--bands", options.bands,
                        "up to eight bands to count, as in 1,2,3; default: all but alpha\nbands");
  app.add_flag("--synthetic-blue", options.syntheticBlue,
               "take the three --bands for green, red and near infrared, and\n"
               "count in place of the third the blue that naturalcolor makes");
  app.add_option("--tile", options.tile, "side of the tiles in pixels, 512 by default; nothing depends on it")
      ->type_name("N")
      ->check(examples::Count(1u << 20));
  app.add_option("--title", options.title, "title of the plot")->type_name("TEXT");
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("The histograms of a raster's bands, with minimum, mean and maximum.\n", "histogram");
  HistogramOptions options;
  app.footer(
      "The minimum and the maximum are those of the samples, the mean is that of the histogram. The\n"
      "synthetic blue counts in whole numbers from 0 to 255, without its fraction.\n"
      "\n"
      "No-data: a pixel is left out where a no-data value, a mask band or an alpha band of INPUT says so\n"
      "in one of the bands that are read. The files appear under their names only when they are complete.\n"
      "\n"
      "Exit status: 0 done; 2 an argument was refused and nothing was written; 1 the work failed.");
  AddHistogramOptions(app, options);
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
