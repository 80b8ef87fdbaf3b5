#include "b_log.h"
#include "b_vec.h"
#include "scene_mesh.h"
#include "scene_schema.h"
#include "scene_validation.h"

#include <optional>

namespace scene {
namespace {

constexpr std::uint32_t restartMarker = 0xFFFFFFFFu;
constexpr std::uint8_t lineStripTopology = 6;

std::string_view meshName(const base::AttribMap& mesh) {
  const base::string* name = mesh.findAttribute<base::string>(mesh_schema::name());
  return name ? std::string_view(*name) : std::string_view();
}

std::uint32_t stripElements(std::uint32_t length, bool lines) {
  const std::uint32_t corners = lines ? 1 : 2;
  return length > corners ? length - corners : 0;
}

// Strips: by their `ecounts`, or split at restart markers in the primitive's index range.
std::uint32_t countStrips(const base::AttribMap& primitive, std::optional<std::uint8_t> topology,
                          const base::vector<std::uint32_t>* source) {
  const bool lines = topology == lineStripTopology;
  std::uint32_t total = 0;
  if (const auto* ecounts = primitive.findVecAttribute<std::uint32_t>(meshPrimitive_schema::ecounts())) {
    for (const std::uint32_t length : *ecounts) total += stripElements(length, lines);
    return total;
  }
  if (!source || (topology != 4 && topology != lineStripTopology)) return 0;
  const std::uint32_t size = static_cast<std::uint32_t>(source->size());
  const std::uint32_t start =
      std::min(valueOf<std::uint32_t>(primitive, meshPrimitive_schema::indexStart()).value_or(0), size);
  const std::uint32_t count =
      std::min(valueOf<std::uint32_t>(primitive, meshPrimitive_schema::indexCount()).value_or(size), size - start);
  std::uint32_t run = 0;
  for (std::uint32_t i = start; i < start + count; ++i) {
    if ((*source)[i] == restartMarker) {
      total += stripElements(std::exchange(run, 0u), lines);
    } else {
      ++run;
    }
  }
  return total + stripElements(run, lines);  // a last strip needs no closing marker
}

// The number of indices a primitive covers when it gives none itself.
std::uint32_t coveredIndices(const base::AttribMap& mesh, std::optional<std::uint32_t> own,
                             std::optional<std::uint8_t> topology, const base::vector<std::uint32_t>* source) {
  if (own) return *own;
  if (topology == 0) {
    const auto* positions = mesh.findVecAttribute<base::base_vec3<float>>(mesh_schema::positions());
    return positions ? static_cast<std::uint32_t>(positions->size()) : 0;
  }
  if (source) return static_cast<std::uint32_t>(source->size());
  base::log().message(base::logScene, base::logDebug, "mesh |{}| Primitive with no assigned indices detected!",
                      meshName(mesh));
  return 0;
}

}  // namespace

std::uint32_t countFaces(const base::AttribMap& mesh, std::uint32_t flags) {
  const bool triangles = flags & countTriangles;
  const base::vector<std::uint32_t>* triIndices = triangles && !(flags & ignoreTriIndices)
                                                      ? mesh.findVecAttribute<std::uint32_t>(mesh_schema::triIndices())
                                                      : nullptr;
  const bool triangleMode = triIndices != nullptr;
  const base::vector<std::uint32_t>* source = triIndices;
  if (!source) source = mesh.findVecAttribute<std::uint32_t>(mesh_schema::indices());
  if (!source) source = mesh.findVecAttribute<std::uint32_t>(mesh_schema::positionIndices());

  const base::AttribArray* primitives = findArrayMember(mesh, mesh_schema::primitives());
  std::uint32_t total = 0;
  for (std::uint32_t i = 0; primitives && i < primitives->size(); ++i) {
    const base::AttribMap* primitive = mapAt(*primitives, i);
    if (!primitive) {
      base::log().message(base::logScene, base::logDebug, "mesh |{}| Invalid primitive detected!", meshName(mesh));
      continue;
    }
    const auto topology = valueOf<std::uint8_t>(*primitive, meshPrimitive_schema::topology());
    const FaceCounts counts = faceCountsOf(*primitive);
    if (counts.uniform && *counts.uniform < 3) continue;
    if ((topology && *topology > 2) || (!topology && !counts.present())) {
      total += countStrips(*primitive, topology, source);
    } else if (triangleMode) {
      const auto own = valueOf<std::uint32_t>(*primitive, meshPrimitive_schema::triIndexCount());
      total += coveredIndices(mesh, own, topology, source) / 3;
    } else if (counts.perFace) {
      for (const std::uint16_t n : *counts.perFace) {
        if (n >= 3) total += triangles ? n - 2u : 1u;
      }
    } else if (counts.uniform) {
      const std::uint32_t v = *counts.uniform;
      const auto own = valueOf<std::uint32_t>(*primitive, meshPrimitive_schema::indexCount());
      const std::uint32_t n = coveredIndices(mesh, own, topology, source);
      total += triangles ? (n / v) * (v - 2) : n / v;
    }
  }
  return total;
}

std::uint32_t getFaceCount(const base::AttribMap& mesh) { return countFaces(mesh, 0); }

std::uint32_t getTriangleCount(const base::AttribMap& mesh, std::uint32_t flags) {
  return countFaces(mesh, flags | countTriangles);
}

}  // namespace scene
