#include "b_exception.h"

#include "b_log.h"
#include "b_platform_system.h"
#include "b_stack_walker.h"

#include <zlib.h>

namespace base {
namespace {

const char* orNull(const char* text) { return text ? text : "(null)"; }

std::string_view orNull(const base::string& text) { return text.empty() ? std::string_view("(null)") : text; }

base::string withSystemText(std::string_view message, std::uint32_t code) {
  base::string text(message);
  text += "| ";
  text += systemErrorText(code);
  return text;
}

}  // namespace

base::string systemErrorText(std::uint32_t code) {
  base::string text = platform::systemErrorText(code);
  while (!text.empty() && (text.back() == '\r' || text.back() == '\n')) text.pop_back();
  return text;
}

exception::exception(std::string_view message, const char* file, const char* function, unsigned line)
    : m_line(line),
      m_file(file),
      m_function(function),
      m_message(message),
      // Skip this constructor's own frame.
      m_callStack(stackWalker().capture(1)) {}

exception::~exception() = default;

const char* exception::what() const noexcept { return m_message.c_str(); }

void exception::report(Log& log) const {
  log.message(logSystem, logError, "{}\n    File: {} ({})\nFunction: {}", orNull(m_message), orNull(m_file), m_line,
              orNull(m_function));
  if (m_callStack.empty()) return;
  log.message(logSystem, logError, "Call stack:");
  log.text(logSystem, logError, m_callStack);
}

void exception::reportWithDetail(Log& log, std::string_view prefix, std::string_view detail) const {
  log.message(logSystem, logError, "{}{}({})\n    File: {} ({})\nFunction: {}\n", prefix, orNull(m_message), detail,
              orNull(m_file), m_line, orNull(m_function));
}

switch_exception::switch_exception(const char* file, const char* function, unsigned line)
    : exception("Unhandled case in switch statement.", file, function, line) {}

string_conversion_exception::string_conversion_exception(std::string_view message, const char* file,
                                                         const char* function, unsigned line)
    : exception(message.empty() ? std::string_view("Invalid string conversion") : message, file, function, line) {}

api_exception::api_exception(std::string_view message, const char* file, const char* function, unsigned line,
                             std::uint32_t errorCode)
    : exception(withSystemText(message, errorCode), file, function, line), m_errorCode(errorCode) {}

unsupported_interface::unsupported_interface(const char* file, const char* function, unsigned line,
                                             const char* interfaceName)
    : exception("Unsupported interface.", file, function, line), m_interface(interfaceName) {}

void unsupported_interface::report(Log& log) const { reportWithDetail(log, "", orNull(m_interface)); }

invalid_argument::invalid_argument(const char* file, const char* function, unsigned line, std::string_view argument)
    : exception("Invalid argument", file, function, line), m_argument(argument) {}

void invalid_argument::report(Log& log) const { reportWithDetail(log, "", m_argument); }

zlib_exception::zlib_exception(std::string_view message, const char* file, const char* function, unsigned line,
                               int zlibCode)
    : exception(message, file, function, line), m_zlibCode(zlibCode) {}

void zlib_exception::report(Log& log) const {
  // zError indexes a table without a bounds check: only the codes zlib defines may reach it.
  if (m_zlibCode < Z_VERSION_ERROR || m_zlibCode > Z_NEED_DICT) {
    reportWithDetail(log, "zlib| ", fmt::format("unknown zlib error {}", m_zlibCode));
    return;
  }
  reportWithDetail(log, "zlib| ", orNull(zError(m_zlibCode)));
}

namespace fs {
file_not_found::file_not_found(std::string_view message, const char* file, const char* function, unsigned line,
                               std::string_view path)
    : exception(message, file, function, line), m_path(path) {}
}  // namespace fs

// Out of line, so that each kind's type information lives in this library alone and a
// plug-in that throws one does not carry (and export) a copy of its own.
switch_exception::~switch_exception() = default;
string_conversion_exception::~string_conversion_exception() = default;
api_exception::~api_exception() = default;
unsupported_interface::~unsupported_interface() = default;
invalid_argument::~invalid_argument() = default;
wrong_password::~wrong_password() = default;
zlib_exception::~zlib_exception() = default;
namespace fs {
file_not_found::~file_not_found() = default;
}  // namespace fs

}  // namespace base
