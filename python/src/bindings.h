#pragma once

#include <pybind11/pybind11.h>

namespace pymeshport {

/// Adds meshport.read_ply.
void bindReadPly(pybind11::module_& module);
/// Adds meshport.import_scene, meshport.Scene and meshport.SceneObject.
void bindScene(pybind11::module_& module);

}  // namespace pymeshport
