#pragma once

#include "b_api.h"

namespace base {

/// A lock within one process: a critical section on Windows, a mutex elsewhere. Meets the
/// standard's BasicLockable, so std::lock_guard takes it. The lock may be taken again by the
/// thread that holds it only on Windows; callers never rely on that.
class BASE1_API CriticalSection {
 public:
  CriticalSection();
  ~CriticalSection();
  CriticalSection(const CriticalSection&) = delete;
  CriticalSection& operator=(const CriticalSection&) = delete;

  void lock();
  void unlock();

 private:
  // Room for the system's lock object, which lives here without a header of its own.
  alignas(16) unsigned char m_storage[64];
};

}  // namespace base
