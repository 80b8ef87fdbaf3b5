#include "scene_validation.h"

#include "b_color.h"
#include "b_log.h"
#include "b_normal.h"
#include "b_vec.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"

#include <algorithm>
#include <cmath>
#include <optional>

namespace scene {
namespace {

using base::logError;
using base::logScene;
using base::logWarning;

std::string_view nameOf(const base::AttribMap& mesh) {
  const base::string* name = mesh.findAttribute<base::string>(mesh_schema::name());
  return name ? std::string_view(*name) : std::string_view();
}

// The components of a 2-, 3- or 4-float vector.
template <class V>
auto componentsOf(const V& v) {
  if constexpr (requires { v.w; }) {
    return std::array<float, 4>{v.x, v.y, v.z, v.w};
  } else if constexpr (requires { v.z; }) {
    return std::array<float, 3>{v.x, v.y, v.z};
  } else {
    return std::array<float, 2>{v.x, v.y};
  }
}

struct VectorCheck {
  const char* label;
  std::size_t expected;  // 0: any count
  bool zeroLength = false;
  bool unitLength = false;
};

// Logs every bad element; false only when the count differs from the expected one.
template <class V>
bool checkVectors(const base::vector<V>& vectors, std::string_view mesh, const VectorCheck& check) {
  for (const V& vector : vectors) {
    const auto c = componentsOf(vector);
    bool nan = false, infinite = false, zero = true;
    float squared = 0;
    for (const float value : c) {
      nan = nan || std::isnan(value);
      infinite = infinite || std::isinf(value);
      zero = zero && value == 0.0f;
      squared += value * value;
    }
    if (nan) {
      base::log().message(logScene, logError, "validate |{}| Nan detected in the {}!", mesh, check.label);
    } else if (infinite) {
      base::log().message(logScene, logError, "validate |{}| Inf detected in the {}!", mesh, check.label);
    } else if (check.zeroLength && zero) {
      base::log().message(logScene, logWarning, "validate |{}| Zero length detected in the {}!", mesh, check.label);
    } else if (check.unitLength && std::fabs(squared - 1.0f) > 1e-5f) {
      base::log().message(logScene, logWarning, "validate |{}| Unnormalized detected in the {}!", mesh, check.label);
    }
  }
  if (check.expected == 0 || vectors.size() == check.expected) return true;
  base::log().message(logScene, logError, "validate |{}| The {} and positions count doesn't match!", mesh, check.label);
  return false;
}

template <class V>
bool checkOptional(const base::AttribMap& map, base::name_id name, std::string_view mesh, const VectorCheck& check) {
  const base::vector<V>* vectors = map.findVecAttribute<V>(name);
  return !vectors || checkVectors(*vectors, mesh, check);
}

// A set with an index channel of its own (face-varying data) holds as many entries as its
// channel needs: the channel runs in step with the mesh's indices, and each of its values
// names an entry or is the set's invalid index.
bool checkSetChannel(const base::AttribMap& set, const base::vector<std::uint32_t>* channel, std::size_t entries,
                     std::size_t corners, std::string_view mesh, std::string_view label) {
  if (!channel) return true;
  if (channel->size() != corners) {
    base::log().message(logScene, logError, "validate |{}| The {} index channel and indices count doesn't match!", mesh,
                        label);
    return false;
  }
  const std::uint32_t invalid = valueOf<std::uint32_t>(set, meshUVSet_schema::invalidIndex()).value_or(0xFFFFFFFFu);
  const auto bad = std::find_if(channel->begin(), channel->end(),
                                [&](std::uint32_t value) { return value != invalid && value >= entries; });
  if (bad == channel->end()) return true;
  base::log().message(logScene, logError, "validate |{}| Found {} index out of range at position {}!", mesh, label,
                      bad - channel->begin());
  return false;
}

// The entries of a set: the longest of its layouts.
template <class One, class Three, class Four>
std::size_t entriesOf(const base::AttribMap& set, base::name_id one, base::name_id three, base::name_id four) {
  const auto sizeOf = [](const auto* list) -> std::size_t { return list ? list->size() : 0; };
  return std::max({sizeOf(set.findVecAttribute<One>(one)), sizeOf(set.findVecAttribute<Three>(three)),
                   sizeOf(set.findVecAttribute<Four>(four))});
}

// The vertex data: positions, normals, tangents, velocities, colour and UV sets. A set with
// an index channel of its own need not match the vertices.
bool checkVertexData(const base::AttribMap& mesh, std::string_view name, std::size_t vertices, std::size_t corners) {
  bool valid = true;
  using Vec2 = base::base_vec2<float>;
  using Vec3 = base::base_vec3<float>;
  using Vec4 = base::base_vec4<float>;
  valid &= checkOptional<base::normal>(mesh, mesh_schema::normals(), name, {"normals", vertices, true, true});
  valid &= checkOptional<Vec3>(mesh, mesh_schema::tangents(), name, {"tangents", vertices, true, true});
  valid &= checkOptional<Vec3>(mesh, mesh_schema::velocities(), name, {"velocities", vertices});
  const base::AttribArray* colours = findArrayMember(mesh, mesh_schema::colorSets());
  for (std::uint32_t i = 0; colours && i < colours->size(); ++i) {
    const base::AttribMap* set = mapAt(*colours, i);
    if (!set) continue;
    const auto* channel = set->findVecAttribute<std::uint32_t>(meshColorSet_schema::indices());
    const std::size_t expected = channel ? 0 : vertices;
    valid &= checkOptional<Vec3>(*set, meshColorSet_schema::RGB(), name, {"rgb colors", expected});
    valid &= checkOptional<Vec4>(*set, meshColorSet_schema::RGBA(), name, {"rgba colors", expected});
    valid &= checkSetChannel(*set, channel,
                             entriesOf<float, Vec3, Vec4>(*set, meshColorSet_schema::A(), meshColorSet_schema::RGB(),
                                                          meshColorSet_schema::RGBA()),
                             corners, name, "color");
  }
  const base::AttribArray* uvs = findArrayMember(mesh, mesh_schema::uvSets());
  for (std::uint32_t i = 0; uvs && i < uvs->size(); ++i) {
    const base::AttribMap* set = mapAt(*uvs, i);
    if (!set) continue;
    const auto* channel = set->findVecAttribute<std::uint32_t>(meshUVSet_schema::indices());
    const std::size_t expected = channel ? 0 : vertices;
    valid &= checkOptional<Vec2>(*set, meshUVSet_schema::UV(), name, {"uv coordinates", expected});
    valid &= checkOptional<Vec3>(*set, meshUVSet_schema::UVW(), name, {"uvw coordinates", expected});
    valid &= checkOptional<Vec4>(*set, meshUVSet_schema::UVWQ(), name, {"uvwq coordinates", expected});
    valid &= checkSetChannel(
        *set, channel,
        entriesOf<Vec2, Vec3, Vec4>(*set, meshUVSet_schema::UV(), meshUVSet_schema::UVW(), meshUVSet_schema::UVWQ()),
        corners, name, "uv");
  }
  return valid;
}

// A primitive's range in one index list: missing parts reported when there are several
// primitives, a range beyond the list reported. Gives the range, or none when it is unknown.
std::optional<std::pair<std::uint32_t, std::uint32_t>> checkRange(const base::AttribMap& primitive,
                                                                  base::name_id startName, base::name_id countName,
                                                                  std::size_t listSize, std::size_t primitives,
                                                                  std::string_view mesh, const char* missingStart,
                                                                  const char* missingCount) {
  const std::optional<std::uint32_t> start = valueOf<std::uint32_t>(primitive, startName);
  const std::optional<std::uint32_t> count = valueOf<std::uint32_t>(primitive, countName);
  if (!start && primitives >= 2) base::log().message(logScene, logError, "validate |{}| {}", mesh, missingStart);
  if (!count && primitives >= 2) base::log().message(logScene, logError, "validate |{}| {}", mesh, missingCount);
  if (!start || !count) return std::nullopt;
  if (std::uint64_t(*start) + *count > listSize) {
    base::log().message(logScene, logError, "validate |{}| Index offset/count out of bounds {}-{} out of {}!", mesh,
                        *start, *count, listSize);
    return std::nullopt;
  }
  return std::make_pair(*start, *count);
}

// The face vertex counts of a primitive against the indices of its range (the whole list
// when it names none); strips by their counts.
void checkFaceCounts(const base::AttribMap& primitive, std::optional<std::uint32_t> rangeCount,
                     const base::vector<std::uint32_t>* indices, std::string_view mesh) {
  const FaceCounts counts = faceCountsOf(primitive);
  const auto* ecounts = primitive.findVecAttribute<std::uint32_t>(meshPrimitive_schema::ecounts());
  if (!counts.present() && !ecounts) {
    base::log().message(logScene, logWarning, "validate |{}| Found primitive from unknown type!!", mesh);
    return;
  }
  if (!indices) return;
  const std::uint64_t covered = rangeCount ? *rangeCount : indices->size();
  if (counts.uniform) {
    // A count of 0 divides nothing: it is as wrong as any count that does not divide.
    if (*counts.uniform == 0 || covered % *counts.uniform != 0) {
      base::log().message(logScene, logError, "validate |{}| Invalid face vertex count {}!", mesh, *counts.uniform);
    }
    return;
  }
  std::uint64_t sum = 0;
  if (counts.perFace) {
    for (const std::uint16_t n : *counts.perFace) sum += n;
  } else {
    for (const std::uint32_t n : *ecounts) sum += n;
  }
  if (sum != covered) {
    base::log().message(logScene, logError, "validate |{}| Invalid face vertex counts. Expected {}, got {}!", mesh,
                        covered, sum);
  }
}

void checkIndexValues(const base::vector<std::uint32_t>& values, std::size_t limit, std::string_view mesh,
                      const char* format) {
  for (const std::uint32_t value : values) {
    if (value >= limit) base::log().message(logScene, logError, fmt::runtime(format), mesh, value);
  }
}

}  // namespace

bool validateMesh(const base::AttribMap& mesh) {
  const std::string_view name = nameOf(mesh);
  const auto* positions = mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::positions());
  if (!positions) {
    base::log().message(logScene, logError, "validate |{}| The vertex positions are missing!", name);
  } else {
    checkVectors(*positions, name, {"positions", 0});
  }
  // Without positions the other per-vertex lists have nothing to agree with.
  const std::size_t vertices = positions ? positions->size() : 0;
  // Range checks look at vertex indices, never at the differences of an encoded mesh.
  const bool hasIndices = mesh.findVecAttribute<std::uint32_t>(mesh_schema::indices()) != nullptr;
  const base::vector<std::uint32_t> plain = hasIndices ? decodedIndices(mesh) : base::vector<std::uint32_t>();
  const base::vector<std::uint32_t>* indices = hasIndices ? &plain : nullptr;
  bool valid = checkVertexData(mesh, name, vertices, plain.size());
  const auto* triIndices = mesh.findVecAttribute<std::uint32_t>(mesh_schema::triIndices());
  const auto* positionIndices = mesh.findVecAttribute<std::uint32_t>(mesh_schema::positionIndices());

