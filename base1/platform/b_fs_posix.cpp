#include "b_exception.h"
#include "b_path.h"
#include "b_platform_fs.h"

#include <dirent.h>
#include <fcntl.h>
#include <fnmatch.h>
#include <sys/stat.h>
#include <unistd.h>

#include <fmt/format.h>

#include <atomic>
#include <cerrno>
#include <filesystem>

namespace base::fs {
namespace {

std::uint32_t code(int error) { return static_cast<std::uint32_t>(error); }

// ENOENT and ENOTDIR are what Windows calls file and path not found.
bool isNotFound(int error) { return error == ENOENT || error == ENOTDIR; }

[[noreturn]] void fail(const char* function, std::string_view what, std::string_view path, int error) {
  raise<api_exception>(function, fmt::format("{} '{}'", what, path), code(error));
}

bool statPath(const base::string& path, struct stat& info, bool followLinks) {
  return (followLinks ? ::stat(path.c_str(), &info) : ::lstat(path.c_str(), &info)) == 0;
}

int openFlags(std::uint32_t mode, bool followLinks) {
  const bool reading = mode & openRead;
  const bool writing = mode & openWrite;
  int flags = O_CLOEXEC | (reading && writing ? O_RDWR : writing ? O_WRONLY : O_RDONLY);
  if (mode & openCreate) flags |= O_CREAT;
  // A file opened only for reading is never emptied.
  if (writing && (mode & openTruncate)) flags |= O_TRUNC;
  if (!followLinks) flags |= O_NOFOLLOW;
  return flags;
}

int seekWhence(std::uint32_t origin) {
  switch (origin) {
    case seekBegin:
      return SEEK_SET;
    case seekCurrent:
      return SEEK_CUR;
    case seekEnd:
      return SEEK_END;
    default:
      return -1;
  }
}

// A file opened with open(2); reads and writes go straight to the system.
class PosixStreamWorker final : public StreamWorker {
 public:
  PosixStreamWorker(const base::string& path, std::uint32_t mode, bool followLinks)
      : StreamWorker(platform::fileStreamCapabilities(mode), path), m_mode(mode), m_followLinks(followLinks) {
    m_file = ::open(path.c_str(), openFlags(mode, followLinks), 0666);
    if (m_file < 0) {
      const int error = errno;
      if (isNotFound(error)) {
        raise<file_not_found>("base::fs::PosixPlugin::openFile",
                              fmt::format("Can't open '{}': {}", path, systemErrorText(code(error))), path);
      }
      fail("base::fs::PosixPlugin::openFile", "Can't open", path, error);
    }
    // The system opens a directory for reading; Windows refuses, and so do we.
    struct stat info {};
    if (::fstat(m_file, &info) == 0 && S_ISDIR(info.st_mode)) {
      ::close(m_file);
      fail("base::fs::PosixPlugin::openFile", "Can't open", path, EISDIR);
    }
  }
  ~PosixStreamWorker() override { closeFile(); }

