#include "call_log.h"

#include "b_utf8.h"

#include <fmt/format.h>

#include <algorithm>

namespace pymeshport {
namespace {

thread_local CallLog* currentCall = nullptr;

}  // namespace

class ThreadLogSink : public base::LogSink {
 public:
  ~ThreadLogSink() override { base::log().removeSink(this); }
  void write(base::name_id, int level, std::string_view text) override {
    if (currentCall) {
      // Messages quote names from files, which may be in any encoding; Python takes text.
      currentCall->m_messages.push_back({level, base::utf8Text(text)});
    } else {
      fmt::print(stderr, "meshport: {}: {}\n", base::levelText(level), text);
    }
  }
};

CallLog::CallLog() : m_outer(std::exchange(currentCall, this)) {}

CallLog::~CallLog() { currentCall = m_outer; }

std::optional<std::string> CallLog::cause() const {
  const auto found = std::find_if(m_messages.rbegin(), m_messages.rend(),
                                  [](const Message& message) { return message.level <= base::logWarning; });
  if (found == m_messages.rend()) return std::nullopt;
  return found->text;
}

void CallLog::install() {
  // The log exists before the sink, so the sink goes first at exit.
  base::Log& log = base::log();
  static ThreadLogSink sink;
  log.setStderr(false);
  log.addSink(&sink);
}

}  // namespace pymeshport
