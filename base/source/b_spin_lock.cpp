#include "b_spin_lock.h"

#include "b_platform_system.h"

namespace base {

SpinLock::BackOff SpinLock::backOffStep(unsigned attempt) {
  if (attempt < 60) return BackOff::spin;
  if (attempt < 90) return BackOff::yield;
  if (attempt < 105) return BackOff::sleep0;
  return BackOff::sleep1;
}

void SpinLock::backOff(unsigned& attempt) {
  switch (backOffStep(attempt)) {
    case BackOff::spin:
      break;
    case BackOff::yield:
      platform::yieldThread();
      break;
    case BackOff::sleep0:
      platform::sleepMilliseconds(0);
      break;
    case BackOff::sleep1:
      platform::sleepMilliseconds(1);
      attempt = 0;
      return;
  }
  ++attempt;
}

void SpinLock::lockContended() {
  unsigned attempt = 0;
  do {
    backOff(attempt);
  } while (!try_lock());
}

}  // namespace base