  const base::AttribArray* primitives = findArrayMember(mesh, mesh_schema::primitives());
  bool indexed = false, perAttribute = false;
  if (!primitives) {
    base::log().message(logScene, logWarning, "validate |{}| Mesh doesn't contain any primitives!", name);
  }
  const std::size_t count = primitives ? primitives->size() : 0;
  for (std::uint32_t i = 0; i < count; ++i) {
    const base::AttribMap* primitive = mapAt(*primitives, i);
    if (!primitive) continue;
    const auto code = valueOf<std::uint8_t>(*primitive, meshPrimitive_schema::topology());
    const int topology = code ? *code : -1;
    std::optional<std::uint32_t> rangeCount;
    if (topology < 0 || topology == 1 || topology == 2 || topology == 4 || topology == 6) {
      indexed = true;
      const auto range =
          checkRange(*primitive, meshPrimitive_schema::indexStart(), meshPrimitive_schema::indexCount(),
                     indices ? indices->size() : 0, count, name, "Missing start index!", "Missing index count!");
      if (range && indices) rangeCount = range->second;
      if (triIndices) {
        checkRange(*primitive, meshPrimitive_schema::triIndexStart(), meshPrimitive_schema::triIndexCount(),
                   triIndices->size(), count, name, "Missing triangle start index!", "Missing triangle index count!");
      }
      perAttribute = perAttribute || topology == 2;
    }
    checkFaceCounts(*primitive, rangeCount, indices, name);
  }

