#include "arguments.h"

#include <cfloat>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <exception>

#include "errors.h"

namespace examples {

namespace {

bool ParseNumber(const std::string& text, double& value) {
  char* end = nullptr;
  value = std::strtod(text.c_str(), &end);
  return !text.empty() && end == text.c_str() + text.size();
}

CLI::Validator NumberWith(const std::string& expected, bool (*accept)(double)) {
  const auto check = [expected, accept](const std::string& text) {
    double value = 0.0;
    if (ParseNumber(text, value) && accept(value)) return std::string();
    return "'" + text + "' is not usable; expected " + expected;
  };
  return CLI::Validator(check, "");
}

}  // namespace

CLI::Validator Count(std::uint32_t last, std::uint32_t first) {
  const auto check = [last, first](const std::string& text) {
    double value = 0.0;
    if (ParseNumber(text, value) && value == std::floor(value) && value >= first && value <= last)
      return std::string();
    return "'" + text + "' is not usable; expected a whole number from " + std::to_string(first) + " to " +
           std::to_string(last);
  };
  return CLI::Validator(check, "");
}

CLI::Validator Number() {
  return NumberWith("a finite number", [](double value) { return std::isfinite(value); });
}

CLI::Validator SinglePrecision() {
  return NumberWith("a number in the range of single precision",
                    [](double value) { return std::abs(value) <= FLT_MAX; });
}

CLI::Validator PositiveNumber() {
  return NumberWith("a finite number above 0",
                    [](double value) { return std::isfinite(value) && value > 0.0; });
}

CLI::Validator OneOf(const std::vector<std::string>& names) {
  const auto check = [names](const std::string& text) {
    std::string list;
    for (const std::string& name : names) {
      if (text == name) return std::string();
      list += (list.empty() ? "" : ", ") + name;
    }
    return "'" + text + "' is not usable; expected one of " + list;
  };
  return CLI::Validator(check, "");
}

CLI::Validator Tail() {
  return NumberWith("a number from 0 to below 50", [](double value) { return value >= 0.0 && value < 50.0; });
}

void AddShow(CLI::App& command, std::vector<int>& show) {
  command
      .add_option("--show", show,
                  "the bands in the picture and in the printed figures: three\n"
                  "as red, green and blue, or one; default: the first")
      ->type_name("R,G,B")
      ->delimiter(',')
      ->expected(1, 3)
      ->check(Count(1u << 16));
}

void AddOutputOptions(CLI::App& command, OutputOptions& options, const OutputTypes& types,
                      const std::string& notes) {
  command.footer(
      notes +
      "\n"
      "Exit status: 0 done; 2 an argument was refused and nothing was written; 1 the work failed.");
  command
      .add_option("OUTPUT", options.output, "the GeoTIFF to write (.tif or .tiff); an old one is replaced")
      ->type_name("FILE")
      ->required();
  command.add_option("--type", options.type, "pixel type of OUTPUT: " + types.help)
      ->type_name("TYPE")
      ->check(OneOf(types.names));
  if (!types.noDataHelp.empty())
    command.add_option("--nodata", options.noData, "no-data value of OUTPUT; default: " + types.noDataHelp)
        ->type_name("V")
        ->check(NumberWith("a number or nan", [](double value) { return !std::isinf(value); }));
  command
      .add_option("--tile", options.tile,
                  "side of the tiles in pixels, 512 by default; OUTPUT does not depend on it")
      ->type_name("N")
      ->check(Count(1u << 20));
  command.add_option("--png", options.png, "also draw a picture of OUTPUT into this file (.png)")
      ->type_name("FILE");
  command.add_option("--title", options.title, "title of the picture")->type_name("TEXT");
}

void AddJobOptions(CLI::App& command, JobOptions& options, const std::string& notes) {
  AddJobOptions(command, options,
                {.names = OutputTypeNames(),
                 .help = "Byte, UInt16, Int16, UInt32, Int32,\nUInt64, Int64, Float32 (default) or Float64",
                 .noDataHelp = "nan for floating types, else\n"
                               "-32768 for Int16 and Int32, 255 for Byte, 65535 for the rest"},
                notes);
}

void AddJobOptions(CLI::App& command, JobOptions& options, const OutputTypes& types,
                   const std::string& notes) {
  command.add_option("INPUT", options.input, "a raster that GDAL reads, of any pixel type")
      ->type_name("FILE")
      ->required();
  AddOutputOptions(
      command, options, types,
      notes +
          "\n"
          "No-data: a pixel is left out where a no-data value, a mask band or an alpha band of INPUT\n"
          "says so, and where a sample is NaN. OUTPUT is georeferenced as INPUT is, and appears\n"
          "under its name only when it is complete.\n");
}

void AddBandList(CLI::App& command, const std::string& name, std::vector<int>& bands,
                 const std::string& help) {
  command.add_option(name, bands, help)
      ->type_name("N,...")
      ->delimiter(',')
      ->expected(1, 1 << 16)
      ->check(Count(1u << 16));
}

int RunProgram(CLI::App& app, int argc, char** argv, const std::function<void()>& work) {
  try {
    app.parse(argc, argv);
    StartGdal();
    work();
    return 0;
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) return app.exit(error);
    std::fprintf(stderr, "%s: %s\nRun with --help for more.\n", app.get_name().c_str(), error.what());
    return 2;
  } catch (const Refusal& error) {
    std::fprintf(stderr, "%s: %s\n", app.get_name().c_str(), error.what());
    return 2;
  } catch (const std::exception& error) {
    std::fprintf(stderr, "%s: %s\n", app.get_name().c_str(), error.what());
    return 1;
  }
}

}  // namespace examples
