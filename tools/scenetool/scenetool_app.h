#pragma once

#include <CLI/CLI.hpp>

#include <string>
#include <vector>

namespace scenetool {

/// Exit codes: the work succeeded, the work failed, the command line was wrong.
enum ExitCode : int { exitOk = 0, exitFailed = 1, exitUsage = 2 };

/// The command line: global options and the commands. Each command registers itself on the
/// app and sets `run`; main parses, applies the global options, then runs the command.
struct Options {
  int logLevel = 3;
  std::string logFile;
  bool version = false;
};

/// Builds the parser with the global options bound to `options`.
void addGlobalOptions(CLI::App& app, Options& options);

/// Runs scenetool on the given arguments and returns the exit code.
int run(int argc, const char* const* argv);

/// Prints "scenetool: error: <text>" on standard error.
void printError(const std::string& text);

}  // namespace scenetool