  std::uint32_t read(void* buffer, std::uint32_t count) override {
    auto* bytes = static_cast<std::uint8_t*>(buffer);
    std::uint32_t done = 0;
    while (done < count) {
      const ssize_t got = ::read(m_file, bytes + done, count - done);
      if (got < 0 && errno == EINTR) continue;
      if (got < 0) fail("base::fs::PosixPlugin::readFile", "Can't read", name(), errno);
      if (got == 0) break;
      done += static_cast<std::uint32_t>(got);
    }
    if (hasher() && done) hasher()->update(bytes, done);
    return done;
  }
  std::uint32_t write(const void* buffer, std::uint32_t count) override {
    const auto* bytes = static_cast<const std::uint8_t*>(buffer);
    std::uint32_t done = 0;
    while (done < count) {
      const ssize_t put = ::write(m_file, bytes + done, count - done);
      if (put < 0 && errno == EINTR) continue;
      if (put <= 0) fail("base::fs::PosixPlugin::writeFile", "Can't write", name(), put < 0 ? errno : ENOSPC);
      done += static_cast<std::uint32_t>(put);
    }
    return done;
  }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin) override {
    const std::int64_t previous = hasher() ? getPosition() : 0;
    const off_t position = ::lseek(m_file, offset, seekWhence(origin));
    if (position < 0) fail("base::fs::PosixPlugin::fileSetPosition", "Can't move in", name(), errno);
    if (hasher() && position != previous) platform::logHashedMove(previous);
    return position;
  }
  std::int64_t getPosition() override {
    const off_t position = ::lseek(m_file, 0, SEEK_CUR);
    if (position < 0) fail("base::fs::PosixPlugin::fileGetPosition", "Can't tell the position in", name(), errno);
    return position;
  }
  std::int64_t getSize() override {
    struct stat info {};
    if (::fstat(m_file, &info) != 0)
      fail("base::fs::PosixPlugin::fileGetSize", "Can't tell the size of", name(), errno);
    return info.st_size;
  }
  void setSize(std::int64_t size) override {
    if (::ftruncate(m_file, size) != 0)
      fail("base::fs::PosixPlugin::fileTrunc", "Can't change the size of", name(), errno);
    if (getPosition() > size) ::lseek(m_file, size, SEEK_SET);
  }
  bool isEOF() override { return getPosition() >= getSize(); }
  void flush() override {
    if ((capabilities() & capWrite) && ::fsync(m_file) != 0) {
      fail("base::fs::PosixPlugin::fileFlush", "Can't flush", name(), errno);
    }
  }
  void close() override {
    closeFile();
    setCapabilities(0);
  }
  Stream reopen() override {
    return Stream::adopt(new PosixStreamWorker(name(), platform::reopenMode(m_mode), m_followLinks));
  }

 private:
  void closeFile() {
    if (m_file >= 0) ::close(m_file);
    m_file = -1;
  }

  int m_file = -1;
  std::uint32_t m_mode;
  bool m_followLinks;
};

// Windows matches "*.*" against every name, with or without a dot.
base::string namePatternOf(std::string_view pattern) {
  const std::size_t separator = pattern.find_last_of("/\\");
  const std::string_view name = pattern.substr(separator == std::string_view::npos ? 0 : separator + 1);
  return name == "*.*" ? base::string("*") : base::string(name);
}

// The files (Files true) or the sub-directories of one directory whose names match a pattern.
template <bool Files>
class PosixFindFiles final : public IEnum {
 public:
  explicit PosixFindFiles(std::string_view pattern)
      : m_directory(getDirectory(pattern)), m_pattern(namePatternOf(pattern)) {
    m_listing = ::opendir(m_directory.empty() ? "." : m_directory.c_str());
    if (!m_listing) fail(constructorName(), "Can't search for files in", m_directory, errno);
    advance();
  }
  ~PosixFindFiles() override { closeListing(); }

  bool atEnd() const override { return !m_listing; }
  void next() override {
    if (!m_listing) raise<exception>("base::fs::PosixFindFiles::next", "invalid call to PosixFindFiles::next()");
    advance();
  }
  base::string name() const override { return m_name; }
  base::string directory() const override { return m_directory; }
  std::uint32_t attributes() const override { return m_attributes; }
  std::int64_t size() const override { return m_size; }
  std::int64_t modifiedTime() const override { return m_modified; }

 private:
  static const char* constructorName() {
    return Files ? "base::fs::PosixFindFiles<1>::PosixFindFiles" : "base::fs::PosixFindFiles<0>::PosixFindFiles";
  }

  void advance() {
    for (;;) {
      errno = 0;
      const dirent* entry = ::readdir(m_listing);
      if (!entry) {
        const int error = errno;
        closeListing();
        if (error) fail("base::fs::PosixFindFiles::next", "Can't search for files in", m_directory, error);
        return;
      }
      if (::fnmatch(m_pattern.c_str(), entry->d_name, 0) == 0 && describe(entry->d_name)) return;
    }
  }

