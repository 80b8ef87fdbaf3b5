#include "b_exception.h"
#include "b_path.h"
#include "b_platform_fs.h"
#include "b_win_text.h"

#include <windows.h>
// The shell's and the device-control declarations need windows.h first.
#include <shellapi.h>
#include <winioctl.h>

#include <fmt/format.h>

#include <algorithm>
#include <atomic>

namespace base::fs {
namespace {

using platform::wideText;

bool isNotFound(DWORD error) { return error == ERROR_FILE_NOT_FOUND || error == ERROR_PATH_NOT_FOUND; }

[[noreturn]] void fail(const char* function, std::string_view what, std::string_view path, DWORD error) {
  raise<api_exception>(function, fmt::format("{} '{}'", what, path), error);
}

DWORD attributesOf(std::string_view path) { return GetFileAttributesW(wideText(path).c_str()); }

// Closes a system handle when it goes.
struct HandleCloser {
  HANDLE handle;
  ~HandleCloser() {
    if (handle != INVALID_HANDLE_VALUE) CloseHandle(handle);
  }
};

DWORD shareMode(std::uint32_t mode) {
  const bool read = mode & shareRead;
  if (mode & shareWrite) return read ? FILE_SHARE_READ | FILE_SHARE_WRITE : FILE_SHARE_WRITE;
  return read ? FILE_SHARE_READ : 0;
}

DWORD creationRule(std::uint32_t mode) {
  // A file opened only for reading is never emptied.
  const bool truncate = (mode & openTruncate) && (mode & openWrite);
  if (mode & openCreate) return truncate ? CREATE_ALWAYS : OPEN_ALWAYS;
  return truncate ? TRUNCATE_EXISTING : OPEN_EXISTING;
}

// A file opened with CreateFileW; reads and writes go straight to the system.
class WinStreamWorker final : public StreamWorker {
 public:
  WinStreamWorker(const base::string& path, std::uint32_t mode, bool followLinks)
      : StreamWorker(platform::fileStreamCapabilities(mode), path), m_mode(mode), m_followLinks(followLinks) {
    const DWORD access = ((mode & openRead) ? GENERIC_READ : 0) | ((mode & openWrite) ? GENERIC_WRITE : 0);
    const DWORD flags =
        FILE_ATTRIBUTE_NORMAL | FILE_FLAG_SEQUENTIAL_SCAN | (followLinks ? 0 : FILE_FLAG_OPEN_REPARSE_POINT);
    m_file = CreateFileW(wideText(path).c_str(), access, shareMode(mode), nullptr, creationRule(mode), flags, nullptr);
    if (m_file != INVALID_HANDLE_VALUE) return;
    const DWORD error = GetLastError();
    if (isNotFound(error)) {
      raise<file_not_found>("base::fs::WinPlugin::openFile",
                            fmt::format("Can't open '{}': {}", path, systemErrorText(error)), path);
    }
    fail("base::fs::WinPlugin::openFile", "Can't open", path, error);
  }
  ~WinStreamWorker() override { closeFile(); }

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    DWORD got = 0;
    if (!ReadFile(m_file, buffer, count, &got, nullptr))
      fail("base::fs::WinPlugin::readFile", "Can't read", name(), GetLastError());
    if (hasher() && got) hasher()->update(buffer, got);
    return got;
  }
  std::uint32_t write(const void* buffer, std::uint32_t count) override {
    DWORD put = 0;
    if (!WriteFile(m_file, buffer, count, &put, nullptr))
      fail("base::fs::WinPlugin::writeFile", "Can't write", name(), GetLastError());
    return put;
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    const std::int64_t previous = hasher() ? getPosition() : 0;
    const std::int64_t position = move(offset, origin, "base::fs::WinPlugin::fileSetPosition");
    if (hasher() && position != previous) platform::logHashedMove(previous);
    return position;
  }
  std::int64_t getPosition() override { return move(0, seekCurrent, "base::fs::WinPlugin::fileGetPosition"); }
  std::int64_t getSize() override {
    LARGE_INTEGER size{};
    if (!GetFileSizeEx(m_file, &size))
      fail("base::fs::WinPlugin::fileGetSize", "Can't tell the size of", name(), GetLastError());
    return size.QuadPart;
  }
  void setSize(std::int64_t size) override {
    const std::int64_t previous = getPosition();
    move(size, seekBegin, "base::fs::WinPlugin::fileTrunc");
    if (!SetEndOfFile(m_file))
      fail("base::fs::WinPlugin::fileTrunc", "Can't change the size of", name(), GetLastError());
    move(std::min(previous, size), seekBegin, "base::fs::WinPlugin::fileTrunc");
  }
  bool isEOF() override { return getPosition() >= getSize(); }
  void flush() override {
    if ((capabilities() & capWrite) && !FlushFileBuffers(m_file)) {
      fail("base::fs::WinPlugin::fileFlush", "Can't flush", name(), GetLastError());
    }
  }
  void close() override {
    closeFile();
    setCapabilities(0);
  }
  Stream reopen() override {
    return Stream::adopt(new WinStreamWorker(name(), platform::reopenMode(m_mode), m_followLinks));
  }

