#include "import_digest.h"

#include "b_attrib_array.h"
#include "b_stream.h"
#include "b_vec.h"
#include "ply_parser.h"
#include "scene_index_delta.h"
#include "scene_mesh.h"
#include "scene_schema.h"
#include "scene_validation.h"

#include <fmt/format.h>
#include <fmt/ranges.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <sstream>

namespace testing_support {
namespace {

using ply::PropertySemantic;
using scene::mesh_schema;
using scene::meshColorSet_schema;
using scene::meshPrimitive_schema;
using scene::meshUVSet_schema;

constexpr std::uint32_t marker = 0xFFFFFFFFu;

// ---- Faces as compared.

struct Face {
  std::vector<std::uint32_t> corners;
  std::vector<std::string> uvs;  // one per corner, or none
  std::string colour;
  std::vector<std::string> kept;
};

// The face turned to its smallest rotation (corners with their coordinates), as text.
std::string textOf(const Face& face) {
  const std::size_t n = face.corners.size();
  // The least rotation, in linear time (two candidates compared as far as they agree), so
  // that a face of 65,535 equal corners costs no more than any other.
  const auto order = [&](std::size_t a, std::size_t b) {
    if (face.corners[a] != face.corners[b]) return face.corners[a] < face.corners[b] ? -1 : 1;
    if (face.uvs.empty() || face.uvs[a] == face.uvs[b]) return 0;
    return face.uvs[a] < face.uvs[b] ? -1 : 1;
  };
  std::size_t i = 0, j = 1, k = 0;
  while (i < n && j < n && k < n) {
    const int c = order((i + k) % n, (j + k) % n);
    if (c == 0) {
      ++k;
      continue;
    }
    (c > 0 ? i : j) += k + 1;
    if (i == j) ++j;
    k = 0;
  }
  const std::size_t best = std::min(i, j);
  std::string text = "face";
  // A face without corners has none to carry face-varying values: its colour is nowhere.
  if (n == 0) {
    for (const std::string& kept : face.kept) text += fmt::format(" | {}", kept);
    return text;
  }
  for (std::size_t r = 0; r < n; ++r) {
    const std::size_t at = (best + r) % n;
    text += fmt::format(" {}{}", face.corners[at], face.uvs.empty() ? std::string() : face.uvs[at]);
  }
  if (!face.colour.empty()) text += fmt::format(" | colour {}", face.colour);
  for (const std::string& kept : face.kept) text += fmt::format(" | {}", kept);
  return text;
}

std::string uvText(float u, float v) { return fmt::format("({} {})", u, v); }

// ---- What the reader delivers.

struct RawElement {
  const ply::Element* element;
  std::vector<std::vector<ply::ValueArray>> instances;  // per instance, per property
  std::vector<bool> dropped;
};

class RawRecorder {
 public:
  std::vector<RawElement> elements;

  bool plyElement(const ply::Element& element) {
    elements.push_back({&element, {}, {}});
    return true;
  }
  void beginInstance(std::uint32_t) {
    RawElement& raw = elements.back();
    raw.instances.emplace_back(raw.element->properties.size());
    raw.dropped.push_back(false);
  }
  void dropInstance(std::uint32_t) { elements.back().dropped.back() = true; }
  void plyProperty(const ply::Element& element, const ply::Property& property, const ply::ValueArray& values) {
    elements.back().instances.back()[static_cast<std::size_t>(&property - element.properties.data())] = values;
  }
};

// The semantic the importer reads a property as: other tools' texture coordinate names too.
PropertySemantic importedSemantic(const ply::Property& property) {
  if (property.semantic != PropertySemantic::unknown) return property.semantic;
  if (property.name == "texture_u" || property.name == "texture_s") return PropertySemantic::u;
  if (property.name == "texture_v" || property.name == "texture_t") return PropertySemantic::v;
  return PropertySemantic::unknown;
}

bool isKept(const ply::Property& property) {
  return importedSemantic(property) == PropertySemantic::unknown && !(property.isList && property.name == "texcoord");
}

double nativeNumber(const ply::Value& value, ply::DataType type) {
  switch (type) {
    case ply::DataType::int8:
    case ply::DataType::int16:
    case ply::DataType::int32:
      return value.i;
    case ply::DataType::float32:
      return value.f;
    case ply::DataType::float64:
      return value.d;
    default:
      return value.u;
  }
}

// A kept value as the importer stores it: in the property's own type.
std::string keptText(const ply::Property& property, const ply::ValueArray& values) {
  std::vector<std::string> numbers;
  for (const ply::Value& value : values) numbers.push_back(fmt::format("{}", nativeNumber(value, property.type)));
  if (property.isList) return fmt::format("{}=[{}]", std::string_view(property.word), fmt::join(numbers, " "));
  return fmt::format("{}={}", std::string_view(property.word), numbers.empty() ? std::string("0") : numbers[0]);
}

std::uint32_t indexOf(const ply::Value& value, ply::DataType type, std::optional<std::uint32_t> vertices) {
  const auto index = static_cast<std::uint32_t>(value.convertTo<std::int64_t>(type));
  return vertices && index != marker && index >= *vertices ? 0 : index;
}

class Expectation {
 public:
  ExpectedImport result;

