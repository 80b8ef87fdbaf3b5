#pragma once

#include "b_log.h"

#include <string>
#include <vector>

namespace testing_support {

/// Collects every log message while alive, at the given level, and keeps standard error
/// quiet; restores the log's level and standard error when destroyed.
class LogCapture : public base::LogSink {
 public:
  struct Entry {
    base::name_id category;
    int level;
    std::string text;
  };

  explicit LogCapture(int level = base::logDebug) : m_previousLevel(base::log().level()) {
    base::log().setLevel(level);
    base::log().setStderr(false);
    base::log().addSink(this);
  }
  ~LogCapture() override {
    base::log().removeSink(this);
    base::log().setStderr(true);
    base::log().setLevel(m_previousLevel);
  }

  void write(base::name_id category, int level, std::string_view text) override {
    entries.push_back({category, level, std::string(text)});
  }

  /// The texts alone, in order.
  std::vector<std::string> texts() const {
    std::vector<std::string> result;
    for (const Entry& entry : entries) result.push_back(entry.text);
    return result;
  }

  void progress(base::name_id, std::string_view what, std::uint64_t done, std::uint64_t total) override {
    progressReports.push_back({std::string(what), done, total});
  }

  struct ProgressReport {
    std::string what;
    std::uint64_t done;
    std::uint64_t total;
  };

  std::vector<Entry> entries;
  std::vector<ProgressReport> progressReports;

 private:
  int m_previousLevel;
};

}  // namespace testing_support
