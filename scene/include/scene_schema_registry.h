#pragma once

#include "b_plugin_factory.h"

#include <span>
#include <string_view>

namespace scene {

/// What a schema describes.
enum class SchemaKind {
  sceneType,      ///< a registered scene type: objects of it can be made
  abstractType,   ///< a base of scene types, never made itself
  interfaceOnly,  ///< a scene interface without a registered type
  record,         ///< a record nested in scene objects
  parameters,     ///< an importer's or exporter's parameter set
  viewportType,   ///< a registered viewport type
};

/// One schema as tools see it: its type name, interface, base and names in declaration order.
struct SchemaInfo {
  const char* type;
  const char* interfaceName;  ///< empty for records and parameter sets
  const char* base;           ///< the schema it extends, or null
  std::span<const char* const> names;
  SchemaKind kind;
};

/// Every schema, in the schema table's order.
std::span<const SchemaInfo> schemas();
/// The schema of that type name, or null.
const SchemaInfo* findSchema(std::string_view type);

/// Interns every schema name, once per process, so that equal texts share one handle in
/// every module that carries this library.
void internSchemaNames();

/// Registers the 38 scene types in `factory` (descriptors made once per process and shared
/// by every factory).
void register_scene_schema(base::PluginFactory& factory);
/// Registers the viewport types `viewport`, `popupWindow` and `viewportWindow`.
void register_viewport_schema(base::PluginFactory& factory);

/// The help text of an importer or exporter parameter on the command line, where the
/// option is the parameter's name after a '-'.
struct ParameterHelp {
  const char* parameter;
  const char* help;
};
std::span<const ParameterHelp> parameterHelpTexts();

}  // namespace scene
