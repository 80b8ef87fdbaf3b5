#pragma once

#include "b_plugin_factory.h"

namespace scenetool {

/// Prints a line per object of `factory`: its index, type and name; for a mesh also its
/// vertex, face and triangle counts, primitives, colour and UV sets, normals and bounds.
void printSceneSummary(const base::PluginFactory& factory);

}  // namespace scenetool
