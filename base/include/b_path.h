#pragma once

#include "b_api.h"
#include "b_containers.h"

#include <string_view>

namespace base {

// Plain string functions on paths. Both `/` and `\` separate path parts on every platform,
// so that a Windows path written with either separator and a POSIX path both work.

/// The extension of the path's file name: the text after its last dot, or with `second`
/// after its second-to-last dot (after the only one when there is one). Empty when the file
/// name has no dot: "a\b.c.ply" gives "ply" and "c.ply"; "dir.old/file" gives "".
BASE1_API base::string getExtension(std::string_view path, bool second = false);

/// The path up to and including its last separator, normalised: separators become the
/// platform's own, a run of them becomes one (a leading pair is kept), and a ".." part
/// removes the part before it. The root stays: "/usr/bin/../data/x" gives "/usr/data/".
/// A path without a separator gives "".
BASE1_API base::string getDirectory(std::string_view path);

/// The full path of the running program (UTF-8). Throws base::api_exception when the system
/// cannot tell it.
BASE1_API base::string getExecutablePath();

}  // namespace base
