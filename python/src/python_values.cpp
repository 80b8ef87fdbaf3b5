#include "python_values.h"

#include "b_attrib_array.h"
#include "b_attrib_factory.h"
#include "b_attribute_map.h"
#include "b_structured.h"
#include "b_utf8.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <map>
#include <memory>
#include <optional>
#include <vector>

namespace pymeshport {
namespace {

// Builds Python values from the structured form of an attribute.
class PythonValueWriter : public base::StructuredWriter {
 public:
  void beginObject() override { open(py::dict()); }
  void key(std::string_view name) override { m_key = pythonText(name); }
  void endObject() override { close(); }
  void beginArray() override { open(py::list()); }
  void endArray() override { close(); }
  void null() override { put(py::none()); }
  void value(bool value) override { put(py::bool_(value)); }
  void value(std::int64_t value) override { put(py::int_(value)); }
  void value(std::uint64_t value) override { put(py::int_(value)); }
  void value(float value) override { put(py::float_(value)); }
  void value(double value) override { put(py::float_(value)); }
  void value(std::string_view text) override { put(pythonText(text)); }

  py::object result() const { return m_result; }

 private:
  void open(py::object container) {
    put(container);
    m_open.push_back(std::move(container));
  }
  void close() { m_open.pop_back(); }
  void put(const py::object& value) {
    if (m_open.empty()) {
      m_result = value;
    } else if (py::isinstance<py::dict>(m_open.back())) {
      m_open.back()[m_key] = value;
    } else {
      m_open.back().cast<py::list>().append(value);
    }
  }

  std::vector<py::object> m_open;
  py::object m_key;
  py::object m_result = py::none();
};

std::optional<py::dtype> dtypeOfComponent(std::uint8_t code) {
  switch (code) {
    case 0:
      return py::dtype::of<std::int8_t>();
    case 1:
      return py::dtype::of<std::uint8_t>();
    case 2:
      return py::dtype::of<std::int16_t>();
    case 3:
      return py::dtype::of<std::uint16_t>();
    case 4:
      return py::dtype::of<bool>();
    case 5:
      return py::dtype::of<std::uint32_t>();
    case 6:
      return py::dtype::of<std::int32_t>();
    case 7:
      return py::dtype::of<std::int64_t>();
    case 8:
      return py::dtype::of<std::uint64_t>();
    case 10:
      return py::dtype::of<float>();
    case 11:
      return py::dtype::of<double>();
    default:
      return std::nullopt;
  }
}

// The bytes of one value of the list `attribute`, a list of numbers or of fixed vectors of
// them; 0 when it is some other list. The values lie side by side; an empty list asks the
// factory for a value of its type.
std::size_t valueBytes(const base::Attribute& attribute) {
  const std::string_view type = base::text(attribute.type());
  const std::string_view valueType = type.substr(0, type.size() - std::min<std::size_t>(type.size(), 2));
  // Object references hold pointers; their structured form gives the objects' indices.
  if (!type.ends_with("[]") || valueType == "plugin") return 0;
  if (attribute.size() >= 2) {
    return static_cast<std::size_t>(static_cast<const std::byte*>(attribute.data(1)) -
                                    static_cast<const std::byte*>(attribute.data(0)));
  }
  if (attribute.size() == 1) return attribute.byteSize() - 4;
  const base::name_id name = base::intern(valueType);
  if (!base::attribFactory().knows(name)) return 0;
  const std::unique_ptr<base::Attribute> value(base::attribFactory().create(name));
  return value->byteSize();
}

// A list of numbers, or of fixed vectors of them, as an array; none for any other attribute.
std::optional<py::array> numberList(const base::Attribute& attribute, const ListArrayMaker& makeArray) {
  const std::optional<py::dtype> dtype = dtypeOfComponent(attribute.componentType());
  const std::size_t bytes = dtype ? valueBytes(attribute) : 0;
  const auto component = static_cast<std::size_t>(dtype ? dtype->itemsize() : 0);
  if (bytes == 0 || bytes % component != 0) return std::nullopt;
  const std::size_t width = bytes / component;
  return makeArray(attribute, attribute.data(0), attribute.size(), width == 1 ? 0 : width, *dtype);
}

}  // namespace

py::str pythonText(std::string_view bytes) { return py::str(base::utf8Text(bytes)); }

py::object toPython(const base::Attribute& attribute, const ListArrayMaker& makeArray) {
  if (const base::AttribMap* map = attribute.asMap()) {
    std::map<std::string_view, const base::Attribute*> sorted;
    for (const auto& [name, member] : map->members()) sorted.emplace(base::text(name), member);
    py::dict members;
    for (const auto& [name, member] : sorted) members[pythonText(name)] = toPython(*member, makeArray);
    return members;
  }
  if (const base::AttribArray* array = attribute.asArray()) {
    py::list elements;
    for (const auto& element : array->elements()) elements.append(toPython(*element, makeArray));
    return elements;
  }
  if (std::optional<py::array> list = numberList(attribute, makeArray)) return std::move(*list);
  PythonValueWriter writer;
  attribute.writeValue(writer);
  return writer.result();
}

}  // namespace pymeshport