  if (indexed) {
    if (!indices || indices->empty()) {
      base::log().message(logScene, logWarning, "validate |{}| Missing indices!", name);
    }
    if (indices && triIndices && indices->size() != triIndices->size()) {
      base::log().message(logScene, logWarning, "validate |{}| Triangulated indices mismatch!", name);
    }
    if (!perAttribute && positions && indices) {
      checkIndexValues(*indices, vertices, name, "validate |{}| Found face index out of range at position {}!");
    }
  }
  if (perAttribute) {
    if (!positionIndices || positionIndices->empty()) {
      base::log().message(logScene, logWarning, "validate |{}| Missing position indices!", name);
    } else {
      checkIndexValues(*positionIndices, vertices, name,
                       "validate |{}| Found position index out of range at position {}!");
    }
    const auto* normals = mesh.findVecAttribute<base::normal>(mesh_schema::normals());
    if (const auto* normalIndices = mesh.findVecAttribute<std::uint32_t>(mesh_schema::normalIndices());
        normalIndices && normals) {
      checkIndexValues(*normalIndices, normals->size(), name,
                       "validate |{}| Found normal index out of range at position {}!");
    }
    const auto* tangents = mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::tangents());
    if (const auto* tangentIndices = mesh.findVecAttribute<std::uint32_t>(mesh_schema::tangentIndices());
        tangentIndices && tangents) {
      checkIndexValues(*tangentIndices, tangents->size(), name,
                       "validate |{}| Found tangent index out of range at position {}!");
    }
  }
  return valid;
}

}  // namespace scene