  void add(const RawElement& raw) {
    switch (raw.element->semantic) {
      case ply::ElementSemantic::vertex:
        addVertices(raw);
        break;
      case ply::ElementSemantic::face:
      case ply::ElementSemantic::tristrips:
      case ply::ElementSemantic::edge:
        addPrimitive(raw);
        break;
      default:
        break;
    }
  }

 private:
  static bool has(const ply::Element& element, PropertySemantic semantic) {
    return std::any_of(element.properties.begin(), element.properties.end(),
                       [&](const ply::Property& p) { return importedSemantic(p) == semantic; });
  }

  void addVertices(const RawElement& raw) {
    const ply::Element& element = *raw.element;
    ImportDigest& digest = result.digest;
    if (has(element, PropertySemantic::x)) {
      if (m_vertices) digest.keptVertexProperties.clear();
      m_vertices = element.count;
      digest.positions.assign(element.count, "?");
      for (std::size_t i = 0; i < raw.instances.size(); ++i) {
        float xyz[3] = {0, 0, 0};
        for (std::size_t p = 0; p < element.properties.size(); ++p) {
          const auto semantic = static_cast<std::uint32_t>(element.properties[p].semantic);
          const ply::ValueArray& values = raw.instances[i][p];
          if (semantic <= 2 && !values.empty()) xyz[semantic] = values[0].convertTo<float>(element.properties[p].type);
        }
        digest.positions[i] = fmt::format("{} {} {}", xyz[0], xyz[1], xyz[2]);
      }
    }
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      const ply::Property& property = element.properties[p];
      if (!isKept(property)) continue;
      std::string text = std::string(property.word) + ":";
      for (std::size_t i = 0; i < raw.instances.size(); ++i) {
        // An instance that could not be read keeps its place: an empty list, or its value
        // as far as it was read.
        const ply::ValueArray& values = raw.instances[i][p];
        text +=
            fmt::format(" {}", raw.dropped[i] && property.isList ? keptText(property, {}) : keptText(property, values));
      }
      digest.keptVertexProperties.push_back(text);
    }
  }

  void addPrimitive(const RawElement& raw) {
    const ply::Element& element = *raw.element;
    if (!has(element, PropertySemantic::vertexIndex)) return;
    std::size_t indices = 0;
    forEachIndexList(raw, [&](std::size_t, const std::vector<std::uint32_t>& list) {
      indices += static_cast<std::size_t>(std::count_if(list.begin(), list.end(), [](auto i) { return i != marker; }));
    });
    if (indices == 0) return;  // nothing to draw, nothing an export writes
    std::vector<std::string> primitive;
    if (element.semantic == ply::ElementSemantic::tristrips) {
      primitive = strips(raw);
    } else {
      primitive = element.semantic == ply::ElementSemantic::edge ? edges(raw) : faces(raw);
      std::sort(primitive.begin(), primitive.end());
    }
    primitive.insert(primitive.begin(), element.semantic == ply::ElementSemantic::tristrips ? "strips" : "faces");
    result.digest.primitives.push_back(std::move(primitive));
  }

