#pragma once

#include "b_log.h"

#include <chrono>
#include <string>

namespace scenetool {

/// Draws the progress of long work as a bar on standard error while it lives, when standard
/// error is a terminal and the work takes more than about a second; never anywhere else.
class ProgressBar : public base::LogSink {
 public:
  ProgressBar();
  ~ProgressBar() override;
  ProgressBar(const ProgressBar&) = delete;
  ProgressBar& operator=(const ProgressBar&) = delete;

  void write(base::name_id, int, std::string_view) override {}
  void progress(base::name_id category, std::string_view what, std::uint64_t done, std::uint64_t total) override;

 private:
  void clear();

  bool m_enabled;
  bool m_started = false;
  bool m_drawn = false;
  int m_percent = -1;
  std::chrono::steady_clock::time_point m_start;
};

}  // namespace scenetool
