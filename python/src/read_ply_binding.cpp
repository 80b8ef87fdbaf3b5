// meshport.read_ply: a PLY file's raw elements as NumPy arrays, without an import.

#include "b_fs.h"
#include "bindings.h"
#include "python_bridge.h"
#include "python_values.h"
#include "raw_ply.h"

#include <pybind11/stl/filesystem.h>

#include <filesystem>

namespace pymeshport {
namespace {

// `name`, or when the dict has it already, `name` with the first free number: ".2", ".3".
py::str freeKey(const py::dict& dict, const std::string& name) {
  py::str key = pythonText(name);
  for (int k = 2; dict.contains(key); ++k) key = pythonText(name + "." + std::to_string(k));
  return key;
}

py::dict readPly(const std::filesystem::path& file) {
  const std::string path = file.string();
  base::vector<RawElement> elements = runFileCall(path, [&] {
    base::Stream stream = base::fs::master().open(path, base::fs::openForReading);
    return readRawPly(stream);
  });
  py::dict result;
  for (const RawElement& element : elements) {
    py::dict properties;
    for (const RawProperty& property : element.properties) {
      properties[freeKey(properties, property.name)] = arrayOf(property.values);
      if (property.counts) properties[freeKey(properties, property.name + ".counts")] = arrayOf(*property.counts);
    }
    result[freeKey(result, element.name)] = properties;
  }
  return result;
}

}  // namespace

void bindReadPly(py::module_& module) {
  module.def("read_ply", &readPly, py::arg("path"),
             R"(Reads a PLY file's raw elements, without importing it into a scene.

Returns a dict by element name, in file order; each element is a dict by property name
as the header spells it ("u", "s" and "texture_u" stay apart), in header order. A name
that repeats gets ".2", ".3", ... A scalar property is a one-dimensional array in its
PLY type (char int8, uchar uint8, ... double float64). A list property is a two-dimensional
array, one row per instance, when every list has the same length; otherwise a flat array
of all items, with their lengths in "NAME.counts" (uint32).

The values are those 'scenetool ply --values' shows. For an ASCII file, an integer
property whose words leave its declared type's range (300 for a uchar) comes back in the
32-bit type of the same signedness (int32 or uint32), so that no value changes.

An ASCII instance that cannot be read is skipped, as the importer skips it, with a
warning: its scalars read 0 from the bad word on and its lists are empty, so that every
array keeps one row per instance.

Files ending in .gz are decompressed as they are read. Raises NotFoundError,
CorruptError (a bad header, a body that ends before the header's counts, damaged
compressed data) or Error. The read runs without the interpreter lock.)");
}

}  // namespace pymeshport
