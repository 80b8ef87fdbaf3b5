#include "ply_dump.h"

#include "b_utf8.h"

#include <fmt/format.h>

#include <cmath>

namespace scenetool {
namespace {

template <class T>
std::string realText(T value) {
  if (std::isnan(value)) return "NaN";
  if (std::isinf(value)) return value > 0 ? "Infinity" : "-Infinity";
  return fmt::format("{}", value);
}

bool isReal(ply::DataType type) { return type == ply::DataType::float32 || type == ply::DataType::float64; }

}  // namespace

std::string valueText(const ply::Value& value, ply::DataType type) {
  switch (type) {
    case ply::DataType::int8:
    case ply::DataType::int16:
    case ply::DataType::int32:
      return fmt::format("{}", value.i);
    case ply::DataType::uint8:
    case ply::DataType::uint16:
    case ply::DataType::uint32:
      return fmt::format("{}", value.u);
    case ply::DataType::float32:
      return realText(value.f);
    case ply::DataType::float64:
      return realText(value.d);
    case ply::DataType::none:
      break;
  }
  return "null";
}

PlyJsonDump::PlyJsonDump(std::FILE* out, const ply::Header& header, bool values)
    : m_stream(out, m_buffer, sizeof m_buffer),
      m_writer(m_stream),
      m_instanceWriter(m_instance),
      m_values(values),
      m_header(header) {}

void PlyJsonDump::begin() {
  if (m_begun) return;
  m_begun = true;
  m_writer.StartObject();
  m_writer.Key("format");
  const std::string_view format = ply::encodingWord(m_header.encoding);
  m_writer.String(format.data(), static_cast<rapidjson::SizeType>(format.size()));
  m_writer.Key("elements");
  m_writer.StartArray();
}

bool PlyJsonDump::plyElement(const ply::Element& element) {
  closeElement();
  begin();
  writeElementHead(element);
  ++m_announced;
  m_expected = element.properties.size();
  if (m_values) {
    m_writer.Key("instances");
    m_writer.StartArray();
  }
  return m_values;
}

void PlyJsonDump::writeElementHead(const ply::Element& element) {
  m_writer.StartObject();
  m_writer.Key("name");
  const std::string elementName = base::utf8Text(element.name);  // names from files may be in any encoding
  m_writer.String(elementName.c_str(), static_cast<rapidjson::SizeType>(elementName.size()));
  m_writer.Key("semantic");
  m_writer.Uint(static_cast<unsigned>(element.semantic));
  m_writer.Key("count");
  m_writer.Uint(element.count);
  m_writer.Key("properties");
  m_writer.StartArray();
  for (const ply::Property& property : element.properties) {
    m_writer.StartObject();
    m_writer.Key("name");
    const std::string propertyName = base::utf8Text(property.name);
    m_writer.String(propertyName.c_str(), static_cast<rapidjson::SizeType>(propertyName.size()));
    m_writer.Key("semantic");
    m_writer.Uint(static_cast<unsigned>(property.semantic));
    m_writer.Key("type");
    const std::string_view type = ply::dataTypeWord(property.type);
    m_writer.String(type.data(), static_cast<rapidjson::SizeType>(type.size()));
    m_writer.Key("list");
    m_writer.Bool(property.isList);
    m_writer.Key("countType");
    if (property.isList) {
      const std::string_view countType = ply::dataTypeWord(property.countType);
      m_writer.String(countType.data(), static_cast<rapidjson::SizeType>(countType.size()));
    } else {
      m_writer.Null();
    }
    m_writer.EndObject();
  }
  m_writer.EndArray();
}

void PlyJsonDump::beginInstance(std::uint32_t) {
  flushInstance();
  m_instance.Clear();
  m_instanceWriter.Reset(m_instance);
  m_instanceWriter.StartArray();
  m_entries = 0;
  m_inInstance = true;
}

void PlyJsonDump::flushInstance() {
  if (m_inInstance && m_entries == m_expected) {
    m_instanceWriter.EndArray();
    m_writer.RawValue(m_instance.GetString(), m_instance.GetSize(), rapidjson::kArrayType);
  }
  m_inInstance = false;
}

void PlyJsonDump::writeValue(const ply::Value& value, ply::DataType type) {
  const std::string text = valueText(value, type);
  if (isReal(type) && (text.back() == 'N' || text.back() == 'y')) {
    m_instanceWriter.String(text.c_str(), static_cast<rapidjson::SizeType>(text.size()));
  } else {
    m_instanceWriter.RawValue(text.c_str(), text.size(), rapidjson::kNumberType);
  }
}

void PlyJsonDump::plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
  ++m_entries;
  if (!property.isList) return writeValue(values[0], property.type);
  m_instanceWriter.StartArray();
  for (const ply::Value& value : values) writeValue(value, property.type);
  m_instanceWriter.EndArray();
}

void PlyJsonDump::closeElement() {
  if (m_announced == 0) return;
  flushInstance();
  if (m_values) m_writer.EndArray();
  m_writer.EndObject();
}

void PlyJsonDump::finish() {
  closeElement();
  begin();
  for (std::size_t i = m_announced; i < m_header.elements.size(); ++i) {
    writeElementHead(m_header.elements[i]);
    if (m_values) {
      m_writer.Key("instances");
      m_writer.StartArray();
      m_writer.EndArray();
    }
    m_writer.EndObject();
  }
  m_announced = m_header.elements.size();
  m_writer.EndArray();
  m_writer.EndObject();
  m_stream.Put('\n');
  m_stream.Flush();
}

void PlyTextDump::begin() {
  if (m_begun) return;
  m_begun = true;
  fmt::print(m_out, "format: {}\n", ply::encodingWord(m_header.encoding));
}

void PlyTextDump::writeElementHead(const ply::Element& element) {
  fmt::print(m_out, "element {} ({} instances)\n", ply::displayName(element), element.count);
  for (const ply::Property& property : element.properties) {
    if (property.isList) {
      fmt::print(m_out, "  property list {} {} {}\n", ply::dataTypeWord(property.countType),
                 ply::dataTypeWord(property.type), ply::displayName(property));
    } else {
      fmt::print(m_out, "  property {} {}\n", ply::dataTypeWord(property.type), ply::displayName(property));
    }
  }
}

bool PlyTextDump::plyElement(const ply::Element& element) {
  endLine();
  begin();
  writeElementHead(element);
  ++m_announced;
  m_expected = element.properties.size();
  return m_values;
}

void PlyTextDump::beginInstance(std::uint32_t index) {
  endLine();
  m_line = fmt::format("  [{}]", index);
  m_entries = 0;
}

void PlyTextDump::plyProperty(const ply::Element&, const ply::Property& property, const ply::ValueArray& values) {
  ++m_entries;
  if (!property.isList) {
    m_line += ' ';
    m_line += valueText(values[0], property.type);
    return;
  }
  m_line += " {";
  for (std::size_t i = 0; i < values.size(); ++i) {
    if (i) m_line += ' ';
    m_line += valueText(values[i], property.type);
  }
  m_line += '}';
}

void PlyTextDump::endLine() {
  // An instance that the data cut short is left out, as in the JSON form.
  if (!m_line.empty() && m_entries == m_expected) fmt::print(m_out, "{}\n", m_line);
  m_line.clear();
}

void PlyTextDump::finish() {
  endLine();
  begin();
  for (std::size_t i = m_announced; i < m_header.elements.size(); ++i) writeElementHead(m_header.elements[i]);
  m_announced = m_header.elements.size();
}

}  // namespace scenetool
