// What changed between two dates, tile by tile: change difference before.tif after.tif change.tif --png
// change.png

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <limits>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "processes/gridmill/chandiffchange.h"
#include "processes/gridmill/chandiffchange2.h"
#include "processes/gridmill/chanratiochange.h"
#include "processes/gridmill/chanratiochange2.h"
#include "processes/gridmill/combchange.h"
#include "processes/gridmill/intenratiochange.h"
#include "processes/gridmill/magnitudechange.h"
#include "processes/gridmill/singlechange.h"
#include "processes/gridmill/tasseledcapchange.h"
#include "support/arguments.h"
#include "support/errors.h"
#include "support/grid.h"
#include "support/job.h"
#include "support/output.h"

namespace {

using examples::DatasetPtr;
using examples::LoadedTile;
using examples::OutputOptions;
using examples::PictureStyle;
using examples::Quantity;
using examples::Refusal;
using examples::Tile;
using examples::TileReader;
using orvik::tessel::Mask;
using orvik::tessel::Raster;

// The image of the operators is AFTER and their reference BEFORE, so that the image minus the reference is an
// increase where it is positive.
constexpr orvik::changedetection::DiffType increase = orvik::changedetection::eDIFF_FORWARD;
// The operator of a single band has it the other way round.
constexpr orvik::changedetection::DiffType singleIncrease = orvik::changedetection::eDIFF_BACKWARD;

struct ChangeOptions : OutputOptions {
  std::string before;
  std::string after;
  std::vector<int> bands;
  std::vector<int> beforeBands;
  std::vector<double> exclude;
  std::optional<int> show;
  std::vector<int> composite;  // bands of OUTPUT
  bool twoMasks = false;
  std::string sensor;
  std::string beforeSensor;

  double NoDataValue() const;
  const std::string& BeforeSensor() const { return beforeSensor.empty() ? sensor : beforeSensor; }
};

// The default of Int32 is below the differences of 16-bit samples, which reach -65535.
double ChangeOptions::NoDataValue() const {
  const bool wide = !noData && OutputType() == GDT_Int32;
  return wide ? std::numeric_limits<std::int32_t>::min() : NoData();
}

// The sensors that the tasseled-cap operators know, and the bands that they read.
struct Sensor {
  std::string name;
  std::size_t bands;
};
const std::vector<Sensor> sensors = {{"Landsat-4 MSS", 4}, {"Landsat-5 MSS", 4},  {"Landsat-4 TM", 6},
                                     {"Landsat-5 TM", 6},  {"Landsat-7 ETM+", 6}, {"Ikonos", 4},
                                     {"QuickBird", 4}};

std::vector<std::string> SensorNames() {
  std::vector<std::string> names;
  for (const Sensor& sensor : sensors) names.push_back(sensor.name);
  return names;
}

std::string Listed(const std::vector<std::string>& words) {
  std::string list;
  for (const std::string& word : words) list += (list.empty() ? "" : ", ") + word;
  return list;
}

std::size_t BandsOfSensor(const std::string& name) {
  const auto known = [&](const Sensor& sensor) { return sensor.name == name; };
  return std::find_if(sensors.begin(), sensors.end(), known)->bands;
}

// The rasters of the two dates, and which bands of them are compared: the one at a place of a list with the
// one at the same place of the other.
struct Dates {
  DatasetPtr before;
  DatasetPtr after;
  std::vector<int> beforeBands = {};
  std::vector<int> afterBands = {};

