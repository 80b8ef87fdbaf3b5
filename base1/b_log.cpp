#include "b_log.h"

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <ctime>

#include <fmt/chrono.h>
#include <cstring>

namespace base {

const name_id logScene = intern("scene");
const name_id logSystem = intern("system");
const name_id logIO = intern("io");
const name_id logAll = intern("all");

LogSink::~LogSink() = default;

Log::Log() = default;

Log::~Log() {
  if (m_file) std::fclose(m_file);
}

std::string levelText(int level) {
  switch (level) {
    case logError: return "error";
    case logWarning: return "warning";
    case logInfo: return "info";
    case logDebug: return "debug";
    default: return fmt::format("level {}", level);
  }
}

void Log::write(name_id category, int level, std::string_view text) {
  std::lock_guard lock(m_mutex);
  if (m_stderr) {
    fmt::print(stderr, "{}: {}\n", levelText(level), text);
  }
  if (m_file) {
    const auto now = std::chrono::system_clock::to_time_t(std::chrono::system_clock::now());
    std::tm local{};
#if defined(_WIN32)
    localtime_s(&local, &now);
#else
    localtime_r(&now, &local);
#endif
    fmt::print(m_file, "{:%Y-%m-%d %H:%M:%S} {} [{}] {}\n", local, levelText(level), base::text(category), text);
    std::fflush(m_file);
  }
  for (LogSink* sink : m_sinks) sink->write(category, level, text);
}

void Log::setStderr(bool enabled) {
  std::lock_guard lock(m_mutex);
  m_stderr = enabled;
}

bool Log::setFile(const std::string& path, std::string& error) {
  std::FILE* file = nullptr;
  if (!path.empty()) {
    file = std::fopen(path.c_str(), "a");
    if (!file) {
      error = std::strerror(errno);
      return false;
    }
  }
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

Log& log() {
  // Never destroyed, so that destructors of other static objects may still log.
  static Log* instance = new Log;
  return *instance;
}

}  // namespace base