  // The indices of every index list of the instances read whole, list by list.
  template <class Each>
  void forEachIndexList(const RawElement& raw, Each each) {
    const ply::Element& element = *raw.element;
    for (std::size_t i = 0; i < raw.instances.size(); ++i) {
      if (raw.dropped[i]) continue;
      for (std::size_t p = 0; p < element.properties.size(); ++p) {
        const ply::Property& property = element.properties[p];
        if (property.semantic != PropertySemantic::vertexIndex) continue;
        std::vector<std::uint32_t> indices;
        for (const ply::Value& value : raw.instances[i][p])
          indices.push_back(indexOf(value, property.type, m_vertices));
        if (indices.size() > 65535 && element.semantic != ply::ElementSemantic::tristrips) result.fails = true;
        each(i, indices);
      }
    }
  }

  std::vector<std::string> strips(const RawElement& raw) {
    std::vector<std::string> strips;
    forEachIndexList(raw, [&](std::size_t, const std::vector<std::uint32_t>& indices) {
      std::vector<std::uint32_t> run;
      const auto close = [&] {
        strips.push_back(fmt::format("strip {}", fmt::join(run, " ")));
        result.digest.faceCount += run.size() > 2 ? static_cast<std::uint32_t>(run.size() - 2) : 0;
        run.clear();
      };
      for (const std::uint32_t index : indices) {
        if (index != marker) {
          run.push_back(index);
        } else if (!run.empty()) {
          close();
        }
      }
      close();
    });
    return strips;
  }

  std::vector<std::string> edges(const RawElement& raw) {
    std::vector<std::uint32_t> all;
    forEachIndexList(raw, [&](std::size_t, const std::vector<std::uint32_t>& indices) {
      all.insert(all.end(), indices.begin(), indices.end());
    });
    std::vector<std::string> edges;
    for (std::size_t k = 0; k < all.size(); k += 2) {
      edges.push_back(textOf(Face{{all.begin() + static_cast<std::ptrdiff_t>(k),
                                   all.begin() + static_cast<std::ptrdiff_t>(std::min(k + 2, all.size()))},
                                  {},
                                  {},
                                  {}}));
    }
    return edges;
  }

  std::vector<std::string> faces(const RawElement& raw) {
    const ply::Element& element = *raw.element;
    std::vector<Face> made;
    std::vector<std::size_t> instanceOf;
    forEachIndexList(raw, [&](std::size_t i, const std::vector<std::uint32_t>& indices) {
      made.push_back(Face{indices, {}, colourOf(element, raw.instances[i]), keptOf(element, raw.instances[i])});
      instanceOf.push_back(i);
      result.digest.faceCount += indices.size() >= 3;
    });
    spreadCoordinates(raw, made, instanceOf);
    std::vector<std::string> texts;
    for (const Face& face : made) texts.push_back(textOf(face));
    return texts;
  }

  // The colour set's entry: red, green, blue (and alpha when the element has one), a channel
  // that no property fills reading 0.
  static std::string colourOf(const ply::Element& element, const std::vector<ply::ValueArray>& instance) {
    if (!has(element, PropertySemantic::red)) return "";
    const bool alpha = has(element, PropertySemantic::alpha);
    float channels[4] = {0, 0, 0, 0};
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      const ply::Property& property = element.properties[p];
      const auto channel =
          static_cast<std::uint32_t>(property.semantic) - static_cast<std::uint32_t>(PropertySemantic::red);
      if (property.isList || channel > 3 || (channel == 3 && !alpha) || instance[p].empty()) continue;
      channels[channel] = ply::toFP(instance[p][0], property);
    }
    return alpha ? fmt::format("{} {} {} {}", channels[0], channels[1], channels[2], channels[3])
                 : fmt::format("{} {} {}", channels[0], channels[1], channels[2]);
  }

