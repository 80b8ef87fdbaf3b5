#pragma once

#include "b_plugin_factory.h"

#include <string>

namespace scene {

/// A line per object of `factory`: its index, type and name; for a mesh also its vertex,
/// face and triangle counts, primitives, colour and UV sets, normals and bounds, and a
/// second line naming the properties the importer kept. Every line ends with a line break.
std::string sceneSummary(const base::PluginFactory& factory);

}  // namespace scene
