#pragma once

#include "b_api.h"
#include "b_name.h"

#include <fmt/format.h>

#include <atomic>
#include <cstdint>
#include <cstdio>
#include <mutex>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace base {

/// Log categories: the handles of "scene", "system", "io" and "all".
BASE1_API extern const name_id logScene;
BASE1_API extern const name_id logSystem;
BASE1_API extern const name_id logIO;
BASE1_API extern const name_id logAll;

/// Log levels.
enum LogLevel : int { logError = 2, logWarning = 3, logInfo = 4, logDebug = 5 };

/// A destination for finished log messages (a test's capture, a window, ...).
class BASE1_API LogSink {
 public:
  virtual ~LogSink();
  virtual void write(name_id category, int level, std::string_view text) = 0;
  /// Long work has got to `done` of `total` (a front end draws a bar); nothing by default.
  virtual void progress(name_id category, std::string_view what, std::uint64_t done, std::uint64_t total);
};

/// The log: a current level and the sinks that finished messages go to. Standard error is
/// a sink by default; a file sink can be added. Thread-safe.
class BASE1_API Log {
 public:
  Log();
  virtual ~Log();
  Log(const Log&) = delete;
  Log& operator=(const Log&) = delete;

  /// Hands a finished message to every sink. No filtering happens here.
  virtual void write(name_id category, int level, std::string_view text);

  /// Formats and writes a message unless its level is above the current one or its format is
  /// empty; both are tested before any formatting.
  template <class... Args>
  requires(sizeof...(Args) > 0) void message(name_id category, int level, fmt::format_string<Args...> format,
                                             Args&&... args) {
    const fmt::string_view text = format;
    if (level > m_level.load(std::memory_order_relaxed) || text.size() == 0) return;
    write(category, level, fmt::format(format, std::forward<Args>(args)...));
  }

  /// A message without arguments is passed unchanged: its braces are not placeholders.
  void message(name_id category, int level, std::string_view text) { this->text(category, level, text); }

  /// Writes a finished text, which is not a format, unless its level is above the current one.
  void text(name_id category, int level, std::string_view finished) {
    if (level <= m_level.load(std::memory_order_relaxed) && !finished.empty()) write(category, level, finished);
  }

  int level() const { return m_level.load(std::memory_order_relaxed); }
  void setLevel(int level) { m_level = level; }

  /// Hands a progress report to every sink (base::Progress makes them).
  void progress(name_id category, std::string_view what, std::uint64_t done, std::uint64_t total);

  /// Turns the standard-error sink on or off.
  void setStderr(bool enabled);
  /// Appends every message to the file at `path` from now on; an empty path closes it.
  /// Returns false, with the system's reason in `error`, when the file cannot be opened.
  bool setFile(const std::string& path, std::string& error);

  /// Adds or removes a sink that the caller owns.
  void addSink(LogSink* sink);
  void removeSink(LogSink* sink);

 private:
  std::atomic<int> m_level{logWarning};
  bool m_stderr = true;
  std::FILE* m_file = nullptr;
  std::vector<LogSink*> m_sinks;
  std::recursive_mutex m_mutex;
};

/// The process-wide log; callers never own it.
BASE1_API Log& log();

/// `text` as a message may quote it: words from a file are cut to `limit` bytes (never
/// inside a UTF-8 sequence) and marked with "...", so a hostile word cannot flood the log.
BASE1_API std::string clipped(std::string_view text, std::size_t limit = 80);

/// Whether `stream` is an interactive terminal (where a progress bar may be drawn).
BASE1_API bool isTerminal(std::FILE* stream);

/// The text of a level: "error", "warning", "info", "debug" (others: "level N").
BASE1_API std::string levelText(int level);

}  // namespace base
