// Vegetation indices of a scene in one pass, tile by tile: indices scene.tif indices.tif --roles
// blue,green,red,nir,swir1,swir2 --index ndvi,savi,greenness --png indices.png

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <string>
#include <vector>

#include "processes/gridmill/vegindex.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::Quantity;
using examples::Refusal;
using examples::Tile;
using orvik::filters::BandRole;
using orvik::tessel::Raster;

struct IndexOptions : JobOptions {
  std::vector<int> bands;
  std::vector<std::string> roles;
  std::vector<std::string> indices;
  std::vector<std::string> show;
  std::vector<double> scale;
};

const std::vector<std::string> roleNames = {"blue", "green", "red", "red-edge", "nir", "swir1", "swir2"};
const std::string noRole = "other";

// An index as it is asked for and as it is shown, in the order of the operator's codes.
struct Index {
  std::string argument;
  std::string name;
  std::vector<BandRole> needs;
  examples::Span span;
  std::string note = {};
};

const std::vector<Index>& Indices() {
  using namespace orvik::filters;
  using examples::Span;
  static const std::vector<Index> indices = {
      {"ngrdi", "NGRDI", {eBAND_GREEN, eBAND_RED}, Span::bothSigns},
      {"excess-green", "excess green", {eBAND_BLUE, eBAND_GREEN, eBAND_RED}, Span::values},
      {"dvi", "DVI", {eBAND_RED, eBAND_NIR}, Span::bothSigns},
      {"rvi", "RVI", {eBAND_RED, eBAND_NIR}, Span::fromZero},
      {"ndvi", "NDVI", {eBAND_RED, eBAND_NIR}, Span::bothSigns},
      {"tvi", "TVI", {eBAND_RED, eBAND_NIR}, Span::fromZero},
      {"savi", "SAVI", {eBAND_RED, eBAND_NIR}, Span::bothSigns, "L = 0.5"},
      {"msavi2", "MSAVI2", {eBAND_RED, eBAND_NIR}, Span::values},
      {"gemi", "GEMI", {eBAND_RED, eBAND_NIR}, Span::values},
      {"greenness",
       "greenness",
       {eBAND_BLUE, eBAND_GREEN, eBAND_RED, eBAND_NIR, eBAND_SWIR1, eBAND_SWIR2},
       Span::values,
       "swir2 weighs −1.18"},
      {"mcari", "MCARI", {eBAND_GREEN, eBAND_RED, eBAND_RED_EDGE}, Span::values},
      {"mtvi1", "MTVI1", {eBAND_GREEN, eBAND_RED, eBAND_NIR}, Span::values}};
  return indices;
}

std::vector<std::string> IndexNames() {
  std::vector<std::string> names;
  for (const Index& index : Indices()) names.push_back(index.argument);
  return names;
}

bool Contains(const std::vector<std::string>& names, const std::string& name) {
  return std::find(names.begin(), names.end(), name) != names.end();
}

std::string Listed(const std::vector<std::string>& words) {
  std::string list;
  for (const std::string& word : words) list += (list.empty() ? "" : ", ") + word;
  return list;
}

// Those that were asked for, in the order of their codes, as the operator writes them.
std::vector<Index> Requested(const IndexOptions& options) {
  std::vector<Index> requested;
  for (const Index& index : Indices())
    if (Contains(options.indices, index.argument)) requested.push_back(index);
  return requested;
}

// A missing band would count as 0, and of two bands with one role the operator takes the later.
void CheckRoles(const IndexOptions& options, std::size_t bands) {
  if (options.roles.size() != bands)
    throw Refusal("--roles", CPLSPrintf("%zu roles for %zu bands", options.roles.size(), bands),
                  "one for each band that is read, " + noRole + " for one without a role, or --bands");
  for (const std::string& role : roleNames)
    if (std::count(options.roles.begin(), options.roles.end(), role) > 1)
      throw Refusal("--roles", "'" + role + "' stands twice", "each role once");
  for (const Index& index : Requested(options))
    for (const BandRole need : index.needs)
      if (!Contains(options.roles, roleNames[need]))
        throw Refusal("--roles", index.argument + " needs the role '" + roleNames[need] + "'",
                      "a band that has it, or another --index");
  for (const std::string& shown : options.show)
    if (!Contains(options.indices, shown))
      throw Refusal("--show", "'" + shown + "' is not computed", "one of " + Listed(options.indices));
  if (!options.scale.empty() && options.scale.front() == 0.0)
    throw Refusal("--scale", "a factor of 0 leaves nothing", "a factor above or below 0");
}

orvik::filters::VegIndex OperatorFor(const IndexOptions& options) {
  std::vector<unsigned int> requests, roles;
  for (const Index& index : Indices()) requests.push_back(Contains(options.indices, index.argument) ? 1 : 0);
  for (const std::string& role : options.roles)  // "other" gets the number after the last one
    roles.push_back(
        static_cast<unsigned int>(std::find(roleNames.begin(), roleNames.end(), role) - roleNames.begin()));
  orvik::filters::VegIndex index;
  index.SetRequestedIndex(requests);
  index.SetBandIndex(roles);
  return index;
}

// Samples, which are `Float32` then, become reflectances or whatever the factor and the offset lead to.
void Apply(const std::vector<double>& scale, Raster& raster) {
  const double offset = scale.size() > 1 ? scale.back() : 0.0;
  auto* samples = reinterpret_cast<float*>(raster.data);
  const std::size_t count = static_cast<std::size_t>(raster.width) * raster.height * raster.channels;
  for (std::size_t i = 0; i < count; ++i)
    samples[i] = static_cast<float>(samples[i] * scale.front() + offset);
}

