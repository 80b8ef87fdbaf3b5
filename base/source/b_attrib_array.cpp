#include "b_attrib_array.h"

#include "b_binary_io.h"
#include "b_exception.h"
#include "b_log.h"
#include "b_structured.h"

#include <algorithm>
#include <memory>

namespace base {
namespace {

const name_id& arrayTypeName() {
  static const name_id name = intern("array");
  return name;
}

const name_id& noType() {
  static const name_id name = intern("");
  return name;
}

// The least an element takes: a 16-bit type id and its length.
constexpr std::uint64_t smallestElement = 2 + 4;

}  // namespace

AttribArray::AttribArray(AttribFactory* factory) : m_factory(factory) {}

AttribArray::~AttribArray() { destroyElements(); }

void AttribArray::destroyElements() {
  for (Attribute* element : m_elements) delete element;
  m_elements.clear();
}

name_id AttribArray::type() const { return arrayTypeName(); }

Attribute* AttribArray::clone() const {
  auto* copy = new AttribArray(m_factory);
  copy->flags = flags;
  copy->m_name = m_name;
  copy->setData(&m_elements);
  return copy;
}

void AttribArray::write(Stream& stream, BinaryContext& context) const {
  Attribute::write(stream, context);
  binary::put(stream, static_cast<std::uint32_t>(m_elements.size()));
  for (const Attribute* element : m_elements) {
    context.writeType(stream, element ? element->type() : noType());
    if (element) {
      binary::writeSized(stream, *element, context);
    } else {
      binary::put(stream, std::uint32_t(0));
    }
  }
}

void AttribArray::writeValue(StructuredWriter& writer) const {
  writer.beginArray();
  for (const Attribute* element : m_elements) {
    if (!element) {
      writer.null();
    } else if (element->asMap()) {
      element->writeValue(writer);
    } else {
      writer.beginObject();
      writer.key("^value");
      element->writeValue(writer);
      writer.key("^type");
      writer.value(text(element->type()));
      writer.endObject();
    }
  }
  writer.endArray();
}

bool AttribArray::readValue(StructuredReader& reader) {
  std::size_t size = 0;
  if (!reader.beginArray(size)) return false;
  Elements elements;
  bool fits = true;
  for (std::size_t k = 0; k < size && fits; ++k) {
    if (reader.null()) {
      elements.push_back(nullptr);
      continue;
    }
    std::unique_ptr<Attribute> element;
    if (reader.nextHasKey("^type")) {
      std::size_t members = 0;
      base::string type;
      reader.beginObject(members);
      fits = reader.find("^type") && reader.value(type);
      if (fits) element.reset(m_factory->create(intern(type)));
      if (fits && !element) {
        log().message(logSystem, logWarning, "array attribute: Unknown attribute type '{}'. Ignoring...",
                      clipped(type));
      } else if (fits) {
        fits = reader.find("^value") && element->readValue(reader);
      }
      reader.endObject();
    } else {
      element.reset(m_factory->create(intern("map")));
      fits = element && element->readValue(reader);
    }
    if (fits && element) elements.push_back(element.release());
  }
  reader.endArray();
  if (fits) {
    destroyElements();
    m_elements = std::move(elements);
  } else {
    for (Attribute* element : elements) delete element;
  }
  return fits;
}

void AttribArray::read(Stream& stream, BinaryContext& context) {
  const BinaryContext::Level level(context, stream);
  Attribute::read(stream, context);
  destroyElements();
  const std::uint32_t count = binary::readCount(stream, smallestElement, "array elements");
  for (std::uint32_t k = 0; k < count; ++k) {
    name_id type = nullptr;
    try {
      type = context.readType(stream);
    } catch (const exception&) {
      log().message(logSystem, logError,
                    "array attribute: Unable to read the attribute type inside! Probably a corrupted file!");
      throw;
    }
    const std::uint32_t length = binary::readCount(stream, 1, "element bytes");
    if (type == noType()) {
      append(nullptr);
      continue;
    }
    std::unique_ptr<Attribute> element(m_factory->create(type));
    if (!element) {
      log().message(logSystem, logWarning, "array attribute: Unknown attribute type '{}'. Ignoring...",
                    clipped(text(type)));
      if (const std::uint64_t skipped = stream.skip(length); skipped < length)
        binary::failShort(stream, length, skipped);
      continue;
    }
    binary::readSized(stream, *element, context, length);
    append(element.release());
  }
}

void* AttribArray::data(int index) {
  if (index < 0) return &m_elements;
  if (static_cast<std::size_t>(index) >= m_elements.size()) return nullptr;
  Attribute* element = m_elements[static_cast<std::size_t>(index)];
  return element ? element->data() : nullptr;
}

bool AttribArray::erase(int index) {
  if (index < 0 || static_cast<std::size_t>(index) >= m_elements.size()) return false;
  delete m_elements[static_cast<std::size_t>(index)];
  m_elements.erase(m_elements.begin() + index);
  return true;
}

std::uint32_t AttribArray::byteSize() const {
  std::uint32_t bytes = 4;
  for (const Attribute* element : m_elements) bytes += element ? element->byteSize() : 0;
  return bytes;
}

bool AttribArray::copyFrom(const Attribute& source, std::uint32_t mode, int) {
  const AttribArray* from = source.asArray();
  if (!from || !(mode & copyOverwrite)) return false;
  setData(&from->m_elements);
  return true;
}

bool AttribArray::hasRuntimeFlag() const {
  return Attribute::hasRuntimeFlag() || std::any_of(m_elements.begin(), m_elements.end(), [](const Attribute* element) {
           return element && element->hasRuntimeFlag();
         });
}

void AttribArray::setData(const void* data, int index) {
  if (index >= 0) {
    if (static_cast<std::size_t>(index) < m_elements.size() && m_elements[static_cast<std::size_t>(index)]) {
      m_elements[static_cast<std::size_t>(index)]->setData(data);
    }
    return;
  }
  const auto& source = *static_cast<const Elements*>(data);
  if (&source == &m_elements) return;
  Elements copies;
  copies.reserve(source.size());
  for (const Attribute* element : source) copies.push_back(element ? element->clone() : nullptr);
  destroyElements();
  m_elements = std::move(copies);
}

int AttribArray::compareData(const void* data, int index) const {
  if (index >= 0) {
    if (static_cast<std::size_t>(index) >= m_elements.size() || !m_elements[static_cast<std::size_t>(index)]) return 1;
    return m_elements[static_cast<std::size_t>(index)]->compareData(data);
  }
  const auto& other = *static_cast<const Elements*>(data);
  if (m_elements.size() != other.size()) return m_elements.size() < other.size() ? -1 : 1;
  for (std::size_t k = 0; k < m_elements.size(); ++k) {
    const Attribute* mine = m_elements[k];
    const Attribute* theirs = other[k];
    if (!mine || !theirs) {
      if (mine != theirs) return mine ? 1 : -1;
      continue;
    }
    if (mine->type() != theirs->type()) return 1;
    if (const int order = mine->compareData(theirs->data()); order != 0) return order;
  }
  return 0;
}

void AttribArray::append(Attribute* element) {
  base::reserveForAppend(m_elements, 1);
  m_elements.push_back(element);
}

}  // namespace base
