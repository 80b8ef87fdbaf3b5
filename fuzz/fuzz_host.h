#pragma once

// The host around a fuzz target. The input becomes a file: a file system attached to the
// master file system serves it under any name that starts with "fuzz-input", so that readers
// which take a path read it from memory, as a host's file would reach them. The scene
// factory loads the plug-ins beside the program once, as a host does at start-up.

#include "scene_factory.h"

#include <cstddef>
#include <cstdint>

namespace fuzzing {

/// Attaches the file system once, then makes `data` the content of every "fuzz-input" file.
void setInputFile(const std::uint8_t* data, std::size_t size);

/// The scene factory with the plug-ins beside the program and their importers.txt.
scene::SceneFactory& pluginFactory();

}  // namespace fuzzing
