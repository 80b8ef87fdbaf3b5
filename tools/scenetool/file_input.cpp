#include "file_input.h"

#include "b_exception.h"
#include "b_fs.h"
#include "scenetool_app.h"

#include <fmt/format.h>

namespace scenetool {
namespace {

// The path the system was asked for, when aliases made it differ from what the user wrote.
std::string expandedNote(const std::string& path, const base::fs::file_not_found& error) {
  if (error.path().empty() || std::string_view(error.path()) == path) return {};
  return fmt::format(" ({})", error.path());
}

}  // namespace

bool openInput(const std::string& path, base::Stream& stream) {
  try {
    stream = base::fs::master().open(path, base::fs::openForReading);
    return true;
  } catch (const base::fs::file_not_found& error) {
    printError(fmt::format("{}: no such file{}", path, expandedNote(path, error)));
  } catch (const base::invalid_argument& error) {
    printError(fmt::format("{}: {}", path, error.argument()));
  } catch (const base::api_exception& error) {
    printError(fmt::format("{}: cannot open the file: {}", path, base::systemErrorText(error.errorCode())));
  } catch (const base::exception& error) {
    printError(fmt::format("{}: cannot open the file: {}", path, error.what()));
  }
  return false;
}

}  // namespace scenetool