  static std::vector<std::string> keptOf(const ply::Element& element, const std::vector<ply::ValueArray>& instance) {
    std::vector<std::string> kept;
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      if (isKept(element.properties[p])) kept.push_back(keptText(element.properties[p], instance[p]));
    }
    return kept;
  }

  // An instance's texcoord list covers the corners of every face it gave, in order, two
  // values a corner; corners beyond its values read (0, 0).
  static void spreadCoordinates(const RawElement& raw, std::vector<Face>& faces,
                                const std::vector<std::size_t>& instanceOf) {
    const ply::Element& element = *raw.element;
    const auto texcoord = std::find_if(element.properties.begin(), element.properties.end(), [](const auto& p) {
      return p.isList && p.semantic == PropertySemantic::unknown && p.name == "texcoord";
    });
    if (texcoord == element.properties.end()) return;
    const auto p = static_cast<std::size_t>(texcoord - element.properties.begin());
    std::size_t corner = 0;
    for (std::size_t f = 0; f < faces.size(); ++f) {
      if (f == 0 || instanceOf[f] != instanceOf[f - 1]) corner = 0;
      const ply::ValueArray& items = raw.instances[instanceOf[f]][p];
      const std::size_t pairs = std::min<std::size_t>(items.size(), 65535) / 2;
      for (std::size_t k = 0; k < faces[f].corners.size(); ++k, ++corner) {
        faces[f].uvs.push_back(corner < pairs ? uvText(items[2 * corner].convertTo<float>(texcoord->type),
                                                       items[2 * corner + 1].convertTo<float>(texcoord->type))
                                              : uvText(0, 0));
      }
    }
  }

  std::optional<std::uint32_t> m_vertices;
};

// ---- What the importer made.

// The numbers of a kept list member, whatever its type.
std::vector<double> numbersOf(const base::Attribute& list) {
  const std::string_view type = base::text(list.type());
  const auto* data = static_cast<const std::byte*>(const_cast<base::Attribute&>(list).data(0));
  std::vector<double> numbers(list.size());
  const auto read = [&]<class T>(T) {
    for (std::size_t k = 0; k < numbers.size(); ++k) {
      T value;
      std::memcpy(&value, data + k * sizeof(T), sizeof(T));
      numbers[k] = static_cast<double>(value);
    }
  };
  if (type == "int8[]") read(std::int8_t{});
  if (type == "uint8[]") read(std::uint8_t{});
  if (type == "int16[]") read(std::int16_t{});
  if (type == "uint16[]") read(std::uint16_t{});
  if (type == "int32[]") read(std::int32_t{});
  if (type == "uint32[]") read(std::uint32_t{});
  if (type == "float[]") read(float{});
  if (type == "double[]") read(double{});
  return numbers;
}

// A kept property's values per instance as the records name them.
struct KeptColumn {
  std::string name;
  std::int32_t primitive;
  std::vector<std::string> values;
};

std::vector<KeptColumn> keptColumnsOf(const base::AttribMap& mesh) {
  std::vector<KeptColumn> columns;
  const base::AttribArray* records = scene::findArrayMember(mesh, base::intern("keptProperties"));
  for (std::uint32_t k = 0; records && k < records->size(); ++k) {
    const base::AttribMap& record = *scene::mapAt(*records, k);
    const std::string name(*scene::scalarMember<base::string>(record, base::intern("name")));
    const std::string attribute(*scene::scalarMember<base::string>(record, base::intern("attribute")));
    KeptColumn column{name, *scene::scalarMember<std::int32_t>(record, base::intern("primitive")), {}};
    if (const base::Attribute* scalars = mesh.findMember(base::intern(attribute))) {
      for (const double value : numbersOf(*scalars)) column.values.push_back(fmt::format("{}={}", name, value));
    } else {
      const std::vector<double> counts = numbersOf(*mesh.findMember(base::intern(attribute + ".counts")));
      const std::vector<double> items = numbersOf(*mesh.findMember(base::intern(attribute + ".items")));
      std::size_t at = 0;
      for (const double count : counts) {
        const auto n = static_cast<std::size_t>(count);
        column.values.push_back(fmt::format("{}=[{}]", name,
                                            fmt::join(items.begin() + static_cast<std::ptrdiff_t>(at),
                                                      items.begin() + static_cast<std::ptrdiff_t>(at + n), " ")));
        at += n;
      }
    }
    columns.push_back(std::move(column));
  }
  return columns;
}

