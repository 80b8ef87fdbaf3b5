#pragma once

#include "b_plugin.h"
#include "b_plugin_factory.h"
#include "b_stream.h"

#include <cstdint>
#include <mutex>
#include <string_view>

namespace base::fs {

/// Bits of open's mode.
enum OpenMode : std::uint32_t {
  openRead = 0x1,
  openWrite = 0x2,  ///< without openRead it implies openCreate
  shareRead = 0x4,  ///< others may read while the file is open
  shareWrite = 0x8,
  openCreate = 0x20,
  openTruncate = 0x40,
  openByExtension = 0x80,  ///< with openWrite: the file system is chosen by the file's extension
};
/// What readers use.
inline constexpr std::uint32_t openForReading = openRead | shareRead;

/// Bits of a file system's capability word: the operations it takes part in.
enum Capability : std::uint32_t {
  canTouch = 0x2,
  canSwitchLinks = 0x8,
  canRename = 0x10,
  canRemove = 0x20,
  canCopy = 0x40,
  canMkdir = 0x100,
};
/// The system file system's word.
inline constexpr std::uint32_t systemCapabilities = 511;

/// Bits of an enumerator entry's attributes (the values Windows uses).
enum EntryAttribute : std::uint32_t {
  entryReadOnly = 0x1,
  entryHidden = 0x2,
  entryDirectory = 0x10,
  entryLink = 0x400,
};

/// A directory listing: starts at its first entry, or at its end when there is none.
class BASE1_API IEnum : public RefCntAtomic {
 public:
  ~IEnum() override;
  virtual bool atEnd() const = 0;
  /// Moves to the next entry; at the end it throws base::exception.
  virtual void next() = 0;
  /// The entry's file name.
  virtual base::string name() const = 0;
  /// The directory searched, with its trailing separator.
  virtual base::string directory() const = 0;
  /// EntryAttribute bits.
  virtual std::uint32_t attributes() const = 0;
  /// The entry's size in bytes; 0 for a directory.
  virtual std::int64_t size() const = 0;
  /// The entry's last change, in seconds since 1970-01-01 UTC.
  virtual std::int64_t modifiedTime() const = 0;
};

/// Describes a kind of file system: its name, author and the extensions of the files it
/// opens (`;`-separated).
class BASE1_API PluginDesc : public IPluginDesc {
 public:
  PluginDesc(std::string_view name, std::string_view author, std::string_view extensions);
  ~PluginDesc() override;

  base::string extensions;
};

/// A file system. The operations a file system does not offer throw
/// base::unsupported_interface; its capability word says which of them the master asks.
/// Paths are UTF-8.
class BASE1_API IPlugin : public base::IPlugin {
 public:
  IPlugin(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index, std::uint32_t capabilities);
  ~IPlugin() override;

  PluginDesc* getDesc() const;
  /// Whether symbolic links are followed.
  virtual bool symLinksPermitted() const;
  virtual void symLinksPermitted(bool permitted);
  /// Questions that archive file systems answer about a path; false here.
  virtual bool isArchive(std::string_view path);
  virtual bool isInArchive(std::string_view path);
  /// A file (not a directory) exists.
  virtual bool fileExists(std::string_view path) = 0;
  virtual bool dirExists(std::string_view path) = 0;
  /// Opens a file (OpenMode bits). A file that is not there throws fs::file_not_found.
  virtual Stream open(std::string_view path, std::uint32_t mode) = 0;
  /// Sub-directories and files whose names match the last part of `pattern` (`*` and `?`).
  virtual ref<IEnum> findFolders(std::string_view pattern) = 0;
  virtual ref<IEnum> findFiles(std::string_view pattern) = 0;
  virtual void remove(std::string_view path, bool recursive);
  virtual void rename(std::string_view from, std::string_view to);
  /// Moves the file `from` to `to`, replacing a file there in one step: a reader of `to`
  /// finds the old file or the new one, never none. Both lie on one file system.
  virtual void replace(std::string_view from, std::string_view to);
  virtual void copy(std::string_view from, std::string_view to);
  /// Sets the file's times to now.
  virtual void touch(std::string_view path);
  /// The target of a symbolic link; empty for anything else.
  virtual base::string readLink(std::string_view path);
  virtual void mkdir(std::string_view path);
  virtual base::string curdir();

