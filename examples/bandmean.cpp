// The mean of a raster's bands, tile by tile: bandmean scene.tif mean.tif --png mean.png

#include <cmath>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "processes/gridmill/averagechannels.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::Quantity;
using orvik::tessel::Mask;
using orvik::tessel::Raster;

struct MeanOptions : JobOptions {
  std::vector<int> bands;
};

// The bands that were asked for, else all but the alpha bands.
std::vector<int> BandsOf(const MeanOptions& options, GDALDataset& input) {
  for (const int band : options.bands) examples::CheckBand("--bands", input, band);
  if (!options.bands.empty()) return options.bands;
  std::vector<int> bands;
  for (int band = 1; band <= input.GetRasterCount(); ++band)
    if (input.GetRasterBand(band)->GetColorInterpretation() != GCI_AlphaBand) bands.push_back(band);
  if (bands.empty())
    throw examples::Refusal("INPUT", "all bands are alpha bands", "a band with values, or --bands");
  return bands;
}

// As stated, or NaN where the output has it. Any integer could be a mean, so that without need there is none,
// and the input's own value comes first.
std::optional<double> NoDataOf(const MeanOptions& options, GDALRasterBand& band, bool masked) {
  const GDALDataType type = options.OutputType();
  if (options.noData || examples::IsFloating(type)) return options.NoData();
  if (!masked) return std::nullopt;
  int stated = 0;
  const double ofInput = band.GetNoDataValue(&stated);
  return stated && examples::IsStorable(ofInput, type) ? ofInput : options.NoData();
}

// Writes the no-data value where the mask is clear. The operator leaves its own no-data value there in the
// form of an input sample, which cannot be NaN or negative for every type.
void FillMasked(const Mask& mask, double noData, GDALDataType type, Raster& out) {
  const auto size = static_cast<std::size_t>(GDALGetDataTypeSizeBytes(type));
  std::vector<unsigned char> sample(size);
  GDALCopyWords(&noData, GDT_Float64, 0, sample.data(), type, 0, 1);
  unsigned char* to = out.data;
  for (std::uint32_t y = 0; y < out.height; ++y)
    for (std::uint32_t x = 0; x < out.width; ++x, to += size)
      if (!mask.IsValid(static_cast<std::int32_t>(x), static_cast<std::int32_t>(y)))
        std::memcpy(to, sample.data(), size);
}

void Run(const MeanOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  const std::vector<int> bands = BandsOf(options, *input);
  const examples::TileReader reader({.dataset = *input, .bands = bands}, 0, options.tile);
  // No sample equals NaN: the mask alone decides what is no-data.
  orvik::filters::AverageChannels mean(std::numeric_limits<float>::quiet_NaN());
  const Quantity quantity = {
      .name = "mean of " + std::to_string(bands.size()) + (bands.size() == 1 ? " band" : " bands"),
      .noData = NoDataOf(options, *input->GetRasterBand(bands.front()), reader.Masked())};
  RunJob(options, *input, reader, quantity, {.ramp = examples::GreyRamp}, [&](LoadedTile& in, Raster& out) {
    mean.Process(in.raster.get(), in.mask.get(), &out, nullptr);
    if (in.mask) FillMasked(*in.mask, *quantity.noData, options.OutputType(), out);
  });
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("The arithmetic mean of the bands of a raster, computed in single precision.\n", "bandmean");
  MeanOptions options;
  AddJobOptions(
      app, options,
      "A pixel needs data in all bands. Bands of unlike types are read in a type that holds them all.\n"
      "Integer outputs take the no-data value of INPUT where it fits, and none where no pixel can be\n"
      "without data.\n");
  app.add_option("--bands", options.bands, "bands to average, as in 1,2,3; default: all but alpha bands")
      ->type_name("N,...")
      ->delimiter(',')
      ->expected(1, 1 << 16)
      ->check(examples::Count(1u << 16));
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
