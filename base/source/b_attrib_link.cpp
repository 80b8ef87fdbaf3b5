#include "b_attrib_link.h"

#include "b_attribute_map.h"
#include "b_binary_io.h"
#include "b_structured.h"

#include <atomic>
#include <charconv>

namespace base {
namespace {

std::atomic<AttribPath::PluginResolver> pluginResolver{nullptr};

const name_id& linkTypeName() {
  static const name_id name = intern("link");
  return name;
}

constexpr std::uint8_t localStep = 1;

}  // namespace

void AttribPath::setPluginResolver(PluginResolver resolver) { pluginResolver = resolver; }

base::string AttribPath::toText() const {
  base::string text;
  for (const Step& step : m_steps) {
    if (!text.empty()) text += '/';
    if (step.local) {
      text += base::text(step.name);
    } else {
      text += '@';
      text += std::to_string(step.plugin);
    }
  }
  return text;
}

bool AttribPath::fromText(std::string_view text) {
  if (text.empty()) {
    m_steps.clear();
    return true;
  }
  base::vector<Step> steps;
  for (std::size_t start = 0; start <= text.size();) {
    const std::size_t end = std::min(text.find('/', start), text.size());
    const std::string_view part = text.substr(start, end - start);
    if (part.empty()) return false;
    Step step;
    // Only the first step may name a plug-in object.
    if (part.front() == '@' && !steps.empty()) return false;
    if (part.front() == '@') {
      const auto [at, error] = std::from_chars(part.data() + 1, part.data() + part.size(), step.plugin);
      if (error != std::errc() || at != part.data() + part.size()) return false;
      step.local = false;
    } else {
      step.name = intern(part);
    }
    base::append(steps, step);
    start = end + 1;
  }
  m_steps = std::move(steps);
  return true;
}

AttribMap* AttribPath::pluginObject(const AttribMap& from) const {
  if (m_steps.empty() || m_steps.front().local) return nullptr;
  const PluginResolver resolver = pluginResolver.load();
  return resolver ? resolver(from, m_steps.front().plugin) : nullptr;
}

Attribute* AttribPath::resolve(const AttribMap& from, const AttribMap** container) const {
  const AttribMap* map = &from;
  std::size_t first = 0;
  if (!m_steps.empty() && !m_steps.front().local) {
    map = pluginObject(from);
    first = 1;
    if (!map) return nullptr;
  }
  Attribute* found = first == m_steps.size() ? const_cast<AttribMap*>(map) : nullptr;
  for (std::size_t k = first; k < m_steps.size(); ++k) {
    if (!map || !m_steps[k].name || m_steps[k].name->length == 0) return nullptr;
    if (container) *container = map;
    Attribute** slot = const_cast<AttribMap*>(map)->findAttributeMutable(m_steps[k].name);
    found = *slot;
    if (!found) return nullptr;
    map = found->asMap();
  }
  return found;
}

bool operator==(const AttribPath& a, const AttribPath& b) {
  if (a.m_steps.size() != b.m_steps.size()) return false;
  for (std::size_t k = 0; k < a.m_steps.size(); ++k) {
    const AttribPath::Step& x = a.m_steps[k];
    const AttribPath::Step& y = b.m_steps[k];
    if (x.name != y.name || x.plugin != y.plugin || x.local != y.local) return false;
  }
  return true;
}

name_id AttribLink::type() const { return linkTypeName(); }

Attribute* AttribLink::clone() const {
  auto* copy = new AttribLink;
  copy->flags = flags;
  copy->setPath(m_path);
  return copy;
}

void AttribLink::writeValue(StructuredWriter& writer) const { writer.value(std::string_view(m_path.toText())); }

bool AttribLink::readValue(StructuredReader& reader) {
  base::string text;
  return reader.value(text) && fromString(text);
}

void AttribLink::write(Stream& stream, BinaryContext& context) const {
  Attribute::write(stream, context);
  binary::put(stream, static_cast<std::uint32_t>(m_path.steps().size()));
  static const name_id none = intern("");
  for (const AttribPath::Step& step : m_path.steps()) {
    binary::put(stream, step.local ? localStep : std::uint8_t(0));
    context.writeName(stream, step.name ? step.name : none);
    binary::put(stream, step.plugin);
  }
}

void AttribLink::read(Stream& stream, BinaryContext& context) {
  Attribute::read(stream, context);
  // The least a step takes: its flags byte, a 16-bit name id and its plug-in id.
  const std::uint32_t count = binary::readCount(stream, 1 + 2 + 4, "path steps");
  AttribPath path;
  for (std::uint32_t k = 0; k < count; ++k) {
    AttribPath::Step step;
    step.local = (binary::get<std::uint8_t>(stream) & localStep) != 0;
    step.name = context.readName(stream);
    if (!step.local) step.name = nullptr;  // a plug-in step is written with an empty name
    step.plugin = binary::get<std::uint32_t>(stream);
    path.append(step);
  }
  setPath(path);
}

void* AttribLink::data(int) { return &m_path; }

bool AttribLink::copyFrom(const Attribute& source, std::uint32_t mode, int) {
  const AttribLink* from = source.asLink();
  if (!from || !(mode & copyOverwrite)) return false;
  setPath(from->m_path);
  return true;
}

bool AttribLink::fromString(std::string_view text) {
  AttribPath path;
  if (!path.fromText(text)) return false;
  setPath(path);
  return true;
}

void AttribLink::setData(const void* data, int) { setPath(*static_cast<const AttribPath*>(data)); }

int AttribLink::compareData(const void* data, int) const {
  return m_path == *static_cast<const AttribPath*>(data) ? 0 : 1;
}

void AttribLink::setPath(const AttribPath& path) {
  m_path = path;
  m_path.owner = m_path.empty() ? nullptr : this;
}

}  // namespace base
