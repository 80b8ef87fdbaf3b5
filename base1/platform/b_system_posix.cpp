#include "b_platform_system.h"

#include "b_exception.h"

#include <execinfo.h>
#include <sched.h>
#include <sys/mman.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <mutex>
#include <new>
#include <thread>

namespace base::platform {

base::string systemErrorText(std::uint32_t code) {
  // glibc names every code it knows; for the others strerror would invent "Unknown error N".
  const int value = static_cast<int>(code);
  if (code > 0x7fffffffu || strerrorname_np(value) == nullptr) return {};
  char buffer[1024];
  const char* text = strerror_r(value, buffer, sizeof buffer);
  return base::string(text);
}

base::string captureStack(int skip) {
  constexpr int maxFrames = 64;
  void* frames[maxFrames];
  const int count = backtrace(frames, maxFrames);
  std::unique_ptr<char*, decltype(&std::free)> symbols(backtrace_symbols(frames, count), &std::free);
  base::string text;
  for (int i = skip + 1; i < count; ++i) {
    text += symbols ? symbols.get()[i] : "?";
    text += '\n';
  }
  return text;
}

void* allocateBytes(std::size_t size) {
  constexpr std::size_t largePage = std::size_t(2) << 20;
  if (size < 2 * largePage) return std::malloc(size);
  if (size > SIZE_MAX - largePage) return nullptr;
  const std::size_t rounded = (size + largePage - 1) & ~(largePage - 1);
  void* block = std::aligned_alloc(largePage, rounded);
  // Only advice: where the system has no large pages to give, the block works as it is.
  if (block) madvise(block, rounded, MADV_HUGEPAGE);
  return block;
}

std::tm localTime(std::time_t time) {
  std::tm local{};
  localtime_r(&time, &local);
  return local;
}

char pathSeparator() { return '/'; }

base::string executablePath() {
  base::string path(1024, '\0');
  for (int attempt = 0; attempt < 10; ++attempt, path.resize(path.size() * 2)) {
    const ssize_t length = readlink("/proc/self/exe", path.data(), path.size());
    if (length < 0) {
      raise<api_exception>("base::getExecutablePath", "Can't get the executable's path",
                           static_cast<std::uint32_t>(errno));
    }
    if (static_cast<std::size_t>(length) < path.size()) {
      path.resize(static_cast<std::size_t>(length));
      return path;
    }
  }
  raise<api_exception>("base::getExecutablePath", "Can't get the executable's path",
                       static_cast<std::uint32_t>(ENAMETOOLONG));
}

bool isTerminal(std::FILE* stream) { return ::isatty(::fileno(stream)) == 1; }

std::FILE* openForAppending(const std::string& path, std::string& error) {
  std::FILE* file = std::fopen(path.c_str(), "a");
  // fopen reports through errno, whose texts the C library has.
  if (!file) error = std::strerror(errno);
  return file;
}

void createLock(void* storage, std::size_t size) {
  static_assert(alignof(std::mutex) <= 16);
  if (size < sizeof(std::mutex)) std::abort();  // the storage was sized for every system
  new (storage) std::mutex;
}

void destroyLock(void* storage) { static_cast<std::mutex*>(storage)->~mutex(); }

void enterLock(void* storage) { static_cast<std::mutex*>(storage)->lock(); }

void leaveLock(void* storage) { static_cast<std::mutex*>(storage)->unlock(); }

void yieldThread() { sched_yield(); }

void sleepMilliseconds(unsigned milliseconds) { std::this_thread::sleep_for(std::chrono::milliseconds(milliseconds)); }

}  // namespace base::platform
