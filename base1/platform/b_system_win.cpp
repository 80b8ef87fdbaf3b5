#include "b_platform_system.h"

#include "b_exception.h"
#include "b_win_text.h"

#include <windows.h>

#include <io.h>
#include <cerrno>
#include <cstdio>
#include <cstdlib>

namespace base::platform {

base::string systemErrorText(std::uint32_t code) {
  wchar_t wide[1024];
  const DWORD length = FormatMessageW(FORMAT_MESSAGE_FROM_SYSTEM | FORMAT_MESSAGE_IGNORE_INSERTS, nullptr, code,
                                      MAKELANGID(LANG_NEUTRAL, SUBLANG_DEFAULT), wide, 1024, nullptr);
  if (length == 0) return {};
  return utf8Text(std::wstring_view(wide, length));
}

std::wstring wideText(std::string_view text) {
  if (text.empty()) return {};
  const int size = static_cast<int>(text.size());
  const int count = MultiByteToWideChar(CP_UTF8, 0, text.data(), size, nullptr, 0);
  std::wstring result(static_cast<std::size_t>(count), L'\0');
  MultiByteToWideChar(CP_UTF8, 0, text.data(), size, result.data(), count);
  return result;
}

base::string utf8Text(std::wstring_view text) {
  if (text.empty()) return {};
  const int size = static_cast<int>(text.size());
  const int bytes = WideCharToMultiByte(CP_UTF8, 0, text.data(), size, nullptr, 0, nullptr, nullptr);
  base::string result(static_cast<std::size_t>(bytes), '\0');
  WideCharToMultiByte(CP_UTF8, 0, text.data(), size, result.data(), bytes, nullptr, nullptr);
  return result;
}

base::string captureStack(int skip) {
  constexpr int maxFrames = 62;
  void* frames[maxFrames];
  const USHORT count = CaptureStackBackTrace(static_cast<DWORD>(skip + 1), maxFrames, frames, nullptr);
  base::string text;
  for (USHORT i = 0; i < count; ++i) {
    HMODULE module = nullptr;
    char name[MAX_PATH] = "?";
    if (GetModuleHandleExA(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                           static_cast<LPCSTR>(frames[i]), &module)) {
      GetModuleFileNameA(module, name, MAX_PATH);
    }
    char line[MAX_PATH + 64];
    std::snprintf(line, sizeof line, "%s(+0x%llx)\n", name,
                  static_cast<unsigned long long>(static_cast<char*>(frames[i]) - reinterpret_cast<char*>(module)));
    text += line;
  }
  return text;
}

void* allocateBytes(std::size_t size) { return std::malloc(size); }

std::tm localTime(std::time_t time) {
  std::tm local{};
  localtime_s(&local, &time);
  return local;
}

char pathSeparator() { return '\\'; }

base::string executablePath() {
  std::wstring path(1024, L'\0');
  for (int attempt = 0; attempt < 10; ++attempt, path.resize(path.size() * 2)) {
    const DWORD length = GetModuleFileNameW(nullptr, path.data(), static_cast<DWORD>(path.size()));
    if (length == 0) raise<api_exception>("base::getExecutablePath", "Can't get the executable's path", GetLastError());
    if (length < path.size()) return utf8Text(std::wstring_view(path.data(), length));
  }
  raise<api_exception>("base::getExecutablePath", "Can't get the executable's path",
                       static_cast<std::uint32_t>(ERROR_INSUFFICIENT_BUFFER));
}

bool isTerminal(std::FILE* stream) { return _isatty(_fileno(stream)) != 0; }

std::FILE* openForAppending(const std::string& path, std::string& error) {
  // The narrow fopen reads a path in the ANSI code page, which cannot name every folder:
  // the path goes to the wide one.
  std::FILE* file = _wfopen(wideText(path).c_str(), L"a");
  if (!file) {
    // _wfopen reports through errno, whose texts the C library has.
    char text[256] = {};
    strerror_s(text, sizeof text, errno);
    error = text;
  }
  return file;
}

void createLock(void* storage, std::size_t size) {
  static_assert(alignof(CRITICAL_SECTION) <= 16);
  if (size < sizeof(CRITICAL_SECTION)) std::abort();  // the storage was sized for every system
  InitializeCriticalSection(static_cast<CRITICAL_SECTION*>(storage));
}

void destroyLock(void* storage) { DeleteCriticalSection(static_cast<CRITICAL_SECTION*>(storage)); }

void enterLock(void* storage) { EnterCriticalSection(static_cast<CRITICAL_SECTION*>(storage)); }

void leaveLock(void* storage) { LeaveCriticalSection(static_cast<CRITICAL_SECTION*>(storage)); }

void yieldThread() { SwitchToThread(); }

void sleepMilliseconds(unsigned milliseconds) { Sleep(milliseconds); }

}  // namespace base::platform
