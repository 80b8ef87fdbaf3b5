#include "b_fs.h"
#include "b_fs_gzip.h"
#include "b_platform_fs.h"

namespace base::fs {
namespace {

class MasterPluginDesc final : public PluginDesc {
 public:
  MasterPluginDesc() : PluginDesc("master", "", "") {}
  base::IPlugin* create(PluginFactory* factory, std::uint32_t index) override {
    return new MasterFS(factory, this, index);
  }
};

// The factory of the process's file systems, and the master made from it (destroyed first).
struct FileSystems {
  ref<PluginFactory> factory{new PluginFactory("file systems")};
  ref<MasterFS> master;

  FileSystems() {
    factory->registerDesc(platform::systemFileSystem());
    factory->registerDesc(gzipFileSystem());
    factory->registerDesc(ref<IPluginDesc>(new MasterPluginDesc));
    master = ref<MasterFS>(static_cast<MasterFS*>(
        factory->create(intern("master"), PluginFactory::createOrNull | PluginFactory::createUnlisted).get()));
  }
};

}  // namespace

MasterFS& master() {
  static FileSystems fileSystems;
  return *fileSystems.master;
}

AliasTable& aliases() {
  static AliasTable table;
  return table;
}

}  // namespace base::fs
