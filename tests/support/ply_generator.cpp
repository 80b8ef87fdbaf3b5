#include "ply_generator.h"

#include "test_random.h"

#include <fmt/format.h>

#include <algorithm>
#include <cctype>
#include <functional>
#include <numeric>

namespace testing_support {
namespace {

using ply::DataType;

const std::vector<DataType> allTypes = {DataType::int8,  DataType::uint8,  DataType::int16,   DataType::uint16,
                                        DataType::int32, DataType::uint32, DataType::float32, DataType::float64};

// Names that no semantic claims: plain, in UTF-8, in Latin-1 (not UTF-8), with bytes that
// no word may hold.
const std::vector<std::string> keptNames = {
    "quality",    "confidence", "intensity", "label", "scalar_i", "\xC3\xA9t\xC3\xA9", "\xE6\xB8\xA9\xE5\xBA\xA6",
    "qualit\xE9", "a,b",        "#tag"};
const std::vector<std::string> unknownElementNames = {"camera", "range_grid",
                                                      "donn\xC3\xA9"
                                                      "es",
                                                      "blob", "meta"};

// 10 to the power of -3 to 6, written out: the math library's pow may round differently on
// another platform, and a seed must give the same bytes everywhere.
double scaleOf(Random& random, std::int64_t highest) {
  static constexpr double scales[] = {1e-3, 1e-2, 1e-1, 1e0, 1e1, 1e2, 1e3, 1e4, 1e5, 1e6};
  return scales[random.between(0, highest + 3)];
}

// A value of `type`, exact in it: a real of a few digits, or any integer of the type.
double randomValue(Random& random, DataType type) {
  switch (type) {
    case DataType::float32:
      if (random.chance(5)) return -0.0;
      return static_cast<float>((random.unit() - 0.5) * scaleOf(random, 4));
    case DataType::float64:
      return (random.unit() - 0.5) * scaleOf(random, 6);
    default:
      return static_cast<double>(
          random.between(static_cast<std::int64_t>(lowestOf(type)), static_cast<std::int64_t>(highestOf(type))));
  }
}

// A colour channel: 0 to 1 for the real types, any value for integers.
double randomChannel(Random& random, DataType type) {
  if (type == DataType::float32) return static_cast<float>(random.unit());
  if (type == DataType::float64) return random.unit();
  return randomValue(random, type);
}

DataType anyType(Random& random) { return random.pick(allTypes); }

// A type that holds every integer in [low, high].
DataType typeHolding(Random& random, double low, double high) {
  std::vector<DataType> types;
  for (const DataType type : allTypes) {
    if (lowestOf(type) <= low && highestOf(type) >= high) types.push_back(type);
  }
  return random.pick(types);
}

ModelProperty scalar(std::string name, DataType type) { return {std::move(name), type, false, DataType::uint8}; }

ModelProperty list(std::string name, DataType type, DataType countType) {
  return {std::move(name), type, true, countType};
}

// Per-instance values that some properties of an element take; the others are filled by
// the element's own rule.
using Filler = std::function<std::vector<double>(Random&, std::size_t instance)>;

struct PropertyPlan {
  ModelProperty property;
  Filler fill;
};

// Kept properties: scalars of any type, a list of any lengths (0 to 5).
void addKeptProperties(Random& random, std::vector<PropertyPlan>& plans) {
  for (std::int64_t k = random.between(0, 2); k > 0; --k) {
    const DataType type = anyType(random);
    plans.push_back({scalar(random.pick(keptNames), type),
                     [type](Random& r, std::size_t) { return std::vector<double>{randomValue(r, type)}; }});
  }
  if (random.chance(25)) {
    const DataType type = anyType(random);
    plans.push_back({list(random.pick(keptNames), type, anyType(random)), [type](Random& r, std::size_t) {
                       std::vector<double> items(static_cast<std::size_t>(r.between(0, 5)));
                       for (double& item : items) item = randomValue(r, type);
                       return items;
                     }});
  }
}

// Three channels of one type (named with `prefix`), and an alpha of its own type at times.
void addColours(Random& random, std::vector<PropertyPlan>& plans, const std::string& prefix = "") {
  const DataType type = random.chance(50) ? DataType::uint8 : anyType(random);
  std::vector<std::string> channels = {prefix + "red", prefix + "green", prefix + "blue"};
  if (random.chance(40)) channels.push_back(prefix + "alpha");
  for (const std::string& channel : channels) {
    const DataType own = channel.ends_with("alpha") && random.chance(30) ? anyType(random) : type;
    plans.push_back(
        {scalar(channel, own), [own](Random& r, std::size_t) { return std::vector<double>{randomChannel(r, own)}; }});
  }
}

ModelElement elementOf(std::string name, std::size_t count, std::vector<PropertyPlan> plans, Random& random) {
  random.shuffle(plans.begin(), plans.end());
  ModelElement element{std::move(name), {}, {}};
  for (const PropertyPlan& plan : plans) element.properties.push_back(plan.property);
  element.values.resize(count);
  for (std::size_t i = 0; i < count; ++i) {
    for (const PropertyPlan& plan : plans) element.values[i].push_back(plan.fill(random, i));
  }
  return element;
}

// A vertex element; one that is not the first may leave out positions and add its lists to
// the first one's. One UV pair, one colour group and one single channel at most, so that two
// such elements stay within what an export can write.
ModelElement vertexElement(Random& random, std::size_t vertices, bool first) {
  std::vector<PropertyPlan> plans;
  const auto real = [&] { return random.chance(70) ? DataType::float32 : anyType(random); };
  const auto add = [&](const std::string& name, DataType type) {
    plans.push_back(
        {scalar(name, type), [type](Random& r, std::size_t) { return std::vector<double>{randomValue(r, type)}; }});
  };
  if (first || random.chance(70)) {
    for (const char* name : {"x", "y", "z"}) add(name, real());
  }
  if (random.chance(30)) {
    for (const char* name : {"nx", "ny", "nz"}) add(name, real());
  }
  if (random.chance(25)) {
    const auto [u, v] = random.pick(std::vector<std::pair<std::string, std::string>>{
        {"u", "v"}, {"s", "t"}, {"tx", "ty"}, {"texture_u", "texture_v"}, {"texture_s", "texture_t"}});
    add(u, real());
    add(v, real());
  }
  if (random.chance(30)) {
    addColours(random, plans, random.pick(std::vector<std::string>{"", "", "ambient_", "diffuse_", "specular_"}));
  }
  if (random.chance(10)) add(random.chance(50) ? "opacity" : "specular_power", real());
  addKeptProperties(random, plans);
  return elementOf("vertex", vertices, std::move(plans), random);
}

// A face's corners: three to eight vertices (now and then none to two), distinct but now
// and then.
std::vector<double> randomFace(Random& random, std::size_t vertices) {
  const std::size_t n = random.chance(2)    ? static_cast<std::size_t>(random.between(0, 2))
                        : random.chance(60) ? 3
                        : random.chance(50) ? 4
                                            : static_cast<std::size_t>(random.between(5, 8));
  std::vector<double> corners;
  while (corners.size() < n) {
    const double corner = static_cast<double>(random.below(vertices));
    if (std::find(corners.begin(), corners.end(), corner) == corners.end() || random.chance(3)) {
      corners.push_back(corner);
    }
  }
  return corners;
}

// The face turned so that its smallest rotation comes first: the key faces sort by.
std::vector<double> rotatedKey(std::vector<double> corners) {
  std::vector<double> best = corners;
  for (std::size_t k = 1; k < corners.size(); ++k) {
    std::rotate(corners.begin(), corners.begin() + 1, corners.end());
    best = std::min(best, corners);
  }
  return best;
}

void orderInstances(Random& random, ModelElement& element, std::size_t indexProperty, FaceOrder order) {
  auto& instances = element.values;
  if (order == FaceOrder::random) {
    random.shuffle(instances.begin(), instances.end());
    return;
  }
  std::stable_sort(instances.begin(), instances.end(), [&](const auto& a, const auto& b) {
    return rotatedKey(a[indexProperty]) < rotatedKey(b[indexProperty]);
  });
  if (order == FaceOrder::reversed) std::reverse(instances.begin(), instances.end());
  if (order == FaceOrder::blockShuffled && instances.size() > 1) {
    const std::size_t size =
        std::max<std::size_t>(1, instances.size() / static_cast<std::size_t>(random.between(2, 8)));
    std::vector<std::vector<std::vector<std::vector<double>>>> blocks;
    for (std::size_t at = 0; at < instances.size(); at += size) {
      blocks.emplace_back(instances.begin() + static_cast<std::ptrdiff_t>(at),
                          instances.begin() + static_cast<std::ptrdiff_t>(std::min(at + size, instances.size())));
    }
    random.shuffle(blocks.begin(), blocks.end());
    instances.clear();
    for (auto& block : blocks) instances.insert(instances.end(), block.begin(), block.end());
  }
}

ModelElement faceElement(Random& random, std::size_t vertices) {
  const std::size_t count = random.chance(20)
                                ? vertices
                                : static_cast<std::size_t>(random.between(
                                      1, std::min<std::int64_t>(vertices > 1000 ? 20000 : 400, 2 * vertices)));
  const double top = static_cast<double>(vertices - 1);
  std::vector<PropertyPlan> plans;
  // One index list, or two: each gives a face of the instance.
  const std::size_t lists = random.chance(10) ? 2 : 1;
  for (std::size_t k = 0; k < lists; ++k) {
    plans.push_back(
        {list(k == 0 ? "vertex_indices" : "vertex_index", typeHolding(random, 0, top), typeHolding(random, 0, 8)),
         [vertices](Random& r, std::size_t) { return randomFace(r, vertices); }});
  }
  if (random.chance(35)) addColours(random, plans);
  // Properties that a face element has no place for.
  if (random.chance(10)) {
    plans.push_back({scalar("material_index", DataType::int32),
                     [](Random& r, std::size_t) { return std::vector<double>{static_cast<double>(r.below(4))}; }});
  }
  if (random.chance(5)) {
    for (const char* name : {"nx", "ny", "nz"}) {
      plans.push_back({scalar(name, DataType::float32),
                       [](Random& r, std::size_t) { return std::vector<double>{randomValue(r, DataType::float32)}; }});
    }
  }
  if (random.chance(30)) {
    // Filled once the corners are known: two values per corner, or now and then any number.
    const DataType type = random.chance(80) ? DataType::float32 : anyType(random);
    plans.push_back({list("texcoord", type, typeHolding(random, 0, 40)),
                     [](Random&, std::size_t) { return std::vector<double>{}; }});
  }
  addKeptProperties(random, plans);
  ModelElement element = elementOf("face", count, std::move(plans), random);
  for (std::size_t p = 0; p < element.properties.size(); ++p) {
    if (element.properties[p].name != "texcoord") continue;
    for (auto& instance : element.values) {
      std::size_t corners = 0;
      for (std::size_t q = 0; q < element.properties.size(); ++q) {
        if (element.properties[q].name.starts_with("vertex_ind")) corners += instance[q].size();
      }
      const std::size_t items =
          random.chance(90) ? 2 * corners : static_cast<std::size_t>(random.between(0, 2 * corners + 3));
      instance[p].resize(items);
      for (double& item : instance[p]) item = randomValue(random, element.properties[p].type);
    }
  }
  const auto indices = std::find_if(element.properties.begin(), element.properties.end(),
                                    [](const ModelProperty& property) { return property.name == "vertex_indices"; });
  orderInstances(random, element, static_cast<std::size_t>(indices - element.properties.begin()),
                 static_cast<FaceOrder>(random.below(4)));
  return element;
}

// Strips of one to eight indices, split by restart markers (-1, or its 32-bit pattern in an
// unsigned list), with a marker at the start, the end or twice in a row now and then.
ModelElement stripElement(Random& random, std::size_t vertices) {
  std::vector<DataType> types;
  for (const DataType type : allTypes) {
    if (highestOf(type) >= static_cast<double>(vertices - 1) && (lowestOf(type) < 0 || type == DataType::uint32)) {
      types.push_back(type);
    }
  }
  const DataType type = random.pick(types);
  const double marker = type == DataType::uint32 ? 4294967295.0 : -1.0;
  std::vector<PropertyPlan> plans;
  plans.push_back({list("vertex_indices", type, typeHolding(random, 0, 40)), [=](Random& r, std::size_t) {
                     std::vector<double> items;
                     if (r.chance(10)) items.push_back(marker);
                     for (std::int64_t run = r.between(1, 3); run > 0; --run) {
                       for (std::int64_t k = r.between(1, 8); k > 0; --k) {
                         items.push_back(static_cast<double>(r.below(vertices)));
                       }
                       if (run > 1 || r.chance(10)) items.push_back(marker);
                       if (r.chance(5)) items.push_back(marker);
                     }
                     return items;
                   }});
  return elementOf("tristrips", static_cast<std::size_t>(random.between(1, 5)), std::move(plans), random);
}

// Materials of any kind of values, a few of them equal.
ModelElement materialElement(Random& random) {
  std::vector<PropertyPlan> plans;
  for (const char* group : {"ambient_", "diffuse_", "specular_"}) {
    if (random.chance(50)) addColours(random, plans, group);
  }
  for (const char* name : {"specular_power", "opacity"}) {
    if (!random.chance(40)) continue;
    const DataType type = random.chance(70) ? DataType::float32 : anyType(random);
    plans.push_back({scalar(name, type), [type](Random& r, std::size_t) {
                       return std::vector<double>{r.chance(30) ? 1.0 : randomChannel(r, type)};
                     }});
  }
  ModelElement element =
      elementOf("material", static_cast<std::size_t>(random.between(0, 6)), std::move(plans), random);
  for (std::size_t i = 1; i < element.values.size(); ++i) {
    if (random.chance(30)) element.values[i] = element.values[i - 1];
  }
  return element;
}

ModelElement edgeElement(Random& random, std::size_t vertices) {
  std::vector<PropertyPlan> plans;
  plans.push_back(
      {list("vertex_indices", typeHolding(random, 0, static_cast<double>(vertices - 1)), typeHolding(random, 0, 2)),
       [vertices](Random& r, std::size_t) {
         return std::vector<double>{static_cast<double>(r.below(vertices)), static_cast<double>(r.below(vertices))};
       }});
  if (random.chance(20)) {
    plans.push_back({scalar("crease", DataType::float32),
                     [](Random& r, std::size_t) { return std::vector<double>{randomValue(r, DataType::float32)}; }});
  }
  return elementOf("edge", static_cast<std::size_t>(random.between(1, static_cast<std::int64_t>(vertices))),
                   std::move(plans), random);
}

// An element the importer passes over: any properties, a vertex_indices list at times, none
// at all at others.
ModelElement unknownElement(Random& random, std::size_t vertices) {
  std::vector<PropertyPlan> plans;
  if (!random.chance(20)) {
    for (std::int64_t k = random.between(1, 3); k > 0; --k) {
      const DataType type = anyType(random);
      const bool isList = random.chance(40);
      plans.push_back({isList ? list(random.pick(keptNames), type, typeHolding(random, 0, 6))
                              : scalar(random.pick(keptNames), type),
                       [=](Random& r, std::size_t) {
                         std::vector<double> items(isList ? static_cast<std::size_t>(r.between(0, 6)) : 1);
                         for (double& item : items) item = randomValue(r, type);
                         return items;
                       }});
    }
    if (random.chance(20)) {
      plans.push_back({list("vertex_indices", DataType::int32, DataType::uint8),
                       [vertices](Random& r, std::size_t) { return randomFace(r, vertices); }});
    }
  }
  return elementOf(random.pick(unknownElementNames), static_cast<std::size_t>(random.between(0, 5)), std::move(plans),
                   random);
}

PlyModel randomModel(Random& random) {
  // Now and then a file larger than the reader's window, so that values straddle its refills.
  const std::size_t vertices = static_cast<std::size_t>(random.chance(2)    ? random.between(2000, 6000)
                                                        : random.chance(10) ? random.between(128, 300)
                                                                            : random.between(3, 60));
  enum class Kind { vertex, face, strips, edge, material, unknown };
  std::vector<Kind> kinds = {Kind::vertex, Kind::face};
  if (random.chance(15)) kinds.push_back(Kind::vertex);
  if (random.chance(25)) kinds.push_back(Kind::face);
  for (const Kind kind : {Kind::strips, Kind::strips, Kind::edge, Kind::edge}) {
    if (random.chance(kinds.back() == kind ? 10 : 30)) kinds.push_back(kind);
  }
  if (random.chance(15)) kinds.push_back(Kind::material);
  for (std::int64_t k = random.between(0, 2); k > 0; --k) kinds.push_back(Kind::unknown);
  random.shuffle(kinds.begin(), kinds.end());
  PlyModel model;
  bool firstVertices = true;
  for (const Kind kind : kinds) {
    switch (kind) {
      case Kind::vertex:
        model.elements.push_back(vertexElement(random, vertices, std::exchange(firstVertices, false)));
        break;
      case Kind::material:
        model.elements.push_back(materialElement(random));
        break;
      case Kind::face:
        model.elements.push_back(faceElement(random, vertices));
        break;
      case Kind::strips:
        model.elements.push_back(stripElement(random, vertices));
        break;
      case Kind::edge:
        model.elements.push_back(edgeElement(random, vertices));
        break;
      case Kind::unknown:
        model.elements.push_back(unknownElement(random, vertices));
        break;
    }
  }
  return model;
}

std::size_t vertexCountOf(const PlyModel& model) {
  for (const ModelElement& element : model.elements) {
    if (element.name == "vertex") return element.values.size();
  }
  return 0;
}

// An index past the vertices in a face or edge list whose type can hold one.
bool breakAnIndex(Random& random, GeneratedFile& file) {
  const double vertices = static_cast<double>(vertexCountOf(file.model));
  std::vector<std::pair<std::size_t, std::size_t>> candidates;  // element, property
  // Indices are checked against the vertices read before them.
  const auto firstVertices = std::find_if(file.model.elements.begin(), file.model.elements.end(),
                                          [](const ModelElement& element) { return element.name == "vertex"; });
  for (auto e = static_cast<std::size_t>(firstVertices - file.model.elements.begin()); e < file.model.elements.size();
       ++e) {
    const ModelElement& element = file.model.elements[e];
    if ((element.name != "face" && element.name != "edge") || element.values.empty()) continue;
    for (std::size_t p = 0; p < element.properties.size(); ++p) {
      if (element.properties[p].name.starts_with("vertex_ind") && highestOf(element.properties[p].type) >= vertices) {
        candidates.emplace_back(e, p);
      }
    }
  }
  if (candidates.empty()) return false;
  const auto [e, p] = random.pick(candidates);
  ModelElement& element = file.model.elements[e];
  std::vector<double>& corners = element.values[random.below(element.values.size())][p];
  if (corners.empty()) return false;
  const double high = std::min(highestOf(element.properties[p].type), vertices + 1000);
  corners[random.below(corners.size())] =
      static_cast<double>(random.between(static_cast<std::int64_t>(vertices), static_cast<std::int64_t>(high)));
  file.bytes = writeModel(file.model, file.encoding);
  file.broken = fmt::format("an index past the vertices in element '{}'", element.name);
  file.expectedMessage = fmt::format("Element '{}': 1 invalid vertex index was stored as 0", element.name);
  return true;
}

// A byte that starts no value after the first word of an ASCII instance line of two words
// or more.
bool breakALine(Random& random, GeneratedFile& file) {
  std::vector<std::pair<std::size_t, std::size_t>> lines;  // element, instance
  std::size_t line = 0;
  std::vector<std::size_t> lineOf;
  for (std::size_t e = 0; e < file.model.elements.size(); ++e) {
    const ModelElement& element = file.model.elements[e];
    if (element.properties.empty()) continue;
    for (std::size_t i = 0; i < element.values.size(); ++i, ++line) {
      std::size_t words = 0;
      for (std::size_t p = 0; p < element.properties.size(); ++p) {
        words += element.properties[p].isList ? 1 + element.values[i][p].size() : 1;
      }
      if (words >= 2) {
        lines.emplace_back(e, i);
        lineOf.push_back(line);
      }
    }
  }
  if (lines.empty()) return false;
  const std::size_t chosen = random.below(lines.size());
  std::size_t at = bodyOffset(file.bytes);
  for (std::size_t k = 0; k < lineOf[chosen]; ++k) at = file.bytes.find('\n', at) + 1;
  file.bytes.insert(file.bytes.find(' ', at), " #");
  const ModelElement& element = file.model.elements[lines[chosen].first];
  file.broken = fmt::format("a malformed line in element '{}'", element.name);
  file.expectedMessage =
      fmt::format("Element '{}': 1 of {} instances could not be parsed", element.name, element.values.size());
  return true;
}

void cutTheBody(Random& random, GeneratedFile& file) {
  const std::size_t body = bodyOffset(file.bytes);
  const std::size_t length = file.bytes.size() - body;
  std::size_t cut = body + random.below(std::max<std::size_t>(length, 1));
  // A cut inside an ASCII word leaves a shorter number that reads like any other: cut before
  // the word, so that a value is missing.
  while (file.encoding == ply::Encoding::ascii && cut > body &&
         !std::isspace(static_cast<unsigned char>(file.bytes[cut - 1]))) {
    --cut;
  }
  file.bytes.resize(cut);
  file.broken = fmt::format("the body cut after {} of its {} bytes", file.bytes.size() - body, length);
  file.expectedMessage = "The data ends early in element '";
}

}  // namespace

GeneratedFile randomValidFile(std::uint64_t seed) {
  Random random(seed);
  GeneratedFile file;
  file.seed = seed;
  file.model = randomModel(random);
  file.encoding = static_cast<ply::Encoding>(random.below(3));
  file.bytes = writeModel(file.model, file.encoding);
  return file;
}

GeneratedFile randomInvalidFile(std::uint64_t seed) {
  GeneratedFile file = randomValidFile(seed);
  Random random(seed ^ 0x5DEECE66Dull);
  const bool ascii = file.encoding == ply::Encoding::ascii;
  if (ascii && random.chance(50) && breakALine(random, file)) return file;
  if (random.chance(50) && breakAnIndex(random, file)) return file;
  cutTheBody(random, file);
  return file;
}

std::string describe(const GeneratedFile& file) {
  return fmt::format("{}-{}-seed-{}", file.broken.empty() ? "valid" : "invalid", ply::encodingWord(file.encoding),
                     file.seed);
}

}  // namespace testing_support
