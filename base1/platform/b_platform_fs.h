#pragma once

// The system file system: base::fs::PosixPlugin in b_fs_posix.cpp, base::fs::WinPlugin in
// b_fs_win.cpp, both named "system" and alike in every answer. The two files also define
// the temp and current-path functions of b_fs.h. What both need is here.

#include "b_fs.h"
#include "b_log.h"

#include <string_view>

namespace base::platform {

/// The descriptor of the system file system.
ref<fs::PluginDesc> systemFileSystem();

/// The mode a system file system opens with: write without read creates the file.
inline std::uint32_t effectiveOpenMode(std::uint32_t mode) {
  if ((mode & fs::openWrite) && !(mode & fs::openRead)) mode |= fs::openCreate;
  return mode;
}

/// The capability word of a system file stream opened with `mode`.
inline std::uint32_t fileStreamCapabilities(std::uint32_t mode) {
  std::uint32_t capabilities = capPosition | capSize | capFile | capReopen;
  if (mode & fs::openRead) capabilities |= capRead;
  if (mode & fs::openWrite) capabilities |= capWrite | capSetSize;
  return capabilities;
}

/// The mode a reopened file stream uses: the same file again, never emptied a second time.
inline std::uint32_t reopenMode(std::uint32_t mode) { return mode & ~std::uint32_t(fs::openTruncate); }

/// Whether a listing shows an entry: never "." and "..", and no directories among files.
inline bool listsEntry(std::string_view name, bool isDirectory, bool files) {
  if (name == "." || name == "..") return false;
  return files ? !isDirectory : isDirectory;
}

/// A file stream with a hasher moved away from where the hash has got to.
inline void logHashedMove(std::int64_t previous) {
  log().message(logIO, logDebug, "File position moved to {} while calculating the hash!", previous);
}

}  // namespace base::platform