// The face-varying set of `sets` whose channel names entries for the range.
const base::AttribMap* setCovering(const base::AttribMap& mesh, base::name_id sets, std::uint32_t start,
                                   std::uint32_t count) {
  const base::AttribArray* array = scene::findArrayMember(mesh, sets);
  for (std::uint32_t k = 0; array && k < array->size(); ++k) {
    const base::AttribMap* set = scene::mapAt(*array, k);
    const auto* channel = set ? scene::listMember<std::uint32_t>(*set, meshUVSet_schema::indices()) : nullptr;
    if (!channel || channel->size() < std::size_t(start) + count) continue;
    if (std::any_of(channel->begin() + start, channel->begin() + start + count, [](auto i) { return i != marker; })) {
      return set;
    }
  }
  return nullptr;
}

std::string colourEntry(const base::AttribMap& set, std::uint32_t entry) {
  if (const auto* rgb = scene::listMember<base::base_vec3<float>>(set, meshColorSet_schema::RGB())) {
    const auto& c = rgb->at(entry);
    return fmt::format("{} {} {}", c.x, c.y, c.z);
  }
  const auto& c = scene::listMember<base::base_vec4<float>>(set, meshColorSet_schema::RGBA())->at(entry);
  return fmt::format("{} {} {} {}", c.x, c.y, c.z, c.w);
}

std::vector<std::string> primitiveFaces(const base::AttribMap& mesh, const base::AttribMap& primitive,
                                        std::int32_t index, const base::vector<std::uint32_t>& indices,
                                        const std::vector<KeptColumn>& kept) {
  const std::uint32_t start =
      scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexStart()).value_or(0);
  const std::uint32_t count = scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexCount())
                                  .value_or(static_cast<std::uint32_t>(indices.size()));
  std::vector<std::string> texts;
  if (const auto* runs = scene::listMember<std::uint32_t>(primitive, meshPrimitive_schema::ecounts())) {
    texts.push_back("strips");
    std::uint32_t at = start;
    for (const std::uint32_t run : *runs) {
      texts.push_back(fmt::format("strip {}", fmt::join(indices.begin() + at, indices.begin() + at + run, " ")));
      at += run;
    }
    return texts;
  }
  const base::AttribMap* uvSet = setCovering(mesh, mesh_schema::uvSets(), start, count);
  const base::AttribMap* colourSet = setCovering(mesh, mesh_schema::colorSets(), start, count);
  const scene::FaceCounts counts = scene::faceCountsOf(primitive);
  std::vector<std::uint32_t> sizes;
  if (counts.perFace) sizes.assign(counts.perFace->begin(), counts.perFace->end());
  for (std::uint32_t at = 0; counts.uniform && *counts.uniform > 0 && at < count; at += *counts.uniform) {
    sizes.push_back(std::min<std::uint32_t>(*counts.uniform, count - at));
  }
  std::uint32_t at = start;
  for (std::size_t f = 0; f < sizes.size(); ++f) {
    Face face{{indices.begin() + at, indices.begin() + at + sizes[f]}, {}, {}, {}};
    for (std::uint32_t c = at; uvSet && c < at + sizes[f]; ++c) {
      const auto& uv = scene::listMember<base::base_vec2<float>>(*uvSet, meshUVSet_schema::UV())
                           ->at(scene::listMember<std::uint32_t>(*uvSet, meshUVSet_schema::indices())->at(c));
      face.uvs.push_back(uvText(uv.x, uv.y));
    }
    if (colourSet && sizes[f] > 0) {
      face.colour =
          colourEntry(*colourSet, scene::listMember<std::uint32_t>(*colourSet, meshUVSet_schema::indices())->at(at));
    }
    for (const KeptColumn& column : kept) {
      if (column.primitive == index) face.kept.push_back(column.values.at(f));
    }
    texts.push_back(textOf(face));
    at += sizes[f];
  }
  std::sort(texts.begin(), texts.end());
  texts.insert(texts.begin(), "faces");
  return texts;
}

}  // namespace

