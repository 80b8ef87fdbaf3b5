#pragma once

#include "b_log.h"

#include <optional>
#include <string>
#include <vector>

namespace pymeshport {

/// The log's messages that the current thread writes while a CallLog lives on it, held for
/// the caller: the module turns the cause of a failure into the exception's text and hands
/// the rest to Python's logging afterwards, when it holds the interpreter again. Calls on
/// other threads keep their own messages apart.
class CallLog {
 public:
  struct Message {
    int level = base::logInfo;
    std::string text;
  };

  CallLog();
  ~CallLog();
  CallLog(const CallLog&) = delete;
  CallLog& operator=(const CallLog&) = delete;

  /// The latest error or warning: what a failed call cites. A reader that stops says why
  /// as an error, then where as a warning ("The data ends early in element 'face': ...").
  std::optional<std::string> cause() const;
  /// Every message held, in order, taken.
  std::vector<Message> take() { return std::move(m_messages); }

  /// Routes the process's log through the calls: once, when the module loads. Messages
  /// written outside any call still go to standard error.
  static void install();

 private:
  friend class ThreadLogSink;
  std::vector<Message> m_messages;
  CallLog* m_outer = nullptr;
};

}  // namespace pymeshport
