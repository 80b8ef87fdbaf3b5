#pragma once

// UTF-8 and UTF-16 for the Windows platform files: paths and system texts reach the system
// as UTF-16 and come back as UTF-8.

#include "b_containers.h"

#include <string>
#include <string_view>

namespace base::platform {

std::wstring wideText(std::string_view text);
base::string utf8Text(std::wstring_view text);

}  // namespace base::platform