  // The raster that gives the output its georeference.
  GDALDataset& Grid() const { return after->GetSpatialRef() == nullptr ? *before : *after; }
};

Dates OpenDates(const ChangeOptions& options) {
  Dates dates{examples::OpenRaster("BEFORE", options.before), examples::OpenRaster("AFTER", options.after)};
  examples::CheckSameGrid({*dates.after, "AFTER", options.after}, {*dates.before, "BEFORE", options.before});
  CheckOutputs(options, {dates.before.get(), dates.after.get()}, options.NoDataValue());
  for (const int band : options.bands) examples::CheckBand("--bands", *dates.after, band, "AFTER");
  if (options.beforeBands.empty())
    for (const int band : options.bands) examples::CheckBand("--bands", *dates.before, band, "BEFORE");
  for (const int band : options.beforeBands)
    examples::CheckBand("--before-bands", *dates.before, band, "BEFORE");
  return dates;
}

// The bands that were asked for, else all.
void TakeBands(const ChangeOptions& options, Dates& dates) {
  dates.afterBands = options.bands.empty() ? examples::ValueBands(*dates.after) : options.bands;
  dates.beforeBands = !options.beforeBands.empty() ? options.beforeBands
                      : !options.bands.empty()     ? options.bands
                                                   : examples::ValueBands(*dates.before);
}

// The same, as many of both dates.
void ChooseBands(const ChangeOptions& options, Dates& dates) {
  TakeBands(options, dates);
  const std::size_t before = dates.beforeBands.size(), after = dates.afterBands.size();
  if (before == after && after > 0) return;
  const std::string counts = CPLSPrintf("%zu bands are to be compared with %zu of BEFORE", after, before);
  if (options.bands.empty() && options.beforeBands.empty())
    throw Refusal("AFTER", counts, "as many, or --bands and --before-bands with the ones to compare");
  throw Refusal(options.beforeBands.empty() ? "--bands" : "--before-bands", counts, "as many");
}

// The bands that were asked for, else those of a file that holds the bands of the sensor and no others, or
// all seven of TM and ETM+.
std::vector<int> BandsFor(const std::string& sensor, const std::string& argument, const std::string& option,
                          const std::vector<int>& asked, GDALDataset& dataset) {
  const std::size_t needed = BandsOfSensor(sensor);
  const std::string wanted = CPLSPrintf("the %zu bands of ", needed) + sensor +
                             (needed == 6 ? " in the order 1, 2, 3, 4, 5, 7" : " in their order");
  if (!asked.empty() && asked.size() != needed)
    throw Refusal(option, CPLSPrintf("%zu bands for ", asked.size()) + argument, wanted);
  if (!asked.empty()) return asked;
  std::vector<int> bands = examples::ValueBands(dataset);
  if (needed == 6 && bands.size() == 7) bands.erase(bands.begin() + 5);  // the thermal band
  if (bands.size() != needed)
    throw Refusal(argument,
                  CPLSPrintf("has %zu bands that are not alpha", examples::ValueBands(dataset).size()),
                  wanted + ", or " + option + " with their numbers");
  return bands;
}

void ChooseSensorBands(const ChangeOptions& options, Dates& dates) {
  dates.afterBands = BandsFor(options.sensor, "AFTER", "--bands", options.bands, *dates.after);
  const bool own = !options.beforeBands.empty();
  dates.beforeBands = BandsFor(options.BeforeSensor(), "BEFORE", "--before-bands",
                               own ? options.beforeBands : options.bands, *dates.before);
  // The operators test the samples of both dates for no-data as far as the image has channels. A band that
  // comes again changes neither the test nor the result.
  const std::size_t channels = std::max(dates.afterBands.size(), dates.beforeBands.size());
  dates.afterBands.resize(channels, dates.afterBands.back());
  dates.beforeBands.resize(channels, dates.beforeBands.back());
}

// The type that holds the real parts of all samples of both dates.
GDALDataType CommonType(const Dates& dates) {
  return GDALDataTypeUnion(examples::RealTypeOf(*dates.before, dates.beforeBands),
                           examples::RealTypeOf(*dates.after, dates.afterBands));
}

// A reader for each date. Both read in one type, as most operators take the reference for one of the image's.
struct Readers {
  TileReader before;
  TileReader after;

