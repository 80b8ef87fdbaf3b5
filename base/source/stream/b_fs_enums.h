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

/// A listing made of other listings, one after the other: it shows the current one's entry.
class ChainedEnum : public IEnum {
 public:
  bool atEnd() const override { return !m_current; }
  /// Moves on in the current listing, and to the next one at its end.
  void next() override;
  base::string name() const override { return m_current ? m_current->name() : base::string(); }
  base::string directory() const override { return m_current ? m_current->directory() : base::string(); }
  std::uint32_t attributes() const override { return m_current ? m_current->attributes() : 0; }
  std::int64_t size() const override { return m_current ? m_current->size() : 0; }
  std::int64_t modifiedTime() const override { return m_current ? m_current->modifiedTime() : 0; }

 protected:
  /// Makes the next listing that is not at its end the current one; none at the end.
  virtual void openNext() = 0;

  ref<IEnum> m_current;
};

/// The entries of every file system's listing of one pattern, grouped by file system in the
/// given order. A file system whose listing fails is passed over.
template <class Next>
class MultiFindFilesEnum final : public ChainedEnum {
 public:
  MultiFindFilesEnum(base::vector<ref<IPlugin>> plugins, std::string_view pattern)
      : m_plugins(std::move(plugins)), m_pattern(pattern) {
    openNext();
  }

 private:
  void openNext() override;

  base::vector<ref<IPlugin>> m_plugins;
  base::string m_pattern;
  std::size_t m_nextPlugin = 0;
};

/// The files matching a name pattern in a start directory and in every directory below it,
/// the deepest directories first. Links to directories are not followed, so a link that
/// points back up the tree cannot make the listing endless.
class RecursiveEnum final : public ChainedEnum {
 public:
  /// `pattern` is split at its first wildcard: the directory before it is where the listing
  /// starts, the pattern's last part is what the file names must match.
  RecursiveEnum(IPlugin& fileSystem, std::string_view pattern);

 private:
  void gatherFolders(const base::string& start);
  void openNext() override;

  ref<IPlugin> m_fileSystem;
  base::string m_namePattern;
  base::vector<base::string> m_folders;
};

}  // namespace base::fs
