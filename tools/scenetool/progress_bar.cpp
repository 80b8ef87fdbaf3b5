#include "progress_bar.h"

#include <fmt/format.h>

#include <cstdio>

namespace scenetool {
namespace {
constexpr int barWidth = 30;
constexpr auto quietTime = std::chrono::seconds(1);
}  // namespace

ProgressBar::ProgressBar() : m_enabled(base::isTerminal(stderr)) {
  if (m_enabled) base::log().addSink(this);
}

ProgressBar::~ProgressBar() {
  if (!m_enabled) return;
  base::log().removeSink(this);
  clear();
}

void ProgressBar::progress(base::name_id, std::string_view what, std::uint64_t done, std::uint64_t total) {
  const auto now = std::chrono::steady_clock::now();
  if (!m_started) {
    m_started = true;
    m_start = now;
  }
  if (done >= total) {
    clear();
    m_started = false;
    return;
  }
  const int percent = total ? static_cast<int>(done * 100 / total) : 100;
  if (now - m_start < quietTime || percent == m_percent) return;
  m_percent = percent;
  const int filled = percent * barWidth / 100;
  fmt::print(stderr, "\r{} [{}{}] {:3}%", what, std::string(static_cast<std::size_t>(filled), '#'),
             std::string(static_cast<std::size_t>(barWidth - filled), ' '), percent);
  std::fflush(stderr);
  m_drawn = true;
}

void ProgressBar::clear() {
  if (!m_drawn) return;
  fmt::print(stderr, "\r\033[K");
  std::fflush(stderr);
  m_drawn = false;
  m_percent = -1;
}

}  // namespace scenetool