  // Reads the entry's properties; false when the listing does not show it.
  bool describe(const char* entryName) {
    const int folder = ::dirfd(m_listing);
    struct stat own {};
    if (::fstatat(folder, entryName, &own, AT_SYMLINK_NOFOLLOW) != 0) return false;
    struct stat target = own;
    const bool link = S_ISLNK(own.st_mode);
    // A link stands for what it points at; a dangling one is listed as a file.
    if (link && ::fstatat(folder, entryName, &target, 0) != 0) target = own;
    const bool isDirectory = S_ISDIR(target.st_mode);
    if (!platform::listsEntry(entryName, isDirectory, Files)) return false;
    m_name = entryName;
    m_attributes = 0;
    if (isDirectory) m_attributes |= entryDirectory;
    if (link) m_attributes |= entryLink;
    if (entryName[0] == '.') m_attributes |= entryHidden;
    if (!(target.st_mode & S_IWUSR)) m_attributes |= entryReadOnly;
    m_size = S_ISREG(target.st_mode) ? target.st_size : 0;
    m_modified = target.st_mtime;
    return true;
  }

  void closeListing() {
    if (m_listing) ::closedir(m_listing);
    m_listing = nullptr;
  }

  base::string m_directory;
  base::string m_pattern;
  DIR* m_listing = nullptr;
  base::string m_name;
  std::uint32_t m_attributes = 0;
  std::int64_t m_size = 0;
  std::int64_t m_modified = 0;
};

// The file system of a POSIX system, named "system" like its Windows twin.
class PosixPlugin final : public IPlugin {
 public:
  PosixPlugin(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index)
      : IPlugin(factory, descriptor, index, systemCapabilities) {}

  bool symLinksPermitted() const override { return m_followLinks; }
  void symLinksPermitted(bool permitted) override { m_followLinks = permitted; }
  bool fileExists(std::string_view path) override {
    struct stat info {};
    return statPath(base::string(path), info, m_followLinks) && !S_ISDIR(info.st_mode);
  }
  bool dirExists(std::string_view path) override {
    struct stat info {};
    return statPath(base::string(path), info, m_followLinks) && S_ISDIR(info.st_mode);
  }
  Stream open(std::string_view path, std::uint32_t mode) override {
    return Stream::adopt(new PosixStreamWorker(base::string(path), platform::effectiveOpenMode(mode), m_followLinks));
  }
  ref<IEnum> findFolders(std::string_view pattern) override { return ref<IEnum>(new PosixFindFiles<false>(pattern)); }
  ref<IEnum> findFiles(std::string_view pattern) override { return ref<IEnum>(new PosixFindFiles<true>(pattern)); }
  void remove(std::string_view path, bool recursive) override;
  void rename(std::string_view from, std::string_view to) override;
  void replace(std::string_view from, std::string_view to) override;
  void copy(std::string_view from, std::string_view to) override;
  void touch(std::string_view path) override;
  base::string readLink(std::string_view path) override;
  void mkdir(std::string_view path) override;
  base::string curdir() override { return currentPath(); }

