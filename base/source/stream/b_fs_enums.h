#pragma once

// The listings that the file systems build from other listings: the master's merge of its
// file systems' listings, and the recursive listing.

#include "b_fs.h"

namespace base::fs {

/// Which listing MultiFindFilesEnum asks each file system for.
struct NextFile {
  static ref<IEnum> find(IPlugin& fileSystem, std::string_view pattern) { return fileSystem.findFiles(pattern); }
};
struct NextFolder {
  static ref<IEnum> find(IPlugin& fileSystem, std::string_view pattern) { return fileSystem.findFolders(pattern); }
};

/// The entries of every file system's listing of one pattern, grouped by file system in the
/// given order. A file system whose listing fails is passed over.
template <class Next>
class MultiFindFilesEnum final : public IEnum {
 public:
  MultiFindFilesEnum(base::vector<ref<IPlugin>> plugins, std::string_view pattern)
      : m_plugins(std::move(plugins)), m_pattern(pattern) {
    openNext();
  }

  bool atEnd() const override { return !m_current; }
  void next() override;
  base::string name() const override { return m_current ? m_current->name() : base::string(); }
  base::string directory() const override { return m_current ? m_current->directory() : base::string(); }
  std::uint32_t attributes() const override { return m_current ? m_current->attributes() : 0; }
  std::int64_t size() const override { return m_current ? m_current->size() : 0; }
  std::int64_t modifiedTime() const override { return m_current ? m_current->modifiedTime() : 0; }

 private:
  void openNext();

  base::vector<ref<IPlugin>> m_plugins;
  base::string m_pattern;
  std::size_t m_nextPlugin = 0;
  ref<IEnum> m_current;
};

/// The files matching a name pattern in a start directory and in every directory below it,
/// the deepest directories first. Links to directories are not followed, so a link that
/// points back up the tree cannot make the listing endless.
class RecursiveEnum final : public IEnum {
 public:
  /// `pattern` is split at its first wildcard: the directory before it is where the listing
  /// starts, the pattern's last part is what the file names must match.
  RecursiveEnum(IPlugin& fileSystem, std::string_view pattern);

  bool atEnd() const override { return !m_current; }
  void next() override;
  base::string name() const override { return m_current ? m_current->name() : base::string(); }
  base::string directory() const override { return m_current ? m_current->directory() : base::string(); }
  std::uint32_t attributes() const override { return m_current ? m_current->attributes() : 0; }
  std::int64_t size() const override { return m_current ? m_current->size() : 0; }
  std::int64_t modifiedTime() const override { return m_current ? m_current->modifiedTime() : 0; }

 private:
  void gatherFolders(const base::string& start);
  void openNext();

  ref<IPlugin> m_fileSystem;
  base::string m_namePattern;
  base::vector<base::string> m_folders;
  ref<IEnum> m_current;
};

}  // namespace base::fs
