#pragma once

#include "b_plugin_factory.h"

namespace scenetool {

/// Prints {"objects": [{"index": I, "type": T, "attributes": {...}}, ...]}, the objects of
/// `factory` in its order, on standard output.
void printSceneJson(const base::PluginFactory& factory);

}  // namespace scenetool
