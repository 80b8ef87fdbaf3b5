#pragma once

#include "b_containers.h"
#include "b_stream.h"

#include <cstdint>
#include <string>

namespace scenetool {

/// Reads the whole file at `path`. False, with the system's reason in `error`, when it
/// cannot be opened or read.
bool readWholeFile(const std::string& path, base::vector<std::uint8_t>& data, std::string& error);

/// Reads the whole file at `path` into `data` and sets `stream` to a view of it named after
/// the path. False, with the "cannot read the file" error line printed, when it cannot.
bool openInput(const std::string& path, base::vector<std::uint8_t>& data, base::Stream& stream);

}  // namespace scenetool
