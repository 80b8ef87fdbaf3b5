#pragma once

#include "ply_parser.h"

#include <rapidjson/filewritestream.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <cstdio>
#include <string>

namespace scenetool {

/// Writes a PLY file's header model, and with values every property instance as read, as
/// the JSON document of `scenetool ply --json`. It is a body receiver: the document is
/// written while the file is read, so a large file is never held twice. Each instance is
/// held until it is complete; one that the data cut short is left out.
class PlyJsonDump {
 public:
  /// `header` is the model that the parse fills; it is read when the body begins.
  PlyJsonDump(std::FILE* out, const ply::Header& header, bool values);

  /// Announces the element; the first call also writes the format.
  bool plyElement(const ply::Element& element);
  void beginInstance(std::uint32_t index);
  void plyProperty(const ply::Element& element, const ply::Property& property, const ply::ValueArray& values);

  /// Writes what is still open, and the elements that the body did not announce (all of
  /// them when only the header was read).
  void finish();

 private:
  void begin();
  void writeElementHead(const ply::Element& element);
  void writeValue(const ply::Value& value, ply::DataType type);
  void flushInstance();
  void closeElement();

  char m_buffer[1 << 16];
  rapidjson::FileWriteStream m_stream;
  rapidjson::Writer<rapidjson::FileWriteStream> m_writer;
  rapidjson::StringBuffer m_instance;
  rapidjson::Writer<rapidjson::StringBuffer> m_instanceWriter;
  std::size_t m_entries = 0;
  std::size_t m_expected = 0;
  bool m_values;
  bool m_begun = false;
  bool m_inInstance = false;
  std::size_t m_announced = 0;
  const ply::Header& m_header;
};

/// The same as readable text: format, elements with counts, properties with types, and with
/// values one line per complete instance.
class PlyTextDump {
 public:
  PlyTextDump(std::FILE* out, const ply::Header& header, bool values)
      : m_out(out), m_header(header), m_values(values) {}

  bool plyElement(const ply::Element& element);
  void beginInstance(std::uint32_t index);
  void plyProperty(const ply::Element& element, const ply::Property& property, const ply::ValueArray& values);
  void finish();

 private:
  void begin();
  void writeElementHead(const ply::Element& element);
  void endLine();

  std::FILE* m_out;
  const ply::Header& m_header;
  bool m_values;
  bool m_begun = false;
  std::string m_line;
  std::size_t m_entries = 0;
  std::size_t m_expected = 0;
  std::size_t m_announced = 0;
};

/// The text of a value as read: integers exactly, floats in the shortest form that reads
/// back to the same bits, NaN and infinities as "NaN", "Infinity", "-Infinity".
std::string valueText(const ply::Value& value, ply::DataType type);

}  // namespace scenetool
