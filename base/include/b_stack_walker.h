#pragma once

#include "b_api.h"
#include "b_containers.h"

namespace base {

/// Produces the text of the current call stack, one frame a line. Capture can be turned
/// off per thread, for code that throws and catches often on purpose.
class BASE1_API StackWalker {
public:
  /// The calling thread's stack without its innermost `skip` frames; empty while capture
  /// is off on this thread or when the platform gives no frames.
  base::string capture(int skip = 0) const;

  /// Turns capture on or off for the calling thread; returns the previous setting.
  static bool setThreadCapture(bool enabled);
  static bool threadCapture();
};

/// Turns stack capture off on this thread for the life of the object.
class BASE1_API NoStackCapture {
public:
  NoStackCapture();
  ~NoStackCapture();
  NoStackCapture(const NoStackCapture&) = delete;
  NoStackCapture& operator=(const NoStackCapture&) = delete;

private:
  bool m_previous;
};

/// The process-wide stack walker; callers never own it.
BASE1_API StackWalker& stackWalker();

}  // namespace base
