#pragma once

// A ceiling on a test process's memory, for tests that prove that hostile counts allocate
// nothing the input does not back. Meant for a death-test child: the limit stays until
// the process ends. Needs POSIX, and a build without AddressSanitizer, which reserves far
// more address space than it uses.

#if !defined(_WIN32) && !defined(__SANITIZE_ADDRESS__)
#  define MESHPORT_HAS_ADDRESS_LIMIT 1

#  include <sys/resource.h>
#  include <unistd.h>

#  include <cstdint>
#  include <fstream>
#  include <new>

namespace testing_support {

/// The exit status of a child that ran out of memory under the limit.
inline constexpr int allocationFailed = 3;

/// The address space the process holds now.
inline std::uint64_t addressSpaceInUse() {
  std::uint64_t pages = 0;
  std::ifstream("/proc/self/statm") >> pages;
  return pages * static_cast<std::uint64_t>(sysconf(_SC_PAGESIZE));
}

/// Limits the process to the address space it holds and `extra` bytes more. An allocation
/// beyond that through operator new exits with allocationFailed; the host allocator's
/// throws std::bad_alloc, which the caller turns into that exit.
inline void limitAddressSpace(std::uint64_t extra) {
  const rlimit limit{addressSpaceInUse() + extra, RLIM_INFINITY};
  setrlimit(RLIMIT_AS, &limit);
  std::set_new_handler([] { _exit(allocationFailed); });
}

}  // namespace testing_support

#endif
