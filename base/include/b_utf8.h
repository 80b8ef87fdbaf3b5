#pragma once

#include "b_api.h"

#include <string>
#include <string_view>

namespace base {

/// Whether `bytes` is well-formed UTF-8 (no overlong forms, no surrogates, nothing above
/// U+10FFFF).
BASE1_API bool isUtf8(std::string_view bytes);

/// `bytes` as UTF-8 text: each byte that does not start or continue a well-formed sequence
/// becomes U+FFFD, one replacement per maximal ill-formed subpart, as Unicode recommends.
/// Names from files keep their bytes everywhere else; this is for output that must be text
/// (JSON, Python strings).
BASE1_API std::string utf8Text(std::string_view bytes);

}  // namespace base