 private:
  std::int64_t move(std::int64_t offset, std::uint32_t origin, const char* function) {
    const DWORD method = origin == seekBegin ? FILE_BEGIN : origin == seekCurrent ? FILE_CURRENT : FILE_END;
    if (origin > seekEnd) fail(function, "Can't move in", name(), ERROR_INVALID_PARAMETER);
    LARGE_INTEGER distance{};
    distance.QuadPart = offset;
    LARGE_INTEGER position{};
    if (!SetFilePointerEx(m_file, distance, &position, method)) fail(function, "Can't move in", name(), GetLastError());
    return position.QuadPart;
  }
  void closeFile() {
    if (m_file != INVALID_HANDLE_VALUE) CloseHandle(m_file);
    m_file = INVALID_HANDLE_VALUE;
  }

  HANDLE m_file = INVALID_HANDLE_VALUE;
  std::uint32_t m_mode;
  bool m_followLinks;
};

// The files (Files true) or the sub-directories whose names match a pattern.
template <bool Files>
class WinFindFiles final : public IEnum {
 public:
  explicit WinFindFiles(std::string_view pattern) : m_directory(getDirectory(pattern)) {
    m_search = FindFirstFileW(wideText(pattern).c_str(), &m_entry);
    if (m_search == INVALID_HANDLE_VALUE) {
      const DWORD error = GetLastError();
      if (error == ERROR_FILE_NOT_FOUND) return;
      fail(Files ? "base::fs::WinFindFiles<1>::WinFindFiles" : "base::fs::WinFindFiles<0>::WinFindFiles",
           "Can't search for files", pattern, error);
    }
    if (!listed()) advance();
  }
  ~WinFindFiles() override { closeSearch(); }

  bool atEnd() const override { return m_search == INVALID_HANDLE_VALUE; }
  void next() override {
    if (atEnd()) raise<exception>("base::fs::WinFindFiles::next", "invalid call to WinFindFiles::next()");
    advance();
  }
  base::string name() const override { return atEnd() ? base::string() : platform::utf8Text(m_entry.cFileName); }
  base::string directory() const override { return m_directory; }
  std::uint32_t attributes() const override { return atEnd() ? 0 : m_entry.dwFileAttributes; }
  std::int64_t size() const override {
    if (atEnd() || (m_entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY)) return 0;
    return (static_cast<std::int64_t>(m_entry.nFileSizeHigh) << 32) | m_entry.nFileSizeLow;
  }
  std::int64_t modifiedTime() const override {
    if (atEnd()) return 0;
    // File times count 100 ns steps from 1601-01-01.
    const std::int64_t ticks = (static_cast<std::int64_t>(m_entry.ftLastWriteTime.dwHighDateTime) << 32) |
                               m_entry.ftLastWriteTime.dwLowDateTime;
    return (ticks - 116444736000000000LL) / 10000000;
  }

 private:
  bool listed() const {
    return platform::listsEntry(platform::utf8Text(m_entry.cFileName),
                                (m_entry.dwFileAttributes & FILE_ATTRIBUTE_DIRECTORY) != 0, Files);
  }
  void advance() {
    do {
      if (!FindNextFileW(m_search, &m_entry)) {
        const DWORD error = GetLastError();
        closeSearch();
        if (error != ERROR_NO_MORE_FILES)
          fail("base::fs::WinFindFiles::next", "Can't search for files", m_directory, error);
        return;
      }
    } while (!listed());
  }
  void closeSearch() {
    if (m_search != INVALID_HANDLE_VALUE) FindClose(m_search);
    m_search = INVALID_HANDLE_VALUE;
  }

