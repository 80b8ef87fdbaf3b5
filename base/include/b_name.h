#pragma once

#include "b_api.h"

#include <cstddef>
#include <string_view>

namespace base {

/// An interned text: immutable, zero-terminated, alive for the life of the process.
struct NameRecord {
  const char* text;
  std::size_t length;
};

/// Handle of an interned text. Equal texts give the identical handle, so handles compare
/// (and order) by address. The null handle means "not set"; the handle of "" is a valid one.
using name_id = const NameRecord*;

/// The process-wide table of interned texts. Thread-safe; entries are never removed.
class BASE1_API NameServer {
 public:
  /// Returns the handle of `text`, inserting it on first sight.
  virtual name_id intern(std::string_view text) = 0;
  /// Returns the handle of `text` when it is interned already, else null; inserts nothing.
  virtual name_id find(std::string_view text) const = 0;
  /// Number of interned texts.
  virtual std::size_t size() const = 0;

 protected:
  // Out of line: the class's type information then lives in base1 alone.
  virtual ~NameServer();
};

/// The process-wide name server; callers never own it.
BASE1_API NameServer& nameServer();

/// Shorthand for nameServer().intern(text).
inline name_id intern(std::string_view text) { return nameServer().intern(text); }

/// The text of a handle; the null handle reads as "".
inline std::string_view text(name_id name) {
  return name ? std::string_view(name->text, name->length) : std::string_view();
}

}  // namespace base
