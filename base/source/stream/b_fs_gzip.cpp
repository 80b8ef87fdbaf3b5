#include "b_fs_gzip.h"

#include "b_exception.h"
#include "b_fs_enums.h"
#include "b_path.h"
#include "b_string_conversion.h"

#include <fmt/format.h>

namespace base::fs {
namespace {

// A file system of decompressed views: it holds no files of its own, lists nothing and
// changes nothing (capability word 0), and opens only gzip files for reading.
class GzipPlugin final : public IPlugin {
 public:
  GzipPlugin(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index)
      : IPlugin(factory, descriptor, index, 0),
        m_system(factory->create(intern("system"), PluginFactory::createOrNull | PluginFactory::createUnlisted)) {}

  bool fileExists(std::string_view) override { return false; }
  bool dirExists(std::string_view) override { return false; }
  Stream open(std::string_view path, std::uint32_t mode) override;
  ref<IEnum> findFolders(std::string_view) override { return nothing(); }
  ref<IEnum> findFiles(std::string_view) override { return nothing(); }

 private:
  static ref<IEnum> nothing() { return ref<IEnum>(new MultiFindFilesEnum<NextFile>({}, {})); }
  [[noreturn]] static void notMine(std::string_view path, std::string_view why) {
    raise<file_not_found>("base::fs::GzipPlugin::open", fmt::format("{}: {}", path, why), path);
  }

  ref<base::IPlugin> m_system;
};

Stream GzipPlugin::open(std::string_view path, std::uint32_t mode) {
  auto* system = dynamic_cast<IPlugin*>(m_system.get());
  if ((mode & openWrite) || !system) notMine(path, "the gzip file system only reads");
  if (asciiLower(getExtension(path)) != "gz") notMine(path, "not a .gz file");
  Stream compressed = system->open(path, mode);
  // A file named .gz that holds something else is left to the other file systems, which
  // open it as it is.
  std::uint8_t magic[2] = {0, 0};
  const bool gzip = compressed.read(magic, 2) == 2 && magic[0] == 0x1f && magic[1] == 0x8b;
  if (!gzip) notMine(path, "not gzip data");
  compressed.setPosition(0, seekBegin);
  return inflateStream(compressed, path);
}

class GzipPluginDesc final : public PluginDesc {
 public:
  GzipPluginDesc() : PluginDesc("gzip", "Tarn Velisk", "gz") {}
  base::IPlugin* create(PluginFactory* factory, std::uint32_t index) override {
    return new GzipPlugin(factory, this, index);
  }
};

}  // namespace

ref<IPluginDesc> gzipFileSystem() { return ref<IPluginDesc>(new GzipPluginDesc); }

}  // namespace base::fs
