#include "scenetool_app.h"

#include "b_exception.h"
#include "b_log.h"
#include "scenetool_version.h"

#include <fmt/format.h>

#include <cstdio>

namespace scenetool {
namespace {

constexpr const char* description =
    "scenetool: import, inspect, validate and store PLY scenes through the scene plug-ins "
    "found beside this program.";

bool applyLogOptions(const Options& options) {
  base::log().setLevel(options.logLevel);
  if (options.logFile.empty()) return true;
  std::string error;
  if (base::log().setFile(options.logFile, error)) return true;
  printError(fmt::format("cannot open log file '{}': {}", options.logFile, error));
  return false;
}

void addGlobalOptions(CLI::App& app, Options& options) {
  app.require_subcommand(0, 1);
  app.add_flag("--version", options.version, "Print the version and exit");
  app.add_option("--log-level", options.logLevel,
                 "Log messages up to this level: 2 errors, 3 warnings (default), 4 information, 5 debug")
      ->check(CLI::Range(0, 5));
  app.add_option("--log-file", options.logFile, "Also append log messages to this file");
}

// A failure that escapes a command is reported in the one error line, never as a crash.
int runCommand(const Command& command) {
  try {
    return command.run();
  } catch (const std::exception& error) {
    printError(error.what());
    return exitFailed;
  }
}

}  // namespace

void printError(const std::string& text) { fmt::print(stderr, "scenetool: error: {}\n", text); }

int run(int argc, const char* const* argv) {
  CLI::App app(description, "scenetool");
  Options options;
  addGlobalOptions(app, options);
  const std::vector<Command> commands{addPlyCommand(app), addInfoCommand(app)};
  try {
    app.parse(argc, argv);
  } catch (const CLI::CallForHelp&) {
    std::fputs(app.help().c_str(), stdout);
    return exitOk;
  } catch (const CLI::ParseError& error) {
    printError(error.what());
    fmt::print(stderr, "Run 'scenetool --help' for usage.\n");
    return exitUsage;
  }
  if (options.version) {
    fmt::print("scenetool {}\n", SCENETOOL_VERSION);
    return exitOk;
  }
  if (!applyLogOptions(options)) return exitFailed;
  for (const Command& command : commands) {
    if (command.parser->parsed()) return runCommand(command);
  }
  printError("no command given");
  fmt::print(stderr, "{}", app.help());
  return exitUsage;
}

}  // namespace scenetool
