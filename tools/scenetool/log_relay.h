#pragma once

#include "b_log.h"

#include <optional>
#include <string>

namespace scenetool {

/// Takes over the log's standard-error output while a command runs, so that no message is
/// printed twice: the latest error is held back, because when the command fails it is the
/// cause and goes into the one "scenetool: error:" line. Every other message, and a held
/// error that turns out not to be the cause, is printed as a log line.
class LogRelay : public base::LogSink {
 public:
  LogRelay();
  ~LogRelay() override;
  LogRelay(const LogRelay&) = delete;
  LogRelay& operator=(const LogRelay&) = delete;

  void write(base::name_id category, int level, std::string_view text) override;

  /// The held error, taken; empty when none was logged.
  std::optional<std::string> takeCause();

 private:
  void printHeld();

  std::optional<std::string> m_held;
};

}  // namespace scenetool
