#pragma once

#include "b_name.h"
#include "scene_schema_names.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

namespace scene {

namespace detail {
/// A text as a template argument: each distinct text gets one accessor instantiation.
template <std::size_t N>
struct SchemaText {
  char text[N];
  constexpr SchemaText(const char (&value)[N]) { std::copy_n(value, N, text); }
};

/// The handle of a schema text, interned on first use and kept for the life of the process.
template <SchemaText Text>
base::name_id schemaName() {
  static const base::name_id handle = base::intern(std::string_view(Text.text, sizeof(Text.text) - 1));
  return handle;
}
}  // namespace detail

// A schema structure declares its type's name first, then a static accessor per attribute.
#define SCENE_SCHEMA_TYPE(type) \
  static base::name_id typeName() { return ::scene::detail::schemaName<#type>(); }
#define SCENE_SCHEMA_NAME(name) \
  static base::name_id name() { return ::scene::detail::schemaName<#name>(); }
#define SCENE_SCHEMA_KEYWORD_NAME(name) \
  static base::name_id name##_() { return ::scene::detail::schemaName<#name>(); }

// The schema of every scene type and of the records nested in scene objects. A derived
// schema reaches the names of its bases: mesh_schema::visible() is geometry_schema's.

struct scene_schema {
  SCENE_SCHEMA_TYPE(scene)
  SCENE_SCHEMA_NAMES_SCENE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct light_schema {
  SCENE_SCHEMA_TYPE(light)
  SCENE_SCHEMA_NAMES_LIGHT(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct bufferAdapter_schema {
  SCENE_SCHEMA_TYPE(bufferAdapter)
  SCENE_SCHEMA_NAMES_BUFFER_ADAPTER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct buffer_schema {
  SCENE_SCHEMA_TYPE(buffer)
  SCENE_SCHEMA_NAMES_BUFFER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct texture_schema {
  SCENE_SCHEMA_TYPE(texture)
  SCENE_SCHEMA_NAMES_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct bitmapTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(bitmapTexture)
  SCENE_SCHEMA_NAMES_BITMAP_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct randomTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(randomTexture)
  SCENE_SCHEMA_NAMES_RANDOM_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct noiseTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(noiseTexture)
  SCENE_SCHEMA_NAMES_NOISE_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct vertColorTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(vertColorTexture)
  SCENE_SCHEMA_NAMES_VERT_COLOR_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct cellularTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(cellularTexture)
  SCENE_SCHEMA_NAMES_CELLULAR_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct checkerTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(checkerTexture)
  SCENE_SCHEMA_NAMES_CHECKER_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct embeddedTexture_schema : virtual bitmapTexture_schema {
  SCENE_SCHEMA_TYPE(embeddedTexture)
  SCENE_SCHEMA_NAMES_EMBEDDED_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct curvatureTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(curvatureTexture)
  SCENE_SCHEMA_NAMES_CURVATURE_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct fileTexture_schema : virtual bitmapTexture_schema {
  SCENE_SCHEMA_TYPE(fileTexture)
  SCENE_SCHEMA_NAMES_FILE_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct cubistTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(cubistTexture)
  SCENE_SCHEMA_NAMES_CUBIST_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct material_schema {
  SCENE_SCHEMA_TYPE(material)
  SCENE_SCHEMA_NAMES_MATERIAL(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct dotsTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(dotsTexture)
  SCENE_SCHEMA_NAMES_DOTS_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct mixTexture_schema : virtual texture_schema {
  SCENE_SCHEMA_TYPE(mixTexture)
  SCENE_SCHEMA_NAMES_MIX_TEXTURE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct principalMaterial_schema : virtual material_schema {
  SCENE_SCHEMA_TYPE(principalMaterial)
  SCENE_SCHEMA_NAMES_PRINCIPAL_MATERIAL(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct hairMaterial_schema : virtual material_schema {
  SCENE_SCHEMA_TYPE(hairMaterial)
  SCENE_SCHEMA_NAMES_HAIR_MATERIAL(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct toonMaterial_schema : virtual material_schema {
  SCENE_SCHEMA_TYPE(toonMaterial)
  SCENE_SCHEMA_NAMES_TOON_MATERIAL(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct lightGroup_schema {
  SCENE_SCHEMA_TYPE(lightGroup)
  SCENE_SCHEMA_NAMES_LIGHT_GROUP(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct node_schema {
  SCENE_SCHEMA_TYPE(node)
  SCENE_SCHEMA_NAMES_NODE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct keyframeChannel_schema {
  SCENE_SCHEMA_TYPE(keyframeChannel)
  SCENE_SCHEMA_NAMES_KEYFRAME_CHANNEL(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct animLayer_schema {
  SCENE_SCHEMA_TYPE(animLayer)
  SCENE_SCHEMA_NAMES_ANIM_LAYER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct keyframeChannelCurve_schema {
  SCENE_SCHEMA_TYPE(keyframeChannelCurve)
  SCENE_SCHEMA_NAMES_KEYFRAME_CHANNEL_CURVE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct geometry_schema {
  SCENE_SCHEMA_TYPE(geometry)
  SCENE_SCHEMA_NAMES_GEOMETRY(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct instancer_schema {
  SCENE_SCHEMA_TYPE(instancer)
  SCENE_SCHEMA_NAMES_INSTANCER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct animLayerAction_schema {
  SCENE_SCHEMA_TYPE(animLayerAction)
  SCENE_SCHEMA_NAMES_ANIM_LAYER_ACTION(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct animClip_schema {
  SCENE_SCHEMA_TYPE(animClip)
  SCENE_SCHEMA_NAMES_ANIM_CLIP(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct geometryLOD_schema {
  SCENE_SCHEMA_TYPE(geometryLOD)
  SCENE_SCHEMA_NAMES_GEOMETRY_L_O_D(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct lines_schema : virtual geometry_schema {
  SCENE_SCHEMA_TYPE(lines)
  SCENE_SCHEMA_NAMES_LINES(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct meshPrimitive_schema {
  SCENE_SCHEMA_TYPE(meshPrimitive)
  SCENE_SCHEMA_NAMES_MESH_PRIMITIVE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct points_schema : virtual geometry_schema {
  SCENE_SCHEMA_TYPE(points)
  SCENE_SCHEMA_NAMES_POINTS(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct hair_schema : virtual geometry_schema {
  SCENE_SCHEMA_TYPE(hair)
  SCENE_SCHEMA_NAMES_HAIR(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct fur_schema : virtual geometry_schema {
  SCENE_SCHEMA_TYPE(fur)
  SCENE_SCHEMA_NAMES_FUR(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct meshJointsSet_schema {
  SCENE_SCHEMA_TYPE(meshJointsSet)
  SCENE_SCHEMA_NAMES_MESH_JOINTS_SET(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct meshBindPoseSet_schema {
  SCENE_SCHEMA_TYPE(meshBindPoseSet)
  SCENE_SCHEMA_NAMES_MESH_BIND_POSE_SET(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct subdividable_schema : virtual geometry_schema {
  SCENE_SCHEMA_TYPE(subdividable)
  SCENE_SCHEMA_NAMES_SUBDIVIDABLE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct meshUVSet_schema {
  SCENE_SCHEMA_TYPE(meshUVSet)
  SCENE_SCHEMA_NAMES_MESH_U_V_SET(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct mesh_schema : virtual subdividable_schema {
  SCENE_SCHEMA_TYPE(mesh)
  SCENE_SCHEMA_NAMES_MESH(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct meshColorSet_schema {
  SCENE_SCHEMA_TYPE(meshColorSet)
  SCENE_SCHEMA_NAMES_MESH_COLOR_SET(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct skin_schema : virtual subdividable_schema {
  SCENE_SCHEMA_TYPE(skin)
  SCENE_SCHEMA_NAMES_SKIN(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct morph_schema : virtual subdividable_schema {
  SCENE_SCHEMA_TYPE(morph)
  SCENE_SCHEMA_NAMES_MORPH(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct environment_schema {
  SCENE_SCHEMA_TYPE(environment)
  SCENE_SCHEMA_NAMES_ENVIRONMENT(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct stereoCamera_schema {
  SCENE_SCHEMA_TYPE(stereoCamera)
  SCENE_SCHEMA_NAMES_STEREO_CAMERA(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct camera_schema {
  SCENE_SCHEMA_TYPE(camera)
  SCENE_SCHEMA_NAMES_CAMERA(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct morphTarget_schema {
  SCENE_SCHEMA_TYPE(morphTarget)
  SCENE_SCHEMA_NAMES_MORPH_TARGET(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct clipPlane_schema {
  SCENE_SCHEMA_TYPE(clipPlane)
  SCENE_SCHEMA_NAMES_CLIP_PLANE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct compositingChannel_schema {
  SCENE_SCHEMA_TYPE(compositingChannel)
  SCENE_SCHEMA_NAMES_COMPOSITING_CHANNEL(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct outputJob_schema {
  SCENE_SCHEMA_TYPE(outputJob)
  SCENE_SCHEMA_NAMES_OUTPUT_JOB(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct renderOutput_schema {
  SCENE_SCHEMA_TYPE(renderOutput)
  SCENE_SCHEMA_NAMES_RENDER_OUTPUT(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct sceneReference_schema {
  SCENE_SCHEMA_TYPE(sceneReference)
  SCENE_SCHEMA_NAMES_SCENE_REFERENCE(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct workflow_schema {
  SCENE_SCHEMA_TYPE(workflow)
  SCENE_SCHEMA_NAMES_WORKFLOW(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct metadata_schema {
  SCENE_SCHEMA_TYPE(metadata)
  SCENE_SCHEMA_NAMES_METADATA(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct scriptOutput_schema {
  SCENE_SCHEMA_TYPE(scriptOutput)
  SCENE_SCHEMA_NAMES_SCRIPT_OUTPUT(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct historyEvent_schema {
  SCENE_SCHEMA_TYPE(historyEvent)
  SCENE_SCHEMA_NAMES_HISTORY_EVENT(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct sceneImporter_schema {
  SCENE_SCHEMA_TYPE(sceneImporter)
  SCENE_SCHEMA_NAMES_SCENE_IMPORTER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct sceneExporter_schema {
  SCENE_SCHEMA_TYPE(sceneExporter)
  SCENE_SCHEMA_NAMES_SCENE_EXPORTER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct viewport_schema {
  SCENE_SCHEMA_TYPE(viewport)
  SCENE_SCHEMA_NAMES_VIEWPORT(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct popupWindow_schema {
  SCENE_SCHEMA_TYPE(popupWindow)
  SCENE_SCHEMA_NAMES_POPUP_WINDOW(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct viewportWindow_schema {
  SCENE_SCHEMA_TYPE(viewportWindow)
  SCENE_SCHEMA_NAMES_VIEWPORT_WINDOW(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

struct renderer_schema {
  SCENE_SCHEMA_TYPE(renderer)
  SCENE_SCHEMA_NAMES_RENDERER(SCENE_SCHEMA_NAME, SCENE_SCHEMA_KEYWORD_NAME)
};

#undef SCENE_SCHEMA_TYPE
#undef SCENE_SCHEMA_NAME
#undef SCENE_SCHEMA_KEYWORD_NAME

}  // namespace scene
