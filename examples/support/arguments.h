#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "job.h"

namespace examples {

/// The pixel types that a command writes, and what its help says about them.
struct OutputTypes {
  std::vector<std::string> names;
  std::string help;
  std::string noDataHelp;  ///< the no-data values that they have unless stated; empty: none can be stated
};

/// Adds the arguments of `OutputOptions` to a command, and `notes` to the end of its help.
void AddOutputOptions(CLI::App& command, OutputOptions& options, const OutputTypes& types,
                      const std::string& notes);

/// Adds the arguments of `JobOptions` to a command, and `notes` to the end of its help.
void AddJobOptions(CLI::App& command, JobOptions& options, const std::string& notes);
/// The same with the pixel types that the command writes.
void AddJobOptions(CLI::App& command, JobOptions& options, const OutputTypes& types,
                   const std::string& notes);

/// Adds an option that takes a list of bands. `help` ends with its default.
void AddBandList(CLI::App& command, const std::string& name, std::vector<int>& bands,
                 const std::string& help);

/// Refuses anything but a whole number from `first` to `last`.
CLI::Validator Count(std::uint32_t last, std::uint32_t first = 1);

/// Refuses anything but one of the names.
CLI::Validator OneOf(const std::vector<std::string>& names);

/// Refuses anything but a finite number.
CLI::Validator Number();
/// Refuses anything but a finite number in the range of single precision.
CLI::Validator SinglePrecision();
/// Refuses anything but a finite number above 0.
CLI::Validator PositiveNumber();

/// Refuses anything but a percentage from 0 to below 50.
CLI::Validator Tail();

/// Adds `--show`, the bands in the picture and in the printed figures.
void AddShow(CLI::App& command, std::vector<int>& show);

/// Parses the command line, runs `work` and turns what went wrong into a message on standard error.
///
/// Returns the exit status: 0 for done, 2 for an argument that was refused before anything was written, 1 for
/// work that failed.
int RunProgram(CLI::App& app, int argc, char** argv, const std::function<void()>& work);

}  // namespace examples