  base::string m_directory;
  HANDLE m_search = INVALID_HANDLE_VALUE;
  WIN32_FIND_DATAW m_entry{};
};

// The reparse data of a symbolic link; the system headers keep this layout to the driver kit.
struct SymbolicLinkReparse {
  DWORD tag;
  WORD dataLength;
  WORD reserved;
  WORD substituteOffset;
  WORD substituteLength;
  WORD printOffset;
  WORD printLength;
  ULONG flags;
  WCHAR path[1];
};

class WinPlugin final : public IPlugin {
 public:
  WinPlugin(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index)
      : IPlugin(factory, descriptor, index, systemCapabilities) {}

  bool symLinksPermitted() const override { return m_followLinks; }
  void symLinksPermitted(bool permitted) override { m_followLinks = permitted; }
  bool fileExists(std::string_view path) override {
    const DWORD attributes = attributesOf(path);
    return attributes != INVALID_FILE_ATTRIBUTES && !(attributes & FILE_ATTRIBUTE_DIRECTORY);
  }
  bool dirExists(std::string_view path) override {
    const DWORD attributes = attributesOf(path);
    return attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY);
  }
  Stream open(std::string_view path, std::uint32_t mode) override {
    return Stream::adopt(new WinStreamWorker(base::string(path), platform::effectiveOpenMode(mode), m_followLinks));
  }
  ref<IEnum> findFolders(std::string_view pattern) override { return ref<IEnum>(new WinFindFiles<false>(pattern)); }
  ref<IEnum> findFiles(std::string_view pattern) override { return ref<IEnum>(new WinFindFiles<true>(pattern)); }
  void remove(std::string_view path, bool recursive) override;
  void rename(std::string_view from, std::string_view to) override {
    if (!MoveFileW(wideText(from).c_str(), wideText(to).c_str())) {
      fail("base::fs::WinPlugin::rename", "Can't rename", from, GetLastError());
    }
  }
  // A plain move never replaces a file: replacing needs the flag.
  void replace(std::string_view from, std::string_view to) override {
    if (!MoveFileExW(wideText(from).c_str(), wideText(to).c_str(),
                     MOVEFILE_REPLACE_EXISTING | MOVEFILE_WRITE_THROUGH)) {
      fail("base::fs::WinPlugin::replace", "Can't replace", to, GetLastError());
    }
  }
  void copy(std::string_view from, std::string_view to) override {
    const DWORD attributes = attributesOf(from);
    if (attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY)) {
      fail("base::fs::WinPlugin::copy", "Can't copy", from, ERROR_DIRECTORY);
    }
    if (!CopyFileW(wideText(from).c_str(), wideText(to).c_str(), FALSE)) {
      fail("base::fs::WinPlugin::copy", "Can't copy", from, GetLastError());
    }
  }
  void touch(std::string_view path) override;
  base::string readLink(std::string_view path) override;
  void mkdir(std::string_view path) override {
    if (CreateDirectoryW(wideText(path).c_str(), nullptr)) return;
    const DWORD error = GetLastError();
    if (error == ERROR_PATH_NOT_FOUND) {
      raise<exception>("base::fs::WinPlugin::mkdir", "Invalid path to create '" + base::string(path) + "'");
    }
    fail("base::fs::WinPlugin::mkdir", "Can't create the folder", path, error);
  }
  base::string curdir() override { return currentPath(); }

 private:
  std::atomic<bool> m_followLinks{true};
};

void WinPlugin::remove(std::string_view path, bool recursive) {
  const std::wstring file = wideText(path);
  if (recursive) {
    // The shell takes a list of paths, each ended by a zero, the list by another.
    std::wstring list = file + L'\0';
    SHFILEOPSTRUCTW operation{};
    operation.wFunc = FO_DELETE;
    operation.pFrom = list.c_str();
    operation.fFlags = FOF_NO_UI;
    const int error = SHFileOperationW(&operation);
    if (error != 0) fail("base::fs::WinPlugin::remove", "Can't remove", path, static_cast<DWORD>(error));
    return;
  }
  const DWORD attributes = GetFileAttributesW(file.c_str());
  const bool folder = attributes != INVALID_FILE_ATTRIBUTES && (attributes & FILE_ATTRIBUTE_DIRECTORY);
  if (!(folder ? RemoveDirectoryW(file.c_str()) : DeleteFileW(file.c_str()))) {
    fail("base::fs::WinPlugin::remove", "Can't remove", path, GetLastError());
  }
}