  /// The files matching the name part of `pattern` in the pattern's start directory (the
  /// part before its first wildcard) and every directory below it.
  ref<IEnum> findRecursive(std::string_view pattern);

  std::uint32_t capabilities() const { return m_capabilities; }

 protected:
  void setCapabilities(std::uint32_t capabilities) { m_capabilities = capabilities; }

 private:
  std::uint32_t m_capabilities;
};

/// Names and the texts they stand for: "models:bunny.ply" reads as the text of "models"
/// followed by "bunny.ply". Safe to use from several threads.
class BASE1_API AliasTable {
 public:
  /// Adds or replaces an alias; an empty `text` removes it.
  void set(std::string_view name, std::string_view text);
  void clear();
  /// The path with every alias replaced, the replacement scanned again so that aliases may
  /// refer to aliases. A name of one letter (a drive) is never an alias. An alias that comes
  /// back into its own expansion throws base::invalid_argument.
  base::string expand(std::string_view path) const;

 private:
  mutable std::mutex m_lock;
  base::map<base::string, base::string, std::less<>> m_aliases;
};

/// The file system that all file access goes through: it expands aliases and hands each
/// operation to its attached file systems in order.
class BASE1_API MasterFS : public IPlugin {
 public:
  /// Attaches the file systems registered in `factory` that it knows, "system" first; they
  /// are made by `factory`, which must outlive them.
  MasterFS(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index);
  ~MasterFS() override;

  /// Attaches the file system registered under `name` (nothing happens when one of that name
  /// is attached); throws base::invalid_argument when no descriptor has that name.
  void attachFS(std::string_view name);
  void detachFS(std::string_view name);
  /// The attached file system of that name, or null.
  ref<IPlugin> findFS(std::string_view name) const;

  bool symLinksPermitted() const override;
  void symLinksPermitted(bool permitted) override;
  bool isArchive(std::string_view path) override;
  bool isInArchive(std::string_view path) override;
  bool fileExists(std::string_view path) override;
  bool dirExists(std::string_view path) override;
  /// The first file system that has the file opens it; for reading, the file systems that
  /// list the file's extension are asked first. When none has it, the last
  /// base::wrong_password is thrown, else the first fs::file_not_found.
  Stream open(std::string_view path, std::uint32_t mode) override;
  /// The listings of all attached file systems, one after the other.
  ref<IEnum> findFolders(std::string_view pattern) override;
  ref<IEnum> findFiles(std::string_view pattern) override;
  void remove(std::string_view path, bool recursive) override;
  void rename(std::string_view from, std::string_view to) override;
  void replace(std::string_view from, std::string_view to) override;
  void copy(std::string_view from, std::string_view to) override;
  void touch(std::string_view path) override;
  void mkdir(std::string_view path) override;
  /// The "system" file system's current directory.
  base::string curdir() override;

  const base::vector<ref<IPlugin>>& plugins() const { return m_plugins; }

 private:
  void updateCapabilities();

  base::vector<ref<IPlugin>> m_plugins;
};

/// The process-wide master file system and its alias table; callers never own them.
BASE1_API MasterFS& master();
BASE1_API AliasTable& aliases();

/// The system's folder for temporary files, with its trailing separator.
BASE1_API base::string tmpPath();
/// Creates a new empty file in the temporary folder and returns its path.
BASE1_API base::string tmpFilename();
/// The process's current directory.
BASE1_API base::string currentPath();
/// `path` made absolute against the current directory.
BASE1_API base::string absolutePath(std::string_view path);

}  // namespace base::fs
