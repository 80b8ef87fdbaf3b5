#pragma once

#include "b_stream.h"

#include <string>

namespace scenetool {

/// Opens the file at `path` for reading through the master file system (aliases expanded).
/// False, with the error line printed, when it cannot be opened.
bool openInput(const std::string& path, base::Stream& stream);

}  // namespace scenetool
