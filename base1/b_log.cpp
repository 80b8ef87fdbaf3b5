#include "b_log.h"

#include "b_platform_system.h"

#include <algorithm>
#include <chrono>
#include <ctime>

#include <fmt/chrono.h>

namespace base {

const name_id logScene = intern("scene");
const name_id logSystem = intern("system");
const name_id logIO = intern("io");
const name_id logAll = intern("all");

LogSink::~LogSink() = default;

void LogSink::progress(name_id, std::string_view, std::uint64_t, std::uint64_t) {}

Log::Log() = default;

Log::~Log() {
  if (m_file) std::fclose(m_file);
}

std::string levelText(int level) {
  switch (level) {
    case logError:
      return "error";
    case logWarning:
      return "warning";
    case logInfo:
      return "info";
    case logDebug:
      return "debug";
    default:
      return fmt::format("level {}", level);
  }
}

namespace {
// How deep this thread is inside sinks. A sink may log: its message reaches the sinks again,
// but only a few levels deep, so a sink that always logs cannot recurse without end.
thread_local int sinkDepth = 0;
constexpr int maxSinkDepth = 4;

struct SinkDepth {
  SinkDepth() { ++sinkDepth; }
  ~SinkDepth() { --sinkDepth; }
};
}  // namespace

void Log::write(name_id category, int level, std::string_view text) {
  // Recursive, so that a sink may log or add and remove sinks; held while the sinks run, so
  // that a sink is never called after removeSink returned.
  std::lock_guard lock(m_mutex);
  if (m_stderr) {
    fmt::print(stderr, "{}: {}\n", levelText(level), text);
  }
  if (m_file) {
    const std::tm local = platform::localTime(std::chrono::system_clock::to_time_t(std::chrono::system_clock::now()));
    fmt::print(m_file, "{:%Y-%m-%d %H:%M:%S} {} [{}] {}\n", local, levelText(level), base::text(category), text);
    std::fflush(m_file);
  }
  if (sinkDepth >= maxSinkDepth) return;
  const SinkDepth depth;
  // A copy, since a sink may change the list while it runs.
  const std::vector<LogSink*> sinks = m_sinks;
  for (LogSink* sink : sinks) sink->write(category, level, text);
}

void Log::progress(name_id category, std::string_view what, std::uint64_t done, std::uint64_t total) {
  std::lock_guard lock(m_mutex);
  const std::vector<LogSink*> sinks = m_sinks;
  for (LogSink* sink : sinks) sink->progress(category, what, done, total);
}

bool isTerminal(std::FILE* stream) { return platform::isTerminal(stream); }

void Log::setStderr(bool enabled) {
  std::lock_guard lock(m_mutex);
  m_stderr = enabled;
}

bool Log::setFile(const std::string& path, std::string& error) {
  std::FILE* file = nullptr;
  if (!path.empty() && !(file = platform::openForAppending(path, error))) return false;
  std::lock_guard lock(m_mutex);
  if (m_file) std::fclose(m_file);
  m_file = file;
  return true;
}

void Log::addSink(LogSink* sink) {
  std::lock_guard lock(m_mutex);
  m_sinks.push_back(sink);
}

void Log::removeSink(LogSink* sink) {
  std::lock_guard lock(m_mutex);
  m_sinks.erase(std::remove(m_sinks.begin(), m_sinks.end(), sink), m_sinks.end());
}

std::string clipped(std::string_view text, std::size_t limit) {
  if (text.size() <= limit) return std::string(text);
  std::size_t cut = limit;
  // Never end inside a UTF-8 sequence: back off over its continuation bytes.
  while (cut > 0 && (static_cast<unsigned char>(text[cut]) & 0xC0) == 0x80) --cut;
  std::string result(text.substr(0, cut));
  result += "...";
  return result;
}

Log& log() {
  // Never destroyed, so that destructors of other static objects may still log.
  static Log* instance = new Log;
  return *instance;
}

}  // namespace base