std::ostream& operator<<(std::ostream& out, const ImportDigest& digest) {
  out << "positions (" << digest.positions.size() << "):\n";
  for (const std::string& position : digest.positions) out << "  " << position << "\n";
  for (std::size_t p = 0; p < digest.primitives.size(); ++p) {
    out << "primitive " << p << ":\n";
    for (const std::string& line : digest.primitives[p]) out << "  " << line << "\n";
  }
  for (const std::string& kept : digest.keptVertexProperties) out << "kept " << kept << "\n";
  return out << "faces counted: " << digest.faceCount << "\n";
}

std::string firstDifference(const ImportDigest& expected, const ImportDigest& actual) {
  std::ostringstream a, b;
  a << expected;
  b << actual;
  std::istringstream linesA(a.str()), linesB(b.str());
  std::string lineA, lineB;
  for (int line = 1;; ++line) {
    const bool moreA = static_cast<bool>(std::getline(linesA, lineA));
    const bool moreB = static_cast<bool>(std::getline(linesB, lineB));
    if (!moreA && !moreB) return "";
    if (!moreA || !moreB || lineA != lineB) {
      return fmt::format("line {}: expected '{}', got '{}'", line, moreA ? lineA : "(end)", moreB ? lineB : "(end)");
    }
  }
}

ExpectedImport expectedImport(const std::string& bytes) {
  ply::Header header;
  RawRecorder raw;
  base::Stream stream = base::memStream(bytes.data(), static_cast<std::int64_t>(bytes.size()));
  const ply::ReadResult read = ply::readFile(header, stream, raw);
  Expectation expectation;
  if (read == ply::ReadResult::headerFailed) {
    expectation.result.fails = true;
    return expectation.result;
  }
  for (const RawElement& element : raw.elements) {
    expectation.add(element);
    expectation.result.incomplete |=
        std::find(element.dropped.begin(), element.dropped.end(), true) != element.dropped.end();
  }
  expectation.result.incomplete |= read == ply::ReadResult::bodyEndedEarly;
  return expectation.result;
}

ImportDigest digestOf(const base::AttribMap& mesh) {
  ImportDigest digest;
  if (const auto* positions = scene::listMember<base::base_vec3<float>>(mesh, mesh_schema::positions())) {
    for (const auto& p : *positions) digest.positions.push_back(fmt::format("{} {} {}", p.x, p.y, p.z));
  }
  const std::vector<KeptColumn> kept = keptColumnsOf(mesh);
  const base::vector<std::uint32_t> indices = scene::decodedIndices(mesh);
  const base::AttribArray* primitives = scene::findArrayMember(mesh, mesh_schema::primitives());
  for (std::uint32_t k = 0; primitives && k < primitives->size(); ++k) {
    const base::AttribMap& primitive = *scene::mapAt(*primitives, k);
    // The point set that a file without faces gets is no primitive of the file's; one
    // without indices holds nothing to draw, and an export leaves it out.
    if (!primitive.findMember(meshPrimitive_schema::indexStart()) ||
        scene::scalarMember<std::uint32_t>(primitive, meshPrimitive_schema::indexCount()).value_or(0) == 0) {
      continue;
    }
    digest.primitives.push_back(primitiveFaces(mesh, primitive, static_cast<std::int32_t>(k), indices, kept));
  }
  for (const KeptColumn& column : kept) {
    if (column.primitive != -1) continue;
    std::string text = fmt::format("{}:", column.name);
    for (const std::string& value : column.values) text += fmt::format(" {}", value);
    digest.keptVertexProperties.push_back(text);
  }
  digest.faceCount = scene::getFaceCount(mesh);
  return digest;
}

}  // namespace testing_support
