#pragma once

#include "b_plugin.h"
#include "scene_schema.h"

#include <cstdint>

namespace scene {

/// The plug-in object that every scene interface is; named so that interfaces inherit its
/// constructor as `IPlugin::IPlugin`.
using IPlugin = base::IPlugin;

/// Secondary interface of objects that have bounds; queried as "IBounded".
class IBounded : public base::IPluginInterface {
 public:
  base::name_id interfaceName() const override;
};

/// Secondary interface of objects in the node hierarchy; queried as "IHierarchical".
class IHierarchical : public base::IPluginInterface {
 public:
  base::name_id interfaceName() const override;
};

// Every scene object is a plug-in object (an attribute map) that names its attributes
// through its schema. The interfaces add no data of their own.

#define SCENE_INTERFACE(Interface, Base, schema)                  \
  class Interface : public Base, public virtual schema##_schema { \
   public:                                                        \
    using Base::Base;                                             \
  };

SCENE_INTERFACE(IScene, IPlugin, scene)

class INode : public IPlugin, public IBounded, public IHierarchical, public virtual node_schema {
 public:
  INode(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index);
};

class IGeometry : public IPlugin, public IBounded, public virtual geometry_schema {
 public:
  IGeometry(base::PluginFactory* factory, base::IPluginDesc* descriptor, std::uint32_t index);
};

SCENE_INTERFACE(ISubdividable, IGeometry, subdividable)
SCENE_INTERFACE(IMesh, ISubdividable, mesh)
SCENE_INTERFACE(ISkin, ISubdividable, skin)
SCENE_INTERFACE(IMorph, ISubdividable, morph)
SCENE_INTERFACE(ILines, IGeometry, lines)
SCENE_INTERFACE(IPoints, IGeometry, points)
SCENE_INTERFACE(IHair, IGeometry, hair)
SCENE_INTERFACE(IFur, IGeometry, fur)

/// A material. It may inherit every attribute it lacks from another material.
class IMaterial : public IPlugin, public virtual material_schema {
 public:
  using IPlugin::IPlugin;

  /// Makes `base` the material this one inherits from (null: none) and stores it in the
  /// `inherit` attribute. Refused, with the warning "The object can't inherit itself!", when
  /// `base` is this material or inherits from it; false then.
  bool inheritFrom(IMaterial* base);
};

SCENE_INTERFACE(IPrincipalMaterial, IMaterial, principalMaterial)
SCENE_INTERFACE(IHairMaterial, IMaterial, hairMaterial)
SCENE_INTERFACE(IToonMaterial, IMaterial, toonMaterial)

SCENE_INTERFACE(ITexture, IPlugin, texture)
SCENE_INTERFACE(IBitmapTexture, ITexture, bitmapTexture)
SCENE_INTERFACE(IFileTexture, IBitmapTexture, fileTexture)
SCENE_INTERFACE(IEmbeddedTexture, IBitmapTexture, embeddedTexture)
SCENE_INTERFACE(IRandomTexture, ITexture, randomTexture)
SCENE_INTERFACE(INoiseTexture, ITexture, noiseTexture)
SCENE_INTERFACE(IVertColorTexture, ITexture, vertColorTexture)
SCENE_INTERFACE(ICellularTexture, ITexture, cellularTexture)
SCENE_INTERFACE(ICheckerTexture, ITexture, checkerTexture)
SCENE_INTERFACE(ICurvatureTexture, ITexture, curvatureTexture)
SCENE_INTERFACE(ICubistTexture, ITexture, cubistTexture)
SCENE_INTERFACE(IDotsTexture, ITexture, dotsTexture)
SCENE_INTERFACE(IMixTexture, ITexture, mixTexture)

SCENE_INTERFACE(IAnimLayer, IPlugin, animLayer)
SCENE_INTERFACE(IBufferAdapter, IPlugin, bufferAdapter)
SCENE_INTERFACE(IRenderer, IPlugin, renderer)
SCENE_INTERFACE(ILight, IPlugin, light)
SCENE_INTERFACE(ILightGroup, IPlugin, lightGroup)
SCENE_INTERFACE(ICamera, IPlugin, camera)
SCENE_INTERFACE(IEnvironment, IPlugin, environment)
SCENE_INTERFACE(IClipPlane, IPlugin, clipPlane)
SCENE_INTERFACE(IBuffer, IPlugin, buffer)
SCENE_INTERFACE(IInstancer, IPlugin, instancer)
SCENE_INTERFACE(IKeyframeChannel, IPlugin, keyframeChannel)
SCENE_INTERFACE(IAnimClip, IPlugin, animClip)
SCENE_INTERFACE(IRenderOutput, IPlugin, renderOutput)
SCENE_INTERFACE(ISceneReference, IPlugin, sceneReference)
SCENE_INTERFACE(IMetadata, IPlugin, metadata)

#undef SCENE_INTERFACE

}  // namespace scene
