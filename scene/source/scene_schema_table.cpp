#include "scene_schema_registry.h"

#include "scene_schema_names.h"

namespace scene {
namespace {

#define SCHEMA_TEXT(name) #name,
constexpr const char* sceneNames[] = {SCENE_SCHEMA_NAMES_SCENE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* lightNames[] = {SCENE_SCHEMA_NAMES_LIGHT(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* bufferAdapterNames[] = {SCENE_SCHEMA_NAMES_BUFFER_ADAPTER(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* bufferNames[] = {SCENE_SCHEMA_NAMES_BUFFER(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* textureNames[] = {SCENE_SCHEMA_NAMES_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* bitmapTextureNames[] = {SCENE_SCHEMA_NAMES_BITMAP_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* randomTextureNames[] = {SCENE_SCHEMA_NAMES_RANDOM_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* noiseTextureNames[] = {SCENE_SCHEMA_NAMES_NOISE_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* vertColorTextureNames[] = {SCENE_SCHEMA_NAMES_VERT_COLOR_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* cellularTextureNames[] = {SCENE_SCHEMA_NAMES_CELLULAR_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* checkerTextureNames[] = {SCENE_SCHEMA_NAMES_CHECKER_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* embeddedTextureNames[] = {SCENE_SCHEMA_NAMES_EMBEDDED_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* curvatureTextureNames[] = {SCENE_SCHEMA_NAMES_CURVATURE_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* fileTextureNames[] = {SCENE_SCHEMA_NAMES_FILE_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* cubistTextureNames[] = {SCENE_SCHEMA_NAMES_CUBIST_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* materialNames[] = {SCENE_SCHEMA_NAMES_MATERIAL(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* dotsTextureNames[] = {SCENE_SCHEMA_NAMES_DOTS_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* mixTextureNames[] = {SCENE_SCHEMA_NAMES_MIX_TEXTURE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* principalMaterialNames[] = {SCENE_SCHEMA_NAMES_PRINCIPAL_MATERIAL(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* hairMaterialNames[] = {SCENE_SCHEMA_NAMES_HAIR_MATERIAL(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* toonMaterialNames[] = {SCENE_SCHEMA_NAMES_TOON_MATERIAL(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* lightGroupNames[] = {SCENE_SCHEMA_NAMES_LIGHT_GROUP(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* nodeNames[] = {SCENE_SCHEMA_NAMES_NODE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* keyframeChannelNames[] = {SCENE_SCHEMA_NAMES_KEYFRAME_CHANNEL(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* animLayerNames[] = {SCENE_SCHEMA_NAMES_ANIM_LAYER(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* keyframeChannelCurveNames[] = {
    SCENE_SCHEMA_NAMES_KEYFRAME_CHANNEL_CURVE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* geometryNames[] = {SCENE_SCHEMA_NAMES_GEOMETRY(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* instancerNames[] = {SCENE_SCHEMA_NAMES_INSTANCER(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* animLayerActionNames[] = {SCENE_SCHEMA_NAMES_ANIM_LAYER_ACTION(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* animClipNames[] = {SCENE_SCHEMA_NAMES_ANIM_CLIP(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* geometryLODNames[] = {SCENE_SCHEMA_NAMES_GEOMETRY_L_O_D(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* linesNames[] = {SCENE_SCHEMA_NAMES_LINES(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* meshPrimitiveNames[] = {SCENE_SCHEMA_NAMES_MESH_PRIMITIVE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* pointsNames[] = {SCENE_SCHEMA_NAMES_POINTS(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* hairNames[] = {SCENE_SCHEMA_NAMES_HAIR(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* furNames[] = {SCENE_SCHEMA_NAMES_FUR(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* meshJointsSetNames[] = {SCENE_SCHEMA_NAMES_MESH_JOINTS_SET(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* meshBindPoseSetNames[] = {SCENE_SCHEMA_NAMES_MESH_BIND_POSE_SET(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* subdividableNames[] = {SCENE_SCHEMA_NAMES_SUBDIVIDABLE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* meshUVSetNames[] = {SCENE_SCHEMA_NAMES_MESH_U_V_SET(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* meshNames[] = {SCENE_SCHEMA_NAMES_MESH(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* meshColorSetNames[] = {SCENE_SCHEMA_NAMES_MESH_COLOR_SET(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* skinNames[] = {SCENE_SCHEMA_NAMES_SKIN(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* morphNames[] = {SCENE_SCHEMA_NAMES_MORPH(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* environmentNames[] = {SCENE_SCHEMA_NAMES_ENVIRONMENT(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* stereoCameraNames[] = {SCENE_SCHEMA_NAMES_STEREO_CAMERA(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* cameraNames[] = {SCENE_SCHEMA_NAMES_CAMERA(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* morphTargetNames[] = {SCENE_SCHEMA_NAMES_MORPH_TARGET(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* clipPlaneNames[] = {SCENE_SCHEMA_NAMES_CLIP_PLANE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* compositingChannelNames[] = {SCENE_SCHEMA_NAMES_COMPOSITING_CHANNEL(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* outputJobNames[] = {SCENE_SCHEMA_NAMES_OUTPUT_JOB(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* renderOutputNames[] = {SCENE_SCHEMA_NAMES_RENDER_OUTPUT(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* sceneReferenceNames[] = {SCENE_SCHEMA_NAMES_SCENE_REFERENCE(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* workflowNames[] = {SCENE_SCHEMA_NAMES_WORKFLOW(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* metadataNames[] = {SCENE_SCHEMA_NAMES_METADATA(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* scriptOutputNames[] = {SCENE_SCHEMA_NAMES_SCRIPT_OUTPUT(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* historyEventNames[] = {SCENE_SCHEMA_NAMES_HISTORY_EVENT(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* sceneImporterNames[] = {SCENE_SCHEMA_NAMES_SCENE_IMPORTER(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* sceneExporterNames[] = {SCENE_SCHEMA_NAMES_SCENE_EXPORTER(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* viewportNames[] = {SCENE_SCHEMA_NAMES_VIEWPORT(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* popupWindowNames[] = {SCENE_SCHEMA_NAMES_POPUP_WINDOW(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* viewportWindowNames[] = {SCENE_SCHEMA_NAMES_VIEWPORT_WINDOW(SCHEMA_TEXT, SCHEMA_TEXT)};
constexpr const char* rendererNames[] = {SCENE_SCHEMA_NAMES_RENDERER(SCHEMA_TEXT, SCHEMA_TEXT)};
#undef SCHEMA_TEXT

// In the order of the schema table.
constexpr SchemaInfo schemaTable[] = {
    {"scene", "IScene", nullptr, sceneNames, SchemaKind::sceneType},
    {"light", "ILight", nullptr, lightNames, SchemaKind::sceneType},
    {"bufferAdapter", "IBufferAdapter", nullptr, bufferAdapterNames, SchemaKind::sceneType},
    {"buffer", "IBuffer", nullptr, bufferNames, SchemaKind::sceneType},
    {"texture", "ITexture", nullptr, textureNames, SchemaKind::sceneType},
    {"bitmapTexture", "IBitmapTexture", "texture", bitmapTextureNames, SchemaKind::abstractType},
    {"randomTexture", "IRandomTexture", "texture", randomTextureNames, SchemaKind::sceneType},
    {"noiseTexture", "INoiseTexture", "texture", noiseTextureNames, SchemaKind::sceneType},
    {"vertColorTexture", "IVertColorTexture", "texture", vertColorTextureNames, SchemaKind::sceneType},
    {"cellularTexture", "ICellularTexture", "texture", cellularTextureNames, SchemaKind::sceneType},
    {"checkerTexture", "ICheckerTexture", "texture", checkerTextureNames, SchemaKind::sceneType},
    {"embeddedTexture", "IEmbeddedTexture", "bitmapTexture", embeddedTextureNames, SchemaKind::sceneType},
    {"curvatureTexture", "ICurvatureTexture", "texture", curvatureTextureNames, SchemaKind::sceneType},
    {"fileTexture", "IFileTexture", "bitmapTexture", fileTextureNames, SchemaKind::sceneType},
    {"cubistTexture", "ICubistTexture", "texture", cubistTextureNames, SchemaKind::sceneType},
    {"material", "IMaterial", nullptr, materialNames, SchemaKind::abstractType},
    {"dotsTexture", "IDotsTexture", "texture", dotsTextureNames, SchemaKind::sceneType},
    {"mixTexture", "IMixTexture", "texture", mixTextureNames, SchemaKind::sceneType},
    {"principalMaterial", "IPrincipalMaterial", "material", principalMaterialNames, SchemaKind::sceneType},
    {"hairMaterial", "IHairMaterial", "material", hairMaterialNames, SchemaKind::sceneType},
    {"toonMaterial", "IToonMaterial", "material", toonMaterialNames, SchemaKind::sceneType},
    {"lightGroup", "ILightGroup", nullptr, lightGroupNames, SchemaKind::sceneType},
    {"node", "INode", nullptr, nodeNames, SchemaKind::sceneType},
    {"keyframeChannel", "IKeyframeChannel", nullptr, keyframeChannelNames, SchemaKind::sceneType},
    {"animLayer", "IAnimLayer", nullptr, animLayerNames, SchemaKind::sceneType},
    {"keyframeChannelCurve", "", nullptr, keyframeChannelCurveNames, SchemaKind::record},
    {"geometry", "IGeometry", nullptr, geometryNames, SchemaKind::abstractType},
    {"instancer", "IInstancer", nullptr, instancerNames, SchemaKind::sceneType},
    {"animLayerAction", "", nullptr, animLayerActionNames, SchemaKind::record},
    {"animClip", "IAnimClip", nullptr, animClipNames, SchemaKind::sceneType},
    {"geometryLOD", "", nullptr, geometryLODNames, SchemaKind::record},
    {"lines", "ILines", "geometry", linesNames, SchemaKind::sceneType},
    {"meshPrimitive", "", nullptr, meshPrimitiveNames, SchemaKind::record},
    {"points", "IPoints", "geometry", pointsNames, SchemaKind::sceneType},
    {"hair", "IHair", "geometry", hairNames, SchemaKind::sceneType},
    {"fur", "IFur", "geometry", furNames, SchemaKind::sceneType},
    {"meshJointsSet", "", nullptr, meshJointsSetNames, SchemaKind::record},
    {"meshBindPoseSet", "", nullptr, meshBindPoseSetNames, SchemaKind::record},
    {"subdividable", "ISubdividable", "geometry", subdividableNames, SchemaKind::abstractType},
    {"meshUVSet", "", nullptr, meshUVSetNames, SchemaKind::record},
    {"mesh", "IMesh", "subdividable", meshNames, SchemaKind::sceneType},
    {"meshColorSet", "", nullptr, meshColorSetNames, SchemaKind::record},
    {"skin", "ISkin", "subdividable", skinNames, SchemaKind::sceneType},
    {"morph", "IMorph", "subdividable", morphNames, SchemaKind::sceneType},
    {"environment", "IEnvironment", nullptr, environmentNames, SchemaKind::sceneType},
    {"stereoCamera", "", nullptr, stereoCameraNames, SchemaKind::record},
    {"camera", "ICamera", nullptr, cameraNames, SchemaKind::sceneType},
    {"morphTarget", "", nullptr, morphTargetNames, SchemaKind::record},
    {"clipPlane", "IClipPlane", nullptr, clipPlaneNames, SchemaKind::sceneType},
    {"compositingChannel", "", nullptr, compositingChannelNames, SchemaKind::record},
    {"outputJob", "", nullptr, outputJobNames, SchemaKind::record},
    {"renderOutput", "IRenderOutput", nullptr, renderOutputNames, SchemaKind::sceneType},
    {"sceneReference", "ISceneReference", nullptr, sceneReferenceNames, SchemaKind::sceneType},
    {"workflow", "", nullptr, workflowNames, SchemaKind::record},
    {"metadata", "IMetadata", nullptr, metadataNames, SchemaKind::sceneType},
    {"scriptOutput", "", nullptr, scriptOutputNames, SchemaKind::record},
    {"historyEvent", "", nullptr, historyEventNames, SchemaKind::record},
    {"sceneImporter", "", nullptr, sceneImporterNames, SchemaKind::parameters},
    {"sceneExporter", "", nullptr, sceneExporterNames, SchemaKind::parameters},
    {"viewport", "", nullptr, viewportNames, SchemaKind::viewportType},
    {"popupWindow", "", nullptr, popupWindowNames, SchemaKind::viewportType},
    {"viewportWindow", "", nullptr, viewportWindowNames, SchemaKind::viewportType},
    {"renderer", "IRenderer", nullptr, rendererNames, SchemaKind::interfaceOnly},
};

}  // namespace

std::span<const SchemaInfo> schemas() { return schemaTable; }

}  // namespace scene
