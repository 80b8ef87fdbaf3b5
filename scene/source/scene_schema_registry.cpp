#include "scene_schema_registry.h"

#include "scene_interfaces.h"

#include <mutex>

namespace scene {
namespace {

// A scene type's descriptor: it makes objects of the type's interface class.
template <class Object>
class SceneTypeDesc final : public base::IPluginDesc {
 public:
  SceneTypeDesc() { name = Object::typeName(); }
  base::IPlugin* create(base::PluginFactory* factory, std::uint32_t index) override {
    return new Object(factory, this, index);
  }
};

// Descriptors live for the whole process: the reference taken here is never dropped.
template <class Object>
base::IPluginDesc* make() {
  auto* descriptor = new SceneTypeDesc<Object>;
  descriptor->addRef();
  return descriptor;
}

base::IPluginDesc* makeGeneral(const char* type) {
  auto* descriptor = new base::IPluginDesc;
  descriptor->name = base::intern(type);
  descriptor->addRef();
  return descriptor;
}

void registerAll(base::PluginFactory& factory, std::span<base::IPluginDesc* const> descriptors) {
  for (base::IPluginDesc* descriptor : descriptors) factory.registerDesc(base::ref<base::IPluginDesc>(descriptor));
}

constexpr ParameterHelp helpTexts[] = {
    {"importMeshes", "Whether to import meshes."},
    {"importSurfaces", "Whether to import NURBS and patch surfaces."},
    {"importColors", "Whether to import the mesh vertex colors."},
    {"importMultiIndex",
     "Whether to import separate index channels for each vertex attribute or use a global index channel. Separate "
     "index channels provide more flexibility to compute normals/tangents and subdivision/displacement on the fly. "
     "Global index channel is faster and takes less memory if the geometry will be not further processed."},
    {"importTextureCoordinates",
     "Whether to import the mesh texture coordinates. This is required for texturing to work."},
    {"importNormals",
     "Whether to import the mesh normals. If not present in the file, they must be generated on the fly which takes "
     "extra time."},
    {"flipNormals", "Whether to flip the face orientation/normals. Some models may use wrong convention."},
    {"importTangents",
     "Whether to import the mesh tangents. If not present in the file, they must be generated on the fly or use the "
     "'Without Tangents' bump space."},
    {"importVelocities", "Whether to import the vertex velocities. Velocities are used for effects like motion blur."},
    {"importSkeletons", "Whether to import the mesh skeletons. Skeletons are used to pose and animate the characters."},
    {"importEdges", "Whether to import mesh/surface edges. Edges can be used to draw object outlines."},
    {"importMaterials", "Whether to import materials."},
    {"importLights", "Whether to import the scene lights."},
    {"importCameras", "Whether to import scene cameras."},
    {"importAnimations", "Whether to import animations."},
    {"importHair", "Whether to import hair/curves/lines."},
    {"importPoints", "Whether to import points/particles."},
    {"keepInSync",
     "If on, synchronize with the source file at startup, making sure you are working with the last version."},
    {"exportEdges", "Whether to export mesh edges."},
    {"exportHair", "Whether to export hair/curves/lines."},
    {"exportPoints", "Whether to export points/particles."},
    {"exportColors", "Whether to export the mesh vertex colors."},
    {"exportTextureCoordinates",
     "Whether to export the mesh texture coordinates. This is required for texturing to work."},
    {"exportTangents",
     "Whether to export the mesh tangents. If not present in the file, bump and normal mapping may not work."},
    {"exportAnimations", "Whether to export animations."},
    {"exportCameras", "Whether to export scene cameras."},
    {"exportLights", "Whether to export the scene lights."},
    {"exportBinary", "Whether to export in binary format."},
    {"exportCompress", "Whether to export in compressed format."},
    {"exportCompressImages", "Whether to compress the images to take less space when possible."},
    {"exportImageMaxDim", "Maximum dimension of the images. Can be used to further decrease the file size."},
    {"exportEmbedded", "Incorporate into the file any external resources."},
};

}  // namespace

const SchemaInfo* findSchema(std::string_view type) {
  for (const SchemaInfo& schema : schemas()) {
    if (type == schema.type) return &schema;
  }
  return nullptr;
}

void internSchemaNames() {
  static std::once_flag once;
  std::call_once(once, [] {
    for (const SchemaInfo& schema : schemas()) {
      base::intern(schema.type);
      for (const char* name : schema.names) base::intern(name);
    }
  });
}

void register_scene_schema(base::PluginFactory& factory) {
  internSchemaNames();
  static base::IPluginDesc* const descriptors[] = {
      make<IScene>(),
      make<ILight>(),
      make<IBufferAdapter>(),
      make<IBuffer>(),
      make<ITexture>(),
      make<IRandomTexture>(),
      make<INoiseTexture>(),
      make<IVertColorTexture>(),
      make<ICellularTexture>(),
      make<ICheckerTexture>(),
      make<IEmbeddedTexture>(),
      make<ICurvatureTexture>(),
      make<IFileTexture>(),
      make<ICubistTexture>(),
      make<IDotsTexture>(),
      make<IMixTexture>(),
      make<IPrincipalMaterial>(),
      make<IHairMaterial>(),
      make<IToonMaterial>(),
      make<ILightGroup>(),
      make<INode>(),
      make<IKeyframeChannel>(),
      make<IAnimLayer>(),
      make<IInstancer>(),
      make<IAnimClip>(),
      make<ILines>(),
      make<IPoints>(),
      make<IHair>(),
      make<IFur>(),
      make<IMesh>(),
      make<ISkin>(),
      make<IMorph>(),
      make<IEnvironment>(),
      make<ICamera>(),
      make<IClipPlane>(),
      make<IRenderOutput>(),
      make<ISceneReference>(),
      make<IMetadata>(),
  };
  registerAll(factory, descriptors);
}

void register_viewport_schema(base::PluginFactory& factory) {
  static base::IPluginDesc* const descriptors[] = {
      makeGeneral("viewport"),
      makeGeneral("popupWindow"),
      makeGeneral("viewportWindow"),
  };
  registerAll(factory, descriptors);
}

std::span<const ParameterHelp> parameterHelpTexts() { return helpTexts; }

}  // namespace scene
