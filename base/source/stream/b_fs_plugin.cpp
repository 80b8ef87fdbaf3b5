#include "b_exception.h"
#include "b_fs.h"
#include "b_fs_enums.h"

namespace base::fs {

IEnum::~IEnum() = default;

PluginDesc::PluginDesc(std::string_view name, std::string_view author, std::string_view extensions)
    : extensions(extensions) {
  this->name = intern(name);
  this->author = author;
}

PluginDesc::~PluginDesc() = default;

IPlugin::IPlugin(PluginFactory* factory, PluginDesc* descriptor, std::uint32_t index, std::uint32_t capabilities)
    : base::IPlugin(factory, descriptor, index), m_capabilities(capabilities) {}

IPlugin::~IPlugin() = default;

PluginDesc* IPlugin::getDesc() const { return static_cast<PluginDesc*>(descriptor()); }

bool IPlugin::symLinksPermitted() const {
  raise<unsupported_interface>("base::fs::IPlugin::symLinksPermitted", "fs::Plugin::symbolicLinks");
}

void IPlugin::symLinksPermitted(bool) {
  raise<unsupported_interface>("base::fs::IPlugin::symLinksPermitted", "fs::Plugin::symbolicLinks");
}

bool IPlugin::isArchive(std::string_view) { return false; }

bool IPlugin::isInArchive(std::string_view) { return false; }

void IPlugin::remove(std::string_view, bool) {
  raise<unsupported_interface>("base::fs::IPlugin::remove", "fs::Plugin::remove");
}

void IPlugin::rename(std::string_view, std::string_view) {
  raise<unsupported_interface>("base::fs::IPlugin::rename", "fs::Plugin::rename");
}

void IPlugin::replace(std::string_view, std::string_view) {
  raise<unsupported_interface>("base::fs::IPlugin::replace", "fs::Plugin::replace");
}

void IPlugin::copy(std::string_view, std::string_view) {
  raise<unsupported_interface>("base::fs::IPlugin::copy", "fs::Plugin::copy");
}

void IPlugin::touch(std::string_view) { raise<unsupported_interface>("base::fs::IPlugin::touch", "fs::Plugin::touch"); }

base::string IPlugin::readLink(std::string_view) {
  raise<unsupported_interface>("base::fs::IPlugin::readLink", "fs::Plugin::readLink");
}

void IPlugin::mkdir(std::string_view) { raise<unsupported_interface>("base::fs::IPlugin::mkdir", "fs::Plugin::mkdir"); }

base::string IPlugin::curdir() { raise<unsupported_interface>("base::fs::IPlugin::curdir", "fs::Plugin::curdir"); }

ref<IEnum> IPlugin::findRecursive(std::string_view pattern) { return ref<IEnum>(new RecursiveEnum(*this, pattern)); }

}  // namespace base::fs
