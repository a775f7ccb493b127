// A class map of a raster by ranges of its values, tile by tile: classes dem.tif classes.tif
// --breaks 0,10,20,50 --unit m --png classes.png

#include <cmath>
#include <cstdlib>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "processes/gridmill/rangeclasses.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::JobOptions;
using examples::LoadedTile;
using examples::PictureStyle;
using examples::Quantity;
using examples::Refusal;
using orvik::tessel::Raster;

constexpr float infinity = std::numeric_limits<float>::infinity();
constexpr float neverEqual = std::numeric_limits<float>::quiet_NaN();  // the mask alone decides
constexpr std::size_t mostInByte = 255, mostInPicture = 24;

struct ClassOptions : JobOptions {
  int band = 1;
  std::vector<float> breaks;
  std::vector<std::string> ranges;
  std::optional<std::string> unit;
};

// From `low` to below `high`; an open end is infinite.
struct Range {
  float low;
  float high;
};

std::string Text(float value) { return CPLSPrintf("%.7g", value); }

// @param unit  empty, or with a space before it
std::string LabelOf(const Range& range, const std::string& unit = "") {
  const std::string low = Text(range.low), high = Text(range.high) + unit;
  if (std::isinf(range.low)) return std::isinf(range.high) ? "all values" : "below " + high;
  if (std::isinf(range.high)) return low + unit + " or more";
  return low + " to < " + high;
}

// A side of LO:HI, which the validator has seen to be a number or nothing.
float EndOf(const std::string& text, float open) {
  return text.empty() ? open : static_cast<float>(std::strtod(text.c_str(), nullptr));
}

std::vector<Range> RangesOf(const ClassOptions& options) {
  std::vector<Range> ranges;
  for (const std::string& text : options.ranges) {
    const std::size_t colon = text.find(':');
    const Range range{EndOf(text.substr(0, colon), -infinity), EndOf(text.substr(colon + 1), infinity)};
    if (!(range.low < range.high))
      throw Refusal("--ranges", "'" + text + "' is empty in single precision", "LO:HI with LO below HI");
    ranges.push_back(range);
  }
  float low = -infinity;
  for (const float high : options.breaks) {
    if (!(low < high))
      throw Refusal("--breaks", Text(high) + " does not lie above " + Text(low) + " before it",
                    "numbers that rise in single precision");
    ranges.push_back({low, high});
    low = high;
  }
  if (!options.breaks.empty()) ranges.push_back({low, infinity});
  return ranges;
}

// The operator leaves both bounds out. The number below `low` as the lower one lets `low` in.
orvik::gridmill::RangeClasses OperatorFor(const std::vector<Range>& ranges) {
  std::vector<float> low, high;
  for (const Range& range : ranges) {
    low.push_back(std::nextafter(range.low, -infinity));
    high.push_back(range.high);
  }
  orvik::gridmill::RangeClasses classes;
  classes.SetNumClasses(static_cast<int>(ranges.size()));
  classes.SetMinRange(low);
  classes.SetMaxRange(high);
  classes.SetNoData(neverEqual);
  return classes;
}

// With the type that holds the classes.
ClassOptions Completed(ClassOptions options, std::size_t classes) {
  if (options.type.empty()) options.type = classes > mostInByte ? "UInt16" : "Byte";
  if (options.type == "Byte" && classes > mostInByte)
    throw Refusal("--type", "Byte has no room for " + std::to_string(classes) + " classes",
                  "UInt16, or at most " + std::to_string(mostInByte) + " classes");
  if (!options.png.empty() && classes > mostInPicture)
    throw Refusal("--png", "a legend has no room for " + std::to_string(classes) + " classes",
                  "at most " + std::to_string(mostInPicture) + " classes, or no --png");
  return options;
}

Quantity QuantityOf(const ClassOptions& options, const std::vector<Range>& ranges, const std::string& unit) {
  Quantity quantity = {.name = "classes of band " + std::to_string(options.band), .noData = 0.0};
  for (const Range& range : ranges)
    quantity.classes.push_back(LabelOf(range, unit.empty() ? "" : " " + unit));
  return quantity;
}

