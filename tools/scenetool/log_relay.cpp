#include "log_relay.h"

#include "b_utf8.h"

#include <fmt/format.h>

namespace scenetool {

LogRelay::LogRelay() {
  base::log().setStderr(false);
  base::log().addSink(this);
}

LogRelay::~LogRelay() {
  base::log().removeSink(this);
  base::log().setStderr(true);
  printHeld();
}

// Messages quote names from files, which may be in any encoding: the terminal gets text.
void LogRelay::write(base::name_id, int level, std::string_view bytes) {
  const std::string text = base::utf8Text(bytes);
  if (level == base::logError) {
    printHeld();
    m_held = text;
    return;
  }
  fmt::print(stderr, "{}: {}\n", base::levelText(level), text);
}

std::optional<std::string> LogRelay::takeCause() { return std::exchange(m_held, std::nullopt); }

void LogRelay::printHeld() {
  if (m_held) fmt::print(stderr, "{}: {}\n", base::levelText(base::logError), *m_held);
  m_held.reset();
}

}  // namespace scenetool
