// Writes the seed corpora of the fuzz targets from the repository's own data, so that each
// target starts from real inputs of its kind:
//   fuzz_seeds SOURCE_DIR OUTPUT_DIR
// makes OUTPUT_DIR/<target>/ for every target. The object-list files of tests/data/scene give
// the attribute maps, written in their binary and their JSON form.

#include "b_attribute_map.h"
#include "b_binary_io.h"
#include "b_exception.h"
#include "b_fs.h"
#include "b_json.h"
#include "b_plugin_factory.h"
#include "scene_schema_registry.h"

#include <filesystem>
#include <iostream>
#include <string>

namespace {

namespace stdfs = std::filesystem;

void copyFiles(const stdfs::path& from, const char* extension, const stdfs::path& to) {
  stdfs::create_directories(to);
  for (const auto& entry : stdfs::directory_iterator(from)) {
    if (entry.path().extension() == extension) {
      stdfs::copy_file(entry.path(), to / entry.path().filename(), stdfs::copy_options::overwrite_existing);
    }
  }
}

base::Stream create(const stdfs::path& path) {
  return base::fs::master().open(path.string(), base::fs::openWrite | base::fs::openTruncate);
}

// Every object of every readable object-list file, as a map in binary and in JSON.
void writeMaps(const stdfs::path& sceneFolder, const stdfs::path& output) {
  stdfs::create_directories(output / "attribute_binary");
  stdfs::create_directories(output / "attribute_json");
  for (const auto& entry : stdfs::directory_iterator(sceneFolder)) {
    if (entry.path().extension() != ".scene") continue;
    base::ref<base::PluginFactory> factory(new base::PluginFactory("scene"));
    scene::register_scene_schema(*factory);
    try {
      base::Stream input = base::fs::master().open(entry.path().string(), base::fs::openForReading);
      factory->read(input);
    } catch (const base::exception&) {
      continue;  // the damaged files are seeds of the object-list target only
    }
    for (const auto& object : factory->objects()) {
      if (!object) continue;
      const std::string stem = entry.path().stem().string() + "_" + std::to_string(object->index());
      base::Stream binary = create(output / "attribute_binary" / (stem + ".bin"));
      object->write(binary, base::plainContext());
      base::JsonWriter json;
      object->writeValue(json);
      create(output / "attribute_json" / (stem + ".json"))
          .write(json.text().data(), static_cast<std::uint32_t>(json.text().size()));
    }
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::cerr << "usage: fuzz_seeds SOURCE_DIR OUTPUT_DIR\n";
    return 2;
  }
  const stdfs::path source = argv[1];
  const stdfs::path output = argv[2];
  try {
    for (const char* folder : {"valid", "invalid"}) {
      copyFiles(source / "tests/data/ply" / folder, ".ply", output / "ply");
      copyFiles(source / "tests/data/ply" / folder, ".ply", output / "import");
      copyFiles(source / "tests/data/ply" / folder, ".ply", output / "raw_ply");
    }
    for (const char* folder : {"", "invalid"})
      copyFiles(source / "tests/data/scene" / folder, ".scene", output / "object_list");
    copyFiles(source / "data/attributes", ".xml", output / "description");
    copyFiles(source / "data", ".txt", output / "importers");
    copyFiles(source / "fuzz/seeds/importers", ".txt", output / "importers");
    writeMaps(source / "tests/data/scene", output);
  } catch (const base::exception& error) {
    std::cerr << "fuzz_seeds: " << error.what() << "\n";
    return 1;
  } catch (const std::exception& error) {
    std::cerr << "fuzz_seeds: " << error.what() << "\n";
    return 1;
  }
  return 0;
}