 private:
  std::atomic<bool> m_followLinks{true};
};

void PosixPlugin::remove(std::string_view path, bool recursive) {
  const base::string file(path);
  struct stat info {};
  if (!statPath(file, info, false)) fail("base::fs::PosixPlugin::remove", "Can't remove", file, errno);
  std::error_code error;
  if (recursive) {
    std::filesystem::remove_all(std::filesystem::path(path), error);
  } else if ((S_ISDIR(info.st_mode) ? ::rmdir(file.c_str()) : ::unlink(file.c_str())) != 0) {
    error.assign(errno, std::generic_category());
  }
  if (error) fail("base::fs::PosixPlugin::remove", "Can't remove", file, error.value());
}

void PosixPlugin::rename(std::string_view from, std::string_view to) {
  const base::string source(from);
  const base::string target(to);
  // Like Windows, a move never replaces a file that is there already.
  struct stat info {};
  if (statPath(target, info, false)) fail("base::fs::PosixPlugin::rename", "Can't rename to", target, EEXIST);
  if (::rename(source.c_str(), target.c_str()) != 0)
    fail("base::fs::PosixPlugin::rename", "Can't rename", source, errno);
}

void PosixPlugin::replace(std::string_view from, std::string_view to) {
  const base::string source(from);
  const base::string target(to);
  // rename() replaces a file atomically.
  if (::rename(source.c_str(), target.c_str()) != 0)
    fail("base::fs::PosixPlugin::replace", "Can't replace", target, errno);
}

void PosixPlugin::copy(std::string_view from, std::string_view to) {
  const base::string source(from);
  struct stat info {};
  if (!statPath(source, info, true)) fail("base::fs::PosixPlugin::copy", "Can't copy", source, errno);
  if (S_ISDIR(info.st_mode)) fail("base::fs::PosixPlugin::copy", "Can't copy", source, EISDIR);
  std::error_code error;
  std::filesystem::copy_file(std::filesystem::path(from), std::filesystem::path(to),
                             std::filesystem::copy_options::overwrite_existing, error);
  if (error) fail("base::fs::PosixPlugin::copy", "Can't copy to", to, error.value());
}

void PosixPlugin::touch(std::string_view path) {
  const base::string file(path);
  if (::utimensat(AT_FDCWD, file.c_str(), nullptr, 0) != 0)
    fail("base::fs::PosixPlugin::touch", "Can't touch", file, errno);
}

base::string PosixPlugin::readLink(std::string_view path) {
  const base::string file(path);
  struct stat info {};
  if (!statPath(file, info, false)) fail("base::fs::PosixPlugin::readLink", "Can't read the link", file, errno);
  if (!S_ISLNK(info.st_mode)) return {};
  base::string target(16384, '\0');
  const ssize_t length = ::readlink(file.c_str(), target.data(), target.size());
  if (length < 0) fail("base::fs::PosixPlugin::readLink", "Can't read the link", file, errno);
  target.resize(static_cast<std::size_t>(length));
  return target;
}

void PosixPlugin::mkdir(std::string_view path) {
  const base::string folder(path);
  if (::mkdir(folder.c_str(), 0777) == 0) return;
  const int error = errno;
  if (isNotFound(error)) raise<exception>("base::fs::PosixPlugin::mkdir", "Invalid path to create '" + folder + "'");
  fail("base::fs::PosixPlugin::mkdir", "Can't create the folder", folder, error);
}

class PosixPluginDesc final : public PluginDesc {
 public:
  PosixPluginDesc() : PluginDesc("system", "Tarn Velisk", "") {}
  base::IPlugin* create(PluginFactory* factory, std::uint32_t index) override {
    return new PosixPlugin(factory, this, index);
  }
};

}  // namespace

base::string tmpPath() {
  std::error_code error;
  const std::filesystem::path folder = std::filesystem::temp_directory_path(error);
  if (error) raise<api_exception>("base::fs::tmpPath", "Can't get the temp folder", code(error.value()));
  base::string path(folder.native());
  if (path.back() != '/') path += '/';
  return path;
}

base::string tmpFilename() {
  base::string path = tmpPath() + "meshport-XXXXXX";
  const int file = ::mkstemp(path.data());
  if (file < 0) raise<api_exception>("base::fs::tmpFilename", "Can't get a temp file name", code(errno));
  ::close(file);
  return path;
}

base::string currentPath() {
  std::error_code error;
  const std::filesystem::path folder = std::filesystem::current_path(error);
  if (error) raise<api_exception>("base::fs::currentPath", "Can't get the current directory", code(error.value()));
  return base::string(folder.native());
}

base::string absolutePath(std::string_view path) {
  std::error_code error;
  const std::filesystem::path full = std::filesystem::absolute(std::filesystem::path(path), error);
  if (error) raise<api_exception>("base::fs::absolutePath", "Can't get the current directory", code(error.value()));
  return base::string(full.lexically_normal().native());
}

}  // namespace base::fs

namespace base::platform {
ref<fs::PluginDesc> systemFileSystem() { return ref<fs::PluginDesc>(new fs::PosixPluginDesc); }
}  // namespace base::platform
