#include "b_stack_walker.h"

#include "b_platform_system.h"

namespace base {
namespace {
thread_local bool t_captureEnabled = true;
}

base::string StackWalker::capture(int skip) const {
  if (!t_captureEnabled) return {};
  // One more frame for this function itself.
  return platform::captureStack(skip + 1);
}

bool StackWalker::setThreadCapture(bool enabled) {
  const bool previous = t_captureEnabled;
  t_captureEnabled = enabled;
  return previous;
}

bool StackWalker::threadCapture() { return t_captureEnabled; }

NoStackCapture::NoStackCapture() : m_previous(StackWalker::setThreadCapture(false)) {}

NoStackCapture::~NoStackCapture() { StackWalker::setThreadCapture(m_previous); }

StackWalker& stackWalker() {
  static StackWalker walker;
  return walker;
}

}  // namespace base
