#pragma once

#include "b_api.h"

#include <atomic>
#include <cstdint>

namespace base {

/// A one-word lock for short critical sections (weak-reference lists). Waiting backs off in
/// steps counted in attempts: 0-59 spin, 60-89 yield the processor, 90-104 sleep 0 ms,
/// attempt 105 sleeps 1 ms and starts the count again.
class BASE1_API SpinLock {
public:
  enum class BackOff { spin, yield, sleep0, sleep1 };

  void lock() {
    std::uint32_t expected = 0;
    if (m_state.compare_exchange_strong(expected, 1, std::memory_order_acquire)) return;
    lockContended();
  }
  bool try_lock() {
    std::uint32_t expected = 0;
    return m_state.compare_exchange_strong(expected, 1, std::memory_order_acquire);
  }
  void unlock() { m_state.exchange(0, std::memory_order_release); }

  /// What waiting does at `attempt` (0-105).
  static BackOff backOffStep(unsigned attempt);
  /// Waits one step and advances `attempt`, wrapping after 105.
  static void backOff(unsigned& attempt);

private:
  void lockContended();

  std::atomic<std::uint32_t> m_state{0};
};

}  // namespace base
