#pragma once

#include "scene_plugin.h"

namespace ply {

/// The exporter part of the PLY plug-in object: the object answers "ISceneExporter" with it.
/// It reads its parameters from the object's own attributes, where the scene factory puts
/// them before an export.
class PLYExporter final : public scene::ISceneExporter {
 public:
  explicit PLYExporter(const base::AttribMap& parameters) : m_parameters(parameters) {}

  /// exportBinary, exportBigEndian, exportColors, exportTextureCoordinates, exportEdges,
  /// exportPoints, exportMaterials, exportCustomProperties and exportMergeMeshes with their
  /// defaults; the map's type becomes "sceneExporter".
  void getParameters(base::AttribMap& parameters) override;
  /// Writes the meshes of `scene` to `path`, one file per mesh (the second to `name-1.ply`
  /// beside it, and so on) or all in one. A scene without meshes, a mesh that PLY cannot
  /// hold and a failed write throw base::exception naming the file; a file is written
  /// under a temporary name first and replaces `path` only once complete.
  bool exportScene(base::PluginFactory& scene, std::string_view path) override;

 private:
  const base::AttribMap& m_parameters;
};

}  // namespace ply