void WinPlugin::touch(std::string_view path) {
  const HandleCloser file{CreateFileW(wideText(path).c_str(), FILE_WRITE_ATTRIBUTES,
                                      FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                                      FILE_FLAG_BACKUP_SEMANTICS, nullptr)};
  if (file.handle == INVALID_HANDLE_VALUE) fail("base::fs::WinPlugin::touch", "Can't touch", path, GetLastError());
  FILETIME now{};
  GetSystemTimeAsFileTime(&now);
  if (!SetFileTime(file.handle, nullptr, &now, &now))
    fail("base::fs::WinPlugin::touch", "Can't touch", path, GetLastError());
}

base::string WinPlugin::readLink(std::string_view path) {
  const HandleCloser link{CreateFileW(wideText(path).c_str(), GENERIC_READ,
                                      FILE_SHARE_READ | FILE_SHARE_WRITE | FILE_SHARE_DELETE, nullptr, OPEN_EXISTING,
                                      FILE_FLAG_BACKUP_SEMANTICS | FILE_FLAG_OPEN_REPARSE_POINT, nullptr)};
  if (link.handle == INVALID_HANDLE_VALUE)
    fail("base::fs::WinPlugin::readLink", "Can't read the link", path, GetLastError());
  alignas(8) BYTE buffer[16384];
  DWORD length = 0;
  if (!DeviceIoControl(link.handle, FSCTL_GET_REPARSE_POINT, nullptr, 0, buffer, sizeof buffer, &length, nullptr)) {
    return {};
  }
  const auto* reparse = reinterpret_cast<const SymbolicLinkReparse*>(buffer);
  if (length < offsetof(SymbolicLinkReparse, path) || reparse->tag != IO_REPARSE_TAG_SYMLINK) return {};
  const std::size_t end = offsetof(SymbolicLinkReparse, path) + reparse->printOffset + reparse->printLength;
  if (end > length) return {};
  return platform::utf8Text(
      std::wstring_view(reparse->path + reparse->printOffset / sizeof(WCHAR), reparse->printLength / sizeof(WCHAR)));
}

class WinPluginDesc final : public PluginDesc {
 public:
  WinPluginDesc() : PluginDesc("system", "Tarn Velisk", "") {}
  base::IPlugin* create(PluginFactory* factory, std::uint32_t index) override {
    return new WinPlugin(factory, this, index);
  }
};

// The text a system call writes into a buffer it sizes: `call(size, buffer)` gives the
// length written, or the size needed when the buffer is too small, or 0 on failure.
template <class Call>
base::string systemText(Call&& call, const char* function, const char* failure) {
  std::wstring text(MAX_PATH, L'\0');
  for (int attempt = 0; attempt < 10; ++attempt) {
    const DWORD length = call(static_cast<DWORD>(text.size()), text.data());
    if (length == 0) raise<api_exception>(function, failure, GetLastError());
    if (length < text.size()) return platform::utf8Text(std::wstring_view(text.data(), length));
    text.resize(length + 1);
  }
  raise<api_exception>(function, failure, static_cast<std::uint32_t>(ERROR_INSUFFICIENT_BUFFER));
}

}  // namespace

base::string tmpPath() {
  return systemText([](DWORD size, wchar_t* buffer) { return GetTempPathW(size, buffer); }, "base::fs::tmpPath",
                    "Can't get the temp folder");
}

base::string tmpFilename() {
  wchar_t name[MAX_PATH + 1];
  if (!GetTempFileNameW(wideText(tmpPath()).c_str(), L"mp", 0, name)) {
    raise<api_exception>("base::fs::tmpFilename", "Can't get a temp file name", GetLastError());
  }
  return platform::utf8Text(name);
}

base::string currentPath() {
  return systemText([](DWORD size, wchar_t* buffer) { return GetCurrentDirectoryW(size, buffer); },
                    "base::fs::currentPath", "Can't get the current directory");
}

base::string absolutePath(std::string_view path) {
  const std::wstring relative = wideText(path);
  return systemText(
      [&](DWORD size, wchar_t* buffer) { return GetFullPathNameW(relative.c_str(), size, buffer, nullptr); },
      "base::fs::absolutePath", "Can't get the current directory");
}

}  // namespace base::fs

namespace base::platform {
ref<fs::PluginDesc> systemFileSystem() { return ref<fs::PluginDesc>(new fs::WinPluginDesc); }
}  // namespace base::platform
