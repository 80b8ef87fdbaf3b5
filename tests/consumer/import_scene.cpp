// Imports the PLY file named on the command line as a host does, through the installed scene
// library and the scene plug-in of the installed tree (PREFIX/bin, PREFIX/data), and prints
// what the scene holds.
#include "b_attribute_desc.h"
#include "b_exception.h"
#include "scene_factory.h"
#include "scene_validation.h"
#include "scene_schema.h"
#include "scene_schema_registry.h"

#include <cstdio>
#include <string>

int main(int argc, char** argv) {
  if (argc != 3) return 2;
  const std::string prefix = argv[1];
  base::attribDescManager().loadFolder(prefix + "/data/attributes/");
  scene::SceneFactory factory;
  factory.reloadPlugins(prefix + "/bin", prefix + "/data/importers.txt");
  base::ref<base::PluginFactory> objects(new base::PluginFactory("scene"));
  scene::register_scene_schema(*objects);
  try {
    base::AttribMap parameters;
    if (!factory.getImporterParameters(argv[2], parameters) || !factory.load(*objects, argv[2], parameters)) return 1;
  } catch (const base::exception& error) {
    std::fprintf(stderr, "%s\n", error.what());
    return 1;
  }
  for (const auto& object : objects->objects()) {
    if (object && object->mapType() == scene::mesh_schema::typeName()) {
      std::printf("imported a mesh of %u faces\n", scene::getFaceCount(*object));
    }
  }
  return 0;
}