// A root of a negative number.
template <class Real>
void FillNaN(double noData, Raster& out) {
  auto* samples = reinterpret_cast<Real*>(out.data);
  const std::size_t count = static_cast<std::size_t>(out.width) * out.height * out.channels;
  for (std::size_t i = 0; i < count; ++i)
    if (std::isnan(samples[i])) samples[i] = static_cast<Real>(noData);
}

std::string SamplesAsRead(const std::vector<double>& scale) {
  if (scale.empty()) return "samples as stored";
  std::string text = CPLSPrintf("samples × %.6g", scale.front());
  if (scale.size() > 1)
    text += CPLSPrintf(scale.back() < 0.0 ? " − %.6g" : " + %.6g", std::abs(scale.back()));
  return text;
}

examples::Job JobOf(const IndexOptions& options, GDALDataset& input) {
  const std::filesystem::path path(options.input);
  examples::Job job{.options = options, .grid = input, .bands = {}};
  std::vector<examples::Panel> panels;
  std::vector<std::string> names, shown;
  for (const Index& index : Requested(options)) {
    names.push_back(index.name);
    job.bands.push_back({.name = index.name, .noData = options.NoData()});
    if (!options.show.empty() && !Contains(options.show, index.argument)) continue;
    shown.push_back(index.name);
    const bool signs = index.span == examples::Span::bothSigns;
    panels.push_back({.band = static_cast<int>(job.bands.size()),
                      .quantity = job.bands.back(),
                      .style = {.ramp = signs ? examples::PlantRamp : examples::GreenRamp,
                                .span = index.span,
                                .note = index.note}});
  }
  job.name = Listed(names);
  job.shown = static_cast<std::size_t>(panels.front().band) - 1;
  job.style = panels.front().style;
  job.style.title = !options.title.empty() ? options.title : Listed(shown) + ", " + path.stem().string();
  job.style.caption =
      examples::DescribeGrid(path.filename().string(), input) + "; " + SamplesAsRead(options.scale);
  job.beside.assign(panels.begin() + 1, panels.end());
  return job;
}

void Run(const IndexOptions& options) {
  const examples::DatasetPtr input = OpenInput(options);
  const std::vector<int> bands = examples::ChosenBands(options.bands, *input);
  CheckRoles(options, bands.size());
  const GDALDataType type = options.scale.empty() ? examples::RealTypeOf(*input, bands) : GDT_Float32;
  const examples::TileReader reader({.dataset = *input, .bands = bands, .type = type}, 0, options.tile);
  const orvik::filters::VegIndex index = OperatorFor(options);
  RunJob(JobOf(options, *input), [&](const Tile& tile, Raster& out) {
    LoadedTile in = reader.Read(tile);
    if (!options.scale.empty()) Apply(options.scale, *in.raster);
    index.Process(in.raster.get(), in.mask.get(), &out);
    if (in.mask) examples::FillMasked(*in.mask, options.NoData(), options.OutputType(), out);
    options.OutputType() == GDT_Float32 ? FillNaN<float>(options.NoData(), out)
                                        : FillNaN<double>(options.NoData(), out);
  });
}

void AddNames(CLI::App& app, const std::string& option, std::vector<std::string>& names,
              const std::vector<std::string>& known, const std::string& help) {
  app.add_option(option, names, help)
      ->type_name("NAME,...")
      ->delimiter(',')
      ->expected(1, 1 << 16)
      ->check(examples::OneOf(known));
}

void AddIndexOptions(CLI::App& app, IndexOptions& options) {
  std::vector<std::string> roles = roleNames;
  roles.push_back(noRole);
  AddNames(app, "--roles", options.roles, roles,
           "what each band is, in their order: blue, green, red,\n"
           "red-edge, nir, swir1, swir2, or other");
  AddNames(app, "--index", options.indices, IndexNames(),
           "the indices to compute: ngrdi, excess-green, dvi, rvi, ndvi,\n"
           "tvi, savi, msavi2, gemi, greenness, mcari, mtvi1");
  app.get_option("--roles")->required();
  app.get_option("--index")->required();
  AddNames(app, "--show", options.show, IndexNames(),
           "those in the picture and in the printed figures; default: all");
  examples::AddBandList(app, "--bands", options.bands,
                        "bands to read, as in 1,2,3; default: all but alpha bands");
  app.add_option("--scale", options.scale,
                 "multiply the samples by FACTOR and add OFFSET before, as a\n"
                 "product's notes say for reflectances; default: as stored")
      ->type_name("FACTOR[,OFFSET]")
      ->delimiter(',')
      ->expected(1, 2)
      ->check(examples::SinglePrecision());
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("Up to twelve vegetation indices of a scene in one pass, a band of OUTPUT each.\n", "indices");
  IndexOptions options;
  AddJobOptions(
      app, options,
      {.names = {"Float32", "Float64"}, .help = "Float32 (default) or Float64", .noDataHelp = "nan"},
      "The bands of OUTPUT stand in the order of --index's list above, whatever the order asked for.\n"
      "\n"
      "Units: savi, msavi2 and gemi add constants to the samples and presume reflectances from 0 to 1,\n"
      "excess-green counts from 0 to 255. ngrdi, ndvi, rvi and tvi do not depend on a factor, the others\n"
      "grow with it. A divisor of 0 gives 0. tvi and msavi2 are no-data where they would take the root of\n"
      "a negative number. Unlike the common forms, greenness weighs swir2 by -1.18 and not -0.18, and\n"
      "msavi2 is 0.5 higher.\n");
  AddIndexOptions(app, options);
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
