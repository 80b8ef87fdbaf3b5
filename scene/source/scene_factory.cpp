#include "scene_factory.h"

#include "b_exception.h"
#include "b_fs.h"
#include "b_log.h"
#include "b_path.h"
#include "b_string_conversion.h"

#include <fmt/format.h>

#include <algorithm>
#include <exception>
#include <set>

namespace scene {
namespace {

std::string_view trimmed(std::string_view text) {
  const std::size_t first = text.find_first_not_of(" \t");
  if (first == std::string_view::npos) return {};
  return text.substr(first, text.find_last_not_of(" \t") - first + 1);
}

// Calls `each` with every non-empty token of a `;`-separated list, trimmed.
template <class Each>
void forEachToken(std::string_view list, Each&& each) {
  for (std::size_t start = 0; start <= list.size();) {
    const std::size_t end = std::min(list.find(';', start), list.size());
    const std::string_view token = trimmed(list.substr(start, end - start));
    if (!token.empty()) each(token);
    start = end + 1;
  }
}

base::string extensionsOf(const IScenePluginDesc& descriptor, bool importers) {
  return importers ? descriptor.getImporterExtensions() : descriptor.getExporterExtensions();
}

// The names that an importers.txt lists, comments and blank lines removed.
base::vector<base::string> listedNames(std::string_view importerList) {
  base::Stream file = base::fs::master().open(importerList, base::fs::openForReading);
  base::vector<base::string> lines;
  base::readLines(file, lines);
  base::vector<base::string> names;
  for (const base::string& line : lines) {
    std::string_view name = trimmed(line);
    const std::size_t comment = name.find("//");
    if (comment == 0) continue;
    if (comment != std::string_view::npos) name = trimmed(name.substr(0, comment));
    if (!name.empty()) base::append(names, base::string(name));
  }
  return names;
}

// Runs an entry point of a plug-in library; nothing it throws gets out.
template <class Call>
void guarded(const char* unhandledMessage, Call&& call) {
  try {
    call();
  } catch (const base::exception& error) {
    error.report(base::log());
  } catch (const std::exception& error) {
    base::log().message(base::logScene, base::logError, std::string_view(error.what()));
  } catch (...) {
    base::log().message(base::logScene, base::logError, unhandledMessage);
  }
}

}  // namespace

bool matchesExtension(std::string_view extension, std::string_view list) {
  bool matched = false;
  forEachToken(list, [&](std::string_view token) {
    matched = matched || token == extension || token.substr(0, token.find('|')) == extension;
  });
  return matched;
}

SceneFactory::SceneFactory() : base::PluginFactory("mesh factory") {}

SceneFactory::~SceneFactory() { unloadPlugins(); }

void SceneFactory::reloadPlugins() {
  const base::string programFolder = base::getDirectory(base::getExecutablePath());
  reloadPlugins(programFolder, base::getDirectory(programFolder + "../data/") + "importers.txt");
}

void SceneFactory::reloadPlugins(std::string_view pluginDirectory, std::string_view importerList) {
  unloadPlugins();
  loadPluginsFromPath(pluginDirectory);
  orderPlugins(importerList);
}

void SceneFactory::loadPluginsFromPath(std::string_view directory) {
  base::log().message(base::logScene, base::logDebug, "Loading scene plugins from path '{}' ...", directory);
  base::string pattern(directory);
  if (!pattern.empty() && pattern.back() != '/' && pattern.back() != '\\') pattern += '/';
  pattern += "scene_*";
  pattern += base::DynLib::fileSuffix();
  base::vector<base::string> files;
  for (base::ref<base::fs::IEnum> found = base::fs::master().findFiles(pattern); !found->atEnd(); found->next()) {
    base::append(files, found->directory() + found->name());
  }
  // The system lists a folder in no particular order; load in a fixed one.
  std::sort(files.begin(), files.end());
  for (const base::string& file : files) {
    guarded("Unhandled exception occurred while loading the mesh plugins!", [&] { loadLibrary(file); });
  }
}

void SceneFactory::loadLibrary(const base::string& file) {
  base::log().message(base::logScene, base::logDebug, "Trying to load '{}' as a scene plugin...",
                      std::string_view(file).substr(file.find_last_of("/\\") + 1));
  base::ref<base::DynLib> library(new base::DynLib(file));
  const auto load = reinterpret_cast<LoadScenePluginFunction>(library->loadSymbol("loadScenePlugin"));
  if (!load) {
    base::log().message(base::logScene, base::logError, "Failed to load scene plugin '{}'!", file);
    return;
  }
  const auto before = descriptors();
  base::append(m_pluginLibraries, library);
  load(*this);
  for (const auto& [name, descriptor] : descriptors()) {
    if (!before.count(name)) m_libraryOf[descriptor.get()] = file;
  }
}

void SceneFactory::orderPlugins(std::string_view importerList) {
  m_scenePlugins.clear();
  // The registry in name order: the order the plug-ins that the list does not name take.
  base::vector<base::ref<IScenePluginDesc>> registered;
  for (const auto& [name, descriptor] : descriptors()) {
    if (!(descriptor->flags & IScenePluginDesc::sceneDescFlag)) {
      base::log().message(base::logScene, base::logWarning, "'{}' is not a scene plugin descriptor; it is skipped",
                          base::text(name));
      continue;
    }
    base::append(registered, base::ref<IScenePluginDesc>(static_cast<IScenePluginDesc*>(descriptor.get())));
  }
  std::sort(registered.begin(), registered.end(),
            [](const auto& a, const auto& b) { return base::text(a->name) < base::text(b->name); });

  base::vector<base::string> names;
  try {
    names = listedNames(importerList);
  } catch (const std::exception&) {
    base::log().message(base::logScene, base::logWarning, "Can't open importers.txt!");
  }
  for (const base::string& name : names) {
    const auto found = std::find_if(registered.begin(), registered.end(),
                                    [&](const auto& descriptor) { return base::text(descriptor->name) == name; });
    if (found == registered.end()) {
      base::log().message(base::logScene, base::logWarning, "Can't find mesh importer called '{}'!", name);
    } else if (std::find(m_scenePlugins.begin(), m_scenePlugins.end(), *found) == m_scenePlugins.end()) {
      base::append(m_scenePlugins, *found);
    }
  }
  for (const base::ref<IScenePluginDesc>& descriptor : registered) {
    if (std::find(m_scenePlugins.begin(), m_scenePlugins.end(), descriptor) == m_scenePlugins.end()) {
      base::append(m_scenePlugins, descriptor);
    }
  }
}

void SceneFactory::unloadPlugins() {
  // The descriptors' code lives in the libraries: they go first.
  clearDescriptors();
  m_scenePlugins.clear();
  m_libraryOf.clear();
  for (const base::ref<base::DynLib>& library : m_pluginLibraries) {
    guarded("Unhandled exception occurred while unloading the mesh plugins!", [&] {
      const auto unload = reinterpret_cast<UnloadScenePluginFunction>(library->loadSymbol("unloadScenePlugin"));
      if (unload) unload(*this);
    });
  }
  m_pluginLibraries.clear();
}

base::string SceneFactory::libraryOf(const base::IPluginDesc* descriptor) const {
  const auto found = m_libraryOf.find(descriptor);
  return found == m_libraryOf.end() ? base::string() : found->second;
}

base::ref<base::IPlugin> SceneFactory::createFor(std::string_view extension, bool importers) {
  for (const base::ref<IScenePluginDesc>& descriptor : m_scenePlugins) {
    if (!matchesExtension(extension, extensionsOf(*descriptor, importers))) continue;
    base::ref<base::IPlugin> object(descriptor->create(this, base::IPlugin::unlisted));
    if (object) return object;
  }
  return nullptr;
}

base::ref<base::IPlugin> SceneFactory::createImporter(std::string_view path, const char* function,
                                                      std::string_view emptyMessage) {
  base::string previous;
  for (const bool second : {true, false}) {
    const base::string extension = base::asciiLower(base::getExtension(path, second));
    if (extension.empty()) base::raise<base::exception>(function, emptyMessage);
    if (extension == previous) return nullptr;
    if (base::ref<base::IPlugin> object = createFor(extension, true)) return object;
    previous = extension;
  }
  return nullptr;
}

bool SceneFactory::getImporterParameters(std::string_view path, base::AttribMap& parameters) {
  const bool exists = base::fs::master().fileExists(path);
  const base::ref<base::IPlugin> object = createImporter(path, "scene::SceneFactory::getImporterParameters",
                                                         "mesh factory: Can't load meshes without an extension!");
  if (!object) return false;
  if (ISceneImporter* importer = importerOf(*object)) {
    if (!exists || importer->canImport(path)) importer->getParameters(parameters);
  }
  return true;
}

bool SceneFactory::getPluginParameters(IScenePluginDesc& descriptor, bool importers, base::AttribMap& parameters) {
  const base::ref<base::IPlugin> object(descriptor.create(this, base::IPlugin::unlisted));
  if (!object) return false;
  ISceneImporter* importer = importers ? importerOf(*object) : nullptr;
  ISceneExporter* exporter = importers ? nullptr : exporterOf(*object);
  if (importer) importer->getParameters(parameters);
  if (exporter) exporter->getParameters(parameters);
  return importer || exporter;
}

bool SceneFactory::getExporterParameters(std::string_view path, base::AttribMap& parameters) {
  const base::string extension = base::asciiLower(base::getExtension(path, true));
  if (extension.empty()) {
    base::raise<base::exception>("scene::SceneFactory::getExporterParameters",
                                 "mesh factory: Can't save meshes without an extension!");
  }
  for (const base::ref<IScenePluginDesc>& descriptor : m_scenePlugins) {
    if (matchesExtension(extension, descriptor->getExporterExtensions()) &&
        getPluginParameters(*descriptor, false, parameters)) {
      return true;
    }
  }
  return false;
}

bool SceneFactory::load(base::PluginFactory& scene, std::string_view path, const base::AttribMap& parameters) {
  const base::ref<base::IPlugin> object = createImporter(
      path, "scene::SceneFactory::load", fmt::format("mesh factory|{}| Can't load meshes without an extension!", path));
  if (!object) return false;
  ISceneImporter* importer = importerOf(*object);
  if (!importer || !importer->canImport(path)) return false;
  object->copyFrom(parameters, base::copyOverwrite);
  return importer->importScene(scene, path);
}

bool SceneFactory::save(base::PluginFactory& scene, std::string_view path, const base::AttribMap& parameters) {
  const base::string extension = base::asciiLower(base::getExtension(path, true));
  if (extension.empty()) {
    base::raise<base::exception>("scene::SceneFactory::save",
                                 "mesh factory: Can't save meshes without a provided format!");
  }
  const base::ref<base::IPlugin> object = createFor(extension, false);
  ISceneExporter* exporter = object ? exporterOf(*object) : nullptr;
  if (!exporter) return false;
  object->copyFrom(parameters, base::copyOverwrite);
  return exporter->exportScene(scene, path);
}

base::string SceneFactory::getSupportedExtensions(bool importers) const {
  std::set<base::string> extensions;
  for (const base::ref<IScenePluginDesc>& descriptor : m_scenePlugins) {
    forEachToken(extensionsOf(*descriptor, importers), [&](std::string_view token) { extensions.emplace(token); });
  }
  base::string joined;
  for (const base::string& extension : extensions) {
    if (!joined.empty()) joined += ';';
    joined += extension;
  }
  return joined;
}

bool SceneFactory::isExtensionSupported(std::string_view extension, bool importers) const {
  return std::any_of(m_scenePlugins.begin(), m_scenePlugins.end(), [&](const base::ref<IScenePluginDesc>& descriptor) {
    return matchesExtension(extension, extensionsOf(*descriptor, importers));
  });
}

}  // namespace scene
