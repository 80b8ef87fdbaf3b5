#pragma once

// Which element each kept property came from. The importer keeps properties that no
// semantic claims as mesh lists ("ply:NAME", see ply_custom_properties.cpp); the mesh's
// `keptProperties` array says, for each, the name and element it had in the file, so that
// an export puts it back on that element under that name, whatever the lists' lengths.

#include "b_attribute_map.h"
#include "b_containers.h"

#include <cstdint>

namespace ply {

/// One kept property, as the `keptProperties` array of a mesh holds it (a map each).
struct KeptProperty {
  static constexpr std::int32_t vertexElement = -1;

  base::string name;     ///< `name`: the property's name as written in the file
  base::string element;  ///< `element`: its element's name as written
  /// `primitive`: the index in `primitives` of the primitive its element's faces became, or
  /// vertexElement for a property of the vertices.
  std::int32_t primitive = vertexElement;
  /// `attribute`: the mesh member holding the values (a list's lengths and items are that
  /// name with ".counts" and ".items").
  base::string attribute;
};

/// The name of the mesh member that lists the kept properties.
base::name_id keptPropertiesName();

/// Appends `kept` to the mesh's list.
void addKeptProperty(base::AttribMap& mesh, const KeptProperty& kept);

/// The mesh's kept properties in file order; none for a mesh stored before the list existed
/// (its kept lists are then placed by their names and lengths). Entries that are no maps, or
/// that lack a member, are passed over.
base::vector<KeptProperty> keptPropertiesOf(const base::AttribMap& mesh);

/// Removes the kept properties of the vertices, with their lists.
void removeKeptVertexProperties(base::AttribMap& mesh);

}  // namespace ply
