#include "ply_body.h"

namespace ply::detail {

void warnEndedEarly(const Element& element, std::uint64_t read) {
  base::log().message(base::logScene, base::logWarning, "The data ends early in element '{}': {} of {} instances read",
                      base::clipped(displayName(element)), read, element.count);
}

void SkippedLineReport::note() {
  if (++m_count <= linesPerElement) {
    base::log().message(base::logScene, base::logWarning,
                        "Unable to parse property instance. Skipping this element instance");
  }
}

void SkippedLineReport::finish(const Element& element) {
  if (m_count > 0) {
    base::log().message(base::logScene, base::logWarning,
                        "Element '{}': {} of {} instances could not be parsed; their lines were skipped",
                        base::clipped(displayName(element)), m_count, element.count);
  }
  m_count = 0;
}

BinaryPlan::BinaryPlan(const Element& element) {
  std::uint32_t offset = 0;
  for (const Property& property : element.properties) {
    if (property.isList) {
      offsets.clear();
      return;
    }
    base::append(offsets, offset);
    offset += dataTypeSize(property.type);
  }
  recordSize = offset;
}

}  // namespace ply::detail