  Readers(const Dates& dates, GDALDataType type, std::uint32_t tile)
      : before({*dates.before, dates.beforeBands, "BEFORE", type}, 0, tile),
        after({*dates.after, dates.afterBands, "AFTER", type}, 0, tile) {
    if (!(before.Type() == after.Type()))
      throw Refusal("AFTER", "only one of the dates has signed bytes", "bytes of one sign in both");
  }
};

// Both masks in one: valid where both are.
Mask* Common(LoadedTile& before, LoadedTile& after) {
  if (!before.mask || !after.mask) return before.mask ? before.mask.get() : after.mask.get();
  for (std::size_t i = 0; i < after.mask->bits.size(); ++i) after.mask->bits[i] &= before.mask->bits[i];
  return after.mask.get();
}

// The words of a comparison for the output and its picture.
struct Words {
  std::string title;
  std::vector<std::string> bands;  // of the output
  std::string unit = {};           // of all bands but
  std::string shownUnit = {};      // of the one that is shown, if it has a unit of its own
  std::size_t shown = 0;
  PictureStyle style = {};
};

examples::Job JobOf(const ChangeOptions& options, const Dates& dates, const Words& words) {
  const std::filesystem::path before(options.before), after(options.after);
  PictureStyle style = words.style;
  style.title = !options.title.empty()
                    ? options.title
                    : words.title + ", " + before.stem().string() + " to " + after.stem().string();
  style.caption =
      examples::DescribeGrid(before.filename().string() + " to " + after.filename().string(), *dates.after);
  if (style.span == examples::Span::change && words.unit.empty() && words.shownUnit.empty())
    style.unit = "in sample units";
  if (style.span != examples::Span::values) {
    style.ramp = examples::ChangeRamp;
    style.top = "increase";
    style.bottom = "decrease";
  }
  std::vector<Quantity> bands;
  for (const std::string& name : words.bands)
    bands.push_back({.name = name, .unit = words.unit, .noData = options.NoDataValue()});
  if (!words.shownUnit.empty()) bands[words.shown].unit = words.shownUnit;
  return {.options = options,
          .grid = dates.Grid(),
          .bands = bands,
          .shown = words.shown,
          .style = style,
          .name = words.title};
}

// What is written for no-data, and which samples are no-data by their value.
template <class Operator>
void SetNoData(const ChangeOptions& options, const Dates& dates, Operator& change) {
  change.SetNoData(static_cast<float>(options.NoDataValue()));
  if (options.exclude.empty()) return;
  const std::size_t channels = dates.afterBands.size();
  change.SetRefNoData(std::vector(channels, static_cast<float>(options.exclude.front())));
  change.SetImgNoData(std::vector(channels, static_cast<float>(options.exclude.back())));
}

// Runs an operator over the tiles. `finish` gets the mask of both dates and each tile of the output.
template <class Operator, class Finish>
void RunTiles(const ChangeOptions& options, const Dates& dates, GDALDataType type, const Operator& change,
              const Words& words, Finish finish) {
  const Readers readers(dates, type, options.tile);
  RunJob(JobOf(options, dates, words), [&](const Tile& tile, Raster& out) {
    LoadedTile before = readers.before.Read(tile), after = readers.after.Read(tile);
    Mask* mask = Common(before, after);
    change.Process(after.raster.get(), before.raster.get(), mask, &out);
    finish(mask, out);
  });
}

constexpr auto asItIs = [](Raster&) {};

// Sets an operator up and runs it over the tiles. `finish` gets each tile of the output.
template <class Operator, class Finish>
void Run(const ChangeOptions& options, const Dates& dates, GDALDataType type, Operator& change,
         const Words& words, Finish finish) {
  SetNoData(options, dates, change);
  RunTiles(options, dates, type, change, words, [&](const Mask*, Raster& out) { finish(out); });
}

// Reads a date in its own type, which has to be one that the operators with two masks take.
TileReader OwnReader(GDALDataset& dataset, const std::vector<int>& bands, const std::string& argument,
                     std::uint32_t tile) {
  const GDALDataType type = examples::RealTypeOf(dataset, bands);
  TileReader reader({dataset, bands, argument, type}, 0, tile);
  const bool taken = type == GDT_Byte || type == GDT_Int16 || type == GDT_UInt16 || type == GDT_Float32;
  const bool signedBytes = reader.Type() == orvik::tessel::DataType::Of<char>();
  if (taken && !signedBytes) return reader;
  throw Refusal(argument,
                std::string("has samples of ") + (signedBytes ? "signed bytes" : GDALGetDataTypeName(type)),
                "Byte, Int16, UInt16 or Float32 with --two-masks");
}

// Sets an operator with two masks up and runs it over the tiles. A set bit of the reference's mask excludes.
template <class Operator, class Finish>
void RunTwoMasks(const ChangeOptions& options, const Dates& dates, Operator& change, const Words& words,
                 Finish finish) {
  const TileReader befores = OwnReader(*dates.before, dates.beforeBands, "BEFORE", options.tile);
  const TileReader afters = OwnReader(*dates.after, dates.afterBands, "AFTER", options.tile);
  SetNoData(options, dates, change);
  RunJob(JobOf(options, dates, words), [&](const Tile& tile, Raster& out) {
    LoadedTile before = befores.Read(tile), after = afters.Read(tile);
    if (before.mask)
      for (unsigned char& bits : before.mask->bits) bits = static_cast<unsigned char>(~bits);
    change.Process(after.raster.get(), before.raster.get(), after.mask.get(), before.mask.get(), &out);
    finish(out);
  });
}

// The place among the compared bands that --show names, the first by default.
std::size_t ShownBand(const ChangeOptions& options, const Dates& dates) {
  if (!options.show) return 0;
  const auto begin = dates.afterBands.begin(), end = dates.afterBands.end();
  const auto at = std::find(begin, end, *options.show);
  if (at != end) return static_cast<std::size_t>(at - begin);
  std::vector<std::string> names;
  for (const int band : dates.afterBands) names.push_back(std::to_string(band));
  throw Refusal("--show", CPLSPrintf("band %d is not compared", *options.show), "one of " + Listed(names));
}

// "band 4", or "band 5 (4 before)"
std::string BandName(const Dates& dates, std::size_t at) {
  const int before = dates.beforeBands[at], after = dates.afterBands[at];
  std::string name = "band " + std::to_string(after);
  if (before != after) name += " (" + std::to_string(before) + " before)";
  return name;
}

Words WordsByBand(const std::string& measure, const ChangeOptions& options, const Dates& dates) {
  Words words;
  for (std::size_t i = 0; i < dates.afterBands.size(); ++i)
    words.bands.push_back(measure + " of " + BandName(dates, i));
  words.shown = ShownBand(options, dates);
  words.style.legend = BandName(dates, words.shown);
  words.title = words.bands[words.shown];
  words.title.front() = static_cast<char>(std::toupper(static_cast<unsigned char>(words.title.front())));
  return words;
}

// The unit of the samples, if all the compared bands state the same one.
std::string UnitOf(const Dates& dates) {
  const std::string unit = dates.after->GetRasterBand(dates.afterBands.front())->GetUnitType();
  const auto same = [&](GDALDataset& dataset, const std::vector<int>& bands) {
    return std::all_of(bands.begin(), bands.end(),
                       [&](int band) { return unit == dataset.GetRasterBand(band)->GetUnitType(); });
  };
  return same(*dates.before, dates.beforeBands) && same(*dates.after, dates.afterBands) ? unit : "";
}

// An integer difference is formed in the type of the output: it would wrap, and fractions would be cut off
// before the subtraction.
void CheckHoldsDifferences(const ChangeOptions& options, GDALDataType samples) {
  const GDALDataType type = options.OutputType();
  if (examples::IsFloating(type)) return;
  const int bits = GDALGetDataTypeSizeBits(samples);
  if (!examples::IsFloating(samples) && bits < GDALGetDataTypeSizeBits(type)) return;
  throw Refusal(
      "--type",
      std::string("differences of ") + GDALGetDataTypeName(samples) + " do not fit into " + options.type,
      bits == 16 ? "Int32, Float32 or Float64" : "Float32 or Float64");
}

void RunDifference(const ChangeOptions& options) {
  Dates dates = OpenDates(options);
  ChooseBands(options, dates);
  const GDALDataType type = CommonType(dates);
  CheckHoldsDifferences(options, type);
  Words words = WordsByBand("difference", options, dates);
  words.unit = UnitOf(dates);
  words.style.span = examples::Span::change;
  words.style.note = "after − before";
  if (options.twoMasks) {
    if (options.type != "Int16" && options.type != "Float32")
      throw Refusal("--type", options.type + " is not written with --two-masks", "Int16 or Float32");
    orvik::changedetection::ChanDiffChange2 difference(orvik::changedetection::eDIFF2_SIGNED);
    return RunTwoMasks(options, dates, difference, words, asItIs);
  }
  orvik::changedetection::ChanDiffChange difference(increase);
  Run(options, dates, type, difference, words, asItIs);
}

// The operator writes 0 for a masked pixel, which is a difference too.
void RunSingle(const ChangeOptions& options) {
  ChangeOptions one = options;
  if (one.bands.empty()) one.bands = {1};
  Dates dates = OpenDates(one);
  ChooseBands(one, dates);
  const GDALDataType type = CommonType(dates);
  CheckHoldsDifferences(one, type);
  Words words = WordsByBand("difference", one, dates);
  words.unit = UnitOf(dates);
  words.style.span = examples::Span::change;
  words.style.note = "after − before";
  const orvik::changedetection::SingleChange difference(singleIncrease);
  RunTiles(one, dates, type, difference, words, [&](const Mask* mask, Raster& out) {
    if (mask) examples::FillMasked(*mask, one.NoDataValue(), one.OutputType(), out);
  });
}

// A zero in BEFORE gives an infinity or NaN.
void FillWhereInfinite(float noData, Raster& out) {
  auto* samples = reinterpret_cast<float*>(out.data);
  const std::size_t count = static_cast<std::size_t>(out.width) * out.height * out.channels;
  for (std::size_t i = 0; i < count; ++i)
    if (!std::isfinite(samples[i])) samples[i] = noData;
}

void RunRatio(const ChangeOptions& options) {
  Dates dates = OpenDates(options);
  ChooseBands(options, dates);
  Words words = WordsByBand("ratio", options, dates);
  words.style.span = examples::Span::factor;
  words.style.note = "after / before, log scale";
  const auto finish = [&](Raster& out) { FillWhereInfinite(static_cast<float>(options.NoDataValue()), out); };
  if (options.twoMasks) {
    orvik::changedetection::ChanRatioChange ratio(orvik::changedetection::eDIFF2_SIGNED);
    return RunTwoMasks(options, dates, ratio, words, finish);
  }
  orvik::changedetection::ChanRatioChange2 ratio(increase);
  Run(options, dates, GDT_Float32, ratio, words, finish);
}

// A mean of 0 after has a logarithm of minus infinity. One of 0 before has a ratio of 0 decibels by
// definition of the operator, which is no ratio.
void RunIntensity(const ChangeOptions& options) {
  Dates dates = OpenDates(options);
  ChooseBands(options, dates);
  Words words{.title = "Change of intensity",
              .bands = {"intensity after", "intensity before", "intensity ratio", "zero"},
              .unit = UnitOf(dates),
              .shownUnit = "dB",
              .shown = 2};
  words.style.span = examples::Span::change;
  words.style.legend = "intensity";
  words.style.note = "after / before";
  const auto noData = static_cast<float>(options.NoDataValue());
  orvik::changedetection::IntenRatioChange intensity(increase);
  Run(options, dates, CommonType(dates), intensity, words, [&](Raster& out) {
    auto* pixel = reinterpret_cast<float*>(out.data);
    for (std::uint32_t i = 0; i < out.width * out.height; ++i, pixel += out.channels)
      if (pixel[1] == 0.0f || std::isinf(pixel[2])) std::fill_n(pixel, out.channels, noData);
  });
}

// "4 after" for the bands of AFTER, then those of BEFORE.
std::vector<std::string> NamesOfBoth(const Dates& dates) {
  std::vector<std::string> names;
  for (const int band : dates.afterBands) names.push_back(std::to_string(band) + " after");
  for (const int band : dates.beforeBands) names.push_back(std::to_string(band) + " before");
  return names;
}

// Three bands of the output as red, green and blue, or one.
void ShowBands(const std::vector<int>& asked, const std::vector<std::string>& names, Words& words) {
  const auto count = static_cast<int>(words.bands.size());
  std::vector<int> numbers;
  for (int number = 1; number <= count; ++number) numbers.push_back(number);
  for (const int band : asked)
    if (band > count)
      throw Refusal("--show", CPLSPrintf("there is no band %d in OUTPUT", band),
                    CPLSPrintf("a band from 1 to %d", count));
  const std::vector<int> places = examples::ShownPlaces(asked, numbers, "in OUTPUT");
  words.shown = static_cast<std::size_t>(places.front());
  if (places.size() == 1) return;
  const std::string colours[] = {"red: ", "green: ", "blue: "};
  for (std::size_t i = 0; i < places.size(); ++i)
    words.style.composite.push_back({places[i] + 1, colours[i] + names[static_cast<std::size_t>(places[i])]});
  words.style.legend = "bands";
}

void RunCombination(const ChangeOptions& options) {
  Dates dates = OpenDates(options);
  TakeBands(options, dates);
  for (const auto& [argument, bands] : {std::pair("BEFORE", dates.beforeBands), {"AFTER", dates.afterBands}})
    if (bands.empty()) throw Refusal(argument, "all bands are alpha bands", "a band with values");
  Words words{.title = "Combination", .bands = {}, .unit = UnitOf(dates)};
  const std::vector<std::string> names = NamesOfBoth(dates);
  for (const std::string& name : names) words.bands.push_back("band " + name);
  ShowBands(options.composite, names, words);
  orvik::changedetection::CombChange combination(increase);
  Run(options, dates, CommonType(dates), combination, words, asItIs);
}

// The output of the operators that write both dates and the difference.
Words WordsByDate(const std::string& measure, const Dates& dates) {
  Words words{.title = "Change of " + measure,
              .bands = {measure + " after", measure + " before", measure + " difference"},
              .unit = UnitOf(dates),
              .shown = 2};
  words.style.span = examples::Span::change;
  words.style.legend = measure;
  words.style.note = "after − before";
  return words;
}

void RunMagnitude(const ChangeOptions& options) {
  Dates dates = OpenDates(options);
  ChooseBands(options, dates);
  // A square is formed in the type of the sample, where it wraps for wider integers.
  const GDALDataType common = CommonType(dates);
  const bool narrow = common == GDT_Byte || common == GDT_Int16;
  orvik::changedetection::MagnitudeChange magnitude(increase);
  Run(options, dates, narrow ? common : GDT_Float64, magnitude, WordsByDate("magnitude", dates), asItIs);
}

template <class Operator>
void RunTasseledCap(const ChangeOptions& options) {
  const bool green = std::is_same_v<Operator, orvik::changedetection::TCGNChange>;
  if (options.sensor.empty()) throw Refusal("--sensor", "is missing", "one of " + Listed(SensorNames()));
  Dates dates = OpenDates(options);
  ChooseSensorBands(options, dates);
  Operator change(options.sensor, options.BeforeSensor(), increase);
  Run(options, dates, CommonType(dates), change, WordsByDate(green ? "greenness" : "brightness", dates),
      asItIs);
}

void AddBandOptions(CLI::App& command, ChangeOptions& options, const std::string& byDefault) {
  examples::AddBandList(command, "--bands", options.bands,
                        "bands to compare, as in 1,2,3; default: " + byDefault);
  examples::AddBandList(command, "--before-bands", options.beforeBands,
                        "the bands of BEFORE, where they have other numbers");
}

void AddShowOption(CLI::App& command, ChangeOptions& options) {
  command
      .add_option("--show", options.show,
                  "the band in the picture and in the printed figures, by its\n"
                  "number in AFTER; default: the first that is compared")
      ->type_name("N")
      ->check(examples::Count(1u << 16));
}

void AddSensorOptions(CLI::App& command, ChangeOptions& options) {
  const CLI::Validator known = examples::OneOf(SensorNames());
  command
      .add_option("--sensor", options.sensor,
                  "sensor of both dates, in quotes:\n"
                  "Landsat-4 MSS, Landsat-5 MSS, Landsat-4 TM, Landsat-5 TM,\n"
                  "Landsat-7 ETM+, Ikonos or QuickBird")
      ->type_name("NAME")
      ->check(known);
  command.add_option("--before-sensor", options.beforeSensor, "sensor of BEFORE, where it is another one")
      ->type_name("NAME")
      ->check(known);
}

const examples::OutputTypes signedTypes = {
    .names = {"Int16", "Int32", "Float32", "Float64"},
    .help = "Int16, Int32, Float32 (default) or\nFloat64",
    .noDataHelp = "nan for floating types,\n-32768 for Int16, -2147483648 for Int32"};
const examples::OutputTypes ratioTypes = {
    .names = {"Float32"}, .help = "Float32 and no other", .noDataHelp = "nan"};

void AddTwoMasksOption(CLI::App& command, ChangeOptions& options, const std::string& types) {
  command.add_flag("--two-masks", options.twoMasks,
                   "by the operator that reads each date in its own type and with\n"
                   "a mask of its own: Byte, Int16, UInt16 or Float32, to\n" +
                       types);
}

void AddDates(CLI::App& command, ChangeOptions& options, const examples::OutputTypes& types,
              const std::string& notes) {
  const auto add = [&](const char* name, std::string& path, const char* help) {
    command.add_option(name, path, help)->type_name("FILE")->required();
  };
  add("BEFORE", options.before, "the raster of the first date, of any pixel type");
  add("AFTER", options.after, "the raster of the second date, on the same grid");
  AddOutputOptions(
      command, options, types,
      notes +
          "\n"
          "No-data: a pixel is left out of all bands where a no-data value, a mask band or an alpha band\n"
          "of BEFORE or of AFTER says so, in any of the bands that are read, and where a sample is NaN.\n"
          "It holds the no-data value in OUTPUT and is transparent in the picture. OUTPUT appears under\n"
          "its name only when it is complete.\n");
}

// For a measure that has a sign.
void AddSignedDates(CLI::App& command, ChangeOptions& options, const examples::OutputTypes& types,
                    const std::string& notes) {
  AddDates(command, options, types,
           "Positive is an increase from BEFORE to AFTER, negative a decrease. The colours of the picture\n"
           "reach as far as 98 % of the values.\n" +
               notes);
}

// For an operator that tests for no-data.
void AddChangeOptions(CLI::App& command, ChangeOptions& options, const examples::OutputTypes& types,
                      const std::string& notes) {
  AddSignedDates(command, options, types, notes);
  command
      .add_option("--exclude", options.exclude,
                  "also leave out the samples of this value; two numbers stand\n"
                  "for BEFORE and AFTER")
      ->type_name("V[,V]")
      ->delimiter(',')
      ->expected(1, 2)
      ->check(examples::SinglePrecision());
}

// A subcommand, and what it runs.
struct Command {
  CLI::App* parsed;
  void (*run)(const ChangeOptions&);
};

Command AddDifference(CLI::App& app, ChangeOptions& options) {
  CLI::App* command = app.add_subcommand("difference", "AFTER minus BEFORE, band by band");
  AddChangeOptions(*command, options, signedTypes,
                   "--exclude leaves out a band of a pixel, not the pixel. An integer type must hold every\n"
                   "difference that the types of the inputs can give.\n");
  AddBandOptions(*command, options, "all but\nalpha bands");
  AddShowOption(*command, options);
  AddTwoMasksOption(*command, options, "Int16 or Float32");
  return {command, RunDifference};
}

Command AddSingle(CLI::App& app, ChangeOptions& options) {
  CLI::App* command = app.add_subcommand("single", "AFTER minus BEFORE of one band, in single precision");
  AddSignedDates(
      *command, options, signedTypes,
      "An integer type must hold every difference that the types of the inputs can give. Samples of\n"
      "32 and 64 bits are narrowed to single precision before the subtraction.\n");
  const auto add = [&](const char* name, std::vector<int>& bands, const char* help) {
    command->add_option(name, bands, help)->type_name("N")->expected(1)->check(examples::Count(1u << 16));
  };
  add("--bands", options.bands, "the band to compare; default: 1");
  add("--before-bands", options.beforeBands, "the band of BEFORE, where it has another number");
  return {command, RunSingle};
}

Command AddRatio(CLI::App& app, ChangeOptions& options) {
  CLI::App* command = app.add_subcommand("ratio", "AFTER divided by BEFORE, band by band");
  AddChangeOptions(*command, options, ratioTypes,
                   "For ratios read: above 1 and below 1. --exclude leaves out a band of a pixel, not the\n"
                   "pixel. A ratio to 0 is no-data. The colours are even in the logarithm of the ratio.\n");
  AddBandOptions(*command, options, "all but\nalpha bands");
  AddShowOption(*command, options);
  AddTwoMasksOption(*command, options, "Float32");
  return {command, RunRatio};
}

Command AddIntensity(CLI::App& app, ChangeOptions& options) {
  CLI::App* command =
      app.add_subcommand("intensity", "mean of the bands of AFTER, of BEFORE, and their ratio in decibels");
  AddChangeOptions(
      *command, options, ratioTypes,
      "OUTPUT has four bands: after, before, the ratio, which the picture shows, and one of zeros.\n"
      "The value of --exclude in any band leaves out the pixel. A mean of 0 makes it no-data.\n");
  AddBandOptions(*command, options, "all but\nalpha bands");
  return {command, RunIntensity};
}

Command AddCombination(CLI::App& app, ChangeOptions& options) {
  CLI::App* command =
      app.add_subcommand("combine", "the bands of AFTER, then those of BEFORE, in one raster");
  AddDates(*command, options, signedTypes,
           "The numbers of --show are those of OUTPUT. A sample beyond the range of the type is limited to\n"
           "it.\n");
  AddBandOptions(*command, options, "all but\nalpha bands");
  examples::AddShow(*command, options.composite);
  return {command, RunCombination};
}

Command AddMagnitude(CLI::App& app, ChangeOptions& options) {
  CLI::App* command = app.add_subcommand(
      "magnitude", "length of a pixel's vector of bands in AFTER, in BEFORE, and the difference");
  AddChangeOptions(*command, options, signedTypes,
                   "OUTPUT has three bands: after, before and after minus before, which the picture shows.\n"
                   "The value of --exclude in any band leaves out the pixel.\n");
  AddBandOptions(*command, options, "all but\nalpha bands");
  return {command, RunMagnitude};
}

Command AddTasseledCap(CLI::App& app, ChangeOptions& options, const std::string& axis,
                       void (*run)(const ChangeOptions&)) {
  CLI::App* command =
      app.add_subcommand(axis, "tasseled-cap " + axis + " of AFTER, of BEFORE, and the difference");
  AddChangeOptions(*command, options, signedTypes,
                   "OUTPUT has three bands: after, before and after minus before, which the picture shows.\n"
                   "The value of --exclude in any band that is read leaves out the pixel. The samples are\n"
                   "weighted as they are stored, without calibration.\n");
  AddSensorOptions(*command, options);
  AddBandOptions(*command, options,
                 "those of\nthe sensor in a file that holds no others; 1,2,3,4,5,7 of\n"
                 "seven for TM and ETM+");
  return {command, run};
}

}  // namespace

int main(int argc, char** argv) {
  CLI::App app("What changed between two dates of one place.\n", "change");
  ChangeOptions options;
  app.require_subcommand(1);
  app.fallthrough(false);
  const Command commands[] = {
      AddDifference(app, options),
      AddSingle(app, options),
      AddRatio(app, options),
      AddIntensity(app, options),
      AddMagnitude(app, options),
      AddCombination(app, options),
      AddTasseledCap(app, options, "greenness", RunTasseledCap<orvik::changedetection::TCGNChange>),
      AddTasseledCap(app, options, "brightness", RunTasseledCap<orvik::changedetection::TCSBChange>)};
  return examples::RunProgram(app, argc, argv, [&] {
    for (const Command& command : commands)
      if (command.parsed->parsed()) command.run(options);
  });
}
