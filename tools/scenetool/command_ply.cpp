#include "file_input.h"
#include "log_relay.h"
#include "ply_dump.h"
#include "ply_parser.h"
#include "scenetool_app.h"

#include <fmt/format.h>

#include <memory>

namespace scenetool {
namespace {

struct PlyOptions {
  std::string file;
  bool values = false;
  bool json = false;
};

// Reads the header, and with values the body, into a dump. False when the header failed.
template <class Dump>
bool dumpFile(base::Stream& stream, ply::Header& header, bool values) {
  Dump dump(stdout, header, values);
  if (!values) {
    if (!ply::parseHeader(header, stream)) return false;
  } else if (ply::readFile(header, stream, dump) == ply::ReadResult::headerFailed) {
    return false;
  }
  dump.finish();
  return true;
}

int runPly(const PlyOptions& options) {
  base::Stream stream;
  if (!openInput(options.file, stream)) return exitFailed;
  ply::Header header;
  LogRelay relay;
  const bool read = options.json ? dumpFile<PlyJsonDump>(stream, header, options.values)
                                 : dumpFile<PlyTextDump>(stream, header, options.values);
  if (read) return exitOk;
  const auto cause = relay.takeCause();
  printError(fmt::format("{}: {}", options.file, cause ? *cause : "not a readable PLY header"));
  return exitFailed;
}

}  // namespace

Command addPlyCommand(CLI::App& app) {
  auto options = std::make_shared<PlyOptions>();
  CLI::App* command = app.add_subcommand("ply",
                                         "Show a PLY file's header, and with --values its raw values, "
                                         "without importing it");
  command->add_option("FILE", options->file, "The PLY file")->required();
  command->add_flag("--values", options->values, "Also show every property instance's value as read");
  command->add_flag("--json", options->json, "Write JSON instead of text");
  return {command, [options] { return runPly(*options); }};
}

}  // namespace scenetool
