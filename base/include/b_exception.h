#pragma once

#include "b_api.h"
#include "b_containers.h"

#include <cstdint>
#include <exception>
#include <string_view>
#include <type_traits>
#include <utility>

namespace base {

class Log;

/// Where an exception was raised: the qualified function name given at the throw site, and
/// the real file and line.
struct ThrowSite {
  const char* function;
  const char* file;
  unsigned line;

  // The builtins give the caller's place, like std::source_location, on every compiler
  // the project builds with.
  ThrowSite(const char* functionName, const char* callerFile = __builtin_FILE(), unsigned callerLine = __builtin_LINE())
      : function(functionName), file(callerFile), line(callerLine) {}
};

/// The root of every failure that a caller cannot test for. It records where it was raised
/// and the call stack at that moment (empty while capture is off on the thread), and writes
/// itself to a log at level 2 in the "system" category.
class BASE1_API exception : public std::exception {
 public:
  exception(std::string_view message, const char* file, const char* function, unsigned line);
  ~exception() override;

  const char* what() const noexcept override;
  /// Writes the exception as one error message, then the call stack when one was captured.
  virtual void report(Log& log) const;

  unsigned line() const { return m_line; }
  const char* file() const { return m_file; }
  const char* function() const { return m_function; }
  const base::string& message() const { return m_message; }
  const base::string& callStack() const { return m_callStack; }

 protected:
  /// Writes "<message>(<detail>)" with the place, the form of kinds that carry a detail.
  void reportWithDetail(Log& log, std::string_view prefix, std::string_view detail) const;

 private:
  unsigned m_line;
  const char* m_file;
  const char* m_function;
  base::string m_message;
  base::string m_callStack;
};

/// A switch met a value it has no case for.
class BASE1_API switch_exception : public exception {
 public:
  ~switch_exception() override;
  switch_exception(const char* file, const char* function, unsigned line);
};

/// A text that does not convert to the requested type.
class BASE1_API string_conversion_exception : public exception {
 public:
  ~string_conversion_exception() override;
  /// An empty `message` becomes "Invalid string conversion".
  string_conversion_exception(std::string_view message, const char* file, const char* function, unsigned line);
};

/// An operating-system call failed; the message ends with the system's text for the code.
class BASE1_API api_exception : public exception {
 public:
  ~api_exception() override;
  api_exception(std::string_view message, const char* file, const char* function, unsigned line,
                std::uint32_t errorCode);
  std::uint32_t errorCode() const { return m_errorCode; }

 private:
  std::uint32_t m_errorCode;
};

/// An object or stream lacks the interface that an operation needs.
class BASE1_API unsupported_interface : public exception {
 public:
  ~unsupported_interface() override;
  unsupported_interface(const char* file, const char* function, unsigned line, const char* interfaceName);
  const char* interfaceName() const { return m_interface; }
  void report(Log& log) const override;

 private:
  const char* m_interface;
};

/// An argument outside what the operation accepts.
class BASE1_API invalid_argument : public exception {
 public:
  ~invalid_argument() override;
  invalid_argument(const char* file, const char* function, unsigned line, std::string_view argument);
  const base::string& argument() const { return m_argument; }
  void report(Log& log) const override;

 private:
  base::string m_argument;
};

/// A password that does not open the data.
class BASE1_API wrong_password : public exception {
 public:
  ~wrong_password() override;
  using exception::exception;
};

/// A zlib call failed; reports with zlib's text for the result code.
class BASE1_API zlib_exception : public exception {
 public:
  ~zlib_exception() override;
  zlib_exception(std::string_view message, const char* file, const char* function, unsigned line, int zlibCode);
  int zlibCode() const { return m_zlibCode; }
  void report(Log& log) const override;

 private:
  int m_zlibCode;
};

namespace fs {
/// A path that names no file.
class BASE1_API file_not_found : public base::exception {
 public:
  ~file_not_found() override;
  file_not_found(std::string_view message, const char* file, const char* function, unsigned line,
                 std::string_view path);
  const base::string& path() const { return m_path; }

 private:
  base::string m_path;
};
}  // namespace fs

namespace detail {
template <class E, class Message, class... Rest>
[[noreturn]] void raiseWithMessage(const ThrowSite& site, Message&& message, Rest&&... rest) {
  throw E(std::forward<Message>(message), site.file, site.function, site.line, std::forward<Rest>(rest)...);
}
}  // namespace detail

/// The one way to throw: `raise<api_exception>("base::fs::open", "Can't open", code)`.
/// The site fills file, function and line; the other arguments are the kind's own: its
/// message first for the kinds that take one, then its extra field.
template <class E, class... Args>
[[noreturn]] void raise(ThrowSite site, Args&&... args) {
  if constexpr (std::is_constructible_v<E, const char*, const char*, unsigned, Args&&...>) {
    throw E(site.file, site.function, site.line, std::forward<Args>(args)...);
  } else {
    detail::raiseWithMessage<E>(site, std::forward<Args>(args)...);
  }
}

/// The operating system's description of an error code, without trailing CR/LF; empty for
/// a code that the system does not know.
BASE1_API base::string systemErrorText(std::uint32_t code);

}  // namespace base
