// The mean of a raster's bands, tile by tile: bandmean scene.tif mean.tif --png mean.png

#include <limits>
#include <string>
#include <vector>

#include "processes/gridmill/averagechannels.h"
#include "support/arguments.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::Quantity;
using orvik::tessel::Raster;

struct MeanOptions : JobOptions {
  std::vector<int> bands;
};

// As stated, or NaN where the output has it. Any integer could be a mean, so that without need there is none,
// and the input's own value comes first.
std::optional<double> NoDataOf(const MeanOptions& options, GDALRasterBand& band, bool masked) {
  const GDALDataType type = options.OutputType();
  if (options.noData || examples::IsFloating(type) || !masked) return options.NoDataIf(masked);
  int stated = 0;
  const double ofInput = band.GetNoDataValue(&stated);
  return stated && examples::IsStorable(ofInput, type) ? ofInput : options.NoData();
}

void Run(const MeanOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  const std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  const examples::TileReader reader({.dataset = *input, .bands = bands}, 0, options.tile);
  // No sample equals NaN: the mask alone decides what is no-data.
  orvik::filters::AverageChannels mean(std::numeric_limits<float>::quiet_NaN());
  const Quantity quantity = {
      .name = "mean of " + std::to_string(bands.size()) + (bands.size() == 1 ? " band" : " bands"),
      .noData = NoDataOf(options, *input->GetRasterBand(bands.front()), reader.Masked())};
  RunJob(options, *input, reader, quantity, {.ramp = examples::GreyRamp}, [&](LoadedTile& in, Raster& out) {
    mean.Process(in.raster.get(), in.mask.get(), &out, nullptr);
    // The operator leaves its own no-data value there in the form of an input sample, which cannot be NaN or
    // negative for every type.
    if (in.mask) examples::FillMasked(*in.mask, *quantity.noData, options.OutputType(), out);
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
  examples::AddBandList(app, "--bands", options.bands,
                        "bands to average, as in 1,2,3; default: all but alpha bands");
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
