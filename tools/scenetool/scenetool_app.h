#pragma once

#include <CLI/CLI.hpp>

#include <functional>
#include <string>
#include <string_view>
#include <vector>

namespace scenetool {

/// Exit codes: the work succeeded, the work failed, the command line was wrong.
enum ExitCode : int { exitOk = 0, exitFailed = 1, exitUsage = 2 };

/// Global options, applied before any command runs.
struct Options {
  int logLevel = 3;
  std::string logFile;
  std::vector<std::string> aliases;  ///< NAME=TEXT entries for the alias table
  bool version = false;
};

/// A command: its parser (a subcommand of the app) and what runs when it was chosen.
struct Command {
  CLI::App* parser;
  std::function<int()> run;
};

/// Registers `scenetool ply FILE [--values] [--json]`.
Command addPlyCommand(CLI::App& app);
/// Registers `scenetool import FILE [-p NAME=VALUE]... [--json] [-o OUT.scene]`.
Command addImportCommand(CLI::App& app);
/// Registers `scenetool convert IN OUT [--format ENCODING] [-p NAME=VALUE]...`.
Command addConvertCommand(CLI::App& app);
/// Registers `scenetool plugins [--json]`.
Command addPluginsCommand(CLI::App& app);
/// Registers `scenetool schema [TYPE] [--json]`.
Command addSchemaCommand(CLI::App& app);
/// Registers `scenetool validate FILE`.
Command addValidateCommand(CLI::App& app);
/// Registers `scenetool info FILE.scene [--json]`.
Command addInfoCommand(CLI::App& app);

/// Runs scenetool on the given arguments and returns the exit code.
int run(int argc, const char* const* argv);

/// Prints "scenetool: error: <text>" on standard error.
void printError(const std::string& text);
/// Prints "scenetool: error: <path>: <text>"; a text that names the file at its start
/// already (a decompressing stream's error, say) is printed as it is.
void printFileError(const std::string& path, std::string_view text);

}  // namespace scenetool
