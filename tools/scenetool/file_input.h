#pragma once

#include "b_containers.h"

#include <cstdint>
#include <string>

namespace scenetool {

/// Reads the whole file at `path`. False, with the system's reason in `error`, when it
/// cannot be opened or read.
bool readWholeFile(const std::string& path, base::vector<std::uint8_t>& data, std::string& error);

}  // namespace scenetool
