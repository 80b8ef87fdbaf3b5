#include "b_fs.h"

#include "b_exception.h"
#include "b_fs_enums.h"
#include "b_log.h"
#include "b_path.h"
#include "b_stack_walker.h"
#include "b_string_conversion.h"

#include <fmt/format.h>

#include <algorithm>
#include <exception>

namespace base::fs {
namespace {

// The file systems a master attaches when they are registered, in this order.
constexpr std::string_view attachOrder[] = {"system", "gzip", "zst", "lzma", "lz4", "zip", "vexa"};

bool listsExtension(std::string_view list, std::string_view extension) {
  for (std::size_t start = 0; start <= list.size();) {
    const std::size_t end = std::min(list.find(';', start), list.size());
    if (list.substr(start, end - start) == extension) return true;
    start = end + 1;
  }
  return false;
}

// The order in which open tries the file systems: for reading, those that list the file's
// extension come first ("scan.ply.gz" is the gzip file system's before it is the system's
// raw bytes), then the others in attach order.
base::vector<ref<IPlugin>> readingOrder(const base::vector<ref<IPlugin>>& plugins, std::uint32_t mode,
                                        std::string_view extension) {
  base::vector<ref<IPlugin>> order = plugins;
  if (!(mode & openWrite) && !extension.empty()) {
    std::stable_partition(order.begin(), order.end(), [extension](const ref<IPlugin>& plugin) {
      return listsExtension(plugin->getDesc()->extensions, extension);
    });
  }
  return order;
}

// Runs `operation` on the first file system with `capability` that does it without an
// exception; when all fail, the first one's exception is thrown.
template <class Operation>
void modify(const base::vector<ref<IPlugin>>& plugins, std::uint32_t capability, const char* function,
            std::string_view path, Operation&& operation) {
  std::exception_ptr first;
  for (const ref<IPlugin>& plugin : plugins) {
    if (!(plugin->capabilities() & capability)) continue;
    try {
      operation(*plugin);
      return;
    } catch (const exception&) {
      if (!first) first = std::current_exception();
    }
  }
  if (first) std::rethrow_exception(first);
  raise<exception>(function, fmt::format("no attached file system can change '{}'", path));
}

}  // namespace

MasterFS::MasterFS(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index)
    : IPlugin(factory, descriptor, index, 0) {
  for (const std::string_view name : attachOrder) {
    // Only the file systems that this process registers are attached; an absent one is
    // not an error.
    if (!factory->findDesc(nameServer().find(name))) continue;
    try {
      attachFS(name);
    } catch (const exception& error) {
      error.report(log());
    }
  }
}

MasterFS::~MasterFS() = default;

void MasterFS::attachFS(std::string_view name) {
  if (findFS(name)) return;
  const name_id type = nameServer().find(name);
  ref<IPluginDesc> descriptor = type ? factory()->findDesc(type) : nullptr;
  if (!dynamic_cast<PluginDesc*>(descriptor.get())) {
    raise<invalid_argument>("base::fs::MasterFS::attachFS",
                            fmt::format("file system with name {} can't be found", clipped(name)));
  }
  ref<base::IPlugin> object = factory()->create(type, PluginFactory::createOrNull | PluginFactory::createUnlisted);
  auto* fileSystem = dynamic_cast<IPlugin*>(object.get());
  if (!fileSystem) {
    raise<exception>("base::fs::MasterFS::attachFS", fmt::format("file system {} could not be made", clipped(name)));
  }
  base::append(m_plugins, ref<IPlugin>(fileSystem));
  updateCapabilities();
}

void MasterFS::detachFS(std::string_view name) {
  std::erase_if(m_plugins, [name](const ref<IPlugin>& plugin) { return text(plugin->getDesc()->name) == name; });
  updateCapabilities();
}

ref<IPlugin> MasterFS::findFS(std::string_view name) const {
  for (const ref<IPlugin>& plugin : m_plugins) {
    if (text(plugin->getDesc()->name) == name) return plugin;
  }
  return nullptr;
}

void MasterFS::updateCapabilities() {
  std::uint32_t word = 0;
  for (const ref<IPlugin>& plugin : m_plugins) word |= plugin->capabilities();
  setCapabilities(word);
}

bool MasterFS::symLinksPermitted() const {
  return std::any_of(m_plugins.begin(), m_plugins.end(), [](const ref<IPlugin>& plugin) {
    return (plugin->capabilities() & canSwitchLinks) && plugin->symLinksPermitted();
  });
}

void MasterFS::symLinksPermitted(bool permitted) {
  for (const ref<IPlugin>& plugin : m_plugins) {
    if (plugin->capabilities() & canSwitchLinks) plugin->symLinksPermitted(permitted);
  }
}

bool MasterFS::isArchive(std::string_view path) {
  const base::string expanded = aliases().expand(path);
  bool answer = false;
  for (const ref<IPlugin>& plugin : m_plugins) answer = plugin->isArchive(expanded) || answer;
  return answer;
}

bool MasterFS::isInArchive(std::string_view path) {
  const base::string expanded = aliases().expand(path);
  bool answer = false;
  for (const ref<IPlugin>& plugin : m_plugins) answer = plugin->isInArchive(expanded) || answer;
  return answer;
}

bool MasterFS::fileExists(std::string_view path) {
  const NoStackCapture noCapture;
  const base::string expanded = aliases().expand(path);
  return std::any_of(m_plugins.begin(), m_plugins.end(),
                     [&](const ref<IPlugin>& plugin) { return plugin->fileExists(expanded); });
}

bool MasterFS::dirExists(std::string_view path) {
  const base::string expanded = aliases().expand(path);
  return std::any_of(m_plugins.begin(), m_plugins.end(),
                     [&](const ref<IPlugin>& plugin) { return plugin->dirExists(expanded); });
}

Stream MasterFS::open(std::string_view path, std::uint32_t mode) {
  if (path.empty()) raise<invalid_argument>("base::fs::MasterFS::open", "file name not provided");
  const base::string expanded = aliases().expand(path);
  if ((mode & openWrite) && (mode & openByExtension)) {
    const base::string extension = getExtension(path);
    for (const ref<IPlugin>& plugin : m_plugins) {
      if (!extension.empty() && listsExtension(plugin->getDesc()->extensions, extension)) {
        return plugin->open(expanded, mode);
      }
    }
  }
  // Trying file systems that do not have the file is expected: no stacks for those throws.
  const NoStackCapture noCapture;
  std::exception_ptr notFound;
  std::exception_ptr wrongPassword;
  for (const ref<IPlugin>& plugin : readingOrder(m_plugins, mode, asciiLower(getExtension(expanded)))) {
    try {
      return plugin->open(expanded, mode);
    } catch (const file_not_found&) {
      if (!notFound) notFound = std::current_exception();
    } catch (const wrong_password&) {
      wrongPassword = std::current_exception();
    }
  }
  if (wrongPassword) std::rethrow_exception(wrongPassword);
  if (notFound) std::rethrow_exception(notFound);
  raise<file_not_found>("base::fs::MasterFS::open", fmt::format("no file system is attached to open '{}'", expanded),
                        expanded);
}

ref<IEnum> MasterFS::findFolders(std::string_view pattern) {
  return ref<IEnum>(new MultiFindFilesEnum<NextFolder>(m_plugins, aliases().expand(pattern)));
}

ref<IEnum> MasterFS::findFiles(std::string_view pattern) {
  return ref<IEnum>(new MultiFindFilesEnum<NextFile>(m_plugins, aliases().expand(pattern)));
}

void MasterFS::remove(std::string_view path, bool recursive) {
  const base::string expanded = aliases().expand(path);
  modify(m_plugins, canRemove, "base::fs::MasterFS::remove", expanded,
         [&](IPlugin& plugin) { plugin.remove(expanded, recursive); });
}

void MasterFS::rename(std::string_view from, std::string_view to) {
  const base::string source = aliases().expand(from);
  const base::string target = aliases().expand(to);
  modify(m_plugins, canRename, "base::fs::MasterFS::rename", source,
         [&](IPlugin& plugin) { plugin.rename(source, target); });
}

void MasterFS::replace(std::string_view from, std::string_view to) {
  const base::string source = aliases().expand(from);
  const base::string target = aliases().expand(to);
  modify(m_plugins, canRename, "base::fs::MasterFS::replace", source,
         [&](IPlugin& plugin) { plugin.replace(source, target); });
}

void MasterFS::copy(std::string_view from, std::string_view to) {
  const base::string source = aliases().expand(from);
  const base::string target = aliases().expand(to);
  modify(m_plugins, canCopy, "base::fs::MasterFS::copy", target, [&](IPlugin& plugin) { plugin.copy(source, target); });
}

void MasterFS::touch(std::string_view path) {
  const base::string expanded = aliases().expand(path);
  modify(m_plugins, canTouch, "base::fs::MasterFS::touch", expanded, [&](IPlugin& plugin) { plugin.touch(expanded); });
}

void MasterFS::mkdir(std::string_view path) {
  const base::string expanded = aliases().expand(path);
  modify(m_plugins, canMkdir, "base::fs::MasterFS::mkdir", expanded, [&](IPlugin& plugin) { plugin.mkdir(expanded); });
}

base::string MasterFS::curdir() {
  const ref<IPlugin> system = findFS("system");
  return system ? system->curdir() : IPlugin::curdir();
}

}  // namespace base::fs
