#pragma once

#include <exception>
#include <string>

namespace pymeshport {

/// What went wrong in a call on a file, sorted into the module's exception classes.
struct CallFailure {
  enum class Kind { error, notFound, unsupported, corrupt, badParameter, badParameterValue, outOfMemory };
  Kind kind = Kind::error;
  std::string message;  ///< names the file first
};

/// `text` about the file at `path`, with the path in front unless it already starts so.
std::string fileMessage(const std::string& path, std::string_view text);

/// The failure that the exception `thrown` stands for; `cause` is what the call logged last
/// as an error or warning, empty when nothing was.
CallFailure failureOf(std::exception_ptr thrown, const std::string& path, const std::string& cause);

/// Thrown by the module's own code where a call fails without an exception of its own.
class CallError : public std::exception {
 public:
  explicit CallError(CallFailure failure) : m_failure(std::move(failure)) {}
  const CallFailure& failure() const { return m_failure; }
  const char* what() const noexcept override { return m_failure.message.c_str(); }

 private:
  CallFailure m_failure;
};

}  // namespace pymeshport
