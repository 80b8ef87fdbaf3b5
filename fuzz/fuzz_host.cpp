#include "fuzz_host.h"

#include "b_exception.h"
#include "b_fs.h"
#include "b_name.h"
#include "b_plugin_factory.h"

#include <string_view>

namespace fuzzing {
namespace {

constexpr std::string_view servedPrefix = "fuzz-input";
const std::uint8_t* inputData = nullptr;
std::size_t inputSize = 0;

struct NoEntries final : base::fs::IEnum {
  bool atEnd() const override { return true; }
  void next() override {}
  base::string name() const override { return {}; }
  base::string directory() const override { return {}; }
  std::uint32_t attributes() const override { return 0; }
  std::int64_t size() const override { return 0; }
  std::int64_t modifiedTime() const override { return 0; }
};

class InputFileSystem final : public base::fs::IPlugin {
 public:
  using IPlugin::IPlugin;

  // Only the file name counts: a reader may have made the path absolute.
  bool fileExists(std::string_view path) override {
    const std::size_t slash = path.find_last_of("/\\");
    return path.substr(slash == std::string_view::npos ? 0 : slash + 1).starts_with(servedPrefix);
  }
  bool dirExists(std::string_view) override { return false; }
  base::Stream open(std::string_view path, std::uint32_t) override {
    if (!fileExists(path)) base::raise<base::fs::file_not_found>("fuzzing::InputFileSystem::open", "fuzz input", path);
    return base::memStream(inputData, static_cast<std::int64_t>(inputSize), path);
  }
  base::ref<base::fs::IEnum> findFolders(std::string_view) override {
    return base::ref<base::fs::IEnum>(new NoEntries);
  }
  base::ref<base::fs::IEnum> findFiles(std::string_view) override { return base::ref<base::fs::IEnum>(new NoEntries); }
};

class InputFileSystemDesc final : public base::fs::PluginDesc {
 public:
  InputFileSystemDesc() : PluginDesc("fuzz input", "", "") {}
  base::IPlugin* create(base::PluginFactory* factory, std::uint32_t index) override {
    return new InputFileSystem(factory, this, index, 0);
  }
};

}  // namespace

void setInputFile(const std::uint8_t* data, std::size_t size) {
  static const bool attached = [] {
    base::fs::MasterFS& master = base::fs::master();
    master.factory()->registerDesc(base::ref<base::IPluginDesc>(new InputFileSystemDesc));
    master.attachFS("fuzz input");
    return true;
  }();
  static_cast<void>(attached);
  inputData = data;
  inputSize = size;
}

scene::SceneFactory& pluginFactory() {
  static scene::SceneFactory factory;
  static const bool loaded = [] {
    factory.reloadPlugins();
    return true;
  }();
  static_cast<void>(loaded);
  return factory;
}

}  // namespace fuzzing
