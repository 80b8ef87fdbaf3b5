#include "b_critical_section.h"

#include "b_platform_system.h"

namespace base {

CriticalSection::CriticalSection() { platform::createLock(m_storage, sizeof m_storage); }

CriticalSection::~CriticalSection() { platform::destroyLock(m_storage); }

void CriticalSection::lock() { platform::enterLock(m_storage); }

void CriticalSection::unlock() { platform::leaveLock(m_storage); }

}  // namespace base
