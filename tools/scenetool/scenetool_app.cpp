#include "scenetool_app.h"

#include "b_exception.h"
#include "b_fs.h"
#include "b_log.h"
#include "descriptions.h"
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

// An alias entry is NAME=TEXT; a name of one letter would be read as a drive, never as an alias.
std::string checkAlias(const std::string& entry) {
  const std::size_t equals = entry.find('=');
  if (equals == std::string::npos) return "an alias is NAME=TEXT";
  if (equals < 2) return "an alias name has at least two characters";
  if (entry.find(':') < equals) return "an alias name holds no ':'";
  return {};
}

void applyAliases(const Options& options) {
  for (const std::string& entry : options.aliases) {
    const std::size_t equals = entry.find('=');
    base::fs::aliases().set(std::string_view(entry).substr(0, equals), std::string_view(entry).substr(equals + 1));
  }
}

void addGlobalOptions(CLI::App& app, Options& options) {
  app.require_subcommand(0, 1);
  // Options are --words everywhere: a path that starts with '/' is a path, never an option.
  app.allow_windows_style_options(false);
  app.add_flag("--version", options.version, "Print the version and exit");
  app.add_option("--log-level", options.logLevel,
                 "Log messages up to this level: 2 errors, 3 warnings (default), 4 information, 5 debug")
      ->check(CLI::Range(0, 5));
  app.add_option("--log-file", options.logFile, "Also append log messages to this file");
  app.add_option("--alias", options.aliases,
                 "Let NAME: at the start of a path stand for TEXT (NAME=TEXT, repeatable), "
                 "as in --alias models=/data/models/ then models:bunny.ply")
      ->type_name("NAME=TEXT")
      ->check(CLI::Validator(checkAlias, ""))
      ->allow_extra_args(false);
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

void printFileError(const std::string& path, std::string_view text) {
  if (text.starts_with(path + ": ")) return printError(std::string(text));
  printError(fmt::format("{}: {}", path, text));
}

int run(int argc, const char* const* argv) {
  CLI::App app(description, "scenetool");
  Options options;
  addGlobalOptions(app, options);
  const std::vector<Command> commands{addImportCommand(app),  addConvertCommand(app), addPluginsCommand(app),
                                      addSchemaCommand(app),  addPlyCommand(app),     addInfoCommand(app),
                                      addValidateCommand(app)};
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
  applyAliases(options);
  loadDescriptions();
  for (const Command& command : commands) {
    if (command.parser->parsed()) return runCommand(command);
  }
  printError("no command given");
  fmt::print(stderr, "{}", app.help());
  return exitUsage;
}

}  // namespace scenetool