PictureStyle StyleOf(const std::vector<Range>& ranges, const std::string& band, const std::string& unit) {
  PictureStyle style;
  style.legend = band;
  style.unit = unit.empty() ? "" : "in " + unit;
  style.noData = "no class";
  for (std::size_t i = 0; i < ranges.size(); ++i)
    style.classes.push_back(
        {static_cast<double>(i + 1), examples::ClassColour(i, ranges.size()), LabelOf(ranges[i])});
  return style;
}

void Run(const ClassOptions& asked) {
  if (asked.breaks.empty() && asked.ranges.empty())
    throw Refusal("--breaks", "is missing, and --ranges too", "one of them");
  if (!asked.breaks.empty() && !asked.ranges.empty())
    throw Refusal("--ranges", "stands beside --breaks", "one of them");
  const std::vector<Range> ranges = RangesOf(asked);
  const ClassOptions options = Completed(asked, ranges.size());
  const examples::DatasetPtr input = OpenInput(options);
  examples::CheckBand("--band", *input, options.band);
  const examples::TileReader reader(
      {.dataset = *input, .bands = {options.band}, .type = examples::RealTypeOf(*input, {options.band})}, 0,
      options.tile);
  GDALRasterBand& band = *input->GetRasterBand(options.band);
  const std::string unit = options.unit.value_or(band.GetUnitType()), name = band.GetDescription();
  const Quantity quantity = QuantityOf(options, ranges, unit);
  const orvik::gridmill::RangeClasses classes = OperatorFor(ranges);
  RunJob(options, *input, reader, quantity,
         StyleOf(ranges, name.empty() ? "band " + std::to_string(options.band) : name, unit),
         [&](LoadedTile& in, Raster& out) {
           classes.Process(in.raster.get(), nullptr, &out);  // the operator ignores masks
           if (in.mask) examples::FillMasked(*in.mask, *quantity.noData, options.OutputType(), out);
         });
}

CLI::Validator RangeText() {
  const CLI::Validator number = examples::SinglePrecision();
  return CLI::Validator(
      [number](std::string& text) {
        const std::size_t colon = text.find(':');
        bool usable = colon != std::string::npos;
        for (std::string end : {text.substr(0, colon), usable ? text.substr(colon + 1) : ""})
          usable = usable && (end.empty() || number(end).empty());
        if (usable) return std::string();
        return "'" + text + "' is not usable; expected LO:HI, two numbers in the range of single precision";
      },
      "");
}

void AddClassOptions(CLI::App& app, ClassOptions& options) {
  app.add_option("--band", options.band, "band of INPUT to classify, 1 by default")
      ->type_name("N")
      ->check(examples::Count(1u << 16));
  app.add_option("--breaks", options.breaks,
                 "rising numbers: below A is class 1, from A to below B class 2,\n"
                 "and so on; the last class is open above")
      ->type_name("A,B,...")
      ->delimiter(',')
      ->expected(1, 65534)
      ->check(examples::SinglePrecision());
  app.add_option("--ranges", options.ranges,
                 "in place of --breaks: a range for each class, with gaps or\n"
                 "overlapping. Where two overlap, the later one holds. An end\n"
                 "that is left out is open: :0,0:10,50:")
      ->type_name("LO:HI,...")
      ->delimiter(',')
      ->expected(1, 65535)
      ->check(RangeText());
  app.add_option("--unit", options.unit, "unit of the values in texts; default: what INPUT states")
      ->type_name("TEXT");
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("A class map of a raster by ranges of its values.\n", "classes");
  ClassOptions options;
  options.type.clear();
  AddJobOptions(
      app, options,
      {.names = {"Byte", "UInt16"},
       .help = "Byte or UInt16; default:\nUInt16 for more than 255 classes",
       .noDataHelp = ""},
      "A class holds its lower bound and leaves out its upper one: a sample equal to a break is in the\n"
      "class that begins there. Samples and bounds are compared in single precision. An infinite sample\n"
      "is in no class.\n"
      "\n"
      "OUTPUT holds the numbers of the classes, from 1 on. 0 is its no-data value, and stands for pixels\n"
      "without data and for those in no class. The printed shares are those of the pixels in a class.\n");
  AddClassOptions(app, options);
  return examples::RunProgram(app, argc, argv, [&] { Run(options); });
}
